// The abstract data source: a dictionary and the cases it delivers.
// (A first outline; the dictionary model fills it in.)
#pragma once

#include <cstdint>

class QORA_InputCaseIterator;

class QORA_DataSource {
public:
    virtual ~QORA_DataSource();
    // A new iterator over this source's cases, owned by the caller. buffer is
    // an optional caller-owned area of ValueCount() 8-byte units.
    virtual QORA_InputCaseIterator* NewIterator(void* buffer) = 0;
    // Value units per case.
    virtual int ValueCount() const;
    // Number of cases; -1 when unknown.
    virtual int64_t CaseCount() const;
};
