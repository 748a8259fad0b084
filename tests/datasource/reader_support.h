// Opening fixture files with the reader, and telling how an open failed.
#pragma once

#include <gtest/gtest.h>

#include <exception>
#include <memory>
#include <string>

#include "SystemFileDataSource.h"
#include "dserror.h"
#include "sysfile_builder.h"

// How an open failed: the internal error number and the failed condition.
struct OpenFailure {
    long number = 0;  // 0: the open succeeded
    std::string condition;
    std::string text;
};

inline std::unique_ptr<SystemFileDataSource> OpenFixture(const std::string& path) {
    return std::make_unique<SystemFileDataSource>(path.c_str());
}

inline OpenFailure FailureOf(const std::string& path) {
    OpenFailure failure;
    try {
        SystemFileDataSource source(path.c_str());
    } catch (const ErrorText& e) {
        failure.text = e.Text();
        try {
            std::rethrow_if_nested(e);
            failure.number = -1;  // not a format error
        } catch (const SystemFileException& inner) {
            failure.number = inner.Number();
            failure.condition = inner.Condition();
        }
    }
    return failure;
}

inline OpenFailure FailureOf(const fixture::SysFileBuilder& b) { return FailureOf(b.WriteTemp()); }

// Parameterised over both byte orders.
class ByteOrders : public ::testing::TestWithParam<fixture::Endian> {};
