// A view of one variable's value units inside an iterator's current case,
// with typed setters and the missing-value tests.
#pragma once

#include <cstdint>

class QORA_InputCaseIterator;
class QORA_Variable;

class CaseValue {
  public:
    // A detached view for a variable index: no value, no variable, numeric.
    explicit CaseValue(int index = -1) : _index(index) {}
    CaseValue(QORA_InputCaseIterator& iterator, int index);

    // Takes the value pointer again, after the iterator moved to another case
    // or the view was detached.
    void Refresh(QORA_InputCaseIterator& iterator);

    int Index() const { return _index; }
    int Type() const { return _type; }
    void* Value() const { return _pValue; }

    // A number is 8 bytes; a string is exactly its width in bytes, and the
    // bytes of its last unit beyond the width become blanks.
    void SetRaw(const void* value);
    // Precondition: a string. Keeps the longest whole-character prefix that
    // fits the width and blanks the rest.
    void SetString(const char* text);
    // Precondition: a number.
    void SetNumeric(double value);

    // System-missing for a number (a NaN is not), all blanks for a string.
    bool IsSysmisOrBlank() const;
    // User- or system-missing by the variable's missing values.
    bool IsMissing() const;

  private:
    void BlankLastUnit() const;

    void* _pValue = nullptr;
    const QORA_Variable* _pVariable = nullptr;
    int32_t _index;
    uint16_t _type = 0;
};
