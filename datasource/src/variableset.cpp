#include "variableset.h"

#include <algorithm>
#include <climits>
#include <unordered_map>
#include <unordered_set>

#include "datasrc.h"
#include "dserror.h"
#include "namerules.h"
#include "qoramb.h"

namespace {

// Walks one line. Every step checks the bytes that are really there, so a
// damaged line fails a step instead of driving a read past its end.
class LineReader {
  public:
    explicit LineReader(std::string_view line) : fRest(line) {}

    std::string_view Rest() const { return fRest; }

    // The next byte, consumed; 0 at the end.
    char Next() {
        if (fRest.empty()) return 0;
        const char c = fRest[0];
        fRest.remove_prefix(1);
        return c;
    }
    bool Take(char c) { return !fRest.empty() && fRest[0] == c && Next() == c; }

    // The text before the next c; c is consumed too.
    std::optional<std::string_view> UpTo(char c) {
        const size_t at = fRest.find(c);
        if (at == std::string_view::npos) return std::nullopt;
        const std::string_view text = fRest.substr(0, at);
        fRest.remove_prefix(at + 1);
        return text;
    }

    // A decimal byte count ended by a blank, then that many bytes.
    std::optional<std::string_view> Counted(bool allowEmpty) {
        const std::optional<std::string_view> digits = UpTo(' ');
        if (!digits || digits->empty()) return std::nullopt;
        size_t length = 0;
        for (const char c : *digits) {
            if (c < '0' || c > '9') return std::nullopt;
            length = length * 10 + static_cast<size_t>(c - '0');
            if (length > fRest.size()) return std::nullopt;
        }
        if (length == 0 && !allowEmpty) return std::nullopt;
        const std::string_view text = fRest.substr(0, length);
        fRest.remove_prefix(length);
        return text;
    }

  private:
    std::string_view fRest;
};

// The part of a multiple response line between "=" and the variable list.
bool ParseMultResp(LineReader& in, QORA_VariableSet& set) {
    const char type = in.Next();
    if (type == 'C') {
        set.SetCategory(QORA_VariableSet::kMultipleCategory);
        if (!in.Take(' ')) return false;
    } else if (type == 'D' || type == 'E') {
        set.SetCategory(QORA_VariableSet::kMultipleDichotomy);
        if (type == 'E') {
            if (!in.Take(' ')) return false;
            const std::optional<std::string_view> digits = in.UpTo(' ');
            if (!digits) return false;
            uint32_t flags = 0;
            for (size_t i = 0; i < 2 && i < digits->size(); ++i)
                if ((*digits)[i] != '0') flags |= 1u << i;
            set.SetFlags(flags);
        }
        const std::optional<std::string_view> value = in.Counted(false);
        if (!value || !in.Take(' ')) return false;
        set.SetValue(std::string(*value));
    } else {
        return false;
    }
    const std::optional<std::string_view> label = in.Counted(true);
    if (!label || !in.Take(' ')) return false;
    set.SetLabel(std::string(*label));
    return true;
}

void AppendCounted(std::string& text, std::string_view bytes) {
    text += std::to_string(bytes.size());
    text += ' ';
    text += bytes;
}

bool SameName(std::string_view a, std::string_view b) {
    return mbEqualNoCase(a.data(), static_cast<int>(a.size()), b.data(), static_cast<int>(b.size()),
                         nullptr) == 1;
}

// A name in upper case, whole: names with equal keys differ at most in case.
// Worked out once per name, so that a long list is matched in linear time.
std::string NameKey(std::string_view name) {
    std::string key(name.size(), '\0');
    const int n = mbToUpper(name.data(), int(name.size()), key.data(), int(key.size()), nullptr);
    key.resize(size_t(std::max(n, 0)));
    return key;
}

// Where each set of a family sits in the list, by name key.
using SetIndex = std::unordered_map<std::string, size_t>;

// Member names are matched against variables on their first bytes only.
std::string MemberKey(const std::string& name) {
    const std::string cut = mbPrefix(name, kMaxNameBytes);
    return MakeLookupKey(cut.data(), cut.size());
}

// A later line naming an earlier set takes that set's place.
void Merge(QORA_VariableSetList& sets, SetIndex& index, QORA_VariableSet set) {
    const auto found = index.emplace(NameKey(set.GetName()), sets.size());
    if (found.second) {
        sets.push_back(std::move(set));
    } else {
        sets[found.first->second] = std::move(set);
    }
}

void LoadRecord(const QORA_DataSource& source, int32_t type, bool multResp,
                QORA_VariableSetList& sets, SetIndex& index) {
    if (!source.HasExtension(type)) return;
    const QORA_Extension record = source.GetExtension(type);
    const std::string_view content = record.Impl()->Content();
    size_t start = 0;
    while (start < content.size()) {
        size_t end = content.find('\n', start);
        if (end == std::string_view::npos) end = content.size();
        const std::string_view line = content.substr(start, end - start);
        start = end + 1;
        if (line.size() <= 1) continue;
        // Some writers leave the "$" off multiple response set names.
        std::optional<QORA_VariableSet> set = multResp && line[0] != '$'
                                                  ? QORA_VariableSet::Parse("$" + std::string(line))
                                                  : QORA_VariableSet::Parse(line);
        if (set) Merge(sets, index, std::move(*set));
    }
}

void StoreText(QORA_DataSource& source, int32_t type, const std::string& text) {
    if (text.empty()) return;
    QORA_ASSERT(text.size() <= static_cast<size_t>(INT32_MAX));
    source.SetExtensionContent(type, 1, static_cast<int32_t>(text.size()), text.data());
}

}  // namespace

