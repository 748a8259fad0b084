#include "SaveDS.h"

#include <algorithm>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <set>
#include <string>
#include <unordered_map>

#include "CompressedSystemFile.h"
#include "SystemFileHeader.h"
#include "calendar.h"
#include "dserror.h"
#include "qoramb.h"

namespace {

enum : size_t {
    kUnit = 8,
    kNameSize = 8,
    kMaxValueLabel = 255,
    kSegmentBytes = SystemFileDechunker::kSegmentBytes,
    kSegmentText = SystemFileDechunker::kSegmentWidth,
    kSegmentWidth = SystemFileDechunker::kSureBytes,  // a segment holds at least this much
};
// What a continuation record carries as its print and write formats.
const int32_t kContinuationFormat = 0x00011D01;

// The bytes of the dictionary, collected before they are written at once.
class RecordBytes {
  public:
    void Int(int32_t value) { Raw(&value, sizeof value); }
    void Raw(const void* bytes, size_t size) {
        fBytes.append(static_cast<const char*>(bytes), size);
    }
    // text in a field of size bytes, blank-padded.
    void Text(const std::string& text, size_t size) {
        const size_t n = std::min(size, text.size());
        fBytes.append(text, 0, n);
        Blanks(size - n);
    }
    void Blanks(size_t n) { fBytes.append(n, ' '); }
    size_t Size() const { return fBytes.size(); }
    const std::string& Bytes() const { return fBytes; }

  private:
    std::string fBytes;
};

// The creation date ("04 Dec 26") and time ("17:16:43") of the header.
void CreationStamp(std::string* date, std::string* time) {
    std::time_t now = std::time(nullptr);
    // A clock that cannot be right still gives a date that can be read back.
    if (now < 86400) now = 86400;
    std::tm local{};
    localtime_r(&now, &local);
    char text[32];
    std::snprintf(text, sizeof text, "%02d %-3.3s %02d", local.tm_mday,
                  MonthAbbreviation(local.tm_mon + 1), local.tm_year % 100);
    date->assign(text, SystemFileHeader::kDateSize);
    std::snprintf(text, sizeof text, "%02d:%02d:%02d", local.tm_hour % 100, local.tm_min % 100,
                  local.tm_sec % 100);
    time->assign(text, SystemFileHeader::kTimeSize);
}

// Bytes of text, from the start, that form whole characters and fit in limit.
size_t WholeCharacters(const char* text, size_t length, size_t limit) {
    size_t n = 0;
    while (n < limit) {
        const int len = mbCharLength(text + n, length - n);
        const size_t step = len > 0 ? size_t(len) : 1;
        if (n + step > limit) break;
        n += step;
    }
    return n;
}

}  // namespace

SystemFileDataSource::SaveDS::SaveDS(SystemFileDataSource& parent, QORA_FileStream& stream,
                                     HeaderSettings& settings)
    : QORA_DataSource(&parent), fSettings(settings), fStream(stream), fPending(stream) {
    SetFileName(nullptr);
}

SystemFileDataSource::SaveDS::~SaveDS() { Finish(); }

void SystemFileDataSource::SaveDS::PrepareDictionary() {
    std::set<std::string> keys;
    for (int i = 0; i < ColumnCount(); ++i) {
        const std::string& key = GetVariable(i).GetKey();
        if (!keys.insert(key).second) RaiseError(kErrDuplicateKey, key);
    }
    PrepareExtensions();
}

// Exported from the highest subtype down: the handlers of the higher ones
// reshape the dictionary that the lower ones describe.
void SystemFileDataSource::SaveDS::PrepareExtensions() {
    const CaseLayout source = Layout();
    const int sourceUnits = ValueCount();
    fSettings.fVeryLongStrings.clear();
    const int32_t highest = ExtensionTypeBound();
    fRecords.clear();
    fRecords.resize(size_t(highest) + 1);
    for (int32_t subtype = highest; subtype >= 1; --subtype)
        ExportExtension(subtype, *this, fSettings, fRecords[subtype]);
    BuildMovers(source, sourceUnits);
}

