// Drives the public calls as a caller would: the input chooses a sequence of
// opens (write, append, copy), variable definitions, labels, values, case
// commits, read-backs and closes, with their arguments, valid or not. A model
// follows every call that succeeded; at the end every file that was finished
// must open and read back exactly the variables and cases committed to it.
// No call may crash or trip a sanitizer.
#include <stdlib.h>
#include <unistd.h>

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "qoraio32.h"

namespace {

constexpr int kFiles = 3;
constexpr int kMaxOps = 200;
constexpr int kMaxCases = 300;

// The fuzz input, read as a stream of choices; zeros once it runs out.
class Input {
  public:
    Input(const uint8_t* data, size_t size) : fAt(data), fEnd(data + size) {}
    bool Done() const { return fAt == fEnd; }
    uint8_t Byte() { return fAt < fEnd ? *fAt++ : 0; }
    int Below(int n) { return Byte() % n; }
    int Int() {
        uint32_t v = 0;
        for (int i = 0; i < 4; ++i) v = v << 8 | Byte();
        return int(v);
    }
    double Double() {
        uint64_t bits = 0;
        for (int i = 0; i < 8; ++i) bits = bits << 8 | Byte();
        double v;
        std::memcpy(&v, &bits, sizeof v);
        return v;
    }
    // Text of printable ASCII; the rare byte 0x7F stands for a longer run.
    std::string Text(size_t maxLength) {
        const size_t length = Byte() == 0x7F ? size_t(Byte()) * 8 : Byte() % 24;
        std::string text;
        for (size_t i = 0; i < length && i < maxLength; ++i) text += char(0x20 + Byte() % 95);
        return text;
    }
    std::string Name() {
        static const char kChars[] = "abcXYZ019_.@#$ ";
        std::string name;
        for (int n = 1 + Below(12); n > 0; --n) name += kChars[Below(sizeof kChars - 1)];
        return name;
    }

  private:
    const uint8_t* fAt;
    const uint8_t* fEnd;
};

struct Var {
    std::string name;
    int type;
};
struct Value {
    double number = 0;
    std::string text;  // a string's whole width
};
using Case = std::vector<Value>;
struct FileModel {
    std::vector<Var> vars;
    std::vector<Case> cases;
};

Case BlankCase(const std::vector<Var>& vars) {
    Case blank;
    for (const Var& var : vars)
        blank.push_back({qoraSysmisVal(), std::string(size_t(var.type), ' ')});
    return blank;
}

// A broken promise of the library: said, then a crash the fuzzer records.
[[noreturn]] void Fail(const std::string& what) {
    std::fprintf(stderr, "call_sequence_fuzz: %s\n", what.c_str());
    std::abort();
}

bool SameNumber(double a, double b) { return a == b || (std::isnan(a) && std::isnan(b)); }

// One handle the driver opened, with what the file will hold when it closes.
struct Open {
    int handle;
    int file;
    bool writing;  // a new file or a copy, not an append
    bool committed;
    FileModel model;
    std::optional<Case> pending;
};

class Driver {
  public:
    Driver(const std::string& dir, Input& in) : fDir(dir), fIn(in) {}
    ~Driver() {
        for (Open& open : fOpen) qoraCloseWrite(open.handle);
        for (int k = 0; k < kFiles; ++k) std::filesystem::remove(Path(k));
    }

    void Run() {
        for (int op = 0; op < kMaxOps && !fIn.Done(); ++op) Step();
        while (!fOpen.empty()) Close(0);
        for (int k = 0; k < kFiles; ++k)
            if (fFinished[k]) Verify(k);
    }

  private:
    std::string Path(int k) const { return fDir + "/f" + std::to_string(k) + ".qsf"; }
    bool InUse(int k) const {
        for (const Open& open : fOpen)
            if (open.file == k) return true;
        return false;
    }

    void Step() {
        const int choice = fIn.Below(14);
        if (choice <= 2) return OpenFile(choice);
        if (choice == 3) return ReadBack(fIn.Below(kFiles));
        if (choice == 4) return StrayHandle();
        if (fOpen.empty()) return;
        const size_t which = size_t(fIn.Below(int(fOpen.size())));
        Open& open = fOpen[which];
        switch (choice) {
            case 5:
                return Define(open);
            case 6:
                return Label(open);
            case 7:
                return Commit(open);
            case 8:
            case 9:
                return SetValue(open);
            case 10:
                return CommitCase(open);
            case 11:
                return WholeCase(open);
            case 12:
                qoraSetCompression(open.handle, fIn.Below(3));
                return;
            default:
                return Close(which);
        }
    }

