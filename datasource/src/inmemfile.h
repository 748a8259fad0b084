// A stream over a growable block of memory.
#pragma once

#include <cstddef>
#include <memory>

#include "strbaseio.h"

class QORA_InMemoryFile : public QORA_StrBaseIO {
  public:
    enum : size_t { kInitialSize = 4096 };

    QORA_InMemoryFile();
    QORA_InMemoryFile(const QORA_InMemoryFile&) = delete;
    QORA_InMemoryFile& operator=(const QORA_InMemoryFile&) = delete;

    void ClearError() override {}
    bool IsGood() const override { return true; }
    uint32_t Read(void* buffer, uint32_t count) override;
    uint32_t Write(const void* buffer, uint32_t count) override;
    // Positions outside the data are refused (-1); an unknown origin gives -2.
    int Seek(int64_t offset, int origin) override;
    int64_t Tell() const override { return _pos - _start; }
    bool AtEnd() const override { return _atEnd; }

    const char* Data() const { return _start; }
    size_t Size() const { return static_cast<size_t>(_end - _start); }
    size_t Capacity() const { return static_cast<size_t>(_limit - _start); }

  private:
    std::unique_ptr<char[]> _block;
    char* _start;
    char* _pos;
    char* _end;
    char* _limit;
    bool _atEnd = false;
};
