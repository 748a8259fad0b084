#include "case.h"

#include <algorithm>
#include <climits>
#include <cstring>

#include "datasrc.h"
#include "dserror.h"
#include "qoramb.h"

QORA_Case::QORA_Case(QORA_DataSource& source, void* buffer) : fpSource(&source) {
    if (buffer == nullptr) {
        fpOwned.reset(new double[static_cast<size_t>(std::max(source.ValueCount(), 1))]());
        buffer = fpOwned.get();
    }
    fpBuffer = buffer;
}

QORA_Case::~QORA_Case() = default;

void* QORA_Case::ValuePointer(int index) const {
    QORA_ASSERT(0 <= index);
    return static_cast<char*>(fpBuffer) + static_cast<size_t>(fpSource->ValueOffset(index)) * 8;
}

void QORA_Case::SetNumeric(int index, double value) {
    QORA_ASSERT(fpSource->IsValidIndex(index));
    std::memcpy(ValuePointer(index), &value, sizeof value);
}

void QORA_Case::SetString(int index, const char* text, size_t length) {
    const int tgtlen = fpSource->GetVariable(index).GetType();
    QORA_ASSERT(tgtlen > 0);
    if (text == nullptr) length = 0;
    char* value = static_cast<char*>(ValuePointer(index));
    const size_t units = static_cast<size_t>(ValueUnits(tgtlen));
    mbCopyPadded(value, static_cast<size_t>(tgtlen), text ? text : "",
                 static_cast<int>(std::min<size_t>(length, INT_MAX)));
    std::memset(value + tgtlen, ' ', units * 8 - static_cast<size_t>(tgtlen));
}

void QORA_Case::SetString(int index, const char* text) {
    SetString(index, text, text ? std::strlen(text) : 0);
}

void QORA_Case::Clear(int first, int last) {
    QORA_ASSERT(0 <= first && first <= last + 1);
    fpSource->ClearValues(fpBuffer, first, last - first + 1);
}

void QORA_Case::ClearAll() { fpSource->ClearValues(fpBuffer, 0, fpSource->ColumnCount()); }

QORA_InputCaseIterator::QORA_InputCaseIterator(QORA_DataSource& source, void* buffer)
    : fCase(source, buffer) {
    source.NotifyIteratorCreated(this);
}

void QORA_InputCaseIterator::ForwardSetting(int32_t value) {
    fCase.SetSetting(value);
    if (fCase.GetLink() != nullptr) fCase.GetLink()->ForwardSetting(value);
}

void QORA_InputCaseIterator::Link(QORA_InputCaseIterator* other) {
    fCase.SetLink(other);
    if (other != nullptr) other->ForwardSetting(fCase.GetSetting());
}

bool QORA_InputCaseIterator::ReadCaseInto(void* units) {
    void* const own = fCase.Buffer();
    fCase.SetBuffer(units);
    try {
        const bool read = ReadCase();
        fCase.SetBuffer(own);
        return read;
    } catch (...) {
        fCase.SetBuffer(own);
        throw;
    }
}
