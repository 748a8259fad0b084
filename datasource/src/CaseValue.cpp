#include "CaseValue.h"

#include <cstring>

#include "case.h"
#include "datasrc.h"
#include "dserror.h"
#include "qoramb.h"
#include "specialvalues.h"

CaseValue::CaseValue(QORA_InputCaseIterator& iterator, int index) : _index(index) {
    Refresh(iterator);
}

void CaseValue::Refresh(QORA_InputCaseIterator& iterator) {
    _pVariable = &iterator.DataSource().GetVariable(_index);
    _pValue = iterator.ValuePointer(_index);
    _type = static_cast<uint16_t>(_pVariable->GetType());
}

void CaseValue::BlankLastUnit() const {
    char* last = static_cast<char*>(_pValue) + (ValueUnits(_type) - 1) * 8;
    std::memset(last, ' ', 8);
}

void CaseValue::SetRaw(const void* value) {
    QORA_ASSERT(_pValue);
    if (_type == 0) {
        std::memcpy(_pValue, value, 8);
        return;
    }
    BlankLastUnit();
    std::memcpy(_pValue, value, _type);
}

void CaseValue::SetString(const char* text) {
    QORA_ASSERT(_type != 0);
    QORA_ASSERT(_pValue);
    BlankLastUnit();
    mbCopyPadded(static_cast<char*>(_pValue), _type, text ? text : "",
                 text ? static_cast<int>(std::strlen(text)) : 0);
}

void CaseValue::SetNumeric(double value) {
    QORA_ASSERT(_type == 0);
    QORA_ASSERT(_pValue);
    std::memcpy(_pValue, &value, sizeof value);
}

bool CaseValue::IsSysmisOrBlank() const {
    QORA_ASSERT(_pValue);
    if (_type == 0) {
        double value;
        std::memcpy(&value, _pValue, sizeof value);
        return value == SysmisValue();
    }
    const char* bytes = static_cast<const char*>(_pValue);
    for (int k = 0; k < _type; ++k)
        if (bytes[k] != ' ') return false;
    return true;
}

bool CaseValue::IsMissing() const {
    QORA_ASSERT(_pValue && _pVariable);
    return _pVariable->IsMissing(_pValue);
}