void SystemFileDataSource::SaveDS::BuildMovers(const CaseLayout& source, int sourceUnits) {
    fMovers.clear();
    fpOutput.reset();
    const auto& strings = fSettings.fVeryLongStrings;
    if (strings.empty()) return;
    int64_t outputUnits = sourceUnits;
    for (const auto& [index, width] : strings)
        outputUnits += int64_t(SystemFileDechunker::FileUnits(uint32_t(width))) - ValueUnits(width);
    // The split dictionary and the file's case must agree unit for unit.
    QORA_ASSERT(outputUnits == ValueCount());
    fpOutput.reset(new unsigned char[kUnit * size_t(outputUnits)]);
    unsigned char* destination = fpOutput.get();
    int at = 0;
    for (const auto& [index, width] : strings) {
        QORA_ASSERT(0 <= index && size_t(index) < source.Count());
        QORA_ASSERT(QORA_Variable::IsValidType(width) && width > int(kSegmentText));
        const int offset = source.Offset(size_t(index));
        QORA_ASSERT(at <= offset && offset + ValueUnits(width) <= sourceUnits);
        if (offset > at) {
            fMovers.push_back(std::make_unique<OrdinaryMover>(destination, offset - at));
            destination += kUnit * size_t(offset - at);
        }
        fMovers.push_back(std::make_unique<EStringMover>(destination, width));
        destination += kUnit * SystemFileDechunker::FileUnits(uint32_t(width));
        at = offset + ValueUnits(width);
    }
    if (at < sourceUnits)
        fMovers.push_back(std::make_unique<OrdinaryMover>(destination, sourceUnits - at));
}

namespace {

void WriteHeader(const SystemFileDataSource::SaveDS& dict, const HeaderSettings& settings,
                 RecordBytes& out) {
    SystemFileHeader header;
    header.fProduct = settings.fProduct;
    header.fLayoutCode = settings.fLayoutCode;
    header.fCaseSize = dict.ValueCount();
    header.fCompression = settings.fCompressed ? 1 : 0;
    const int weight = dict.GetCaseWeight();
    header.fWeightIndex = weight < 0 ? 0 : 1 + dict.ValueOffset(weight);
    const int64_t count = settings.fCaseCount;
    header.fCaseCount = 0 <= count && count <= INT32_MAX ? int32_t(count) : -1;
    header.fBias = settings.fBias;
    CreationStamp(&header.fDate, &header.fTime);
    const char* label = dict.GetIdString();
    header.fLabel = label ? label : "";
    unsigned char bytes[SystemFileHeader::kSize];
    header.Encode(bytes);
    out.Raw(bytes, sizeof bytes);
}

void WriteVariable(const QORA_Variable& var, RecordBytes& out) {
    const char* label = var.GetLabel();
    out.Int(kVariableRecord);
    out.Int(var.GetType());
    out.Int(label ? 1 : 0);
    out.Int(var.GetMissingCode());
    out.Int(int32_t(var.GetPrintFormatWord()));
    out.Int(int32_t(var.GetWriteFormatWord()));
    out.Text(var.GetName(), kNameSize);
    if (label) {
        const size_t length = std::strlen(label);
        out.Int(int32_t(length));
        out.Raw(label, length);
        out.Blanks((4 - length % 4) % 4);
    }
    unsigned char missing[3][kUnit];
    const int code = var.GetMissingValues(missing[0], missing[1], missing[2]);
    out.Raw(missing, kUnit * size_t(std::abs(code)));
    for (int i = 1; i < var.ValueUnits(); ++i) {
        out.Int(kVariableRecord);
        out.Int(-1);
        out.Int(0);
        out.Int(0);
        out.Int(kContinuationFormat);
        out.Int(kContinuationFormat);
        out.Blanks(kNameSize);
    }
}

// One type 3 record per map, in the order the maps first appear, and a type 4
// record naming every variable that holds that very map (equal contents are
// not enough). One pass: a dictionary of many variables stays linear.
void WriteValueLabels(const QORA_DataSource& dict, RecordBytes& out) {
    std::vector<std::pair<QORA_VLMap, std::vector<int32_t>>> groups;
    std::unordered_map<const QORA_VLMapImpl*, size_t> groupOf;
    for (int i = 0; i < dict.ColumnCount(); ++i) {
        const QORA_VLMap map = dict.GetVariable(i).GetValueLabels();
        if (!map.IsValid()) continue;
        const auto found = groupOf.emplace(map.Impl(), groups.size());
        if (found.second) groups.emplace_back(map, std::vector<int32_t>());
        groups[found.first->second].second.push_back(1 + dict.ValueOffset(i));
    }
    for (const auto& [map, slots] : groups) {
        const auto& pairs = map.Impl()->Pairs();
        out.Int(kValueLabelRecord);
        out.Int(int32_t(pairs.size()));
        for (const auto& pair : pairs) {
            out.Raw(pair.key.data(), kUnit);
            const size_t n = std::min<size_t>(pair.label.size(), kMaxValueLabel);
            const unsigned char length = static_cast<unsigned char>(n);
            out.Raw(&length, 1);
            out.Raw(pair.label.data(), n);
            out.Blanks((n + kUnit) / kUnit * kUnit - 1 - n);
        }
        out.Int(kValueLabelVarsRecord);
        out.Int(int32_t(slots.size()));
        out.Raw(slots.data(), sizeof(int32_t) * slots.size());
    }
}

// Whole lines only: a last part shorter than a line is not written.
void WriteDocuments(const QORA_DataSource& dict, RecordBytes& out) {
    const QORA_Extension documents = dict.GetExtension(kDocumentExtension);
    if (documents.IsEmpty()) return;
    const std::string& text = documents.Impl()->Content();
    const size_t lines = text.size() / kDocumentLineSize;
    out.Int(kDocumentRecord);
    out.Int(int32_t(lines));
    out.Raw(text.data(), lines * kDocumentLineSize);
}

}  // namespace

