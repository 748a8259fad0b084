// The encoding record: the name of the character encoding of all text in the
// file, its bytes without a terminator.
#include "SFExtensionEncoding.h"

#include <cstdint>
#include <string>

#include "HeaderSettings.h"
#include "SystemFileExtensionRecord.h"
#include "codepage.h"
#include "dserror.h"
#include "extension.h"

namespace {

class SFExtensionEncoding : public SystemFileExtensionHandler {
  public:
    // Without a name, no record.
    void Export(QORA_DataSource&, HeaderSettings& settings,
                SystemFileExtensionRecord& rec) override {
        rec.SetText(settings.fEncodingName);
    }

    // The name is taken as it stands, whether a converter knows it or not.
    void Import(QORA_DataSource&, HeaderSettings& settings,
                const SystemFileExtensionRecord& rec) override {
        QORA_FILE_CHECK_TEXT(kErrBadFormat, rec.UnitSize() == 1, "rec.UnitSize() == sizeof(char)");
        QORA_FILE_CHECK(kErrBadFormat, rec.NUnits() > 0);
        settings.fEncodingName = rec.Text();
    }
};

SFExtensionEncoding gHandler;
const bool gRegistered = (RegisterExtensionHandler(kEncodingExtension, gHandler), true);

}  // namespace

void SetCharacterCodeFromEncoding(HeaderSettings& settings) {
    if (const long codePage = EncodingNameToCodePage(settings.fEncodingName.c_str()))
        settings.fCharacterCode = int32_t(codePage);
}

std::string FileEncodingName(const HeaderSettings& settings) {
    if (!settings.fEncodingName.empty()) return settings.fEncodingName;
    std::string name;
    if (CodePageToEncodingName(settings.fCharacterCode, name)) return name;
    return EncodingDisplayName(nullptr);
}
