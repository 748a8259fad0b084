// Lines of the multiple response and variable sets records: each form written
// and read back, malformed lines, records merged, and sets losing absent names.
#include "variableset.h"

#include <gtest/gtest.h>

#include <string>

#include "datasrc.h"
#include "dserror.h"

namespace {

using Set = QORA_VariableSet;

class DictionaryOnly : public QORA_DataSource {
  public:
    QORA_InputCaseIterator* NewIterator(void*) override { return nullptr; }
    void SetRecord(int32_t type, const std::string& text) {
        SetExtensionContent(type, 1, static_cast<int32_t>(text.size()), text.data());
    }
};

Set Make(Set::Category category, const char* name, const char* value, const char* label,
         std::initializer_list<const char*> variables, uint32_t flags = 0) {
    Set set(category);
    set.SetName(name);
    set.SetValue(value);
    set.SetLabel(label);
    for (const char* v : variables) set.AddVariable(v);
    set.SetExtended(flags & Set::kExtendedFlag);
    set.SetLabelLeftOut(flags & Set::kLabelLeftOut);
    return set;
}

// Every field of a set on one line: category|name|value|label|flags|variables.
std::string Describe(const Set& set) {
    std::string text = std::to_string(set.GetCategory()) + "|" + set.GetName() + "|" +
                       set.GetValue() + "|" + set.GetLabel() + "|" +
                       std::to_string(set.GetFlags()) + "|";
    for (const std::string& v : set.GetVariables()) text += v + " ";
    return text;
}

std::string LineOf(const Set& set) {
    std::string text;
    set.AppendLine(text);
    return text;
}

std::string Parsed(std::string_view line) {
    const auto set = Set::Parse(line);
    return set ? Describe(*set) : "nothing";
}

}  // namespace

TEST(VariableSetLine, EachFormWrittenAndReadBack) {
    const std::tuple<Set, const char*, const char*> rows[] = {
        {Make(Set::kMultipleDichotomy, "$drinks", "1", "Drinks", {"tea", "coffee"}),
         "$drinks=D1 1 6 Drinks tea coffee\n", "2|$drinks|1|Drinks|0|tea coffee "},
        {Make(Set::kMultipleDichotomy, "$drinks", "1", "Drinks", {"tea"}, Set::kExtendedFlag),
         "$drinks=E 1 1 1 6 Drinks tea\n", "2|$drinks|1|Drinks|1|tea "},
        // A left-out label reads back empty; only the extended form keeps the flag.
        {Make(Set::kMultipleDichotomy, "$d", "1", "Hidden", {"tea"}, 3), "$d=E 11 1 1 0  tea\n",
         "2|$d|1||3|tea "},
        {Make(Set::kMultipleDichotomy, "$d", "1", "Hidden", {"tea"}, Set::kLabelLeftOut),
         "$d=D1 1 0  tea\n", "2|$d|1||0|tea "},
        {Make(Set::kMultipleCategory, "$colours", "", "Best colour", {"c1"}),
         "$colours=C 11 Best colour c1\n", "1|$colours||Best colour|0|c1 "},
        {Make(Set::kVariableSet, "Demographics", "", "", {"age", "sex"}), "Demographics= age sex\n",
         "0|Demographics|||0|age sex "},
        // Blanks and "=" inside counted texts survive.
        {Make(Set::kMultipleDichotomy, "$x", "yes please", "a = b  c", {"v1", "v2"}),
         "$x=D10 yes please 8 a = b  c v1 v2\n", "2|$x|yes please|a = b  c|0|v1 v2 "},
    };
    for (const auto& [set, line, fields] : rows) {
        EXPECT_EQ(LineOf(set), line);
        EXPECT_EQ(Parsed(line), fields) << line;
    }
    EXPECT_THROW(LineOf(Make(Set::kMultipleDichotomy, "drinks", "1", "", {})), ErrorText);
    EXPECT_THROW(LineOf(Make(Set::kMultipleDichotomy, "$drinks", "", "", {})), ErrorText);
    EXPECT_THROW(LineOf(Set(Set::kMultipleCategory)), ErrorText);
}

