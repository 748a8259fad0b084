/* Prints a system file: its variables, then each case on a line, with dates
 * as yyyy-mm-dd and system-missing values as a dot.
 *
 *   read_file FILE.qsf
 */
#include <stdio.h>
#include <string.h>

#include "qoraio32.h"

/* Print format codes of variables that hold dates. */
static int is_date(int code) {
    return code == 20 || code == 23 || code == 24 || code == 28 || code == 29 || code == 30 ||
           code == 38 || code == 39;
}

static void print_value(int handle, int index, const char* name, int type) {
    char text[32768];
    double value;
    int code, decimals, width, day, month, year;
    if (type > 0) {
        size_t length;
        qoraGetValueChar(handle, index + 1, text, (int)sizeof text);
        for (length = strlen(text); length > 0 && text[length - 1] == ' ';) text[--length] = 0;
        printf(" %s", text);
        return;
    }
    qoraGetValueNumeric(handle, index + 1, &value);
    qoraGetVarPrintFormat(handle, name, &code, &decimals, &width);
    if (value == qoraSysmisVal())
        printf(" .");
    else if (is_date(code) && qoraConvertQORADate(&day, &month, &year, value) == QORA_STATUS_OK)
        printf(" %04d-%02d-%02d", year, month, day);
    else
        printf(" %.*f", decimals, value);
}

int main(int argc, char** argv) {
    int handle, count = 0, cases = 0, i, status;
    char** names = NULL;
    int* types = NULL;

    if (argc != 2) {
        fprintf(stderr, "usage: read_file FILE.qsf\n");
        return 2;
    }
    status = qoraOpenRead(argv[1], &handle);
    if (status != QORA_STATUS_OK) {
        fprintf(stderr, "read_file: %s: status %d\n", argv[1], status);
        return 1;
    }
    qoraGetNumberofCases(handle, &cases);
    status = qoraGetVarNames(handle, &count, &names, &types);
    printf("%d variables, %d cases\n", count, cases);
    for (i = 0; i < count; ++i) printf("%s %s\n", names[i], types[i] ? "string" : "numeric");
    /* Reading stops with the warning QORA_WARN_END_OF_FILE after the last case. */
    while (status == QORA_STATUS_OK && qoraReadCaseRecord(handle) == QORA_STATUS_OK) {
        for (i = 0; i < count; ++i) print_value(handle, i, names[i], types[i]);
        printf("\n");
    }
    qoraFreeVarNames(names, types, count);
    qoraCloseRead(handle);
    return status == QORA_STATUS_OK ? 0 : 1;
}
