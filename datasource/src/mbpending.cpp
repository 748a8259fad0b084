// Placeholder for the multibyte module until it is merged: UTF-8 mode with
// identity conversion. Weak, so the module's own definitions win; delete
// this file once they are linked in.
#include <algorithm>
#include <cstring>

#include "qoramb.h"

namespace {
int gUtf8Mode = 1;
}

__attribute__((weak)) int mbIsUtf8Mode() { return gUtf8Mode; }
__attribute__((weak)) void mbSetUtf8Mode(int flag) { gUtf8Mode = flag; }
__attribute__((weak)) unsigned mbGeneration() { return 0; }
__attribute__((weak)) int mbCodePageToUtf8(UConverter*, char* dst, int dstSize, const char* src,
                                           int srcLen, int* error) {
    const int n = std::min(dstSize, srcLen);
    std::memcpy(dst, src, n);
    *error = 0;
    return n;
}
__attribute__((weak)) int mbUtf8ToCodePage(UConverter* cnv, char* dst, int dstSize, const char* src,
                                           int srcLen, int* error) {
    return mbCodePageToUtf8(cnv, dst, dstSize, src, srcLen, error);
}
