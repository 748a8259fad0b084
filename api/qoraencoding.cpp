// The interface encoding, a file's encoding and the locale.
#include <clocale>
#include <cstring>
#include <string>

#include "SFExtensionEncoding.h"
#include "SystemFileDataSource.h"
#include "codepage.h"
#include "qoracall.h"
#include "qoramb.h"

namespace {

// Kept between calls of qoraSetLocale, which hands out a pointer into it.
std::string gLocaleResult;

// The longest encoding name handed out; a file may record one of any length.
enum { kMaxEncodingName = 64 };

// Runs body(file) on the system file behind the entry, or returns 29.
template <typename Body>
int FileCall(int handle, Body&& body) {
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        const SystemFileDataSource* file = entry.SystemFileOrParent();
        return file ? body(*file) : int(QORA_STATUS_NO_SYSTEM_FILE);
    });
}

// The code page of a runtime locale name: what follows its last ".", up to a
// modifier ("@euro") or the next category of a composite name.
std::string LocaleCodePage(const char* name) {
    const char* dot = std::strrchr(name, '.');
    return dot ? std::string(dot + 1, std::strcspn(dot + 1, "@;")) : std::string();
}

}  // namespace

int QORA_API qoraSetInterfaceEncoding(int encoding) {
    return GuardedCall(kCatchHandle, [&]() -> int {
        if (encoding != 0 && encoding != 1) return QORA_STATUS_BAD_ENCODING;
        if (TheHandleTable().AnyOpen()) return QORA_STATUS_FILES_OPEN;
        mbSetUtf8Mode(encoding);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetInterfaceEncoding() { return mbIsUtf8Mode(); }

int QORA_API qoraGetFileEncoding(int handle, char* encoding) {
    if (encoding == nullptr) return kCatchHandle;
    encoding[0] = '\0';
    return FileCall(handle, [&](const SystemFileDataSource& file) {
        mbCopyBounded(encoding, FileEncodingName(file.Settings()).c_str(), kMaxEncodingName + 1);
        return QORA_STATUS_OK;
    });
}

// The whole name counts, however long.
int QORA_API qoraGetFileCodePage(int handle, int* codePage) {
    if (codePage == nullptr) return kCatchHandle;
    *codePage = 0;
    return FileCall(handle, [&](const SystemFileDataSource& file) {
        const long number = EncodingNameToCodePage(FileEncodingName(file.Settings()).c_str());
        if (number == 0) return QORA_STATUS_NO_SYSTEM_FILE;
        *codePage = int(number);
        return QORA_STATUS_OK;
    });
}

// Exported as qoraIsCompatibleEncoding@8 and, by its plain name, as
// qoraIsCompatibleEndoding.
#if defined(_WIN32)
int QORA_API qoraIsCompatibleEncoding(int handle, int* compatible) {
#else
int QORA_API qoraIsCompatibleEndoding(int handle, int* compatible) {
#endif
    if (compatible == nullptr) return kCatchHandle;
    *compatible = 1;
    return FileCall(handle, [&](const SystemFileDataSource& file) {
        const std::string name = FileEncodingName(file.Settings());
        *compatible =
            IsSameEncoding(name.c_str(), InterfaceEncodingName().c_str()) && !file.IsSwapped();
        return QORA_STATUS_OK;
    });
}

const char* QORA_API qoraSetLocale(int category, const char* locale) {
    try {
        if (TheHandleTable().AnyOpen()) {
            const char* current = std::setlocale(category, nullptr);
            gLocaleResult = current ? current : "";
        } else {
            const char* current = std::setlocale(category, nullptr);
            const std::string before = current ? current : "";
            const char* set = std::setlocale(category, locale);
            gLocaleResult = set ? set : "";
            if (!set) std::setlocale(category, before.c_str());
            const std::string codePage = LocaleCodePage(gLocaleResult.c_str());
            if (!codePage.empty()) SetCodePageConverter(codePage.c_str());
        }
        return gLocaleResult.empty() ? nullptr : gLocaleResult.c_str();
    } catch (...) {
        return nullptr;
    }
}
