// Every object the library builds when it is loaded, in one place, so that
// their construction order is the order written here (and their destruction
// the reverse, at unload). Files still open at unload are not finished.
#include <clocale>

#include "handletable.h"
#include "monthnames.h"
#include "specialvalues.h"

namespace {

// The runtime's locale starts as the user's, so that code-page mode means
// the code page of the user's locale.
struct UserLocale {
    UserLocale() { std::setlocale(LC_ALL, ""); }
};

const UserLocale gUserLocale;
HandleTable gHandleTable;
const SpecialValues gSpecialValues;
const char* const kMonthAbbreviations[12] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                             "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
// Next, in this order: the extension record handler registry, then the lock of the locale lookup.

}  // namespace

HandleTable& TheHandleTable() { return gHandleTable; }

double SysmisValue() { return gSpecialValues.fSysmis; }
double LowestValue() { return gSpecialValues.fLowest; }
double HighestValue() { return gSpecialValues.fHighest; }

const char* MonthAbbreviation(int month) {
    return month >= 1 && month <= 12 ? kMonthAbbreviations[month - 1] : nullptr;
}
