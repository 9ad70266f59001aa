#include "Platform/AssertionReport.h"

#include <gtest/gtest.h>

namespace ZULMetaData::Test {

namespace {

#if defined(__APPLE__)
constexpr const char* s_report = "Assertion failed: \\(door\\.isOpen\\(\\)\\), function enter, file House, line 26";
#else
constexpr const char* s_report = "House:26: enter: Assertion `door\\.isOpen\\(\\)' failed\\.";
#endif

TEST(AssertionReportDeathTest, NamesExpressionFunctionFileAndLine) {
    EXPECT_DEATH(reportFailedAssertion("door.isOpen()", "enter", "House", 26), s_report);
}

TEST(AssertionReportDeathTest, AbortsTheProcess) {
    EXPECT_EXIT(reportFailedAssertion("door.isOpen()", "enter", "House", 26), testing::KilledBySignal(SIGABRT), "");
}

} // namespace

} // namespace ZULMetaData::Test
