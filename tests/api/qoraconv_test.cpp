// The converter as a user runs it: CSV and its JSON dictionary to a system
// file and back unchanged, what it makes of a bare CSV, and each kind of bad
// input stopped with its line, a sentence and no output left behind.
#include <gtest/gtest.h>

#include <fstream>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>

#include "run_tool.h"
#include "sysfile_builder.h"

namespace {

fixture::ToolRun Conv(const std::string& arguments) {
    return fixture::RunTool(std::string(QORACONV_PATH) + " " + arguments);
}

std::string ReadText(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

bool Exists(const std::string& path) { return std::ifstream(path).good(); }

const char kCsv[] =
    "Id,Score,Born,Seen,City,Note\n"
    "1,12.5,1970-01-01,2020-02-29 23:59:59,LDN,\"said \"\"hi\"\", left\"\n"
    "2,,1582-10-14,,PAR,\"two\nlines\"\n"
    "3,-1e+100,,1999-12-31 00:00:00,NONE,\n";

// Every property a side file can give; Seen and Note keep what the cells say.
const char kDictionary[] = R"({"variables": [
 {"name": "Id", "label": "Respondent", "format": "F4.0", "missingValues": [9, 99],
  "valueLabels": [{"value": 1, "label": "first"}], "level": "nominal", "alignment": "center",
  "columns": 6},
 {"name": "Score", "format": "F8.2", "writeFormat": "COMMA10.2", "missingValues": [999],
  "missingRange": {"low": -99, "high": -1}, "level": "scale"},
 {"name": "Born", "format": "ADATE10"},
 {"name": "City", "type": "string", "width": 8, "missingValues": ["NONE"],
  "valueLabels": [{"value": "LDN", "label": "London"}], "alignment": "right"}
]})";

TEST(QoraConv, CsvAndDictionaryComeBackUnchanged) {
    fixture::TempDir dir;
    const std::string base = dir.Path() + "/";
    std::ofstream(base + "in.csv") << kCsv;
    std::ofstream(base + "in.json") << kDictionary;

    struct Step {
        const char* options;
        const char* dict;
        const char* input;
        const char* output;
    };
    for (const Step& step :
         {Step{"--compress", "in.json", "in.csv", "one.qsf"},
          Step{"", "one.json", "one.qsf", "one.csv"}, Step{"", "one.json", "one.csv", "two.qsf"},
          Step{"", "two.json", "two.qsf", "two.csv"}}) {
        const fixture::ToolRun run =
            Conv(std::string(step.options) + " --dict " + base + step.dict + " " + base +
                 step.input + " " + base + step.output);
        ASSERT_EQ(run.exitCode, 0) << step.input << ": " << run.output;
    }
    EXPECT_EQ(ReadText(base + "one.csv"), kCsv);
    EXPECT_EQ(ReadText(base + "two.csv"), kCsv);
    EXPECT_EQ(ReadText(base + "two.json"), ReadText(base + "one.json"));
    EXPECT_EQ(fixture::RunTool(std::string(QORADUMP_PATH) + " --json " + base + "two.qsf").output,
              ReadText(base + "one.json"));

    // Each property given comes back as given.
    const auto given = nlohmann::json::parse(kDictionary)["variables"];
    const auto written = nlohmann::json::parse(ReadText(base + "one.json"))["variables"];
    ASSERT_EQ(written.size(), 6u);
    for (const auto& entry : given) {
        const auto match = std::find_if(written.begin(), written.end(),
                                        [&](const auto& w) { return w["name"] == entry["name"]; });
        ASSERT_NE(match, written.end()) << entry["name"];
        for (const auto& item : entry.items())
            EXPECT_EQ((*match)[item.key()], item.value()) << entry["name"] << " " << item.key();
    }
}

