#include "status.h"

#include "qoraio32.h"

namespace {

struct StatusText {
    int code;
    const char* name;
    const char* sentence;
};

const StatusText kStatusTexts[] = {
    {QORA_STATUS_CANNOT_OPEN, "QORA_STATUS_CANNOT_OPEN", "The file cannot be opened."},
    {QORA_STATUS_WRITE_FAILED, "QORA_STATUS_WRITE_FAILED", "Writing to the file failed."},
    {QORA_STATUS_READ_FAILED, "QORA_STATUS_READ_FAILED", "Reading from the file failed."},
    {QORA_STATUS_TOO_MANY_FILES, "QORA_STATUS_TOO_MANY_FILES", "Too many files are open."},
    {QORA_STATUS_BAD_FILE_HANDLE, "QORA_STATUS_BAD_FILE_HANDLE",
     "The file handle is not valid, or the call failed inside the library."},
    {QORA_STATUS_BAD_FILE, "QORA_STATUS_BAD_FILE",
     "The file is missing, unreadable or not a valid system file."},
    {QORA_STATUS_NO_MEMORY, "QORA_STATUS_NO_MEMORY", "There is not enough memory."},
    {QORA_STATUS_OPENED_FOR_READING, "QORA_STATUS_OPENED_FOR_READING",
     "The file is open for reading only."},
    {QORA_STATUS_NOT_OPENED_FOR_READING, "QORA_STATUS_NOT_OPENED_FOR_READING",
     "The file is not open for reading."},
    {QORA_STATUS_BAD_VAR_NAME, "QORA_STATUS_BAD_VAR_NAME", "The variable name is not valid."},
    {QORA_STATUS_NO_VARIABLES, "QORA_STATUS_NO_VARIABLES", "The dictionary has no variables."},
    {QORA_STATUS_VAR_NOT_FOUND, "QORA_STATUS_VAR_NOT_FOUND", "The variable does not exist."},
    {QORA_STATUS_DUPLICATE_VAR, "QORA_STATUS_DUPLICATE_VAR", "The variable already exists."},
    {QORA_STATUS_NUMERIC_REQUIRED, "QORA_STATUS_NUMERIC_REQUIRED", "The variable is not numeric."},
    {QORA_STATUS_STRING_REQUIRED, "QORA_STATUS_STRING_REQUIRED", "The variable is not a string."},
    {QORA_STATUS_SHORT_STRING_REQUIRED, "QORA_STATUS_SHORT_STRING_REQUIRED",
     "The string variable is wider than 8 bytes."},
    {QORA_STATUS_BAD_VAR_TYPE, "QORA_STATUS_BAD_VAR_TYPE", "The variable type is not valid."},
    {QORA_STATUS_BAD_MISSING_SPEC, "QORA_STATUS_BAD_MISSING_SPEC",
     "The missing values are not valid."},
    {QORA_STATUS_BAD_PRINT_FORMAT, "QORA_STATUS_BAD_PRINT_FORMAT",
     "The print format is not valid."},
    {QORA_STATUS_BAD_WRITE_FORMAT, "QORA_STATUS_BAD_WRITE_FORMAT",
     "The write format is not valid."},
    {QORA_STATUS_BAD_DATE, "QORA_STATUS_BAD_DATE", "The date is not valid."},
    {QORA_STATUS_BAD_TIME, "QORA_STATUS_BAD_TIME", "The time is not valid."},
    {QORA_STATUS_WIDTH_MISMATCH, "QORA_STATUS_WIDTH_MISMATCH",
     "The string variables differ in width."},
    {QORA_STATUS_NO_SYSTEM_FILE, "QORA_STATUS_NO_SYSTEM_FILE",
     "The handle gives no view of a system file."},
    {QORA_STATUS_DICT_COMMITTED, "QORA_STATUS_DICT_COMMITTED",
     "The dictionary has already been committed."},
    {QORA_STATUS_DICT_NOT_COMMITTED, "QORA_STATUS_DICT_NOT_COMMITTED",
     "The dictionary has not been committed yet."},
    {QORA_STATUS_NO_RELEASE_INFO, "QORA_STATUS_NO_RELEASE_INFO",
     "The file carries no release information."},
    {QORA_STATUS_BAD_DATE_INFO, "QORA_STATUS_BAD_DATE_INFO",
     "The date variable information is not valid."},
    {QORA_STATUS_STRING_TOO_LONG, "QORA_STATUS_STRING_TOO_LONG",
     "The string is longer than the variable."},
    {QORA_STATUS_CANNOT_FREE, "QORA_STATUS_CANNOT_FREE", "The memory could not be released."},
    {QORA_STATUS_BUFFER_TOO_SHORT, "QORA_STATUS_BUFFER_TOO_SHORT", "The buffer is too short."},
    {QORA_STATUS_NO_CURRENT_CASE, "QORA_STATUS_NO_CURRENT_CASE", "No case is loaded."},
    {QORA_STATUS_CANNOT_APPEND, "QORA_STATUS_CANNOT_APPEND", "Cases cannot be added to the file."},
    {QORA_STATUS_BAD_EXTENSION, "QORA_STATUS_BAD_EXTENSION",
     "The extension record may not be used."},
    {QORA_STATUS_BAD_VAR_HANDLE, "QORA_STATUS_BAD_VAR_HANDLE", "The variable handle is not valid."},
    {QORA_STATUS_BAD_ENCODING, "QORA_STATUS_BAD_ENCODING", "The encoding is not valid."},
    {QORA_STATUS_FILES_OPEN, "QORA_STATUS_FILES_OPEN",
     "The encoding cannot change while files are open."},
    {QORA_STATUS_BAD_MRSET_DEF, "QORA_STATUS_BAD_MRSET_DEF",
     "The multiple response set is not valid."},
    {QORA_STATUS_BAD_MRSET_NAME, "QORA_STATUS_BAD_MRSET_NAME",
     "The multiple response set name is not valid."},
    {QORA_STATUS_DUPLICATE_MRSET, "QORA_STATUS_DUPLICATE_MRSET",
     "The multiple response set already exists."},
    {QORA_STATUS_BAD_SUBTYPE, "QORA_STATUS_BAD_SUBTYPE",
     "The extension record subtype is not valid."},
    {QORA_STATUS_BAD_ATTR_NAME, "QORA_STATUS_BAD_ATTR_NAME", "The attribute name is not valid."},
    {QORA_STATUS_BAD_ATTR_DEF, "QORA_STATUS_BAD_ATTR_DEF", "The attribute is not valid."},
    {QORA_STATUS_BAD_MRSET_INDEX, "QORA_STATUS_BAD_MRSET_INDEX",
     "The multiple response set index is out of range."},
};

}  // namespace

int Check(int status, const std::string& doing) {
    if (status > 0) throw Failure{status, doing};
    return status;
}

std::string FailureText(const Failure& failure) {
    const char* name = "unknown status";
    const char* sentence = "The library reported an error.";
    for (const StatusText& text : kStatusTexts) {
        if (text.code == failure.status) {
            name = text.name;
            sentence = text.sentence;
        }
    }
    return std::string(name) + " (" + std::to_string(failure.status) + ") while " + failure.doing +
           ". " + sentence;
}
