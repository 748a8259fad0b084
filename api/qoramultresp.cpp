// Multiple response sets and variable sets: their record texts whole, and
// the multiple response sets one by one as definitions a caller can read and
// add.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "namerules.h"
#include "qoracall.h"
#include "qoramb.h"
#include "variableset.h"

namespace {

// The text of a stored set record, handed out whole; the caller frees it.
int HandOutRecordText(int handle, int subtype, int noneStatus, char** text) {
    if (text == nullptr) return kCatchCaseIn;
    *text = nullptr;
    return EntryCall(handle, AccessAny, kCatchCaseIn, [&](FileEntry& entry) -> int {
        if (entry.fMode == WriteMode) return QORA_STATUS_NOT_OPENED_FOR_READING;
        if (!entry.fpDataSource->HasExtension(subtype)) return noneStatus;
        const QORA_Extension record = entry.fpDataSource->GetExtension(subtype);
        if (record.Impl()->ElementSize() != 1) return QORA_STATUS_BAD_SUBTYPE;
        *text = CopyForCaller(record.Impl()->Content());
        return *text ? QORA_STATUS_OK : QORA_STATUS_NO_MEMORY;
    });
}

void FreeDefinition(qoraMultRespDef* definition) {
    if (definition == nullptr) return;
    std::free(definition->countedValue);
    FreeCallerStrings(definition->varNames, definition->numVars);
    std::free(definition);
}

struct DefinitionFree {
    void operator()(qoraMultRespDef* definition) const { FreeDefinition(definition); }
};
using OwnedDefinition = std::unique_ptr<qoraMultRespDef, DefinitionFree>;

// Fills a zeroed definition from a set; the names of the file's dictionary
// tell whether a dichotomy set counts a number.
int Fill(qoraMultRespDef& def, const QORA_VariableSet& set, const FileEntry& entry) {
    mbCopyBounded(def.name, set.GetName().c_str(), sizeof def.name);
    mbCopyBounded(def.label, set.GetLabel().c_str(), sizeof def.label);
    const std::vector<std::string>& names = set.GetVariables();
    def.isDichotomy = set.GetCategory() == QORA_VariableSet::kMultipleDichotomy;
    if (def.isDichotomy) {
        def.useCategoryLabels = set.IsExtended();
        def.useFirstVarLabel = set.IsLabelLeftOut();
        def.countedValue = CopyForCaller(set.GetValue());
        if (def.countedValue == nullptr) return QORA_STATUS_NO_MEMORY;
        const int first = names.empty() ? -1 : entry.FindVariable(names[0].c_str());
        if (first >= 0 && !entry.fpDataSource->GetVariable(first).IsString()) {
            def.isNumeric = 1;
            def.numericCountedValue = int(std::strtol(def.countedValue, nullptr, 10));
        }
    }
    if (names.empty()) return QORA_STATUS_OK;
    def.varNames = static_cast<char**>(std::calloc(names.size(), sizeof(char*)));
    if (def.varNames == nullptr) return QORA_STATUS_NO_MEMORY;
    def.numVars = int(names.size());
    for (size_t i = 0; i < names.size(); ++i) {
        def.varNames[i] = CopyForCaller(names[i]);
        if (def.varNames[i] == nullptr) return QORA_STATUS_NO_MEMORY;
    }
    return QORA_STATUS_OK;
}

// A text field of the definition, which need not be terminated.
std::string Field(const char* field, size_t size) {
    return std::string(field, strnlen(field, size));
}

std::string WithoutSurroundingBlanks(const std::string& text) {
    const size_t first = text.find_first_not_of(' ');
    if (first == std::string::npos) return std::string();
    return text.substr(first, text.find_last_not_of(' ') - first + 1);
}

// A set is one line of its record, so its texts may not break a line.
bool FitsOneLine(const std::string& text) {
    return text.find_first_of("\r\n") == std::string::npos;
}

// The members in order: each must name a variable of the right kind, and no
// variable may come twice.
int AddMembers(const FileEntry& entry, const qoraMultRespDef& def, QORA_VariableSet& set) {
    if (def.numVars > 0 && def.varNames == nullptr) return QORA_STATUS_BAD_MRSET_DEF;
    const bool dichotomy = def.isDichotomy != 0;
    std::vector<std::string> keys;
    bool strings = dichotomy && def.isNumeric == 0;
    for (int i = 0; i < def.numVars; ++i) {
        const char* name = def.varNames[i];
        const int index = name != nullptr && *name != '\0' ? entry.FindVariable(name) : -1;
        if (index < 0) return QORA_STATUS_BAD_MRSET_DEF;
        const QORA_Variable& var = entry.fpDataSource->GetVariable(index);
        if (!dichotomy && i == 0) strings = var.IsString();
        if (var.IsString() != strings) return QORA_STATUS_BAD_MRSET_DEF;
        set.AddVariable(WithoutSurroundingBlanks(name));
        keys.push_back(var.GetKey());
    }
    std::sort(keys.begin(), keys.end());
    if (std::adjacent_find(keys.begin(), keys.end()) != keys.end())
        return QORA_STATUS_BAD_MRSET_DEF;
    return QORA_STATUS_OK;
}

// A category set asks for no labels; a dichotomy set asks for the first
// variable's label only together with the category labels.
bool LabelFlagsAgree(const qoraMultRespDef& def) {
    if (def.isDichotomy == 0) return def.useCategoryLabels == 0 && def.useFirstVarLabel == 0;
    return def.useFirstVarLabel == 0 || def.useCategoryLabels != 0;
}

// Label, counted value and flags of a set whose name and members passed.
int Describe(const qoraMultRespDef& def, QORA_VariableSet& set) {
    const std::string label = Field(def.label, sizeof def.label);
    if (!FitsOneLine(label)) return QORA_STATUS_BAD_MRSET_DEF;
    if (!label.empty()) set.SetLabel(label);
    if (def.isDichotomy == 0) return QORA_STATUS_OK;
    char number[16];
    std::snprintf(number, sizeof number, "%ld", long(def.numericCountedValue));
    const std::string value = def.isNumeric != 0 ? number : def.countedValue;
    if (!FitsOneLine(value)) return QORA_STATUS_BAD_MRSET_DEF;
    set.SetValue(value);
    set.SetExtended(def.useCategoryLabels != 0);
    set.SetLabelLeftOut(def.useFirstVarLabel != 0);
    return QORA_STATUS_OK;
}

// The first failure decides the status, except that a set whose label flags
// disagree is reported as such even when its name was taken.
int AddDefinition(FileEntry& entry, const qoraMultRespDef& def) {
    const std::string name = Field(def.name, sizeof def.name);
    if (qoraValidateVarname(name.c_str()) != kNameSystem) return QORA_STATUS_BAD_MRSET_NAME;
    const bool dichotomy = def.isDichotomy != 0;
    if (dichotomy && def.isNumeric == 0 &&
        (def.countedValue == nullptr || def.countedValue[0] == '\0'))
        return QORA_STATUS_BAD_MRSET_DEF;
    QORA_VariableSet set(dichotomy ? QORA_VariableSet::kMultipleDichotomy
                                   : QORA_VariableSet::kMultipleCategory);
    set.SetName(WithoutSurroundingBlanks(name));
    int status = entry.fMultResp.Has(set.GetName()) ? QORA_STATUS_DUPLICATE_MRSET : 0;
    if (status == QORA_STATUS_OK) status = AddMembers(entry, def, set);
    if ((status == QORA_STATUS_OK || status == QORA_STATUS_DUPLICATE_MRSET) &&
        !LabelFlagsAgree(def))
        status = QORA_STATUS_BAD_MRSET_DEF;
    if (status == QORA_STATUS_OK) status = Describe(def, set);
    if (status != QORA_STATUS_OK) return status;
    if (set.GetVariables().size() < 2) return QORA_STATUS_BAD_MRSET_DEF;
    entry.fMultResp.Add(std::move(set));
    return QORA_STATUS_OK;
}

// A definition of the given name, label and members; the caller sets the
// counted value.
qoraMultRespDef Definition(const char* name, const char* label, int isDichotomy,
                           const char* const* varNames, int numVars) {
    qoraMultRespDef def{};
    mbCopyBounded(def.name, name ? name : "", sizeof def.name);
    mbCopyBounded(def.label, label ? label : "", sizeof def.label);
    def.isDichotomy = isDichotomy != 0;
    def.varNames = const_cast<char**>(varNames);
    def.numVars = numVars;
    return def;
}

}  // namespace

