// POSIX implementation of the descriptor calls. Large-file safe: offsets are
// 64-bit whatever the build's default.
#define _FILE_OFFSET_BITS 64

#include "qorafile.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>

static_assert(sizeof(off_t) == 8, "file offsets must be 64-bit");

namespace qora {

namespace {

std::atomic<bool> gFaultArmed{false};
FileFault gFault;
std::atomic<int64_t> gFaultCount{0};

// Whether this call is the one to fail; errno is set when it is.
bool Faulted(FileCall call) {
    if (!gFaultArmed.load(std::memory_order_relaxed) || (gFault.calls & call) == 0) return false;
    if (gFaultCount.fetch_add(1) + 1 != gFault.failAt) return false;
    errno = gFault.error;
    return true;
}

int OpenFlags(const FileAccess& access) {
    int flags = O_CLOEXEC;
    if (access.read && access.write) {
        flags |= O_RDWR;
    } else if (access.write) {
        flags |= O_WRONLY;
    } else {
        flags |= O_RDONLY;
    }
    if (access.create) flags |= O_CREAT;
    if (access.truncate) flags |= O_TRUNC;
    if (access.append) flags |= O_APPEND;
    return flags;
}

}  // namespace

void InjectFileFault(const FileFault& fault) {
    gFaultArmed = false;
    gFault = fault;
    gFaultCount = 0;
    gFaultArmed = fault.failAt > 0;
}

int64_t CountedFileCalls() { return gFaultCount; }

int FileOpen(const char* utf8Name, const FileAccess& access) {
    if (Faulted(kFileOpen)) return -1;
    int fd;
    // Read and write for everyone the umask allows, as any new file gets here.
    do {
        fd = ::open(utf8Name, OpenFlags(access), 0666);
    } while (fd < 0 && errno == EINTR);
    if (fd < 0) return -1;
    // POSIX knows no sharing modes: denyNone and the deny-write default are
    // both left to the openers. The access hints become read-ahead advice.
    ::posix_fadvise(fd, 0, 0, access.randomHint ? POSIX_FADV_RANDOM : POSIX_FADV_SEQUENTIAL);
    return fd;
}

int64_t FileRead(int fd, void* buffer, uint32_t count) {
    if (Faulted(kFileRead)) return -1;
    char* out = static_cast<char*>(buffer);
    int64_t done = 0;
    while (done < count) {
        ssize_t got = ::read(fd, out + done, count - done);
        if (got < 0) {
            if (errno == EINTR) continue;
            return -1;
        }
        if (got == 0) break;
        done += got;
    }
    return done;
}

int64_t FileWrite(int fd, const void* buffer, uint32_t count) {
    if (Faulted(kFileWrite)) return gFault.shortWrite ? FileWrite(fd, buffer, count / 2) : -1;
    const char* in = static_cast<const char*>(buffer);
    int64_t done = 0;
    while (done < count) {
        ssize_t put = ::write(fd, in + done, count - done);
        if (put < 0) {
            if (errno == EINTR) continue;
            return -1;
        }
        if (put == 0) break;
        done += put;
    }
    return done;
}

int64_t FileSeek(int fd, int64_t offset, int origin) {
    if (Faulted(kFileSeek)) return -1;
    int whence = origin == 0 ? SEEK_SET : origin == 1 ? SEEK_CUR : SEEK_END;
    return ::lseek(fd, static_cast<off_t>(offset), whence);
}

int FileClose(int fd) {
    // A close interrupted by a signal has still released the descriptor on
    // Linux: retrying could close a descriptor another thread just got.
    int rc = ::close(fd);
    return rc < 0 && errno != EINTR ? -1 : 0;
}

int FileRemove(const char* utf8Name) { return ::unlink(utf8Name); }

}  // namespace qora
