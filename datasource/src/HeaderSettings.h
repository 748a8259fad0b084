// What the header and the information records of one system file say, and
// what the reader learns about the file's byte order. One per system file
// data source: the reader fills it, the writer writes from it, and the
// extension record handlers read and update it.
#pragma once

#include <bitset>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "SystemFileDechunker.h"
#include "byteorder.h"

class QORA_DataSource;

struct HeaderSettings {
    enum { eMaxSeenSubtype = 100 };

    HeaderSettings();

    double fBias = 100.0;
    double fSysmis;
    double fHighest;
    double fLowest;
    int64_t fCaseCount = -1;  // -1: unknown
    int32_t fCaseSize = -1;   // value units per case
    std::string fProduct;
    int32_t fLayoutCode = 2;
    int32_t fReleaseMajor = 16, fReleaseMinor = 0, fReleaseRevision = 0;
    int32_t fMachineCode = 720;
    int32_t fFloatCode = 1;
    int32_t fCompressionCode = 1;
    int32_t fCharacterCode = 2;
    int32_t fWeightIndex = 0;
    // Short name to long name pairs of the long variable names record.
    std::vector<std::pair<std::string, std::string>> fNameList;
    // Flag s: a type 7 record of subtype s was read; flag 0: documents were.
    std::bitset<eMaxSeenSubtype> fRecordsSeen;
    // Writing: the (dictionary index, width) of each very long string, in
    // dictionary order, that the export of the very long strings record split
    // into segments; the writer reshapes each case to match.
    std::vector<std::pair<int, int>> fVeryLongStrings;
    // Joins very long strings from their segments; null when the file has none.
    std::unique_ptr<SystemFileDechunker> fpDechunker;
    // One byte per value unit, 1 for a unit holding a number; made only for a
    // file in the opposite byte order, and always as long as the dictionary's
    // case, whatever the header claims.
    std::vector<uint8_t> fSwapMask;
    bool fCompressed = false;
    bool fSwapped = false;
    // Without a long names record, names are shown in lower case.
    bool fLongNamesSeen = false;
    std::string fEncodingName;

    bool HasSeen(int subtype) const {
        return 0 <= subtype && subtype < eMaxSeenSubtype && fRecordsSeen[subtype];
    }
    void NoteSeen(int subtype) {
        if (0 <= subtype && subtype < eMaxSeenSubtype) fRecordsSeen.set(subtype);
    }

    // Marks the value unit of every numeric variable of the source.
    void BuildSwapMask(const QORA_DataSource& source);
};

// The creation time stamp of the header's 9 date bytes ("04 Dec 26") and 8
// time bytes ("17:16:43"), in seconds since 14 October 1582. False when the
// fields do not make a valid date and time (the stamp is then left alone).
bool ParseCreationStamp(const char* date, const char* time, double* stamp);
