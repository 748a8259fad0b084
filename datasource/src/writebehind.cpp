#include "writebehind.h"

#include <cstring>

#include "strbaseio.h"

bool WriteBehind::Put(int64_t at, const void* data, uint32_t count) {
    if (fLength > 0 && (at != fStart + fLength || count > kSize - fLength) && !Flush())
        return false;
    if (count > kSize) return fStream.Seek(at, 0) == 0 && fStream.Write(data, count) == count;
    if (!fBuffer) fBuffer.reset(new unsigned char[kSize]);
    if (fLength == 0) fStart = at;
    std::memcpy(fBuffer.get() + fLength, data, count);
    fLength += count;
    return true;
}

bool WriteBehind::Append(const void* data, uint32_t count) {
    return Put(fLength > 0 ? fStart + fLength : fStream.Tell(), data, count);
}

bool WriteBehind::Flush() {
    if (fLength == 0) return true;
    const uint32_t length = fLength;
    fLength = 0;
    return fStream.Seek(fStart, 0) == 0 && fStream.Write(fBuffer.get(), length) == length;
}
