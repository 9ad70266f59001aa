// Opening files, moving in them, and turning byte orders around.

#include "SharedDependencies/EndianFile.h"

#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <concepts>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <sys/stat.h>

namespace ZULMetaData::Test {

namespace {

constexpr std::int64_t s_fiveGiB = 5LL << 30;

/// A file that holds "0123456789", and the path of one that is not there.
class FileOpen : public testing::Test {
protected:
    FileOpen() { writeFile(file, "0123456789"); }

    TemporaryFolder folder;
    const std::string file = folder / "digits";
    const std::string missing = folder / "missing";
    std::ifstream input;
    std::ofstream output;
    std::fstream both;

    template <class Stream>
    void open(Stream& stream, const std::string& path, std::ios_base::openmode mode) {
        fileOpen(stream, path.c_str(), mode | std::ios_base::binary);
    }

    bool missingExists() const { return std::filesystem::exists(missing); }
};

// ---- Input ----------------------------------------------------------------------------------------------------

TEST_F(FileOpen, AddsTheInputModeForAnInputStream) {
    open(input, file, {});
    std::string text;
    EXPECT_TRUE(input >> text);
    EXPECT_EQ(text, "0123456789");
    EXPECT_EQ(contentsOf(file), "0123456789");
}

TEST_F(FileOpen, KeepsTheModeThatAnInputStreamAsksFor) {
    open(input, file, std::ios_base::ate);
    EXPECT_EQ(input.tellg(), 10);
}

TEST_F(FileOpen, FailsForInputThatIsNotThereAndDoesNotCreateIt) {
    open(input, missing, {});
    EXPECT_TRUE(input.fail());
    EXPECT_FALSE(input.is_open());
    EXPECT_FALSE(missingExists());
}

TEST_F(FileOpen, ClearsAnEarlierFailureWhereItSucceeds) {
    open(input, missing, {});
    open(input, file, {});
    EXPECT_TRUE(input.good());
}

TEST_F(FileOpen, TakesPathsInUTF8) {
    const std::string path = folder / "Aufnahme \xc3\xbc \xe5\x8b\x95\xe7\x94\xbb";
    open(output, path, {});
    output << "x";
    output.close();
    open(input, path, {});
    EXPECT_EQ(input.get(), 'x');
}

// ---- Output ---------------------------------------------------------------------------------------------------

TEST_F(FileOpen, AddsTheOutputModeForAnOutputStreamAndCreatesTheFile) {
    open(output, missing, {});
    output << "new";
    output.close();
    EXPECT_EQ(contentsOf(missing), "new");
}

TEST_F(FileOpen, EmptiesAFileThatIsToBeTruncated) {
    open(output, file, std::ios_base::trunc);
    EXPECT_EQ(contentsOf(file), "");
}

TEST_F(FileOpen, AppendsWhereAsked) {
    open(output, file, std::ios_base::app);
    output << "ab";
    output.close();
    EXPECT_EQ(contentsOf(file), "0123456789ab");
}

TEST_F(FileOpen, KeepsTheContentsForAnOutputStreamThatAlsoReads) {
    open(output, file, std::ios_base::in);
    output << "ab";
    output.close();
    EXPECT_EQ(contentsOf(file), "ab23456789");
}

TEST_F(FileOpen, FailsForOutputWhereNoFileCanBe) {
    open(output, folder.path().string(), std::ios_base::trunc);
    EXPECT_TRUE(output.fail());
    EXPECT_FALSE(output.is_open());
}

// ---- Both -----------------------------------------------------------------------------------------------------

TEST_F(FileOpen, TakesTheModeAsGivenForAStreamOfBoth) {
    open(both, file, std::ios_base::in | std::ios_base::out);
    EXPECT_EQ(both.get(), '0');
    both.seekp(5);
    both << 'x';
    both.close();
    EXPECT_EQ(contentsOf(file), "01234x6789");
}

TEST_F(FileOpen, AddsNoOutputModeToAStreamOfBoth) {
    open(both, file, std::ios_base::in);
    both << 'x' << std::flush;
    EXPECT_TRUE(both.fail());
    EXPECT_EQ(contentsOf(file), "0123456789");
}

TEST_F(FileOpen, AddsNoInputModeToAStreamOfBoth) {
    open(both, file, std::ios_base::out | std::ios_base::trunc);
    both << "abc" << std::flush;
    both.seekg(0);
    EXPECT_EQ(both.get(), EOF);
    EXPECT_EQ(contentsOf(file), "abc");
}

TEST_F(FileOpen, FailsForAPipeInsteadOfWaitingForItsOtherEnd) {
    const std::string pipe = folder / "pipe";
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    open(input, pipe, {});
    open(output, pipe, std::ios_base::trunc);
    open(both, pipe, std::ios_base::in | std::ios_base::out);
    EXPECT_TRUE(input.fail() && output.fail() && both.fail());
    EXPECT_FALSE(input.is_open() || output.is_open() || both.is_open());
    EXPECT_EQ(errno, EINVAL);
}

TEST_F(FileOpen, FailsForALinkToAPipe) {
    ASSERT_EQ(mkfifo((folder / "pipe").c_str(), 0600), 0);
    std::filesystem::create_symlink("pipe", folder / "link");
    open(input, folder / "link", {});
    EXPECT_TRUE(input.fail());
}

TEST_F(FileOpen, DoesNotCreateAFileThatIsToBeReadAndWritten) {
    open(both, missing, std::ios_base::in | std::ios_base::out);
    EXPECT_TRUE(both.fail());
    EXPECT_FALSE(missingExists());
}

// ---- Positions ------------------------------------------------------------------------------------------------

class SeekWritePos : public FileOpen {};

TEST_F(SeekWritePos, CountsFromTheStart) {
    open(both, file, std::ios_base::in | std::ios_base::out);
    seekWritePos(both, 7);
    seekWritePos(both, 2);
    both << 'x';
    both.close();
    EXPECT_EQ(contentsOf(file), "01x3456789");
}

TEST_F(SeekWritePos, GoesBeyondFourGiB) {
    open(output, missing, {});
    seekWritePos(output, s_fiveGiB);
    EXPECT_EQ(toInt64(output.tellp()), s_fiveGiB);
    output << 'x';
    output.close();
    EXPECT_EQ(std::filesystem::file_size(missing), static_cast<std::uintmax_t>(s_fiveGiB + 1));
}

TEST_F(SeekWritePos, FailsInFrontOfTheStart) {
    open(output, file, std::ios_base::app);
    seekWritePos(output, -1);
    EXPECT_TRUE(output.fail());
}

TEST(ToInt64, GivesPositionsOfAnySize) {
    EXPECT_EQ(toInt64(std::streampos(0)), 0);
    EXPECT_EQ(toInt64(std::streampos(24)), 24);
    EXPECT_EQ(toInt64(std::streampos(s_fiveGiB)), 5368709120);
}

TEST(ToInt64, GivesMinusOneForAStreamThatFailed) {
    std::istringstream stream("0123");
    stream.setstate(std::ios_base::failbit);
    EXPECT_EQ(toInt64(stream.tellg()), -1);
}

// ---- Byte order -----------------------------------------------------------------------------------------------

TEST(SwapInt, ReversesAllEightBytes) {
    EXPECT_EQ(swapInt(std::uint64_t{0x0123456789abcdef}), 0xefcdab8967452301U);
    EXPECT_EQ(swapInt(std::uint64_t{0xff00000000000000}), 0xffU);
    EXPECT_EQ(swapInt(std::uint64_t{0x80}), 0x8000000000000000U);
    EXPECT_EQ(swapInt(std::uint64_t{0}), 0U);
    EXPECT_EQ(swapInt(std::uint64_t{0xffffffffffffffff}), 0xffffffffffffffffU);
}

TEST(SwapInt, ReversesAllFourBytes) {
    EXPECT_EQ(swapInt(std::uint32_t{0x01234567}), 0x67452301U);
    EXPECT_EQ(swapInt(std::uint32_t{0xff000000}), 0xffU);
    EXPECT_EQ(swapInt(std::uint32_t{0x80}), 0x80000000U);
    EXPECT_EQ(swapInt(std::uint32_t{0}), 0U);
    EXPECT_EQ(swapInt(std::uint32_t{0xffffffff}), 0xffffffffU);
}

TEST(SwapInt, KeepsTheWidthOfItsArgument) {
    EXPECT_TRUE((std::same_as<decltype(swapInt(std::uint64_t{1})), std::uint64_t>));
    EXPECT_TRUE((std::same_as<decltype(swapInt(std::uint32_t{1})), std::uint32_t>));
}

} // namespace

} // namespace ZULMetaData::Test
