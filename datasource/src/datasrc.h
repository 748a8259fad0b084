// The abstract data source: a dictionary and the cases it delivers. The
// dictionary and every file-level property live in the data block of this
// base class; subclasses add case delivery and their own file handling.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "Attributes.h"
#include "extension.h"
#include "trendsinfo.h"
#include "variable.h"

class QORA_InputCaseIterator;

// Makes room for n more elements, growing geometrically, so that adding them
// next cannot fail half done (and appending stays linear overall).
template <class Vector>
void ReserveMore(Vector& v, size_t n) {
    if (v.capacity() - v.size() < n) v.reserve(std::max(2 * v.capacity(), v.size() + n));
}

// Where each variable's values start in a case, in 8-byte value units. Kept
// in step with the dictionary by every append, insert, replace and delete.
class CaseLayout {
  public:
    size_t Count() const { return fOffsets.size(); }
    int32_t Offset(size_t index) const { return fOffsets[index]; }
    int32_t Total() const { return fTotal; }
    // Units of the last variable; 0 once a delete from the front empties it.
    int32_t LastSize() const { return fLastSize; }
    // The first variable whose values start at or after the unit; Count()
    // when there is none.
    size_t FirstAtOrAfter(int32_t unit) const;

    // Makes room for one more variable, so that a following change cannot
    // fail half done.
    void Reserve();
    void Insert(size_t position, int32_t units);
    void Resize(size_t index, int32_t oldUnits, int32_t newUnits);
    // Removes the inclusive range start..finish.
    void Erase(size_t start, size_t finish);

  private:
    std::vector<int32_t> fOffsets;
    int32_t fTotal = 0;
    int32_t fLastSize = 0;
};

class QORA_DataSource {
  public:
    enum { eMaxSplitVars = 8, eMaxSplitBytes = 64 };
    // A case holds at most this many units, so its size in bytes fits in 32 bits.
    enum : int32_t { eMaxValueUnits = INT32_MAX / 8 };
    // The identity of no variable.
    enum : int32_t { kNoVariable = -1 };

    // A party told of every case iterator made over the data source.
    class Observer {
      public:
        virtual ~Observer() = default;
        virtual void IteratorCreated(QORA_InputCaseIterator* iterator);
    };

    // A new data source: empty without a parent, else a copy of the parent's
    // dictionary and properties that remembers its parent.
    explicit QORA_DataSource(QORA_DataSource* parent = nullptr);
    QORA_DataSource(const QORA_DataSource& other);
    QORA_DataSource& operator=(const QORA_DataSource&) = delete;
    virtual ~QORA_DataSource();

    // A new iterator over this source's cases, owned by the caller. buffer is
    // an optional caller-owned area of ValueCount() 8-byte units.
    virtual QORA_InputCaseIterator* NewIterator(void* buffer) = 0;
    // Value units per case.
    virtual int ValueCount() const;
    // Number of cases; -1 when unknown.
    virtual int64_t CaseCount() const;

    // Takes over the dictionary and properties of other, keeping this source's
    // parent and an empty file name.
    void AssignFrom(const QORA_DataSource& other);

    // The dictionary. Indexes are 0-based positions.
    int ColumnCount() const { return static_cast<int>(fData.fDictionary.size()); }
    bool IsValidIndex(int index) const { return 0 <= index && index < ColumnCount(); }
    const QORA_Variable& GetVariable(int index) const;
    // Any property may be changed through the handle but the type, which moves
    // the case layout: a retyped copy goes back through ReplaceVariable.
    QORA_Variable& GetVariable(int index);
    // Case and trailing blanks ignored; the first match wins; -1 when absent.
    int FindVariable(const char* name) const;
    int FindVariable(const char* name, size_t length) const;
    // -1 when no variable has the identity.
    int IndexOfID(int32_t id) const;
    // Whether a variable of the type still fits in a case.
    bool HasRoomFor(int type) const;
    // Returns the new index.
    int AppendVariable(const QORA_Variable& var);
    // Places var at position varAfter (the end when it equals ColumnCount()).
    void InsertVariable(int varAfter, const QORA_Variable& var);
    // var must be the same variable (identity), perhaps of another width.
    void ReplaceVariable(int index, const QORA_Variable& var);
    // The inclusive range start..finish; nothing when it is empty.
    void DeleteVariables(int start, int finish);
    // Appends a new variable of the type; its index goes to *index.
    QORA_Variable& NewVariable(int type, int* index);

