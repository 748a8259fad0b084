#include "SystemFileDataSource.h"

#include <algorithm>
#include <array>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <set>
#include <utility>
#include <vector>

#include "SystemFileExtensionRecord.h"
#include "dictnry.h"
#include "qoramb.h"
#include "variableset.h"

namespace {

using int32 = int32_t;

enum : int32 {
    kVariableRecord = 2,
    kValueLabelRecord = 3,
    kValueLabelVarsRecord = 4,
    kDocumentRecord = 6,
    kExtensionRecord = 7,
    kEndRecord = 999
};
enum { kDocumentLineSize = 80, kMaxFileVarType = 255, kMaxNameSize = 64 };

std::string TrimmedText(const char* bytes, size_t size) {
    while (size > 0 && bytes[size - 1] == ' ') --size;
    return std::string(bytes, size);
}

// Reads the header and the dictionary records of one file into its source.
// Every number read is checked against the bytes that remain before it
// sizes an allocation or a loop.
class DictionaryReader {
  public:
    DictionaryReader(SystemFileDataSource& source, QORA_StrBaseIO& stream)
        : fSource(source), fSettings(source.Settings()), fStream(stream), fSlots(source) {
        fStream.Seek(0, 2);
        fFileSize = fStream.Tell();
        fStream.Seek(0, 0);
    }

    void ReadHeader();
    // Up to and including the type 999 record.
    void ReadRecords();

  private:
    uint32_t Read(void* buffer, uint32_t count) { return fStream.Read(buffer, count); }
    int64_t Remaining() const { return std::max<int64_t>(0, fFileSize - fStream.Tell()); }
    int32 Int(int32 value) const { return fSettings.fSwapped ? SwapInt32(value) : value; }
    int32 ReadInt(const char* condition);
    void ReadRaw(std::string& bytes, int64_t size, const char* condition);

    void CloseVariables();
    void ReadVariable();
    void ReadValueLabels();
    void ReadDocuments();
    void ReadExtension();

    SystemFileDataSource& fSource;
    HeaderSettings& fSettings;
    QORA_StrBaseIO& fStream;
    SlotDictionary fSlots;
    int64_t fFileSize = 0;
    bool fVariablesClosed = false;
};

int32 DictionaryReader::ReadInt(const char* condition) {
    int32 value = 0;
    const uint32_t len = Read(&value, sizeof value);
    QORA_FILE_CHECK_TEXT(kErrTooShort, len == sizeof value, condition);
    return Int(value);
}

// size comes from the file: it is checked against what is left before the
// buffer is made.
void DictionaryReader::ReadRaw(std::string& bytes, int64_t size, const char* condition) {
    QORA_FILE_CHECK_TEXT(kErrTooShort, size <= Remaining(), condition);
    QORA_FILE_CHECK_TEXT(kErrBadFormat, size <= INT32_MAX, "size <= INT32_MAX");
    bytes.resize(size_t(size));
    const uint32_t len = Read(&bytes[0], uint32_t(size));
    QORA_FILE_CHECK_TEXT(kErrTooShort, len == size, condition);
}

void DictionaryReader::ReadHeader() {
    char magic[5] = {};
    uint32_t nRead = Read(magic, 4);
    QORA_FILE_CHECK_TEXT(kErrTooShort, nRead == 4, "nRead == 4");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, std::string(magic) == "$FL2",
                         "std::string(magic) == \"$FL2\"");
    char h[HeaderSettings::kHeaderSize - 4];
    const uint32_t len1 = sizeof h;
    nRead = Read(h, len1);
    QORA_FILE_CHECK_TEXT(kErrTooShort, nRead == len1, "nRead == len1");

    int32 layout, caseSize, compression, weight, caseCount;
    double bias;
    std::memcpy(&layout, h + 60, 4);
    std::memcpy(&caseSize, h + 64, 4);
    std::memcpy(&compression, h + 68, 4);
    std::memcpy(&weight, h + 72, 4);
    std::memcpy(&caseCount, h + 76, 4);
    std::memcpy(&bias, h + 80, 8);
    // A writer puts a small layout code; anything else means its bytes were
    // written the other way round.
    fSettings.fSwapped = layout < 1 || layout > 255;
    fSettings.fLayoutCode = Int(layout);
    fSettings.fCaseSize = Int(caseSize);
    fSettings.fCompressed = Int(compression) != 0;
    fSettings.fWeightIndex = Int(weight);
    fSettings.fCaseCount = Int(caseCount);
    fSettings.fBias = fSettings.fSwapped ? SwapDouble(bias) : bias;
    fSettings.fProduct = TrimmedText(h, HeaderSettings::kProductSize);

