// Custom attribute calls: the attributes of the file and of each variable,
// handed out as parallel arrays of names and texts.
#include <cstdlib>
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

int QORA_API qoraFreeAttributes(char** names, char** texts, int count) {
    return GuardedCall(kCatchFree, [&] {
        FreeCallerStrings(names, count);
        FreeCallerStrings(texts, count);
        return QORA_STATUS_OK;
    });
}
