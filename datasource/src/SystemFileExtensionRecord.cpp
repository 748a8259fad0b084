#include "SystemFileExtensionRecord.h"

#include <cstring>
#include <string>
#include <vector>

#include "HeaderSettings.h"
#include "datasrc.h"

void SystemFileExtensionRecord::SetUnitSize(int32_t unitSize) {
    QORA_ASSERT(m_pContents == 0);
    m_unitSize = unitSize;
}

void SystemFileExtensionRecord::SetNUnits(int32_t nUnits) {
    QORA_ASSERT(m_pContents == 0);
    m_nUnits = nUnits;
}

unsigned char* SystemFileExtensionRecord::Contents() {
    if (!m_pContents) {
        QORA_ASSERT(m_nUnits > 0 && m_unitSize > 0);
        m_pContents.reset(new unsigned char[ByteCount()]);
    }
    return m_pContents.get();
}

void SystemFileExtensionRecord::SetContents(const void* data) {
    std::memcpy(Contents(), data, ByteCount());
}

std::string SystemFileExtensionRecord::Text() const {
    if (!m_pContents) return std::string();
    return std::string(reinterpret_cast<const char*>(m_pContents.get()), size_t(ByteCount()));
}

void SystemFileExtensionRecord::SetText(const std::string& text) {
    if (text.empty()) return;
    QORA_ASSERT(text.size() <= size_t(INT32_MAX));
    SetUnitSize(1);
    SetNUnits(int32_t(text.size()));
    SetContents(text.data());
}

namespace {

// Created by the first registration, at load; read-only afterwards.
std::vector<SystemFileExtensionHandler*>& Registry() {
    static std::vector<SystemFileExtensionHandler*> registry;
    return registry;
}

}  // namespace

void RegisterExtensionHandler(int32_t subtype, SystemFileExtensionHandler& handler) {
    QORA_ASSERT(0 <= subtype);
    auto& registry = Registry();
    if (registry.size() <= size_t(subtype)) registry.resize(size_t(subtype) + 1, nullptr);
    registry[subtype] = &handler;
}

SystemFileExtensionHandler* FindExtensionHandler(int32_t subtype) {
    const auto& registry = Registry();
    return subtype >= 0 && size_t(subtype) < registry.size() ? registry[subtype] : nullptr;
}

void ExportExtension(int32_t subtype, QORA_DataSource& source, HeaderSettings& settings,
                     SystemFileExtensionRecord& record) {
    if (SystemFileExtensionHandler* handler = FindExtensionHandler(subtype)) {
        handler->Export(source, settings, record);
        return;
    }
    if (!source.HasExtension(subtype)) return;
    const QORA_ExtensionImpl* stored = source.GetExtension(subtype).Impl();
    record.SetUnitSize(stored->ElementSize());
    record.SetNUnits(stored->ElementCount());
    if (!record.IsEmpty()) record.SetContents(stored->Content().data());
}

void ImportExtension(int32_t subtype, QORA_DataSource& source, HeaderSettings& settings,
                     const SystemFileExtensionRecord& record) {
    if (SystemFileExtensionHandler* handler = FindExtensionHandler(subtype))
        handler->Import(source, settings, record);
    else if (!record.IsEmpty())
        source.ImportExtension(subtype, record.UnitSize(), record.Text());
    settings.NoteSeen(subtype);
}
