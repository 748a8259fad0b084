// A scope that sets the runtime locale, the current converter and the
// interface encoding, and restores all three, for tests that run under the
// real locales tools/make-test-locales.sh generates.
#pragma once

#include <gtest/gtest.h>

#include <clocale>
#include <string>

#include "codepage.h"
#include "qoramb.h"

// A runtime locale, a name for SetCodePageConverter and the interface mode.
struct Encoding {
    const char* locale;
    const char* converter;
    int utf8Mode;
};
constexpr Encoding kUtf8{"en_US.UTF-8", "UTF-8", 1};
constexpr Encoding kCp1252{"de_DE.CP1252", "cp1252", 0};
constexpr Encoding kLatin1{"en_US.ISO-8859-1", "ISO-8859-1", 0};
constexpr Encoding kGbk{"zh_CN.GBK", "GBK", 0};

class EncodingScope {
  public:
    explicit EncodingScope(const Encoding& e)
        : fLocale(setlocale(LC_ALL, nullptr)),
          fConverter(ucnv_getName(CurrentConverter(), &fErr)),
          fMode(mbIsUtf8Mode()) {
        if (!setlocale(LC_ALL, e.locale)) ADD_FAILURE() << "locale missing: " << e.locale;
        EXPECT_TRUE(SetCodePageConverter(e.converter)) << e.converter;
        mbSetUtf8Mode(e.utf8Mode);
    }
    ~EncodingScope() {
        setlocale(LC_ALL, fLocale.c_str());
        SetCodePageConverter(fConverter.c_str());
        mbSetUtf8Mode(fMode);
    }

  private:
    UErrorCode fErr = U_ZERO_ERROR;
    std::string fLocale;
    std::string fConverter;
    int fMode;
};
