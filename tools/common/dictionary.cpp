#include "dictionary.h"

#include "casetext.h"
#include "qoraio32.h"
#include "status.h"

std::vector<Variable> Variables(int handle) {
    int count = 0;
    char** names = nullptr;
    int* types = nullptr;
    std::vector<Variable> variables;
    // The name list refuses a file without variables, which is still a file.
    if (Check(qoraGetNumberofVariables(handle, &count), "counting the variables") != 0 ||
        count == 0)
        return variables;
    if (Check(qoraGetVarNames(handle, &count, &names, &types), "listing the variables") != 0)
        return variables;
    for (int i = 0; i < count; ++i) {
        int code = 0, decimals = 0, width = 0;
        qoraGetVarPrintFormat(handle, names[i], &code, &decimals, &width);
        variables.push_back({names[i], types[i], code});
    }
    qoraFreeVarNames(names, types, count);
    return variables;
}

NumericMissing NumericMissingValues(int handle, const Variable& var) {
    NumericMissing missing{};
    Check(qoraGetVarNMissingValues(handle, var.name.c_str(), &missing.count, &missing.values[0],
                                   &missing.values[1], &missing.values[2]),
          "reading the missing values of " + var.name);
    return missing;
}

std::vector<std::string> StringMissingValues(int handle, const Variable& var) {
    std::vector<char> values[3];
    for (auto& value : values) value.assign(size_t(var.type) + 1, '\0');
    int count = 0;
    const int status = qoraGetVarCMissingValues(handle, var.name.c_str(), &count, values[0].data(),
                                                values[1].data(), values[2].data());
    std::vector<std::string> missing;
    if (status == QORA_STATUS_SHORT_STRING_REQUIRED) return missing;
    Check(status, "reading the missing values of " + var.name);
    for (int i = 0; i < count && i < 3; ++i) missing.push_back(TrimBlanks(values[i].data()));
    return missing;
}

std::vector<std::pair<double, std::string>> NumericValueLabels(int handle, const Variable& var) {
    double* values = nullptr;
    char** labels = nullptr;
    int count = 0;
    std::vector<std::pair<double, std::string>> pairs;
    if (Check(qoraGetVarNValueLabels(handle, var.name.c_str(), &values, &labels, &count),
              "reading the value labels of " + var.name) != 0)
        return pairs;
    for (int i = 0; i < count; ++i) pairs.emplace_back(values[i], labels[i]);
    qoraFreeVarNValueLabels(values, labels, count);
    return pairs;
}

std::vector<std::pair<std::string, std::string>> StringValueLabels(int handle,
                                                                   const Variable& var) {
    char** values = nullptr;
    char** labels = nullptr;
    int count = 0;
    std::vector<std::pair<std::string, std::string>> pairs;
    if (Check(qoraGetVarCValueLabels(handle, var.name.c_str(), &values, &labels, &count),
              "reading the value labels of " + var.name) != 0)
        return pairs;
    for (int i = 0; i < count; ++i) pairs.emplace_back(TrimBlanks(values[i]), labels[i]);
    qoraFreeVarCValueLabels(values, labels, count);
    return pairs;
}
