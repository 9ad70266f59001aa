#include "Platform/ProcessInfo.h"

#include "Platform/OSRelease.h"
#include "Tests/Platform/ImageTestSupport.h"

#include <gtest/gtest.h>

#include <fstream>
#include <string>

namespace ZULMetaData::Test {

namespace {

std::vector<std::int64_t> numbersOf(const std::string& release) {
    const auto numbers = parseReleaseNumbers(release);
    return {numbers.major, numbers.minor, numbers.patch};
}

using Numbers = std::vector<std::int64_t>;

TEST(ReleaseNumbers, AreReadUpToTheFirstOtherText) {
    EXPECT_EQ(numbersOf("6.18.44"), (Numbers{6, 18, 44}));
    EXPECT_EQ(numbersOf("6.1.0-13-amd64"), (Numbers{6, 1, 0}));
    EXPECT_EQ(numbersOf("5.15.0.91"), (Numbers{5, 15, 0}));
    EXPECT_EQ(numbersOf("4.19.112+"), (Numbers{4, 19, 112}));
}

TEST(ReleaseNumbers, ThatAreMissingAreZero) {
    EXPECT_EQ(numbersOf("14.2"), (Numbers{14, 2, 0}));
    EXPECT_EQ(numbersOf("15"), (Numbers{15, 0, 0}));
    EXPECT_EQ(numbersOf("6.12-rc1"), (Numbers{6, 12, 0}));
    EXPECT_EQ(numbersOf("6-1.2"), (Numbers{6, 0, 0}));
    EXPECT_EQ(numbersOf("6."), (Numbers{6, 0, 0}));
    EXPECT_EQ(numbersOf("6..3"), (Numbers{6, 0, 0}));
    EXPECT_EQ(numbersOf(""), (Numbers{0, 0, 0}));
}

TEST(ReleaseNumbers, OfOtherTextAreZero) {
    EXPECT_EQ(numbersOf("rolling"), (Numbers{0, 0, 0}));
    EXPECT_EQ(numbersOf("-5.4.3"), (Numbers{0, 0, 0}));
    EXPECT_EQ(numbersOf(" 5.4.3"), (Numbers{0, 0, 0}));
    EXPECT_EQ(numbersOf(".1.2"), (Numbers{0, 0, 0}));
}

TEST(ReleaseNumbers, FillTheirFields) {
    EXPECT_EQ(numbersOf("9223372036854775807.0.1"), (Numbers{9223372036854775807, 0, 1}));
    EXPECT_EQ(numbersOf("9223372036854775808.0.1"), (Numbers{0, 0, 0}));
    EXPECT_EQ(numbersOf("5.99999999999999999999.1"), (Numbers{5, 0, 0}));
}

TEST(OSReleaseText, GivesThePrettyNameWithoutItsQuotes) {
    EXPECT_EQ(prettyNameOfOSRelease("NAME=\"Some Linux\"\nPRETTY_NAME=\"Some Linux 12 (quiet)\"\nID=some\n"),
              "Some Linux 12 (quiet)");
    EXPECT_EQ(prettyNameOfOSRelease("PRETTY_NAME='Some Linux 12'"), "Some Linux 12");
    EXPECT_EQ(prettyNameOfOSRelease("PRETTY_NAME=Some\n"), "Some");
}

TEST(OSReleaseText, ResolvesEscapesLikeTheShell) {
    EXPECT_EQ(prettyNameOfOSRelease(R"(PRETTY_NAME="a \"b\" \$c \`d\` \\ \e")"), R"(a "b" $c `d` \ \e)");
    EXPECT_EQ(prettyNameOfOSRelease(R"(PRETTY_NAME='a \" b')"), R"(a \" b)");
    EXPECT_EQ(prettyNameOfOSRelease(R"(PRETTY_NAME=a\ b)"), "a b");
    EXPECT_EQ(prettyNameOfOSRelease(R"(PRETTY_NAME="it's")"), "it's");
    EXPECT_EQ(prettyNameOfOSRelease(R"(PRETTY_NAME='a'"b"c)"), "abc");
}

TEST(OSReleaseText, KeepsTextsOfOtherScripts) {
    EXPECT_EQ(prettyNameOfOSRelease("PRETTY_NAME=\"Caf\xC3\xA9 1\"\n"), "Caf\xC3\xA9 1");
}

TEST(OSReleaseText, LetsTheLastAssignmentCount) {
    EXPECT_EQ(prettyNameOfOSRelease("PRETTY_NAME=first\nPRETTY_NAME=second\n"), "second");
}

TEST(OSReleaseText, MayHaveBlanksAndLineEndsOfAnotherSystem) {
    EXPECT_EQ(prettyNameOfOSRelease("\r\n  PRETTY_NAME=\"Some 1\" \r\n"), "Some 1");
}

TEST(OSReleaseText, WithoutAPrettyNameGivesNone) {
    EXPECT_EQ(prettyNameOfOSRelease(""), "");
    EXPECT_EQ(prettyNameOfOSRelease("\n\n"), "");
    EXPECT_EQ(prettyNameOfOSRelease("NAME=Some\n#PRETTY_NAME=Comment\nMY_PRETTY_NAME=Other\n"), "");
    EXPECT_EQ(prettyNameOfOSRelease("PRETTY_NAME=\n"), "");
}

TEST(OSReleaseText, WithAnOpenQuoteGivesNone) {
    EXPECT_EQ(prettyNameOfOSRelease("PRETTY_NAME=\"open\nNAME=\"x\"\n"), "");
    EXPECT_EQ(prettyNameOfOSRelease("PRETTY_NAME=\"open\\\"\n"), "");
}

TEST(ProcessInfo, HasAtLeastOneActiveProcessorAndNoMoreThanThereAre) {
    const auto info = ProcessInfo::current();
    EXPECT_GE(info.activeProcessorCount, 1U);
    EXPECT_GE(info.processorCount, info.activeProcessorCount);
}

TEST(ProcessInfo, CountsProcessorsLikeTheSystemsOwnTool) {
    const auto info = ProcessInfo::current();
    EXPECT_EQ(std::to_string(info.processorCount) + "\n", run("getconf _NPROCESSORS_CONF").output);
    EXPECT_EQ(std::to_string(info.activeProcessorCount) + "\n", run("getconf _NPROCESSORS_ONLN").output);
}

TEST(ProcessInfo, StartsWithNothingKnown) {
    const ProcessInfo info;
    EXPECT_EQ(info.physicalMemory, 0U);
    EXPECT_EQ(info.operatingSystemVersionString, "");
    EXPECT_EQ(info.operatingSystemVersion.major, 0);
    EXPECT_EQ(info.operatingSystemVersion.minor, 0);
    EXPECT_EQ(info.operatingSystemVersion.patch, 0);
}

#if defined(__linux__)

TEST(ProcessInfo, GivesTheMemoryOfTheMachineInBytes) {
    std::string key;
    std::uint64_t kibibytes = 0;
    std::ifstream("/proc/meminfo") >> key >> kibibytes;
    ASSERT_EQ(key, "MemTotal:");
    EXPECT_EQ(ProcessInfo::current().physicalMemory, kibibytes * 1024);
}

TEST(ProcessInfo, GivesTheNumbersOfTheRunningKernel) {
    const auto version = ProcessInfo::current().operatingSystemVersion;
    EXPECT_GE(version.major, 2);
    const auto numbers = std::to_string(version.major) + "." + std::to_string(version.minor) + ".";
    EXPECT_EQ(run("uname -r").output.substr(0, numbers.size()), numbers);
}

TEST(ProcessInfo, NamesTheSystemAsItsReleaseFileDoes) {
    const auto fromShell = run(". /etc/os-release && printf %s \"$PRETTY_NAME\"");
    ASSERT_EQ(fromShell.status, 0);
    EXPECT_EQ(ProcessInfo::current().operatingSystemVersionString, fromShell.output);
}

#endif

} // namespace

} // namespace ZULMetaData::Test
