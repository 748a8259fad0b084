#include "DictionaryReader.h"

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <map>
#include <utility>
#include <vector>

#include "SystemFileDataSource.h"
#include "SystemFileExtensionRecord.h"
#include "SystemFileHeader.h"
#include "dictnry.h"

namespace {

using int32 = int32_t;

enum { kMaxFileVarType = 255, kStringValueSize = 8 };

// The fixed part of a type 2 record, after its record type.
struct VariableRecord {
    int32 type;  // 0 numeric, 1..255 string width, -1 continuation
    int32 hasLabel;
    int32 missingCode;
    int32 printFormat;
    int32 writeFormat;
    char name[8];
};
static_assert(sizeof(VariableRecord) == 28, "the record has no padding");

// The frame of a type 7 record, after its record type.
struct ExtensionFrame {
    int32 subtype;
    int32 unitSize;
    int32 unitCount;
};

// Every number read is checked against the bytes that remain before it
// sizes an allocation or a loop.
class DictionaryReader {
  public:
    DictionaryReader(SystemFileDataSource& source, QORA_StrBaseIO& stream)
        : fSource(source), fSettings(source.Settings()), fStream(stream), fSlots(source) {
        fStream.Seek(0, SEEK_END);
        fFileSize = fStream.Tell();
        fStream.Seek(0, SEEK_SET);
    }

    void ReadHeader();
    // Up to and including the type 999 record.
    void ReadRecords();

  private:
    int64_t Remaining() const { return std::max<int64_t>(0, fFileSize - fStream.Tell()); }
    int32 Int(int32 value) const { return fSettings.fSwapped ? SwapInt32(value) : value; }
    // The one guard of every read: size bytes or error 1205 with the condition.
    void ReadExact(void* buffer, int64_t size, const char* condition);
    int32 ReadInt(const char* condition);
    // A size read from the file is checked against what is left before the
    // buffer is made.
    void ReadSized(std::string& bytes, int64_t size, const char* condition);

    void CloseVariables();
    void ReadVariable();
    void ReadValueLabels();
    QORA_VLMap LabelMap(int type) const;
    void AttachValueLabels();
    void ReadDocuments();
    void ReadExtension();

    SystemFileDataSource& fSource;
    HeaderSettings& fSettings;
    QORA_StrBaseIO& fStream;
    SlotDictionary fSlots;
    int64_t fFileSize = 0;
    bool fVariablesClosed = false;

    // The variable or value label record being read, in buffers that the
    // records of a large dictionary reuse rather than allocate each anew.
    std::string fLabel;
    std::vector<std::pair<std::string, std::string>> fPairs;
    std::vector<int32> fLabelSlots;
    std::vector<int> fIndexes;
    // The maps by the cut of their values, which takes at most nine values.
    std::vector<std::pair<int, QORA_VLMap>> fByCut;
};

void DictionaryReader::ReadExact(void* buffer, int64_t size, const char* condition) {
    QORA_FILE_CHECK_TEXT(kErrTooShort, size <= Remaining(), condition);
    QORA_FILE_CHECK_TEXT(kErrBadFormat, size <= INT32_MAX, "size <= INT32_MAX");
    const uint32_t len = fStream.Read(buffer, uint32_t(size));
    QORA_FILE_CHECK_TEXT(kErrTooShort, len == size, condition);
}

int32 DictionaryReader::ReadInt(const char* condition) {
    int32 value = 0;
    ReadExact(&value, sizeof value, condition);
    return Int(value);
}

void DictionaryReader::ReadSized(std::string& bytes, int64_t size, const char* condition) {
    QORA_FILE_CHECK_TEXT(kErrTooShort, size <= Remaining(), condition);
    bytes.resize(size_t(size));
    ReadExact(&bytes[0], size, condition);
}

void DictionaryReader::ReadHeader() {
    unsigned char bytes[SystemFileHeader::kSize];
    ReadExact(bytes, SystemFileHeader::kMagicSize, "nRead == 4");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, SystemFileHeader::HasMagic(bytes),
                         "std::string(magic) == \"$FL2\"");
    ReadExact(bytes + SystemFileHeader::kMagicSize,
              SystemFileHeader::kSize - SystemFileHeader::kMagicSize, "nRead == len1");
    const SystemFileHeader header = SystemFileHeader::Decode(bytes);
    fSettings.fSwapped = header.fSwapped;
    fSettings.fLayoutCode = header.fLayoutCode;
    fSettings.fCaseSize = header.fCaseSize;
    fSettings.fCompressed = header.fCompression != 0;
    fSettings.fWeightIndex = header.fWeightIndex;
    fSettings.fCaseCount = header.fCaseCount;
    fSettings.fBias = header.fBias;
    fSettings.fProduct = header.fProduct;

