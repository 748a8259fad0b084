// Extension records kept verbatim beside the dictionary: records no handler
// turned into dictionary properties, the document text (type 0) and the set
// texts parsed on demand. Kept per type in a data source's QORA_ExtensionList.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "refcnt.h"

// The subtypes of the type 7 records a system file may carry; type 0 is the
// document text, which a file keeps in a record of its own.
enum ExtensionSubtype : int32_t {
    kDocumentExtension = 0,
    kIntegerInfoExtension = 3,
    kFloatInfoExtension = 4,
    kVariableSetExtension = 5,
    kDateInfoExtension = 6,
    kMultRespExtension = 7,
    kKIVExtension = 8,
    kTextInfoExtension = 10,
    kDisplayExtension = 11,
    kKIVIdExtension = 12,
    kLongNamesExtension = 13,
    kVeryLongStringsExtension = 14,
    kCaseCountExtension = 16,
    kFileAttributesExtension = 17,
    kVariableAttributesExtension = 18,
    kExtendedMultRespExtension = 19,
    kEncodingExtension = 20,
    kLongValueLabelsExtension = 21,
};

class QORA_ExtensionImpl : public QORA_RefCntObject {
  public:
    // Copies elementSize * nElements bytes of content (absent: empty record).
    // Preconditions elementSize >= 1, nElements >= 0.
    QORA_ExtensionImpl(int32_t type, int32_t elementSize, int32_t nElements, const void* content);
    // Takes content as it stands; its length need not be a multiple of elementSize.
    QORA_ExtensionImpl(int32_t type, int32_t elementSize, std::string content);
    ~QORA_ExtensionImpl() override = default;

    int32_t Type() const { return fType; }
    int32_t ElementSize() const { return fElementSize; }
    int32_t ElementCount() const { return static_cast<int32_t>(fContent.size() / fElementSize); }
    const std::string& Content() const { return fContent; }
    bool IsEmpty() const { return fContent.empty(); }
    // Precondition nElements >= 0.
    void Append(int32_t nElements, const void* content);
    // The last 4 bytes as a little-endian integer; 0 for fewer than 4 bytes.
    int32_t LastInteger() const;

  private:
    int32_t fType;
    int32_t fElementSize;
    std::string fContent;
};

// Handle to a record (null for none), copied on write.
class QORA_Extension {
  public:
    QORA_Extension() = default;
    QORA_Extension(int32_t type, int32_t elementSize, int32_t nElements, const void* content);
    explicit QORA_Extension(QORA_ExtensionImpl* impl) : fpImpl(impl) {}

    bool IsValid() const { return fpImpl.IsValid(); }
    // Null or without content.
    bool IsEmpty() const { return !fpImpl.IsValid() || fpImpl->IsEmpty(); }
    const QORA_ExtensionImpl* Impl() const { return fpImpl.Get(); }
    bool SameObject(const QORA_Extension& other) const { return fpImpl.SameObject(other.fpImpl); }
    // Precondition: a valid handle. Unshares the record first.
    void Append(int32_t nElements, const void* content);
    int32_t LastInteger() const { return fpImpl.IsValid() ? fpImpl->LastInteger() : 0; }

  private:
    QORA_CowRef<QORA_ExtensionImpl> fpImpl;
};

// Reads a record in whole elements.
class QORA_ExtensionReader {
  public:
    explicit QORA_ExtensionReader(QORA_Extension record) : fRecord(std::move(record)) {}
    int32_t Type() const;          // -1 for a null handle
    int32_t ElementSize() const;   // 0 for a null handle
    int32_t ElementCount() const;  // 0 for a null handle
    int32_t Position() const { return fPos; }
    // Copies the whole elements that fit in maxBytes, never more than remain;
    // returns how many and moves past them.
    int32_t Read(void* buffer, int32_t maxBytes);

  private:
    QORA_Extension fRecord;
    int32_t fPos = 0;
};

// A data source's records, one handle per type (index = type); only non-empty
// records are stored. Copying the list shares the records.
class QORA_ExtensionList {
  public:
    // Types a file may bring: a larger one would make the list (and the
    // writer's walk over it) unreasonably long.
    enum { eMaxExtensionType = 65535 };

    bool HasExtension(int32_t type) const;
    // The stored record, or a new empty one of that type with element size 1.
    QORA_Extension Get(int32_t type) const;
    int32_t LastIntegerOf(int32_t type) const;
    // Preconditions 0 <= type, nElements >= 0, absent content only with a zero
    // count. A zero count clears the type; an element size below 1 is taken as 1.
    void SetContent(int32_t type, int32_t elementSize, int32_t nElements, const void* content);
    // Stores a non-empty record; a null or empty one clears the type.
    void Set(int32_t type, const QORA_Extension& record);
    // Preconditions HasExtension(type), nElements >= 0.
    void Append(int32_t type, int32_t nElements, const void* content);
    // The larger of 22 and the list length - 1 (the list never shrinks).
    int32_t TypeBound() const;
    // A record read from a file: the type and element size are checked (error
    // 1204 when out of range) and content is stored as read.
    void Import(int32_t type, int32_t elementSize, std::string content);

  private:
    std::vector<QORA_Extension> fRecords;
};
