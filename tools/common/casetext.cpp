#include "casetext.h"

#include <charconv>
#include <cmath>
#include <cstdio>

#include "qoraio32.h"
#include "status.h"

namespace {

// A date value as yyyy-mm-dd (with hh:mm:ss when asked); a number that is no
// date is shown as a number.
std::string DateText(double value, bool withTime) {
    int day = 0, month = 0, year = 0, days = 0, hour = 0, minute = 0;
    double second = 0;
    if (qoraConvertQORADate(&day, &month, &year, value) != QORA_STATUS_OK) return NumberText(value);
    char text[64];
    if (withTime && qoraConvertQORATime(&days, &hour, &minute, &second, value) == QORA_STATUS_OK)
        std::snprintf(text, sizeof text, "%04d-%02d-%02d %02d:%02d:%02d", year, month, day, hour,
                      minute, int(second));
    else
        std::snprintf(text, sizeof text, "%04d-%02d-%02d", year, month, day);
    return text;
}

// Reads exactly `digits` decimal digits at `pos`.
bool Digits(std::string_view text, size_t pos, size_t digits, int& out) {
    if (pos + digits > text.size()) return false;
    out = 0;
    for (size_t i = pos; i < pos + digits; ++i) {
        if (text[i] < '0' || text[i] > '9') return false;
        out = out * 10 + (text[i] - '0');
    }
    return true;
}

// Says what failed only when a value cannot be read, so that reading costs no
// text.
void CheckValue(int status, const Variable& var) {
    if (status > 0) Check(status, "reading the value of " + var.name);
}

}  // namespace

bool IsDateFormat(int code) {
    return code == 20 || code == 23 || code == 24 || code == 28 || code == 29 || code == 30 ||
           code == 38 || code == 39;
}
bool IsDateTimeFormat(int code) { return code == 22; }

std::string NumberText(double value) {
    char text[32];
    auto result = std::to_chars(text, text + sizeof text, value);
    return std::string(text, result.ptr);
}

std::string TrimBlanks(std::string text) {
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

std::string CsvField(const std::string& text) {
    if (text.find_first_of(",\"\r\n") == std::string::npos) return text;
    std::string quoted = "\"";
    for (char c : text) {
        if (c == '"') quoted += '"';
        quoted += c;
    }
    return quoted + '"';
}

std::string ValueText(int handle, int index, const Variable& var, std::vector<char>& buffer) {
    const double varHandle = index + 1;
    if (var.type == 0) {
        double value = 0;
        CheckValue(qoraGetValueNumeric(handle, varHandle, &value), var);
        if (value == qoraSysmisVal()) return std::string();
        if (IsDateFormat(var.printFormat)) return DateText(value, false);
        if (IsDateTimeFormat(var.printFormat)) return DateText(value, true);
        return NumberText(value);
    }
    CheckValue(qoraGetValueChar(handle, varHandle, buffer.data(), int(buffer.size())), var);
    return CsvField(TrimBlanks(buffer.data()));
}

bool ParseNumber(std::string_view text, double& value) {
    const char* end = text.data() + text.size();
    auto [last, error] = std::from_chars(text.data(), end, value);
    return error == std::errc() && last == end && std::isfinite(value);
}

bool ParseDate(std::string_view text, bool withTime, double& value) {
    int year, month, day, hour = 0, minute = 0, second = 0;
    if (text.size() != (withTime ? 19u : 10u) || !Digits(text, 0, 4, year) || text[4] != '-' ||
        !Digits(text, 5, 2, month) || text[7] != '-' || !Digits(text, 8, 2, day))
        return false;
    if (withTime &&
        (text[10] != ' ' || !Digits(text, 11, 2, hour) || text[13] != ':' ||
         !Digits(text, 14, 2, minute) || text[16] != ':' || !Digits(text, 17, 2, second)))
        return false;
    double date = 0, time = 0;
    if (qoraConvertDate(day, month, year, &date) != QORA_STATUS_OK ||
        qoraConvertTime(0, hour, minute, second, &time) != QORA_STATUS_OK)
        return false;
    value = date + time;
    return true;
}
