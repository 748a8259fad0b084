// The fixed 176 bytes at the start of every system file: what wrote it, how
// its numbers and cases are laid out, and its label.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

struct SystemFileHeader {
    // Byte offsets of the fields, from the start of the file.
    enum : size_t {
        kMagicOffset = 0,
        kProductOffset = 4,
        kLayoutOffset = 64,
        kCaseSizeOffset = 68,
        kCompressionOffset = 72,
        kWeightOffset = 76,
        kCaseCountOffset = 80,
        kBiasOffset = 84,
        kDateOffset = 92,
        kTimeOffset = 101,
        kLabelOffset = 109,
        kPaddingOffset = 173,
        kSize = 176,
    };
    // Widths of the text fields.
    enum : size_t {
        kMagicSize = 4,
        kProductSize = 60,
        kDateSize = 9,
        kTimeSize = 8,
        kLabelSize = 64
    };

    std::string fProduct;      // the writing software; trailing blanks removed
    int32_t fLayoutCode = 2;   // small in the writer's byte order: tells the order
    int32_t fCaseSize = 0;     // value units per case
    int32_t fCompression = 0;  // 0 raw cases, else compressed
    int32_t fWeightIndex = 0;  // 1-based value unit of the weight; 0 none
    int32_t fCaseCount = -1;   // -1 unknown
    double fBias = 100.0;
    std::string fDate;      // "04 Dec 26", as stored
    std::string fTime;      // "17:16:43", as stored
    std::string fLabel;     // the file label; trailing blanks removed
    bool fSwapped = false;  // the numbers are in the opposite byte order

    // Whether the first bytes of a file name the format.
    static bool HasMagic(const unsigned char* bytes);
    // kSize bytes that begin with the magic; numbers come out in the
    // machine's order.
    static SystemFileHeader Decode(const unsigned char* bytes);
    // kSize bytes in the machine's order; text is cut to its field and padded
    // with blanks (a NUL ends it early).
    void Encode(unsigned char* bytes) const;
};

// The dictionary records that follow the header, by the type that opens each.
enum DictionaryRecordType : int32_t {
    kVariableRecord = 2,
    kValueLabelRecord = 3,
    kValueLabelVarsRecord = 4,  // follows each value label record
    kDocumentRecord = 6,
    kExtensionRecord = 7,
    kEndRecord = 999,
};
// Document text is kept in lines of this many bytes.
enum : size_t { kDocumentLineSize = 80 };