void SystemFileDataSource::SaveDS::WriteDictionary() {
    const int64_t start = fStream.Tell();
    RecordBytes out;
    WriteHeader(*this, fSettings, out);
    for (int i = 0; i < ColumnCount(); ++i) WriteVariable(GetVariable(i), out);
    WriteValueLabels(*this, out);
    WriteDocuments(*this, out);
    for (size_t subtype = 1; subtype < fRecords.size(); ++subtype) {
        const SystemFileExtensionRecord& record = fRecords[subtype];
        if (record.IsEmpty()) continue;
        QORA_ASSERT(record.Contents() != nullptr);
        out.Int(kExtensionRecord);
        out.Int(int32_t(subtype));
        out.Int(record.UnitSize());
        out.Int(record.NUnits());
        if (subtype == kCaseCountExtension) fCaseCountPos = start + int64_t(out.Size());
        out.Raw(record.Contents(), size_t(record.ByteCount()));
    }
    out.Int(kEndRecord);
    out.Int(0);
    fRecords.clear();
    QORA_ASSERT(out.Size() <= UINT32_MAX);
    const std::string& bytes = out.Bytes();
    if (fStream.Write(bytes.data(), uint32_t(bytes.size())) != bytes.size())
        RaiseError(kErrStreamWrite, GetFileName());
}

void SystemFileDataSource::SaveDS::StartCases(SparseFileIndex& index, int64_t dataStart) {
    OpenCompressor(index, dataStart);
    fCasesMayFollow = true;
}

void SystemFileDataSource::SaveDS::OpenCompressor(SparseFileIndex& index, int64_t dataStart) {
    if (fSettings.fCompressed)
        fpCompressor.reset(
            new CompressedSystemFile(uint32_t(ValueCount()), &index, &fStream, dataStart));
}

void SystemFileDataSource::SaveDS::PrepareAppend(SparseFileIndex& index, int64_t dataStart,
                                                 int64_t caseCountRecordPos) {
    PrepareExtensions();
    fRecords.clear();
    // Cases are written as the dictionary lays them out; a file whose cases
    // are laid out otherwise cannot be continued.
    QORA_FILE_CHECK(kErrBadFormat, fSettings.fCaseSize == ValueCount());
    fCaseCountPos = caseCountRecordPos;
    OpenCompressor(index, dataStart);
    if (fpCompressor) {
        fCasesBefore = CompressedCases(index, dataStart);
        fpCompressor->PrepareAppend(fCasesBefore);
    } else {
        AppendRaw(dataStart);
    }
    fCasesMayFollow = true;
}

// The cases the compressed data really hold, whatever count the file
// claims: the new ones must follow the last of them, and only there does
// the last block continue.
int64_t SystemFileDataSource::SaveDS::CompressedCases(SparseFileIndex& index, int64_t dataStart) {
    QORA_FileStream reader(fStream);
    CompressedSystemFile data(uint32_t(ValueCount()), &index, &reader, dataStart);
    data.SetRequestedCase(INT64_MAX);
    data.ReadCase(nullptr, nullptr);
    return data.CurrentCase();
}

// New cases go after the last whole case; bytes of a case cut short, which
// no reader can use, are written over.
void SystemFileDataSource::SaveDS::AppendRaw(int64_t dataStart) {
    const int64_t caseBytes = int64_t(kUnit) * ValueCount();
    fStream.Commit();
    const char* name = fStream.Name();
    if (name == nullptr || !fStream.Open(name, "r+b")) RaiseError(kErrCannotOpen, GetFileName());
    // Without the end of the file the cases already there are unknown, and
    // new ones would be written over them.
    if (fStream.Seek(0, SEEK_END) != 0) RaiseError(kErrStreamRead, GetFileName());
    const int64_t dataBytes = std::max<int64_t>(0, fStream.Tell() - dataStart);
    fCasesBefore = caseBytes > 0 ? dataBytes / caseBytes : 0;
    fStream.Seek(dataStart + fCasesBefore * caseBytes, SEEK_SET);
}

