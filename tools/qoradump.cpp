// Prints a system file: its header facts, its dictionary and its cases as
// CSV, through the public interface of the shared library only.
//
//   qoradump [--utf8] [--dict | --cases] [--from N] [--to M] FILE
//
// With --utf8 every text comes in UTF-8, whatever the file's encoding;
// otherwise in the code page of the locale. Cases are numbered from 1; --from and --to bound the
// cases printed, both included. System-missing values print as empty fields; string values lose
// their trailing blanks.
#include <algorithm>
#include <charconv>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "qoraio32.h"

namespace {

struct StatusText {
    int code;
    const char* name;
    const char* sentence;
};

const StatusText kStatusTexts[] = {
    {QORA_STATUS_CANNOT_OPEN, "QORA_STATUS_CANNOT_OPEN", "The file cannot be opened."},
    {QORA_STATUS_WRITE_FAILED, "QORA_STATUS_WRITE_FAILED", "Writing to the file failed."},
    {QORA_STATUS_READ_FAILED, "QORA_STATUS_READ_FAILED", "Reading from the file failed."},
    {QORA_STATUS_TOO_MANY_FILES, "QORA_STATUS_TOO_MANY_FILES", "Too many files are open."},
    {QORA_STATUS_BAD_FILE_HANDLE, "QORA_STATUS_BAD_FILE_HANDLE",
     "The file handle is not valid, or the call failed inside the library."},
    {QORA_STATUS_BAD_FILE, "QORA_STATUS_BAD_FILE",
     "The file is missing, unreadable or not a valid system file."},
    {QORA_STATUS_NO_MEMORY, "QORA_STATUS_NO_MEMORY", "There is not enough memory."},
    {QORA_STATUS_OPENED_FOR_READING, "QORA_STATUS_OPENED_FOR_READING",
     "The file is open for reading only."},
    {QORA_STATUS_NOT_OPENED_FOR_READING, "QORA_STATUS_NOT_OPENED_FOR_READING",
     "The file is not open for reading."},
    {QORA_STATUS_BAD_VAR_NAME, "QORA_STATUS_BAD_VAR_NAME", "The variable name is not valid."},
    {QORA_STATUS_NO_VARIABLES, "QORA_STATUS_NO_VARIABLES", "The dictionary has no variables."},
    {QORA_STATUS_VAR_NOT_FOUND, "QORA_STATUS_VAR_NOT_FOUND", "The variable does not exist."},
    {QORA_STATUS_DUPLICATE_VAR, "QORA_STATUS_DUPLICATE_VAR", "The variable already exists."},
    {QORA_STATUS_NUMERIC_REQUIRED, "QORA_STATUS_NUMERIC_REQUIRED", "The variable is not numeric."},
    {QORA_STATUS_STRING_REQUIRED, "QORA_STATUS_STRING_REQUIRED", "The variable is not a string."},
    {QORA_STATUS_SHORT_STRING_REQUIRED, "QORA_STATUS_SHORT_STRING_REQUIRED",
     "The string variable is wider than 8 bytes."},
    {QORA_STATUS_BAD_VAR_TYPE, "QORA_STATUS_BAD_VAR_TYPE", "The variable type is not valid."},
    {QORA_STATUS_BAD_MISSING_SPEC, "QORA_STATUS_BAD_MISSING_SPEC",
     "The missing values are not valid."},
    {QORA_STATUS_BAD_PRINT_FORMAT, "QORA_STATUS_BAD_PRINT_FORMAT",
     "The print format is not valid."},
    {QORA_STATUS_BAD_WRITE_FORMAT, "QORA_STATUS_BAD_WRITE_FORMAT",
     "The write format is not valid."},
    {QORA_STATUS_BAD_DATE, "QORA_STATUS_BAD_DATE", "The date is not valid."},
    {QORA_STATUS_BAD_TIME, "QORA_STATUS_BAD_TIME", "The time is not valid."},
    {QORA_STATUS_WIDTH_MISMATCH, "QORA_STATUS_WIDTH_MISMATCH",
     "The string variables differ in width."},
    {QORA_STATUS_NO_SYSTEM_FILE, "QORA_STATUS_NO_SYSTEM_FILE",
     "The handle gives no view of a system file."},
    {QORA_STATUS_DICT_COMMITTED, "QORA_STATUS_DICT_COMMITTED",
     "The dictionary has already been committed."},
    {QORA_STATUS_DICT_NOT_COMMITTED, "QORA_STATUS_DICT_NOT_COMMITTED",
     "The dictionary has not been committed yet."},
    {QORA_STATUS_NO_RELEASE_INFO, "QORA_STATUS_NO_RELEASE_INFO",
     "The file carries no release information."},
    {QORA_STATUS_BAD_DATE_INFO, "QORA_STATUS_BAD_DATE_INFO",
     "The date variable information is not valid."},
    {QORA_STATUS_STRING_TOO_LONG, "QORA_STATUS_STRING_TOO_LONG",
     "The string is longer than the variable."},
    {QORA_STATUS_CANNOT_FREE, "QORA_STATUS_CANNOT_FREE", "The memory could not be released."},
    {QORA_STATUS_BUFFER_TOO_SHORT, "QORA_STATUS_BUFFER_TOO_SHORT", "The buffer is too short."},
    {QORA_STATUS_NO_CURRENT_CASE, "QORA_STATUS_NO_CURRENT_CASE", "No case is loaded."},
    {QORA_STATUS_CANNOT_APPEND, "QORA_STATUS_CANNOT_APPEND", "Cases cannot be added to the file."},
    {QORA_STATUS_BAD_EXTENSION, "QORA_STATUS_BAD_EXTENSION",
     "The extension record may not be used."},
    {QORA_STATUS_BAD_VAR_HANDLE, "QORA_STATUS_BAD_VAR_HANDLE", "The variable handle is not valid."},
    {QORA_STATUS_BAD_ENCODING, "QORA_STATUS_BAD_ENCODING", "The encoding is not valid."},
    {QORA_STATUS_FILES_OPEN, "QORA_STATUS_FILES_OPEN",
     "The encoding cannot change while files are open."},
    {QORA_STATUS_BAD_MRSET_DEF, "QORA_STATUS_BAD_MRSET_DEF",
     "The multiple response set is not valid."},
    {QORA_STATUS_BAD_MRSET_NAME, "QORA_STATUS_BAD_MRSET_NAME",
     "The multiple response set name is not valid."},
    {QORA_STATUS_DUPLICATE_MRSET, "QORA_STATUS_DUPLICATE_MRSET",
     "The multiple response set already exists."},
    {QORA_STATUS_BAD_SUBTYPE, "QORA_STATUS_BAD_SUBTYPE",
     "The extension record subtype is not valid."},
    {QORA_STATUS_BAD_ATTR_NAME, "QORA_STATUS_BAD_ATTR_NAME", "The attribute name is not valid."},
    {QORA_STATUS_BAD_ATTR_DEF, "QORA_STATUS_BAD_ATTR_DEF", "The attribute is not valid."},
    {QORA_STATUS_BAD_MRSET_INDEX, "QORA_STATUS_BAD_MRSET_INDEX",
     "The multiple response set index is out of range."},
};

// A failed call: the status, and what was being done.
struct Failure {
    int status;
    std::string doing;
};

int Check(int status, const std::string& doing) {
    if (status > 0) throw Failure{status, doing};
    return status;
}

void Report(const char* fileName, const Failure& failure) {
    const char* name = "unknown status";
    const char* sentence = "The library reported an error.";
    for (const StatusText& text : kStatusTexts) {
        if (text.code == failure.status) {
            name = text.name;
            sentence = text.sentence;
        }
    }
    std::fprintf(stderr, "qoradump: %s: %s (%d) while %s. %s\n", fileName, name, failure.status,
                 failure.doing.c_str(), sentence);
}

struct Options {
    bool utf8 = false;
    bool dict = true;
    bool cases = true;
    long from = 1;
    long to = -1;  // no limit
    const char* fileName = nullptr;
};

bool ParseCount(const char* text, long& out) {
    const char* end = text + std::strlen(text);
    auto [last, error] = std::from_chars(text, end, out);
    return error == std::errc() && last == end && out >= 1;
}

bool ParseOptions(int argc, char** argv, Options& options) {
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        const bool hasValue = i + 1 < argc;
        if (arg == "--utf8") {
            options.utf8 = true;
        } else if (arg == "--dict") {
            options.cases = false;
        } else if (arg == "--cases") {
            options.dict = false;
        } else if (arg == "--from" && hasValue) {
            if (!ParseCount(argv[++i], options.from)) return false;
        } else if (arg == "--to" && hasValue) {
            if (!ParseCount(argv[++i], options.to)) return false;
        } else if (arg[0] != '-' && !options.fileName) {
            options.fileName = argv[i];
        } else {
            return false;
        }
    }
    return options.fileName && (options.dict || options.cases);
}

