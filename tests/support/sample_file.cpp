#include "sample_file.h"

#include <string>

namespace fixture {

namespace {

// Days since 1 March of year 0 in the proleptic Gregorian calendar.
long DayNumber(int year, int month, int day) {
    if (month <= 2) --year;
    const long era = (year >= 0 ? year : year - 399) / 400;
    const long yearOfEra = year - era * 400;
    const long dayOfYear = (153 * (month + (month > 2 ? -3 : 9)) + 2) / 5 + day - 1;
    const long dayOfEra = yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear;
    return era * 146097 + dayOfEra;
}

// Seconds since 14 October 1582 at midnight of the given day.
double DateValue(int year, int month, int day) {
    return double(DayNumber(year, month, day) - DayNumber(1582, 10, 14)) * 86400.0;
}

}  // namespace

Bytes SampleFile(Endian endian, bool compressed) {
    SysFileBuilder b(endian);
    b.header().label = "Sample survey";
    b.Compressed(compressed);
    b.Numeric("ID")
        .LongName("Id")
        .Label("Respondent number")
        .Formats(FormatWord(5, 4, 0), FormatWord(5, 4, 0));
    b.Numeric("SEX")
        .LongName("Sex")
        .Label("Sex of respondent")
        .Missing({9.0})
        .Formats(FormatWord(5, 1, 0), FormatWord(5, 1, 0));
    b.Numeric("SCORE").LongName("Score").Label("Test score, in points").MissingRange(-99.0, -1.0);
    b.String("CITY", 6).LongName("City").Label("Home town").MissingStrings({"NONE"});
    b.String("REMARK", 30).LongName("Remark").Label("Interviewer's remark");
    b.Numeric("BORN")
        .LongName("Born")
        .Label("Date of birth")
        .Formats(FormatWord(20, 11, 0), FormatWord(20, 11, 0));
    b.String("COUNTRY", 20).LongName("CountryOfBirth").Label("Country of birth");
    b.String("COMMENTS", 300).LongName("InterviewerComments").Label("Comments in full");
    b.ValueLabels({{1.0, "Male"}, {2.0, "Female"}, {9.0, "No answer"}}, {b.Slot("SEX")});
    b.ValueLabels({{"LDN", "London"}, {"PAR", "Paris"}, {"NONE", "Not given"}}, {b.Slot("CITY")});
    b.Documents({"Sample survey of twelve respondents, for trying the library out.",
                 "   (Entered 04 Dec 26)"});
    b.IntegerInfo();
    b.FloatInfo();
    b.VariableSets({SysFileBuilder::VariableSetLine("Answers", {"SEX", "SCORE", "CITY"})});
    b.DateInfo({0, 1, 1, 1, 1, 1, 1, 2, 1});  // the respondent number counts the cases
    b.MultipleResponseSets({SysFileBuilder::CategorySetLine("$scores", "Scores", {"ID", "SCORE"}),
                            SysFileBuilder::DichotomySetLine("$ones", "1", "Ones", {"ID", "SEX"})});
    b.DisplayParams({{3, 5, 1},
                     {1, 5, 1},
                     {3, 8, 1},
                     {1, 6, 0},
                     {1, 30, 0},
                     {3, 11, 1},
                     {1, 20, 0},
                     {1, 40, 0},
                     {1, 40, 0}});
    b.LongNames();
    b.VeryLongStrings();
    b.CaseCount64(12);
    b.FileAttributes(SysFileBuilder::AttributeText({{"Source", {"fixture builder"}}}));
    b.VariableAttributes({{"Score", SysFileBuilder::AttributeText({{"Unit", {"points"}}})}});
    b.LongValueLabelsRecord(
        {{"CountryOfBirth",
          20,
          {{"United Kingdom", "Born in the United Kingdom"}, {"France", "Born in France"}}}});
    b.Extension(30, 4, b.Int32s({1, 2, 3}));

    const double sysmis = kSysmis;
    b.Case({1.0, 1.0, 87.5, "LDN", "friendly", DateValue(1970, 1, 1), "United Kingdom",
            std::string(279, '-') + " end of a long remark"});
    b.Case({2.0, 2.0, 92.0, "PAR", "said \"no comment\"", DateValue(1985, 6, 15), "France", ""});
    b.Case({3.0, 9.0, -5.0, "NONE", "", sysmis, "", ""});
    b.Case({4.0, 1.0, sysmis, "LDN", "late, then left early", DateValue(1999, 12, 31), "", ""});
    b.Case({5.0, 2.0, 64.25, "ROM", "  leading blanks kept", DateValue(2000, 2, 29), "", ""});
    b.Case({6.0, sysmis, 70.0, "PAR", "", DateValue(1582, 10, 14), "", ""});
    b.Case({7.0, 1.0, 151.0, "LDN", "top score", DateValue(1962, 3, 8), "", ""});
    b.Case({8.0, 2.0, 0.5, "", "no town given", DateValue(1991, 7, 4), "", ""});
    b.Case({9.0, 1.0, 100.0, "PAR", "line one,\"two\"", DateValue(2004, 11, 30), "", ""});
    b.Case({10.0, 2.0, 55.125, "LDN", "bien sur", DateValue(1977, 8, 16), "", ""});
    b.Case({11.0, 1.0, -1.0, "NONE", "refused the test", DateValue(1968, 5, 1), "", ""});
    b.Case({12.0, 2.0, 79.0, "PAR", "the last one", DateValue(2010, 1, 2), "", ""});
    return b.Build();
}

}  // namespace fixture
