// The very long strings record: SHORT=width, a NUL and a tab, for every
// string wider than 255 bytes. A file stores such a string as a run of
// segment variables: k = W / 252 full segments of width 255, then one of
// width W mod 252 when that is not 0.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <map>
#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "HeaderSettings.h"
#include "SFExtensionExtNames.h"
#include "SystemFileDechunker.h"
#include "SystemFileExtensionRecord.h"
#include "datasrc.h"
#include "dserror.h"
#include "qoramb.h"

namespace {

using Plan = SystemFileDechunker;
enum : int { kMaxShortString = Plan::kSegmentWidth, kBaseBytes = 5 };
// Bytes of an entry in which its "=" and the end of its width must appear,
// the digits a width may have and the NULs and tabs that may end it.
constexpr ptrdiff_t kNameField = 16, kWidthField = 10, kMaxDigits = 5, kMaxSeparators = 2;

// Very long strings by dictionary index: their widths.
using StringWidths = std::map<int, int>;

// Segments after the first are named from the first bytes of its key.
std::string SegmentBase(const QORA_Variable& first) { return mbPrefix(first.GetKey(), kBaseBytes); }

std::string Base36(unsigned n) {
    static const char kDigits[] = "0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZ";
    std::string digits;
    do digits.insert(digits.begin(), kDigits[n % 36]);
    while ((n /= 36) != 0);
    return digits;
}

void Retype(QORA_Variable& var, int width) {
    var.SetType(width);
    const QORA_Format format{1, width, 0};
    var.SetPrintFormat(format);
    var.SetWriteFormat(format);
}

// Replaces each very long string by its segments, the last string first so
// that earlier indexes hold. Generated names avoid every key of the
// dictionary and every short name, since the variables take their short
// names after this.
void Split(QORA_DataSource& source, const HeaderSettings& settings) {
    std::set<std::string> used;
    for (int i = 0; i < source.ColumnCount(); ++i) used.insert(source.GetVariable(i).GetKey());
    for (const auto& names : settings.fNameList) used.insert(names.second);
    const auto& strings = settings.fVeryLongStrings;
    for (auto it = strings.rbegin(); it != strings.rend(); ++it) {
        const auto [index, width] = *it;
        const QORA_Variable whole = source.GetVariable(index);
        const std::string base = SegmentBase(whole);
        source.DeleteVariables(index, index);
        unsigned counter = 0;
        for (int j = 0; j < Plan::SegmentCount(width); ++j) {
            QORA_Variable segment = whole;
            Retype(segment, Plan::SegmentWidth(width, j));
            if (j > 0) {
                std::string name;
                do name = base + Base36(counter++);
                while (!used.insert(name).second);
                segment.SetName(name.c_str());
            }
            source.InsertVariable(index + j, segment);
        }
    }
}

// Whether the variables from index on are the segments of a string of the
// width that no earlier entry took; if so they are taken now.
bool TakeSegments(const QORA_DataSource& source, int index, int width, std::vector<bool>& taken) {
    if (width <= kMaxShortString || width > QORA_Variable::MAX_STRING_TYPE) return false;
    const int count = Plan::SegmentCount(width);
    if (count > source.ColumnCount() - index) return false;
    const std::string base = SegmentBase(source.GetVariable(index));
    const int full = width / int(Plan::kSureBytes), rest = width % int(Plan::kSureBytes);
    for (int j = 0; j < count; ++j) {
        const QORA_Variable& segment = source.GetVariable(index + j);
        if (taken[size_t(index + j)]) return false;
        const bool fits =
            j < full ? segment.GetType() == kMaxShortString &&
                           segment.GetKey().compare(0, base.size(), base) == 0
                     : rest <= segment.GetType() && segment.GetType() <= 8 * ValueUnits(rest);
        if (!fits) return false;
    }
    std::fill_n(taken.begin() + index, count, true);
    return true;
}

// The entries whose segments hold up. An entry that breaks the format
// raises SystemFileException; the names of the file are those of the long
// names record, read before this one.
StringWidths ParseEntries(const QORA_DataSource& source, const HeaderSettings& settings,
                          const std::string& text) {
    const std::map<std::string, std::string> longNames(settings.fNameList.begin(),
                                                       settings.fNameList.end());
    std::vector<bool> taken(size_t(source.ColumnCount()), false);
    StringWidths strings;
    const char* p = text.data();
    const char* const e = p + text.size();
    while (p < e) {
        const char* const nameEnd = p + std::min(kNameField, e - p);
        const char* const equal = std::find(p, nameEnd, '=');
        QORA_FILE_CHECK_TEXT(kErrBadFormat, equal != nameEnd, "equal != content+16");
        const auto rename = longNames.find(std::string(p, equal));
        QORA_FILE_CHECK_TEXT(kErrBadFormat, rename != longNames.end(), "name == rename->first");
        const int varIndex = source.FindVariable(rename->second.data(), rename->second.size());
        QORA_FILE_CHECK(kErrBadFormat, varIndex >= 0);

        const char* const digits = equal + 1;
        const char* const widthEnd = digits + std::min(kWidthField, e - digits);
        const char* const endLen =
            std::find_if(digits, widthEnd, [](char c) { return c == '\0' || c == '\t'; });
        QORA_FILE_CHECK_TEXT(kErrBadFormat, endLen != widthEnd && endLen - digits <= kMaxDigits,
                             "endLen < lengthString+6");
        const char* const endDigits =
            std::find_if(digits, endLen, [](char c) { return c < '0' || '9' < c; });
        QORA_FILE_CHECK(kErrBadFormat, endLen == endDigits);
        int width = 0;
        for (const char* d = digits; d < endDigits; ++d) width = width * 10 + (*d - '0');
        if (TakeSegments(source, varIndex, width, taken)) strings.emplace(varIndex, width);

        p = endDigits;
        while (p < e && (*p == '\0' || *p == '\t')) ++p;
        QORA_FILE_CHECK_TEXT(kErrBadFormat, p - endDigits <= kMaxSeparators,
                             "content < endDigits+3");
    }
    return strings;
}

// Each string is copied out of its segments, then the ordinary units up to
// the next string's segments (or the end of the file's case).
std::unique_ptr<SystemFileDechunker> MakePlan(const QORA_DataSource& source,
                                              const StringWidths& strings, uint32_t rawUnits) {
    auto plan = std::make_unique<SystemFileDechunker>();
    uint32_t saved = 0;  // units the strings so far take fewer in the dictionary's case
    for (auto it = strings.begin(); it != strings.end(); ++it) {
        const auto [index, width] = *it;
        const uint32_t sourceUnit = uint32_t(source.ValueOffset(index));
        if (it == strings.begin() && sourceUnit > 0)
            plan->Add(SystemFileDechunker::LeadingEntry(sourceUnit));
        const auto next = std::next(it);
        const uint32_t nextUnit =
            next == strings.end() ? rawUnits : uint32_t(source.ValueOffset(next->first));
        const uint32_t fileUnits = SystemFileDechunker::FileUnits(uint32_t(width));
        plan->Add(SystemFileDechunker::StringEntry(sourceUnit, uint32_t(width), sourceUnit - saved,
                                                   nextUnit - sourceUnit - fileUnits));
        saved += fileUnits - SystemFileDechunker::CaseUnits(uint32_t(width));
    }
    return plan;
}

// One variable of width W in place of each run of segments.
void Merge(QORA_DataSource& source, const StringWidths& strings) {
    for (auto it = strings.rbegin(); it != strings.rend(); ++it) {
        const auto [index, width] = *it;
        QORA_Variable whole = source.GetVariable(index);
        Retype(whole, width);
        source.DeleteVariables(index, index + Plan::SegmentCount(width) - 1);
        source.InsertVariable(index, whole);
    }
}

class SFExtensionExtStrings : public SystemFileExtensionHandler {
  public:
    // Runs before the long names record's export: the short names are made
    // here, and the record names each string by the short name its first
    // segment will carry.
    void Export(QORA_DataSource& source, HeaderSettings& settings,
                SystemFileExtensionRecord& record) override {
        GenerateShortNames(source, settings);
        settings.fVeryLongStrings.clear();
        for (int i = 0; i < source.ColumnCount(); ++i) {
            const int width = source.GetVariable(i).GetType();
            if (width > kMaxShortString) settings.fVeryLongStrings.emplace_back(i, width);
        }
        if (settings.fVeryLongStrings.empty()) return;
        std::string text;
        for (const auto& [index, width] : settings.fVeryLongStrings)
            text += settings.fNameList[size_t(index)].second + "=" + std::to_string(width) +
                    std::string("\0\t", 2);
        record.SetText(text);
        Split(source, settings);
    }

    // A record that breaks the format is ignored whole and the segments stay
    // separate variables. Only the first record counts: after it the
    // dictionary no longer shows the file's case.
    void Import(QORA_DataSource& source, HeaderSettings& settings,
                const SystemFileExtensionRecord& record) override {
        if (settings.fpDechunker) return;
        settings.fCaseSize = source.ValueCount();
        StringWidths strings;
        try {
            strings = ParseEntries(source, settings, record.Text());
        } catch (const SystemFileException&) {
            return;
        }
        if (strings.empty()) return;
        settings.fpDechunker = MakePlan(source, strings, uint32_t(settings.fCaseSize));
        Merge(source, strings);
    }
};

SFExtensionExtStrings gHandler;
const bool gRegistered = (RegisterExtensionHandler(kVeryLongStringsExtension, gHandler), true);

}  // namespace
