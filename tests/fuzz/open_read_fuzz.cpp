// Opens arbitrary bytes as a system file through the public calls, in either
// interface encoding, and reads everything the calls give: every variable's
// properties and the cases.
// Bad input may be refused with any status; it must never crash, leak or
// touch memory outside its buffers.
#include <sys/mman.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

#include "qoraio32.h"

namespace {

// The calls take a file name; an in-memory file reached through /proc keeps
// the disk out of the loop.
class MemoryFile {
  public:
    MemoryFile() : fFd(memfd_create("qora-fuzz", 0)) {
        std::snprintf(fPath, sizeof fPath, "/proc/self/fd/%d", fFd);
    }
    const char* Fill(const uint8_t* data, size_t size) {
        if (ftruncate(fFd, 0) != 0) return nullptr;
        for (size_t done = 0; done < size;) {
            const ssize_t n = pwrite(fFd, data + done, size - done, off_t(done));
            if (n <= 0) return nullptr;
            done += size_t(n);
        }
        return fPath;
    }

  private:
    int fFd;
    char fPath[64];
};

constexpr int kMaxCases = 200;

void ReadVariable(int handle, const char* name, int type) {
    std::vector<char> text(512);
    int length = 0, a = 0, b = 0, c = 0;
    qoraGetVarLabelLong(handle, name, text.data(), int(text.size()), &length);
    qoraGetVarPrintFormat(handle, name, &a, &b, &c);
    qoraGetVarWriteFormat(handle, name, &a, &b, &c);
    qoraGetVarMeasureLevel(handle, name, &a);
    qoraGetVarAlignment(handle, name, &a);
    qoraGetVarColumnWidth(handle, name, &a);
    double varHandle = 0;
    qoraGetVarHandle(handle, name, &varHandle);
    char** labels = nullptr;
    int count = 0;
    if (type == 0) {
        double v[3];
        qoraGetVarNMissingValues(handle, name, &count, &v[0], &v[1], &v[2]);
        double* values = nullptr;
        if (qoraGetVarNValueLabels(handle, name, &values, &labels, &count) == 0)
            qoraFreeVarNValueLabels(values, labels, count);
        qoraGetVarNValueLabelLong(handle, name, 1.0, text.data(), int(text.size()), &length);
    } else {
        std::vector<char> v[3];
        for (auto& one : v) one.resize(size_t(type) + 1);
        qoraGetVarCMissingValues(handle, name, &count, v[0].data(), v[1].data(), v[2].data());
        char** values = nullptr;
        if (qoraGetVarCValueLabels(handle, name, &values, &labels, &count) == 0)
            qoraFreeVarCValueLabels(values, labels, count);
        qoraGetVarCValueLabelLong(handle, name, "1", text.data(), int(text.size()), &length);
    }
}

void ReadCases(int handle, const std::vector<int>& types) {
    int caseSize = 0;
    qoraGetCaseSize(handle, &caseSize);
    std::vector<char> whole(size_t(caseSize) + 8);
    std::vector<char> text(1 << 16);
    qoraWholeCaseIn(handle, whole.data());
    for (int n = 0; n < kMaxCases && qoraReadCaseRecord(handle) == 0; ++n) {
        for (size_t i = 0; i < types.size(); ++i) {
            double value;
            if (types[i] == 0)
                qoraGetValueNumeric(handle, double(i + 1), &value);
            else
                qoraGetValueChar(handle, double(i + 1), text.data(), int(text.size()));
        }
    }
    // Back to the start, then somewhere past the end.
    if (qoraSeekNextCase(handle, 1) == 0) qoraReadCaseRecord(handle);
    if (qoraSeekNextCase(handle, 1 << 20) == 0) qoraReadCaseRecord(handle);
}

}  // namespace

// The first byte chooses the interface encoding (its low bit: UTF-8); the
// rest is the file, so every file is read raw in one mode and converted in
// the other whenever its encoding differs from the locale's.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static MemoryFile file;
    if (size == 0 || qoraSetInterfaceEncoding(data[0] & 1) != 0) return 0;
    const char* path = file.Fill(data + 1, size - 1);
    int handle = -1;
    if (!path || qoraOpenRead(path, &handle) != 0) return 0;

    int count = 0;
    qoraGetNumberofVariables(handle, &count);
    qoraGetNumberofCases(handle, &count);
    char** names = nullptr;
    int* types = nullptr;
    std::vector<int> typeList;
    if (qoraGetVarNames(handle, &count, &names, &types) == 0) {
        for (int i = 0; i < count; ++i) {
            ReadVariable(handle, names[i], types[i]);
            typeList.push_back(types[i]);
        }
        qoraFreeVarNames(names, types, count);
    }
    ReadCases(handle, typeList);
    qoraCloseRead(handle);
    return 0;
}
