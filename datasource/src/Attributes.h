// Custom attributes: named lists of text values attached to the file or to a
// variable, and the text form in which the attribute records carry them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

class Attributes {
  public:
    using Values = std::vector<std::string>;
    struct Entry {
        std::string name;
        Values values;
    };

    Attributes() = default;
    // A copy starts from the source's change count, plus one when it is not empty.
    Attributes(const Attributes& other);
    Attributes& operator=(const Attributes& other) {
        Assign(other);
        return *this;
    }

    int Size() const { return fpEntries ? static_cast<int>(fpEntries->size()) : 0; }
    uint32_t ChangeCount() const { return fChanges; }
    // Preconditions 0 <= k, k < Size().
    const std::string& NameAt(int k) const;
    const Values& ValuesAt(int k) const;
    // Names are compared ignoring case. -1 when absent.
    int IndexOf(const std::string& name) const;
    // An empty list when absent.
    const Values& ValuesOf(const std::string& name) const;

    // An existing entry takes the new spelling and values in place; otherwise
    // the entry is appended.
    void Set(const std::string& name, Values values);
    void RemoveAt(int k);
    bool Remove(const std::string& name);
    // Sets each entry of other that is absent here, or that differs when
    // replace is set. Whether anything changed.
    bool Merge(const Attributes& other, bool replace);
    void Assign(const Attributes& other);
    // Names compared byte for byte here.
    bool operator==(const Attributes& other) const;
    bool operator!=(const Attributes& other) const { return !(*this == other); }

    // The record text: for each entry with values, name ( 'value'\n ... ).
    std::string ToText() const;
    // Parses text of length bytes (zero bytes allowed) all or nothing: on
    // success this set is replaced, on failure left as it is. *errorPos (may
    // be null) gets the position reached: where a "/" or the end stopped a
    // successful parse, where the fault was found otherwise.
    bool FromText(const char* text, size_t length, size_t* errorPos = nullptr);

    // The reserved names the package defines for variables and for the file.
    static const std::vector<std::string>& VariableReservedNames();
    static const std::vector<std::string>& FileReservedNames();
    // The variable name rules (0 to 6), plus 7 for a name whose last "." ends
    // it or is followed by a byte not above the blank, and 100 for the same
    // with its last "_". Trailing blanks are not counted.
    static int CheckName(const char* name, size_t length);
    // 1 ordinary name, 2 reserved name of the list, 3 other "$" name, 0 invalid.
    static int ClassifyName(const char* name, size_t length, bool forVariable);
    // How exported calls present value position (1-based) of count values:
    // "name[07]"; the bare name when count is 1.
    static std::string PresentedName(const std::string& name, int position, int count);

  private:
    Values& MutableValuesAt(int k);

    std::unique_ptr<std::vector<Entry>> fpEntries;  // none while empty
    uint32_t fChanges = 0;
};
