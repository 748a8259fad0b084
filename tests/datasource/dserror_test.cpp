#include "dserror.h"

#include <gtest/gtest.h>

namespace {

std::string TextOf(void (*raise)()) {
    try {
        raise();
    } catch (const ErrorText& e) {
        return e.Text();
    }
    return "nothing raised";
}

TEST(ErrorTexts, EachFormatNamesWhatIsInvolved) {
    // A literal must land in the text, not be taken for some other argument.
    EXPECT_EQ(TextOf([] { RaiseError(1002, "compressed case data"); }),
              "Datasource error # 1002 involving compressed case data");
    EXPECT_EQ(TextOf([] { RaiseError(1505, "AGE", "age"); }),
              "Datasource error # 1505 involving AGE and age");
    EXPECT_EQ(TextOf([] { RaiseError(1209); }), "Datasource error # 1209");
}

TEST(ErrorTexts, FailedPreconditionNamesTheCondition) {
    const std::string text = TextOf([] { QORA_ASSERT(1 + 1 == 3); });
    EXPECT_NE(text.find("1 + 1 == 3"), std::string::npos);
    EXPECT_NE(text.find("dserror_test.cpp"), std::string::npos);
}

}  // namespace
