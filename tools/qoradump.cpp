// Prints a system file: its header facts, its dictionary and its cases as
// CSV, through the public interface of the shared library only.
//
//   qoradump [--utf8] [--dict | --cases] [--from N] [--to M] FILE
//   qoradump [--utf8] --json FILE
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

#include "casetext.h"
#include "dictionary.h"
#include "dictjson.h"
#include "formats.h"
#include "qoraio32.h"
#include "status.h"

namespace {

void Report(const char* fileName, const Failure& failure) {
    std::fprintf(stderr, "qoradump: %s: %s\n", fileName, FailureText(failure).c_str());
}

struct Options {
    bool utf8 = false;
    bool dict = true;
    bool cases = true;
    bool json = false;  // the dictionary as the JSON side file of qoraconv
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
        } else if (arg == "--json") {
            options.json = true;
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
    std::printf("    %s format: %s\n", what, FormatText({type, width, decimals}).c_str());
}

void PrintNumericMissing(int handle, const Variable& var) {
    const NumericMissing missing = NumericMissingValues(handle, var);
    const int count = missing.count;
    if (count == 0) return;
    std::printf("    missing values:");
    if (count < 0)
        std::printf(" %s thru %s", NumberText(missing.values[0]).c_str(),
                    NumberText(missing.values[1]).c_str());
    for (int i = count < 0 ? 2 : 0; i < (count < 0 ? -count : count); ++i)
        std::printf(" %s", NumberText(missing.values[i]).c_str());
    std::printf("\n");
}

void PrintStringMissing(int handle, const Variable& var) {
    const std::vector<std::string> missing = StringMissingValues(handle, var);
    if (missing.empty()) return;
    std::printf("    missing values:");
    for (const std::string& value : missing) std::printf(" \"%s\"", value.c_str());
    std::printf("\n");
}

void PrintValueLabels(int handle, const Variable& var) {
    if (var.type == 0) {
        for (const auto& [value, label] : NumericValueLabels(handle, var))
            std::printf("    value label: %s = \"%s\"\n", NumberText(value).c_str(), label.c_str());
    } else {
        for (const auto& [value, label] : StringValueLabels(handle, var))
            std::printf("    value label: \"%s\" = \"%s\"\n", value.c_str(), label.c_str());
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
    std::printf("    measurement level %s, alignment %s, column width %d\n", LevelWord(level),
                AlignmentWord(alignment), columns);
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

void PrintJson(int handle) { std::printf("%s\n", DictionaryJson(handle).dump(2).c_str()); }

}  // namespace

int main(int argc, char** argv) {
    Options options;
    if (!ParseOptions(argc, argv, options)) {
        std::fprintf(stderr,
                     "usage: qoradump [--utf8] [--dict | --cases | --json] [--from N] [--to M] "
                     "FILE\n"
                     "  --utf8    show every text in UTF-8 (else in the locale's code page)\n"
                     "  --dict    print the header facts and the dictionary only\n"
                     "  --cases   print the cases only, as CSV\n"
                     "  --from N  start at case N (cases are numbered from 1)\n"
                     "  --to M    stop after case M\n"
                     "  --json    print the dictionary as JSON only (the side file of qoraconv)\n");
        return 2;
    }
    int handle = -1;
    try {
        if (options.utf8) Check(qoraSetInterfaceEncoding(1), "choosing UTF-8");
        Check(qoraOpenRead(options.fileName, &handle), "opening the file");
        const std::vector<Variable> variables = Variables(handle);
        if (options.json) {
            PrintJson(handle);
            options.dict = options.cases = false;
        }
        if (options.dict) PrintDictionary(handle, variables);
        if (options.dict && options.cases) std::printf("\n");
        if (options.cases) PrintCases(handle, variables, options);
        Check(qoraCloseRead(handle), "closing the file");
    } catch (const Failure& failure) {
        if (handle >= 0) qoraCloseRead(handle);
        Report(options.fileName, failure);
        return 1;
    } catch (const Json::exception& error) {
        qoraCloseRead(handle);
        std::fprintf(stderr, "qoradump: %s: the dictionary cannot be written as JSON (%s).\n",
                     options.fileName, error.what());
        return 1;
    }
    return 0;
}
