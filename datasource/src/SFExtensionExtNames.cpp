// The long names record: SHORT=Long entries joined by tabs, one per variable
// of the written dictionary, in the file's encoding.
#include "SFExtensionExtNames.h"

#include <algorithm>
#include <cstdint>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "HeaderSettings.h"
#include "SystemFileExtensionRecord.h"
#include "datasrc.h"
#include "dserror.h"
#include "namerules.h"
#include "nametable.h"
#include "qoramb.h"
#include "variableset.h"

namespace {

enum : size_t { kShortNameBytes = 8 };

using NameList = std::vector<std::pair<std::string, std::string>>;

// First name to second name; of two entries with one first name, the first
// wins.
class Renames {
  public:
    explicit Renames(const NameList& list) : fList(list), fFirst(list.size()) {
        for (size_t i = 0; i < list.size(); ++i)
            if (!fFirst.Insert(list[i].first, int32_t(i))) fRepeats = true;
    }

    // The second name for name; null when no entry has it first.
    const std::string* Find(std::string_view name) const {
        const int32_t at = fFirst.Find(name);
        return at < 0 ? nullptr : &fList[size_t(at)].second;
    }
    // Find for the name of the variable at position. A record lists the
    // variables in their order, so the entry there is tried first, which
    // spares a look-up in a table far larger than the cache.
    const std::string* FindAt(size_t position, std::string_view name) const {
        if (!fRepeats && position < fList.size() && fList[position].first == name)
            return &fList[position].second;
        return Find(name);
    }

  private:
    const NameList& fList;
    NameTable fFirst;
    bool fRepeats = false;  // some first name has two entries
};

// 0 -> A, 25 -> Z, 26 -> AA, 27 -> AB, ...
std::string BijectiveBase26(unsigned k) {
    std::string digits;
    for (unsigned n = k + 1; n > 0; n = (n - 1) / 26)
        digits.insert(digits.begin(), char('A' + (n - 1) % 26));
    return digits;
}

// The first 8 bytes of the key, without the dots and underscores it ends in.
std::string CutKey(const std::string& key) {
    std::string candidate = mbPrefix(key, kShortNameBytes);
    while (!candidate.empty() && (candidate.back() == '.' || candidate.back() == '_'))
        candidate.pop_back();
    return candidate;
}

// V<position>_A, V<position>_B, ...: the stem is cut to leave room for the
// suffix, and never stands alone.
std::string NumberedShortName(int position, const std::string& name, std::set<std::string>& used) {
    const std::string stem = "V" + std::to_string(position);
    for (unsigned k = 0;; ++k) {
        const std::string suffix = BijectiveBase26(k);
        const int room = int(kShortNameBytes) - int(suffix.size()) - 1;
        if (room < 2) RaiseError(kErrNoShortName, name);
        std::string candidate = stem.substr(0, size_t(room)) + "_" + suffix;
        if (used.insert(candidate).second) return candidate;
    }
}

// Members of the stored sets follow their variables. The extended
// dichotomy sets are read after this record, under the names they were
// written with, so they keep them. On export every member becomes what a
// reader matches it by: at most 64 bytes, upper case.
void RenameSetMembers(QORA_DataSource& source, const Renames& renames, bool exporting) {
    for (QORA_SetFamily family :
         {QORA_SetFamily::kVariableSets, QORA_SetFamily::kMultipleResponse}) {
        QORA_VariableSetList sets = LoadVariableSets(source, family);
        if (sets.empty()) continue;
        for (QORA_VariableSet& set : sets) {
            if (set.GetCategory() == QORA_VariableSet::kMultipleDichotomy && set.IsExtended())
                continue;
            for (size_t k = 0; k < set.GetVariables().size(); ++k) {
                std::string name = set.GetVariables()[k];
                if (const std::string* renamed = renames.Find(name)) name = *renamed;
                if (exporting) {
                    const std::string cut = mbPrefix(name, kMaxNameBytes);
                    name = MakeLookupKey(cut.data(), cut.size());
                }
                set.SetVariable(k, std::move(name));
            }
        }
        StoreVariableSets(source, sets);
    }
}

void RenameVariables(QORA_DataSource& source, const Renames& renames) {
    for (int i = 0; i < source.ColumnCount(); ++i) {
        QORA_Variable& var = source.GetVariable(i);
        if (const std::string* renamed = renames.FindAt(size_t(i), var.GetName()))
            var.SetName(renamed->data(), renamed->size());
    }
}

void Rename(QORA_DataSource& source, const NameList& list, bool exporting) {
    const Renames renames(list);
    RenameSetMembers(source, renames, exporting);
    RenameVariables(source, renames);
}

// The position of the first "=" or tab from pos on, or npos: one pass,
// where find_first_of searches its set once per byte.
size_t FindSeparator(const std::string& text, size_t pos) {
    const auto at =
        std::find_if(text.begin() + pos, text.end(), [](char c) { return c == '=' || c == '\t'; });
    return at == text.end() ? std::string::npos : size_t(at - text.begin());
}

// Appends one (short name, long name) pair per entry. A long name is cut to
// the 64 bytes a name may have, so that no caller's name buffer overflows.
void ParseNames(const std::string& text, NameList& list) {
    const size_t len = text.size();
    for (size_t pos = 0; pos < len;) {
        const size_t i = FindSeparator(text, pos);
        QORA_FILE_CHECK_TEXT(kErrBadFormat, i != std::string::npos && text[i] == '=',
                             "i != notFound && extString[i] == '='");
        size_t j = FindSeparator(text, i + 1);
        if (j == std::string::npos) j = len;
        QORA_FILE_CHECK_TEXT(kErrBadFormat, j == len || text[j] == '\t',
                             "j == len || extString[j] == '\\t'");
        list.emplace_back(text.substr(pos, i - pos),
                          mbPrefix(std::string_view(text).substr(i + 1, j - i - 1), kMaxNameBytes));
        pos = j + 1;
    }
}

class SFExtensionExtNames : public SystemFileExtensionHandler {
  public:
    // The name list comes from the short names that the very long strings
    // record's export generated; the variables take their short names here.
    void Export(QORA_DataSource& source, HeaderSettings& settings,
                SystemFileExtensionRecord& record) override {
        settings.fLongNamesSeen = true;
        if (settings.fNameList.empty()) return;
        Rename(source, settings.fNameList, true);
        std::string text;
        for (const auto& [name, shortName] : settings.fNameList) {
            if (!text.empty()) text += '\t';
            text += shortName + "=" + name;
        }
        record.SetText(text);
    }

