// Writes system file bytes from a description, for reader tests.
//
// Written apart from the library on purpose: it shares no code with the
// reader, the writer or the compressor, so a reader test never checks the
// library only against itself. Everything a real file can hold can be set,
// and most fields can be set to something a real file never holds, so the
// same helper serves for malformed input.
//
//   SysFileBuilder b(Endian::Swapped);
//   b.Numeric("AGE").Label("Age in years").Missing({-1.0});
//   b.String("NAME", 20);
//   b.Case({30.0, "Ann"});
//   std::string path = b.WriteTemp();
//
// Dictionary records are written in the order they are added; the type 999
// record and the case data follow them.
#pragma once

#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <deque>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace fixture {

using Bytes = std::vector<uint8_t>;

// Byte order of every integer and double of the file: the machine's own or
// the opposite one. Text and string values are never reversed.
enum class Endian { Native, Swapped };

// Names the byte order in parameterised test names:
// INSTANTIATE_TEST_SUITE_P(Orders, T, ::testing::Values(Endian::Native,
// Endian::Swapped), fixture::EndianName).
std::string EndianName(const ::testing::TestParamInfo<Endian>& info);

// The special values of the format, by their bits.
double FromBits(uint64_t bits);
extern const double kSysmis;   // FFEFFFFFFFFFFFFF
extern const double kHighest;  // 7FEFFFFFFFFFFFFF
extern const double kLowest;   // FFEFFFFFFFFFFFFE

// Packed print/write format words.
uint32_t FormatWord(int type, int width, int decimals);
uint32_t StringFormat(int width);  // type 1: the width's high byte sits in bits 0-7

// One value of a case, a missing value or a value label: a number or the
// bytes of a string.
class Value {
  public:
    Value(double number) : fNumber(number) {}
    Value(int number) : fNumber(number) {}
    Value(const char* text) : fIsString(true), fText(text) {}
    Value(std::string text) : fIsString(true), fText(std::move(text)) {}

    bool IsString() const { return fIsString; }
    double Number() const { return fNumber; }
    const std::string& Text() const { return fText; }

  private:
    bool fIsString = false;
    double fNumber = 0.0;
    std::string fText;
};

// Removes a directory tree when destroyed; named after the running test.
class TempDir {
  public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;
    const std::string& Path() const { return fPath; }

  private:
    std::string fPath;
};

// Cuts or patches built bytes for malformed-input tests.
Bytes Truncated(Bytes bytes, size_t size);
void Patch(Bytes& bytes, size_t offset, const Bytes& with);

class SysFileBuilder;

// One variable of the dictionary as the caller sees it. A string wider than
// 255 bytes is written as its segments (each a string variable of its own in
// the file) and takes one value per case, split the way a writer splits it.
class Var {
  public:
    Var& Label(std::string label);
    Var& LongName(std::string name);  // used by SysFileBuilder::LongNames()
    Var& Formats(uint32_t print, uint32_t write);

    // Missing values, coded as the variable record codes them.
    Var& Missing(std::vector<double> discrete);                   // code 0..3
    Var& MissingRange(double low, double high);                   // code -2
    Var& MissingRange(double low, double high, double discrete);  // code -3
    Var& MissingStrings(std::vector<std::string> discrete);       // 8 bytes each, never reversed
    // Any code with any values, whether they agree or not.
    Var& MissingRaw(int32_t code, std::vector<Value> values);

    // Overrides for malformed records (first record of the variable).
    Var& TypeField(int32_t type);
    Var& LabelLengthField(int32_t length);
    Var& Continuations(int count);  // continuation records after the first record

    const std::string& Name() const { return fName; }
    int Width() const { return fWidth; }
    int Slot() const { return fSlot; }  // 1-based number of the first value unit
    int Units() const;                  // value units in the file's case

  private:
    friend class SysFileBuilder;
    Var(std::string name, int width, int slot);

    std::string fName;
    std::string fLongName;
    int fWidth;
    int fSlot;
    std::optional<std::string> fLabel;
    int32_t fMissingCode = 0;
    std::vector<Value> fMissing;
    std::optional<uint32_t> fPrint, fWrite;
    std::optional<int32_t> fTypeField, fLabelLengthField;
    std::optional<int> fContinuations;
};

struct Header {
    std::string magic = "$FL2";
    std::string product = "@(#) QORA DATA FILE test fixture";
    int32_t layoutCode = 2;
    std::optional<int32_t> caseSize;     // default: units of the variables
    std::optional<int32_t> compression;  // default: 1 when compressed, else 0
    int32_t weightIndex = 0;
    std::optional<int32_t> caseCount;  // default: the number of cases given
    double bias = 100.0;
    std::string date = "04 Dec 26";
    std::string time = "17:16:43";
    std::string label;
};

struct ValueLabelSet {
    std::vector<std::pair<Value, std::string>> labels;
    std::vector<int32_t> slots;  // 1-based first value units
    // Overrides for malformed records.
    std::optional<int32_t> labelCount;
    std::optional<int32_t> variableCount;
    int32_t secondType = 4;
    bool omitSecond = false;
};

struct LongValueLabels {
    std::string name;
    int32_t width;
    std::vector<std::pair<std::string, std::string>> labels;  // value, label
};

class SysFileBuilder {
  public:
    explicit SysFileBuilder(Endian endian = Endian::Native);

    Header& header() { return fHeader; }
    SysFileBuilder& Compressed(bool on = true);
    SysFileBuilder& Weight(const Var& var);

