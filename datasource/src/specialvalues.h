// The special numeric values of the data model, computed bit-exact once when
// the library is loaded (the object lives with the other load-time objects).
// Static initialisers of other files must not call the accessors.
#pragma once

class SpecialValues {
  public:
    SpecialValues();
    const double fSysmis;   // FFEFFFFFFFFFFFFF: the most negative finite double
    const double fLowest;   // FFEFFFFFFFFFFFFE: the next double above system-missing
    const double fHighest;  // 7FEFFFFFFFFFFFFF: the largest finite double
};

double SysmisValue();
double LowestValue();
double HighestValue();
