// The case count record: a byte-order marker and a 64-bit case count, whose
// place in the file the reader notes so that the count can be patched when
// the file is finished.
#include <cstdint>

#include "HeaderSettings.h"
#include "SystemFileExtensionRecord.h"
#include "dserror.h"
#include "extension.h"

namespace {

class SFExtensionNCases : public SystemFileExtensionHandler {
  public:
    void Export(QORA_DataSource&, HeaderSettings& settings,
                SystemFileExtensionRecord& rec) override {
        const int64_t units[2] = {kMarker, settings.fCaseCount};
        rec.SetUnits(units, 2);
    }

    // The marker, not the header, tells the count's byte order: the record
    // may come from a machine of the other order. A count only ever raises
    // the one the header gave (an unknown -1 is always replaced).
    void Import(QORA_DataSource&, HeaderSettings& settings,
                const SystemFileExtensionRecord& rec) override {
        QORA_FILE_CHECK_TEXT(kErrBadFormat, rec.UnitSize() == 8, "rec.UnitSize() == sizeof(int64)");
        QORA_FILE_CHECK(kErrBadFormat, rec.NUnits() == 1 || rec.NUnits() == 2);
        const int64_t count = rec.NUnits() == 2
                                  ? rec.Unit<int64_t>(1, rec.Unit<int64_t>(0, false) != kMarker)
                                  : rec.Unit<int64_t>(0, settings.fSwapped);
        if (count >= settings.fCaseCount) settings.fCaseCount = count;
    }

  private:
    static constexpr int64_t kMarker = 1;
};

SFExtensionNCases gHandler;
const bool gRegistered = (RegisterExtensionHandler(kCaseCountExtension, gHandler), true);

}  // namespace
