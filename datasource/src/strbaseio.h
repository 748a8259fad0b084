// The stream interface through which every byte of a system file passes.
#pragma once

#include <cstdint>

class QORA_StrBaseIO {
  public:
    virtual ~QORA_StrBaseIO() = default;
    // Sets the good flag again after a failure.
    virtual void ClearError() = 0;
    virtual bool IsGood() const = 0;
    // Returns the number of bytes read; fewer than count means the end of the data.
    virtual uint32_t Read(void* buffer, uint32_t count) = 0;
    virtual uint32_t Write(const void* buffer, uint32_t count) = 0;
    // origin 0: from the start, 1: from the current position, 2: from the end.
    // Returns 0, or a negative code.
    virtual int Seek(int64_t offset, int origin) = 0;
    // Position of the next byte.
    virtual int64_t Tell() const = 0;
    // True after a read met the end of the data.
    virtual bool AtEnd() const = 0;
};