TEST(QoraConv, ASpreadsheetCsvGetsTypesFromItsCellsAndNamesRepaired) {
    fixture::TempDir dir;
    const std::string csv = dir.Path() + "/in.csv", out = dir.Path() + "/out.qsf";
    // As a spreadsheet saves it: a byte order mark and CRLF line ends.
    std::ofstream(csv) << "\xEF\xBB\xBF"
                          "first name,2nd,Age,age,When,Stamp,with\r\n"
                          "Ann,x,31,1.25,2020-01-31,2020-01-31 10:20:30,\r\n"
                          "Bob,\"y, z\",,2,2021-02-28,,\r\n";
    const fixture::ToolRun run = Conv(csv + " " + out);
    ASSERT_EQ(run.exitCode, 0) << run.output;
    for (const char* notice : {"in.csv line 1: column 1 (\"first name\") is named first_name.\n",
                               "in.csv line 1: column 2 (\"2nd\") is named V2nd.\n",
                               "in.csv line 1: column 4 (\"age\") is named age_2.\n",
                               "in.csv line 1: column 7 (\"with\") is named with_.\n"})
        EXPECT_NE(run.output.find(notice), std::string::npos) << notice << run.output;

    const std::string dump = fixture::RunTool(std::string(QORADUMP_PATH) + " " + out).output;
    for (const char* line :
         {"1. first_name (string, 3 bytes)\n    print format: A3\n", "2. V2nd (string, 4 bytes)\n",
          "3. Age (numeric)\n    print format: F8.0\n",
          "4. age_2 (numeric)\n    print format: F8.2\n",
          "5. When (numeric)\n    print format: DATE11\n",
          "6. Stamp (numeric)\n    print format: DATETIME20\n",
          "first_name,V2nd,Age,age_2,When,Stamp,with_\n"
          "Ann,x,31,1.25,2020-01-31,2020-01-31 10:20:30,\n"
          "Bob,\"y, z\",,2,2021-02-28,,\n"})
        EXPECT_NE(dump.find(line), std::string::npos) << line << dump;
}

TEST(QoraConv, BadInputStopsAtItsLineAndLeavesNoOutput) {
    struct Case {
        std::string csv;
        std::string dictionary;  // none when empty
        std::string message;
    };
    const Case cases[] = {
        {"a,b\n1,2\n3\n", "",
         "in.csv line 3: the row has 1 cell where the first line names 2 columns."},
        {"a,b\n1,\"2\n3,4\n", "", "in.csv line 2: a quoted cell has no closing quote."},
        {"a\nok\n" + std::string(32768, 'x') + "\n", "",
         "in.csv line 3: a cell is wider than any string can be (32767 bytes)."},
        {"a,,c\n1,2,3\n", "", "in.csv line 1: column 2 (\"\") cannot be made a variable name."},
        {"a,b\n1,2\n", "{\"variables\": [\n {\"name\": \"a\"},\n {\"name\": \"zz\"}\n]}",
         "in.json line 3: variable zz is no column of the CSV file."},
        {"a,b\n1,2\n", "{\"variables\": [\n {\"name\": \"a\",\n \"level\": 3}\n]}",
         "in.json line 2: a property of a has the wrong kind of value"},
        {"a\n1\nx\n", "{\"variables\": [{\"name\": \"a\", \"type\": \"numeric\"}]}",
         "in.csv line 3: \"x\" in column a is not a number."},
        {"a\nabcdef\n", "{\"variables\": [{\"name\": \"a\", \"type\": \"string\", \"width\": 3}]}",
         "in.csv line 2: the cell of a has 6 bytes, more than its width of 3."},
    };
    for (const Case& c : cases) {
        fixture::TempDir dir;
        const std::string base = dir.Path() + "/";
        std::ofstream(base + "in.csv") << c.csv;
        std::ofstream(base + "in.json") << c.dictionary;
        std::ofstream(base + "old.qsf") << "an earlier file";
        const fixture::ToolRun run =
            Conv((c.dictionary.empty() ? "" : "--dict " + base + "in.json ") + base + "in.csv " +
                 base + "old.qsf");
        EXPECT_EQ(run.exitCode, 1) << c.message;
        EXPECT_NE(run.output.find(c.message), std::string::npos) << c.message << "\n" << run.output;
        EXPECT_EQ(ReadText(base + "old.qsf"), "an earlier file") << c.message;
        EXPECT_FALSE(Exists(base + "old.qsf.part")) << c.message;
    }
}

}  // namespace
