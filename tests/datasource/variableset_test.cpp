#include "variableset.h"

#include <gtest/gtest.h>

#include <string>

#include "datasrc.h"
#include "dserror.h"

namespace {

class DictionaryOnly : public QORA_DataSource {
  public:
    QORA_InputCaseIterator* NewIterator(void*) override { return nullptr; }
    void AddNumeric(const char* name) {
        QORA_Variable var(0);
        var.SetName(name);
        AppendVariable(var);
    }
    std::string Record(int32_t type) const {
        return HasExtension(type) ? GetExtension(type).Impl()->Content() : std::string();
    }
    void SetRecord(int32_t type, const std::string& text) {
        SetExtensionContent(type, 1, static_cast<int32_t>(text.size()), text.data());
    }
};

QORA_VariableSet Dichotomy(const char* name, const char* value, const char* label) {
    QORA_VariableSet set(QORA_VariableSet::kMultipleDichotomy);
    set.SetName(name);
    set.SetValue(value);
    set.SetLabel(label);
    return set;
}

std::string LineOf(const QORA_VariableSet& set) {
    std::string text;
    set.AppendLine(text);
    return text;
}

std::vector<std::string> Names(std::initializer_list<const char*> names) {
    return std::vector<std::string>(names.begin(), names.end());
}

}  // namespace

TEST(VariableSetLine, ProducesEachForm) {
    QORA_VariableSet drinks = Dichotomy("$drinks", "1", "Drinks");
    drinks.AddVariable("tea");
    drinks.AddVariable("coffee");
    EXPECT_EQ(LineOf(drinks), "$drinks=D1 1 6 Drinks tea coffee\n");

    drinks.SetExtended(true);
    EXPECT_EQ(LineOf(drinks), "$drinks=E 1 1 1 6 Drinks tea coffee\n");
    drinks.SetLabelLeftOut(true);
    EXPECT_EQ(LineOf(drinks), "$drinks=E 11 1 1 0  tea coffee\n");
    drinks.SetExtended(false);
    EXPECT_EQ(LineOf(drinks), "$drinks=D1 1 0  tea coffee\n");

    QORA_VariableSet colours(QORA_VariableSet::kMultipleCategory);
    colours.SetName("$colours");
    colours.SetLabel("Best colour");
    colours.AddVariable("c1");
    EXPECT_EQ(LineOf(colours), "$colours=C 11 Best colour c1\n");

    QORA_VariableSet plain;
    plain.SetName("Demographics");
    plain.AddVariable("age");
    plain.AddVariable("sex");
    EXPECT_EQ(LineOf(plain), "Demographics= age sex\n");
}

TEST(VariableSetLine, ProducingRefusesBrokenSets) {
    QORA_VariableSet noDollar = Dichotomy("drinks", "1", "");
    EXPECT_THROW(LineOf(noDollar), ErrorText);
    QORA_VariableSet noValue = Dichotomy("$drinks", "", "");
    EXPECT_THROW(LineOf(noValue), ErrorText);
    QORA_VariableSet unnamed(QORA_VariableSet::kMultipleCategory);
    EXPECT_THROW(LineOf(unnamed), ErrorText);
}

TEST(VariableSetLine, RoundTripKeepsCountedTextAndLeftOutLabels) {
    QORA_VariableSet set = Dichotomy("$x", "yes please", "a = b  c");
    set.AddVariable("v1");
    set.AddVariable("v2");
    auto back = QORA_VariableSet::Parse(LineOf(set));
    ASSERT_TRUE(back);
    EXPECT_EQ(back->GetCategory(), QORA_VariableSet::kMultipleDichotomy);
    EXPECT_EQ(back->GetName(), "$x");
    EXPECT_EQ(back->GetValue(), "yes please");
    EXPECT_EQ(back->GetLabel(), "a = b  c");
    EXPECT_EQ(back->GetVariables(), Names({"v1", "v2"}));
    EXPECT_EQ(back->GetFlags(), 0u);

    set.SetLabelLeftOut(true);  // the flag itself is kept by the extended form only
    for (bool extended : {false, true}) {
        set.SetExtended(extended);
        back = QORA_VariableSet::Parse(LineOf(set));
        ASSERT_TRUE(back);
        EXPECT_EQ(back->GetLabel(), "");
        EXPECT_EQ(back->IsLabelLeftOut(), extended);
        EXPECT_EQ(back->GetVariables(), Names({"v1", "v2"}));
    }
}

