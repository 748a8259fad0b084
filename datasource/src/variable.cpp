#include "variable.h"

#include <algorithm>
#include <atomic>
#include <climits>
#include <cstring>

#include "qoramb.h"
#include "specialvalues.h"

namespace {

// Identities run 0, 16, 32, ... in order of creation; the low 4 bits are a
// tag that this library leaves 0, so -1 is never given out.
int32_t NextIdentity() {
    static std::atomic<uint32_t> counter{0};
    return static_cast<int32_t>(counter.fetch_add(1) << 4);
}

int DefaultColumnWidth(int type) {
    if (type == 0) return 8;
    return type <= 50 ? type : 50;
}

// The hexadecimal string format shows two columns per byte; it follows a
// retyped string while its width still fits in the narrow format word.
uint32_t RetypedFormat(uint32_t word, int type) {
    QORA_Format format = UnpackFormat(word);
    if (type >= 1 && format.code == 2 && 2 * type < 254) {
        format.width = 2 * type;
        return PackFormat(format);
    }
    return PackFormat(DefaultFormat(type));
}

uint64_t Bits(const void* value) {
    uint64_t bits;
    std::memcpy(&bits, value, sizeof bits);
    return bits;
}

double Number(const void* value) {
    double x;
    std::memcpy(&x, value, sizeof x);
    return x;
}

bool AllBlanks(const unsigned char* p, size_t n) {
    return std::all_of(p, p + n, [](unsigned char c) { return c == ' '; });
}

}  // namespace

uint32_t PackFormat(const QORA_Format& f) {
    const uint32_t low = f.width & 0xFF, high = (f.width >> 8) & 0xFF;
    if (f.code == 1) return (1u << 16) | (low << 8) | high;
    return (high << 24) | ((f.code & 0xFFu) << 16) | (low << 8) | (f.decimals & 0xFFu);
}

QORA_Format UnpackFormat(uint32_t word) {
    const int code = (word >> 16) & 0xFF;
    const int low = (word >> 8) & 0xFF;
    if (code == 1) return {code, low | static_cast<int>((word & 0xFF) << 8), 0};
    return {code, low, static_cast<int>(word & 0xFF)};
}

QORA_Format DefaultFormat(int type) {
    return type == 0 ? QORA_Format{5, 8, 2} : QORA_Format{1, type, 0};
}

std::string MakeLookupKey(const char* name, size_t length) {
    while (length > 0 && name[length - 1] == ' ') --length;
    if (length == 0) return std::string();
    char key[kKeySize + 1] = {};
    int error = 0;
    const int n =
        mbToUpper(name, static_cast<int>(std::min<size_t>(length, INT_MAX)), key, kKeySize, &error);
    return std::string(key, std::clamp(n, 0, static_cast<int>(kKeySize)));
}

QORA_VariableImpl::QORA_VariableImpl(int type)
    : fPrintFormat(PackFormat(DefaultFormat(type))),
      fWriteFormat(fPrintFormat),
      fType(static_cast<int16_t>(type)),
      fColumnWidth(static_cast<int16_t>(DefaultColumnWidth(type))),
      fMeasure(type == 0 ? 0 : 1),
      fAlign(type == 0 ? 1 : 0),
      fID(NextIdentity()) {}

QORA_Variable::QORA_Variable(int type) {
    QORA_ASSERT(0 <= type && type <= MAX_STRING_TYPE);
    fpImpl.Reset(new QORA_VariableImpl(type));
}

const QORA_VariableImpl& QORA_Variable::Impl() const {
    QORA_ASSERT(fpImpl.IsValid());
    return *fpImpl;
}

QORA_VariableImpl& QORA_Variable::Edit() {
    QORA_ASSERT(fpImpl.IsValid());
    return *fpImpl.Mutable();
}

void QORA_Variable::SetName(const char* name) {
    QORA_ASSERT(name != nullptr);
    SetName(name, std::strlen(name));
}

void QORA_Variable::SetName(const char* name, size_t length) {
    QORA_ASSERT(name != nullptr || length == 0);
    while (length > 0 && name[length - 1] == ' ') --length;
    QORA_VariableImpl& impl = Edit();
    impl.fName.assign(name, length);
    impl.fKey = MakeLookupKey(impl.fName.data(), impl.fName.size());
}

void QORA_Variable::SetType(int type) {
    QORA_ASSERT(0 <= type && type <= MAX_STRING_TYPE);
    if (type == GetType()) return;
    QORA_VariableImpl& impl = Edit();
    impl.fPrintFormat = RetypedFormat(impl.fPrintFormat, type);
    impl.fWriteFormat = RetypedFormat(impl.fWriteFormat, type);
    impl.fType = static_cast<int16_t>(type);
}

