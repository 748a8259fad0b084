// The attribute records: the file's custom attributes (subtype 17) and those
// of the variables (subtype 18), in the attribute text form.
#include <string>

#include "Attributes.h"
#include "HeaderSettings.h"
#include "SystemFileExtensionRecord.h"
#include "datasrc.h"
#include "dserror.h"
#include "extension.h"

namespace {

void CheckTextFrame(const SystemFileExtensionRecord& rec) {
    QORA_FILE_CHECK_TEXT(kErrBadFormat, rec.UnitSize() == 1, "rec.UnitSize() == sizeof(char)");
    QORA_FILE_CHECK(kErrBadFormat, rec.NUnits() >= 0);
}

// The text form of the file's attributes; none when it is empty.
class SFExtensionDatasetAttributes : public SystemFileExtensionHandler {
  public:
    void Export(QORA_DataSource& src, HeaderSettings&, SystemFileExtensionRecord& rec) override {
        rec.SetText(src.FileAttributes().ToText());
    }

    // A text that does not parse leaves the attributes as they were.
    void Import(QORA_DataSource& src, HeaderSettings&,
                const SystemFileExtensionRecord& rec) override {
        CheckTextFrame(rec);
        const std::string text = rec.Text();
        src.FileAttributes().FromText(text.data(), text.size());
    }
};

// Items name:text, separated by "/", for each variable whose attributes have
// a text form. The writer exports this before it gives variables short names,
// so the names are the full ones.
class SFExtensionVariableAttributes : public SystemFileExtensionHandler {
  public:
    void Export(QORA_DataSource& src, HeaderSettings&, SystemFileExtensionRecord& rec) override {
        std::string text;
        for (int i = 0; i < src.ColumnCount(); ++i) {
            const QORA_Variable& var = src.GetVariable(i);
            const std::string form = var.GetAttributes().ToText();
            if (form.empty()) continue;
            if (!text.empty()) text += '/';
            text += var.GetName() + ':' + form;
        }
        rec.SetText(text);
    }

    // Items apply one by one: one for an unknown variable is skipped, and the
    // first that does not parse (or has no name) ends the import quietly.
    void Import(QORA_DataSource& src, HeaderSettings&,
                const SystemFileExtensionRecord& rec) override {
        CheckTextFrame(rec);
        const std::string text = rec.Text();
        size_t pos = 0;
        while (pos < text.size()) {
            const size_t colon = text.find(':', pos);
            if (colon == std::string::npos || colon == pos) return;
            const size_t start = colon + 1;
            Attributes attributes;
            size_t consumed = 0;
            if (!attributes.FromText(text.data() + start, text.size() - start, &consumed)) return;
            const int index = src.FindVariable(text.data() + pos, colon - pos);
            if (index >= 0) src.GetVariable(index).SetAttributes(attributes);
            pos = start + consumed;
            if (pos < text.size() && text[pos] == '/') ++pos;
        }
    }
};

SFExtensionDatasetAttributes gFileHandler;
SFExtensionVariableAttributes gVariableHandler;
const bool gRegistered =
    (RegisterExtensionHandler(kFileAttributesExtension, gFileHandler),
     RegisterExtensionHandler(kVariableAttributesExtension, gVariableHandler), true);

}  // namespace
