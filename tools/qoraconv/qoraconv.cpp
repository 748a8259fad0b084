// Converts between CSV and system files through the public interface of the
// shared library only.
//
//   qoraconv [--compress] [--utf8] [--dict FILE.json] INPUT OUTPUT
//
// A system file as INPUT (it begins with "$FL2") becomes CSV, and --dict
// names the JSON dictionary to write beside it; any other INPUT is CSV that
// becomes a system file, and --dict names a JSON dictionary to apply.
#include <cstdio>
#include <cstring>
#include <fstream>
#include <string>

#include "conversions.h"
#include "dictjson.h"
#include "qoraio32.h"
#include "status.h"

namespace {

const char kUsage[] =
    "usage: qoraconv [--compress] [--utf8] [--dict FILE.json] INPUT OUTPUT\n"
    "  A system file as INPUT is written as CSV; any other INPUT is read as CSV\n"
    "  (its first line names the columns) and written as a system file.\n"
    "  --dict FILE  the JSON dictionary: written beside the CSV, or applied to\n"
    "               the system file being written\n"
    "  --compress   write the system file's cases compressed\n"
    "  --utf8       text in the CSV and JSON is UTF-8\n";

bool ParseOptions(int argc, char** argv, Options& options, bool& utf8) {
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        if (arg == "--compress") {
            options.compress = true;
        } else if (arg == "--utf8") {
            utf8 = true;
        } else if (arg == "--dict" && i + 1 < argc) {
            options.dict = argv[++i];
        } else if (arg[0] != '-' && options.input.empty()) {
            options.input = arg;
        } else if (arg[0] != '-' && options.output.empty()) {
            options.output = arg;
        } else {
            return false;
        }
    }
    return !options.output.empty();
}

bool IsSystemFile(const std::string& path) {
    char magic[4] = {};
    std::ifstream(path, std::ios::binary).read(magic, sizeof magic);
    return std::memcmp(magic, "$FL2", 4) == 0;
}

}  // namespace

int main(int argc, char** argv) {
    Options options;
    bool utf8 = false;
    if (!ParseOptions(argc, argv, options, utf8)) {
        std::fputs(kUsage, stderr);
        return 2;
    }
    try {
        if (utf8) Check(qoraSetInterfaceEncoding(1), "choosing UTF-8");
        if (IsSystemFile(options.input))
            FileToCsv(options);
        else
            CsvToFile(options);
    } catch (const BadInput& bad) {
        std::fprintf(stderr, "qoraconv: %s\n", bad.text.c_str());
        return 1;
    } catch (const Failure& failure) {
        std::fprintf(stderr, "qoraconv: %s: %s\n", options.input.c_str(),
                     FailureText(failure).c_str());
        return 1;
    } catch (const Json::exception& error) {
        std::fprintf(stderr, "qoraconv: %s: the dictionary cannot be written as JSON (%s).\n",
                     options.input.c_str(), error.what());
        return 1;
    }
    return 0;
}
