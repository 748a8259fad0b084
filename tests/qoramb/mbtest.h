// Test scaffolding for the multibyte routines: the encoding scope, and
// exactly sized heap copies so the sanitizer catches any read past a length.
#pragma once

#include <gtest/gtest.h>

#include <clocale>
#include <cstring>
#include <memory>
#include <string>

#include "codepage.h"
#include "encoding_scope.h"
#include "qoramb.h"

using namespace std::string_literals;

// The bytes in a heap block of exactly their size, without terminator.
inline std::unique_ptr<char[]> Exact(const std::string& bytes) {
    std::unique_ptr<char[]> block(new char[bytes.size()]);
    memcpy(block.get(), bytes.data(), bytes.size());
    return block;
}

inline std::string Bytes(const char* p, size_t n) { return std::string(p, n); }
