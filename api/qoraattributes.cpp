// Custom attribute calls: the attributes of the file and of each variable,
// handed out as parallel arrays of names and texts and set from them.
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "qoracall.h"

namespace {

// One name and text per non-empty value; an attribute of several values is
// listed once per value, its name subscripted ("name[07]").
std::vector<std::pair<std::string, std::string>> Presented(const Attributes& attributes) {
    std::vector<std::pair<std::string, std::string>> items;
    for (int k = 0; k < attributes.Size(); ++k) {
        const Attributes::Values& values = attributes.ValuesAt(k);
        const int count = int(values.size());
        for (int i = 0; i < count; ++i) {
            if (values[i].empty()) continue;
            items.emplace_back(Attributes::PresentedName(attributes.NameAt(k), i + 1, count),
                               values[i]);
        }
    }
    return items;
}

// Hands the attributes out; on any failure nothing is handed out and
// everything made is freed.
int HandOut(const Attributes& attributes, char*** names, char*** texts, int* count) {
    const auto items = Presented(attributes);
    if (items.empty()) return QORA_STATUS_OK;
    const int n = int(items.size());
    char** nameArray = static_cast<char**>(std::calloc(items.size(), sizeof(char*)));
    char** textArray = static_cast<char**>(std::calloc(items.size(), sizeof(char*)));
    bool complete = nameArray != nullptr && textArray != nullptr;
    for (int i = 0; complete && i < n; ++i) {
        nameArray[i] = CopyForCaller(items[i].first);
        textArray[i] = CopyForCaller(items[i].second);
        complete = nameArray[i] != nullptr && textArray[i] != nullptr;
    }
    if (!complete) {
        FreeCallerStrings(nameArray, nameArray ? n : 0);
        FreeCallerStrings(textArray, textArray ? n : 0);
        return QORA_STATUS_NO_MEMORY;
    }
    *names = nameArray;
    *texts = textArray;
    *count = n;
    return QORA_STATUS_OK;
}

// An attribute holds at most this many values, so that a subscript given by
// a caller never makes an unbounded list.
enum { kMaxValues = 65535 };

// Sets value k (1-based) of the attribute, or makes text its single value
// when k is 0.
void SetValue(Attributes& attributes, const std::string& name, int k, const std::string& text) {
    Attributes::Values values{text};
    if (k > 0) {
        values = attributes.ValuesOf(name);
        if (values.size() < size_t(k)) values.resize(size_t(k));
        values[size_t(k - 1)] = text;
    }
    attributes.Set(name, std::move(values));
}

// Ordinary names, and the reserved names of the file's or the variables' list.
bool IsAcceptedName(const std::string& name, bool forVariable) {
    const int kind = Attributes::ClassifyName(name.data(), name.size(), forVariable);
    return kind == 1 || kind == 2;
}

// "name" or "name[k]" with k from 1 to kMaxValues: the name and k (0 for
// none); false for a malformed subscript.
bool SplitSubscript(const std::string& presented, std::string* name, int* k) {
    *k = 0;
    *name = presented;
    const size_t open = presented.find('[');
    if (open == std::string::npos) return true;
    const std::string digits = presented.substr(open + 1);
    if (digits.size() < 2 || digits.back() != ']') return false;
    char* end = nullptr;
    const long value = std::strtol(digits.c_str(), &end, 10);
    if (end != digits.c_str() + digits.size() - 1 || digits[0] < '0' || digits[0] > '9' ||
        value < 1 || value > kMaxValues)
        return false;
    *name = presented.substr(0, open);
    *k = int(value);
    return true;
}

// A new set from the parallel arrays; pairs without a name or a text are
// skipped.
int Collect(const char* const* names, const char* const* texts, int count, bool forVariable,
            Attributes& result) {
    if (count > 0 && (names == nullptr || texts == nullptr)) return QORA_STATUS_BAD_ATTR_DEF;
    for (int i = 0; i < count; ++i) {
        if (names[i] == nullptr || *names[i] == '\0' || texts[i] == nullptr || *texts[i] == '\0')
            continue;
        std::string name;
        int k;
        if (!SplitSubscript(names[i], &name, &k) || !IsAcceptedName(name, forVariable))
            return QORA_STATUS_BAD_ATTR_NAME;
        SetValue(result, name, k, texts[i]);
    }
    return QORA_STATUS_OK;
}

// One value set in the attributes when the name and the value are sound.
int AddOne(Attributes& attributes, const char* name, int sub, const char* text, bool forVariable) {
    if (name == nullptr || *name == '\0' || text == nullptr || *text == '\0' ||
        (sub != -1 && (sub < 1 || sub > kMaxValues)))
        return QORA_STATUS_BAD_ATTR_DEF;
    if (!IsAcceptedName(name, forVariable)) return QORA_STATUS_BAD_ATTR_NAME;
    SetValue(attributes, name, sub == -1 ? 0 : sub, text);
    return QORA_STATUS_OK;
}

bool ClearOutputs(char*** names, char*** texts, int* count) {
    if (names == nullptr || texts == nullptr || count == nullptr) return false;
    *names = nullptr;
    *texts = nullptr;
    *count = 0;
    return true;
}

}  // namespace

int QORA_API qoraGetFileAttributes(int handle, char*** names, char*** texts, int* count) {
    if (!ClearOutputs(names, texts, count)) return kCatchHandle;
    return EntryCall(handle, AccessAny, kCatchHandle, [&](FileEntry& entry) {
        return HandOut(entry.fpDataSource->FileAttributes(), names, texts, count);
    });
}

int QORA_API qoraGetVarAttributes(int handle, const char* varName, char*** names, char*** texts,
                                  int* count) {
    if (!ClearOutputs(names, texts, count)) return kCatchHandle;
    return VariableCall(handle, varName, AccessAny, [&](FileEntry&, QORA_Variable& var) {
        return HandOut(var.GetAttributes(), names, texts, count);
    });
}

int QORA_API qoraSetFileAttributes(int handle, const char* const* names, const char* const* texts,
                                   int count) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) -> int {
        Attributes result;
        if (const int status = Collect(names, texts, count, false, result)) return status;
        entry.fpDataSource->FileAttributes() = result;
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraSetVarAttributes(int handle, const char* varName, const char* const* names,
                                  const char* const* texts, int count) {
    return VariableCall(handle, varName, AccessDefine, [&](FileEntry&, QORA_Variable& var) -> int {
        Attributes result;
        if (const int status = Collect(names, texts, count, true, result)) return status;
        var.SetAttributes(result);
        return QORA_STATUS_OK;
    });
}

int QORA_API qoraAddFileAttribute(int handle, const char* attribName, int attribSub,
                                  const char* attribText) {
    return EntryCall(handle, AccessDefine, kCatchHandle, [&](FileEntry& entry) {
        return AddOne(entry.fpDataSource->FileAttributes(), attribName, attribSub, attribText,
                      false);
    });
}

int QORA_API qoraAddVarAttribute(int handle, const char* varName, const char* attribName,
                                 int attribSub, const char* attribText) {
    return VariableCall(handle, varName, AccessDefine, [&](FileEntry&, QORA_Variable& var) {
        Attributes attributes = var.GetAttributes();
        const int status = AddOne(attributes, attribName, attribSub, attribText, true);
        if (status == QORA_STATUS_OK) var.SetAttributes(attributes);
        return status;
    });
}

int QORA_API qoraFreeAttributes(char** names, char** texts, int count) {
    return GuardedCall(kCatchFree, [&] {
        FreeCallerStrings(names, count);
        FreeCallerStrings(texts, count);
        return QORA_STATUS_OK;
    });
}
