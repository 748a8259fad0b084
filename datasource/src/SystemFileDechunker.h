// The plan that joins very long strings again from the segments a file
// stores them in: each entry copies one string out of its segments and then
// the ordinary units up to the next string.
#pragma once

#include <cstdint>
#include <vector>

class SystemFileDechunker {
  public:
    // Unit numbers count 8-byte value units: source units in the file's
    // case, target units in the dictionary's case.
    struct Entry {
        uint32_t sourceUnit;
        uint32_t width;  // 0: no string, only the ordinary units
        uint32_t targetUnit;
        uint32_t sourceUnitAfter;
        uint32_t targetUnitAfter;
        uint32_t ordinaryUnits;
    };

    // How a file stores a string wider than kSegmentWidth: as segment
    // variables, each full one of width kSegmentWidth (kSegmentBytes in the
    // case) carrying at least kSureBytes of the string, and a last one of
    // width W mod kSureBytes when that is not 0.
    enum : uint32_t { kSegmentBytes = 256, kSegmentWidth = 255, kSureBytes = 252 };
    static int SegmentCount(int width) { return (width + kSureBytes - 1) / kSureBytes; }
    // The width of segment j (0-based) of a string of the width.
    static int SegmentWidth(int width, int j) {
        return j < int(width / kSureBytes) ? int(kSegmentWidth) : int(width % kSureBytes);
    }
    // Units a string of the width takes in the file, as segments.
    static uint32_t FileUnits(uint32_t width);
    // Units it takes in the dictionary's case.
    static uint32_t CaseUnits(uint32_t width);
    // The entry of a string of the width at the two units, with the units
    // after it filled in from the width.
    static Entry StringEntry(uint32_t sourceUnit, uint32_t width, uint32_t targetUnit,
                             uint32_t ordinaryUnits);
    // The leading entry: copies the units before the first string.
    static Entry LeadingEntry(uint32_t ordinaryUnits);

    void Add(const Entry& entry) { fEntries.push_back(entry); }
    bool IsEmpty() const { return fEntries.empty(); }
    const std::vector<Entry>& Entries() const { return fEntries; }

    // The entries come from a file: raises SystemFileException 1204 unless
    // every entry agrees with its width and stays inside a file case of
    // rawUnits and a dictionary case of caseUnits.
    void Validate(uint32_t rawUnits, uint32_t caseUnits) const;
    // Builds the dictionary's case from the file's. Precondition: the plan
    // was validated against the sizes of both.
    void Rebuild(const unsigned char* raw, unsigned char* target) const;

  private:
    std::vector<Entry> fEntries;
};
