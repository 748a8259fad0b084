#include "filestream.h"

#include <algorithm>
#include <cstring>
#include <vector>

#include "dserror.h"
#include "qorafile.h"
#include "qoramb.h"

namespace {

using FileName = QORA_FileStream::Data::FileName;

// Converts with one of the code-page routines into a buffer of the given
// worst-case size.
template <typename Convert>
std::string ConvertName(Convert convert, const char* text, size_t worstCase) {
    const int length = static_cast<int>(std::strlen(text));
    std::vector<char> out(worstCase);
    int error = 0;
    int n = convert(nullptr, out.data(), static_cast<int>(out.size()), text, length, &error);
    return std::string(out.data(), static_cast<size_t>(std::max(n, 0)));
}

qora::FileAccess AccessFromMode(const char* mode) {
    auto has = [mode](char c) { return std::strchr(mode, c) != nullptr; };
    qora::FileAccess access;
    if (has('+')) {
        access.read = access.write = true;
        access.create = access.truncate = has('w');
        access.create = access.create || has('a');
        access.append = has('a') && !has('w');
    } else if (has('r')) {
        access.read = true;
    } else if (has('w')) {
        access.write = access.create = access.truncate = true;
    } else if (has('a')) {
        access.write = access.create = access.append = true;
    }
    access.randomHint = has('R');
    access.shortLived = has('T');
    access.denyNone = has('D');
    return access;
}

}  // namespace

void FileName::Set(const char* text) {
    _utf8 = mbIsUtf8Mode() ? std::string(text)
                           : ConvertName(mbCodePageToUtf8, text, 4 * std::strlen(text) + 4);
    _cached = false;
}

const char* FileName::InInterfaceEncoding() const {
    if (mbIsUtf8Mode()) return _utf8.c_str();
    if (!_cached || _generation != mbGeneration()) {
        _codePage = ConvertName(mbUtf8ToCodePage, _utf8.c_str(), 2 * _utf8.size() + 4);
        _generation = mbGeneration();
        _cached = true;
    }
    return _codePage.c_str();
}

QORA_FileStream::QORA_FileStream() : fData(new Data) { fData->name.Reset(new FileName); }

QORA_FileStream::QORA_FileStream(const char* name, const char* mode) : QORA_FileStream() {
    if (!Open(name, mode)) {
        fData->good = false;
        RaiseError(kErrStreamOpen, name);
    }
}

QORA_FileStream::QORA_FileStream(const QORA_FileStream& other) : fData(new Data) {
    fData->name = other.fData->name;
    fData->deleteWhenClosed = other.fData->deleteWhenClosed;
    if (!OpenNamed("rb")) RaiseError(kErrStreamOpen, fData->name->Utf8());
    Seek(0, 0);
}

QORA_FileStream::~QORA_FileStream() {
    try {
        Flush();
    } catch (...) {
        // Nothing may escape a destructor; callers that need to know flush first.
    }
    Close();
    if (fData->deleteWhenClosed && fData->name->RefCount() == 1) {
        qora::FileRemove(fData->name->Utf8().c_str());
    }
}

void QORA_FileStream::ClearError() { fData->good = true; }

bool QORA_FileStream::IsGood() const { return fData->good; }

int64_t QORA_FileStream::Tell() const { return fPos; }

bool QORA_FileStream::AtEnd() const { return fData->atEnd; }

const char* QORA_FileStream::Name() const {
    if (!fData->name.IsValid() || fData->name->Utf8().empty()) return nullptr;
    return fData->name->InInterfaceEncoding();
}

bool QORA_FileStream::Open(const char* name, const char* mode) {
    // The name may be this stream's own (reopening by Name()), so it is taken
    // before the name record changes.
    const std::string text(name ? name : "");
    fData->name.Mutable()->Set(text.c_str());
    fData->deleteWhenClosed = false;
    return OpenNamed(mode);
}

bool QORA_FileStream::Open(const Data::FileName& name, const char* mode) {
    fData->name.Reset(new FileName(name));
    fData->deleteWhenClosed = false;
    return OpenNamed(mode);
}

bool QORA_FileStream::OpenNamed(const char* mode) {
    // Buffered writes belong to the old file: they are written before it goes.
    Flush();
    Close();
    const qora::FileAccess access = AccessFromMode(mode);
    const int fd = qora::FileOpen(fData->name->Utf8().c_str(), access);
    if (fd < 0) {
        fData->good = false;
        return false;
    }
    Data& d = *fData;
    d.fd = fd;
    d.deleteWhenClosed = d.deleteWhenClosed || access.denyNone;
    d.devicePos = access.append ? std::max<int64_t>(qora::FileSeek(fd, 0, 2), 0) : 0;
    fPos = d.devicePos;
    d.good = true;
    return true;
}

void QORA_FileStream::Close() {
    Data& d = *fData;
    if (d.fd >= 0) qora::FileClose(d.fd);
    d.fd = -1;
    d.fillEnd = d.buffer;
    d.bufferPos = -1;
    d.written = false;
    d.atEnd = false;
}

void QORA_FileStream::Fail(long error) {
    fData->good = false;
    const char* name = Name();
    RaiseError(error, name ? name : "");
}

