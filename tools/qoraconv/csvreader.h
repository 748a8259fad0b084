// Reads a CSV file row by row, with the line on which each row begins.
// Fields are separated by commas; a field in double quotes may hold commas,
// line breaks and doubled quotes; rows end with LF or CRLF.
#pragma once

#include <cstdio>
#include <string>
#include <vector>

// The widest string a variable can hold, so the widest cell worth reading.
constexpr size_t kWidestCell = 32767;

class CsvReader {
  public:
    // Throws BadInput when the file cannot be opened.
    explicit CsvReader(const std::string& path);
    ~CsvReader();
    CsvReader(const CsvReader&) = delete;
    CsvReader& operator=(const CsvReader&) = delete;

    // The next row's fields, or false at the end of the file. Throws BadInput
    // on an unclosed quote or a cell wider than kWidestCell.
    bool NextRow(std::vector<std::string>& fields);
    // The line on which the last row read begins, counted from 1.
    long RowLine() const { return fRowLine; }
    // "FILE line N: " for the last row read.
    std::string Where() const;
    // Back to the first row, for a second pass.
    void Rewind();

  private:
    int Get();
    int Peek();
    bool Refill();
    // Each takes one cell and the byte that ends it: a comma, a line feed
    // (for LF or CRLF) or EOF.
    int TakeQuoted(std::string& field);
    int TakeUnquoted(std::string& field);
    void Append(std::string& field, const char* bytes, size_t count);
    [[noreturn]] void Refuse(long line, const std::string& sentence) const;

    std::string fPath;
    std::FILE* fFile;
    std::vector<char> fBuffer;
    size_t fPos = 0;
    size_t fEnd = 0;
    long fLine = 1;
    long fRowLine = 0;
};
