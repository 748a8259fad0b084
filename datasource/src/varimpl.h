// The shared state of one variable. Only QORA_Variable reaches it; every
// change goes through the handle, which makes the object private first.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "Attributes.h"
#include "refcnt.h"
#include "valuelabelmap.h"

class QORA_Variable_Enumerations {
  public:
    enum { MAX_STRING_TYPE = 32767 };
    // Missing-value codes beside the plain counts 0 to 3.
    enum { kMissingRange = -2, kMissingRangeAndValue = -3 };
    enum { kMissingSlots = 3, kMissingSlotSize = 8 };
};

class QORA_VariableImpl : public QORA_RefCntObject, public QORA_Variable_Enumerations {
  public:
    // A new variable with the defaults of its type and a new identity.
    explicit QORA_VariableImpl(int type);
    // A clone keeps everything, the identity included.
    QORA_VariableImpl(const QORA_VariableImpl&) = default;
    QORA_VariableImpl& operator=(const QORA_VariableImpl&) = delete;

    std::string fName;
    std::string fKey;
    unsigned char fMissing[kMissingSlots][kMissingSlotSize] = {};
    // Labels are never edited in place: setting one makes a new string, and
    // clones share it. The string goes when its last variable does.
    std::shared_ptr<const std::string> fpLabel;
    Attributes fAttributes;
    uint32_t fPrintFormat = 0;
    uint32_t fWriteFormat = 0;
    int16_t fType = 0;
    int16_t fColumnWidth = 0;
    int8_t fMissingCode = 0;
    uint8_t fMeasure : 2;
    uint8_t fAlign : 2;
    QORA_VLMap fValueLabels;
    int32_t fID = -1;
};
