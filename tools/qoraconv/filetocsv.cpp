#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>
#include <optional>

#include "casetext.h"
#include "conversions.h"
#include "dictjson.h"
#include "output.h"
#include "qoraio32.h"
#include "status.h"

namespace {

struct FileCloser {
    void operator()(std::FILE* file) const { std::fclose(file); }
};
using OutputFile = std::unique_ptr<std::FILE, FileCloser>;

OutputFile OpenOutput(const PendingOutput& pending, const std::string& path) {
    OutputFile file(std::fopen(pending.Temp().c_str(), "wb"));
    if (!file)
        throw BadInput{path + ": the file cannot be written (" + std::strerror(errno) + ")."};
    std::setvbuf(file.get(), nullptr, _IOFBF, 1 << 20);
    return file;
}

void Close(OutputFile file, const std::string& path) {
    if (std::ferror(file.get()) || std::fclose(file.release()) != 0)
        throw BadInput{path + ": writing failed (" + std::strerror(errno) + ")."};
}

struct ReadHandle {
    int handle = -1;
    ~ReadHandle() {
        if (handle >= 0) qoraCloseRead(handle);
    }
};

void WriteCases(int handle, const std::vector<Variable>& variables, std::FILE* out) {
    size_t widest = 0;
    std::string line;
    for (size_t i = 0; i < variables.size(); ++i) {
        line += (i ? "," : "") + CsvField(variables[i].name);
        widest = std::max(widest, size_t(variables[i].type));
    }
    std::fprintf(out, "%s\n", line.c_str());
    std::vector<char> buffer(widest + 1);
    Progress progress;
    for (long number = 1;; ++number) {
        if (Check(qoraReadCaseRecord(handle), "reading case " + std::to_string(number)) ==
            QORA_WARN_END_OF_FILE)
            break;
        line.clear();
        for (size_t i = 0; i < variables.size(); ++i) {
            if (i) line += ',';
            line += ValueText(handle, int(i), variables[i], buffer);
        }
        line += '\n';
        std::fwrite(line.data(), 1, line.size(), out);
        progress.CaseDone();
    }
}

}  // namespace

void FileToCsv(const Options& options) {
    ReadHandle file;
    Check(qoraOpenRead(options.input.c_str(), &file.handle), "opening " + options.input);
    const std::vector<Variable> variables = Variables(file.handle);

    PendingOutput csv(options.output);
    OutputFile out = OpenOutput(csv, options.output);
    WriteCases(file.handle, variables, out.get());

    Close(std::move(out), options.output);

    // Both files are complete before either is put in place.
    std::optional<PendingOutput> side;
    if (!options.dict.empty()) {
        side.emplace(options.dict);
        OutputFile sideOut = OpenOutput(*side, options.dict);
        std::fprintf(sideOut.get(), "%s\n", DictionaryJson(file.handle).dump(2).c_str());
        Close(std::move(sideOut), options.dict);
    }
    csv.Commit();
    if (side) side->Commit();
}
