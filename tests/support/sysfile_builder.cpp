#include "sysfile_builder.h"

#include <stdlib.h>

#include <algorithm>
#include <cctype>
#include <cmath>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <set>
#include <stdexcept>

namespace fixture {

namespace {

constexpr size_t kHeaderSize = 176;
constexpr int kMaxShortString = 255;
constexpr int kSegmentChars = 252;  // string bytes a full segment stands for

std::string Padded(std::string text, size_t width) {
    text.resize(width, ' ');
    return text;
}

// Value units of one string variable record of the given width.
int StringUnits(int width) { return width <= 8 ? 1 : (width + 7) / 8; }

std::string Joined(const std::vector<std::string>& parts, const std::string& separator) {
    std::string text;
    for (size_t i = 0; i < parts.size(); ++i) text += (i ? separator : "") + parts[i];
    return text;
}

std::string Lines(const std::vector<std::string>& lines) {
    std::string text;
    for (const std::string& line : lines) text += line + "\n";
    return text;
}

}  // namespace

// Emits numbers in the builder's byte order and text as it is.
class SysFileBuilder::Out {
  public:
    explicit Out(bool swap) : fSwap(swap) {}

    void Raw(const void* data, size_t size) {
        const uint8_t* p = static_cast<const uint8_t*>(data);
        bytes.insert(bytes.end(), p, p + size);
    }
    void Number(const void* data, size_t size) {
        Raw(data, size);
        if (fSwap) std::reverse(bytes.end() - size, bytes.end());
    }
    void I32(int32_t value) { Number(&value, sizeof value); }
    void I64(int64_t value) { Number(&value, sizeof value); }
    void F64(double value) { Number(&value, sizeof value); }
    void Byte(uint8_t value) { bytes.push_back(value); }
    void Text(const std::string& text) { Raw(text.data(), text.size()); }
    void Text(const std::string& text, size_t width) { Text(Padded(text, width)); }
    void Append(const Bytes& more) { bytes.insert(bytes.end(), more.begin(), more.end()); }
    void ValueUnit(const Value& value) {
        if (value.IsString())
            Text(value.Text(), 8);
        else
            F64(value.Number());
    }

    Bytes bytes;

