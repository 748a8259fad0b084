#include "accessprobe.h"

#include "filestream.h"
#include "qorafile.h"
#include "qoraio32.h"

namespace {

// Opens and closes at once; true when the open succeeded.
bool OpensAs(const std::string& utf8Name, const qora::FileAccess& access) {
    const int fd = qora::FileOpen(utf8Name.c_str(), access);
    if (fd < 0) return false;
    qora::FileClose(fd);
    return true;
}

qora::FileAccess Access(bool read, bool write, bool create) {
    qora::FileAccess access;
    access.read = read;
    access.write = write;
    access.create = create;
    return access;
}

// A file to be written must be writable when it exists and creatable when it
// does not. An existing file that cannot be read is still only opened for
// writing, never created over: the probe must not truncate or remove it.
bool CanWrite(const std::string& name) {
    if (OpensAs(name, Access(true, false, false))) return OpensAs(name, Access(true, true, false));
    if (OpensAs(name, Access(false, true, false))) return true;
    if (!OpensAs(name, Access(false, true, true))) return false;
    qora::FileRemove(name.c_str());
    return true;
}

}  // namespace

int AccessProbe(const char* fileName, int mode) {
    if (fileName == nullptr) return QORA_STATUS_CANNOT_OPEN;
    QORA_FileStream::Data::FileName name;
    name.Set(fileName);
    bool ok = false;
    switch (mode) {
        case kProbeRead:
            ok = OpensAs(name.Utf8(), Access(true, false, false));
            break;
        case kProbeWrite:
            ok = CanWrite(name.Utf8());
            break;
        case kProbeAppend:
            ok = OpensAs(name.Utf8(), Access(true, true, false));
            break;
    }
    return ok ? QORA_STATUS_OK : QORA_STATUS_CANNOT_OPEN;
}