struct Variable {
    std::string name;
    int type;         // 0 numeric, else the string width
    int printFormat;  // format type code
};

// Print format codes of numbers that hold a date, or a date and a time.
bool IsDateFormat(int code) {
    return code == 20 || code == 23 || code == 24 || code == 28 || code == 29 || code == 30 ||
           code == 38 || code == 39;
}
bool IsDateTimeFormat(int code) { return code == 22; }

// The shortest text that reads back as the same double.
std::string NumberText(double value) {
    char text[32];
    auto result = std::to_chars(text, text + sizeof text, value);
    return std::string(text, result.ptr);
}

// A date value as yyyy-mm-dd (with hh:mm:ss when asked); a number that is no
// date is shown as a number.
std::string DateText(double value, bool withTime) {
    int day = 0, month = 0, year = 0, days = 0, hour = 0, minute = 0;
    double second = 0;
    if (qoraConvertQORADate(&day, &month, &year, value) != QORA_STATUS_OK ||
        qoraConvertQORATime(&days, &hour, &minute, &second, value) != QORA_STATUS_OK)
        return NumberText(value);
    char text[64];
    if (withTime)
        std::snprintf(text, sizeof text, "%04d-%02d-%02d %02d:%02d:%02d", year, month, day, hour,
                      minute, int(second));
    else
        std::snprintf(text, sizeof text, "%04d-%02d-%02d", year, month, day);
    return text;
}

