// Writing a new file: what it replaces, who may read it, when bytes reach it, and what a failure leaves.

#include "Platform/NewFile.h"

#include "Tests/Support/FileSizeLimit.h"
#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <filesystem>
#include <ostream>
#include <string>
#include <sys/stat.h>
#include <system_error>

namespace ZULMetaData::Test {

namespace {

class NewFileTest : public testing::Test {
protected:
    static int errorOfCreating(const FileLocation& location) {
        try {
            const NewFile file(location);
            return 0;
        } catch (const std::system_error& error) {
            return error.code().value();
        }
    }

    TemporaryFolder folder;
    const std::string path = folder / "file";
};

TEST_F(NewFileTest, ReplacesNothing) {
    writeFile(path, "there");
    EXPECT_EQ(errorOfCreating(path), EEXIST);
    EXPECT_EQ(contentsOf(path), "there");
    std::filesystem::create_symlink(folder / "missing", folder / "link");
    EXPECT_EQ(errorOfCreating(folder / "link"), EEXIST);
    EXPECT_EQ(errorOfCreating(folder / "no folder/file"), ENOENT);
}

TEST_F(NewFileTest, IsPrivateWhateverTheMask) {
    const mode_t mask = umask(0);
    const NewFile file(path);
    umask(mask);
    EXPECT_EQ(std::filesystem::status(path).permissions(),
              std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
}

TEST_F(NewFileTest, HoldsBytesUntilItIsFlushedOrClosed) {
    NewFile file(path);
    std::ostream stream(&file);
    EXPECT_FALSE(file.hasUnwritten());
    stream << "abc";
    EXPECT_TRUE(file.hasUnwritten());
    EXPECT_EQ(contentsOf(path), "");
    stream.flush();
    EXPECT_FALSE(file.hasUnwritten());
    EXPECT_EQ(contentsOf(path), "abc");
    stream << "def";
    EXPECT_TRUE(file.close());
    EXPECT_EQ(contentsOf(path), "abcdef");
    EXPECT_EQ(file.failure(), "");
}

TEST_F(NewFileTest, WritesEverythingInOrderWhateverItsSize) {
    std::string expected;
    {
        NewFile file(path);
        std::ostream stream(&file);
        for (int i = 0; i < 300; ++i) {
            const std::string piece(static_cast<std::size_t>(i) * 7, static_cast<char>('a' + i % 26));
            stream << piece;
            expected += piece;
            if (i % 50 == 0)
                stream.flush();
        }
        const std::string large(200'000, 'L');
        stream << large << 'x';
        expected += large + 'x';
        EXPECT_TRUE(file.close());
    }
    EXPECT_EQ(contentsOf(path), expected);
}

TEST_F(NewFileTest, WritesBlocksThatEndWherePagesDo) {
    NewFile file(path);
    std::ostream stream(&file);
    stream << "abc" << std::flush << std::string(65536, 'x');
    EXPECT_EQ(std::filesystem::file_size(path) % 4096, 0U);
    EXPECT_GT(std::filesystem::file_size(path), 0U);
}

TEST_F(NewFileTest, WritesNothingMoreAfterAFailureAndSaysWhatFailed) {
    NewFile file(path);
    std::ostream stream(&file);
    stream << "0123456789" << std::flush;
    {
        const FileSizeLimit limit(15);
        stream << "abcdefghij";
        EXPECT_TRUE(stream.good()) << "it is in memory";
        stream.flush();
        EXPECT_FALSE(stream.good());
    }
    stream.clear();
    stream << "more" << std::flush;
    EXPECT_FALSE(stream.good());
    EXPECT_FALSE(file.close());
    EXPECT_EQ(contentsOf(path), "0123456789abcde");
    EXPECT_EQ(file.failure(), "cannot be written at offset 15: File too large");
}

TEST_F(NewFileTest, FailsWhenItsBufferIsFullAndTheDiskTooAndWhenItCloses) {
    NewFile file(path);
    std::ostream stream(&file);
    NewFile other(folder / "other");
    std::ostream otherStream(&other);
    otherStream << "abc";
    const FileSizeLimit limit(0);
    stream << std::string(65536, 'x');
    EXPECT_TRUE(stream.good());
    stream << 'y';
    EXPECT_FALSE(stream.good());
    EXPECT_EQ(file.failure(), "cannot be written at offset 0: File too large");
    EXPECT_FALSE(other.close());
    EXPECT_EQ(other.failure(), "cannot be written at offset 0: File too large");
}

TEST_F(NewFileTest, TakesNothingAfterItIsClosed) {
    NewFile file(path);
    std::ostream stream(&file);
    EXPECT_TRUE(file.close());
    EXPECT_TRUE(file.close());
    stream << "late";
    EXPECT_FALSE(stream.good());
    EXPECT_EQ(contentsOf(path), "");
}

} // namespace

} // namespace ZULMetaData::Test