const char* QORA_Variable::GetLabel() const {
    const auto& label = Impl().fpLabel;
    return label ? label->c_str() : nullptr;
}

void QORA_Variable::SetLabel(const char* label) { SetLabel(label, label ? std::strlen(label) : 0); }

void QORA_Variable::SetLabel(const char* label, size_t length) {
    Edit().fpLabel = label ? std::make_shared<const std::string>(label, length) : nullptr;
}

int QORA_Variable::GetMissingValues(void* v1, void* v2, void* v3) const {
    const QORA_VariableImpl& impl = Impl();
    void* slots[kMissingSlots] = {v1, v2, v3};
    for (int k = 0; k < kMissingSlots; ++k)
        if (slots[k]) std::memcpy(slots[k], impl.fMissing[k], kMissingSlotSize);
    return impl.fMissingCode;
}

void QORA_Variable::SetMissingValues(int code, const void* v1, const void* v2, const void* v3) {
    QORA_ASSERT(IsValidMissingCode(code));
    const int n = code < 0 ? -code : code;
    QORA_ASSERT(n < 1 || v1);
    QORA_ASSERT(n < 2 || v2);
    QORA_ASSERT(n < 3 || v3);
    // Gathered first: the sources may be slots of a variable sharing this object.
    unsigned char slots[kMissingSlots][kMissingSlotSize] = {};
    const void* values[kMissingSlots] = {v1, v2, v3};
    for (int k = 0; k < n; ++k) std::memcpy(slots[k], values[k], kMissingSlotSize);
    QORA_VariableImpl& impl = Edit();
    std::memcpy(impl.fMissing, slots, sizeof slots);
    impl.fMissingCode = static_cast<int8_t>(code);
}

void QORA_Variable::SetMissingNumbers(const double* v1, const double* v2, const double* v3) {
    QORA_ASSERT(v1 == 0 || GetType() == 0);
    QORA_ASSERT(int(v2 != 0) >= int(v3 != 0));
    QORA_ASSERT(int(v1 != 0) >= int(v2 != 0));
    SetMissingValues(int(v1 != 0) + int(v2 != 0) + int(v3 != 0), v1, v2, v3);
}

void QORA_Variable::SetMissingStrings(const char* v1, const char* v2, const char* v3) {
    QORA_ASSERT(v1 == 0 || GetType() != 0);
    QORA_ASSERT(int(v2 != 0) >= int(v3 != 0));
    QORA_ASSERT(int(v1 != 0) >= int(v2 != 0));
    // Missing values compare as raw bytes with the first 8 bytes of a value,
    // so they are cut like values, not at character boundaries.
    unsigned char fields[kMissingSlots][kMissingSlotSize];
    const char* texts[kMissingSlots] = {v1, v2, v3};
    for (int k = 0; k < kMissingSlots; ++k) {
        std::memset(fields[k], ' ', kMissingSlotSize);
        if (texts[k]) std::memcpy(fields[k], texts[k], strnlen(texts[k], kMissingSlotSize));
    }
    SetMissingValues(int(v1 != 0) + int(v2 != 0) + int(v3 != 0), fields[0], fields[1], fields[2]);
}

void QORA_Variable::SetMissingRange(const double* low, const double* high, const double* value) {
    QORA_ASSERT(GetType() == 0);
    const double range[2] = {low ? *low : SysmisValue(), high ? *high : HighestValue()};
    SetMissingValues(value ? kMissingRangeAndValue : kMissingRange, &range[0], &range[1], value);
}

bool QORA_Variable::IsMissing(const void* value) const {
    const QORA_VariableImpl& impl = Impl();
    const int code = impl.fMissingCode;
    if (impl.fType != 0) {
        if (code < 1) return false;
        const auto* bytes = static_cast<const unsigned char*>(value);
        if (!AllBlanks(bytes + kMissingSlotSize, (ValueUnits() - 1) * size_t(kMissingSlotSize)))
            return false;
        for (int k = 0; k < code; ++k)
            if (std::memcmp(bytes, impl.fMissing[k], kMissingSlotSize) == 0) return true;
        return false;
    }
    const uint64_t bits = Bits(value);
    const double sysmis = SysmisValue();
    if (bits == Bits(&sysmis)) return true;
    if (code > 0) {
        for (int k = 0; k < code; ++k)
            if (bits == Bits(impl.fMissing[k])) return true;
        return false;
    }
    if (code == kMissingRangeAndValue && bits == Bits(impl.fMissing[2])) return true;
    if (code == kMissingRange || code == kMissingRangeAndValue) {
        const double x = Number(value);
        return Number(impl.fMissing[0]) <= x && x <= Number(impl.fMissing[1]);
    }
    return false;
}

