// Date variables: the numeric variables that mark the periods of a time
// series (year, quarter, month, ...) and the string variable that serves as
// the date key. Kept per data source and checked against its dictionary;
// the date variables record (subtype 6) carries them in a file.
#pragma once

#include <cstdint>
#include <vector>

class QORA_DataSource;

class QORA_TrendsInfo {
  public:
    // Date variable types; each but e_NONE requires a variable of its name.
    enum Type : int32_t { e_NONE = 0, e_DATKEY = 11 };
    enum { eMaxDateVars = 11 };

    struct Entry {
        int32_t fID = -1;     // the variable's identity
        int32_t fIndex = -1;  // its dictionary index when last looked up
        int32_t fType = e_NONE;
        int32_t fValue = 1;
    };

    int32_t DateVarCount() const { return fnDateVars; }
    // Precondition 0 <= n < eMaxDateVars. Resets everything, then makes n
    // date entries and the key entry.
    void SetCount(int32_t n);
    // Entries 0 to DateVarCount() - 1 are date variables; the last one, at
    // DateVarCount(), is the key and takes only e_DATKEY or e_NONE. e_NONE
    // clears the entry's type.
    void SetEntry(const QORA_DataSource& source, int32_t i, int32_t varIndex, int32_t type,
                  int32_t value);
    // Precondition 0 <= i <= DateVarCount().
    const Entry& GetEntry(int32_t i) const;

    int32_t First() const { return fFirst; }
    void SetFirst(int32_t n) { fFirst = n; }
    int32_t Second() const { return fSecond; }
    void SetSecond(int32_t n) { fSecond = n; }
    bool Setting() const { return fSetting; }
    int32_t SettingNumber() const { return fSettingNumber; }
    void SetSetting(bool on, int32_t number) {
        fSetting = on;
        fSettingNumber = number;
    }

    // Follows renumbered variables; a vanished key is cleared; a date
    // variable that vanished or no longer has its type's name and kind makes
    // the whole information invalid, and it is reset. True when nothing had
    // to change.
    bool Validate(const QORA_DataSource& source);
    // The numbers as the record and the exported calls lay them out: the
    // setting, its number, the count, the second and first numbers, whether
    // there are date variables, then one triple (value position + 1, type,
    // value) per entry, key included, an entry without a type as zeros. Only
    // the six numbers when there are no date variables.
    std::vector<int32_t> Elements(const QORA_DataSource& source) const;

  private:
    void Reset();

    int32_t fnDateVars = 0;
    std::vector<Entry> fVars = std::vector<Entry>(1);  // fnDateVars + 1 entries
    int32_t fFirst = 1;
    int32_t fSecond = 1;
    bool fSetting = false;
    int32_t fSettingNumber = 1;
};
