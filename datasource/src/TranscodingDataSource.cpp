#include "TranscodingDataSource.h"

#include <algorithm>
#include <climits>
#include <cstring>

#include "dserror.h"
#include "namerules.h"
#include "qoramb.h"
#include "variableset.h"

namespace {

// Names and the file label are cut to what the calls hand out: a converted
// text must not grow past the caller's buffer.
enum { kMaxLabelBytes = 64, kMissingBytes = 8 };

int TripleWidth(int width) { return 3 * width > 32766 ? 32767 : 3 * width; }
int SameWidth(int width) { return width; }

int Length(const std::string& text) { return int(std::min<size_t>(text.size(), INT_MAX)); }

std::string WithoutTrailingBlanks(const char* text, size_t n) {
    while (n > 0 && text[n - 1] == ' ') --n;
    return std::string(text, n);
}

}  // namespace

TranscodingDataSource::TranscodingDataSource(std::unique_ptr<SystemFileDataSource> file,
                                             const std::string& encoding,
                                             const Direction& direction, WarningSink* warnings)
    : QORA_DataSource(file.get()), fDirection(direction), fpFile(std::move(file)), _my(new Data) {
    _my->_encoding = encoding;
    _my->_converter.reset(OpenConverter(encoding.c_str()));
    QORA_ASSERT(_my->_converter);
    ConvertDictionary();
    if (_my->_lossy && warnings) warnings->Warning(fDirection.lossWarning, encoding);
    _my->_converter.reset();
}

TranscodingDataSource::~TranscodingDataSource() = default;

QORA_InputCaseIterator* TranscodingDataSource::NewIterator(void* buffer) {
    return new Iterator(*this, buffer);
}

void TranscodingDataSource::ConvertDictionary() {
    if (const char* label = GetIdString()) SetIdString(Convert(label, kMaxLabelBytes).c_str());
    FileAttributes() = Convert(FileAttributes());
    ConvertedMaps maps;
    for (int i = 0; i < ColumnCount(); ++i) ConvertVariable(i, maps);
    ConvertSets();
}

void TranscodingDataSource::ConvertVariable(int index, ConvertedMaps& maps) {
    QORA_Variable var = GetVariable(index);
    var.SetName(Convert(var.GetName(), kMaxNameBytes).c_str());
    if (const char* label = var.GetLabel()) {
        const std::string converted = Convert(label);
        var.SetLabel(converted.data(), converted.size());
    }
    if (var.IsString() && var.GetMissingCode() > 0) {
        // A value that no longer fits in its 8 bytes cannot stay a missing value.
        char stored[3][kMissingBytes];
        const int code = var.GetMissingValues(stored[0], stored[1], stored[2]);
        std::string kept[3];
        const char* values[3] = {};
        for (int k = 0, n = 0; k < code; ++k) {
            kept[n] = Convert(WithoutTrailingBlanks(stored[k], kMissingBytes));
            if (kept[n].size() > kMissingBytes) {
                _my->_lossy = true;
            } else {
                values[n] = kept[n].c_str();
                ++n;
            }
        }
        var.SetMissingStrings(values[0], values[1], values[2]);
    }
    const QORA_VLMap labels = var.GetValueLabels();
    if (labels.IsValid()) {
        auto found = maps.find(labels.Impl());
        if (found == maps.end()) found = maps.emplace(labels.Impl(), Convert(labels)).first;
        var.SetValueLabels(found->second);
    }
    var.SetAttributes(Convert(var.GetAttributes()));

    PlanEntry entry{uint32_t(fpFile->ValueOffset(index)), var.GetType(), 1, 0};
    if (var.IsString()) {
        var.SetType(fDirection.width(var.GetType()));
        entry.targetWidth = var.GetType();
        entry.targetUnits = var.ValueUnits();
    }
    ReplaceVariable(index, var);
    AddToPlan(entry);
}

void TranscodingDataSource::AddToPlan(const PlanEntry& entry) {
    std::vector<PlanEntry>& plan = _my->_plan;
    if (entry.sourceWidth == 0 && !plan.empty() && plan.back().sourceWidth == 0)
        plan.back().targetUnits += entry.targetUnits;
    else
        plan.push_back(entry);
}

