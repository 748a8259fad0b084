#include "csvreader.h"

#include <cstring>

#include "status.h"

namespace {

constexpr size_t kBufferSize = 1 << 20;

}  // namespace

CsvReader::CsvReader(const std::string& path)
    : fPath(path), fFile(std::fopen(path.c_str(), "rb")), fBuffer(kBufferSize) {
    if (!fFile)
        throw BadInput{path + ": the file cannot be opened (" + std::strerror(errno) + ")."};
    Rewind();
}

CsvReader::~CsvReader() { std::fclose(fFile); }

void CsvReader::Rewind() {
    if (std::fseek(fFile, 0, SEEK_SET) != 0) Refuse(0, "the file cannot be read twice.");
    fPos = fEnd = 0;
    fLine = 1;
    // Spreadsheets often begin UTF-8 text with a byte order mark.
    if (Peek() == 0xEF && fEnd - fPos >= 3 && std::memcmp(&fBuffer[fPos], "\xEF\xBB\xBF", 3) == 0)
        fPos += 3;
}

bool CsvReader::Refill() {
    fPos = 0;
    fEnd = std::fread(fBuffer.data(), 1, fBuffer.size(), fFile);
    if (std::ferror(fFile)) Refuse(fLine, "reading failed.");
    return fEnd > 0;
}

int CsvReader::Get() {
    if (fPos == fEnd && !Refill()) return EOF;
    return static_cast<unsigned char>(fBuffer[fPos++]);
}

int CsvReader::Peek() {
    if (fPos == fEnd && !Refill()) return EOF;
    return static_cast<unsigned char>(fBuffer[fPos]);
}

std::string CsvReader::Where() const { return fPath + " line " + std::to_string(fRowLine) + ": "; }

void CsvReader::Refuse(long line, const std::string& sentence) const {
    throw BadInput{fPath + (line > 0 ? " line " + std::to_string(line) : std::string()) + ": " +
                   sentence};
}

void CsvReader::Append(std::string& field, const char* bytes, size_t count) {
    if (count > kWidestCell - field.size())
        Refuse(fLine, "a cell is wider than any string can be (32767 bytes).");
    field.append(bytes, count);
}

int CsvReader::TakeQuoted(std::string& field) {
    const long quoteLine = fLine;
    Get();  // the opening quote
    for (int c = Get();; c = Get()) {
        if (c == EOF) Refuse(quoteLine, "a quoted cell has no closing quote.");
        if (c == '"' && (c = Get()) != '"') {
            if (c == '\r' && Peek() == '\n') c = Get();
            if (c != ',' && c != '\n' && c != EOF)
                Refuse(fLine, "a quoted cell goes on after its closing quote.");
            return c;
        }
        if (c == '\n') ++fLine;
        const char byte = char(c);
        Append(field, &byte, 1);
    }
}

int CsvReader::TakeUnquoted(std::string& field) {
    for (;;) {
        const char* start = fBuffer.data() + fPos;
        const char* end = fBuffer.data() + fEnd;
        const char* stop = start;
        while (stop < end && *stop != ',' && *stop != '\n' && *stop != '\r') ++stop;
        Append(field, start, size_t(stop - start));
        fPos += size_t(stop - start);
        if (stop == end) {
            if (!Refill()) return EOF;
            continue;
        }
        const int c = Get();
        if (c != '\r') return c;
        if (Peek() == '\n') return Get();
        Append(field, "\r", 1);  // a carriage return alone is text
    }
}

bool CsvReader::NextRow(std::vector<std::string>& fields) {
    if (Peek() == EOF) return false;
    fRowLine = fLine;
    size_t count = 0;
    int c;
    do {
        if (count == fields.size()) fields.emplace_back();
        std::string& field = fields[count++];
        field.clear();
        c = Peek() == '"' ? TakeQuoted(field) : TakeUnquoted(field);
    } while (c == ',');
    if (c == '\n') ++fLine;
    fields.resize(count);
    return true;
}
