/* qoraio32: read and write system files ("$FL2") of the statistics package.
 *
 * Every call returns a status code (QORA_STATUS_OK, a positive error or a
 * negative warning) unless noted. Output arguments are cleared before any
 * check, so a failed call leaves them empty. File handles are 0 to 99.
 * Integers are 32-bit; a variable handle is a double (index + 1). */
#ifndef QORAIO32_H
#define QORAIO32_H

#if defined(_WIN32)
#define QORA_API __stdcall
#else
#define QORA_API
#endif

/* The export table decides what the library shows; on Windows it produces
 * the module definition, so the declarations need no attribute there. */
#if defined(_WIN32)
#define QORA_EXPORT
#else
#define QORA_EXPORT __attribute__((visibility("default")))
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* Status codes. */
#define QORA_STATUS_OK 0
#define QORA_STATUS_CANNOT_OPEN 1
#define QORA_STATUS_WRITE_FAILED 2
#define QORA_STATUS_READ_FAILED 3
#define QORA_STATUS_TOO_MANY_FILES 4
#define QORA_STATUS_BAD_FILE_HANDLE 5
#define QORA_STATUS_BAD_FILE 6
#define QORA_STATUS_NO_MEMORY 7
#define QORA_STATUS_OPENED_FOR_READING 8
#define QORA_STATUS_NOT_OPENED_FOR_READING 9
#define QORA_STATUS_BAD_VAR_NAME 10
#define QORA_STATUS_NO_VARIABLES 11
#define QORA_STATUS_VAR_NOT_FOUND 12
#define QORA_STATUS_DUPLICATE_VAR 13
#define QORA_STATUS_NUMERIC_REQUIRED 14
#define QORA_STATUS_STRING_REQUIRED 15
#define QORA_STATUS_SHORT_STRING_REQUIRED 16
#define QORA_STATUS_BAD_VAR_TYPE 17
#define QORA_STATUS_BAD_MISSING_SPEC 18
#define QORA_STATUS_BAD_PRINT_FORMAT 20
#define QORA_STATUS_BAD_WRITE_FORMAT 21
#define QORA_STATUS_BAD_DATE 22
#define QORA_STATUS_BAD_TIME 23
#define QORA_STATUS_WIDTH_MISMATCH 25
#define QORA_STATUS_NO_SYSTEM_FILE 29
#define QORA_STATUS_DICT_COMMITTED 30
#define QORA_STATUS_DICT_NOT_COMMITTED 31
#define QORA_STATUS_NO_RELEASE_INFO 41
#define QORA_STATUS_BAD_DATE_INFO 45
#define QORA_STATUS_STRING_TOO_LONG 47
#define QORA_STATUS_CANNOT_FREE 48
#define QORA_STATUS_BUFFER_TOO_SHORT 49
#define QORA_STATUS_NO_CURRENT_CASE 50
#define QORA_STATUS_CANNOT_APPEND 52
#define QORA_STATUS_BAD_EXTENSION 57
#define QORA_STATUS_BAD_VAR_HANDLE 58
#define QORA_STATUS_BAD_ENCODING 59
#define QORA_STATUS_FILES_OPEN 60
#define QORA_STATUS_BAD_MRSET_DEF 70
#define QORA_STATUS_BAD_MRSET_NAME 71
#define QORA_STATUS_DUPLICATE_MRSET 72
#define QORA_STATUS_BAD_SUBTYPE 73
#define QORA_STATUS_BAD_ATTR_NAME 75
#define QORA_STATUS_BAD_ATTR_DEF 76
#define QORA_STATUS_BAD_MRSET_INDEX 77

/* Warnings: the call did its work, with a remark. */
#define QORA_WARN_LABEL_TRUNCATED (-2)
#define QORA_WARN_VALUE_LABEL_TRUNCATED (-4)
#define QORA_WARN_END_OF_FILE (-5)
#define QORA_WARN_NO_VARSETS (-7)
#define QORA_WARN_NO_LABELS (-8)
#define QORA_WARN_NO_LABEL (-9)
#define QORA_WARN_NO_WEIGHT (-10)
#define QORA_WARN_NO_DATE_INFO (-11)
#define QORA_WARN_NO_MRSETS (-13)
#define QORA_WARN_NO_KIV_INFO (-14)

/* A multiple response set definition. The offsets up to countedValue are
 * fixed (412 bytes in all where pointers take 4 bytes). */
typedef struct qoraMultRespDef {
    char name[65];           /* zero-terminated, at most 64 bytes */
    char label[257];         /* zero-terminated, at most 256 bytes */
    char padding[2];         /* offset 322 */
    int isDichotomy;         /* offset 324: 1 dichotomy set, 0 category set */
    int isNumeric;           /* counted value numeric (1) or text (0); dichotomy sets */
    int useCategoryLabels;   /* dichotomy sets */
    int useFirstVarLabel;    /* the first variable's label is the set label */
    int reserved[14];        /* zero */
    int numericCountedValue; /* offset 396 */
    char* countedValue;      /* offset 400: zero-terminated text */
    char** varNames;         /* variable names */
    int numVars;             /* number of variables */
} qoraMultRespDef;