    double stamp = 0.0;
    if (ParseCreationStamp(header.fDate.c_str(), header.fTime.c_str(), &stamp) && stamp != 0.0)
        fSource.SetTimeStamp(stamp);
    fSource.SetIdString(header.fLabel.c_str());
}

void DictionaryReader::ReadRecords() {
    for (;;) {
        const int32 recType = ReadInt("len == sizeof(recType)");
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
    VariableRecord rec;
    ReadExact(&rec, sizeof rec, "len == 28");
    const int32 type = Int(rec.type), hasLabel = Int(rec.hasLabel);
    int32 code = Int(rec.missingCode);
    QORA_FILE_CHECK_TEXT(kErrBadFormat, type >= -1 && type <= kMaxFileVarType,
                         "type >= -1 && type <= 255");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, QORA_Variable::IsValidMissingCode(code),
                         "QORA_Variable::IsValidMissingCode(code)");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, type < 0 || fSource.HasRoomFor(type), "HasRoomFor(type)");

    int32 labelLen = 0;
    if (hasLabel != 0) {
        labelLen = ReadInt("len == sizeof(labelLen)");
        QORA_FILE_CHECK_TEXT(kErrBadFormat, labelLen >= 0, "labelLen >= 0");
        ReadSized(fLabel, 4 * ((int64_t(labelLen) + 3) / 4), "len == paddedLen");
    }
    std::string missing;
    if (code != 0) ReadSized(missing, 8 * std::abs(code), "len == 8*abs(code)");
    if (type < 0) return;  // a continuation unit: its width came with its variable

    QORA_Variable var(type);
    var.SetName(rec.name, strnlen(rec.name, sizeof rec.name));
    var.SetPrintFormatWord(Int(rec.printFormat));
    var.SetWriteFormatWord(Int(rec.writeFormat));
    if (hasLabel != 0) var.SetLabel(fLabel.data(), size_t(labelLen));
    if (code != 0) {
        if (type == 0 && fSettings.fSwapped)
            for (size_t at = 0; at < missing.size(); at += 8) SwapBytes(&missing[at], 8);
        // Strings have no ranges: a file that codes one for a string keeps
        // its values as discrete ones, so a count is never negative.
        if (type > 0) code = std::abs(code);
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
    fPairs.resize(size_t(std::max(nLabels, 0)));
    for (auto& [value, label] : fPairs) {
        unsigned char head[kStringValueSize + 1];
        ReadExact(head, sizeof head, "len == header.size()");
        const uint8_t m = head[kStringValueSize];
        ReadSized(label, ((m + 8) / 8) * 8 - 1, "len == paddedLen");
        label.resize(m);
        value.assign(reinterpret_cast<char*>(head), kStringValueSize);
    }

    const int32 recType = ReadInt("len == 2*sizeof(int32)");
    const int32 nVars = ReadInt("len == 2*sizeof(int32)");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, recType == kValueLabelVarsRecord, "h[0] == 4");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, nVars > 0, "h[1] > 0");
    QORA_FILE_CHECK_TEXT(kErrTooShort, nVars <= Remaining() / 4, "len == nVars*sizeof(int32)");
    fLabelSlots.resize(size_t(nVars));
    ReadExact(fLabelSlots.data(), int64_t(nVars) * 4, "len == nVars*sizeof(int32)");
    fIndexes.clear();
    for (int32 slot : fLabelSlots) {
        const int index = fSlots.IndexOfSlot(Int(slot));
        QORA_FILE_CHECK_TEXT(kErrBadFormat, index >= 0, "slots.IsValidSlot(slot)");
        fIndexes.push_back(index);
    }
    AttachValueLabels();
}

