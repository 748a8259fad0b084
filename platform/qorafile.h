// Low-level file access: the descriptor calls the streams are built on.
// This is the one place that knows the operating system's file interface; a
// build for another platform replaces this header's implementation.
#pragma once

#include <cstdint>

namespace qora {

// What a stream asks of the operating system when it opens a file.
struct FileAccess {
    bool read = false;
    bool write = false;
    bool create = false;
    bool truncate = false;
    bool append = false;      // every write goes to the end of the file
    bool randomHint = false;  // otherwise the file is read sequentially
    bool shortLived = false;  // the file is temporary
    bool denyNone = false;    // otherwise others are denied write access
};

// Opens the file named in UTF-8; a new file is readable and writable by its
// owner. Returns the descriptor, or -1 with errno set.
int FileOpen(const char* utf8Name, const FileAccess& access);
// Reads up to count bytes; fewer only at the end of the file. Returns the
// number read, or -1 on failure.
int64_t FileRead(int fd, void* buffer, uint32_t count);
// Writes count bytes; returns the number written, or -1 on failure.
int64_t FileWrite(int fd, const void* buffer, uint32_t count);
// origin 0: from the start, 1: from the current position, 2: from the end.
// Returns the new position, or -1 on failure.
int64_t FileSeek(int fd, int64_t offset, int origin);
// Returns 0, or -1 on failure.
int FileClose(int fd);
int FileRemove(const char* utf8Name);

// Fault injection, for tests of what the library does when the device fails:
// the chosen call of the counted kinds fails as the device would. Nothing in
// the library arms it; unarmed, each call pays one relaxed atomic load.
enum FileCall : unsigned { kFileOpen = 1, kFileRead = 2, kFileWrite = 4, kFileSeek = 8 };
struct FileFault {
    unsigned calls = 0;       // FileCall bits: the kinds of call counted
    int64_t failAt = 0;       // the failAt-th counted call (from 1) fails; 0: none
    int error = 0;            // the errno it fails with
    bool shortWrite = false;  // a failing write puts half its bytes and reports them
};
// Arms the fault (or disarms it, with failAt 0) and restarts the count.
// Not to be called while another thread is in these calls.
void InjectFileFault(const FileFault& fault);
// The calls counted since the fault was armed.
int64_t CountedFileCalls();

}  // namespace qora
