#include "inmemfile.h"

#include <algorithm>
#include <cstring>

QORA_InMemoryFile::QORA_InMemoryFile() : _block(new char[kInitialSize]) {
    _start = _pos = _end = _block.get();
    _limit = _start + kInitialSize;
}

uint32_t QORA_InMemoryFile::Read(void* buffer, uint32_t count) {
    const uint32_t n = static_cast<uint32_t>(std::min<size_t>(count, _end - _pos));
    std::memcpy(buffer, _pos, n);
    _pos += n;
    _atEnd = n < count;
    return n;
}

uint32_t QORA_InMemoryFile::Write(const void* buffer, uint32_t count) {
    if (count == 0) return 0;
    if (count > static_cast<size_t>(_limit - _pos)) {
        // Grow by half again until one step alone covers the request.
        size_t size = Capacity();
        size_t increase = 0;
        do {
            increase = size / 2;
            size += increase;
        } while (increase < count);
        std::unique_ptr<char[]> block(new char[size]);
        std::memcpy(block.get(), _start, Size());
        const ptrdiff_t pos = _pos - _start;
        const ptrdiff_t end = _end - _start;
        _block = std::move(block);
        _start = _block.get();
        _pos = _start + pos;
        _end = _start + end;
        _limit = _start + size;
    }
    std::memcpy(_pos, buffer, count);
    _pos += count;
    _end = std::max(_end, _pos);
    return count;
}

int QORA_InMemoryFile::Seek(int64_t offset, int origin) {
    // Offsets are 32-bit here: an in-memory file never holds 2 GB.
    const ptrdiff_t delta = static_cast<int32_t>(offset);
    const char* base;
    switch (origin) {
        case 0:
            base = _start;
            break;
        case 1:
            base = _pos;
            break;
        case 2:
            base = _end;
            break;
        default:
            return -2;
    }
    const ptrdiff_t target = (base - _start) + delta;
    if (target < 0 || target > _end - _start) return -1;
    _pos = _start + target;
    _atEnd = false;
    return 0;
}
