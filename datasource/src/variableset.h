// Variable sets and multiple response sets. They are not dictionary objects:
// a data source keeps them as text in stored extension records (types 5, 7
// and 19), one set per line, and they are parsed when someone asks for them
// and written back as text when they change.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "extension.h"

class QORA_DataSource;

class QORA_VariableSet {
  public:
    enum Category : int32_t {
        kVariableSet = 0,
        kMultipleCategory = 1,
        kMultipleDichotomy = 2,
    };
    enum Flag : uint32_t {
        kExtendedFlag = 1,  // dichotomy set in the extended ("=E") form
        kLabelLeftOut = 2,  // the label is not written
    };
    // Renderings of the name.
    enum CaseCode { kLowerCase = 0, kUpperCase = 1, kAsStored = 2 };

    QORA_VariableSet() = default;
    explicit QORA_VariableSet(Category category) : fCategory(category) {}

    // One line of a stored record (it ends at its first CR or LF). A line
    // that breaks the grammar yields nothing: text read from a file may be
    // damaged, and one bad line must not cost the other sets.
    static std::optional<QORA_VariableSet> Parse(std::string_view line);
    // Appends the set's line, newline included. Preconditions: a multiple
    // response set's name begins with "$"; a dichotomy set has a counted value.
    void AppendLine(std::string& text) const;

    Category GetCategory() const { return fCategory; }
    void SetCategory(Category category) { fCategory = category; }

    uint32_t GetFlags() const { return fFlags; }
    void SetFlags(uint32_t flags) { fFlags = flags & (kExtendedFlag | kLabelLeftOut); }
    bool IsExtended() const { return (fFlags & kExtendedFlag) != 0; }
    void SetExtended(bool on) { SetFlag(kExtendedFlag, on); }
    bool IsLabelLeftOut() const { return (fFlags & kLabelLeftOut) != 0; }
    void SetLabelLeftOut(bool on) { SetFlag(kLabelLeftOut, on); }

    const std::string& GetName() const { return fName; }
    // caseCode is a CaseCode; any other code is a precondition violation.
    std::string GetName(int caseCode) const;
    void SetName(std::string name) { fName = std::move(name); }

    const std::string& GetLabel() const { return fLabel; }
    void SetLabel(std::string label) { fLabel = std::move(label); }

    // The counted value of a dichotomy set, as text.
    const std::string& GetValue() const { return fValue; }
    void SetValue(std::string value) { fValue = std::move(value); }

    const std::vector<std::string>& GetVariables() const { return fVariables; }
    // Dropped when the set already has that name (case ignored).
    void AddVariable(std::string_view name);
    // Renames in place, keeping the position; precondition k < count.
    void SetVariable(size_t k, std::string name);
    // Removes every member the predicate names; returns whether any went.
    bool RemoveVariablesIf(const std::function<bool(const std::string&)>& unwanted);

  private:
    void SetFlag(uint32_t flag, bool on) { fFlags = on ? (fFlags | flag) : (fFlags & ~flag); }
    bool HasVariable(std::string_view name) const;

    Category fCategory = kVariableSet;
    uint32_t fFlags = 0;
    std::string fName;
    std::string fLabel;
    std::string fValue;
    std::vector<std::string> fVariables;
};

using QORA_VariableSetList = std::vector<QORA_VariableSet>;

// The two families of stored set records.
enum class QORA_SetFamily {
    kMultipleResponse,  // types 7 then 19
    kVariableSets,      // type 5
};

// All sets of one family stored in the data source, in record order. A later
// line naming an earlier set (case ignored) replaces its contents in place.
// Malformed lines are skipped.
QORA_VariableSetList LoadVariableSets(const QORA_DataSource& source, QORA_SetFamily family);

// Writes the sets into their records: variable sets to type 5, extended
// dichotomy sets to type 19, the other multiple response sets to type 7. A
// type that receives no line keeps what it held.
void StoreVariableSets(QORA_DataSource& source, const QORA_VariableSetList& sets);

// Writes the sets of one family in place of every record of that family.
void ReplaceVariableSets(QORA_DataSource& source, QORA_SetFamily family,
                         const QORA_VariableSetList& sets);

// Removes member names that name no variable of the data source, then sets
// left without members. Returns whether anything was removed.
bool PruneVariableSets(QORA_VariableSetList& sets, const QORA_DataSource& source);