std::optional<QORA_VariableSet> QORA_VariableSet::Parse(std::string_view line) {
    line = line.substr(0, line.find_first_of("\r\n"));
    LineReader in(line);
    const std::optional<std::string_view> name = in.UpTo('=');
    if (!name) return std::nullopt;
    QORA_VariableSet set;
    set.fName = std::string(*name);
    if (!name->empty() && (*name)[0] == '$' && !ParseMultResp(in, set)) return std::nullopt;
    std::unordered_set<std::string> members;
    std::string_view rest = in.Rest();
    while (!rest.empty()) {
        const size_t blank = std::min(rest.find(' '), rest.size());
        const std::string_view member = rest.substr(0, blank);
        if (blank > 0 && members.insert(NameKey(member)).second)
            set.fVariables.emplace_back(member);
        rest.remove_prefix(std::min(blank + 1, rest.size()));
    }
    return set;
}

void QORA_VariableSet::AppendLine(std::string& text) const {
    const bool multResp = fCategory == kMultipleCategory || fCategory == kMultipleDichotomy;
    QORA_ASSERT(fCategory == kVariableSet || multResp);
    if (multResp) QORA_ASSERT(!fName.empty() && fName[0] == '$');
    text += fName;
    if (fCategory == kVariableSet) {
        text += "= ";
    } else if (fCategory == kMultipleCategory) {
        text += "=C ";
        AppendCounted(text, fLabel);
        text += ' ';
    } else {
        text += IsExtended() ? (IsLabelLeftOut() ? "=E 11 " : "=E 1 ") : "=D";
        QORA_ASSERT(fValue.size() > 0);
        AppendCounted(text, fValue);
        text += ' ';
        AppendCounted(text, IsLabelLeftOut() ? std::string_view() : std::string_view(fLabel));
        text += ' ';
    }
    for (size_t k = 0; k < fVariables.size(); ++k) {
        if (k > 0) text += ' ';
        text += fVariables[k];
    }
    text += '\n';
}

std::string QORA_VariableSet::GetName(int caseCode) const {
    QORA_ASSERT(caseCode == kLowerCase || caseCode == kUpperCase || caseCode == kAsStored);
    std::string name = fName;
    if (caseCode == kLowerCase) mbToLowerInPlace(name.data());
    if (caseCode == kUpperCase) mbToUpperInPlace(name.data());
    return name;
}

bool QORA_VariableSet::HasVariable(std::string_view name) const {
    for (const std::string& member : fVariables)
        if (SameName(member, name)) return true;
    return false;
}

void QORA_VariableSet::AddVariable(std::string_view name) {
    if (!HasVariable(name)) fVariables.emplace_back(name);
}

void QORA_VariableSet::SetVariable(size_t k, std::string name) {
    QORA_ASSERT(k < fVariables.size());
    fVariables[k] = std::move(name);
}

bool QORA_VariableSet::RemoveVariablesIf(const std::function<bool(const std::string&)>& unwanted) {
    const auto kept = std::remove_if(fVariables.begin(), fVariables.end(), unwanted);
    const bool removed = kept != fVariables.end();
    fVariables.erase(kept, fVariables.end());
    return removed;
}

QORA_VariableSetList LoadVariableSets(const QORA_DataSource& source, QORA_SetFamily family) {
    QORA_VariableSetList sets;
    SetIndex index;
    if (family == QORA_SetFamily::kMultipleResponse) {
        LoadRecord(source, kMultRespExtension, true, sets, index);
        LoadRecord(source, kExtendedMultRespExtension, true, sets, index);
    } else {
        LoadRecord(source, kVariableSetExtension, false, sets, index);
    }
    return sets;
}

void StoreVariableSets(QORA_DataSource& source, const QORA_VariableSetList& sets) {
    std::string variableSets, extended, multResp;
    for (const QORA_VariableSet& set : sets) {
        if (set.GetCategory() == QORA_VariableSet::kVariableSet)
            set.AppendLine(variableSets);
        else if (set.GetCategory() == QORA_VariableSet::kMultipleDichotomy && set.IsExtended())
            set.AppendLine(extended);
        else
            set.AppendLine(multResp);
    }
    StoreText(source, kMultRespExtension, multResp);
    StoreText(source, kVariableSetExtension, variableSets);
    StoreText(source, kExtendedMultRespExtension, extended);
}

void ReplaceVariableSets(QORA_DataSource& source, QORA_SetFamily family,
                         const QORA_VariableSetList& sets) {
    if (family == QORA_SetFamily::kVariableSets) {
        source.SetExtensionContent(kVariableSetExtension, 1, 0, nullptr);
    } else {
        source.SetExtensionContent(kMultRespExtension, 1, 0, nullptr);
        source.SetExtensionContent(kExtendedMultRespExtension, 1, 0, nullptr);
    }
    StoreVariableSets(source, sets);
}

bool PruneVariableSets(QORA_VariableSetList& sets, const QORA_DataSource& source) {
    if (sets.empty()) return false;
    std::unordered_set<std::string> keys;
    for (int i = 0; i < source.ColumnCount(); ++i) keys.insert(source.GetVariable(i).GetKey());
    bool removed = false;
    for (QORA_VariableSet& set : sets) {
        removed |= set.RemoveVariablesIf(
            [&keys](const std::string& name) { return keys.count(MemberKey(name)) == 0; });
    }
    const auto kept = std::remove_if(sets.begin(), sets.end(), [](const QORA_VariableSet& set) {
        return set.GetVariables().empty();
    });
    removed |= kept != sets.end();
    sets.erase(kept, sets.end());
    return removed;
}
