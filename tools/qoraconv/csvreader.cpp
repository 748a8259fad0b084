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

void CsvReader::AddByte(std::string& field, int c) {
    if (field.size() == kWidestCell)
        Refuse(fLine, "a cell is wider than any string can be (32767 bytes).");
    field += char(c);
}

// A comma, a line end (LF, or CR before LF) or the end of the file.
bool CsvReader::EndOfField(int c) {
    return c == ',' || c == '\n' || c == EOF || (c == '\r' && Peek() == '\n');
}

bool CsvReader::NextRow(std::vector<std::string>& fields) {
    int c = Get();
    if (c == EOF) return false;
    fRowLine = fLine;
    size_t count = 0;
    for (;; c = Get()) {
        if (count == fields.size()) fields.emplace_back();
        std::string& field = fields[count++];
        field.clear();
        if (c == '"') {
            const long quoteLine = fLine;
            for (c = Get();; c = Get()) {
                if (c == EOF) Refuse(quoteLine, "a quoted cell has no closing quote.");
                if (c == '"' && (c = Get()) != '"') break;
                if (c == '\n') ++fLine;
                AddByte(field, c);
            }
            if (!EndOfField(c)) Refuse(fLine, "a quoted cell goes on after its closing quote.");
        } else {
            for (; !EndOfField(c); c = Get()) AddByte(field, c);
        }
        if (c == '\r') c = Get();
        if (c != ',') break;
    }
    if (c == '\n') ++fLine;
    fields.resize(count);
    return true;
}
