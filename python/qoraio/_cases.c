/* Case loops of the Python package, so that moving a file's cases costs one
 * call from Python per block of cases instead of one per case. The library's
 * own entry points come in as pointers, taken from the instance the package
 * loaded, so the handles always belong to that one library. */
#include <float.h>
#include <math.h>
#include <stdint.h>

typedef int (*WholeCaseIn)(int handle, void* caseRecord);
typedef int (*WholeCaseOut)(int handle, const void* caseRecord);

enum { kEndOfFile = -5 };
/* System-missing is the lowest double; no other bits compare equal to it. */
static const double kSysmis = -DBL_MAX;

/* Reads up to `cases` cases of `units` value units each into `buffer` and
 * turns system-missing into NaN in the numeric units, given as `runCount`
 * runs of [first, end) unit numbers. Stores the number of cases read in
 * *done; returns the first failing status, else 0. */
int qoraio_read_cases(WholeCaseIn in, int handle, double* buffer, int64_t cases, int units,
                      const int* runs, int runCount, int64_t* done) {
    *done = 0;
    for (int64_t i = 0; i < cases; ++i) {
        double* unit = buffer + i * units;
        int status = in(handle, unit);
        if (status == kEndOfFile) return 0;
        if (status != 0) return status;
        for (int r = 0; r < runCount; ++r) {
            /* Written without a branch, so that the loop vectorises. */
            for (int u = runs[2 * r]; u < runs[2 * r + 1]; ++u) {
                unit[u] = unit[u] == kSysmis ? NAN : unit[u];
            }
        }
        *done = i + 1;
    }
    return 0;
}

/* Writes `cases` cases of `units` value units each from `buffer`, after
 * turning NaN into system-missing in the numeric units (runs as above);
 * returns the first failing status, else 0. */
int qoraio_write_cases(WholeCaseOut out, int handle, double* buffer, int64_t cases, int units,
                       const int* runs, int runCount) {
    for (int64_t i = 0; i < cases; ++i) {
        double* unit = buffer + i * units;
        for (int r = 0; r < runCount; ++r) {
            for (int u = runs[2 * r]; u < runs[2 * r + 1]; ++u) {
                unit[u] = unit[u] != unit[u] ? kSysmis : unit[u];
            }
        }
        int status = out(handle, unit);
        if (status != 0) return status;
    }
    return 0;
}
