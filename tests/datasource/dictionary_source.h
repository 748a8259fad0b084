// What the dictionary tests share: a data source that holds a dictionary and
// no cases, and the fields of a set on one line.
#pragma once

#include <string>

#include "datasrc.h"
#include "variableset.h"

class DictionaryOnly : public QORA_DataSource {
  public:
    QORA_InputCaseIterator* NewIterator(void*) override { return nullptr; }
    int Add(int type, const std::string& name) {
        QORA_Variable var(type);
        var.SetName(name.c_str());
        return AppendVariable(var);
    }
};

// category|name|value|label|flags|variables
inline std::string Describe(const QORA_VariableSet& set) {
    std::string text = std::to_string(set.GetCategory()) + "|" + set.GetName() + "|" +
                       set.GetValue() + "|" + set.GetLabel() + "|" +
                       std::to_string(set.GetFlags()) + "|";
    for (const std::string& v : set.GetVariables()) text += v + " ";
    return text;
}
