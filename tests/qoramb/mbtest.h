// Test scaffolding for the multibyte routines: a scope that sets the runtime
// locale, the current converter and the interface encoding and restores them,
// and exactly sized heap copies so the sanitizer catches any read past a length.
#pragma once

#include <gtest/gtest.h>

#include <clocale>
#include <cstring>
#include <memory>
#include <string>

#include "codepage.h"
#include "qoramb.h"

class EncodingScope {
  public:
    // locale: a runtime locale name; converter: a name for SetCodePageConverter.
    EncodingScope(const char* locale, const char* converter, int utf8Mode)
        : fLocale(setlocale(LC_ALL, nullptr)),
          fConverter(ucnv_getName(CurrentConverter(), &fErr)),
          fMode(mbIsUtf8Mode()) {
        if (!setlocale(LC_ALL, locale)) ADD_FAILURE() << "locale missing: " << locale;
        EXPECT_TRUE(SetCodePageConverter(converter)) << converter;
        mbSetUtf8Mode(utf8Mode);
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

// The bytes of text in a heap block of exactly their size, without terminator.
inline std::unique_ptr<char[]> Exact(const std::string& bytes) {
    std::unique_ptr<char[]> block(new char[bytes.size()]);
    memcpy(block.get(), bytes.data(), bytes.size());
    return block;
}

inline std::string Bytes(const char* p, size_t n) { return std::string(p, n); }
