#include "qoralock.h"

#include <sys/syscall.h>
#include <unistd.h>

uint32_t CurrentThreadId() { return static_cast<uint32_t>(syscall(SYS_gettid)); }

CriticalSection::CriticalSection() {
    pthread_mutexattr_t attr;
    pthread_mutexattr_init(&attr);
    pthread_mutexattr_settype(&attr, PTHREAD_MUTEX_RECURSIVE);
    pthread_mutex_init(&fSection, &attr);
    pthread_mutexattr_destroy(&attr);
}

CriticalSection::~CriticalSection() {
    if (fLocked) pthread_mutex_unlock(&fSection);
    pthread_mutex_destroy(&fSection);
}

void CriticalSection::Enter() {
    pthread_mutex_lock(&fSection);
    Entered();
}

void CriticalSection::Entered() {
    if (fCount < 1) fOwner = CurrentThreadId();
    ++fCount;
    fLocked = true;
}

bool CriticalSection::TryEnterSection() {
    if (pthread_mutex_trylock(&fSection) != 0) return false;
    Entered();
    return true;
}

void CriticalSection::Leave() {
    fLocked = false;
    if (fCount == 1) fOwner = 0;
    --fCount;
    pthread_mutex_unlock(&fSection);
}

void CriticalSectionExt::Enter() {
    CriticalSection::Enter();
    Acquired();
}

bool CriticalSectionExt::TryEnter() {
    if (!TryEnterSection()) return false;
    Acquired();
    return true;
}

void CriticalSectionExt::Acquired() {
    Lock guard(fInner);
    fOwner = CurrentThreadId();
    ++fCount;
}

void CriticalSectionExt::Leave() {
    {
        Lock guard(fInner);
        if (--fCount == 0) fOwner = 0;
    }
    CriticalSection::Leave();
}
