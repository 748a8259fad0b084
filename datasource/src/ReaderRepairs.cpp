#include "ReaderRepairs.h"

#include <algorithm>
#include <string>
#include <unordered_set>
#include <vector>

#include "datasrc.h"
#include "namerules.h"
#include "nametable.h"
#include "qoramb.h"
#include "variableset.h"

namespace {

// Whether a name can stand as it is: valid characters only, and no leading
// character that marks a scratch or system name.
bool IsAcceptableName(const std::string& name) {
    if (name.empty()) return false;
    const unsigned char first = name[0];
    if (first == '#' || first == '$' || first == '_' || first == '.') return false;
    for (size_t at = 0; at < name.size();) {
        const int n = mbCharLength(name.data() + at, std::min<size_t>(4, name.size() - at));
        if (n <= 0) return false;
        const unsigned char c = static_cast<unsigned char>(name[at]);
        if (n == 1 && c < 0x80 && !IsAsciiNameChar(c)) return false;
        at += size_t(n);
    }
    return true;
}

// Lower-cases the names of a file that has no long names record.
void LowerCaseNames(QORA_DataSource& source) {
    for (int i = 0; i < source.ColumnCount(); ++i) {
        QORA_Variable& var = source.GetVariable(i);
        const std::string& name = var.GetName();
        char lower[kMaxNameBytes + 1] = {};
        int error = 0;
        const int n = mbToLower(name.data(), int(name.size()), lower, kMaxNameBytes, &error);
        var.SetName(lower, size_t(std::clamp(n, 0, int(kMaxNameBytes))));
    }
}

const QORA_SetFamily kSetFamilies[] = {QORA_SetFamily::kVariableSets,
                                       QORA_SetFamily::kMultipleResponse};

// Sets may name variables the file does not have: those names go, and the
// records of a family that lost any are written again from what is left.
// When the names will change their case, the sets are written again anyway;
// the variables' names do not show in them, so that is done here, from the
// one parse of each family.
void PruneStoredSets(QORA_DataSource& source, bool rewrite) {
    for (QORA_SetFamily family : kSetFamilies) {
        QORA_VariableSetList sets = LoadVariableSets(source, family);
        if (PruneVariableSets(sets, source))
            ReplaceVariableSets(source, family, sets);
        else if (rewrite && !sets.empty())
            StoreVariableSets(source, sets);
    }
}

}  // namespace

void RepairNames(QORA_DataSource& source) {
    // Names are compared by their lookup keys, so that names differing only in
    // case, which no lookup can tell apart, count as repeats too. The keys
    // are those of variables that keep their names.
    NameTable keys(size_t(source.ColumnCount()));
    std::vector<int> marked;
    for (int i = 0; i < source.ColumnCount(); ++i) {
        const QORA_Variable& var = source.GetVariable(i);
        if (!IsAcceptableName(var.GetName()) || !keys.Insert(var.GetKey(), i)) marked.push_back(i);
    }
    std::unordered_set<std::string> given;
    int counter = 0;
    for (int index : marked) {
        std::string candidate;
        do candidate = "V" + std::to_string(++counter);
        while (keys.Find(candidate) >= 0 || given.count(candidate));
        given.insert(candidate);
        candidate[0] = 'v';
        source.GetVariable(index).SetName(candidate.c_str());
    }
}

void RepairAfterReading(QORA_DataSource& source, bool longNamesSeen) {
    PruneStoredSets(source, !longNamesSeen);
    RepairNames(source);
    if (!longNamesSeen) LowerCaseNames(source);
}
