// Open file handles for tests of the exported calls: closed when the test
// leaves its scope, so that one failing test never fills the process-wide
// handle table for the next.
#pragma once

#include <gtest/gtest.h>

#include <string>

#include "qoraio32.h"
#include "qoramb.h"

namespace fixture {

class OpenHandle {
  public:
    OpenHandle() = default;
    explicit OpenHandle(int handle) : fHandle(handle) {}
    OpenHandle(const OpenHandle&) = delete;
    OpenHandle& operator=(const OpenHandle&) = delete;
    ~OpenHandle() {
        if (fHandle >= 0) qoraCloseRead(fHandle);
    }
    int get() const { return fHandle; }
    int* out() { return &fHandle; }
    // The handle was closed by the test itself.
    void Forget() { fHandle = -1; }

  private:
    int fHandle = -1;
};

// Opens path for reading; the test fails unless the open succeeds.
inline void OpenForRead(const std::string& path, OpenHandle& handle) {
    ASSERT_EQ(qoraOpenRead(path.c_str(), handle.out()), QORA_STATUS_OK) << path;
}

inline void OpenForWrite(const std::string& path, OpenHandle& handle) {
    ASSERT_EQ(qoraOpenWrite(path.c_str(), handle.out()), QORA_STATUS_OK) << path;
}

// Sets the interface encoding for one scope and restores code-page mode.
class Utf8Mode {
  public:
    Utf8Mode() { mbSetUtf8Mode(1); }
    ~Utf8Mode() { mbSetUtf8Mode(0); }
    Utf8Mode(const Utf8Mode&) = delete;
    Utf8Mode& operator=(const Utf8Mode&) = delete;
};

}  // namespace fixture
