// The dictionary extras through the calls: every item written, read back,
// appended to and copied; their statuses; stored data read piece by piece.
#include <gtest/gtest.h>

#include <sstream>
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
    // Note[3] to Note[9] stay empty: they are not handed out.
    const char* const attributeNames[] = {"Note[1]", "Note[2]", "Note[10]", "Owner", ""};
    const char* const attributeTexts[] = {"a", "b", "c", "me", "skipped"};
    const int statuses[] = {qoraSetCompression(w, compressed),
                            qoraCopyDocuments(documents, w),
                            qoraSetTextInfo(w, "text info"),
                            qoraSetKIVGUID(w, "{guid}"),
                            qoraSetKIVFirst(w, "abcd", 4),
                            qoraSetKIVNext(w, "\x01\0\0\0", 4),
                            qoraAddMultRespDefC(w, "$cat", "Categories", 0, nullptr, kStrings, 2),
                            qoraAddMultRespDefN(w, "$dich", "Yes", 1, 1, kNumbers, 2),
                            qoraSetVariableSets(w, "Both= q1 s1\n"),
                            qoraSetDateVariables(w, int(kDates.size()), kDates.data()),
                            qoraSetFileAttributes(w, attributeNames, attributeTexts, 5),
                            qoraAddFileAttribute(w, "$CreationDate", -1, "2026"),
                            qoraAddVarAttribute(w, "q1", "Unit", -1, "kg"),
                            qoraSetExtensionData(w, 30, 4, 2, kRaw),
                            qoraCommitHeader(w),
                            qoraCommitCaseRecord(w)};
    for (size_t i = 0; i < std::size(statuses); ++i) EXPECT_EQ(statuses[i], 0) << "call " << i;
}

// A set as "name:dichotomy,numeric,counted:members".
std::string Definition(int r, int index) {
    qoraMultRespDef* def = nullptr;
    if (qoraGetMultRespDefByIndex(r, index, &def) != QORA_STATUS_OK) return "missing";
    std::ostringstream out;
    out << def->name << ':' << def->isDichotomy << ',' << def->isNumeric << ','
        << (def->countedValue ? def->countedValue : "") << ':';
    for (int i = 0; i < def->numVars; ++i) out << def->varNames[i] << ' ';
    qoraFreeMultRespDefStruct(def);
    return out.str();
}

std::string Listed(int status, char** names, char** texts, int count) {
    std::string listed = std::to_string(status);
    for (int i = 0; i < count; ++i) listed += std::string(names[i]) + "=" + texts[i] + ";";
    qoraFreeAttributes(names, texts, count);
    return listed;
}

// Every extras item of the file as the reading calls hand it out, each after
// the status of its call.
std::string ReadExtras(const std::string& path) {
    OpenHandle h;
    fixture::OpenForRead(path, h);
    const int r = h.get();
    int n = 0, m = 0, status = 0;
    char text[257], *sets = nullptr, **names = nullptr, **texts = nullptr;
    int* dates = nullptr;
    int32_t raw[3] = {};
    std::ostringstream out;
    out << qoraQueryType7(r, 0, &n) << n << '|' << qoraGetTextInfo(r, text) << text << '|'
        << qoraGetKIVGUID(r, text) << text << '|' << qoraGetKIVInfo(r, &n, &m) << n << ',' << m
        << '|' << qoraGetKIVFirst(r, text, 5, &n) << std::string(text, size_t(n)) << '|'
        << qoraGetKIVNext(r, text, 5, &n) << n << '|' << qoraGetMultRespCount(r, &n) << n << '|'
        << Definition(r, 0) << '|' << Definition(r, 1) << '|' << qoraGetVariableSets(r, &sets)
        << sets << '|' << qoraGetDateVariables(r, &n, &dates) << ':';
    for (int i = 0; i < n; ++i) out << dates[i] << ' ';
    qoraFreeVariableSets(sets);
    qoraFreeDateVariables(dates);
    status = qoraGetFileAttributes(r, &names, &texts, &n);
    out << '|' << Listed(status, names, texts, n);
    status = qoraGetVarAttributes(r, "Q1", &names, &texts, &n);
    out << '|' << Listed(status, names, texts, n) << '|' << qoraGetExtensionDataDesc(r, 30, &m, &n)
        << m << ',' << n << '|' << qoraGetExtensionData(r, 30, sizeof raw, &n, raw) << n << ':'
        << raw[0] << ',' << raw[1];
    return out.str();
}

