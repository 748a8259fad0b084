// Every object the library builds when it is loaded, in one place, so that
// their construction order is the order written here (and their destruction
// the reverse, at unload). Files still open at unload are not finished.
#include <clocale>

#include "handletable.h"
#include "specialvalues.h"

namespace {

// The runtime's locale starts as the user's, so that code-page mode means
// the code page of the user's locale.
struct UserLocale {
    UserLocale() { std::setlocale(LC_ALL, ""); }
};

const UserLocale gUserLocale;

}  // namespace

HandleTable gHandleTable;

namespace {

const SpecialValues gSpecialValues;
// The month abbreviations are constant data of the library image. The
// extension record handlers register themselves as their objects are made,
// and the lock of the locale lookup is made beside that lookup.

}  // namespace

double SysmisValue() { return gSpecialValues.fSysmis; }
double LowestValue() { return gSpecialValues.fLowest; }
double HighestValue() { return gSpecialValues.fHighest; }
