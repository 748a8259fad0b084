#include "dictjson.h"

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <sstream>

#include "casetext.h"
#include "dictionary.h"
#include "formats.h"
#include "qoraio32.h"
#include "status.h"

namespace {

const char* const kKeys[] = {"name",        "type",        "width",         "label",
                             "format",      "writeFormat", "missingValues", "missingRange",
                             "valueLabels", "level",       "alignment",     "columns"};

using FormatGetter = int (*)(int, const char*, int*, int*, int*);
using FormatSetter = int (*)(int, const char*, int, int, int);

Format GetFormat(int handle, const Variable& var, FormatGetter get, const char* what) {
    Format format{};
    Check(get(handle, var.name.c_str(), &format.code, &format.decimals, &format.width),
          std::string("reading the ") + what + " format of " + var.name);
    return format;
}

void AddNumericMissing(int handle, const Variable& var, Json& out) {
    const NumericMissing missing = NumericMissingValues(handle, var);
    Json discrete = Json::array();
    for (int i = missing.count < 0 ? 2 : 0; i < std::abs(missing.count); ++i)
        discrete.push_back(missing.values[i]);
    if (!discrete.empty()) out["missingValues"] = discrete;
    if (missing.count < 0)
        out["missingRange"] = Json{{"low", missing.values[0]}, {"high", missing.values[1]}};
}

void AddValueLabels(int handle, const Variable& var, Json& out) {
    Json pairs = Json::array();
    if (var.type == 0) {
        for (const auto& [value, label] : NumericValueLabels(handle, var))
            pairs.push_back(Json{{"value", value}, {"label", label}});
    } else {
        for (const auto& [value, label] : StringValueLabels(handle, var))
            pairs.push_back(Json{{"value", value}, {"label", label}});
    }
    if (!pairs.empty()) out["valueLabels"] = pairs;
}

Json VariableJson(int handle, const Variable& var, std::vector<char>& label) {
    const char* name = var.name.c_str();
    Json out = Json::object();
    out["name"] = var.name;
    out["type"] = var.type == 0 ? "numeric" : "string";
    if (var.type != 0) out["width"] = var.type;
    if (Check(qoraGetVarLabelLong(handle, name, label.data(), int(label.size()), nullptr),
              "reading the label of " + var.name) == 0)
        out["label"] = label.data();
    const std::string print = FormatText(GetFormat(handle, var, qoraGetVarPrintFormat, "print"));
    const std::string write = FormatText(GetFormat(handle, var, qoraGetVarWriteFormat, "write"));
    out["format"] = print;
    if (write != print) out["writeFormat"] = write;
    if (var.type == 0)
        AddNumericMissing(handle, var, out);
    else if (const auto missing = StringMissingValues(handle, var); !missing.empty())
        out["missingValues"] = missing;
    AddValueLabels(handle, var, out);
    int level = 0, alignment = 0, columns = 0;
    Check(qoraGetVarMeasureLevel(handle, name, &level),
          "reading the measurement level of " + var.name);
    Check(qoraGetVarAlignment(handle, name, &alignment), "reading the alignment of " + var.name);
    Check(qoraGetVarColumnWidth(handle, name, &columns), "reading the column width of " + var.name);
    out["level"] = LevelWord(level);
    out["alignment"] = AlignmentWord(alignment);
    out["columns"] = columns;
    return out;
}

// Walks the side file's text for the parser and counts the lines it passed,
// so that each entry can be placed by line.
struct LineCountingIterator {
    using iterator_category = std::input_iterator_tag;
    using value_type = char;
    using difference_type = std::ptrdiff_t;
    using pointer = const char*;
    using reference = const char&;

    const char* pos;
    int* line;

