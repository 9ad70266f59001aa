// Changing a file in place: positions, lengths, failures, and who may.

#include "Platform/DurableFile.h"

#include "Tests/Support/FileSizeLimit.h"
#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <fstream>
#include <string>
#include <sys/stat.h>
#include <system_error>

namespace ZULMetaData::Test {

namespace {

class DurableFileTest : public testing::Test {
protected:
    static std::string read(const DurableFile& file, std::uint64_t position, std::size_t count) {
        std::string bytes(count, '?');
        bytes.resize(file.readAt(position, bytes));
        return bytes;
    }

    /// The error that opening gives; 0 where it can be opened.
    static int errorOfOpening(const FileLocation& location) {
        try {
            DurableFile file(location);
            return 0;
        } catch (const std::system_error& error) {
            return error.code().value();
        }
    }

    TemporaryFolder folder;
    const std::string path = folder / "file";
};

TEST_F(DurableFileTest, WritesWhereItIsToldAndKeepsTheRest) {
    writeFile(path, "0123456789");
    DurableFile file(path);
    file.writeAt(3, std::string("abc"));
    file.writeAt(9, std::string("xyz"));
    file.sync();
    EXPECT_EQ(contentsOf(path), "012abc678xyz");
    EXPECT_EQ(file.size(), 12U);
}

TEST_F(DurableFileTest, ReadsFewerBytesOnlyAtTheEnd) {
    writeFile(path, "0123456789");
    const DurableFile file(path);
    EXPECT_EQ(read(file, 4, 3), "456");
    EXPECT_EQ(read(file, 7, 10), "789");
    EXPECT_EQ(read(file, 10, 10), "");
    EXPECT_EQ(read(file, std::uint64_t(1) << 40, 10), "");
}

TEST_F(DurableFileTest, CutsOffAndFillsUpWithZeros) {
    writeFile(path, "0123456789");
    DurableFile file(path);
    file.truncate(4);
    file.truncate(6);
    EXPECT_EQ(contentsOf(path), std::string("0123\0\0", 6));
}

TEST_F(DurableFileTest, WorksBehindFourGiB) {
    writeFile(path, "");
    DurableFile file(path);
    file.writeAt(0x100000005, std::string("far"));
    EXPECT_EQ(file.size(), 0x100000008U);
    EXPECT_EQ(read(file, 0x100000005, 3), "far");
    file.truncate(0x100000006);
    EXPECT_EQ(read(file, 0x100000005, 3), "f");
}

TEST_F(DurableFileTest, OpensNothingButARegularFileThatExists) {
    EXPECT_EQ(errorOfOpening(folder / "missing"), ENOENT);
    EXPECT_FALSE(std::filesystem::exists(folder / "missing"));
    EXPECT_EQ(errorOfOpening(folder.path()), EISDIR);
    EXPECT_EQ(errorOfOpening("/dev/full"), EINVAL);
    ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
    EXPECT_EQ(errorOfOpening(path), EINVAL);
}

TEST_F(DurableFileTest, KeepsASecondChangerOutUntilItIsGone) {
    writeFile(path, "0123456789");
    {
        const DurableFile file(path);
        EXPECT_EQ(errorOfOpening(path), EBUSY);
        EXPECT_EQ(contentsOf(path), "0123456789") << "readers are not disturbed";
    }
    EXPECT_EQ(errorOfOpening(path), 0);
}

TEST_F(DurableFileTest, WritesAsMuchAsFitsBeforeItFails) {
    writeFile(path, "");
    DurableFile file(path);
    const FileSizeLimit limit(1000);
    try {
        file.writeAt(10, std::string(2000, 'x'));
        ADD_FAILURE() << "written beyond the limit";
    } catch (const std::system_error& error) {
        EXPECT_EQ(error.code().value(), EFBIG);
        EXPECT_NE(std::string(error.what()).find("cannot be written at offset 1000"), std::string::npos)
            << error.what();
    }
    EXPECT_EQ(contentsOf(path), std::string(10, '\0') + std::string(990, 'x'));
}

TEST_F(DurableFileTest, SaysWhatCouldNotBeDone) {
    writeFile(path, "");
    DurableFile file(path);
    EXPECT_THROW(file.truncate(std::uint64_t(1) << 63), std::system_error);
    std::string bytes(4, '\0');
    EXPECT_THROW(file.readAt(std::uint64_t(1) << 63, bytes), std::system_error);
    EXPECT_THROW(file.writeAt(std::uint64_t(1) << 63, bytes), std::system_error);
}

} // namespace

} // namespace ZULMetaData::Test
