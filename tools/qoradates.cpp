// Converts a few dates and times to their stored values and back, through
// the public interface of the shared library.
#include <cstdio>

#include "qoraio32.h"

namespace {

void ShowDate(int day, int month, int year) {
    double value;
    int status = qoraConvertDate(day, month, year, &value);
    if (status != QORA_STATUS_OK) {
        std::printf("%04d-%02d-%02d  refused (status %d)\n", year, month, day, status);
        return;
    }
    int d, m, y;
    status = qoraConvertQORADate(&d, &m, &y, value);
    std::printf("%04d-%02d-%02d  -> %.0f s -> %04d-%02d-%02d (status %d)\n", year, month, day,
                value, y, m, d, status);
}

void ShowTime(int day, int hour, int minute, double second) {
    double value;
    int status = qoraConvertTime(day, hour, minute, second, &value);
    if (status != QORA_STATUS_OK) {
        std::printf("%dd %02d:%02d:%06.3f  refused (status %d)\n", day, hour, minute, second,
                    status);
        return;
    }
    int d, h, m;
    double s;
    status = qoraConvertQORATime(&d, &h, &m, &s, value);
    std::printf("%dd %02d:%02d:%06.3f  -> %.3f s -> %dd %02d:%02d:%06.3f (status %d)\n", day, hour,
                minute, second, value, d, h, m, s, status);
}

}  // namespace

int main() {
    std::puts("Dates (seconds since 14 October 1582):");
    ShowDate(14, 10, 1582);
    ShowDate(1, 1, 1970);
    ShowDate(29, 2, 2000);
    ShowDate(31, 12, 9999);
    ShowDate(29, 2, 1900);
    ShowDate(13, 10, 1582);
    std::puts("Times (seconds):");
    ShowTime(0, 23, 59, 59.0);
    ShowTime(1, 2, 3, 4.5);
    ShowTime(0, 0, 0, 60.0);
    return 0;
}
