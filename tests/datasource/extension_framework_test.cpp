#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "HeaderSettings.h"
#include "SystemFileExtensionRecord.h"
#include "datasrc.h"

namespace {

class Source : public QORA_DataSource {
    QORA_InputCaseIterator* NewIterator(void*) override { return nullptr; }
};

// Records what it was given; exports three bytes.
class RecordingHandler : public SystemFileExtensionHandler {
  public:
    void Export(QORA_DataSource&, HeaderSettings&, SystemFileExtensionRecord& record) override {
        record.SetUnitSize(1);
        record.SetNUnits(3);
        record.SetContents("abc");
    }
    void Import(QORA_DataSource&, HeaderSettings&,
                const SystemFileExtensionRecord& record) override {
        imported.assign(reinterpret_cast<const char*>(record.Contents()), record.ByteCount());
    }
    std::string imported;
};

// Subtypes no real handler uses; the registry is process-wide.
constexpr int32_t kHandled = 97;
constexpr int32_t kUnhandled = 98;

RecordingHandler& Handler() {
    static RecordingHandler handler;
    static const bool registered = (RegisterExtensionHandler(kHandled, handler), true);
    (void)registered;
    return handler;
}

SystemFileExtensionRecord RecordOf(const std::string& bytes, int32_t unitSize) {
    SystemFileExtensionRecord record(unitSize, int32_t(bytes.size()) / unitSize);
    record.SetContents(bytes.data());
    return record;
}

}  // namespace

TEST(ExtensionRecord, ContentsNeedBothSizesAndFixThem) {
    SystemFileExtensionRecord record;
    EXPECT_THROW(record.Contents(), ErrorText);
    record.SetUnitSize(4);
    record.SetNUnits(2);
    EXPECT_EQ(record.ByteCount(), 8);
    record.SetContents("12345678");
    EXPECT_EQ(std::memcmp(record.Contents(), "12345678", 8), 0);
    EXPECT_THROW(record.SetNUnits(3), ErrorText);
    EXPECT_THROW(record.SetUnitSize(1), ErrorText);
}

TEST(ExtensionRegistry, FindsOnlyRegisteredSubtypes) {
    RecordingHandler& handler = Handler();
    EXPECT_EQ(FindExtensionHandler(kHandled), &handler);
    EXPECT_EQ(FindExtensionHandler(kUnhandled), nullptr);
    for (int32_t subtype : {-1, 1 << 20}) EXPECT_EQ(FindExtensionHandler(subtype), nullptr);
}

TEST(ExtensionRegistry, ImportGoesToTheHandlerOrIntoStorage) {
    RecordingHandler& handler = Handler();
    Source source;
    HeaderSettings settings;
    ImportExtension(kHandled, source, settings, RecordOf("xyz!", 2));
    EXPECT_EQ(handler.imported, "xyz!");
    EXPECT_FALSE(source.HasExtension(kHandled));

    ImportExtension(kUnhandled, source, settings, RecordOf("12345678", 4));
    ASSERT_TRUE(source.HasExtension(kUnhandled));
    const QORA_ExtensionImpl* stored = source.GetExtension(kUnhandled).Impl();
    EXPECT_EQ(stored->ElementSize(), 4);
    EXPECT_EQ(stored->Content(), "12345678");
    EXPECT_TRUE(settings.HasSeen(kHandled));
    EXPECT_TRUE(settings.HasSeen(kUnhandled));

    ImportExtension(150, source, settings, RecordOf("q", 1));
    EXPECT_TRUE(source.HasExtension(150));
    EXPECT_EQ(settings.fRecordsSeen.count(), 2u);
}

TEST(ExtensionRegistry, ExportTakesTheHandlerOverStorage) {
    Handler();
    Source source;
    source.SetExtensionContent(kHandled, 1, 5, "store");
    source.SetExtensionContent(kUnhandled, 4, 2, "abcdefgh");
    HeaderSettings settings;

    SystemFileExtensionRecord handled;
    ExportExtension(kHandled, source, settings, handled);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(handled.Contents()), 3), "abc");

    SystemFileExtensionRecord stored;
    ExportExtension(kUnhandled, source, settings, stored);
    EXPECT_EQ(stored.UnitSize(), 4);
    EXPECT_EQ(stored.NUnits(), 2);
    EXPECT_EQ(std::memcmp(stored.Contents(), "abcdefgh", 8), 0);

    SystemFileExtensionRecord absent;
    ExportExtension(12, source, settings, absent);
    EXPECT_TRUE(absent.IsEmpty());
}