    double stamp = 0.0;
    if (ParseCreationStamp(h + 88, h + 97, &stamp) && stamp != 0.0) fSource.SetTimeStamp(stamp);
    fSource.SetIdString(TrimmedText(h + 105, HeaderSettings::kLabelSize).c_str());
}

void DictionaryReader::ReadRecords() {
    for (;;) {
        int32 recType = 0;
        const uint32_t len = Read(&recType, sizeof recType);
        QORA_FILE_CHECK_TEXT(kErrTooShort, len == sizeof(recType), "len == sizeof(recType)");
        recType = Int(recType);
        if (recType != kVariableRecord && !fVariablesClosed) CloseVariables();
        switch (recType) {
            case kVariableRecord:
                ReadVariable();
                break;
            case kValueLabelRecord:
                ReadValueLabels();
                break;
            case kDocumentRecord:
                ReadDocuments();
                break;
            case kExtensionRecord:
                ReadExtension();
                break;
            case kEndRecord:
                ReadInt("len == sizeof(padding)");
                return;
            default:
                QORA_FILE_CHECK_TEXT(kErrBadFormat, false, "false");
        }
    }
}

// Once the variables are all there: slots, the swap mask, the case size
// and the weight follow from the dictionary, never from the header alone.
void DictionaryReader::CloseVariables() {
    fVariablesClosed = true;
    fSlots.Rebuild();
    if (fSettings.fSwapped) fSettings.BuildSwapMask(fSource);
    fSettings.fCaseSize = fSource.ValueCount();
    fSource.SetCaseWeight(fSlots.IndexOfSlot(fSettings.fWeightIndex));
}

void DictionaryReader::ReadVariable() {
    // The case layout is fixed once other records have begun.
    QORA_FILE_CHECK_TEXT(kErrBadFormat, !fVariablesClosed, "!variablesClosed");
    int32 f[5];
    char name[8];
    uint32_t len = Read(f, sizeof f);
    len += Read(name, sizeof name);
    QORA_FILE_CHECK_TEXT(kErrTooShort, len == sizeof f + sizeof name, "len == 28");
    const int32 type = Int(f[0]), hasLabel = Int(f[1]), code = Int(f[2]);
    QORA_FILE_CHECK_TEXT(kErrBadFormat, type >= -1 && type <= kMaxFileVarType,
                         "type >= -1 && type <= 255");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, QORA_Variable::IsValidMissingCode(code),
                         "QORA_Variable::IsValidMissingCode(code)");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, type < 0 || fSource.HasRoomFor(type), "HasRoomFor(type)");

    std::string label;
    int32 labelLen = 0;
    if (hasLabel != 0) {
        labelLen = ReadInt("len == sizeof(labelLen)");
        QORA_FILE_CHECK_TEXT(kErrBadFormat, labelLen >= 0, "labelLen >= 0");
        ReadRaw(label, 4 * ((int64_t(labelLen) + 3) / 4), "len == paddedLen");
    }
    std::string missing;
    if (code != 0) ReadRaw(missing, 8 * std::abs(code), "len == 8*abs(code)");
    if (type < 0) return;  // a continuation unit: its width came with its variable

    QORA_Variable var(type);
    var.SetName(name, strnlen(name, sizeof name));
    var.SetPrintFormatWord(Int(f[3]));
    var.SetWriteFormatWord(Int(f[4]));
    if (hasLabel != 0) var.SetLabel(label.data(), size_t(labelLen));
    if (code != 0) {
        if (type == 0 && fSettings.fSwapped)
            for (size_t at = 0; at < missing.size(); at += 8) SwapBytes(&missing[at], 8);
        const char* v = missing.data();
        const int n = std::abs(code);
        var.SetMissingValues(code, v, n > 1 ? v + 8 : nullptr, n > 2 ? v + 16 : nullptr);
    }
    fSource.AppendVariable(var);
}

