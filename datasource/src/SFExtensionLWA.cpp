// The display parameters record: measurement level, column width and
// alignment of every variable, one int32 triple each, in dictionary order.
#include <cstdint>
#include <vector>

#include "HeaderSettings.h"
#include "SystemFileExtensionRecord.h"
#include "datasrc.h"
#include "dserror.h"
#include "extension.h"

namespace {

class SFExtensionLWA : public SystemFileExtensionHandler {
  public:
    // A dictionary without variables writes no record: it would have no units.
    void Export(QORA_DataSource& src, HeaderSettings&, SystemFileExtensionRecord& rec) override {
        std::vector<int32_t> units;
        units.reserve(size_t(src.ColumnCount()) * kUnitsPerVariable);
        for (int i = 0; i < src.ColumnCount(); ++i) {
            const QORA_Variable& var = src.GetVariable(i);
            units.insert(units.end(),
                         {var.GetMeasureLevel(), var.GetColumnWidth(), var.GetAlignment()});
        }
        rec.SetUnits(units.data(), int32_t(units.size()));
    }

    // Level and alignment keep their two low bits, the width its low 16; a
    // width of 0 or less leaves the variable's own.
    void Import(QORA_DataSource& src, HeaderSettings& settings,
                const SystemFileExtensionRecord& rec) override {
        QORA_FILE_CHECK_TEXT(kErrBadFormat, rec.UnitSize() == 4, "rec.UnitSize() == sizeof(int32)");
        QORA_FILE_CHECK_TEXT(kErrBadFormat,
                             rec.NUnits() == int64_t(src.ColumnCount()) * kUnitsPerVariable,
                             "rec.NUnits()== src.ColumnCount()*3");
        for (int i = 0; i < src.ColumnCount(); ++i) {
            QORA_Variable& var = src.GetVariable(i);
            const int32_t k = i * kUnitsPerVariable;
            var.SetMeasureLevel(rec.Unit<int32_t>(k, settings.fSwapped));
            const int32_t width = rec.Unit<int32_t>(k + 1, settings.fSwapped);
            if (width > 0) var.SetColumnWidth(int16_t(width));
            var.SetAlignment(rec.Unit<int32_t>(k + 2, settings.fSwapped));
        }
    }

  private:
    enum { kUnitsPerVariable = 3 };
};

SFExtensionLWA gHandler;
const bool gRegistered = (RegisterExtensionHandler(kDisplayExtension, gHandler), true);

}  // namespace