    // Variables (type 2 records). References stay valid while the builder lives.
    Var& Numeric(std::string name);
    Var& String(std::string name, int width);
    const Var& Variable(const std::string& name) const;  // throws when unknown
    int Slot(const std::string& name) const { return Variable(name).Slot(); }
    int CaseUnits() const;  // value units in the file's case

    // Value labels (type 3 with its type 4).
    SysFileBuilder& ValueLabels(std::vector<std::pair<Value, std::string>> labels,
                                std::vector<int32_t> slots);
    SysFileBuilder& ValueLabels(ValueLabelSet set);

    // Documents (type 6): each line cut or padded to 80 bytes.
    SysFileBuilder& Documents(std::vector<std::string> lines,
                              std::optional<int32_t> lineCount = std::nullopt);

    // Any type 7 record. The frame's integers follow the byte order; the
    // contents are written as given (use the encoders below for numbers).
    SysFileBuilder& Extension(int32_t subtype, int32_t unitSize, int32_t unitCount, Bytes contents);
    SysFileBuilder& Extension(int32_t subtype, int32_t unitSize, Bytes contents);
    SysFileBuilder& TextExtension(int32_t subtype, const std::string& text);

    // The common extension records, laid out as a writer lays them out.
    SysFileBuilder& IntegerInfo(std::array<int32_t, 8> units = {16, 0, 0, 720, 1, 1, 2, 2});
    SysFileBuilder& FloatInfo(double sysmis = kSysmis, double highest = kHighest,
                              double lowest = kLowest);
    SysFileBuilder& DateInfo(std::vector<int32_t> elements);  // subtype 6
    SysFileBuilder& DisplayParams(std::vector<std::array<int32_t, 3>> levelWidthAlign);
    SysFileBuilder& LongNames(std::vector<std::pair<std::string, std::string>> shortLong);
    SysFileBuilder& LongNames();  // from the variables so far: record name = long name
    SysFileBuilder& VeryLongStrings(std::vector<std::pair<std::string, int>> nameWidth);
    SysFileBuilder& VeryLongStrings();  // from the variables so far wider than 255
    SysFileBuilder& CaseCount64(int64_t count, int64_t marker = 1);
    SysFileBuilder& FileAttributes(const std::string& text);
    SysFileBuilder& VariableAttributes(std::vector<std::pair<std::string, std::string>> nameText);
    SysFileBuilder& Encoding(const std::string& name);
    SysFileBuilder& LongValueLabelsRecord(std::vector<LongValueLabels> entries);
    SysFileBuilder& MultipleResponseSets(std::vector<std::string> lines);          // subtype 7
    SysFileBuilder& ExtendedMultipleResponseSets(std::vector<std::string> lines);  // 19
    SysFileBuilder& VariableSets(std::vector<std::string> lines);                  // subtype 5

    // Bytes placed as they are among the dictionary records.
    SysFileBuilder& RawRecord(Bytes bytes);
    // Whether the type 999 record is written.
    SysFileBuilder& EndRecord(bool write);

    // Case data. One value per variable; numbers for numeric variables,
    // strings for string variables (a mismatch is written as given).
    SysFileBuilder& Case(std::vector<Value> values);

    // Encoders in the builder's byte order.
    Bytes Int32(int32_t value) const;
    Bytes Int32s(const std::vector<int32_t>& values) const;
    Bytes Int64(int64_t value) const;
    Bytes Unit(const Value& value) const;  // one 8-byte value unit

    Bytes Build() const;
    size_t DataStart() const;  // offset of the first byte of the case data
    // Writes into a directory of the running test, removed with the builder.
    std::string WriteTemp(const std::string& fileName = "fixture.qsf") const;
    std::string WriteTemp(const Bytes& bytes, const std::string& fileName) const;

    // Text of the record formats that the helpers above wrap.
    static std::string AttributeText(
        const std::vector<std::pair<std::string, std::vector<std::string>>>& attributes);
    static std::string CategorySetLine(const std::string& name, const std::string& label,
                                       const std::vector<std::string>& vars);
    static std::string DichotomySetLine(const std::string& name, const std::string& counted,
                                        const std::string& label,
                                        const std::vector<std::string>& vars);
    static std::string VariableSetLine(const std::string& name,
                                       const std::vector<std::string>& vars);

  private:
    class Out;
    struct CaseUnit {
        std::array<uint8_t, 8> bytes;  // machine order
        bool number;
    };

    // A dictionary record: a variable (rendered late, so that its settings
    // can be chained after it was added) or finished bytes.
    struct Record {
        int var;  // index into fVars, or -1
        Bytes bytes;
    };

    Bytes HeaderBytes() const;
    Bytes Dictionary() const;
    std::vector<std::vector<std::string>> SegmentNames() const;
    void WriteVar(Out& out, const Var& var, const std::vector<std::string>& segmentNames) const;
    void AppendCase(std::vector<CaseUnit>& units, const std::vector<Value>& row) const;
    Bytes CaseData() const;
    Bytes Compress(const std::vector<CaseUnit>& units) const;
    Bytes FileUnit(const CaseUnit& unit) const;

    Endian fEndian;
    Header fHeader;
    bool fCompressed = false;
    bool fWriteEnd = true;
    std::deque<Var> fVars;
    std::vector<Record> fRecords;
    std::vector<std::vector<Value>> fCases;
    mutable std::shared_ptr<TempDir> fTempDir;
};

}  // namespace fixture