    void Import(QORA_DataSource& source, HeaderSettings& settings,
                const SystemFileExtensionRecord& record) override {
        settings.fLongNamesSeen = true;
        QORA_FILE_CHECK_TEXT(kErrBadFormat, record.UnitSize() == 1, "rec.UnitSize()==1");
        ParseNames(record.Text(), settings.fNameList);
        if (!settings.fNameList.empty()) Rename(source, settings.fNameList, false);
    }
};

SFExtensionExtNames gHandler;
const bool gRegistered = (RegisterExtensionHandler(kLongNamesExtension, gHandler), true);

}  // namespace

void GenerateShortNames(const QORA_DataSource& source, HeaderSettings& settings) {
    NameList& list = settings.fNameList;
    const int count = source.ColumnCount();
    list.assign(size_t(count), {});
    std::vector<bool> named(size_t(count), false);
    std::set<std::string> used;
    for (int i = 0; i < count; ++i) {
        const QORA_Variable& var = source.GetVariable(i);
        list[i].first = var.GetName();
        if (var.GetKey().size() > kShortNameBytes) continue;
        list[i].second = var.GetKey();
        used.insert(var.GetKey());
        named[i] = true;
    }
    for (int i = 0; i < count; ++i) {
        if (named[i]) continue;
        const std::string candidate = CutKey(source.GetVariable(i).GetKey());
        if (candidate.empty() || !used.insert(candidate).second) continue;
        list[i].second = candidate;
        named[i] = true;
    }
    for (int i = 0; i < count; ++i)
        if (!named[i]) list[i].second = NumberedShortName(i + 1, list[i].first, used);
}
