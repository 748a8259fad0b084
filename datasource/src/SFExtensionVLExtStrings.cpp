// The long value labels record: value labels of string variables wider than
// 8 bytes, whose values do not fit the 8 bytes of a value label record. Per
// variable: int32 name length, name, int32 width, int32 label count, then
// per label int32 value length, value, int32 label length, label; the
// integers in the writing machine's byte order.
#include <cstdint>
#include <cstring>
#include <string>

#include "HeaderSettings.h"
#include "SystemFileExtensionRecord.h"
#include "byteorder.h"
#include "datasrc.h"
#include "dserror.h"

namespace {

enum : int32_t { kMaxShortValue = 8 };

void AppendInt(std::string& bytes, size_t value) {
    QORA_ASSERT(value <= size_t(INT32_MAX));
    const int32_t n = int32_t(value);
    bytes.append(reinterpret_cast<const char*>(&n), sizeof n);
}

void AppendCounted(std::string& bytes, const std::string& text) {
    AppendInt(bytes, text.size());
    bytes += text;
}

// Walks the contents; every length is checked against the bytes left
// before it is used.
class EntryReader {
  public:
    EntryReader(const std::string& bytes, bool swapped)
        : fAt(bytes.data()), fEnd(bytes.data() + bytes.size()), fSwapped(swapped) {}

    bool AtEnd() const { return fAt >= fEnd; }
    ptrdiff_t Left() const { return fEnd - fAt; }
    // Precondition: 4 bytes left.
    int32_t Int() {
        int32_t value;
        std::memcpy(&value, fAt, sizeof value);
        fAt += sizeof value;
        return fSwapped ? SwapInt32(value) : value;
    }
    int32_t CheckedInt() {
        QORA_FILE_CHECK_TEXT(kErrBadFormat, Left() >= 4, "r + 4 <= endr");
        return Int();
    }
    // Precondition: 0 <= length <= Left().
    std::string Bytes(int32_t length) {
        const char* const start = fAt;
        fAt += length;
        return std::string(start, size_t(length));
    }

  private:
    const char* fAt;
    const char* const fEnd;
    const bool fSwapped;
};

// One variable's entry; the labels go to the variable when it exists under
// that name with that width, and are dropped otherwise.
void ImportEntry(QORA_DataSource& source, EntryReader& in) {
    QORA_FILE_CHECK_TEXT(kErrBadFormat, in.Left() > 13, "r+13 < endr");
    const int32_t nameLength = in.Int();
    QORA_FILE_CHECK(kErrBadFormat, nameLength >= 0);
    QORA_FILE_CHECK_TEXT(kErrBadFormat, int64_t{nameLength} + 8 < in.Left(),
                         "r+nameLength+8 < endr");
    const std::string name = in.Bytes(nameLength);
    const int32_t varType = in.Int();
    const int32_t nLabels = in.Int();
    const int index = source.FindVariable(name.data(), name.size());
    const bool matched = index >= 0 && source.GetVariable(index).IsString() &&
                         source.GetVariable(index).GetType() == varType;
    QORA_VLMap map = matched ? QORA_VLMap(varType) : QORA_VLMap();
    std::vector<QORA_VLMapImpl::Pair> pairs;
    for (int32_t k = 0; k < nLabels; ++k) {
        const int32_t valLen = in.CheckedInt();
        QORA_FILE_CHECK(kErrBadFormat, valLen >= 0);
        QORA_FILE_CHECK(kErrBadFormat, valLen <= varType);
        QORA_FILE_CHECK_TEXT(kErrBadFormat, valLen <= in.Left(), "r + valLen <= endr");
        const std::string value = in.Bytes(valLen);
        const int32_t labelLen = in.CheckedInt();
        QORA_FILE_CHECK(kErrBadFormat, labelLen >= 0);
        QORA_FILE_CHECK_TEXT(kErrBadFormat, labelLen <= in.Left(), "r + labelLen <= endr");
        std::string label = in.Bytes(labelLen);
        if (matched) pairs.push_back({map.KeyFromText(value.data(), valLen), std::move(label)});
    }
    if (!matched) return;
    map.InsertAll(std::move(pairs));
    source.GetVariable(index).SetValueLabels(map);
}

class SFExtensionVLExtStrings : public SystemFileExtensionHandler {
  public:
    // Runs first of all exports: names and widths are still those of the
    // dictionary. The labels written here leave the writer's copy, so that
    // no value label record repeats them.
    void Export(QORA_DataSource& source, HeaderSettings&,
                SystemFileExtensionRecord& record) override {
        std::string bytes;
        for (int i = 0; i < source.ColumnCount(); ++i) {
            QORA_Variable& var = source.GetVariable(i);
            QORA_VLMap map = var.GetValueLabels();
            if (map.Count() == 0 || map.KeyType() <= kMaxShortValue) continue;
            AppendCounted(bytes, var.GetName());
            AppendInt(bytes, size_t(map.KeyType()));
            AppendInt(bytes, size_t(map.Count()));
            std::string value, label;
            for (map.Reset(); map.NextText(value, label);) {
                AppendCounted(bytes, value);
                AppendCounted(bytes, label);
            }
            var.SetValueLabels(QORA_VLMap());
        }
        record.SetText(bytes);
    }

    // Entries applied before a malformed one stay applied.
    void Import(QORA_DataSource& source, HeaderSettings& settings,
                const SystemFileExtensionRecord& record) override {
        const std::string bytes = record.Text();
        EntryReader in(bytes, settings.fSwapped);
        while (!in.AtEnd()) ImportEntry(source, in);
    }
};

SFExtensionVLExtStrings gHandler;
const bool gRegistered = (RegisterExtensionHandler(kLongValueLabelsExtension, gHandler), true);

}  // namespace