/* Opening, closing and counts. */
QORA_EXPORT int QORA_API qoraOpenRead(const char* fileName, int* handle);
QORA_EXPORT int QORA_API qoraCloseRead(int handle);
QORA_EXPORT int QORA_API qoraCloseWrite(int handle);
QORA_EXPORT int QORA_API qoraCloseAppend(int handle);
QORA_EXPORT int QORA_API qoraGetNumberofVariables(int handle, int* count);
QORA_EXPORT int QORA_API qoraGetNumberofCases(int handle, int* count);
QORA_EXPORT int QORA_API qoraGetEstimatedNofCases(int handle, int* count);
QORA_EXPORT int QORA_API qoraGetCaseSize(int handle, int* size);

/* Writing, appending, copying and file-level properties. */
QORA_EXPORT int QORA_API qoraOpenWrite(const char* fileName, int* handle);
QORA_EXPORT int QORA_API qoraOpenWriteCopy(const char* fileName, const char* dictFileName,
                                           int* handle);
QORA_EXPORT int QORA_API qoraOpenAppend(const char* fileName, int* handle);
QORA_EXPORT int QORA_API qoraCommitHeader(int handle);
QORA_EXPORT int QORA_API qoraSetCompression(int handle, int compSwitch);
QORA_EXPORT int QORA_API qoraGetCompression(int handle, int* compSwitch);
QORA_EXPORT int QORA_API qoraSetIdString(int handle, const char* id);
QORA_EXPORT int QORA_API qoraGetIdString(int handle, char* id);
QORA_EXPORT int QORA_API qoraGetSystemString(int handle, char* text);
QORA_EXPORT int QORA_API qoraGetReleaseInfo(int handle, int* relInfo); /* 3 integers */
QORA_EXPORT int QORA_API qoraGetTimeStamp(int handle, char* fileDate, char* fileTime);
QORA_EXPORT int QORA_API qoraSetCaseWeightVar(int handle, const char* varName);
QORA_EXPORT int QORA_API qoraGetCaseWeightVar(int handle, char* varName);
QORA_EXPORT int QORA_API qoraSetTempDir(const char* dirName);

/* Variables. */
QORA_EXPORT int QORA_API qoraValidateVarname(const char* name);
QORA_EXPORT int QORA_API qoraSetVarName(int handle, const char* name, int type);
QORA_EXPORT int QORA_API qoraGetVarHandle(int handle, const char* name, double* varHandle);
QORA_EXPORT int QORA_API qoraGetVarInfo(int handle, int index, char* name, int* type);
QORA_EXPORT int QORA_API qoraGetVarNames(int handle, int* count, char*** names, int** types);
QORA_EXPORT int QORA_API qoraFreeVarNames(char** names, int* types, int count);
QORA_EXPORT int QORA_API qoraGetVarCompatName(int handle, const char* name, char* shortName);
QORA_EXPORT int QORA_API qoraSetVarLabel(int handle, const char* name, const char* label);
QORA_EXPORT int QORA_API qoraGetVarLabelLong(int handle, const char* name, char* buffer,
                                             int bufferLength, int* labelLength);
QORA_EXPORT int QORA_API qoraGetVarLabel(int handle, const char* name, char* buffer);
QORA_EXPORT int QORA_API qoraSetVarPrintFormat(int handle, const char* name, int type, int decimals,
                                               int width);
QORA_EXPORT int QORA_API qoraSetVarWriteFormat(int handle, const char* name, int type, int decimals,
                                               int width);
QORA_EXPORT int QORA_API qoraGetVarPrintFormat(int handle, const char* name, int* type,
                                               int* decimals, int* width);
QORA_EXPORT int QORA_API qoraGetVarWriteFormat(int handle, const char* name, int* type,
                                               int* decimals, int* width);
QORA_EXPORT int QORA_API qoraSetVarNMissingValues(int handle, const char* name, int count,
                                                  double value1, double value2, double value3);
QORA_EXPORT int QORA_API qoraGetVarNMissingValues(int handle, const char* name, int* count,
                                                  double* value1, double* value2, double* value3);
QORA_EXPORT int QORA_API qoraSetVarCMissingValues(int handle, const char* name, int count,
                                                  const char* value1, const char* value2,
                                                  const char* value3);
QORA_EXPORT int QORA_API qoraGetVarCMissingValues(int handle, const char* name, int* count,
                                                  char* value1, char* value2, char* value3);