void DictionaryReader::ReadValueLabels() {
    const int32 nLabels = ReadInt("len == sizeof(nLabels)");
    // Each pair takes at least 16 bytes.
    QORA_FILE_CHECK_TEXT(kErrTooShort, nLabels <= Remaining() / 16, "len == header.size()");
    std::vector<std::pair<std::string, std::string>> pairs;
    for (int32 i = 0; i < nLabels; ++i) {
        std::array<char, 9> header;
        const uint32_t len = Read(header.data(), header.size());
        QORA_FILE_CHECK_TEXT(kErrTooShort, len == header.size(), "len == header.size()");
        const uint8_t m = static_cast<uint8_t>(header[8]);
        const size_t paddedLen = ((m + 8) / 8) * 8 - 1;
        std::string label;
        ReadRaw(label, paddedLen, "len == paddedLen");
        label.resize(m);
        pairs.emplace_back(std::string(header.data(), 8), std::move(label));
    }

    int32 h[2];
    const uint32_t len = Read(h, sizeof h);
    QORA_FILE_CHECK_TEXT(kErrTooShort, len == 2 * sizeof(int32), "len == 2*sizeof(int32)");
    h[0] = Int(h[0]);
    h[1] = Int(h[1]);
    QORA_FILE_CHECK_TEXT(kErrBadFormat, h[0] == 4, "h[0] == 4");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, h[1] > 0, "h[1] > 0");
    const int32 nVars = h[1];
    QORA_FILE_CHECK_TEXT(kErrTooShort, nVars <= Remaining() / 4, "len == nVars*sizeof(int32)");
    std::vector<int32> slots(nVars);
    const uint32_t lenVars = Read(slots.data(), uint32_t(nVars) * 4);
    QORA_FILE_CHECK_TEXT(kErrTooShort, lenVars == uint32_t(nVars) * 4,
                         "len == nVars*sizeof(int32)");
    std::vector<int> indexes;
    for (int32 slot : slots) {
        const int index = fSlots.IndexOfSlot(Int(slot));
        QORA_FILE_CHECK_TEXT(kErrBadFormat, index >= 0, "slots.IsValidSlot(slot)");
        indexes.push_back(index);
    }

    // The first variable decides whether the values are numbers or strings.
    const int type = fSource.GetVariable(indexes[0]).GetType();
    QORA_VLMap map(type);
    std::string key(map.Impl()->KeyBytes(), ' ');
    for (auto& pair : pairs) {
        if (type == 0 && fSettings.fSwapped) SwapBytes(&pair.first[0], 8);
        key.replace(0, 8, pair.first);
        map.Insert(key.data(), pair.second);
    }
    for (int index : indexes) fSource.GetVariable(index).SetValueLabels(map);
}

void DictionaryReader::ReadDocuments() {
    const int32 nLines = ReadInt("len == sizeof(nLines)");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, nLines >= 0, "nLines >= 0");
    std::string text;
    ReadRaw(text, int64_t(nLines) * kDocumentLineSize, "len == nLines*80");
    fSource.SetExtensionContent(0, 1, int32(text.size()), text.data());
    fSettings.NoteSeen(0);
}

void DictionaryReader::ReadExtension() {
    int32 h[3];
    const uint32_t len = Read(h, sizeof h);
    QORA_FILE_CHECK_TEXT(kErrTooShort, len == 3 * sizeof(int32), "len == 3*sizeof(int32)");
    for (int32& v : h) v = Int(v);
    QORA_FILE_CHECK_TEXT(kErrBadFormat, h[1] > 0 && h[2] > 0, "h[1] > 0 && h[2] > 0");
    const int64_t size = int64_t(h[1]) * h[2];
    QORA_FILE_CHECK_TEXT(kErrTooShort, size <= Remaining(), "len == h[2]*h[1]");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, size <= INT32_MAX, "h[2]*h[1] <= INT32_MAX");
    if (h[0] == 16) fSource.NoteCaseCountRecord();
    SystemFileExtensionRecord record(h[1], h[2]);
    const uint32_t lenData = Read(record.Contents(), uint32_t(size));
    QORA_FILE_CHECK_TEXT(kErrTooShort, lenData == size, "len == h[2]*h[1]");
    ImportExtension(h[0], fSource, fSettings, record);
}

bool IsNameByte(unsigned char c) {
    return ('A' <= c && c <= 'Z') || ('a' <= c && c <= 'z') || ('0' <= c && c <= '9') || c == '@' ||
           c == '#' || c == '$' || c == '_' || c == '.' || c >= 0x80;
}

// Whether a name can stand as it is: valid characters only, and no leading
// character that marks a scratch or system name.
bool IsAcceptableName(const std::string& name) {
    if (name.empty()) return false;
    const unsigned char first = name[0];
    if (first == '#' || first == '$' || first == '_' || first == '.') return false;
    for (size_t at = 0; at < name.size();) {
        const int n = mbCharLength(name.data() + at, std::min<size_t>(4, name.size() - at));
        if (n <= 0) return false;
        if (n == 1 && !IsNameByte(static_cast<unsigned char>(name[at]))) return false;
        at += size_t(n);
    }
    return true;
}