std::string TrimBlanks(std::string text) {
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

std::string CsvField(const std::string& text) {
    if (text.find_first_of(",\"\r\n") == std::string::npos) return text;
    std::string quoted = "\"";
    for (char c : text) {
        if (c == '"') quoted += '"';
        quoted += c;
    }
    return quoted + '"';
}

std::vector<Variable> Variables(int handle) {
    int count = 0;
    char** names = nullptr;
    int* types = nullptr;
    std::vector<Variable> variables;
    // The name list refuses a file without variables, which is still a file.
    if (Check(qoraGetNumberofVariables(handle, &count), "counting the variables") != 0 ||
        count == 0)
        return variables;
    if (Check(qoraGetVarNames(handle, &count, &names, &types), "listing the variables") != 0)
        return variables;
    for (int i = 0; i < count; ++i) {
        int code = 0, decimals = 0, width = 0;
        qoraGetVarPrintFormat(handle, names[i], &code, &decimals, &width);
        variables.push_back({names[i], types[i], code});
    }
    qoraFreeVarNames(names, types, count);
    return variables;
}

// Attribute lines of the file (varName null) or of a variable.
void PrintAttributes(int handle, const char* varName, const char* indent) {
    char** names = nullptr;
    char** texts = nullptr;
    int count = 0;
    const int status = varName ? qoraGetVarAttributes(handle, varName, &names, &texts, &count)
                               : qoraGetFileAttributes(handle, &names, &texts, &count);
    if (Check(status, "reading the attributes") != 0) return;
    for (int i = 0; i < count; ++i)
        std::printf("%sattribute: %s = \"%s\"\n", indent, names[i], texts[i]);
    qoraFreeAttributes(names, texts, count);
}

void PrintHeader(int handle, const std::vector<Variable>& variables) {
    int cases = 0, caseSize = 0;
    Check(qoraGetNumberofCases(handle, &cases), "counting the cases");
    Check(qoraGetCaseSize(handle, &caseSize), "asking for the case size");
    std::printf("Variables: %zu\n", variables.size());
    if (cases < 0)
        std::printf("Cases: unknown\n");
    else
        std::printf("Cases: %d\n", cases);
    std::printf("Case size: %d bytes\n", caseSize);
    char encoding[65];
    int codePage = 0;
    Check(qoraGetFileEncoding(handle, encoding), "asking for the encoding");
    std::printf("Encoding: %s\n", encoding);
    if (qoraGetFileCodePage(handle, &codePage) == QORA_STATUS_OK)
        std::printf("Code page: %d\n", codePage);
    else
        std::printf("Code page: none\n");
    PrintAttributes(handle, nullptr, "");
}

// The getter for the print or the write format, and the format it reports.
using FormatGetter = int (*)(int, const char*, int*, int*, int*);

void PrintFormat(int handle, const Variable& var, const char* what, FormatGetter get) {
    int type = 0, decimals = 0, width = 0;
    Check(get(handle, var.name.c_str(), &type, &decimals, &width),
          std::string("reading the ") + what + " format of " + var.name);
    std::printf("    %s format: code %d, width %d, %d decimals\n", what, type, width, decimals);
}

void PrintNumericMissing(int handle, const Variable& var) {
    int count = 0;
    double values[3];
    Check(qoraGetVarNMissingValues(handle, var.name.c_str(), &count, &values[0], &values[1],
                                   &values[2]),
          "reading the missing values of " + var.name);
    if (count == 0) return;
    std::printf("    missing values:");
    if (count < 0)
        std::printf(" %s thru %s", NumberText(values[0]).c_str(), NumberText(values[1]).c_str());
    for (int i = count < 0 ? 2 : 0; i < (count < 0 ? -count : count); ++i)
        std::printf(" %s", NumberText(values[i]).c_str());
    std::printf("\n");
}

void PrintStringMissing(int handle, const Variable& var) {
    // The library reports missing values of short strings only.
    std::vector<char> values[3];
    for (auto& value : values) value.assign(size_t(var.type) + 1, '\0');
    int count = 0;
    const int status = qoraGetVarCMissingValues(handle, var.name.c_str(), &count, values[0].data(),
                                                values[1].data(), values[2].data());
    if (status == QORA_STATUS_SHORT_STRING_REQUIRED) return;
    Check(status, "reading the missing values of " + var.name);
    if (count == 0) return;
    std::printf("    missing values:");
    for (int i = 0; i < count && i < 3; ++i)
        std::printf(" \"%s\"", TrimBlanks(values[i].data()).c_str());
    std::printf("\n");
}

void PrintValueLabels(int handle, const Variable& var) {
    const std::string doing = "reading the value labels of " + var.name;
    char** labels = nullptr;
    int count = 0;
    if (var.type == 0) {
        double* values = nullptr;
        if (Check(qoraGetVarNValueLabels(handle, var.name.c_str(), &values, &labels, &count),
                  doing) != 0)
            return;
        for (int i = 0; i < count; ++i)
            std::printf("    value label: %s = \"%s\"\n", NumberText(values[i]).c_str(), labels[i]);
        qoraFreeVarNValueLabels(values, labels, count);
    } else {
        char** values = nullptr;
        if (Check(qoraGetVarCValueLabels(handle, var.name.c_str(), &values, &labels, &count),
                  doing) != 0)
            return;
        for (int i = 0; i < count; ++i)
            std::printf("    value label: \"%s\" = \"%s\"\n", TrimBlanks(values[i]).c_str(),
                        labels[i]);
        qoraFreeVarCValueLabels(values, labels, count);
    }
}

void PrintVariable(int handle, int index, const Variable& var) {
    const char* name = var.name.c_str();
    if (var.type == 0)
        std::printf("%d. %s (numeric)\n", index + 1, name);
    else
        std::printf("%d. %s (string, %d bytes)\n", index + 1, name, var.type);

    std::vector<char> label(4096);
    if (Check(qoraGetVarLabelLong(handle, name, label.data(), int(label.size()), nullptr),
              "reading the label of " + var.name) == 0)
        std::printf("    label: %s\n", label.data());

    PrintFormat(handle, var, "print", qoraGetVarPrintFormat);
    PrintFormat(handle, var, "write", qoraGetVarWriteFormat);

    if (var.type == 0)
        PrintNumericMissing(handle, var);
    else
        PrintStringMissing(handle, var);
    PrintValueLabels(handle, var);

    int level = 0, alignment = 0, columns = 0;
    Check(qoraGetVarMeasureLevel(handle, name, &level),
          "reading the measurement level of " + var.name);
    Check(qoraGetVarAlignment(handle, name, &alignment), "reading the alignment of " + var.name);
    Check(qoraGetVarColumnWidth(handle, name, &columns), "reading the column width of " + var.name);
    std::printf("    measurement level %d, alignment %d, column width %d\n", level, alignment,
                columns);
    PrintAttributes(handle, name, "    ");
}

void PrintMultipleResponseSets(int handle) {
    int count = 0;
    Check(qoraGetMultRespCount(handle, &count), "counting the multiple response sets");
    for (int i = 0; i < count; ++i) {
        qoraMultRespDef* def = nullptr;
        Check(qoraGetMultRespDefByIndex(handle, i, &def), "reading a multiple response set");
        std::printf("Multiple response set %s", def->name);
        if (def->isDichotomy)
            std::printf(" (dichotomy, counted value \"%s\")", def->countedValue);
        else
            std::printf(" (categories)");
        if (def->label[0] != '\0') std::printf(", label \"%s\"", def->label);
        std::printf(":");
        for (int k = 0; k < def->numVars; ++k) std::printf(" %s", def->varNames[k]);
        std::printf("\n");
        qoraFreeMultRespDefStruct(def);
    }
}

// One line per set, as the file keeps them.
void PrintVariableSets(int handle) {
    char* text = nullptr;
    if (Check(qoraGetVariableSets(handle, &text), "reading the variable sets") != 0) return;
    for (const char* line = text; *line != '\0';) {
        const char* end = std::strchr(line, '\n');
        const size_t length = end ? size_t(end - line) : std::strlen(line);
        std::printf("Variable set: %.*s\n", int(length), line);
        line += length + (end ? 1 : 0);
    }
    qoraFreeVariableSets(text);
}

void PrintDateVariables(int handle) {
    int count = 0;
    int* elements = nullptr;
    if (Check(qoraGetDateVariables(handle, &count, &elements), "reading the date variables") != 0)
        return;
    std::printf("Date variables: %d, numbers %d %d %d %d\n", elements[2], elements[0], elements[1],
                elements[3], elements[4]);
    for (int i = 6; i + 2 < count; i += 3)
        std::printf("    value position %d, type %d, value %d\n", elements[i], elements[i + 1],
                    elements[i + 2]);
    qoraFreeDateVariables(elements);
}

// The stored records of the subtypes the library leaves to callers.
void PrintExtensionRecords(int handle) {
    for (int subtype = 0; subtype <= 40; ++subtype) {
        int size = 0, count = 0;
        if (qoraGetExtensionDataDesc(handle, subtype, &size, &count) != 0 || count == 0) continue;
        std::printf("Extension record %d: %d elements of %d bytes\n", subtype, count, size);
    }
}

void PrintExtras(int handle) {
    PrintMultipleResponseSets(handle);
    PrintVariableSets(handle);
    PrintDateVariables(handle);
    PrintExtensionRecords(handle);
}

void PrintDictionary(int handle, const std::vector<Variable>& variables) {
    PrintHeader(handle, variables);
    PrintExtras(handle);
    std::printf("\n");
    for (size_t i = 0; i < variables.size(); ++i) PrintVariable(handle, int(i), variables[i]);
}

std::string ValueText(int handle, int index, const Variable& var, std::vector<char>& buffer) {
    const double varHandle = index + 1;
    const std::string doing = "reading the value of " + var.name;
    if (var.type == 0) {
        double value = 0;
        Check(qoraGetValueNumeric(handle, varHandle, &value), doing);
        if (value == qoraSysmisVal()) return std::string();
        if (IsDateFormat(var.printFormat)) return DateText(value, false);
        if (IsDateTimeFormat(var.printFormat)) return DateText(value, true);
        return NumberText(value);
    }
    Check(qoraGetValueChar(handle, varHandle, buffer.data(), int(buffer.size())), doing);
    return CsvField(TrimBlanks(buffer.data()));
}

void PrintCases(int handle, const std::vector<Variable>& variables, const Options& options) {
    size_t widest = 0;
    for (size_t i = 0; i < variables.size(); ++i) {
        std::printf("%s%s", i ? "," : "", CsvField(variables[i].name).c_str());
        widest = std::max(widest, size_t(variables[i].type));
    }
    std::printf("\n");
    if (options.from > 1)
        Check(qoraSeekNextCase(handle, int(options.from - 1)), "seeking the first case");
    std::vector<char> buffer(widest + 1);
    for (long number = options.from; options.to < 0 || number <= options.to; ++number) {
        if (Check(qoraReadCaseRecord(handle), "reading case " + std::to_string(number)) ==
            QORA_WARN_END_OF_FILE)
            break;
        for (size_t i = 0; i < variables.size(); ++i)
            std::printf("%s%s", i ? "," : "",
                        ValueText(handle, int(i), variables[i], buffer).c_str());
        std::printf("\n");
    }
}

}  // namespace

int main(int argc, char** argv) {
    Options options;
    if (!ParseOptions(argc, argv, options)) {
        std::fprintf(stderr,
                     "usage: qoradump [--utf8] [--dict | --cases] [--from N] [--to M] FILE\n"
                     "  --utf8    show every text in UTF-8 (else in the locale's code page)\n"
                     "  --dict    print the header facts and the dictionary only\n"
                     "  --cases   print the cases only, as CSV\n"
                     "  --from N  start at case N (cases are numbered from 1)\n"
                     "  --to M    stop after case M\n");
        return 2;
    }
    int handle = -1;
    try {
        if (options.utf8) Check(qoraSetInterfaceEncoding(1), "choosing UTF-8");
        Check(qoraOpenRead(options.fileName, &handle), "opening the file");
        const std::vector<Variable> variables = Variables(handle);
        if (options.dict) PrintDictionary(handle, variables);
        if (options.dict && options.cases) std::printf("\n");
        if (options.cases) PrintCases(handle, variables, options);
        Check(qoraCloseRead(handle), "closing the file");
    } catch (const Failure& failure) {
        if (handle >= 0) qoraCloseRead(handle);
        Report(options.fileName, failure);
        return 1;
    }
    return 0;
}
