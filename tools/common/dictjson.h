// The JSON dictionary side file: per variable its type, label, formats,
// missing values, value labels, measurement level, alignment and column
// width. qoradump --json and qoraconv write it; qoraconv reads it.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

using Json = nlohmann::ordered_json;

// The side file of an open file.
Json DictionaryJson(int handle);

// One variable of a side file, and the line where its entry begins.
struct SideEntry {
    Json spec;
    int line;
};

// The variables of a side file; throws BadInput when it is not one.
std::vector<SideEntry> ReadSideFile(const std::string& path);

// The type the entry declares (0 numeric, else the string width), or
// `inferred` when it declares none.
int SideType(const std::string& path, const SideEntry& entry, int inferred);

// Gives variable `name` of a file being written what the entry says.
void ApplySideEntry(int handle, const std::string& name, int type, const std::string& path,
                    const SideEntry& entry);
