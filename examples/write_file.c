/* Writes a small system file: a numeric id, a string name and a date, with
 * a label and value labels, and three cases.
 *
 *   write_file OUT.qsf
 */
#include <stdio.h>

#include "qoraio32.h"

static int failed(int status, const char* doing) {
    if (status > 0) fprintf(stderr, "write_file: status %d while %s\n", status, doing);
    return status > 0;
}

int main(int argc, char** argv) {
    static const struct {
        const char* name;
        int year, month, day;
    } people[] = {{"Ada", 1815, 12, 10}, {"Alan", 1912, 6, 23}, {"Grace", 1906, 12, 9}};
    int handle, i, ok;
    double id, name, born, date;

    if (argc != 2) {
        fprintf(stderr, "usage: write_file OUT.qsf\n");
        return 2;
    }
    if (failed(qoraOpenWrite(argv[1], &handle), "opening the file")) return 1;
    /* The dictionary first: names and types (0 numeric, else the string width), then the rest. */
    ok = !failed(qoraSetVarName(handle, "Id", 0), "defining Id") &&
         !failed(qoraSetVarName(handle, "Name", 10), "defining Name") &&
         !failed(qoraSetVarName(handle, "Born", 0), "defining Born") &&
         !failed(qoraSetVarPrintFormat(handle, "Id", 5, 0, 4), "formatting Id") &&
         !failed(qoraSetVarPrintFormat(handle, "Born", 20, 0, 11), "formatting Born") &&
         !failed(qoraSetVarLabel(handle, "Born", "Date of birth"), "labelling Born") &&
         !failed(qoraSetVarNValueLabel(handle, "Id", 1, "first"), "labelling a value of Id") &&
         !failed(qoraSetCompression(handle, 1), "asking for compression") &&
         !failed(qoraCommitHeader(handle), "writing the dictionary");
    /* Then the cases, one value at a time. */
    ok = ok && !failed(qoraGetVarHandle(handle, "Id", &id), "finding Id") &&
         !failed(qoraGetVarHandle(handle, "Name", &name), "finding Name") &&
         !failed(qoraGetVarHandle(handle, "Born", &born), "finding Born");
    for (i = 0; ok && i < 3; ++i) {
        ok = !failed(qoraConvertDate(people[i].day, people[i].month, people[i].year, &date),
                     "converting a date") &&
             !failed(qoraSetValueNumeric(handle, id, i + 1), "setting Id") &&
             !failed(qoraSetValueChar(handle, name, people[i].name), "setting Name") &&
             !failed(qoraSetValueNumeric(handle, born, date), "setting Born") &&
             !failed(qoraCommitCaseRecord(handle), "writing a case");
    }
    /* Closing finishes the file: its case count goes into the header. */
    if (failed(qoraCloseWrite(handle), "closing the file")) return 1;
    return ok ? 0 : 1;
}