// The first variable listed decides whether the values are numbers or
// strings; a map goes only to variables of that kind, so that every value
// handed out is as wide as its variable and is found again by its own
// value. A string value is cut to its variable's width and blank-padded.
// Variables of one width share one map; the maps of widths that cut the
// values alike share their pairs, so that a record listing variables of
// many widths costs its labels once.
void DictionaryReader::AttachValueLabels() {
    const bool numeric = fSource.GetVariable(fIndexes[0]).GetType() == 0;
    std::map<int, QORA_VLMap> byType;
    fByCut.clear();
    for (int index : fIndexes) {
        QORA_Variable& var = fSource.GetVariable(index);
        const int type = var.GetType();
        if ((type == 0) != numeric) continue;
        auto found = byType.find(type);
        if (found == byType.end()) {
            const int cut = std::min<int>(type, kStringValueSize);
            auto model = std::find_if(fByCut.begin(), fByCut.end(),
                                      [cut](const auto& entry) { return entry.first == cut; });
            if (model == fByCut.end()) model = fByCut.emplace(model, cut, LabelMap(type));
            // A model that already has the type goes to its variables as it is.
            QORA_VLMap map = model->second;
            if (map.KeyType() != type) map.SetKeyType(type);
            found = byType.emplace(type, map).first;
        }
        var.SetValueLabels(found->second);
    }
    fByCut.clear();
}

QORA_VLMap DictionaryReader::LabelMap(int type) const {
    QORA_VLMap map(type);
    std::vector<QORA_VLMapImpl::Pair> keyed;
    keyed.reserve(fPairs.size());
    for (std::pair<std::string, std::string> pair : fPairs) {
        if (type == 0) {
            if (fSettings.fSwapped) SwapBytes(&pair.first[0], kStringValueSize);
        } else {
            pair.first = map.KeyFromText(pair.first.data(), std::min<int>(type, kStringValueSize));
        }
        keyed.push_back({std::move(pair.first), std::move(pair.second)});
    }
    map.InsertAll(std::move(keyed));
    return map;
}

void DictionaryReader::ReadDocuments() {
    const int32 nLines = ReadInt("len == sizeof(nLines)");
    QORA_FILE_CHECK_TEXT(kErrBadFormat, nLines >= 0, "nLines >= 0");
    std::string text;
    ReadSized(text, int64_t(nLines) * kDocumentLineSize, "len == nLines*80");
    fSource.SetExtensionContent(kDocumentExtension, 1, int32(text.size()), text.data());
    fSettings.NoteSeen(kDocumentExtension);
}

void DictionaryReader::ReadExtension() {
    ExtensionFrame frame;
    ReadExact(&frame, sizeof frame, "len == 3*sizeof(int32)");
    frame = {Int(frame.subtype), Int(frame.unitSize), Int(frame.unitCount)};
    // A record without contents cannot be held.
    QORA_FILE_CHECK_TEXT(kErrBadFormat, frame.unitSize > 0 && frame.unitCount > 0,
                         "h[1] > 0 && h[2] > 0");
    const int64_t size = int64_t(frame.unitSize) * frame.unitCount;
    QORA_FILE_CHECK_TEXT(kErrTooShort, size <= Remaining(), "len == h[2]*h[1]");
    if (frame.subtype == kCaseCountExtension) fSource.NoteCaseCountRecord();
    SystemFileExtensionRecord record(frame.unitSize, frame.unitCount);
    ReadExact(record.Contents(), size, "len == h[2]*h[1]");
    ImportExtension(frame.subtype, fSource, fSettings, record);
}

}  // namespace

void ReadDictionary(SystemFileDataSource& source, QORA_StrBaseIO& stream) {
    DictionaryReader reader(source, stream);
    reader.ReadHeader();
    reader.ReadRecords();
}
