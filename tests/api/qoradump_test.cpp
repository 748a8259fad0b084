// The dump tool on the example file: its CSV, its dictionary text, its
// ranges and its error reports, as a user sees them.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <fstream>
#include <string>

#include "run_tool.h"
#include "sysfile_builder.h"

namespace {

using DumpResult = fixture::ToolRun;

DumpResult Dump(const std::string& arguments) {
    return fixture::RunTool(std::string(QORADUMP_PATH) + " " + arguments);
}

const std::string kSample = QORA_EXAMPLES_DIR "/sample.qsf";

TEST(QoraDump, CasesAreCsvWithQuotingTrimmingAndEmptyMissing) {
    const DumpResult run = Dump("--cases " + kSample);
    ASSERT_EQ(run.exitCode, 0) << run.output;
    EXPECT_EQ(run.output.substr(0, run.output.find('\n')),
              "Id,Sex,Score,City,Remark,Born,CountryOfBirth,InterviewerComments");
    EXPECT_NE(run.output.find("\n1,1,87.5,LDN,friendly,1970-01-01,United Kingdom," +
                              std::string(279, '-') + " end of a long remark\n"),
              std::string::npos);
    EXPECT_NE(run.output.find("\n2,2,92,PAR,\"said \"\"no comment\"\"\","), std::string::npos);
    EXPECT_NE(run.output.find("\n3,9,-5,NONE,,,,\n"), std::string::npos);
    EXPECT_NE(run.output.find("\n6,,70,PAR,,1582-10-14,,\n"), std::string::npos);  // date 0
    EXPECT_NE(run.output.find("\n4,1,,LDN,\"late, then left early\","), std::string::npos);
    EXPECT_NE(run.output.find("\n5,2,64.25,ROM,  leading blanks kept,"), std::string::npos);
    EXPECT_EQ(std::count(run.output.begin(), run.output.end(), '\n'), 13);
}

TEST(QoraDump, RangeSeeksToTheFirstCaseAndStopsAfterTheLast) {
    const DumpResult run = Dump("--cases --from 11 --to 12 " + kSample);
    ASSERT_EQ(run.exitCode, 0) << run.output;
    EXPECT_EQ(run.output,
              "Id,Sex,Score,City,Remark,Born,CountryOfBirth,InterviewerComments\n"
              "11,1,-1,NONE,refused the test,1968-05-01,,\n"
              "12,2,79,PAR,the last one,2010-01-02,,\n");

    const DumpResult past = Dump("--cases --from 20 " + kSample);
    EXPECT_EQ(past.exitCode, 0) << past.output;
    EXPECT_EQ(std::count(past.output.begin(), past.output.end(), '\n'), 1);
}

// Every property of the variables, the sets, the date variables and the
// records stored as they are.
TEST(QoraDump, DictionaryShowsEveryProperty) {
    const DumpResult run = Dump("--dict " + kSample);
    ASSERT_EQ(run.exitCode, 0) << run.output;
    const std::string& output = run.output;
    // clang-format off
    for (const char* line : {
             "Variables: 8\n", "Cases: 12\n", "Case size: 400 bytes\n",
             "attribute: Source = \"fixture builder\"\n", "2. Sex (numeric)\n",
             "    label: Sex of respondent\n", "    missing values: 9\n",
             "    value label: 2 = \"Female\"\n", "    missing values: -99 thru -1\n",
             "4. City (string, 6 bytes)\n", "    missing values: \"NONE\"\n",
             "    value label: \"LDN\" = \"London\"\n", "    print format: DATE11\n",
             "    measurement level scale, alignment right, column width 8\n",
             "    attribute: Unit = \"points\"\n", "7. CountryOfBirth (string, 20 bytes)\n",
             "    value label: \"France\" = \"Born in France\"\n",
             "8. InterviewerComments (string, 300 bytes)\n",
             "Multiple response set $ones (dichotomy, counted value \"1\"), label \"Ones\": Id Sex\n",
             "Multiple response set $scores (categories), label \"Scores\": Id Score\n",
             "Variable set: Answers= Sex Score City\n", "Date variables: 1, numbers 0 1 1 1\n",
             "    value position 1, type 2, value 1\n", "Extension record 30: 3 elements of 4 bytes\n"})
        // clang-format on
        EXPECT_NE(output.find(line), std::string::npos) << line;
    EXPECT_EQ(output.find("Id,Sex"), std::string::npos);
}

TEST(QoraDump, ErrorsNameTheStatusAndExitNonZero) {
    fixture::TempDir dir;
    const std::string bad = dir.Path() + "/bad.qsf";
    std::ofstream(bad) << "not a system file";
    const DumpResult run = Dump(bad);
    EXPECT_EQ(run.exitCode, 1);
    EXPECT_NE(run.output.find("QORA_STATUS_BAD_FILE (6)"), std::string::npos) << run.output;

    EXPECT_EQ(Dump("--from 0 " + kSample).exitCode, 2);
    EXPECT_EQ(Dump("--dict --cases " + kSample).exitCode, 2);
    EXPECT_EQ(Dump("").exitCode, 2);
}

TEST(QoraDump, Utf8ShowsAFileInACodePageConverted) {
    fixture::SysFileBuilder b;
    b.String("S", 4).LongName("\xD6\xD0");
    b.Encoding("GBK").LongNames().Case({"\xD6\xD0"});
    const DumpResult run = Dump("--utf8 " + b.WriteTemp());
    EXPECT_EQ(run.exitCode, 0) << run.output;
    for (const char* line :
         {"Encoding: GBK\nCode page: 936\n", "1. \xE4\xB8\xAD (string, 12 bytes)",
          "\n\xE4\xB8\xAD\n\xE4\xB8\xAD\n"})
        EXPECT_NE(run.output.find(line), std::string::npos) << line;
}

}  // namespace
