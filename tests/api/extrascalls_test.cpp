// The dictionary extras through the calls: a file that uses every item is
// written, read back item by item, appended to and copied, raw and
// compressed; the statuses of the extras calls; stored data read piece by
// piece.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "api_handles.h"
#include "sysfile_builder.h"

using fixture::OpenHandle;

namespace {

const char* const kStrings[] = {"s1", "s2"};
const char* const kNumbers[] = {"q1", "q2"};
// YEAR_ at unit 1, a dichotomy pair, a category pair, the key DATE_ at unit 6.
const std::vector<int> kDates = {0, 1, 1, 3, 4, 1, 1, 2, 1, 6, 11, 1};
const int32_t kRaw[] = {7, 9};

void Define(int h) {
    for (const auto& [name, type] : std::vector<std::pair<const char*, int>>{
             {"YEAR_", 0}, {"q1", 0}, {"q2", 0}, {"s1", 8}, {"s2", 8}, {"DATE_", 10}})
        ASSERT_EQ(qoraSetVarName(h, name, type), QORA_STATUS_OK) << name;
}

void WriteExtras(const std::string& path, bool compressed, int documents) {
    OpenHandle h;
    fixture::OpenForWrite(path, h);
    const int w = h.get();
    Define(w);
    const char* const attributeNames[] = {"Note[1]", "Note[2]", "Owner", ""};
    const char* const attributeTexts[] = {"a", "b", "me", "skipped"};
    const int statuses[] = {
        qoraSetCompression(w, compressed),
        qoraCopyDocuments(documents, w),
        qoraSetTextInfo(w, "text info"),
        qoraSetKIVGUID(w, "{guid}"),
        qoraSetKIVFirst(w, "abcd", 4),
        qoraSetKIVNext(w, "\x01\0\0\0", 4),
        qoraAddMultRespDefC(w, "$cat", "Categories", 0, nullptr, kStrings, 2),
        qoraAddMultRespDefN(w, "$dich", "Yes", 1, 1, kNumbers, 2),
        qoraSetVariableSets(w, "Both= q1 s1\n"),
        qoraSetDateVariables(w, int(kDates.size()), kDates.data()),
        qoraSetFileAttributes(w, attributeNames, attributeTexts, 4),
        qoraAddFileAttribute(w, "$CreationDate", -1, "2026"),
        qoraAddVarAttribute(w, "q1", "Unit", -1, "kg"),
        qoraSetExtensionData(w, 30, 4, 2, kRaw),
        qoraCommitHeader(w),
        qoraCommitCaseRecord(w),
    };
    for (size_t i = 0; i < std::size(statuses); ++i) EXPECT_EQ(statuses[i], 0) << "call " << i;
}

void ExpectDefinition(int r, int index, const char* name, int dichotomy, const char* const* vars) {
    qoraMultRespDef* def = nullptr;
    ASSERT_EQ(qoraGetMultRespDefByIndex(r, index, &def), QORA_STATUS_OK);
    EXPECT_STREQ(def->name, name);
    EXPECT_EQ(def->isDichotomy, dichotomy);
    EXPECT_EQ(def->isNumeric, dichotomy);
    ASSERT_EQ(def->numVars, 2);
    for (int i = 0; i < 2; ++i) EXPECT_STREQ(def->varNames[i], vars[i]);
    EXPECT_STREQ(def->countedValue, dichotomy ? "1" : nullptr);
    EXPECT_EQ(qoraFreeMultRespDefStruct(def), QORA_STATUS_OK);
}

void ExpectExtras(const std::string& path) {
    OpenHandle h;
    fixture::OpenForRead(path, h);
    const int r = h.get();
    int present = 0, n = 0, last = 0, size = 0;
    EXPECT_EQ(qoraQueryType7(r, 0, &present), QORA_STATUS_OK);
    EXPECT_EQ(present, 1) << "documents";
    char text[257];
    EXPECT_EQ(qoraGetTextInfo(r, text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "text info");
    EXPECT_EQ(qoraGetKIVGUID(r, text), QORA_STATUS_OK);
    EXPECT_STREQ(text, "{guid}");
    EXPECT_EQ(qoraGetKIVInfo(r, &n, &last), QORA_STATUS_OK);
    EXPECT_EQ(n * 1000 + last, 8001);
    EXPECT_EQ(qoraGetKIVFirst(r, text, 5, &n), QORA_STATUS_OK);
    EXPECT_EQ(std::string(text, size_t(n)), std::string("abcd\x01", 5));
    EXPECT_EQ(qoraGetKIVNext(r, text, 5, &n), QORA_STATUS_OK);
    EXPECT_EQ(n, 3);

    EXPECT_EQ(qoraGetMultRespCount(r, &n), QORA_STATUS_OK);
    EXPECT_EQ(n, 2);
    ExpectDefinition(r, 0, "$cat", 0, kStrings);
    ExpectDefinition(r, 1, "$dich", 1, kNumbers);
    char* sets = nullptr;
    EXPECT_EQ(qoraGetVariableSets(r, &sets), QORA_STATUS_OK);
    EXPECT_STREQ(sets, "Both= q1 s1\n");
    EXPECT_EQ(qoraFreeVariableSets(sets), QORA_STATUS_OK);

    int* dates = nullptr;
    EXPECT_EQ(qoraGetDateVariables(r, &n, &dates), QORA_STATUS_OK);
    EXPECT_EQ(std::vector<int>(dates, dates + n), kDates);
    EXPECT_EQ(qoraFreeDateVariables(dates), QORA_STATUS_OK);

    char **names = nullptr, **texts = nullptr;
    ASSERT_EQ(qoraGetFileAttributes(r, &names, &texts, &n), QORA_STATUS_OK);
    std::string listed;
    for (int i = 0; i < n; ++i) listed += std::string(names[i]) + "=" + texts[i] + ";";
    EXPECT_EQ(listed, "Note[1]=a;Note[2]=b;Owner=me;$CreationDate=2026;");
    qoraFreeAttributes(names, texts, n);
    ASSERT_EQ(qoraGetVarAttributes(r, "Q1", &names, &texts, &n), QORA_STATUS_OK);
    ASSERT_EQ(n, 1);
    EXPECT_STREQ(texts[0], "kg");
    qoraFreeAttributes(names, texts, n);

    int32_t raw[3] = {};
    EXPECT_EQ(qoraGetExtensionDataDesc(r, 30, &size, &n), QORA_STATUS_OK);
    EXPECT_EQ(size * 10 + n, 42);
    EXPECT_EQ(qoraGetExtensionData(r, 30, sizeof raw, &n, raw), QORA_STATUS_OK);
    EXPECT_EQ(n * 100 + raw[0] * 10 + raw[1], 279);
}

class Extras : public ::testing::TestWithParam<bool> {};

TEST_P(Extras, SurviveWritingAppendingAndCopying) {
    fixture::SysFileBuilder b;
    b.Numeric("x");
    b.Documents({"a note", "   (Entered 05 Mar 1999)", ""});
    OpenHandle documents;
    fixture::OpenForRead(b.WriteTemp("documents.qsf"), documents);
    fixture::TempDir dir;
    const std::string path = dir.Path() + "/extras.qsf", copy = dir.Path() + "/copy.qsf";
    WriteExtras(path, GetParam(), documents.get());
    ExpectExtras(path);
    {
        OpenHandle h;
        ASSERT_EQ(qoraOpenAppend(path.c_str(), h.out()), QORA_STATUS_OK);
        EXPECT_EQ(qoraCommitCaseRecord(h.get()), QORA_STATUS_OK);
    }
    ExpectExtras(path);
    {
        OpenHandle h;
        ASSERT_EQ(qoraOpenWriteCopy(copy.c_str(), path.c_str(), h.out()), QORA_STATUS_OK);
        EXPECT_EQ(qoraAddMultRespDefC(h.get(), "$cat", "", 0, nullptr, kNumbers, 2),
                  QORA_STATUS_DUPLICATE_MRSET);
        EXPECT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
    }
    ExpectExtras(copy);
}

INSTANTIATE_TEST_SUITE_P(Forms, Extras, ::testing::Values(false, true),
                         [](const auto& info) { return info.param ? "Compressed" : "Raw"; });

TEST(ExtrasCalls, Statuses) {
    fixture::TempDir dir;
    const std::string path = dir.Path() + "/plain.qsf";
    {
        OpenHandle h;
        fixture::OpenForWrite(path, h);
        Define(h.get());
        ASSERT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
    }
    OpenHandle read, write, append;
    fixture::OpenForRead(path, read);
    fixture::OpenForWrite(dir.Path() + "/new.qsf", write);
    ASSERT_EQ(qoraOpenAppend(path.c_str(), append.out()), QORA_STATUS_OK);
    Define(write.get());
    const int r = read.get(), w = write.get(), a = append.get();
    int x = 0, y = 0;
    char text[257];
    char* out = nullptr;
    qoraMultRespDef* def = reinterpret_cast<qoraMultRespDef*>(&x);
    const char* const once[] = {"q1", nullptr};
    const char* const twice[] = {"q1", " Q1"};
    const char* const mixed[] = {"q1", "s1"};
    const char* const badSubscript[] = {"a[x]"};
    qoraMultRespDef disagreeing{};
    std::strcpy(disagreeing.name, "$bad");
    disagreeing.varNames = const_cast<char**>(once);
    disagreeing.numVars = 5;
    qoraMultRespDef labelled = disagreeing;
    labelled.numVars = 0;
    labelled.useCategoryLabels = 1;
    const std::vector<int> noVariable = {0, 1, 1, 1, 1, 1, 99, 2, 1};
    const std::vector<int> notYear = {0, 1, 1, 1, 1, 1, 2, 2, 1};
    const std::vector<int> dateKey = {0, 1, 1, 1, 1, 1, 1, 2, 1, 1, 2, 1};
    const struct {
        int status, expected;
    } rows[] = {
        {qoraSetExtensionData(w, 13, 1, 1, "x"), 57},
        {qoraSetExtensionData(w, 41, 1, 1, "x"), 57},
        {qoraSetExtensionData(-1, 22, 1, 1, "x"), 57},
        {qoraSetExtensionData(w, 30, 1, -1, "x"), 57},
        {qoraGetExtensionDataDesc(r, 0, &x, &y), 57},
        {qoraGetExtensionData(r, 6, 8, &x, text), 57},
        {qoraGetExtensionDataDesc(w, 30, &x, &y), 9},
        {qoraGetExtensionData(r, 30, 8, &x, nullptr), 3},
        {qoraQueryType7(r, 41, &x), 73},
        {qoraQueryType7(r, -1, &x), 73},
        {qoraQueryType7(w, 5, &x), 9},
        {qoraGetTextInfo(w, text), 9},
        {qoraGetTextInfo(r, nullptr), 3},
        {qoraGetMultRespDefs(r, &out), -13},
        {qoraGetVariableSets(r, &out), -7},
        {qoraGetDateVariables(r, &x, nullptr), 3},
        {qoraGetDateVariables(w, &x, reinterpret_cast<int**>(&out)), 9},
        {qoraGetDateVariables(r, &x, reinterpret_cast<int**>(&out)), -11},
        {qoraGetKIVInfo(r, &x, &y), -14},
        {qoraGetKIVFirst(r, text, 8, &x), -14},
        {qoraSetKIVNext(r, "x", 1), 8},
        {qoraSetKIVNext(a, "x", 1), 30},
        {qoraGetMultRespDefByIndex(r, 0, &def), 77},
        {def == nullptr, 1},
        {qoraGetMultRespCount(99, &x), 5},
        {qoraAddMultRespDefC(r, "$r", "", 0, nullptr, kNumbers, 2), 8},
        {qoraAddMultRespDefC(a, "$a", "", 0, nullptr, kNumbers, 2), 30},
        {qoraAddMultRespDefC(w, "cat", "", 0, nullptr, kNumbers, 2), 71},
        {qoraAddMultRespDefC(w, "$one", "", 0, nullptr, kNumbers, 1), 70},
        {qoraAddMultRespDefC(w, "$mix", "", 0, nullptr, mixed, 2), 70},
        {qoraAddMultRespDefC(w, "$twice", "", 0, nullptr, twice, 2), 70},
        {qoraAddMultRespDefC(w, "$empty", "", 1, "", kStrings, 2), 70},
        {qoraAddMultRespDefExt(w, &disagreeing), 70},
        {qoraAddMultRespDefExt(w, &labelled), 70},
        {qoraAddMultRespDefN(w, "$d", "", 1, 1, kNumbers, 2), 0},
        {qoraAddMultRespDefN(w, "$D", "", 1, 1, kNumbers, 2), 72},
        {qoraAddFileAttribute(w, "x", 0, "t"), 76},
        {qoraAddFileAttribute(w, "x", 70000, "t"), 76},
        {qoraAddFileAttribute(w, "$Other", -1, "t"), 75},
        {qoraAddVarAttribute(w, "q1", "$ODBC.Type", -1, "t"), 0},
        {qoraSetFileAttributes(w, nullptr, nullptr, 1), 76},
        {qoraSetFileAttributes(w, badSubscript, badSubscript, 1), 75},
        {qoraSetVarAttributes(w, "none", once, once, 0), 12},
        {qoraSetDateVariables(w, 5, kDates.data()), 45},
        {qoraSetDateVariables(w, 9, noVariable.data()), 45},
        {qoraSetDateVariables(w, 9, notYear.data()), 45},
        {qoraSetDateVariables(w, 12, dateKey.data()), 45},
        {qoraSetDateVariables(a, 12, kDates.data()), 30},
        {qoraFreeMultRespDefs(nullptr), 0},
        {qoraFreeVariableSets(nullptr), 0},
        {qoraFreeMultRespDefStruct(nullptr), 0},
        {qoraFreeDateVariables(nullptr), 0},
    };
    for (size_t i = 0; i < std::size(rows); ++i)
        EXPECT_EQ(rows[i].status, rows[i].expected) << "row " << i;
    EXPECT_EQ(qoraGetMultRespCount(w, &x), QORA_STATUS_OK);
    EXPECT_EQ(x, 1) << "only $d was added";
}

TEST(ExtrasCalls, StoredDataIsHandedOutInWholeElements) {
    fixture::SysFileBuilder b;
    b.Numeric("x");
    b.TextExtension(10, std::string(600, 't'));
    b.Extension(30, 4, b.Int32s({1, 2}));
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);
    std::vector<int> counts;
    char buffer[256];
    for (int i = 0; i < 5; ++i) {
        int n = -1;
        EXPECT_EQ(qoraGetExtensionData(h.get(), 10, sizeof buffer, &n, buffer), QORA_STATUS_OK);
        counts.push_back(n);
    }
    EXPECT_EQ(counts, (std::vector<int>{256, 256, 88, 0, 256}));
    char text[256];
    EXPECT_EQ(qoraGetTextInfo(h.get(), text), QORA_STATUS_OK);
    EXPECT_EQ(std::strlen(text), 255u);
    int n = -1;
    EXPECT_EQ(qoraGetExtensionData(h.get(), 10, sizeof buffer, &n, buffer), QORA_STATUS_OK);
    EXPECT_EQ(n, 256) << "the text info read starts the reader again";
    EXPECT_EQ(qoraGetExtensionData(h.get(), 30, 3, &n, buffer), QORA_STATUS_OK);
    EXPECT_EQ(n, 0) << "no element fits in 3 bytes";
}

}  // namespace
