#include "base/UtcText.h"

#include <gtest/gtest.h>

#include <chrono>

namespace Norv::Agent {
namespace {

using namespace std::chrono_literals;

TEST(UtcTextTest, WritesEveryFieldWithAllItsDigits) {
    const std::chrono::sys_days day = std::chrono::year(2026) / 3 / 4;
    EXPECT_EQ(UtcText(day + 5h + 6min + 7s + 8ms).view(), "2026-03-04T05:06:07.008Z");
    EXPECT_EQ(UtcText(day + 5h + 6min + 7s + 8ms).inSeconds(), "2026-03-04T05:06:07Z");
}

TEST(UtcTextTest, KnowsWhereDaysAndYearsEnd) {
    EXPECT_EQ(UtcText(std::chrono::sys_days(std::chrono::year(2028) / 2 / 29) + 24h - 1ms).view(),
              "2028-02-29T23:59:59.999Z");
    EXPECT_EQ(UtcText(std::chrono::sys_days(std::chrono::year(1999) / 12 / 31) + 24h).inSeconds(),
              "2000-01-01T00:00:00Z");
}

} // namespace
} // namespace Norv::Agent