QORA_EXPORT int QORA_API qoraSetVarMeasureLevel(int handle, const char* name, int level);
QORA_EXPORT int QORA_API qoraGetVarMeasureLevel(int handle, const char* name, int* level);
QORA_EXPORT int QORA_API qoraSetVarAlignment(int handle, const char* name, int alignment);
QORA_EXPORT int QORA_API qoraGetVarAlignment(int handle, const char* name, int* alignment);
QORA_EXPORT int QORA_API qoraSetVarColumnWidth(int handle, const char* name, int width);
QORA_EXPORT int QORA_API qoraGetVarColumnWidth(int handle, const char* name, int* width);

/* Value labels. */
QORA_EXPORT int QORA_API qoraSetVarNValueLabel(int handle, const char* varName, double value,
                                               const char* label);
QORA_EXPORT int QORA_API qoraSetVarCValueLabel(int handle, const char* varName, const char* value,
                                               const char* label);
QORA_EXPORT int QORA_API qoraSetVarNValueLabels(int handle, const char* const* varNames,
                                                int numVars, const double* values,
                                                const char* const* labels, int numLabels);
QORA_EXPORT int QORA_API qoraSetVarCValueLabels(int handle, const char* const* varNames,
                                                int numVars, const char* const* values,
                                                const char* const* labels, int numLabels);
QORA_EXPORT int QORA_API qoraGetVarNValueLabelLong(int handle, const char* varName, double value,
                                                   char* label, int labelSize, int* labelLength);
QORA_EXPORT int QORA_API qoraGetVarCValueLabelLong(int handle, const char* varName,
                                                   const char* value, char* label, int labelSize,
                                                   int* labelLength);
QORA_EXPORT int QORA_API qoraGetVarNValueLabel(int handle, const char* varName, double value,
                                               char* label);
QORA_EXPORT int QORA_API qoraGetVarCValueLabel(int handle, const char* varName, const char* value,
                                               char* label);
QORA_EXPORT int QORA_API qoraGetVarNValueLabels(int handle, const char* varName, double** values,
                                                char*** labels, int* numLabels);
QORA_EXPORT int QORA_API qoraGetVarCValueLabels(int handle, const char* varName, char*** values,
                                                char*** labels, int* numLabels);
QORA_EXPORT int QORA_API qoraFreeVarNValueLabels(double* values, char** labels, int numLabels);
QORA_EXPORT int QORA_API qoraFreeVarCValueLabels(char** values, char** labels, int numLabels);

/* Case data. */
QORA_EXPORT int QORA_API qoraReadCaseRecord(int handle);
QORA_EXPORT int QORA_API qoraWholeCaseIn(int handle, void* caseRecord);
QORA_EXPORT int QORA_API qoraSeekNextCase(int handle, int caseNumber);
QORA_EXPORT int QORA_API qoraGetValueNumeric(int handle, double varHandle, double* value);
QORA_EXPORT int QORA_API qoraGetValueChar(int handle, double varHandle, char* value,
                                          int valueLength);
QORA_EXPORT int QORA_API qoraSetValueNumeric(int handle, double varHandle, double value);
QORA_EXPORT int QORA_API qoraSetValueChar(int handle, double varHandle, const char* value);
QORA_EXPORT int QORA_API qoraCommitCaseRecord(int handle);
QORA_EXPORT int QORA_API qoraWholeCaseOut(int handle, const void* caseRecord);
QORA_EXPORT double QORA_API qoraSysmisVal(void); /* the value, not a status */
QORA_EXPORT int QORA_API qoraHostSysmisVal(double* value);
QORA_EXPORT int QORA_API qoraLowHighVal(double* lowest, double* highest);

/* Dates are seconds since 14 October 1582 00:00, times are seconds. */
QORA_EXPORT int QORA_API qoraConvertDate(int day, int month, int year, double* date);
QORA_EXPORT int QORA_API qoraConvertQORADate(int* day, int* month, int* year, double date);
QORA_EXPORT int QORA_API qoraConvertTime(int day, int hour, int minute, double second,
                                         double* time);
QORA_EXPORT int QORA_API qoraConvertQORATime(int* day, int* hour, int* minute, double* second,
                                             double time);

/* Dictionary extras: raw extension data, documents, text info, KIV data. */
QORA_EXPORT int QORA_API qoraSetExtensionData(int handle, int subType, int elementSize, int count,
                                              const void* data);
QORA_EXPORT int QORA_API qoraGetExtensionDataDesc(int handle, int subType, int* elementSize,
                                                  int* count);
QORA_EXPORT int QORA_API qoraGetExtensionData(int handle, int subType, int bufferSize, int* count,
                                              void* buffer);
