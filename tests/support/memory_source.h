// A data source whose cases are rows held in memory, for tests of cases and
// iterators.
#pragma once

#include <cstring>
#include <string>
#include <vector>

#include "case.h"
#include "datasrc.h"

class MemorySource : public QORA_DataSource {
  public:
    class Iterator : public QORA_InputCaseIterator {
      public:
        Iterator(MemorySource& source, void* buffer)
            : QORA_InputCaseIterator(source, buffer), fSource(source) {}
        bool CanSeek() const override { return true; }
        bool SeekCase(int64_t caseNumber) override {
            fNext = caseNumber;
            return true;
        }
        int64_t TellCase() const override { return fNext; }
        bool ReadCase() override {
            if (fNext < 0 || fNext >= static_cast<int64_t>(fSource.fRows.size())) return false;
            const std::string& row = fSource.fRows[static_cast<size_t>(fNext++)];
            std::memcpy(Case().Buffer(), row.data(), row.size());
            return true;
        }

      private:
        MemorySource& fSource;
        int64_t fNext = 0;
    };

    QORA_InputCaseIterator* NewIterator(void* buffer) override {
        return new Iterator(*this, buffer);
    }

    int Add(int type, const char* name) {
        QORA_Variable var(type);
        var.SetName(name);
        return AppendVariable(var);
    }
    // One case of ValueCount() units, built by fill through a case.
    template <typename Fill>
    void AddRow(Fill fill) {
        QORA_Case row(*this);
        row.ClearAll();
        fill(row);
        fRows.emplace_back(static_cast<const char*>(row.Buffer()),
                           static_cast<size_t>(ValueCount()) * 8);
    }

  private:
    std::vector<std::string> fRows;
};