const std::string kExtras =
    "01|0text info|0{guid}|08,1|0abcd\x01|03|02|$cat:0,0,:s1 s2 |$dich:1,1,1:q1 q2 |0Both= q1 "
    "s1\n|0:0 1 1 3 4 1 1 2 1 6 11 1 "
    "|0Note[01]=a;Note[02]=b;Note[10]=c;Owner=me;$CreationDate=2026;|0Unit=kg;"
    "|04,2|02:7,9";

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
    EXPECT_EQ(ReadExtras(path), kExtras);
    {
        OpenHandle h;
        ASSERT_EQ(qoraOpenAppend(path.c_str(), h.out()), QORA_STATUS_OK);
        EXPECT_EQ(qoraCommitCaseRecord(h.get()), QORA_STATUS_OK);
    }
    EXPECT_EQ(ReadExtras(path), kExtras);
    {
        OpenHandle h;
        ASSERT_EQ(qoraOpenWriteCopy(copy.c_str(), path.c_str(), h.out()), QORA_STATUS_OK);
        EXPECT_EQ(qoraAddMultRespDefC(h.get(), "$cat", "", 0, nullptr, kNumbers, 2),
                  QORA_STATUS_DUPLICATE_MRSET);
        EXPECT_EQ(qoraCommitHeader(h.get()), QORA_STATUS_OK);
    }
    EXPECT_EQ(ReadExtras(copy), kExtras);
}

INSTANTIATE_TEST_SUITE_P(Forms, Extras, ::testing::Values(false, true),
                         [](const auto& info) { return info.param ? "Compressed" : "Raw"; });

TEST(ExtrasCalls, Statuses) {
    fixture::SysFileBuilder b;
    b.Numeric("q1");
    const std::string path = b.WriteTemp();
    OpenHandle read, write, append;
    fixture::OpenForRead(path, read);
    fixture::OpenForWrite(path + ".new", write);
    ASSERT_EQ(qoraOpenAppend(path.c_str(), append.out()), QORA_STATUS_OK);
    Define(write.get());
    const int r = read.get(), w = write.get(), a = append.get();
    int x = 0, y = 0;
    char* out = nullptr;
    qoraMultRespDef* def = reinterpret_cast<qoraMultRespDef*>(&x);
    const char* const once[] = {"q1", nullptr};
    const char* const twice[] = {"q1", " Q1"};
    const char* const mixed[] = {"q1", "s1"};
    const char* const badSubscript[] = {"a[x]"};
    char** names = nullptr;
    qoraMultRespDef disagreeing{};
    std::string("$bad").copy(disagreeing.name, 4);
    qoraMultRespDef labelled = disagreeing;
    labelled.useCategoryLabels = 1;
    disagreeing.varNames = const_cast<char**>(once);
    disagreeing.numVars = 5;
    using Ints = std::vector<int>;
    const struct {
        int status, expected;
    } rows[] = {
        {qoraSetExtensionData(w, 13, 1, 1, "x"), 57},
        {qoraSetExtensionData(w, 41, 1, 1, "x"), 57},
        {qoraSetExtensionData(-1, 22, 1, 1, "x"), 57},
        {qoraSetExtensionData(w, 30, 1, -1, "x"), 57},
        {qoraGetExtensionDataDesc(w, 30, &x, &y), 9},
        {qoraGetExtensionData(r, 30, 8, &x, nullptr), 3},
        {qoraQueryType7(r, 41, &x), 73},
        {qoraGetTextInfo(r, nullptr), 3},
        {qoraGetMultRespDefs(r, &out), -13},
        {qoraGetVariableSets(r, &out), -7},
        {qoraGetDateVariables(r, &x, reinterpret_cast<int**>(&out)), -11},
        {qoraGetKIVInfo(r, &x, &y), -14},
        {qoraSetKIVNext(r, "x", 1), 8},
        {qoraGetMultRespDefByIndex(r, 0, &def), 77},
        {def == nullptr, 1},
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
        {qoraGetVarAttributes(r, "nope", &names, &names, &x), 12},
        {qoraGetFileAttributes(-1, &names, &names, &x), 5},
        {qoraSetDateVariables(w, 5, kDates.data()), 45},
        {qoraSetDateVariables(w, 9, Ints{0, 1, 1, 1, 1, 1, 99, 2, 1}.data()), 45},
        {qoraSetDateVariables(w, 9, Ints{0, 1, 1, 1, 1, 1, 2, 2, 1}.data()), 45},
        {qoraSetDateVariables(w, 12, Ints{0, 1, 1, 1, 1, 1, 1, 2, 1, 1, 2, 1}.data()), 45},
        {qoraSetDateVariables(a, 12, kDates.data()), 30},
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
    int n = -1;
    EXPECT_EQ(qoraGetExtensionData(h.get(), 30, 3, &n, buffer), QORA_STATUS_OK);
    EXPECT_EQ(n, 0) << "no element fits in 3 bytes";
}

}  // namespace