TEST(VariableSetLine, ParsesFlagDigitsAndVariableList) {
    auto set = QORA_VariableSet::Parse("$m=E 10 1 7 0  a  b A\r\nignored");
    ASSERT_TRUE(set);
    EXPECT_EQ(set->GetFlags(), uint32_t{QORA_VariableSet::kExtendedFlag});
    EXPECT_EQ(set->GetValue(), "7");
    EXPECT_EQ(set->GetVariables(), Names({"a", "b"}));

    auto category = QORA_VariableSet::Parse("$c=C 0  x y\n");
    ASSERT_TRUE(category);
    EXPECT_EQ(category->GetCategory(), QORA_VariableSet::kMultipleCategory);
    EXPECT_EQ(category->GetVariables(), Names({"x", "y"}));

    auto plain = QORA_VariableSet::Parse("Set one=p q");
    ASSERT_TRUE(plain);
    EXPECT_EQ(plain->GetCategory(), QORA_VariableSet::kVariableSet);
    EXPECT_EQ(plain->GetName(), "Set one");
    EXPECT_EQ(plain->GetVariables(), Names({"p", "q"}));
}

TEST(VariableSetLine, MalformedLinesYieldNothing) {
    const char* lines[] = {
        "$a C 1 L x",                           // no "="
        "plain set without equals",             // no "=" either
        "$a=X 1 L x",                           // unknown type byte
        "$a=",                                  // no type byte
        "$a=E",                                 // extended without its blank
        "$a=E 1",                               // flag digits never end
        "$a=D0  0  x",                          // zero value length
        "$a=D9 1 0  x",                         // value longer than the line
        "$a=C 99 L x",                          // label longer than the line
        "$a=C 99999999999999999999999999 L x",  // length beyond any integer
        "$a=C x L y",                           // length not a number
        "$a=C  L y",                            // empty length
        "$a=D-1 1 0  x",                        // signed length
        "$a=C 1 Lx",                            // no blank after the label
        "$a=C 1 L",                             // nothing after the label
        "$a=D1 1",                              // nothing after the value
        "$a=D1 1x0  v",                         // no blank after the value
        "$a=C1 L x",                            // no blank after the type
    };
    for (const char* line : lines) EXPECT_FALSE(QORA_VariableSet::Parse(line)) << line;
    // The length claims bytes that lie beyond the view's end in memory.
    const std::string memory = "$a=C 5 L xyz tail";
    EXPECT_FALSE(QORA_VariableSet::Parse(std::string_view(memory).substr(0, 10)));
}

