#include "datasrc.h"

#include <algorithm>
#include <cstring>
#include <ctime>

#include "calendar.h"
#include "specialvalues.h"

namespace {

// The local time in seconds since 14 October 1582 (proleptic Gregorian).
double LocalTimeStamp() {
    const std::time_t now = std::time(nullptr);
    // The reentrant form: files are opened by several threads at once.
    std::tm local;
    const std::tm* t = now == std::time_t(-1) ? nullptr : localtime_r(&now, &local);
    if (!t) return 12379867200.0;
    const int64_t days = GregorianDays(t->tm_year + 1900, t->tm_mon + 1, t->tm_mday);
    const int64_t seconds = t->tm_hour * 3600 + t->tm_min * 60 + t->tm_sec;
    return double(days * 86400 + seconds);
}

}  // namespace

void CaseLayout::Reserve() { ReserveMore(fOffsets, 1); }

void CaseLayout::Insert(size_t position, int32_t units) {
    QORA_ASSERT(position <= fOffsets.size());
    QORA_ASSERT(units <= QORA_DataSource::eMaxValueUnits - fTotal);
    const int32_t at = position < fOffsets.size() ? fOffsets[position] : fTotal;
    fOffsets.insert(fOffsets.begin() + position, at);
    for (size_t i = position + 1; i < fOffsets.size(); ++i) fOffsets[i] += units;
    fTotal += units;
    if (position + 1 == fOffsets.size()) fLastSize = units;
}

void CaseLayout::Resize(size_t index, int32_t oldUnits, int32_t newUnits) {
    QORA_ASSERT(index < fOffsets.size());
    const int32_t delta = newUnits - oldUnits;
    QORA_ASSERT(delta <= QORA_DataSource::eMaxValueUnits - fTotal);
    for (size_t i = index + 1; i < fOffsets.size(); ++i) fOffsets[i] += delta;
    fTotal += delta;
    if (index + 1 == fOffsets.size()) fLastSize += delta;
}

void CaseLayout::Erase(size_t start, size_t finish) {
    const size_t columnCount = fOffsets.size();
    QORA_ASSERT(finish < columnCount);
    QORA_ASSERT(start <= finish);
    if (finish + 1 == columnCount)
        fLastSize = start == 0 ? 0 : fOffsets[start] - fOffsets[start - 1];
    const int32_t end = finish + 1 < columnCount ? fOffsets[finish + 1] : fTotal;
    const int32_t delta = end - fOffsets[start];
    for (size_t i = finish + 1; i < columnCount; ++i) fOffsets[i] -= delta;
    fOffsets.erase(fOffsets.begin() + start, fOffsets.begin() + finish + 1);
    fTotal -= delta;
}

size_t CaseLayout::FirstAtOrAfter(int32_t unit) const {
    return size_t(std::lower_bound(fOffsets.begin(), fOffsets.end(), unit) - fOffsets.begin());
}

void QORA_DataSource::Observer::IteratorCreated(QORA_InputCaseIterator*) {}

QORA_DataSource::Data::Data() : fTimeStamp(LocalTimeStamp()) {
    std::fill(std::begin(fSplitIds), std::end(fSplitIds), kNoVariable);
}

QORA_DataSource::QORA_DataSource(QORA_DataSource* parent) {
    if (!parent) return;
    fData = parent->fData;
    SetParent(parent);
}

QORA_DataSource::QORA_DataSource(const QORA_DataSource& other) : fData(other.fData) {}

QORA_DataSource::~QORA_DataSource() = default;

int QORA_DataSource::ValueCount() const { return fData.fLayout.Total(); }

int64_t QORA_DataSource::CaseCount() const { return -1; }

void QORA_DataSource::AssignFrom(const QORA_DataSource& other) {
    Data copy = other.fData;
    copy.fpParent = fData.fpParent;
    copy.fFileName.clear();
    fData = std::move(copy);
}

const QORA_Variable& QORA_DataSource::GetVariable(int index) const {
    QORA_ASSERT(0 <= index);
    QORA_ASSERT(size_t(index) < fData.fDictionary.size());
    return fData.fDictionary[index];
}

QORA_Variable& QORA_DataSource::GetVariable(int index) {
    QORA_ASSERT(0 <= index);
    QORA_ASSERT(size_t(index) < fData.fDictionary.size());
    return fData.fDictionary[index];
}

int QORA_DataSource::FindVariable(const char* name) const {
    QORA_ASSERT(name != nullptr);
    return FindVariable(name, std::strlen(name));
}

int QORA_DataSource::FindVariable(const char* name, size_t length) const {
    const std::string key = MakeLookupKey(name, length);
    for (int i = 0; i < ColumnCount(); ++i)
        if (fData.fDictionary[i].GetKey() == key) return i;
    return -1;
}

int QORA_DataSource::IndexOfID(int32_t id) const {
    for (int i = 0; i < ColumnCount(); ++i)
        if (fData.fDictionary[i].GetID() == id) return i;
    return -1;
}

bool QORA_DataSource::HasRoomFor(int type) const {
    return QORA_Variable::IsValidType(type) &&
           ::ValueUnits(type) <= eMaxValueUnits - fData.fLayout.Total();
}

int QORA_DataSource::AppendVariable(const QORA_Variable& var) {
    InsertVariable(ColumnCount(), var);
    return ColumnCount() - 1;
}

