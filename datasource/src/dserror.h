// Internal failures. Nothing here ever reaches a caller: the exported calls
// catch every exception and answer with a status code.
#pragma once

#include <stdexcept>
#include <string>

// An internal failure with its text ("Datasource error # %ld involving %s").
class ErrorText : public std::exception {
  public:
    explicit ErrorText(std::string text, unsigned char flag = 1)
        : fText(std::move(text)), fFlag(flag) {}
    const char* what() const noexcept override { return fText.c_str(); }
    const std::string& Text() const { return fText; }
    unsigned char Flag() const { return fFlag; }

  private:
    std::string fText;
    unsigned char fFlag;
};

// An expected failure of reading or writing a system file.
class SystemFileException : public std::exception {
  public:
    SystemFileException(long number, std::string condition, const char* file, int line);
    const char* what() const noexcept override { return fWhat.c_str(); }
    long Number() const { return fNumber; }
    const std::string& Condition() const { return fCondition; }
    const char* File() const { return fFile; }
    int Line() const { return fLine; }

  private:
    long fNumber;
    std::string fCondition;
    const char* fFile;
    int fLine;
    std::string fWhat;
};

// Internal error numbers.
enum : long {
    kErrStreamOpen = 1000,
    kErrStreamWrite = 1002,
    kErrStreamRead = 1003,
    kErrCannotOpen = 1201,
    kErrBadFormat = 1204,
    kErrTooShort = 1205,
    kErrWriteWhileReading = 1209,
    kErrCaseWrite = 1502,
    kErrNoShortName = 1504,
    kErrDuplicateKey = 1505,
    kWarnNotUtf8 = 1701,
    kWarnNotCodePage = 1711,
    kWarnCodePageShown = 1721,
};

// The raising functions: they never return.
[[noreturn]] void RaiseError(long number);
[[noreturn]] void RaiseError(long number, const std::string& what);
[[noreturn]] void RaiseError(long number, const std::string& what, const std::string& what2);
// The same, with the text of the current errno as the last string.
[[noreturn]] void RaiseErrnoError(long number, const std::string& what);
[[noreturn]] void RaiseAssertion(const char* condition, const char* file, int line);

// A precondition of the model: a violation is a programming error, reported
// as an ErrorText naming the condition and the source file.
#define QORA_ASSERT(cond) \
    ((cond) ? static_cast<void>(0) : RaiseAssertion(#cond, __FILE__, __LINE__))

// A condition a file must meet; a violation is a format error of the file,
// reported with the given text (or the condition itself).
#define QORA_FILE_CHECK_TEXT(number, cond, text) \
    ((cond) ? static_cast<void>(0)               \
            : throw SystemFileException((number), (text), __FILE__, __LINE__))
#define QORA_FILE_CHECK(number, cond) QORA_FILE_CHECK_TEXT(number, cond, #cond)
