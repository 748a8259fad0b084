// Attribute calls on a file read from disk: the arrays handed out, their
// subscripted names, and the statuses of the getters.
#include <gtest/gtest.h>

#include <string>

#include "api_handles.h"
#include "qoraio32.h"
#include "sysfile_builder.h"

namespace {

using fixture::OpenHandle;
using fixture::SysFileBuilder;

// "name=text;" for each attribute handed out, after the call's status.
template <class Get>
std::string Listed(Get get) {
    char** names = nullptr;
    char** texts = nullptr;
    int count = -1;
    std::string out = std::to_string(get(&names, &texts, &count)) + "|";
    for (int i = 0; i < count; ++i) out += std::string(names[i]) + "=" + texts[i] + ";";
    EXPECT_EQ(qoraFreeAttributes(names, texts, count), QORA_STATUS_OK);
    return out;
}

TEST(AttributeCalls, ValuesAreListedUnderSubscriptedNames) {
    SysFileBuilder b;
    b.Numeric("AGE");
    b.Numeric("W");
    std::vector<std::string> twelve;
    for (int i = 1; i <= 12; ++i) twelve.push_back(i == 5 ? "" : "v" + std::to_string(i));
    b.FileAttributes(SysFileBuilder::AttributeText({{"Origin", {"survey"}}, {"Many", twelve}}));
    b.VariableAttributes(
        {{"AGE", SysFileBuilder::AttributeText({{"Unit", {"years"}}, {"Pair", {"a", "b"}}})}});
    OpenHandle h;
    fixture::OpenForRead(b.WriteTemp(), h);

    std::string many;
    for (int i = 1; i <= 12; ++i)
        if (i != 5)
            many += "Many[" + std::string(i < 10 ? "0" : "") + std::to_string(i) + "]=v" +
                    std::to_string(i) + ";";
    EXPECT_EQ(Listed([&](char*** n, char*** t, int* c) {
                  return qoraGetFileAttributes(h.get(), n, t, c);
              }),
              "0|Origin=survey;" + many);
    EXPECT_EQ(Listed([&](char*** n, char*** t, int* c) {
                  return qoraGetVarAttributes(h.get(), "age", n, t, c);
              }),
              "0|Unit=years;Pair[1]=a;Pair[2]=b;");
    EXPECT_EQ(Listed([&](char*** n, char*** t, int* c) {
                  return qoraGetVarAttributes(h.get(), "w", n, t, c);
              }),
              "0|");
    EXPECT_EQ(Listed([&](char*** n, char*** t, int* c) {
                  return qoraGetVarAttributes(h.get(), "nope", n, t, c);
              }),
              std::to_string(QORA_STATUS_VAR_NOT_FOUND) + "|");
    EXPECT_EQ(Listed([&](char*** n, char*** t, int* c) {
                  return qoraGetFileAttributes(h.get() + 1, n, t, c);
              }),
              std::to_string(QORA_STATUS_BAD_FILE_HANDLE) + "|");
}

}  // namespace