void SystemFileDataSource::SaveDS::WriteCase(const void* units) {
    // After a failed write the stream no longer stands at a case boundary.
    QORA_FILE_CHECK_TEXT(kErrCaseWrite, !fFailed, "toWrite");
    const unsigned char* data = static_cast<const unsigned char*>(units);
    if (!fMovers.empty()) {
        const unsigned char* source = data;
        for (const auto& mover : fMovers) source = mover->Move(source);
        data = fpOutput.get();
    }
    try {
        if (fpCompressor) {
            fpCompressor->WriteCase(data);
        } else {
            const uint32_t toWrite = uint32_t(kUnit) * uint32_t(fSettings.fCaseSize);
            QORA_FILE_CHECK_TEXT(kErrCaseWrite, fPending.Append(data, toWrite), "toWrite");
        }
    } catch (...) {
        fFailed = true;
        throw;
    }
    ++fCasesWritten;
}

// After a failed write the file holds an unknown number of whole cases: the
// counts then say "unknown", so that no count claims a case that is not there.
bool SystemFileDataSource::SaveDS::Finish() noexcept {
    if (!fCasesMayFollow) return true;
    fCasesMayFollow = false;
    try {
        if (fpCompressor) fpCompressor->Finish();
        if (!fPending.Flush()) fFailed = true;
        fStream.Flush();
    } catch (...) {
        fFailed = true;
    }
    fpCompressor.reset();
    const int64_t total = fFailed || fCasesBefore < 0 ? -1 : fCasesBefore + fCasesWritten;
    if (total == fSettings.fCaseCount && 0 <= total && total <= INT32_MAX) return !fFailed;
    try {
        return PatchCounts(total) && !fFailed;
    } catch (...) {
        // The counts stay as they were: -1 for a new file, the earlier count
        // of an appended one.
        return false;
    }
}

// False when the file could not be reopened to take the counts.
bool SystemFileDataSource::SaveDS::PatchCounts(int64_t total) {
    const char* name = fStream.Name();
    if (name == nullptr) return false;
    fStream.Flush();
    if (!fStream.Open(name, "rb+")) return false;
    const int32_t headerCount = 0 <= total && total <= INT32_MAX ? int32_t(total) : -1;
    fStream.Seek(SystemFileHeader::kCaseCountOffset, SEEK_SET);
    fStream.Write(&headerCount, sizeof headerCount);
    fStream.Flush();
    if (fCaseCountPos > 0) {
        fStream.Seek(fCaseCountPos + int64_t(sizeof(int64_t)), SEEK_SET);
        fStream.Write(&total, sizeof total);
        fStream.Flush();
    }
    fSettings.fCaseCount = total;
    return true;
}

const unsigned char* SystemFileDataSource::SaveDS::OrdinaryMover::Move(
    const unsigned char* source) const {
    std::memcpy(fDestination, source, fBytes);
    return source + fBytes;
}

SystemFileDataSource::SaveDS::EStringMover::EStringMover(unsigned char* destination, int width)
    : fDestination(destination),
      fWidth(width),
      fFullSegments(width / kSegmentWidth),
      fLastUnits((width % kSegmentWidth + kUnit - 1) / kUnit) {}

// Each full segment takes 255 bytes of the string, fewer when that would cut
// a character in two: the character then opens the next segment and NULs
// fill the gap.
const unsigned char* SystemFileDataSource::SaveDS::EStringMover::Move(
    const unsigned char* source) const {
    const char* p = reinterpret_cast<const char*>(source);
    const char* const end = p + fWidth;
    unsigned char* out = fDestination;
    for (int s = 0; s < fFullSegments; ++s, out += kSegmentBytes) {
        const size_t rest = size_t(end - p);
        size_t taken = rest;
        char fill = ' ';
        if (rest >= kSegmentBytes) {
            taken =
                p[kSegmentText - 1] == ' ' ? kSegmentText : WholeCharacters(p, rest, kSegmentText);
            fill = '\0';
        }
        std::memcpy(out, p, taken);
        std::memset(out + taken, fill, kSegmentText - taken);
        out[kSegmentText] = ' ';
        p += taken;
    }
    const size_t room = kUnit * size_t(fLastUnits);
    const size_t rest = std::min(size_t(end - p), room);
    std::memcpy(out, p, rest);
    std::memset(out + rest, ' ', room - rest);
    return source + kUnit * size_t(ValueUnits(fWidth));
}
