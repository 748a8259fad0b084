// Recursive, thread-owned locks over POSIX mutexes, with the interface the
// library's Windows critical sections have.
#pragma once

#include <pthread.h>

#include <cstdint>

// The calling thread's id as the kernel numbers it; never 0.
uint32_t CurrentThreadId();

class CriticalSection {
  public:
    CriticalSection();
    virtual ~CriticalSection();
    CriticalSection(const CriticalSection&) = delete;
    CriticalSection& operator=(const CriticalSection&) = delete;

    virtual void Enter();
    virtual void Leave();

    // Holds the lock for the lifetime of the guard.
    class Lock {
      public:
        explicit Lock(CriticalSection& section) : fSection(section) { fSection.Enter(); }
        ~Lock() { fSection.Leave(); }
        Lock(const Lock&) = delete;
        Lock& operator=(const Lock&) = delete;

      private:
        CriticalSection& fSection;
    };

  protected:
    // Records the calling thread as holder once the mutex is taken.
    void Entered();
    // Takes the mutex only when that needs no waiting.
    bool TryEnterSection();

  private:
    bool fLocked = false;
    pthread_mutex_t fSection;
    uint32_t fOwner = 0;
    int32_t fCount = 0;
};

// A critical section that also answers whether it can be taken at once.
class CriticalSectionExt : public CriticalSection {
  public:
    void Enter() override;
    void Leave() override;
    // Succeeds at once when the calling thread already holds the section
    // (raising its count) or nobody does; otherwise returns false.
    bool TryEnter();

  private:
    void Acquired();

    CriticalSection fInner;  // guards fOwner and fCount
    uint32_t fOwner = 0;
    int32_t fCount = 0;
};
