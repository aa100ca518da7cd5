#include "main/shared/banner.hpp"

#include "foundation/log.hpp"

void reportBanner(const char* title) {
    constexpr const char* kRule = "================================================";
    reportPrintf("\n%s\n%s\n%s\n", kRule, title, kRule);
}