void QORA_DataSource::InsertVariable(int varAfter, const QORA_Variable& var) {
    QORA_ASSERT(0 <= varAfter && size_t(varAfter) <= fData.fDictionary.size());
    QORA_ASSERT(var.IsValid());
    // Everything that can fail happens before either list changes.
    QORA_Variable copy = var;
    ReserveMore(fData.fDictionary, 1);
    fData.fLayout.Reserve();
    fData.fLayout.Insert(varAfter, copy.ValueUnits());
    fData.fDictionary.insert(fData.fDictionary.begin() + varAfter, std::move(copy));
}

void QORA_DataSource::ReplaceVariable(int index, const QORA_Variable& var) {
    QORA_Variable& old = GetVariable(index);
    QORA_ASSERT(fData.fDictionary[index].GetID() == var.GetID());
    QORA_Variable copy = var;
    fData.fLayout.Resize(index, old.ValueUnits(), copy.ValueUnits());
    old = std::move(copy);
}

void QORA_DataSource::DeleteVariables(int start, int finish) {
    QORA_ASSERT(finish < (int)ColumnCount());
    if (finish < 0 || finish < start) return;
    QORA_ASSERT(0 <= start);
    fData.fDictionary.erase(fData.fDictionary.begin() + start,
                            fData.fDictionary.begin() + finish + 1);
    fData.fLayout.Erase(start, finish);
    CheckSplitAfterDelete();
}

void QORA_DataSource::CheckSplitAfterDelete() {
    for (uint32_t k = 0; k < fData.fnSplitVars; ++k) {
        if (SplitVarIndex(k) < 0) {
            fData.fnSplitVars = 0;
            fData.fSplitSorted = false;
            return;
        }
    }
}

QORA_Variable& QORA_DataSource::NewVariable(int type, int* index) {
    QORA_ASSERT(index != nullptr);
    *index = AppendVariable(QORA_Variable(type));
    return fData.fDictionary[*index];
}

int QORA_DataSource::ValueOffset(int var_index) const {
    const int lth = ColumnCount();
    QORA_ASSERT(var_index >= -1);
    QORA_ASSERT(var_index <= lth);
    if (var_index == -1) return -1;
    if (var_index == lth) return fData.fLayout.Total();
    return fData.fLayout.Offset(var_index);
}

void QORA_DataSource::ClearValues(void* buffer, int firstVar, int nVars) const {
    QORA_ASSERT(0 <= firstVar && 0 <= nVars);
    QORA_ASSERT(int64_t(firstVar) + nVars <= ColumnCount());
    auto* unit = static_cast<unsigned char*>(buffer) + 8 * size_t(ValueOffset(firstVar));
    const double sysmis = SysmisValue();
    for (int i = firstVar; i < firstVar + nVars; ++i) {
        const QORA_Variable& var = fData.fDictionary[i];
        const size_t bytes = 8 * size_t(var.ValueUnits());
        if (var.IsString())
            std::memset(unit, ' ', bytes);
        else
            std::memcpy(unit, &sysmis, sizeof sysmis);
        unit += bytes;
    }
}

void QORA_DataSource::SetCaseWeight(int index) {
    fData.fWeightId = IsValidIndex(index) ? fData.fDictionary[index].GetID() : kNoVariable;
}

int QORA_DataSource::GetCaseWeight() const {
    return fData.fWeightId == kNoVariable ? -1 : IndexOfID(fData.fWeightId);
}

void QORA_DataSource::SetSplitVars(uint32_t nVars, const int* varIndexes, bool sorted) {
    QORA_ASSERT(nVars <= eMaxSplitVars);
    // Checked whole before anything is stored, so a refused split leaves the
    // old one intact.
    int32_t ids[eMaxSplitVars];
    int totalSize = 0;
    for (uint32_t i = 0; i < nVars; ++i) {
        QORA_ASSERT(varIndexes[i] >= 0);
        const QORA_Variable& var = GetVariable(varIndexes[i]);
        totalSize += 8 * var.ValueUnits();
        QORA_ASSERT(totalSize <= eMaxSplitBytes);
        ids[i] = var.GetID();
    }
    std::copy(ids, ids + nVars, fData.fSplitIds);
    fData.fnSplitVars = nVars;
    fData.fSplitSorted = sorted;
}

int QORA_DataSource::SplitVarIndex(uint32_t k) const { return IndexOfID(SplitVarID(k)); }

int32_t QORA_DataSource::SplitVarID(uint32_t k) const {
    QORA_ASSERT(k < fData.fnSplitVars);
    return fData.fSplitIds[k];
}

void QORA_DataSource::SetIdString(const char* text) {
    if (text)
        fData.fIdString = text;
    else
        fData.fIdString.reset();
}

const char* QORA_DataSource::GetIdString() const {
    return fData.fIdString ? fData.fIdString->c_str() : nullptr;
}

void QORA_DataSource::ResetTimeStamp() { fData.fTimeStamp = LocalTimeStamp(); }

void QORA_DataSource::SetParent(QORA_DataSource* parent) {
    QORA_ASSERT(parent != this);
    fData.fpParent = parent;
}

void QORA_DataSource::AddObserver(Observer* observer) { fData.fObservers.push_back(observer); }

void QORA_DataSource::RemoveObserver(Observer* observer) {
    auto& list = fData.fObservers;
    list.erase(std::remove(list.begin(), list.end(), observer), list.end());
}

void QORA_DataSource::NotifyIteratorCreated(QORA_InputCaseIterator* iterator) {
    // A copy: an observer may add or remove observers while it is told.
    const std::vector<Observer*> observers = fData.fObservers;
    for (Observer* observer : observers) observer->IteratorCreated(iterator);
}
