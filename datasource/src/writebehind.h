// Bytes bound for a stream, collected and handed over in large writes: the
// case data of a file being written go out in a few calls to the system
// rather than one per case or per compressed block.
#pragma once

#include <cstdint>
#include <memory>

class QORA_StrBaseIO;

class WriteBehind {
  public:
    // Writes cover whole, aligned stretches of kAlign bytes where they can;
    // the collection holds two of them.
    enum : uint32_t { kAlign = 64 * 1024, kSize = 2 * kAlign };

    explicit WriteBehind(QORA_StrBaseIO& stream) : fStream(stream) {}

    // Collects count bytes that belong at the stream position at. What was
    // collected is written first when the bytes do not follow it or do not
    // fit beside it. False when the stream takes fewer bytes than it is given.
    bool Put(int64_t at, const void* data, uint32_t count);
    // Put at the end of what is collected or, with nothing collected, at
    // the stream's position.
    bool Append(const void* data, uint32_t count);
    // Writes what is collected, which is then given up whatever happens.
    bool Flush();

  private:
    bool WriteWholeStretches();
    // Writes the first length bytes collected at their place.
    bool Write(uint32_t length);
    bool WriteAt(int64_t at, const void* data, uint32_t count);

    QORA_StrBaseIO& fStream;
    std::unique_ptr<unsigned char[]> fBuffer;  // made at the first Put
    int64_t fStart = 0;
    uint32_t fLength = 0;
    // After one write has failed nothing more is written: bytes that belong
    // after the ones lost would leave a gap that a reader takes for data.
    bool fFailed = false;
};
