// The fatal assertion.
#pragma once

// Logs "Assertion [ %s ] failed\n" with the condition's text and ends the process with status 1.
[[noreturn]] void assertionFailed(const char* conditionText);

// Ends the process when `condition` does not hold, in every build. The condition's source text is the text
// that the log shows, so its spelling is part of the log's format.
// NOLINTNEXTLINE(cppcoreguidelines-macro-usage): only the preprocessor can spell a condition.
#define ASSERT_OR_EXIT(condition) ((condition) ? static_cast<void>(0) : assertionFailed(#condition))