QORA_VLMap TranscodingDataSource::Convert(const QORA_VLMap& labels) {
    const int32_t keyType = labels.KeyType() == 0 ? 0 : fDirection.width(labels.KeyType());
    QORA_VLMap converted(keyType);
    std::string key;
    for (const QORA_VLMapImpl::Pair& pair : labels.Impl()->Pairs()) {
        const std::string label = Convert(pair.label);
        if (keyType == 0) {
            converted.Insert(pair.key.data(), label);
            continue;
        }
        key.assign(size_t(keyType), ' ');
        int error = 0;
        fDirection.convert(_my->_converter.get(), &key[0], keyType, pair.key.data(),
                           labels.KeyType(), &error);
        if (error != 0) _my->_lossy = true;
        converted.Insert(key.data(), keyType, label);
    }
    return converted;
}

void TranscodingDataSource::ConvertSets() {
    for (QORA_SetFamily family :
         {QORA_SetFamily::kVariableSets, QORA_SetFamily::kMultipleResponse}) {
        QORA_VariableSetList sets = LoadVariableSets(*this, family);
        if (sets.empty()) continue;
        for (QORA_VariableSet& set : sets) {
            set.SetName(Convert(set.GetName()));
            set.SetLabel(Convert(set.GetLabel()));
            set.SetValue(Convert(set.GetValue()));
            for (size_t k = 0; k < set.GetVariables().size(); ++k)
                set.SetVariable(k, Convert(set.GetVariables()[k], kMaxNameBytes));
        }
        ReplaceVariableSets(*this, family, sets);
    }
}

std::string TranscodingDataSource::Convert(const std::string& text, int maxBytes) {
    UConverter* cnv = _my->_converter.get();
    int error = 0;
    // One byte to spare: a result that fills its buffer exactly reports no loss.
    const int size = std::max(fDirection.length(cnv, text.data(), Length(text), &error), 0) + 1;
    std::string converted(size_t(size), ' ');
    const int n = fDirection.convert(cnv, &converted[0], size, text.data(), Length(text), &error);
    converted.resize(size_t(std::clamp(n, 0, size)));
    if (maxBytes >= 0 && converted.size() > size_t(maxBytes)) {
        converted = mbPrefix(converted, size_t(maxBytes));
        error = 1;
    }
    if (error != 0) _my->_lossy = true;
    return converted;
}

Attributes TranscodingDataSource::Convert(const Attributes& attributes) {
    Attributes converted;
    for (int k = 0; k < attributes.Size(); ++k) {
        Attributes::Values values;
        for (const std::string& value : attributes.ValuesAt(k)) values.push_back(Convert(value));
        converted.Set(Convert(attributes.NameAt(k)), std::move(values));
    }
    return converted;
}

TranscodingDataSource::Iterator::Iterator(TranscodingDataSource& source, void* buffer)
    : QORA_InputCaseIterator(source, buffer),
      fSource(source),
      fpFile(source.fpFile->NewIterator(nullptr)),
      fCnv(OpenConverter(source._my->_encoding.c_str())) {
    QORA_ASSERT(fCnv);
}

// A value cut by the conversion keeps the whole characters that fit.
bool TranscodingDataSource::Iterator::ReadCase() {
    if (!fpFile->ReadCase()) return false;
    const char* from = static_cast<const char*>(fpFile->Case().Buffer());
    char* to = static_cast<char*>(Case().Buffer());
    for (const PlanEntry& entry : fSource._my->_plan) {
        const size_t bytes = size_t(entry.targetUnits) * 8;
        const char* value = from + size_t(entry.sourceUnit) * 8;
        if (entry.sourceWidth == 0) {
            std::memcpy(to, value, bytes);
        } else {
            std::memset(to, ' ', bytes);
            int error = 0;
            fSource.fDirection.convert(fCnv.get(), to, entry.targetWidth, value, entry.sourceWidth,
                                       &error);
        }
        to += bytes;
    }
    return true;
}

UTF8DataSource::UTF8DataSource(std::unique_ptr<SystemFileDataSource> file,
                               const std::string& fileEncoding, WarningSink* warnings)
    : TranscodingDataSource(std::move(file), fileEncoding,
                            {mbCodePageToUtf8, mbCodePageToUtf8Length, TripleWidth, kWarnNotUtf8},
                            warnings) {}

CodePageDataSource::CodePageDataSource(std::unique_ptr<SystemFileDataSource> file,
                                       const std::string& interfaceEncoding, WarningSink* warnings)
    : TranscodingDataSource(std::move(file), interfaceEncoding,
                            {mbUtf8ToCodePage, mbUtf8ToCodePageLength, SameWidth, kWarnNotCodePage},
                            warnings) {}