// Lower-cases the names of a file that has no long names record.
void LowerCaseNames(QORA_DataSource& source) {
    for (int i = 0; i < source.ColumnCount(); ++i) {
        QORA_Variable& var = source.GetVariable(i);
        const std::string& name = var.GetName();
        char lower[kMaxNameSize + 1] = {};
        int error = 0;
        const int n = mbToLower(name.data(), int(name.size()), lower, kMaxNameSize, &error);
        var.SetName(lower, size_t(std::clamp(n, 0, int(kMaxNameSize))));
    }
}

const QORA_SetFamily kSetFamilies[] = {QORA_SetFamily::kVariableSets,
                                       QORA_SetFamily::kMultipleResponse};

// Sets may name variables the file does not have: those names go, and the
// records of a family that lost any are written again from what is left.
void PruneStoredSets(QORA_DataSource& source) {
    for (QORA_SetFamily family : kSetFamilies) {
        QORA_VariableSetList sets = LoadVariableSets(source, family);
        if (!PruneVariableSets(sets, source)) continue;
        if (family == QORA_SetFamily::kVariableSets) {
            source.SetExtensionContent(kVariableSetExtension, 1, 0, nullptr);
        } else {
            source.SetExtensionContent(kMultRespExtension, 1, 0, nullptr);
            source.SetExtensionContent(kExtendedMultRespExtension, 1, 0, nullptr);
        }
        StoreVariableSets(source, sets);
    }
}

// After the names changed their case, the sets are written again.
void RestoreSets(QORA_DataSource& source) {
    for (QORA_SetFamily family : kSetFamilies) {
        const QORA_VariableSetList sets = LoadVariableSets(source, family);
        if (!sets.empty()) StoreVariableSets(source, sets);
    }
}

}  // namespace

void RepairNames(QORA_DataSource& source) {
    // Names are compared by their lookup keys, so that names differing only in
    // case, which no lookup can tell apart, count as repeats too.
    std::set<std::string> keys;
    std::vector<int> marked;
    for (int i = 0; i < source.ColumnCount(); ++i) {
        const QORA_Variable& var = source.GetVariable(i);
        if (!IsAcceptableName(var.GetName()) || !keys.insert(var.GetKey()).second)
            marked.push_back(i);
    }
    int counter = 0;
    for (int index : marked) {
        std::string candidate;
        do candidate = "V" + std::to_string(++counter);
        while (keys.count(candidate));
        keys.insert(candidate);
        candidate[0] = 'v';
        source.GetVariable(index).SetName(candidate.c_str());
    }
}

SystemFileDataSource::SystemFileDataSource() = default;

SystemFileDataSource::SystemFileDataSource(const char* fileName) {
    if (!fStream.Open(fileName, "rb")) RaiseError(kErrCannotOpen, fileName);
    try {
        Read();
    } catch (const SystemFileException& e) {
        std::throw_with_nested(ErrorText("Datasource error # " + std::to_string(e.Number()) +
                                         " involving " + fileName));
    }
}

SystemFileDataSource::~SystemFileDataSource() = default;

void SystemFileDataSource::Read() {
    SetFileName(fStream.Name());
    DictionaryReader reader(*this, fStream);
    reader.ReadHeader();
    reader.ReadRecords();
    PruneStoredSets(*this);
    RepairNames(*this);
    if (!fSettings.fLongNamesSeen) {
        LowerCaseNames(*this);
        RestoreSets(*this);
    }
    fState = kReading;
    fDataStart = fStream.Tell();
}

QORA_InputCaseIterator* SystemFileDataSource::NewIterator(void* buffer) {
    if (fState != kReading) {
        // A file written by this source is read back from its start; the
        // finishing of the writing joins with the writer.
        const char* name = fStream.Name();
        if (name == nullptr || !fStream.Open(name, "rb")) RaiseError(kErrCannotOpen, GetFileName());
        fState = kReading;
    }
    return new Iterator(*this, buffer);
}

bool SystemFileDataSource::GetReleaseInfo(int* major, int* minor, int* revision) const {
    *major = fSettings.fReleaseMajor;
    *minor = fSettings.fReleaseMinor;
    *revision = fSettings.fReleaseRevision;
    return fSettings.HasSeen(3);
}

std::unique_ptr<QORA_DataSource> OpenForReading(const char* fileName, WarningSink*) {
    auto source = std::make_unique<SystemFileDataSource>(fileName);
    // The transcoding wrappers join here: for now the source is returned as
    // read, in the file's own encoding, and no warning is given.
    return source;
}