    // 0: a new file, 1: an append, 2: a copy of a finished file's dictionary.
    void OpenFile(int how) {
        const int k = fIn.Below(kFiles);
        if (InUse(k)) return;
        Open open{-1, k, how != 1, how == 1, {}, {}};
        int status = 0;
        if (how == 0) {
            status = qoraOpenWrite(Path(k).c_str(), &open.handle);
        } else if (how == 1) {
            if (!fFinished[k]) return;
            open.model = *fFinished[k];
            status = qoraOpenAppend(Path(k).c_str(), &open.handle);
        } else {
            const int from = fIn.Below(kFiles);
            if (from == k || !fFinished[from] || InUse(from)) return;
            open.model.vars = fFinished[from]->vars;
            status = qoraOpenWriteCopy(Path(k).c_str(), Path(from).c_str(), &open.handle);
        }
        if (status != 0) return;
        if (how != 1) fFinished[k].reset();
        fOpen.push_back(open);
    }

    void Define(Open& open) {
        static const int kTypes[] = {0, 0, 1, 8, 9, 40, 255, 256, 600, -1, 32768};
        const std::string name = fIn.Name();
        const int type = kTypes[fIn.Below(sizeof kTypes / sizeof kTypes[0])];
        if (qoraSetVarName(open.handle, name.c_str(), type) == 0)
            open.model.vars.push_back({name, type});
    }

    void Label(Open& open) {
        if (open.model.vars.empty()) return;
        const Var& var = open.model.vars[size_t(fIn.Below(int(open.model.vars.size())))];
        const std::string label = fIn.Text(1000);
        switch (fIn.Below(3)) {
            case 0:
                qoraSetVarLabel(open.handle, var.name.c_str(), label.c_str());
                break;
            case 1:
                qoraSetVarNValueLabel(open.handle, var.name.c_str(), fIn.Double(), label.c_str());
                break;
            default:
                qoraSetVarCValueLabel(open.handle, var.name.c_str(), fIn.Text(300).c_str(),
                                      label.c_str());
        }
    }

    void Commit(Open& open) {
        if (qoraCommitHeader(open.handle) == 0) open.committed = true;
    }

    // A variable handle: mostly a valid one, now and then anything at all.
    double VarHandle(const Open& open, size_t& index) {
        index = size_t(fIn.Below(int(open.model.vars.size()) + 1));
        return index < open.model.vars.size() ? double(index + 1) : double(fIn.Int());
    }

    void SetValue(Open& open) {
        size_t index;
        const double varHandle = VarHandle(open, index);
        const bool numeric = fIn.Below(2) == 0;
        const double number = fIn.Double();
        const std::string text = fIn.Text(40000);
        const int status = numeric ? qoraSetValueNumeric(open.handle, varHandle, number)
                                   : qoraSetValueChar(open.handle, varHandle, text.c_str());
        if (status != 0) return;
        // A handle drawn at random may name a variable too.
        if (index == open.model.vars.size()) index = size_t(varHandle) - 1;
        if (!open.pending) open.pending = BlankCase(open.model.vars);
        Value& value = (*open.pending)[index];
        if (numeric) {
            value.number = number;
        } else {
            value.text = text;
            value.text.resize(size_t(open.model.vars[index].type), ' ');
        }
    }

    void CommitCase(Open& open) {
        const Case written = open.pending ? *open.pending : BlankCase(open.model.vars);
        if (open.model.cases.size() >= kMaxCases) return;
        if (qoraCommitCaseRecord(open.handle) != 0) return;
        open.model.cases.push_back(written);
        open.pending.reset();
    }

