// Test scaffolding for the multibyte routines: the encoding scope, and
// exactly sized heap copies so the sanitizer catches any read past a length.
#pragma once

#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

#include "encoding_scope.h"  // with the code page and multibyte routines

using namespace std::string_literals;

// The bytes in a heap block of exactly their size, without terminator.
inline std::unique_ptr<char[]> Exact(const std::string& bytes) {
    std::unique_ptr<char[]> block(new char[bytes.size()]);
    memcpy(block.get(), bytes.data(), bytes.size());
    return block;
}