int QORA_API qoraSetMultRespDefs(int handle, const char* text) {
    return qoraSetExtensionData(handle, kMultRespExtension, 1, text ? int(std::strlen(text)) : 0,
                                text);
}

int QORA_API qoraGetMultRespDefs(int handle, char** text) {
    return HandOutRecordText(handle, kMultRespExtension, QORA_WARN_NO_MRSETS, text);
}

int QORA_API qoraFreeMultRespDefs(char* text) {
    return GuardedCall(kCatchFree, [&] {
        std::free(text);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetVariableSets(int handle, const char* text) {
    return qoraSetExtensionData(handle, kVariableSetExtension, 1, text ? int(std::strlen(text)) : 0,
                                text);
}

int QORA_API qoraGetVariableSets(int handle, char** text) {
    return HandOutRecordText(handle, kVariableSetExtension, QORA_WARN_NO_VARSETS, text);
}

int QORA_API qoraFreeVariableSets(char* text) { return qoraFreeMultRespDefs(text); }

int QORA_API qoraGetMultRespCount(int handle, int* count) {
    if (count == nullptr) return kCatchHandle;
    *count = 0;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) {
        *count = entry.fMultResp.Count();
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraGetMultRespDefByIndex(int handle, int index, qoraMultRespDef** definition) {
    if (definition == nullptr) return kCatchHandle;
    *definition = nullptr;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) -> int {
        if (index < 0 || index >= entry.fMultResp.Count()) return QORA_STATUS_BAD_MRSET_INDEX;
        OwnedDefinition def(static_cast<qoraMultRespDef*>(std::calloc(1, sizeof(qoraMultRespDef))));
        if (!def) return QORA_STATUS_NO_MEMORY;
        if (const int status = Fill(*def, entry.fMultResp.At(index), entry)) return status;
        *definition = def.release();
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraFreeMultRespDefStruct(qoraMultRespDef* definition) {
    return GuardedCall(kCatchFree, [&] {
        FreeDefinition(definition);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraAddMultRespDefExt(int handle, const qoraMultRespDef* definition) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) -> int {
        if (definition == nullptr) return QORA_STATUS_BAD_MRSET_DEF;
        return AddDefinition(entry, *definition);
    });
}

int QORA_API qoraAddMultRespDefC(int handle, const char* name, const char* label, int isDichotomy,
                                 const char* countedValue, const char* const* varNames,
                                 int numVars) {
    qoraMultRespDef def = Definition(name, label, isDichotomy, varNames, numVars);
    if (def.isDichotomy) def.countedValue = const_cast<char*>(countedValue);
    return qoraAddMultRespDefExt(handle, &def);
}

int QORA_API qoraAddMultRespDefN(int handle, const char* name, const char* label, int isDichotomy,
                                 int countedValue, const char* const* varNames, int numVars) {
    qoraMultRespDef def = Definition(name, label, isDichotomy, varNames, numVars);
    char text[16];
    if (def.isDichotomy) {
        def.numericCountedValue = countedValue;
        def.isNumeric = 1;
        std::snprintf(text, sizeof text, "%ld", long(countedValue));
        def.countedValue = text;
    }
    return qoraAddMultRespDefExt(handle, &def);
}
