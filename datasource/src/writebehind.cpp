#include "writebehind.h"

#include <cstring>

#include "strbaseio.h"

bool WriteBehind::Put(int64_t at, const void* data, uint32_t count) {
    if (fLength > 0 && at != fStart + fLength && !Flush()) return false;
    const auto* bytes = static_cast<const unsigned char*>(data);
    // A piece that does not fit fills the collection up first: its whole
    // stretches then go out and leave nothing behind, where writing them
    // before the piece moved the rest of a stretch to the front every time.
    if (fLength > 0 && count > kSize - fLength && count <= kSize) {
        const uint32_t room = kSize - fLength;
        std::memcpy(fBuffer.get() + fLength, bytes, room);
        fLength = kSize;
        bytes += room;
        at += room;
        count -= room;
        if (!WriteWholeStretches()) return false;
    }
    if (count > kSize - fLength && !WriteWholeStretches()) return false;
    if (count > kSize - fLength && !Flush()) return false;
    if (count > kSize) return WriteAt(at, bytes, count);
    if (!fBuffer) fBuffer.reset(new unsigned char[kSize]);
    if (fLength == 0) fStart = at;
    std::memcpy(fBuffer.get() + fLength, bytes, count);
    fLength += count;
    return true;
}

bool WriteBehind::Append(const void* data, uint32_t count) {
    return Put(fLength > 0 ? fStart + fLength : fStream.Tell(), data, count);
}

bool WriteBehind::Flush() {
    const uint32_t length = fLength;
    fLength = 0;
    return Write(length);
}

// Writes that start or end inside a page of the file, or inside the large
// pages the system may keep for aligned stretches, cost it up to twice as
// much as aligned ones: the bytes after the last boundary wait for the next.
bool WriteBehind::WriteWholeStretches() {
    const int64_t end = (fStart + fLength) & ~int64_t{kAlign - 1};
    if (end <= fStart) return true;
    const uint32_t length = static_cast<uint32_t>(end - fStart);
    const bool written = Write(length);
    std::memmove(fBuffer.get(), fBuffer.get() + length, fLength - length);
    fStart = end;
    fLength -= length;
    return written;
}

bool WriteBehind::Write(uint32_t length) { return WriteAt(fStart, fBuffer.get(), length); }

bool WriteBehind::WriteAt(int64_t at, const void* data, uint32_t count) {
    if (fFailed) return false;
    if (count == 0) return true;
    // A stream that raises leaves the flag set.
    fFailed = true;
    fFailed = fStream.Seek(at, 0) != 0 || fStream.Write(data, count) != count;
    return !fFailed;
}