  private:
    bool fSwap;
};

std::string EndianName(const ::testing::TestParamInfo<Endian>& info) {
    return info.param == Endian::Native ? "Native" : "Swapped";
}

double FromBits(uint64_t bits) {
    double value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

const double kSysmis = FromBits(0xFFEFFFFFFFFFFFFFull);
const double kHighest = FromBits(0x7FEFFFFFFFFFFFFFull);
const double kLowest = FromBits(0xFFEFFFFFFFFFFFFEull);

uint32_t FormatWord(int type, int width, int decimals) {
    return (uint32_t(width >> 8 & 0xFF) << 24) | (uint32_t(type & 0xFF) << 16) |
           (uint32_t(width & 0xFF) << 8) | uint32_t(decimals & 0xFF);
}

uint32_t StringFormat(int width) {
    return (1u << 16) | (uint32_t(width & 0xFF) << 8) | uint32_t(width >> 8 & 0xFF);
}

TempDir::TempDir() {
    std::string test = "outside-test";
    if (const auto* info = ::testing::UnitTest::GetInstance()->current_test_info())
        test = std::string(info->test_suite_name()) + "." + info->name();
    std::replace(test.begin(), test.end(), '/', '_');
    std::string pattern = ::testing::TempDir() + "qora-" + test + "-XXXXXX";
    if (!mkdtemp(pattern.data())) throw std::runtime_error("cannot create " + pattern);
    fPath = pattern;
}

TempDir::~TempDir() {
    std::error_code ignored;
    std::filesystem::remove_all(fPath, ignored);
}

Bytes Truncated(Bytes bytes, size_t size) {
    bytes.resize(std::min(size, bytes.size()));
    return bytes;
}

void Patch(Bytes& bytes, size_t offset, const Bytes& with) {
    if (offset + with.size() > bytes.size()) throw std::out_of_range("patch past the end");
    std::copy(with.begin(), with.end(), bytes.begin() + offset);
}

Var::Var(std::string name, int width, int slot)
    : fName(std::move(name)), fWidth(width), fSlot(slot) {}

int Var::Units() const {
    if (fWidth == 0) return 1;
    if (fWidth <= kMaxShortString) return StringUnits(fWidth);
    return (fWidth / kSegmentChars * 256 + fWidth % kSegmentChars + 7) / 8;
}

Var& Var::Label(std::string label) {
    fLabel = std::move(label);
    return *this;
}

Var& Var::LongName(std::string name) {
    fLongName = std::move(name);
    return *this;
}

Var& Var::Formats(uint32_t print, uint32_t write) {
    fPrint = print;
    fWrite = write;
    return *this;
}

Var& Var::Missing(std::vector<double> discrete) {
    return MissingRaw(int32_t(discrete.size()), {discrete.begin(), discrete.end()});
}

Var& Var::MissingRange(double low, double high) { return MissingRaw(-2, {low, high}); }

Var& Var::MissingRange(double low, double high, double discrete) {
    return MissingRaw(-3, {low, high, discrete});
}

Var& Var::MissingStrings(std::vector<std::string> discrete) {
    return MissingRaw(int32_t(discrete.size()), {discrete.begin(), discrete.end()});
}

Var& Var::MissingRaw(int32_t code, std::vector<Value> values) {
    fMissingCode = code;
    fMissing = std::move(values);
    return *this;
}

Var& Var::TypeField(int32_t type) {
    fTypeField = type;
    return *this;
}

Var& Var::LabelLengthField(int32_t length) {
    fLabelLengthField = length;
    return *this;
}

Var& Var::Continuations(int count) {
    fContinuations = count;
    return *this;
}

SysFileBuilder::SysFileBuilder(Endian endian) : fEndian(endian) {}

SysFileBuilder& SysFileBuilder::Compressed(bool on) {
    fCompressed = on;
    return *this;
}

SysFileBuilder& SysFileBuilder::Weight(const Var& var) {
    fHeader.weightIndex = var.Slot();
    return *this;
}

Var& SysFileBuilder::Numeric(std::string name) { return String(std::move(name), 0); }

Var& SysFileBuilder::String(std::string name, int width) {
    if (width < 0) throw std::invalid_argument("negative width");
    fVars.push_back(Var(std::move(name), width, CaseUnits() + 1));
    fRecords.push_back({int(fVars.size()) - 1, {}});
    return fVars.back();
}

const Var& SysFileBuilder::Variable(const std::string& name) const {
    for (const Var& var : fVars)
        if (var.Name() == name) return var;
    throw std::invalid_argument("no variable " + name);
}

int SysFileBuilder::CaseUnits() const {
    int units = 0;
    for (const Var& var : fVars) units += var.Units();
    return units;
}

Bytes SysFileBuilder::HeaderBytes() const {
    Out out(fEndian == Endian::Swapped);
    out.Text(fHeader.magic, 4);
    out.Text(fHeader.product, 60);
    out.I32(fHeader.layoutCode);
    out.I32(fHeader.caseSize.value_or(CaseUnits()));
    out.I32(fHeader.compression.value_or(fCompressed ? 1 : 0));
    out.I32(fHeader.weightIndex);
    out.I32(fHeader.caseCount.value_or(int32_t(fCases.size())));
    out.F64(fHeader.bias);
    out.Text(fHeader.date, 9);
    out.Text(fHeader.time, 8);
    out.Text(fHeader.label, 64);
    out.Raw("\0\0\0", 3);
    return out.bytes;
}

// A variable is one record per segment (one segment unless it is a very long
// string), each followed by its continuation records. The label goes to every
// segment, the missing values and the overrides to the first record.
void SysFileBuilder::WriteVar(Out& out, const Var& var,
                              const std::vector<std::string>& segmentNames) const {
    std::vector<int> segments{var.fWidth};
    if (var.fWidth > kMaxShortString) {
        segments.assign(var.fWidth / kSegmentChars, kMaxShortString);
        if (var.fWidth % kSegmentChars) segments.push_back(var.fWidth % kSegmentChars);
    }
    for (size_t s = 0; s < segments.size(); ++s) {
        const int width = segments[s];
        const bool first = s == 0;
        const uint32_t format = width == 0 ? FormatWord(5, 8, 2) : StringFormat(width);
        // Every segment is a copy of its variable: each carries the label.
        const bool hasLabel = var.fLabel.has_value();
        out.I32(2);
        out.I32(first && var.fTypeField ? *var.fTypeField : width);
        out.I32(hasLabel);
        out.I32(first ? var.fMissingCode : 0);
        out.I32(first && var.fPrint ? *var.fPrint : format);
        out.I32(first && var.fWrite ? *var.fWrite : format);
        out.Text(first ? var.fName : segmentNames[s - 1], 8);
        if (hasLabel) {
            const std::string& label = *var.fLabel;
            out.I32(var.fLabelLengthField.value_or(int32_t(label.size())));
            out.Text(label, (label.size() + 3) / 4 * 4);
        }
        if (first)
            for (const Value& missing : var.fMissing) out.ValueUnit(missing);

        const int continuations = first && var.fContinuations && segments.size() == 1
                                      ? *var.fContinuations
                                      : (width == 0 ? 0 : StringUnits(width) - 1);
        for (int c = 0; c < continuations; ++c) {
            for (int32_t field : {2, -1, 0, 0, 0x00011D01, 0x00011D01}) out.I32(field);
            out.Text("", 8);
        }
    }
}

SysFileBuilder& SysFileBuilder::ValueLabels(std::vector<std::pair<Value, std::string>> labels,
                                            std::vector<int32_t> slots) {
    ValueLabelSet set;
    set.labels = std::move(labels);
    set.slots = std::move(slots);
    return ValueLabels(std::move(set));
}

SysFileBuilder& SysFileBuilder::ValueLabels(ValueLabelSet set) {
    Out out(fEndian == Endian::Swapped);
    out.I32(3);
    out.I32(set.labelCount.value_or(int32_t(set.labels.size())));
    for (const auto& [value, label] : set.labels) {
        out.ValueUnit(value);
        const size_t length = std::min<size_t>(label.size(), 255);
        out.Byte(uint8_t(length));
        // Length byte, label and padding fill whole 8-byte units.
        out.Text(label.substr(0, length), (length + 8) / 8 * 8 - 1);
    }
    if (!set.omitSecond) {
        out.I32(set.secondType);
        out.I32(set.variableCount.value_or(int32_t(set.slots.size())));
        for (int32_t slot : set.slots) out.I32(slot);
    }
    return RawRecord(out.bytes);
}

SysFileBuilder& SysFileBuilder::Documents(std::vector<std::string> lines,
                                          std::optional<int32_t> lineCount) {
    Out out(fEndian == Endian::Swapped);
    out.I32(6);
    out.I32(lineCount.value_or(int32_t(lines.size())));
    for (const std::string& line : lines) out.Text(line, 80);
    return RawRecord(out.bytes);
}

SysFileBuilder& SysFileBuilder::Extension(int32_t subtype, int32_t unitSize, int32_t unitCount,
                                          Bytes contents) {
    Out out(fEndian == Endian::Swapped);
    for (int32_t field : {7, subtype, unitSize, unitCount}) out.I32(field);
    out.Append(contents);
    return RawRecord(out.bytes);
}

SysFileBuilder& SysFileBuilder::Extension(int32_t subtype, int32_t unitSize, Bytes contents) {
    const int32_t count = unitSize > 0 ? int32_t(contents.size() / unitSize) : 0;
    return Extension(subtype, unitSize, count, std::move(contents));
}

SysFileBuilder& SysFileBuilder::TextExtension(int32_t subtype, const std::string& text) {
    return Extension(subtype, 1, Bytes(text.begin(), text.end()));
}

SysFileBuilder& SysFileBuilder::IntegerInfo(std::array<int32_t, 8> units) {
    return Extension(3, 4, Int32s({units.begin(), units.end()}));
}

SysFileBuilder& SysFileBuilder::FloatInfo(double sysmis, double highest, double lowest) {
    Out out(fEndian == Endian::Swapped);
    for (double value : {sysmis, highest, lowest}) out.F64(value);
    return Extension(4, 8, out.bytes);
}

SysFileBuilder& SysFileBuilder::DateInfo(std::vector<int32_t> elements) {
    return Extension(6, 4, Int32s(elements));
}

SysFileBuilder& SysFileBuilder::DisplayParams(std::vector<std::array<int32_t, 3>> levelWidthAlign) {
    std::vector<int32_t> units;
    for (const auto& triple : levelWidthAlign)
        units.insert(units.end(), triple.begin(), triple.end());
    return Extension(11, 4, Int32s(units));
}

SysFileBuilder& SysFileBuilder::LongNames(
    std::vector<std::pair<std::string, std::string>> shortLong) {
    std::vector<std::string> entries;
    for (const auto& [shortName, longName] : shortLong)
        entries.push_back(shortName + "=" + longName);
    return TextExtension(13, Joined(entries, "\t"));
}

SysFileBuilder& SysFileBuilder::LongNames() {
    std::vector<std::pair<std::string, std::string>> pairs;
    for (const Var& var : fVars)
        pairs.emplace_back(var.fName.substr(0, 8),
                           var.fLongName.empty() ? var.fName : var.fLongName);
    return LongNames(pairs);
}

SysFileBuilder& SysFileBuilder::VeryLongStrings(
    std::vector<std::pair<std::string, int>> nameWidth) {
    std::string text;
    for (const auto& [name, width] : nameWidth)
        text += name + "=" + std::to_string(width) + std::string("\0\t", 2);
    return TextExtension(14, text);
}

SysFileBuilder& SysFileBuilder::VeryLongStrings() {
    std::vector<std::pair<std::string, int>> pairs;
    for (const Var& var : fVars)
        if (var.fWidth > kMaxShortString) pairs.emplace_back(var.fName.substr(0, 8), var.fWidth);
    return VeryLongStrings(pairs);
}

SysFileBuilder& SysFileBuilder::CaseCount64(int64_t count, int64_t marker) {
    Out out(fEndian == Endian::Swapped);
    out.I64(marker);
    out.I64(count);
    return Extension(16, 8, out.bytes);
}

SysFileBuilder& SysFileBuilder::FileAttributes(const std::string& text) {
    return TextExtension(17, text);
}

SysFileBuilder& SysFileBuilder::VariableAttributes(
    std::vector<std::pair<std::string, std::string>> nameText) {
    std::vector<std::string> items;
    for (const auto& [name, text] : nameText) items.push_back(name + ":" + text);
    return TextExtension(18, Joined(items, "/"));
}

SysFileBuilder& SysFileBuilder::Encoding(const std::string& name) {
    return TextExtension(20, name);
}

SysFileBuilder& SysFileBuilder::LongValueLabelsRecord(std::vector<LongValueLabels> entries) {
    Out out(fEndian == Endian::Swapped);
    for (const LongValueLabels& entry : entries) {
        out.I32(int32_t(entry.name.size()));
        out.Text(entry.name);
        out.I32(entry.width);
        out.I32(int32_t(entry.labels.size()));
        for (const auto& [value, label] : entry.labels) {
            out.I32(int32_t(value.size()));
            out.Text(value);
            out.I32(int32_t(label.size()));
            out.Text(label);
        }
    }
    return Extension(21, 1, out.bytes);
}

SysFileBuilder& SysFileBuilder::MultipleResponseSets(std::vector<std::string> lines) {
    return TextExtension(7, Lines(lines));
}

SysFileBuilder& SysFileBuilder::ExtendedMultipleResponseSets(std::vector<std::string> lines) {
    return TextExtension(19, Lines(lines));
}

SysFileBuilder& SysFileBuilder::VariableSets(std::vector<std::string> lines) {
    return TextExtension(5, Lines(lines));
}

SysFileBuilder& SysFileBuilder::RawRecord(Bytes bytes) {
    fRecords.push_back({-1, std::move(bytes)});
    return *this;
}

SysFileBuilder& SysFileBuilder::EndRecord(bool write) {
    fWriteEnd = write;
    return *this;
}

// Segments after the first are named, as a writer names them, from the first
// five bytes of the upper-case name the variable is known by and a base-36
// counter, skipping every name of the dictionary and every name given
// before; the last very long string is named first.
std::vector<std::vector<std::string>> SysFileBuilder::SegmentNames() const {
    auto upper = [](std::string text) {
        for (char& c : text) c = char(std::toupper(static_cast<unsigned char>(c)));
        return text;
    };
    std::set<std::string> used;
    for (const Var& var : fVars) used.insert({upper(var.fName), upper(var.fLongName)});
    std::vector<std::vector<std::string>> names(fVars.size());
    for (size_t i = fVars.size(); i-- > 0;) {
        const Var& var = fVars[i];
        if (var.fWidth <= kMaxShortString) continue;
        const std::string base =
            upper(var.fLongName.empty() ? var.fName : var.fLongName).substr(0, 5);
        const int later = (var.fWidth + kSegmentChars - 1) / kSegmentChars - 1;
        for (unsigned counter = 0; int(names[i].size()) < later; ++counter) {
            std::string digits;
            for (unsigned n = counter; digits.empty() || n > 0; n /= 36)
                digits.insert(digits.begin(), "0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZ"[n % 36]);
            if (used.insert(base + digits).second) names[i].push_back(base + digits);
        }
    }
    return names;
}

Bytes SysFileBuilder::Dictionary() const {
    Out out(fEndian == Endian::Swapped);
    const std::vector<std::vector<std::string>> segmentNames = SegmentNames();
    for (const Record& record : fRecords) {
        if (record.var >= 0)
            WriteVar(out, fVars[record.var], segmentNames[size_t(record.var)]);
        else
            out.Append(record.bytes);
    }
    if (fWriteEnd) {
        out.I32(999);
        out.I32(0);
    }
    return out.bytes;
}

SysFileBuilder& SysFileBuilder::Case(std::vector<Value> values) {
    if (values.size() != fVars.size())
        throw std::invalid_argument("a case needs one value per variable");
    fCases.push_back(std::move(values));
    return *this;
}

void SysFileBuilder::AppendCase(std::vector<CaseUnit>& units, const std::vector<Value>& row) const {
    auto addText = [&units](const std::string& text) {
        for (size_t at = 0; at < text.size(); at += 8) {
            CaseUnit unit{{}, false};
            std::memcpy(unit.bytes.data(), text.data() + at, 8);
            units.push_back(unit);
        }
    };
    for (size_t i = 0; i < fVars.size(); ++i) {
        const Var& var = fVars[i];
        const Value& value = row[i];
        const size_t width = var.fWidth == 0 ? 8 : var.fWidth;
        if (!value.IsString()) {
            CaseUnit unit{{}, true};
            const double number = value.Number();
            std::memcpy(unit.bytes.data(), &number, 8);
            units.push_back(unit);
            addText(std::string((var.Units() - 1) * 8, ' '));
        } else if (var.fWidth <= kMaxShortString) {
            addText(Padded(value.Text().substr(0, width), var.Units() * 8));
        } else {
            // Each full segment carries 255 bytes and a blank; the last
            // segment carries what is left.
            const std::string text = value.Text().substr(0, var.fWidth);
            const size_t full = var.fWidth / kSegmentChars;
            for (size_t s = 0; s < full; ++s)
                addText(Padded(text.substr(std::min(text.size(), s * 255), 255), 256));
            if (var.fWidth % kSegmentChars) {
                const int lastUnits = StringUnits(var.fWidth % kSegmentChars);
                addText(Padded(text.substr(std::min(text.size(), full * 255)), lastUnits * 8));
            }
        }
    }
}

Bytes SysFileBuilder::FileUnit(const CaseUnit& unit) const {
    Bytes bytes(unit.bytes.begin(), unit.bytes.end());
    if (unit.number && fEndian == Endian::Swapped) std::reverse(bytes.begin(), bytes.end());
    return bytes;
}

namespace {

// The code of one unit (machine order): a whole number from -99 to 151 is
// stored in its control byte, system-missing and eight blanks have codes of
// their own, everything else follows the control bytes raw.
uint8_t CompressionCode(const std::array<uint8_t, 8>& bytes) {
    if (std::all_of(bytes.begin(), bytes.end(), [](uint8_t b) { return b == ' '; })) return 254;
    uint64_t bits;
    std::memcpy(&bits, bytes.data(), 8);
    if (bits == 0xFFEFFFFFFFFFFFFFull) return 255;
    const double value = FromBits(bits);
    const bool whole = std::trunc(value) == value && !(value == 0.0 && std::signbit(value));
    if (whole && value >= -99.0 && value <= 151.0) return uint8_t(value + 100.0);
    return 253;
}

}  // namespace

Bytes SysFileBuilder::Compress(const std::vector<CaseUnit>& units) const {
    Bytes data;
    for (size_t first = 0; first < units.size(); first += 8) {
        std::array<uint8_t, 8> codes{};  // unused codes stay 0 (padding)
        Bytes raws;
        for (size_t i = 0; i < 8 && first + i < units.size(); ++i) {
            codes[i] = CompressionCode(units[first + i].bytes);
            if (codes[i] == 253) {
                Bytes raw = FileUnit(units[first + i]);
                raws.insert(raws.end(), raw.begin(), raw.end());
            }
        }
        data.insert(data.end(), codes.begin(), codes.end());
        data.insert(data.end(), raws.begin(), raws.end());
    }
    return data;
}

Bytes SysFileBuilder::CaseData() const {
    std::vector<CaseUnit> units;
    for (const auto& row : fCases) AppendCase(units, row);
    if (fCompressed) return Compress(units);
    Bytes data;
    for (const CaseUnit& unit : units) {
        const Bytes raw = FileUnit(unit);
        data.insert(data.end(), raw.begin(), raw.end());
    }
    return data;
}

Bytes SysFileBuilder::Int32(int32_t value) const { return Int32s({value}); }

Bytes SysFileBuilder::Int32s(const std::vector<int32_t>& values) const {
    Out out(fEndian == Endian::Swapped);
    for (int32_t value : values) out.I32(value);
    return out.bytes;
}

Bytes SysFileBuilder::Int64(int64_t value) const {
    Out out(fEndian == Endian::Swapped);
    out.I64(value);
    return out.bytes;
}

Bytes SysFileBuilder::Unit(const Value& value) const {
    Out out(fEndian == Endian::Swapped);
    out.ValueUnit(value);
    return out.bytes;
}

Bytes SysFileBuilder::Build() const {
    Bytes file = HeaderBytes();
    for (const Bytes& part : {Dictionary(), CaseData()})
        file.insert(file.end(), part.begin(), part.end());
    return file;
}

size_t SysFileBuilder::DataStart() const { return kHeaderSize + Dictionary().size(); }

std::string SysFileBuilder::WriteTemp(const std::string& fileName) const {
    return WriteTemp(Build(), fileName);
}

std::string SysFileBuilder::WriteTemp(const Bytes& bytes, const std::string& fileName) const {
    if (!fTempDir) fTempDir = std::make_shared<TempDir>();
    const std::string path = fTempDir->Path() + "/" + fileName;
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(reinterpret_cast<const char*>(bytes.data()), std::streamsize(bytes.size()));
    if (!file.flush()) throw std::runtime_error("cannot write " + path);
    return path;
}

std::string SysFileBuilder::AttributeText(
    const std::vector<std::pair<std::string, std::vector<std::string>>>& attributes) {
    std::string text;
    for (const auto& [name, values] : attributes) {
        if (values.empty()) continue;
        text += name + "(";
        for (const std::string& value : values) text += "'" + value + "'\n";
        text += ")";
    }
    return text;
}

std::string SysFileBuilder::CategorySetLine(const std::string& name, const std::string& label,
                                            const std::vector<std::string>& vars) {
    return name + "=C " + std::to_string(label.size()) + " " + label + " " + Joined(vars, " ");
}

std::string SysFileBuilder::DichotomySetLine(const std::string& name, const std::string& counted,
                                             const std::string& label,
                                             const std::vector<std::string>& vars) {
    return name + "=D" + std::to_string(counted.size()) + " " + counted + " " +
           std::to_string(label.size()) + " " + label + " " + Joined(vars, " ");
}

std::string SysFileBuilder::VariableSetLine(const std::string& name,
                                            const std::vector<std::string>& vars) {
    return name + "= " + Joined(vars, " ");
}

}  // namespace fixture