    reference operator*() const { return *pos; }
    LineCountingIterator& operator++() {
        if (*pos == '\n') ++*line;
        ++pos;
        return *this;
    }
    bool operator==(const LineCountingIterator& other) const { return pos == other.pos; }
    bool operator!=(const LineCountingIterator& other) const { return pos != other.pos; }
};

std::string ReadText(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    if (!in) throw BadInput{path + ": the file cannot be opened."};
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

[[noreturn]] void Refuse(const std::string& path, const SideEntry& entry,
                         const std::string& sentence) {
    throw BadInput{path + " line " + std::to_string(entry.line) + ": " + sentence};
}

// The missing-value count the entry's values and range make.
int MissingCount(const std::string& path, const SideEntry& entry, size_t discrete) {
    const bool range = entry.spec.contains("missingRange");
    if (range && discrete <= 1) return discrete == 1 ? -3 : -2;
    if (!range && discrete <= 3) return int(discrete);
    Refuse(path, entry, "a variable has at most three missing values, or a range and one value.");
}

void ApplyMissing(int handle, const char* name, int type, const std::string& path,
                  const SideEntry& entry) {
    const Json& spec = entry.spec;
    const Json discrete = spec.value("missingValues", Json::array());
    const int count = MissingCount(path, entry, discrete.size());
    if (count == 0) return;
    const std::string doing = std::string("setting the missing values of ") + name;
    if (type != 0) {
        std::string values[3];
        for (size_t i = 0; i < discrete.size(); ++i) values[i] = discrete[i].get<std::string>();
        Check(qoraSetVarCMissingValues(handle, name, count, values[0].c_str(), values[1].c_str(),
                                       values[2].c_str()),
              doing);
        return;
    }
    double values[3] = {0, 0, 0};
    size_t next = 0;
    if (count < 0) {
        values[next++] = spec["missingRange"].at("low").get<double>();
        values[next++] = spec["missingRange"].at("high").get<double>();
    }
    for (const Json& value : discrete) values[next++] = value.get<double>();
    Check(qoraSetVarNMissingValues(handle, name, count, values[0], values[1], values[2]), doing);
}

void ApplyValueLabels(int handle, const char* name, int type, const Json& pairs) {
    const std::string doing = std::string("setting the value labels of ") + name;
    for (const Json& pair : pairs) {
        const std::string label = pair.at("label").get<std::string>();
        if (type == 0)
            Check(
                qoraSetVarNValueLabel(handle, name, pair.at("value").get<double>(), label.c_str()),
                doing);
        else
            Check(qoraSetVarCValueLabel(handle, name, pair.at("value").get<std::string>().c_str(),
                                        label.c_str()),
                  doing);
    }
}

void ApplyFormat(int handle, const char* name, const std::string& path, const SideEntry& entry,
                 const char* key, FormatSetter set) {
    Format format{};
    const std::string text = entry.spec.at(key).get<std::string>();
    if (!ParseFormat(text, format)) Refuse(path, entry, "\"" + text + "\" is not a format.");
    Check(set(handle, name, format.code, format.decimals, format.width),
          std::string("setting the format ") + text + " of " + name);
}

}  // namespace

Json DictionaryJson(int handle) {
    Json variables = Json::array();
    std::vector<char> label(65536);
    for (const Variable& var : Variables(handle))
        variables.push_back(VariableJson(handle, var, label));
    Json dictionary = Json::object();
    dictionary["variables"] = variables;
    return dictionary;
}

std::vector<SideEntry> ReadSideFile(const std::string& path) {
    const std::string text = ReadText(path);
    int line = 1;
    std::vector<int> entryLines;
    const LineCountingIterator first{text.data(), &line}, last{text.data() + text.size(), &line};
    Json side;
    try {
        side = Json::parse(first, last, [&](int depth, Json::parse_event_t event, Json&) {
            if (depth == 2 && event == Json::parse_event_t::object_start)
                entryLines.push_back(line);
            return true;
        });
    } catch (const Json::parse_error& error) {
        throw BadInput{path + " line " + std::to_string(line) + ": the text is not JSON (" +
                       error.what() + ")."};
    }
    if (!side.is_object() || side.size() != 1 || !side.contains("variables") ||
        !side["variables"].is_array())
        throw BadInput{path + ": the file holds something other than one \"variables\" list."};
    std::vector<SideEntry> entries;
    for (size_t i = 0; i < side["variables"].size(); ++i) {
        const Json& spec = side["variables"][i];
        const int entryLine = i < entryLines.size() ? entryLines[i] : 1;
        if (!spec.is_object() || !spec.contains("name") || !spec["name"].is_string())
            throw BadInput{path + " line " + std::to_string(entryLine) +
                           ": each entry of \"variables\" is an object with a \"name\"."};
        entries.push_back({spec, entryLine});
    }
    return entries;
}

int SideType(const std::string& path, const SideEntry& entry, int inferred) {
    const Json& spec = entry.spec;
    if (!spec.contains("type")) return inferred;
    if (spec["type"] == "numeric") return 0;
    const Json width = spec.value("width", Json());
    if (spec["type"] != "string" || !width.is_number_integer() || width < 1 || width > 32767)
        Refuse(path, entry,
               "the type is \"numeric\", or \"string\" with a width of 1 to 32767 bytes.");
    return width.get<int>();
}

void ApplySideEntry(int handle, const std::string& name, int type, const std::string& path,
                    const SideEntry& entry) {
    const Json& spec = entry.spec;
    for (const auto& item : spec.items()) {
        if (std::find(std::begin(kKeys), std::end(kKeys), item.key()) == std::end(kKeys))
            Refuse(path, entry, "\"" + item.key() + "\" is not a property of a variable.");
    }
    const char* varName = name.c_str();
    try {
        if (spec.contains("label"))
            Check(qoraSetVarLabel(handle, varName, spec["label"].get<std::string>().c_str()),
                  "setting the label of " + name);
        if (spec.contains("format"))
            ApplyFormat(handle, varName, path, entry, "format", qoraSetVarPrintFormat);
        if (spec.contains("format") || spec.contains("writeFormat"))
            ApplyFormat(handle, varName, path, entry,
                        spec.contains("writeFormat") ? "writeFormat" : "format",
                        qoraSetVarWriteFormat);
        ApplyMissing(handle, varName, type, path, entry);
        ApplyValueLabels(handle, varName, type, spec.value("valueLabels", Json::array()));
        int level = 0, alignment = 0;
        if (spec.contains("level") && !ParseLevel(spec["level"].get<std::string>(), level))
            Refuse(path, entry, "the level is one of unknown, nominal, ordinal and scale.");
        if (spec.contains("level"))
            Check(qoraSetVarMeasureLevel(handle, varName, level),
                  "setting the measurement level of " + name);
        if (spec.contains("alignment") &&
            !ParseAlignment(spec["alignment"].get<std::string>(), alignment))
            Refuse(path, entry, "the alignment is one of left, right and center.");
        if (spec.contains("alignment"))
            Check(qoraSetVarAlignment(handle, varName, alignment),
                  "setting the alignment of " + name);
        if (spec.contains("columns"))
            Check(qoraSetVarColumnWidth(handle, varName, spec["columns"].get<int>()),
                  "setting the column width of " + name);
    } catch (const Failure& failure) {
        Refuse(path, entry, FailureText(failure));
    } catch (const Json::exception& error) {
        Refuse(path, entry,
               "a property of " + name + " has the wrong kind of value (" + error.what() + ").");
    }
}
