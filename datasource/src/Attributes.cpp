#include "Attributes.h"

#include <algorithm>
#include <cstring>

#include "dserror.h"
#include "namerules.h"
#include "qoramb.h"

namespace {

enum { kNameEndsWithDot = 7, kNameEndsWithUnderscore = 100 };

const Attributes::Values kNoValues;

bool SameName(const std::string& a, const std::string& b) {
    return mbEqualNoCase(a.data(), static_cast<int>(a.size()), b.data(), static_cast<int>(b.size()),
                         nullptr) != 0;
}

size_t WithoutTrailingBlanks(const char* name, size_t length) {
    while (length > 0 && name[length - 1] == ' ') --length;
    return length;
}

// Whether the last c of the name is its last character (or is followed by a
// control byte).
bool EndsWith(const std::string& name, char c) {
    const char* last = mbFindLastChar(name.c_str(), static_cast<unsigned char>(c));
    return last != nullptr && static_cast<unsigned char>(last[1]) <= ' ';
}

bool InList(const std::vector<std::string>& list, const std::string& name) {
    return std::any_of(list.begin(), list.end(),
                       [&](const std::string& reserved) { return SameName(reserved, name); });
}

}  // namespace

Attributes::Attributes(const Attributes& other) : fChanges(other.fChanges) {
    if (other.Size() > 0) {
        fpEntries = std::make_unique<std::vector<Entry>>(*other.fpEntries);
        ++fChanges;
    }
}

const std::string& Attributes::NameAt(int k) const {
    QORA_ASSERT(0 <= k);
    QORA_ASSERT(k < Size());
    return (*fpEntries)[k].name;
}

const Attributes::Values& Attributes::ValuesAt(int k) const {
    QORA_ASSERT(0 <= k);
    QORA_ASSERT(k < Size());
    return (*fpEntries)[k].values;
}

int Attributes::IndexOf(const std::string& name) const {
    for (int k = 0; k < Size(); ++k) {
        if (SameName((*fpEntries)[k].name, name)) return k;
    }
    return -1;
}

const Attributes::Values& Attributes::ValuesOf(const std::string& name) const {
    int k = IndexOf(name);
    return k < 0 ? kNoValues : (*fpEntries)[k].values;
}

void Attributes::Set(const std::string& name, Values values) {
    int k = IndexOf(name);
    if (!fpEntries) fpEntries = std::make_unique<std::vector<Entry>>();
    ++fChanges;
    if (k < 0) {
        fpEntries->push_back(Entry{name, std::move(values)});
    } else {
        (*fpEntries)[k] = Entry{name, std::move(values)};
    }
}

void Attributes::RemoveAt(int k) {
    QORA_ASSERT(0 <= k);
    QORA_ASSERT(k < Size());
    ++fChanges;
    fpEntries->erase(fpEntries->begin() + k);
    if (fpEntries->empty()) fpEntries.reset();
}

bool Attributes::Remove(const std::string& name) {
    int k = IndexOf(name);
    if (k < 0) return false;
    RemoveAt(k);
    return true;
}

bool Attributes::Merge(const Attributes& other, bool replace) {
    bool changed = false;
    for (int k = 0; k < other.Size(); ++k) {
        const Entry& entry = (*other.fpEntries)[k];
        int here = IndexOf(entry.name);
        if (here < 0 || (replace && (*fpEntries)[here].values != entry.values)) {
            Set(entry.name, entry.values);
            changed = true;
        }
    }
    return changed;
}

void Attributes::Assign(const Attributes& other) {
    ++fChanges;
    if (this == &other) return;
    if (other.Size() == 0) {
        fpEntries.reset();
    } else {
        fpEntries = std::make_unique<std::vector<Entry>>(*other.fpEntries);
    }
}

bool Attributes::operator==(const Attributes& other) const {
    if (this == &other) return true;
    if (Size() == 0 || other.Size() == 0) return Size() == other.Size();
    const auto& a = *fpEntries;
    const auto& b = *other.fpEntries;
    return a.size() == b.size() &&
           std::equal(a.begin(), a.end(), b.begin(), [](const Entry& x, const Entry& y) {
               return x.name == y.name && x.values == y.values;
           });
}

