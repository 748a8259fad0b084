#include "dserror.h"

#include <cerrno>
#include <cstring>

SystemFileException::SystemFileException(long number, std::string condition, const char* file,
                                         int line)
    : fNumber(number), fCondition(std::move(condition)), fFile(file), fLine(line) {
    fWhat = "Datasource error # " + std::to_string(number) + " involving " + fCondition;
}

void RaiseError(long number) { throw ErrorText("Datasource error # " + std::to_string(number)); }

void RaiseError(long number, const std::string& what) {
    throw ErrorText("Datasource error # " + std::to_string(number) + " involving " + what);
}

void RaiseError(long number, const std::string& what, const std::string& what2) {
    throw ErrorText("Datasource error # " + std::to_string(number) + " involving " + what +
                    " and " + what2);
}

void RaiseErrnoError(long number, const std::string& what) {
    RaiseError(number, what, std::strerror(errno));
}

void RaiseAssertion(const char* condition, const char* file, int line) {
    throw ErrorText(std::string("Assertion failed: ") + condition + ", " + file + ":" +
                    std::to_string(line));
}