    // A whole case in the dictionary's layout, built from the input.
    void WholeCase(Open& open) {
        int size = 0;
        if (qoraGetCaseSize(open.handle, &size) != 0 || open.model.cases.size() >= kMaxCases)
            return;
        Case values = BlankCase(open.model.vars);
        std::string record;
        for (size_t i = 0; i < values.size(); ++i) {
            const int type = open.model.vars[i].type;
            if (type == 0) {
                values[i].number = fIn.Double();
                record.append(reinterpret_cast<const char*>(&values[i].number), 8);
            } else {
                values[i].text = fIn.Text(size_t(type));
                values[i].text.resize(size_t(type), ' ');
                record += values[i].text;
                record.resize((record.size() + 7) / 8 * 8, ' ');
            }
        }
        if (record.size() != size_t(size)) Fail("case size " + std::to_string(size));
        if (qoraWholeCaseOut(open.handle, record.data()) != 0) return;
        open.model.cases.push_back(values);
        open.pending.reset();
    }

    // Calls on a handle that is none of ours: it must neither work nor harm.
    void StrayHandle() {
        const int handle = fIn.Int();
        for (const Open& open : fOpen)
            if (open.handle == handle) return;
        double value = 0;
        qoraGetValueNumeric(handle, 1.0, &value);
        qoraSetValueNumeric(handle, 1.0, 1.0);
        qoraCommitCaseRecord(handle);
        qoraReadCaseRecord(handle);
        qoraCloseRead(handle);
    }

    void Close(size_t which) {
        const Open open = fOpen[which];
        fOpen.erase(fOpen.begin() + long(which));
        const int status = qoraCloseWrite(open.handle);
        // A file written without a committed dictionary is no file.
        if (status == 0 && open.committed)
            fFinished[open.file] = open.model;
        else if (open.writing)
            fFinished[open.file].reset();
        else if (status != 0)
            Fail("an append closed with " + std::to_string(status));
    }

    void ReadBack(int k) {
        if (fFinished[k] && !InUse(k)) Verify(k);
    }

    void Verify(int k) {
        const FileModel& model = *fFinished[k];
        int h = -1;
        if (qoraOpenRead(Path(k).c_str(), &h) != 0) Fail("a finished file does not open");
        int count = 0;
        char** names = nullptr;
        int* types = nullptr;
        if (qoraGetVarNames(h, &count, &names, &types) != 0 && !model.vars.empty())
            Fail("no names");
        if (size_t(count) != model.vars.size()) Fail("variables " + std::to_string(count));
        for (int i = 0; i < count; ++i) {
            const Var& var = model.vars[size_t(i)];
            std::string name = var.name;
            while (!name.empty() && name.back() == ' ') name.pop_back();
            while (!name.empty() && name.front() == ' ') name.erase(0, 1);
            if (name != names[i] || var.type != types[i])
                Fail("variable [" + var.name + "] read as [" + names[i] + "] " +
                     std::to_string(types[i]));
        }
        if (count > 0) qoraFreeVarNames(names, types, count);
        int cases = -2;
        qoraGetNumberofCases(h, &cases);
        if (cases != int(model.cases.size()))
            Fail("cases " + std::to_string(cases) + " of " + std::to_string(model.cases.size()));
        std::vector<char> text(40000);
        for (const Case& expected : model.cases) {
            if (qoraReadCaseRecord(h) != 0) Fail("a case is missing");
            for (size_t i = 0; i < expected.size(); ++i) {
                double number = 0;
                if (model.vars[i].type == 0) {
                    qoraGetValueNumeric(h, double(i + 1), &number);
                    if (!SameNumber(number, expected[i].number))
                        Fail("number " + std::to_string(number));
                } else {
                    qoraGetValueChar(h, double(i + 1), text.data(), int(text.size()));
                    if (expected[i].text != std::string(text.data()))
                        Fail("text [" + std::string(text.data()) + "] for [" + expected[i].text +
                             "]");
                }
            }
        }
        if (qoraReadCaseRecord(h) == 0) Fail("a case too many");
        qoraCloseRead(h);
    }

    const std::string fDir;
    Input& fIn;
    std::vector<Open> fOpen;
    std::optional<FileModel> fFinished[kFiles];
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static const std::string dir = [] {
        char name[] = "/tmp/qora-calls-XXXXXX";
        return std::string(mkdtemp(name) ? name : "/tmp");
    }();
    Input in(data, size);
    Driver(dir, in).Run();
    return 0;
}