TEST(VariableSetLine, MalformedLinesYieldNothing) {
    const char* lines[] = {
        // clang-format off
        "$a C 1 L x", "plain set without equals",  // no "="
        "$a=X 1 L x", "$a=", "$a=C1 L x",          // an unknown type, none, no blank after it
        "$a=E", "$a=E 1",                          // no blank after E, flag digits never end
        "$a=D0  0  x", "$a=D-1 1 0  x",            // a zero or signed value length
        "$a=D9 1 0  x", "$a=C 99 L x",             // a value or label longer than the line
        "$a=C 99999999999999999999999999 L x",     // a length beyond any integer
        "$a=C x L y", "$a=C  L y",                 // a length not a number, or empty
        "$a=C 1 Lx", "$a=C 1 L",                   // no blank, or nothing, after the label
        "$a=D1 1", "$a=D1 1x0  v",                 // nothing, or no blank, after the value
        // clang-format on
    };
    for (const char* line : lines) EXPECT_EQ(Parsed(line), "nothing") << line;
    // The length claims bytes that lie beyond the view's end in memory.
    const std::string memory = "$a=C 5 L xyz tail";
    EXPECT_EQ(Parsed(std::string_view(memory).substr(0, 10)), "nothing");
}

TEST(VariableSetLoad, MultipleResponseFamilyReadsBothRecordsAndMerges) {
    DictionaryOnly source;
    source.SetRecord(kMultRespExtension,
                     "$a=C 1 A x y\n"
                     "b=D1 1 0  p\n"  // written without its "$"
                     "\n"
                     "x\n"
                     "$bad=Q junk\n"
                     "$c=C 0  z");  // no final newline
    source.SetRecord(kExtendedMultRespExtension, "$A=E 1 2 10 2 AA q r\n");
    source.SetRecord(kVariableSetExtension, "vs= a b\n");

    // $A of the extended record replaces $a.
    const QORA_VariableSetList sets = LoadVariableSets(source, QORA_SetFamily::kMultipleResponse);
    ASSERT_EQ(sets.size(), 3u);
    EXPECT_EQ(Describe(sets[0]), "2|$A|10|AA|1|q r ");
    EXPECT_EQ(Describe(sets[1]), "2|$b|1||0|p ");
    EXPECT_EQ(Describe(sets[2]), "1|$c|||0|z ");
    const QORA_VariableSetList plain = LoadVariableSets(source, QORA_SetFamily::kVariableSets);
    ASSERT_EQ(plain.size(), 1u);
    EXPECT_EQ(Describe(plain[0]), "0|vs|||0|a b ");
    EXPECT_TRUE(LoadVariableSets(DictionaryOnly(), QORA_SetFamily::kVariableSets).empty());
}

TEST(VariableSetPrune, RemovesUnknownNamesThenEmptySets) {
    DictionaryOnly source;
    for (const std::string& name : {std::string("age"), std::string(64, 'L')}) {
        QORA_Variable var(0);
        var.SetName(name.c_str());
        source.AppendVariable(var);
    }
    const std::string longName = std::string(64, 'l') + "tail";  // matched on 64 bytes
    QORA_VariableSetList sets = {
        Make(Set::kVariableSet, "keep", "", "", {"AGE", "gone", longName.c_str()}),
        Make(Set::kVariableSet, "empty", "", "", {"nothing"}),
        Make(Set::kVariableSet, "whole", "", "", {"Age"})};
    EXPECT_TRUE(PruneVariableSets(sets, source));
    ASSERT_EQ(sets.size(), 2u);
    EXPECT_EQ(Describe(sets[0]), "0|keep|||0|AGE " + longName + " ");
    EXPECT_EQ(Describe(sets[1]), "0|whole|||0|Age ");
    EXPECT_FALSE(PruneVariableSets(sets, source));
}
