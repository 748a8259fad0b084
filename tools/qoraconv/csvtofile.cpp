#include <algorithm>
#include <cctype>
#include <cstdio>
#include <set>
#include <string_view>

#include "casetext.h"
#include "conversions.h"
#include "csvreader.h"
#include "dictjson.h"
#include "formats.h"
#include "output.h"
#include "qoraio32.h"
#include "status.h"

namespace {

// One CSV column: what its cells are, gathered over the whole file, then
// the variable made of it.
struct Column {
    enum Kind { kNumber, kDate, kDateTime, kString };

    std::string name;
    bool filled = false;    // some cell is not empty
    bool numbers = true;    // every filled cell is a number
    bool dates = true;      // ... a date yyyy-mm-dd
    bool dateTimes = true;  // ... a date and time yyyy-mm-dd hh:mm:ss
    size_t widest = 0;      // bytes of the widest cell
    int decimals = 0;       // most digits after a decimal point
    int type = 0;           // of the variable: 0 numeric, else the string width
    Kind kind = kNumber;    // how its cells read, after its print format
};

const size_t kLongestName = 64;

// The name key of the library is case-blind; ASCII case is the part of it
// that header rows differ in.
std::string NameKey(std::string name) {
    for (char& c : name) c = char(std::toupper(static_cast<unsigned char>(c)));
    return name;
}

// Cut to the longest name, and back to a whole character.
std::string Fit(std::string name, size_t room = kLongestName) {
    if (name.size() <= room) return name;
    name.resize(room);
    while (!name.empty() && qoraValidateVarname(name.c_str()) == 4) name.pop_back();
    return name;
}

// A valid variable name made of a header cell, or "" when none can be made.
std::string RepairedName(const std::string& cell) {
    const size_t first = cell.find_first_not_of(' ');
    if (first == std::string::npos) return "";
    std::string name = cell.substr(first, cell.find_last_not_of(' ') - first + 1);
    for (char& c : name) {
        const unsigned char byte = static_cast<unsigned char>(c);
        if (byte < 0x80 && !std::isalnum(byte) &&
            std::string_view("@#$_.").find(c) == std::string_view::npos)
            c = '_';
    }
    if (std::string_view("0123456789_.#$").find(name[0]) != std::string_view::npos)
        name = "V" + name;
    if (qoraValidateVarname(name.c_str()) == 5) name += "_";  // a reserved word
    name = Fit(name);
    return qoraValidateVarname(name.c_str()) == 0 ? name : "";
}

// The header row's names, repaired where needed (and said so) and made
// distinct.
std::vector<Column> NamedColumns(const std::vector<std::string>& header, const CsvReader& csv) {
    std::vector<Column> columns(header.size());
    std::set<std::string> keys;
    for (size_t i = 0; i < header.size(); ++i) {
        const std::string column = "column " + std::to_string(i + 1) + " (\"" + header[i] + "\")";
        std::string name = RepairedName(header[i]);
        if (name.empty()) throw BadInput{csv.Where() + column + " cannot be made a variable name."};
        for (int n = 2; keys.count(NameKey(name)); ++n) {
            const std::string suffix = "_" + std::to_string(n);
            name = Fit(RepairedName(header[i]), kLongestName - suffix.size()) + suffix;
        }
        if (name != header[i])
            std::fprintf(stderr, "qoraconv: %s%s is named %s.\n", csv.Where().c_str(),
                         column.c_str(), name.c_str());
        keys.insert(NameKey(name));
        columns[i].name = name;
    }
    return columns;
}

void CheckRowLength(const std::vector<std::string>& row, size_t count, const CsvReader& csv) {
    if (row.size() != count)
        throw BadInput{csv.Where() + "the row has " + std::to_string(row.size()) +
                       (row.size() == 1 ? " cell" : " cells") + " where the first line names " +
                       std::to_string(count) + " columns."};
}

void Observe(Column& column, const std::string& cell) {
    if (cell.empty()) return;
    column.filled = true;
    column.widest = std::max(column.widest, cell.size());
    double value;
    if (column.numbers && !ParseNumber(cell, value)) column.numbers = false;
    if (column.numbers && cell.find_first_of("eE") == std::string::npos) {
        const size_t dot = cell.find('.');
        if (dot != std::string::npos)
            column.decimals =
                std::max(column.decimals, int(std::min<size_t>(16, cell.size() - dot - 1)));
    }
    if (column.dates && !ParseDate(cell, false, value)) column.dates = false;
    if (column.dateTimes && !ParseDate(cell, true, value)) column.dateTimes = false;
}

// The first pass: the names, and what every column holds.
std::vector<Column> ReadColumns(CsvReader& csv, const std::string& path) {
    std::vector<std::string> row;
    if (!csv.NextRow(row))
        throw BadInput{path + ": the file is empty, where its first line names the columns."};
    std::vector<Column> columns = NamedColumns(row, csv);
    while (csv.NextRow(row)) {
        CheckRowLength(row, columns.size(), csv);
        for (size_t i = 0; i < row.size(); ++i) Observe(columns[i], row[i]);
    }
    return columns;
}

int InferredType(const Column& column) {
    const bool numeric = column.numbers || column.dates || column.dateTimes;
    return !column.filled || numeric ? 0 : int(column.widest);
}

Format InferredFormat(const Column& column) {
    if (column.filled && column.dates) return {20, 11, 0};      // DATE11
    if (column.filled && column.dateTimes) return {22, 20, 0};  // DATETIME20
    const int width = std::clamp(int(column.widest), std::max(8, column.decimals + 1), 40);
    return {5, width, column.decimals};
}

// The side file entry of each column, or -1; an entry that names no column
// is refused.
std::vector<int> MatchEntries(const std::vector<Column>& columns,
                              const std::vector<SideEntry>& entries, const std::string& path) {
    std::vector<int> match(columns.size(), -1);
    for (size_t e = 0; e < entries.size(); ++e) {
        const std::string name = entries[e].spec["name"].get<std::string>();
        const std::string where = path + " line " + std::to_string(entries[e].line) + ": ";
        auto column = std::find_if(columns.begin(), columns.end(), [&](const Column& c) {
            return NameKey(c.name) == NameKey(name);
        });
        if (column == columns.end())
            throw BadInput{where + "variable " + name + " is no column of the CSV file."};
        int& slot = match[size_t(column - columns.begin())];
        if (slot >= 0) throw BadInput{where + "variable " + name + " is named a second time."};
        slot = int(e);
    }
    return match;
}

Column::Kind KindOf(int handle, const Column& column) {
    if (column.type != 0) return Column::kString;
    int code = 0, decimals = 0, width = 0;
    Check(qoraGetVarPrintFormat(handle, column.name.c_str(), &code, &decimals, &width),
          "reading the print format of " + column.name);
    if (IsDateFormat(code)) return Column::kDate;
    return IsDateTimeFormat(code) ? Column::kDateTime : Column::kNumber;
}

void DefineVariables(int handle, std::vector<Column>& columns,
                     const std::vector<SideEntry>& entries, const std::string& path) {
    const std::vector<int> match = MatchEntries(columns, entries, path);
    for (size_t i = 0; i < columns.size(); ++i) {
        Column& column = columns[i];
        const char* name = column.name.c_str();
        const SideEntry* entry = match[i] >= 0 ? &entries[size_t(match[i])] : nullptr;
        column.type = entry ? SideType(path, *entry, InferredType(column)) : InferredType(column);
        Check(qoraSetVarName(handle, name, column.type), "defining variable " + column.name);
        if (column.type == 0) {
            const Format format = InferredFormat(column);
            const std::string doing = "setting the format of " + column.name;
            Check(qoraSetVarPrintFormat(handle, name, format.code, format.decimals, format.width),
                  doing);
            Check(qoraSetVarWriteFormat(handle, name, format.code, format.decimals, format.width),
                  doing);
        }
        if (entry) ApplySideEntry(handle, column.name, column.type, path, *entry);
        column.kind = KindOf(handle, column);
    }
}

bool ReadCell(Column::Kind kind, const std::string& cell, double& value) {
    if (kind == Column::kDate && ParseDate(cell, false, value)) return true;
    if (kind == Column::kDateTime && ParseDate(cell, true, value)) return true;
    return ParseNumber(cell, value);
}

const char* KindWords(Column::Kind kind) {
    if (kind == Column::kDate) return "a date (yyyy-mm-dd) or a number";
    if (kind == Column::kDateTime) return "a date and time (yyyy-mm-dd hh:mm:ss) or a number";
    return "a number";
}

// Empty cells keep the blank case's system-missing value or blanks.
void SetValue(int handle, size_t index, const Column& column, const std::string& cell,
              const CsvReader& csv) {
    const double varHandle = double(index + 1);
    int status = QORA_STATUS_OK;
    if (column.type != 0) {
        if (cell.size() > size_t(column.type))
            throw BadInput{csv.Where() + "the cell of " + column.name + " has " +
                           std::to_string(cell.size()) + " bytes, more than its width of " +
                           std::to_string(column.type) + "."};
        status = qoraSetValueChar(handle, varHandle, cell.c_str());
    } else {
        double value = 0;
        if (!ReadCell(column.kind, cell, value))
            throw BadInput{csv.Where() + "\"" + cell.substr(0, 40) +
                           (cell.size() > 40 ? "...\"" : "\"") + " in column " + column.name +
                           " is not " + KindWords(column.kind) + "."};
        status = qoraSetValueNumeric(handle, varHandle, value);
    }
    if (status > 0) Check(status, "setting the value of " + column.name);
}

// The second pass: every row a case.
void WriteCases(int handle, CsvReader& csv, const std::vector<Column>& columns) {
    std::vector<std::string> row;
    csv.Rewind();
    csv.NextRow(row);
    Progress progress;
    while (csv.NextRow(row)) {
        CheckRowLength(row, columns.size(), csv);
        for (size_t i = 0; i < row.size(); ++i) {
            if (!row[i].empty()) SetValue(handle, i, columns[i], row[i], csv);
        }
        if (const int status = qoraCommitCaseRecord(handle); status > 0)
            Check(status, "writing the case of line " + std::to_string(csv.RowLine()));
        progress.CaseDone();
    }
}

struct WriteHandle {
    int handle = -1;
    ~WriteHandle() {
        if (handle >= 0) qoraCloseWrite(handle);
    }
};

}  // namespace

void CsvToFile(const Options& options) {
    const std::vector<SideEntry> entries =
        options.dict.empty() ? std::vector<SideEntry>() : ReadSideFile(options.dict);
    CsvReader csv(options.input);
    std::vector<Column> columns = ReadColumns(csv, options.input);

    PendingOutput pending(options.output);
    {
        WriteHandle file;
        Check(qoraOpenWrite(pending.Temp().c_str(), &file.handle),
              "opening " + options.output + " for writing");
        if (options.compress) Check(qoraSetCompression(file.handle, 1), "asking for compression");
        DefineVariables(file.handle, columns, entries, options.dict);
        Check(qoraCommitHeader(file.handle), "writing the dictionary");
        WriteCases(file.handle, csv, columns);
        const int handle = std::exchange(file.handle, -1);
        Check(qoraCloseWrite(handle), "finishing " + options.output);
    }
    pending.Commit();
}