QORA_EXPORT int QORA_API qoraQueryType7(int handle, int subType, int* present);
QORA_EXPORT int QORA_API qoraCopyDocuments(int fromHandle, int toHandle);
QORA_EXPORT int QORA_API qoraSetTextInfo(int handle, const char* text);
QORA_EXPORT int QORA_API qoraGetTextInfo(int handle, char* text); /* 256 bytes */
QORA_EXPORT int QORA_API qoraSetKIVGUID(int handle, const char* text);
QORA_EXPORT int QORA_API qoraGetKIVGUID(int handle, char* text); /* 257 bytes */
QORA_EXPORT int QORA_API qoraGetKIVInfo(int handle, int* length, int* lastWord);
QORA_EXPORT int QORA_API qoraSetKIVFirst(int handle, const void* data, int length);
QORA_EXPORT int QORA_API qoraSetKIVNext(int handle, const void* data, int length);
QORA_EXPORT int QORA_API qoraGetKIVFirst(int handle, void* data, int maxData, int* length);
QORA_EXPORT int QORA_API qoraGetKIVNext(int handle, void* data, int maxData, int* length);

/* Multiple response sets and variable sets. */
QORA_EXPORT int QORA_API qoraSetMultRespDefs(int handle, const char* text);
QORA_EXPORT int QORA_API qoraGetMultRespDefs(int handle, char** text);
QORA_EXPORT int QORA_API qoraFreeMultRespDefs(char* text);
QORA_EXPORT int QORA_API qoraSetVariableSets(int handle, const char* text);
QORA_EXPORT int QORA_API qoraGetVariableSets(int handle, char** text);
QORA_EXPORT int QORA_API qoraFreeVariableSets(char* text);
QORA_EXPORT int QORA_API qoraGetMultRespCount(int handle, int* count);
QORA_EXPORT int QORA_API qoraGetMultRespDefByIndex(int handle, int index,
                                                   qoraMultRespDef** definition);
QORA_EXPORT int QORA_API qoraFreeMultRespDefStruct(qoraMultRespDef* definition);
QORA_EXPORT int QORA_API qoraAddMultRespDefExt(int handle, const qoraMultRespDef* definition);
QORA_EXPORT int QORA_API qoraAddMultRespDefC(int handle, const char* name, const char* label,
                                             int isDichotomy, const char* countedValue,
                                             const char* const* varNames, int numVars);
QORA_EXPORT int QORA_API qoraAddMultRespDefN(int handle, const char* name, const char* label,
                                             int isDichotomy, int countedValue,
                                             const char* const* varNames, int numVars);

/* Date variables. */
QORA_EXPORT int QORA_API qoraSetDateVariables(int handle, int numElements, const int* elements);
QORA_EXPORT int QORA_API qoraGetDateVariables(int handle, int* numElements, int** elements);
QORA_EXPORT int QORA_API qoraFreeDateVariables(int* elements);

/* Custom attributes. */
QORA_EXPORT int QORA_API qoraGetFileAttributes(int handle, char*** names, char*** texts,
                                               int* count);
QORA_EXPORT int QORA_API qoraGetVarAttributes(int handle, const char* varName, char*** names,
                                              char*** texts, int* count);
QORA_EXPORT int QORA_API qoraSetFileAttributes(int handle, const char* const* names,
                                               const char* const* texts, int count);
QORA_EXPORT int QORA_API qoraSetVarAttributes(int handle, const char* varName,
                                              const char* const* names, const char* const* texts,
                                              int count);
QORA_EXPORT int QORA_API qoraAddFileAttribute(int handle, const char* attribName, int attribSub,
                                              const char* attribText);
QORA_EXPORT int QORA_API qoraAddVarAttribute(int handle, const char* varName,
                                             const char* attribName, int attribSub,
                                             const char* attribText);
QORA_EXPORT int QORA_API qoraFreeAttributes(char** names, char** texts, int count);

/* Encodings and locale. */
QORA_EXPORT int QORA_API qoraSetInterfaceEncoding(int encoding); /* 0 code page, 1 UTF-8 */
QORA_EXPORT int QORA_API qoraGetInterfaceEncoding(void);         /* the value, not a status */
/* encoding: a buffer of at least 65 bytes; a longer name is cut to 64. */
QORA_EXPORT int QORA_API qoraGetFileEncoding(int handle, char* encoding);
QORA_EXPORT int QORA_API qoraGetFileCodePage(int handle, int* codePage);
/* Decorated qoraIsCompatibleEncoding@8; its plain name is spelt "Endoding". */
#if defined(_WIN32)
QORA_EXPORT int QORA_API qoraIsCompatibleEncoding(int handle, int* compatible);
#else
QORA_EXPORT int QORA_API qoraIsCompatibleEndoding(int handle, int* compatible);
#endif
/* Returns the locale name in force, or null; not a status. */
QORA_EXPORT const char* QORA_API qoraSetLocale(int category, const char* locale);

#ifdef __cplusplus
}
#endif

#endif /* QORAIO32_H */