std::string Attributes::ToText() const {
    if (Size() == 0) return {};
    size_t room = 0;
    for (const Entry& entry : *fpEntries) {
        room += entry.name.size() + 2;
        for (const std::string& value : entry.values) room += value.size() + 3;
    }
    std::string text;
    text.reserve(room);
    for (const Entry& entry : *fpEntries) {
        if (entry.values.empty()) continue;
        text += entry.name;
        text += '(';
        for (const std::string& value : entry.values) {
            text += '\'';
            std::remove_copy(value.begin(), value.end(), std::back_inserter(text), '\n');
            text += "'\n";
        }
        text += ')';
    }
    return text;
}

namespace {

// The parse of one text; pos is where it stands, and where it stopped.
struct AttributeParser {
    const char* text;
    size_t length;
    size_t pos = 0;

    size_t Find(char c, size_t from) const {
        const void* hit = std::memchr(text + from, c, length - from);
        return hit ? static_cast<const char*>(hit) - text : length;
    }

    // name ( 'value'\n ... ): into result when the name is acceptable.
    bool Entry(Attributes& result) {
        size_t open = Find('(', pos);
        if (open == length || open == pos || open == length - 1) return false;
        std::string name(text + pos, open - pos);
        int check = Attributes::CheckName(name.data(), name.size());
        pos = open + 1;
        Attributes::Values values;
        while (pos < length && text[pos] != ')') {
            size_t newline = Find('\n', pos);
            if (text[pos] != '\'' || newline == length || newline < pos + 2 ||
                text[newline - 1] != '\'' || newline == length - 1)
                return false;
            values.emplace_back(text + pos + 1, newline - pos - 2);
            pos = newline + 1;
        }
        if (pos == length) return false;
        ++pos;  // past ")"
        if ((check == kNameValid || check == kNameSystem) && !values.empty())
            result.Set(name, std::move(values));
        return true;
    }
};

}  // namespace

bool Attributes::FromText(const char* text, size_t length, size_t* errorPos) {
    AttributeParser parser{text, text ? length : 0};
    Attributes result;
    bool ok = true;
    while (ok && parser.pos < parser.length && text[parser.pos] != '/') ok = parser.Entry(result);
    if (errorPos) *errorPos = parser.pos;
    if (ok) Assign(result);
    return ok;
}

const std::vector<std::string>& Attributes::VariableReservedNames() {
    static const std::vector<std::string> names = {"$CreationDate",      "$ExtendedVariableLabel",
                                                   "$ModificationDate",  "$VD.SRuleRef",
                                                   "$VD.RuleOutcomeVar", "$TR.Formula",
                                                   "$TR.Timestamp",      "$ODBC.Name",
                                                   "$ODBC.Table",        "$ODBC.Schema",
                                                   "$ODBC.Catalog",      "$ODBC.Size",
                                                   "$ODBC.Type",         "$Py.Function"};
    return names;
}

const std::vector<std::string>& Attributes::FileReservedNames() {
    static const std::vector<std::string> names = {
        "$CreationDate",    "$ExtendedFileLabel", "$ModificationDate", "$VD.SRule",
        "$VD.CRule",        "$TR.Formula",        "$TR.Timestamp",     "$de.displayedattributes",
        "$@Vintrel.MDDFile"};
    return names;
}

int Attributes::CheckName(const char* name, size_t length) {
    int result = QORA_CheckVariableName(name, length);
    if (result != kNameValid) return result;
    std::string bare(name, WithoutTrailingBlanks(name, length));
    if (EndsWith(bare, '.')) return kNameEndsWithDot;
    if (EndsWith(bare, '_')) return kNameEndsWithUnderscore;
    return kNameValid;
}

int Attributes::ClassifyName(const char* name, size_t length, bool forVariable) {
    switch (CheckName(name, length)) {
        case kNameValid:
            return 1;
        case kNameSystem:
            return InList(forVariable ? VariableReservedNames() : FileReservedNames(),
                          std::string(name, WithoutTrailingBlanks(name, length)))
                       ? 2
                       : 3;
        default:
            return 0;
    }
}

std::string Attributes::PresentedName(const std::string& name, int position, int count) {
    if (count <= 1) return name;
    int digits = static_cast<int>(std::to_string(count).size());
    std::string number = std::to_string(position);
    if (static_cast<int>(number.size()) < digits) number.insert(0, digits - number.size(), '0');
    return name + "[" + number + "]";
}
