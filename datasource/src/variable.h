// A variable: one column of a data file, passed around by a copy-on-write
// handle. Copies share one object until one of them is changed.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "varimpl.h"

// A print or write format as (type code, width, decimals).
struct QORA_Format {
    int code;
    int width;
    int decimals;
    bool operator==(const QORA_Format& o) const {
        return code == o.code && width == o.width && decimals == o.decimals;
    }
};

// The 32-bit format word that a variable and the file hold. The string format
// (code 1) keeps the high byte of its width where other formats keep their
// decimals, so string widths up to 65535 fit.
uint32_t PackFormat(const QORA_Format& format);
QORA_Format UnpackFormat(uint32_t word);
QORA_Format DefaultFormat(int type);

// 8-byte value units taken by a variable of the given type.
inline int ValueUnits(int type) { return type <= 8 ? 1 : (type + 7) / 8; }

// The lookup key of a name: upper case, at most kKeySize bytes.
enum { kKeySize = 128 };
std::string MakeLookupKey(const char* name, size_t length);

class QORA_Variable : public QORA_Variable_Enumerations {
  public:
    // An invalid handle.
    QORA_Variable() = default;
    // A new variable of the type (0 numeric, else the string width).
    explicit QORA_Variable(int type);

    // Checked forms of the preconditions that a file can reach.
    static bool IsValidType(int type) { return 0 <= type && type <= MAX_STRING_TYPE; }
    static bool IsValidMissingCode(int code) { return -3 <= code && code <= 3 && code != -1; }

    bool IsValid() const { return fpImpl.IsValid(); }
    int32_t GetID() const { return Impl().fID; }

    const std::string& GetName() const { return Impl().fName; }
    const std::string& GetKey() const { return Impl().fKey; }
    void SetName(const char* name);
    void SetName(const char* name, size_t length);

    int GetType() const { return Impl().fType; }
    bool IsString() const { return GetType() != 0; }
    int ValueUnits() const { return ::ValueUnits(GetType()); }
    void SetType(int type);

    QORA_Format GetPrintFormat() const { return UnpackFormat(Impl().fPrintFormat); }
    QORA_Format GetWriteFormat() const { return UnpackFormat(Impl().fWriteFormat); }
    uint32_t GetPrintFormatWord() const { return Impl().fPrintFormat; }
    uint32_t GetWriteFormatWord() const { return Impl().fWriteFormat; }
    void SetPrintFormat(const QORA_Format& format) { SetPrintFormatWord(PackFormat(format)); }
    void SetWriteFormat(const QORA_Format& format) { SetWriteFormatWord(PackFormat(format)); }
    void SetPrintFormatWord(uint32_t word) { Edit().fPrintFormat = word; }
    void SetWriteFormatWord(uint32_t word) { Edit().fWriteFormat = word; }

    // Null when the variable has no label; valid while a variable holds the label.
    const char* GetLabel() const;
    void SetLabel(const char* label);
    void SetLabel(const char* label, size_t length);

    // Missing values. Slots are 8 bytes: doubles for a numeric variable,
    // blank-padded bytes for a string.
    int GetMissingCode() const { return Impl().fMissingCode; }
    // Copies slot k (0-based) into each non-null destination; returns the code.
    int GetMissingValues(void* v1, void* v2, void* v3) const;
    // Stores the code as given and copies |code| slots from v1, v2, v3.
    void SetMissingValues(int code, const void* v1, const void* v2, const void* v3);
    // Up to three discrete values; a later one needs every earlier one.
    void SetMissingNumbers(const double* v1, const double* v2, const double* v3);
    void SetMissingStrings(const char* v1, const char* v2, const char* v3);
    // A range; no low means the system-missing value, no high the largest double.
    void SetMissingRange(const double* low, const double* high, const double* value);
    // value points at the variable's value units.
    bool IsMissing(const void* value) const;

    int GetMeasureLevel() const { return Impl().fMeasure; }
    void SetMeasureLevel(int level) { Edit().fMeasure = level & 3; }
    int GetAlignment() const { return Impl().fAlign; }
    void SetAlignment(int alignment) { Edit().fAlign = alignment & 3; }
    int GetColumnWidth() const { return Impl().fColumnWidth; }
    void SetColumnWidth(int16_t width) { Edit().fColumnWidth = width; }

    QORA_VLMap GetValueLabels() const;
    void SetValueLabels(const QORA_VLMap& labels);

    // Changed by setting a changed copy: a reference into the shared object
    // would outlive the next copy of the handle.
    const Attributes& GetAttributes() const { return Impl().fAttributes; }
    void SetAttributes(const Attributes& attributes);

    // Properties alike; the identity does not take part.
    bool operator==(const QORA_Variable& other) const;
    bool operator!=(const QORA_Variable& other) const { return !(*this == other); }

    // Checks a proposed format for a variable type and, with fix, corrects it.
    // 0 acceptable, 1 code not allowed for the type, 2 width corrected,
    // 3 only decimals corrected.
    static int ValidateFormat(int type, int& code, int& width, int& decimals, bool fix);

  private:
    const QORA_VariableImpl& Impl() const;
    QORA_VariableImpl& Edit();

    QORA_CowRef<QORA_VariableImpl> fpImpl;
};
