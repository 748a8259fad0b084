// The date variables record: the date variable information of the data
// source as int32 units (the layout of QORA_TrendsInfo::Elements).
#include <cstdint>
#include <vector>

#include "HeaderSettings.h"
#include "SystemFileExtensionRecord.h"
#include "datasrc.h"
#include "dserror.h"
#include "extension.h"
#include "trendsinfo.h"

namespace {

class SFExtensionTrendsInfo : public SystemFileExtensionHandler {
  public:
    void Export(QORA_DataSource& src, HeaderSettings&, SystemFileExtensionRecord& rec) override {
        QORA_TrendsInfo& info = src.DateInfo();
        info.Validate(src);
        if (!info.Setting() && info.DateVarCount() == 0) return;
        const std::vector<int32_t> units = info.Elements(src);
        rec.SetUnits(units.data(), int32_t(units.size()));
    }

    // The record is applied whole or not at all: a count the information
    // cannot hold, more triples than its entries or a position past the
    // last variable make the file malformed.
    void Import(QORA_DataSource& src, HeaderSettings& settings,
                const SystemFileExtensionRecord& rec) override {
        QORA_FILE_CHECK_TEXT(kErrBadFormat, rec.UnitSize() == 4, "rec.UnitSize() == 4");
        const int32_t nElements = rec.NUnits();
        QORA_FILE_CHECK(kErrBadFormat, nElements >= kFixedUnits);
        const auto unit = [&](int32_t k) { return rec.Unit<int32_t>(k, settings.fSwapped); };
        const int32_t nDateVars = unit(2);
        QORA_FILE_CHECK(kErrBadFormat, 0 <= nDateVars && nDateVars < QORA_TrendsInfo::eMaxDateVars);
        QORA_FILE_CHECK_TEXT(kErrBadFormat, nElements >= 3 * nDateVars + 6,
                             "nElements >= 3*nDateVars+6");
        QORA_FILE_CHECK_TEXT(kErrBadFormat, nElements <= 3 * nDateVars + 9,
                             "nElements <= 3*nDateVars+9");

        QORA_TrendsInfo info;
        info.SetCount(nDateVars);
        for (int32_t i = 0; i < (nElements - kFixedUnits) / 3; ++i) {
            const int32_t position = unit(kFixedUnits + 3 * i);
            if (position < 1) continue;
            const int32_t type = unit(kFixedUnits + 3 * i + 1);
            const size_t iVar = src.Layout().FirstAtOrAfter(position - 1);
            const size_t nVars = src.Layout().Count();
            QORA_FILE_CHECK_TEXT(kErrBadFormat, iVar < nVars, "iVar < nVars");
            QORA_FILE_CHECK_TEXT(kErrBadFormat,
                                 i < nDateVars || type == QORA_TrendsInfo::e_DATKEY ||
                                     type == QORA_TrendsInfo::e_NONE,
                                 "iDateVar < nDateVars || iType == e_DATKEY || iType == e_NONE");
            info.SetEntry(src, i, int32_t(iVar), type, unit(kFixedUnits + 3 * i + 2));
        }
        info.SetSetting(unit(0) != 0, unit(1));
        info.SetFirst(unit(4));
        info.SetSecond(unit(3));
        src.DateInfo() = info;
    }

  private:
    // The six numbers before the triples.
    enum { kFixedUnits = 6 };
};

SFExtensionTrendsInfo gHandler;
const bool gRegistered = (RegisterExtensionHandler(kDateInfoExtension, gHandler), true);

}  // namespace
