// The buffered stream over an operating-system file, with 64-bit positions.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "refcnt.h"
#include "strbaseio.h"

class QORA_FileStream : public QORA_StrBaseIO {
  public:
    enum : uint32_t { kBufferSize = 4096, kBlockAlign = 512 };

    // The owned state of one stream; the file name is shared between copies.
    struct Data {
        // The name of a file, kept in UTF-8 (the form used to open it) and,
        // on demand, in the caller's code page.
        class FileName : public QORA_RefCntObject {
          public:
            // Takes a name in the interface encoding.
            void Set(const char* text);
            const std::string& Utf8() const { return _utf8; }
            // The name in the interface encoding, converted again when the
            // interface encoding has changed since the last call.
            const char* InInterfaceEncoding() const;

          private:
            std::string _utf8;
            // A cache of the UTF-8 name, valid for one interface encoding.
            mutable std::string _codePage;
            mutable unsigned _generation = 0;
            mutable bool _cached = false;
        };

        char buffer[kBufferSize];
        char* fillEnd = buffer;
        int64_t bufferPos = -1;
        int64_t devicePos = 0;
        int fd = -1;
        QORA_CowRef<FileName> name;
        bool deleteWhenClosed = false;
        bool written = false;
        bool good = false;
        bool atEnd = false;
    };

    QORA_FileStream();
    // Raises internal error 1000 when the file cannot be opened.
    QORA_FileStream(const char* name, const char* mode);
    // A read-only stream over the same file, with its own position; shares
    // the file name and its delete-when-closed duty.
    QORA_FileStream(const QORA_FileStream& other);
    QORA_FileStream& operator=(const QORA_FileStream&) = delete;
    ~QORA_FileStream() override;

    void ClearError() override;
    bool IsGood() const override;
    uint32_t Read(void* buffer, uint32_t count) override;
    uint32_t Write(const void* buffer, uint32_t count) override;
    int Seek(int64_t offset, int origin) override;
    int64_t Tell() const override;
    bool AtEnd() const override;

    // Closes what is open and opens the file named in the interface encoding.
    virtual bool Open(const char* name, const char* mode);
    // The same with a name record kept by the caller; the stream takes a copy.
    bool Open(const Data::FileName& name, const char* mode);
    virtual bool Commit();
    virtual bool Flush();
    // The name in the interface encoding; null when the stream has none.
    virtual const char* Name() const;

  private:
    bool OpenNamed(const char* mode);
    void Close();
    size_t Buffered() const { return static_cast<size_t>(fData->fillEnd - fData->buffer); }
    uint32_t TakeFromBuffer(char*& out, uint32_t wanted);
    void MoveDevice(int64_t pos, long error);
    [[noreturn]] void Fail(long error);

    std::unique_ptr<Data> fData;
    int64_t fPos = 0;
};
