// Shared, reference-counted objects and the copy-on-write handle that holds
// them. Dictionaries are copied often (transcoding wrappers, the writer's
// private view); sharing keeps such a copy at one pointer per object until
// something actually changes.
#pragma once

#include <cstdint>
#include <type_traits>
#include <utility>

#include "dserror.h"

class QORA_RefCntObject {
  public:
    QORA_RefCntObject() = default;
    // A copy is a new object: nobody refers to it yet, and it may be shared.
    QORA_RefCntObject(const QORA_RefCntObject&) {}
    QORA_RefCntObject& operator=(const QORA_RefCntObject&) { return *this; }
    virtual ~QORA_RefCntObject() = default;

    void AddRef() { ++fRefCount; }
    // The last release destroys the object.
    void Release() {
        if (--fRefCount <= 0) delete this;
    }
    bool IsShared() const { return fRefCount > 1; }
    int32_t RefCount() const { return fRefCount; }
    // An object someone reaches past its handles must never be shared again:
    // a handle copied from it gets its own copy instead.
    void MarkUnshareable() { fShareable = false; }
    bool IsShareable() const { return fShareable; }

  private:
    int32_t fRefCount = 0;
    bool fShareable = true;
};

// A copy-on-write handle to a T derived from QORA_RefCntObject. Reading goes
// through Get() or ->; every change must go through Mutable(), which first
// makes the object private to this handle. A private copy is made with T's
// copy constructor.
template <class T>
class QORA_CowRef {
    static_assert(std::is_base_of_v<QORA_RefCntObject, T>, "T must be reference counted");

  public:
    QORA_CowRef() = default;
    // Takes a new reference to p (may be null).
    explicit QORA_CowRef(T* p) : fp(p) {
        if (fp) fp->AddRef();
    }
    QORA_CowRef(const QORA_CowRef& other) : fp(Share(other.fp)) {}
    QORA_CowRef(QORA_CowRef&& other) noexcept : fp(std::exchange(other.fp, nullptr)) {}
    QORA_CowRef& operator=(const QORA_CowRef& other) {
        T* p = Share(other.fp);
        Drop();
        fp = p;
        return *this;
    }
    QORA_CowRef& operator=(QORA_CowRef&& other) noexcept {
        if (this != &other) {
            Drop();
            fp = std::exchange(other.fp, nullptr);
        }
        return *this;
    }
    ~QORA_CowRef() { Drop(); }

    bool IsValid() const { return fp != nullptr; }
    const T* Get() const { return fp; }
    const T* operator->() const {
        QORA_ASSERT(fp != nullptr);
        return fp;
    }
    const T& operator*() const { return *operator->(); }
    bool SameObject(const QORA_CowRef& other) const { return fp == other.fp; }

    // The object, private to this handle: cloned first when it is shared.
    T* Mutable() {
        QORA_ASSERT(fp != nullptr);
        if (fp->IsShared()) {
            T* copy = new T(*fp);
            copy->AddRef();
            fp->Release();
            fp = copy;
        }
        return fp;
    }
    // Points the handle at p (may be null), releasing the old object.
    void Reset(T* p = nullptr) { *this = QORA_CowRef(p); }

  private:
    static T* Share(T* p) {
        if (!p) return nullptr;
        if (!p->IsShareable()) p = new T(*p);
        p->AddRef();
        return p;
    }
    void Drop() {
        if (fp) std::exchange(fp, nullptr)->Release();
    }

    T* fp = nullptr;
};