QORA_VLMap QORA_Variable::GetValueLabels() const { return Impl().fValueLabels; }

void QORA_Variable::SetValueLabels(const QORA_VLMap& labels) {
    if (Impl().fValueLabels.SameObject(labels)) return;
    Edit().fValueLabels = labels;
}

void QORA_Variable::SetAttributes(const Attributes& attributes) { Edit().fAttributes = attributes; }

bool QORA_Variable::operator==(const QORA_Variable& other) const {
    QORA_ASSERT(other.fpImpl.IsValid());
    const QORA_VariableImpl& a = Impl();
    const QORA_VariableImpl& b = *other.fpImpl;
    if (&a == &b) return true;
    const bool labelsEqual =
        (!a.fpLabel && !b.fpLabel) || (a.fpLabel && b.fpLabel && *a.fpLabel == *b.fpLabel);
    const int code = a.fMissingCode < 0 ? -a.fMissingCode : a.fMissingCode;
    return a.fName == b.fName && a.fType == b.fType && labelsEqual &&
           a.fMissingCode == b.fMissingCode && a.fPrintFormat == b.fPrintFormat &&
           a.fWriteFormat == b.fWriteFormat && a.fColumnWidth == b.fColumnWidth &&
           a.fMeasure == b.fMeasure && a.fAlign == b.fAlign &&
           std::memcmp(a.fMissing, b.fMissing, code * size_t(kMissingSlotSize)) == 0 &&
           a.fValueLabels == b.fValueLabels && a.fAttributes == b.fAttributes;
}

namespace {

struct NumericFormatRule {
    int minWidth;
    bool decimals;
    int reserve;
};

// Rules of the formats a numeric variable may use, by code; null for codes
// that are not usable.
const NumericFormatRule* NumericRule(int code) {
    static const NumericFormatRule kRules[40] = {
        {},
        {},
        {},
        {1, true, 1},
        {2, true, 2},
        {1, true, 1},
        {},
        {},
        {},
        {},
        {},
        {},
        {},
        {},
        {},
        {},
        {},
        {6, true, 6},
        {},
        {},
        {9, false, 0},
        {5, true, 9},
        {17, true, 21},
        {8, false, 0},
        {5, false, 0},
        {8, true, 12},
        {2, false, 0},
        {3, false, 0},
        {6, false, 0},
        {6, false, 0},
        {8, false, 0},
        {2, true, 2},
        {1, true, 1},
        {1, true, 1},
        {1, true, 1},
        {1, true, 1},
        {1, true, 1},
        {1, true, 1},
        {8, false, 0},
        {8, true, 0},
    };
    if (code < 0 || code > 39 || kRules[code].minWidth == 0) return nullptr;
    return &kRules[code];
}

int ValidateStringFormat(int type, int& code, int& width, int& decimals, bool fix) {
    int result = 0;
    const int wanted = code == 1 ? type : 2 * type;
    if (code == 1 || (code == 2 && 2 * type < 32768)) {
        if (width != wanted) {
            result = 2;
            if (fix) width = wanted;
        }
    } else {
        if (fix) code = 1, width = type, decimals = 0;
        return 1;
    }
    if (decimals != 0) {
        if (result == 0) result = 3;
        if (fix) decimals = 0;
    }
    return result;
}

int ValidateNumericFormat(int& code, int& width, int& decimals, bool fix) {
    const NumericFormatRule* rule = NumericRule(code);
    if (!rule) {
        if (fix) code = 5, width = 8, decimals = 2;
        return 1;
    }
    int result = 0;
    if (width < rule->minWidth || width > 40) {
        result = 2;
        if (fix) width = width < rule->minWidth ? rule->minWidth : 40;
    }
    if (decimals == 0) return result;
    if (rule->decimals && decimals >= 0 && decimals < 17 && decimals <= width - rule->reserve)
        return result;
    if (result == 0) result = 3;
    if (fix) decimals = rule->decimals ? std::max(std::min(width - rule->reserve, 16), 0) : 0;
    return result;
}

}  // namespace

int QORA_Variable::ValidateFormat(int type, int& code, int& width, int& decimals, bool fix) {
    if (type < 0) return 0;
    if (type >= 1) return ValidateStringFormat(type, code, width, decimals, fix);
    return ValidateNumericFormat(code, width, decimals, fix);
}
