// Type 7 extension records: the record in memory, the handlers that turn a
// known subtype into dictionary properties and back, and the registry that
// maps subtypes to handlers. A subtype without a handler is kept verbatim in
// the dictionary and written out again unchanged.
#pragma once

#include <cstdint>
#include <cstring>
#include <memory>
#include <string>

#include "byteorder.h"
#include "dserror.h"

class QORA_DataSource;
struct HeaderSettings;

// One extension record: unit size, unit count and the contents, which are
// made (unit size x unit count bytes) on first use.
class SystemFileExtensionRecord {
  public:
    SystemFileExtensionRecord() = default;
    SystemFileExtensionRecord(int32_t unitSize, int32_t nUnits)
        : m_nUnits(nUnits), m_unitSize(unitSize) {}

    int32_t UnitSize() const { return m_unitSize; }
    int32_t NUnits() const { return m_nUnits; }
    int64_t ByteCount() const { return int64_t(m_unitSize) * m_nUnits; }
    bool IsEmpty() const { return m_nUnits == 0 || m_unitSize == 0; }
    // Only while there are no contents.
    void SetUnitSize(int32_t unitSize);
    void SetNUnits(int32_t nUnits);
    // Allocates the contents on first use; both sizes must be positive.
    unsigned char* Contents();
    const unsigned char* Contents() const { return m_pContents.get(); }
    // Copies ByteCount() bytes.
    void SetContents(const void* data);

    // Unit k as a number, reversed when the file is in the opposite byte
    // order. Preconditions: units of sizeof(T), 0 <= k < NUnits().
    template <class T>
    T Unit(int32_t k, bool swapped) const;
    // n numbers in the machine's order; none leaves the record empty.
    template <class T>
    void SetUnits(const T* values, int32_t n);
    // The contents as bytes; empty when there are none.
    std::string Text() const;
    // Units of one byte; an empty text leaves the record empty.
    void SetText(const std::string& text);

  private:
    std::unique_ptr<unsigned char[]> m_pContents;
    int32_t m_nUnits = 0;
    int32_t m_unitSize = 0;
};

template <class T>
T SystemFileExtensionRecord::Unit(int32_t k, bool swapped) const {
    QORA_ASSERT(m_unitSize == int32_t(sizeof(T)) && 0 <= k && k < m_nUnits);
    T value;
    std::memcpy(&value, m_pContents.get() + size_t(k) * sizeof(T), sizeof value);
    if (swapped) SwapBytes(&value, sizeof value);
    return value;
}

template <class T>
void SystemFileExtensionRecord::SetUnits(const T* values, int32_t n) {
    if (n == 0) return;
    SetUnitSize(int32_t(sizeof(T)));
    SetNUnits(n);
    SetContents(values);
}

// Reads and writes one subtype. Handlers live in static storage and are
// registered when the library is loaded.
class SystemFileExtensionHandler {
  public:
    virtual ~SystemFileExtensionHandler() = default;
    // Fills an empty record from the dictionary of the file being written
    // (the writer's own copy, which the handler may reshape) and the file's
    // settings; leaves the unit count at 0 when there is nothing to write.
    virtual void Export(QORA_DataSource& source, HeaderSettings& settings,
                        SystemFileExtensionRecord& record) = 0;
    // Applies a record that was read. The settings tell whether the file's
    // numbers are in the opposite byte order; the handler reverses its own.
    virtual void Import(QORA_DataSource& source, HeaderSettings& settings,
                        const SystemFileExtensionRecord& record) = 0;
};

// A later registration for the same subtype replaces the earlier one.
void RegisterExtensionHandler(int32_t subtype, SystemFileExtensionHandler& handler);
// Null when no handler is registered for the subtype.
SystemFileExtensionHandler* FindExtensionHandler(int32_t subtype);

// The registered handler's Export, else a copy of the record stored for the
// subtype, else nothing (the record stays empty).
void ExportExtension(int32_t subtype, QORA_DataSource& source, HeaderSettings& settings,
                     SystemFileExtensionRecord& record);
// The registered handler's Import, else the record is stored whole. Either
// way the subtype is noted as seen.
void ImportExtension(int32_t subtype, QORA_DataSource& source, HeaderSettings& settings,
                     const SystemFileExtensionRecord& record);
