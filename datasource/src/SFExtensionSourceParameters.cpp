// The integer and floating-point information records: what the writing
// system says about itself. Both are kept in the file's settings; the
// integer units are written back as read, the floating-point ones never are.
#include <cstdint>

#include "HeaderSettings.h"
#include "SystemFileExtensionRecord.h"
#include "dserror.h"
#include "extension.h"
#include "specialvalues.h"

namespace {

// Integer information, 8 int32 units. The byte-order unit is not kept.
class SFExtensionSourceParametersInt : public SystemFileExtensionHandler {
  public:
    void Export(QORA_DataSource&, HeaderSettings& settings,
                SystemFileExtensionRecord& rec) override {
        int32_t units[kUnits];
        for (int k = 0; k < kUnits; ++k)
            units[k] = kFields[k] ? settings.*kFields[k] : kByteOrderCode;
        rec.SetUnits(units, kUnits);
    }

    void Import(QORA_DataSource&, HeaderSettings& settings,
                const SystemFileExtensionRecord& rec) override {
        QORA_FILE_CHECK(kErrBadFormat, rec.UnitSize() == 4);
        QORA_FILE_CHECK(kErrBadFormat, rec.NUnits() == 8);
        for (int k = 0; k < kUnits; ++k)
            if (kFields[k]) settings.*kFields[k] = rec.Unit<int32_t>(k, settings.fSwapped);
    }

  private:
    enum { kUnits = 8 };
    // The machine's own order: least significant byte first.
    enum { kByteOrderCode = 2 };
    static constexpr int32_t HeaderSettings::*kFields[kUnits] = {&HeaderSettings::fReleaseMajor,
                                                                 &HeaderSettings::fReleaseMinor,
                                                                 &HeaderSettings::fReleaseRevision,
                                                                 &HeaderSettings::fMachineCode,
                                                                 &HeaderSettings::fFloatCode,
                                                                 &HeaderSettings::fCompressionCode,
                                                                 nullptr,
                                                                 &HeaderSettings::fCharacterCode};
};

// Floating-point information: system-missing, highest and lowest value, 3
// float64 units. A file of this library always carries its own constants.
class SFExtensionSourceParametersDouble : public SystemFileExtensionHandler {
  public:
    void Export(QORA_DataSource&, HeaderSettings&, SystemFileExtensionRecord& rec) override {
        const double units[kUnits] = {SysmisValue(), HighestValue(), LowestValue()};
        rec.SetUnits(units, kUnits);
    }

    void Import(QORA_DataSource&, HeaderSettings& settings,
                const SystemFileExtensionRecord& rec) override {
        QORA_FILE_CHECK_TEXT(kErrBadFormat, rec.UnitSize() == 8,
                             "rec.UnitSize() == sizeof(double)");
        QORA_FILE_CHECK(kErrBadFormat, rec.NUnits() == 3);
        settings.fSysmis = rec.Unit<double>(0, settings.fSwapped);
        settings.fHighest = rec.Unit<double>(1, settings.fSwapped);
        settings.fLowest = rec.Unit<double>(2, settings.fSwapped);
    }

  private:
    enum { kUnits = 3 };
};

SFExtensionSourceParametersInt gIntHandler;
SFExtensionSourceParametersDouble gDoubleHandler;
const bool gRegistered = (RegisterExtensionHandler(kIntegerInfoExtension, gIntHandler),
                          RegisterExtensionHandler(kFloatInfoExtension, gDoubleHandler), true);

}  // namespace