    // The first unit of a variable; -1 gives -1, ColumnCount() the total.
    int ValueOffset(int var_index) const;
    const CaseLayout& Layout() const { return fData.fLayout; }
    // Blanks for strings, system-missing for numbers, over nVars variables.
    void ClearValues(void* buffer, int firstVar, int nVars) const;

    // Any index outside the dictionary clears the weight.
    void SetCaseWeight(int index);
    // -1 without a weight variable, also once it has been deleted.
    int GetCaseWeight() const;

    // Split variables, by index; they follow their variables through
    // reordering and vanish together when one of them is deleted.
    void SetSplitVars(uint32_t nVars, const int* varIndexes, bool sorted);
    uint32_t SplitVarCount() const { return fData.fnSplitVars; }
    // -1 when that variable is gone.
    int SplitVarIndex(uint32_t k) const;
    int32_t SplitVarID(uint32_t k) const;
    bool IsSplitSorted() const { return fData.fSplitSorted; }

    // Null text: no id string, which is not the same as an empty one.
    void SetIdString(const char* text);
    const char* GetIdString() const;

    // Null stores the empty name.
    void SetFileName(const char* name) { fData.fFileName = name ? name : ""; }
    const std::string& GetFileName() const { return fData.fFileName; }

    // Seconds on the date scale (since 14 October 1582).
    double GetTimeStamp() const { return fData.fTimeStamp; }
    void SetTimeStamp(double stamp) { fData.fTimeStamp = stamp; }
    void ResetTimeStamp();

    QORA_DataSource* GetParent() const { return fData.fpParent; }
    void SetParent(QORA_DataSource* parent);

    // Observers are not owned; one added twice is told twice.
    void AddObserver(Observer* observer);
    // Removes every occurrence.
    void RemoveObserver(Observer* observer);
    // Called by every case iterator as it is made.
    void NotifyIteratorCreated(QORA_InputCaseIterator* iterator);

    // Stored extension records, by type; slot 0 holds the documents.
    bool HasExtension(int32_t type) const { return fData.fExtensions.HasExtension(type); }
    QORA_Extension GetExtension(int32_t type) const { return fData.fExtensions.Get(type); }
    int32_t LastIntegerOfExtension(int32_t type) const {
        return fData.fExtensions.LastIntegerOf(type);
    }
    void SetExtensionContent(int32_t type, int32_t elementSize, int32_t nElements,
                             const void* content) {
        fData.fExtensions.SetContent(type, elementSize, nElements, content);
    }
    void SetExtension(int32_t type, const QORA_Extension& record) {
        fData.fExtensions.Set(type, record);
    }
    void AppendExtensionData(int32_t type, int32_t nElements, const void* content) {
        fData.fExtensions.Append(type, nElements, content);
    }
    // A record as read from a file; its type and element size are checked.
    void ImportExtension(int32_t type, int32_t elementSize, std::string content) {
        fData.fExtensions.Import(type, elementSize, std::move(content));
    }
    int32_t ExtensionTypeBound() const { return fData.fExtensions.TypeBound(); }

    const Attributes& FileAttributes() const { return fData.fAttributes; }
    Attributes& FileAttributes() { return fData.fAttributes; }

    const QORA_TrendsInfo& DateInfo() const { return fData.fDateInfo; }
    QORA_TrendsInfo& DateInfo() { return fData.fDateInfo; }

  private:
    struct Data {
        Data();
        int32_t fSplitIds[eMaxSplitVars];
        std::vector<QORA_Variable> fDictionary;
        CaseLayout fLayout;
        std::optional<std::string> fIdString;
        int32_t fWeightId = kNoVariable;
        uint32_t fnSplitVars = 0;
        bool fSplitSorted = false;
        QORA_DataSource* fpParent = nullptr;
        std::vector<Observer*> fObservers;
        QORA_ExtensionList fExtensions;
        std::string fFileName;
        double fTimeStamp;
        // Refers to variables by identity, so a copy of the data block is
        // right for the copy's dictionary as it stands.
        QORA_TrendsInfo fDateInfo;
        Attributes fAttributes;
    };

    void CheckSplitAfterDelete();

    Data fData;
};
