#include "extension.h"

#include <algorithm>
#include <cstring>
#include <limits>

#include "dserror.h"

namespace {

std::string Bytes(int32_t elementSize, int32_t nElements, const void* content) {
    QORA_ASSERT(nElements >= 0);
    if (content == nullptr) return {};
    return std::string(static_cast<const char*>(content),
                       static_cast<size_t>(elementSize) * static_cast<size_t>(nElements));
}

}  // namespace

QORA_ExtensionImpl::QORA_ExtensionImpl(int32_t type, int32_t elementSize, int32_t nElements,
                                       const void* content)
    : QORA_ExtensionImpl(type, elementSize, Bytes(elementSize, nElements, content)) {}

QORA_ExtensionImpl::QORA_ExtensionImpl(int32_t type, int32_t elementSize, std::string content)
    : fType(type), fElementSize(elementSize), fContent(std::move(content)) {
    QORA_ASSERT(elementSize >= 1);
    // The element count must stay representable.
    QORA_ASSERT(fContent.size() / elementSize <=
                static_cast<size_t>(std::numeric_limits<int32_t>::max()));
}

void QORA_ExtensionImpl::Append(int32_t nElements, const void* content) {
    QORA_ASSERT(nElements == 0 || content != nullptr);
    std::string more = Bytes(fElementSize, nElements, content);
    QORA_ASSERT((fContent.size() + more.size()) / fElementSize <=
                static_cast<size_t>(std::numeric_limits<int32_t>::max()));
    fContent += more;
}

int32_t QORA_ExtensionImpl::LastInteger() const {
    if (fContent.size() < 4) return 0;
    const unsigned char* last =
        reinterpret_cast<const unsigned char*>(fContent.data()) + fContent.size() - 4;
    uint32_t value = last[0] | (last[1] << 8) | (last[2] << 16) | (uint32_t{last[3]} << 24);
    return static_cast<int32_t>(value);
}

QORA_Extension::QORA_Extension(int32_t type, int32_t elementSize, int32_t nElements,
                               const void* content)
    : fpImpl(new QORA_ExtensionImpl(type, elementSize, nElements, content)) {}

void QORA_Extension::Append(int32_t nElements, const void* content) {
    QORA_ASSERT(IsValid());
    fpImpl.Mutable()->Append(nElements, content);
}

int32_t QORA_ExtensionReader::Type() const {
    return fRecord.IsValid() ? fRecord.Impl()->Type() : -1;
}

int32_t QORA_ExtensionReader::ElementSize() const {
    return fRecord.IsValid() ? fRecord.Impl()->ElementSize() : 0;
}

int32_t QORA_ExtensionReader::ElementCount() const {
    return fRecord.IsValid() ? fRecord.Impl()->ElementCount() : 0;
}

int32_t QORA_ExtensionReader::Read(void* buffer, int32_t maxBytes) {
    if (!fRecord.IsValid() || maxBytes <= 0) return 0;
    const QORA_ExtensionImpl& record = *fRecord.Impl();
    int32_t n = std::min(maxBytes / record.ElementSize(), record.ElementCount() - fPos);
    if (n <= 0) return 0;
    size_t size = record.ElementSize();
    std::memcpy(buffer, record.Content().data() + fPos * size, n * size);
    fPos += n;
    return n;
}

bool QORA_ExtensionList::HasExtension(int32_t type) const {
    return 0 <= type && static_cast<size_t>(type) < fRecords.size() && !fRecords[type].IsEmpty();
}

QORA_Extension QORA_ExtensionList::Get(int32_t type) const {
    return HasExtension(type) ? fRecords[type] : QORA_Extension(type, 1, 0, nullptr);
}

int32_t QORA_ExtensionList::LastIntegerOf(int32_t type) const {
    return HasExtension(type) ? fRecords[type].LastInteger() : 0;
}

void QORA_ExtensionList::SetContent(int32_t type, int32_t elementSize, int32_t nElements,
                                    const void* content) {
    QORA_ASSERT(0 <= type);
    QORA_ASSERT(nElements >= 0);
    QORA_ASSERT((nElements == 0) >= (content == 0));
    if (nElements > 0) {
        Set(type, QORA_Extension(type, std::max(elementSize, 1), nElements, content));
    } else {
        Set(type, QORA_Extension());
    }
}

void QORA_ExtensionList::Set(int32_t type, const QORA_Extension& record) {
    QORA_ASSERT(0 <= type);
    if (!record.IsEmpty()) {
        if (static_cast<size_t>(type) >= fRecords.size()) fRecords.resize(type + size_t{1});
        fRecords[type] = record;
    } else if (static_cast<size_t>(type) < fRecords.size()) {
        fRecords[type] = QORA_Extension();
    }
}

void QORA_ExtensionList::Append(int32_t type, int32_t nElements, const void* content) {
    QORA_ASSERT(HasExtension(type));
    QORA_ASSERT(nElements >= 0);
    if (nElements > 0) fRecords[type].Append(nElements, content);
}

int32_t QORA_ExtensionList::TypeBound() const {
    return std::max<int32_t>(22, static_cast<int32_t>(fRecords.size()) - 1);
}

void QORA_ExtensionList::Import(int32_t type, int32_t elementSize, std::string content) {
    QORA_FILE_CHECK(kErrBadFormat, 0 <= type && type <= eMaxExtensionType);
    QORA_FILE_CHECK(kErrBadFormat, elementSize >= 1);
    QORA_FILE_CHECK(kErrBadFormat, content.size() / elementSize <=
                                       static_cast<size_t>(std::numeric_limits<int32_t>::max()));
    Set(type, QORA_Extension(new QORA_ExtensionImpl(type, elementSize, std::move(content))));
}
