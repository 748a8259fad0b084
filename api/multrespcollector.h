// The multiple response sets of one open file, as the calls see them: parsed
// from the data source's records, added to by callers, and written back into
// the records when the dictionary is committed.
#pragma once

#include <string>

#include "variableset.h"

class QORA_DataSource;

class MultRespCollector {
  public:
    // Parses the records again; sets added since the last flush are dropped.
    void Reload(const QORA_DataSource& source);
    int Count() const { return int(fSets.size()); }
    // Precondition 0 <= k < Count().
    const QORA_VariableSet& At(int k) const;
    // Whether a set of that name exists (case ignored).
    bool Has(const std::string& name) const;
    void Add(QORA_VariableSet set);
    // When sets were added: the records are replaced by all the sets.
    void Flush(QORA_DataSource& source);

  private:
    QORA_VariableSetList fSets;
    bool fChanged = false;
};
