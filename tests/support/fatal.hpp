// Preconditions whose breach ends the process.
#pragma once

#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "tests/support/log_capture.hpp"

inline testing::Matcher<const std::string&> isLog(const std::string& text) {
    return testing::ResultOf(withoutLineNumbers, testing::StrEq(text));
}

// Expects `statement` to end the process with status 1 after exactly `text` in the log, '#' standing for the
// numbers of trace lines. No log stream may be set: the child's standard error is what is compared.
#define EXPECT_FATAL(statement, text) EXPECT_EXIT(statement, testing::ExitedWithCode(1), isLog(text))
