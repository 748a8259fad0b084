#include "multrespcollector.h"

#include "datasrc.h"
#include "dserror.h"
#include "qoramb.h"

void MultRespCollector::Reload(const QORA_DataSource& source) {
    fSets = LoadVariableSets(source, QORA_SetFamily::kMultipleResponse);
    fChanged = false;
}

const QORA_VariableSet& MultRespCollector::At(int k) const {
    QORA_ASSERT(0 <= k && k < Count());
    return fSets[size_t(k)];
}

bool MultRespCollector::Has(const std::string& name) const {
    for (const QORA_VariableSet& set : fSets)
        if (mbCompareNoCase(set.GetName().c_str(), name.c_str()) == 0) return true;
    return false;
}

void MultRespCollector::Add(QORA_VariableSet set) {
    fSets.push_back(std::move(set));
    fChanged = true;
}

void MultRespCollector::Flush(QORA_DataSource& source) {
    if (!fChanged) return;
    source.SetExtensionContent(kMultRespExtension, 1, 0, nullptr);
    source.SetExtensionContent(kExtendedMultRespExtension, 1, 0, nullptr);
    StoreVariableSets(source, fSets);
    fChanged = false;
}