void QORA_FileStream::MoveDevice(int64_t pos, long error) {
    if (fData->devicePos == pos) return;
    if (qora::FileSeek(fData->fd, pos, 0) != pos) Fail(error);
    fData->devicePos = pos;
}

uint32_t QORA_FileStream::TakeFromBuffer(char*& out, uint32_t wanted) {
    const Data& d = *fData;
    if (d.bufferPos < 0 || fPos < d.bufferPos) return 0;
    const int64_t offset = fPos - d.bufferPos;
    if (offset >= static_cast<int64_t>(Buffered())) return 0;
    const uint32_t n =
        static_cast<uint32_t>(std::min<int64_t>(wanted, static_cast<int64_t>(Buffered()) - offset));
    std::memcpy(out, d.buffer + offset, n);
    out += n;
    fPos += n;
    return n;
}

uint32_t QORA_FileStream::Read(void* buffer, uint32_t count) {
    Data& d = *fData;
    // Nothing lies before the start of a file.
    if (d.fd < 0 || count == 0 || fPos < 0) return 0;
    if (d.written) Flush();
    char* out = static_cast<char*>(buffer);
    uint32_t wanted = count - TakeFromBuffer(out, count);

    if (wanted >= kBufferSize) {
        // Straight into the caller's memory, up to the last block boundary.
        const int64_t end = (fPos + wanted) & ~int64_t{kBlockAlign - 1};
        const uint32_t direct = static_cast<uint32_t>(end - fPos);
        MoveDevice(fPos, kErrStreamRead);
        const int64_t got = qora::FileRead(d.fd, out, direct);
        if (got < 0) Fail(kErrStreamRead);
        d.devicePos += got;
        fPos += got;
        out += got;
        wanted -= static_cast<uint32_t>(got);
    }

    while (wanted > 0) {
        const int64_t block = fPos & ~int64_t{kBlockAlign - 1};
        MoveDevice(block, kErrStreamRead);
        const int64_t got = qora::FileRead(d.fd, d.buffer, kBufferSize);
        if (got < 0) Fail(kErrStreamRead);
        d.devicePos += got;
        d.bufferPos = block;
        d.fillEnd = d.buffer + got;
        if (got == 0) {
            d.atEnd = true;
            break;
        }
        wanted -= TakeFromBuffer(out, wanted);
        if (got < kBufferSize) break;
    }
    return count - wanted;
}

uint32_t QORA_FileStream::Write(const void* buffer, uint32_t count) {
    Data& d = *fData;
    if (d.fd < 0 || count == 0) return 0;
    // A write before the start of the file can never succeed.
    if (fPos < 0) Fail(kErrStreamWrite);
    if (!d.written) {
        d.written = true;
        d.fillEnd = d.buffer;
    }
    const char* in = static_cast<const char*>(buffer);
    uint32_t rest = count;

    const int64_t offset = fPos - d.bufferPos;
    if (Buffered() > 0 && offset >= 0 && offset <= static_cast<int64_t>(Buffered()) &&
        offset < kBufferSize) {
        const uint32_t n = std::min<uint32_t>(rest, kBufferSize - static_cast<uint32_t>(offset));
        std::memcpy(d.buffer + offset, in, n);
        d.fillEnd = std::max(d.fillEnd, d.buffer + offset + n);
        in += n;
        rest -= n;
        fPos += n;
        if (Buffered() < kBufferSize) return count;
    }
    Flush();

    if (rest > 0 && rest < kBufferSize) {
        d.bufferPos = fPos;
        std::memcpy(d.buffer, in, rest);
        d.fillEnd = d.buffer + rest;
        fPos += rest;
    } else if (rest > 0) {
        MoveDevice(fPos, kErrStreamWrite);
        const int64_t put = qora::FileWrite(d.fd, in, rest);
        if (put > 0) {
            d.devicePos += put;
            fPos += put;
        }
        if (put != rest) Fail(kErrStreamWrite);
    }
    return count;
}

bool QORA_FileStream::Flush() {
    Data& d = *fData;
    if (!d.written || Buffered() == 0) return true;
    MoveDevice(d.bufferPos, kErrStreamWrite);
    const int64_t put = qora::FileWrite(d.fd, d.buffer, static_cast<uint32_t>(Buffered()));
    if (put > 0) d.devicePos += put;
    if (put != static_cast<int64_t>(Buffered())) Fail(kErrStreamWrite);
    d.fillEnd = d.buffer;
    return true;
}

bool QORA_FileStream::Commit() {
    if (fData->fd < 0) return false;
    return Flush();
}

int QORA_FileStream::Seek(int64_t offset, int origin) {
    Data& d = *fData;
    if (d.fd < 0) return -1;
    d.atEnd = false;
    if (origin == 0) {
        fPos = offset;
    } else if (origin == 1) {
        fPos += offset;
    } else {
        int64_t end = qora::FileSeek(d.fd, 0, 2);
        if (end < 0) {
            d.good = false;
            return -1;
        }
        d.devicePos = end;
        if (d.written && Buffered() > 0) {
            end = std::max(end, d.bufferPos + static_cast<int64_t>(Buffered()));
        }
        fPos = end + offset;
    }
    return 0;
}
