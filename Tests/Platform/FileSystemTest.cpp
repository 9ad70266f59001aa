// Copies that keep holes, and renames that replace nothing.

#include "Platform/FileSystem.h"

#include "Tests/Support/FileSizeLimit.h"
#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <fstream>
#include <string>
#include <sys/stat.h>
#include <system_error>
#include <vector>

namespace ZULMetaData::Test {

namespace {

class FileSystemTest : public testing::Test {
protected:
    FileSystemTest() { writeFile(target, "what was there before"); }

    std::string copied(std::uint64_t offset, std::uint64_t size) {
        copyFileRange(source, offset, size, target);
        return contentsOf(target);
    }

    /// The sentence of the error, and which file it is about.
    std::string failureOfCopying(std::uint64_t offset, std::uint64_t size) {
        try {
            copyFileRange(source, offset, size, target);
        } catch (const CopyError& error) {
            return (error.side() == CopyError::Side::Source ? "source " : "target ") + std::string(error.what());
        }
        return "none";
    }

    /// In bytes.
    static std::uint64_t storedBytes(const std::string& path) {
        struct stat status {};
        EXPECT_EQ(stat(path.c_str(), &status), 0);
        return static_cast<std::uint64_t>(status.st_blocks) * 512;
    }

    TemporaryFolder folder;
    const std::string source = folder / "source";
    const std::string target = folder / "target";
};

TEST_F(FileSystemTest, CopiesARange) {
    writeFile(source, "0123456789");
    EXPECT_EQ(copied(0, 10), "0123456789");
    EXPECT_EQ(copied(3, 4), "3456");
    EXPECT_EQ(copied(10, 0), "");
}

TEST_F(FileSystemTest, KeepsHolesBeforeBetweenAndAfterTheData) {
    constexpr std::uint64_t size = 1 << 30;
    writeSparseFile(source, size, "");
    {
        std::fstream file(source, std::ios::in | std::ios::out | std::ios::binary);
        file.seekp(size / 2 + 5);
        file << "in the middle";
    }
    copyFileRange(source, 0, size, target);
    EXPECT_EQ(std::filesystem::file_size(target), size);
    EXPECT_LT(storedBytes(target), 1U << 20);
    std::ifstream copy(target, std::ios::binary);
    copy.seekg(size / 2);
    std::string middle(20, '?');
    copy.read(middle.data(), 20);
    EXPECT_EQ(middle, std::string(5, '\0') + "in the middle" + std::string(2, '\0'));
}

TEST_F(FileSystemTest, ReportsProgressUpToTheEnd) {
    writeFile(source, "0123456789");
    std::vector<std::uint64_t> reports;
    copyFileRange(source, 2, 6, target, [&](std::uint64_t done) { reports.push_back(done); });
    ASSERT_FALSE(reports.empty());
    EXPECT_EQ(reports.back(), 6U);
}

TEST_F(FileSystemTest, SaysWhereASourceEndsTooEarly) {
    writeFile(source, "0123456789");
    EXPECT_EQ(failureOfCopying(4, 10), "source ends at offset 10");
    EXPECT_EQ(failureOfCopying(40, 10), "source ends at offset 40");
}

TEST_F(FileSystemTest, SaysWhichFileFailed) {
    EXPECT_EQ(failureOfCopying(0, 1), "source cannot be opened: No such file or directory");
    writeFile(source, std::string(1 << 16, 'x'));
    const FileSizeLimit limit(1 << 12);
    EXPECT_EQ(failureOfCopying(0, 1 << 16), "target cannot be written at offset 4096: File too large");
}

using Rename = void (*)(const FileLocation&, const FileLocation&);

class RenameTest : public FileSystemTest, public testing::WithParamInterface<Rename> {};

TEST_P(RenameTest, TakesAFreeName) {
    writeFile(source, "new");
    std::filesystem::remove(target);
    GetParam()(source, target);
    EXPECT_EQ(contentsOf(target), "new");
    EXPECT_FALSE(std::filesystem::exists(source));
}

TEST_P(RenameTest, LeavesAFileAloneThatHasTheName) {
    writeFile(source, "new");
    try {
        GetParam()(source, target);
        FAIL() << "replaced it";
    } catch (const std::system_error& error) {
        EXPECT_EQ(error.code(), std::errc::file_exists);
    }
    EXPECT_EQ(contentsOf(target), "what was there before");
    EXPECT_EQ(contentsOf(source), "new");
}

TEST_P(RenameTest, LeavesNothingIfThereIsNothingToRename) {
    std::filesystem::remove(target);
    EXPECT_THROW(GetParam()(source, target), std::system_error);
    EXPECT_FALSE(std::filesystem::exists(target));
}

TEST_F(FileSystemTest, CreatesAFolderForItsOwnerAlone) {
    const mode_t mask = umask(0);
    EXPECT_TRUE(createPrivateFolder(folder / "private"));
    umask(mask);
    EXPECT_EQ(std::filesystem::status(folder / "private").permissions(), std::filesystem::perms::owner_all);
    EXPECT_FALSE(createPrivateFolder(folder / "private")) << "it is there";
}

TEST_F(FileSystemTest, CreatesNoFolderInTheNameOfAFileAndNoneAboveIt) {
    EXPECT_THROW(createPrivateFolder(target), std::system_error);
    EXPECT_EQ(contentsOf(target), "what was there before");
    EXPECT_THROW(createPrivateFolder(folder / "no folder/private"), std::system_error);
    EXPECT_FALSE(std::filesystem::exists(folder / "no folder"));
}

INSTANTIATE_TEST_SUITE_P(InOneStep, RenameTest, testing::Values(renameWithoutReplacing));
INSTANTIATE_TEST_SUITE_P(InTwoSteps, RenameTest, testing::Values(renameOverPlaceholder));

} // namespace

} // namespace ZULMetaData::Test