TEST(VariableSet, NamesByCaseCodeAndEditsCheckTheirIndex) {
    QORA_VariableSet set;
    set.SetName("MixEd");
    EXPECT_EQ(set.GetName(QORA_VariableSet::kLowerCase), "mixed");
    EXPECT_EQ(set.GetName(QORA_VariableSet::kUpperCase), "MIXED");
    EXPECT_EQ(set.GetName(QORA_VariableSet::kAsStored), "MixEd");
    EXPECT_THROW(set.GetName(3), ErrorText);
    set.AddVariable("Age");
    set.AddVariable("AGE");  // case ignored
    set.AddVariable("sex");
    EXPECT_EQ(set.GetVariables(), Names({"Age", "sex"}));
    set.SetVariable(1, "gender");
    set.RemoveVariable(0);
    EXPECT_EQ(set.GetVariables(), Names({"gender"}));
    EXPECT_THROW(set.RemoveVariable(1), ErrorText);
    EXPECT_THROW(set.SetVariable(1, "x"), ErrorText);
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

    const QORA_VariableSetList sets = LoadVariableSets(source, QORA_SetFamily::kMultipleResponse);
    ASSERT_EQ(sets.size(), 3u);
    EXPECT_EQ(sets[0].GetName(), "$A");
    EXPECT_EQ(sets[0].GetCategory(), QORA_VariableSet::kMultipleDichotomy);
    EXPECT_TRUE(sets[0].IsExtended());
    EXPECT_EQ(sets[0].GetValue(), "10");
    EXPECT_EQ(sets[0].GetLabel(), "AA");
    EXPECT_EQ(sets[0].GetVariables(), Names({"q", "r"}));
    EXPECT_EQ(sets[1].GetName(), "$b");
    EXPECT_EQ(sets[1].GetVariables(), Names({"p"}));
    EXPECT_EQ(sets[2].GetName(), "$c");

    const QORA_VariableSetList plain = LoadVariableSets(source, QORA_SetFamily::kVariableSets);
    ASSERT_EQ(plain.size(), 1u);
    EXPECT_EQ(plain[0].GetName(), "vs");
    EXPECT_TRUE(LoadVariableSets(DictionaryOnly(), QORA_SetFamily::kVariableSets).empty());
}

TEST(VariableSetStore, RoutesEachSetToItsRecordAndRoundTrips) {
    DictionaryOnly source;
    source.SetRecord(kVariableSetExtension, "old= x\n");  // replaced: plain lines are stored
    QORA_VariableSetList sets;
    sets.push_back(Dichotomy("$d", "1 2", "Label"));
    sets.back().AddVariable("a");
    sets.push_back(Dichotomy("$e", "9", ""));
    sets.back().SetExtended(true);
    sets.back().AddVariable("b");
    sets.emplace_back(QORA_VariableSet::kVariableSet);
    sets.back().SetName("plain");
    sets.back().AddVariable("c");
    StoreVariableSets(source, sets);

    EXPECT_EQ(source.Record(kMultRespExtension), "$d=D3 1 2 5 Label a\n");
    EXPECT_EQ(source.Record(kExtendedMultRespExtension), "$e=E 1 1 9 0  b\n");
    EXPECT_EQ(source.Record(kVariableSetExtension), "plain= c\n");

    const QORA_VariableSetList mr = LoadVariableSets(source, QORA_SetFamily::kMultipleResponse);
    ASSERT_EQ(mr.size(), 2u);
    EXPECT_EQ(mr[0].GetValue(), "1 2");
    EXPECT_EQ(mr[1].GetFlags(), uint32_t{QORA_VariableSet::kExtendedFlag});

    // A record no set has lines for is left as it was.
    StoreVariableSets(source, {sets[0]});
    EXPECT_EQ(source.Record(kExtendedMultRespExtension), "$e=E 1 1 9 0  b\n");
    EXPECT_EQ(source.Record(kVariableSetExtension), "plain= c\n");
    EXPECT_EQ(source.Record(kMultRespExtension), "$d=D3 1 2 5 Label a\n");
}

TEST(VariableSetPrune, RemovesUnknownNamesThenEmptySets) {
    DictionaryOnly source;
    source.AddNumeric("age");
    source.AddNumeric(std::string(64, 'L').c_str());
    QORA_VariableSetList sets(3);
    sets[0].SetName("keep");
    sets[0].AddVariable("AGE");
    sets[0].AddVariable("gone");
    sets[0].AddVariable(std::string(64, 'l') + "tail");  // matched on its first 64 bytes
    sets[1].SetName("empty");
    sets[1].AddVariable("nothing");
    sets[2].SetName("whole");
    sets[2].AddVariable("Age");

    EXPECT_TRUE(PruneVariableSets(sets, source));
    ASSERT_EQ(sets.size(), 2u);
    EXPECT_EQ(sets[0].GetVariables(), Names({"AGE", (std::string(64, 'l') + "tail").c_str()}));
    EXPECT_EQ(sets[1].GetName(), "whole");
    EXPECT_FALSE(PruneVariableSets(sets, source));
}
