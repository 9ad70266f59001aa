// Files that tell whether a process is alive: who sees what, and what becomes of them however the process ends.

#include "Platform/LockFile.h"

#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <filesystem>
#include <iterator>
#include <optional>
#include <string>
#include <sys/stat.h>
#include <sys/wait.h>
#include <system_error>
#include <unistd.h>

namespace ZULMetaData::Test {

namespace {

using State = LockFile::State;

class LockFileTest : public testing::Test {
protected:
    static int errorOfCreating(const FileLocation& location) {
        try {
            const LockFile file(location, "note");
            return 0;
        } catch (const std::system_error& error) {
            return error.code().value();
        }
    }

    std::size_t filesInFolder() const {
        return static_cast<std::size_t>(
            std::distance(std::filesystem::directory_iterator(folder.path()), std::filesystem::directory_iterator()));
    }

    TemporaryFolder folder;
    const std::string path = folder / "lock";
};

/// A process that holds the lock until it is told to end or killed.
class Holder {
public:
    explicit Holder(const std::string& path) {
        std::array<int, 2> ready{};
        EXPECT_EQ(pipe(ready.data()), 0);
        process_ = fork();
        if (process_ == 0) {
            const LockFile file(path, "note");
            static_cast<void>(write(ready[1], "!", 1) == 1);
            pause();
            _exit(0);
        }
        char byte = 0;
        EXPECT_EQ(read(ready[0], &byte, 1), 1);
        close(ready[0]);
        close(ready[1]);
    }

    void kill() const {
        ::kill(process_, SIGKILL);
        waitpid(process_, nullptr, 0);
    }

private:
    pid_t process_ = -1;
};

TEST_F(LockFileTest, IsHeldAsLongAsItsObjectLivesAndLeftAfterwards) {
    EXPECT_EQ(LockFile::stateOf(path), State::Absent);
    {
        const LockFile file(path, "note");
        EXPECT_EQ(LockFile::stateOf(path), State::Held) << "also for the process that holds it";
        EXPECT_EQ(contentsOf(path), "note");
    }
    EXPECT_EQ(LockFile::stateOf(path), State::Left);
    EXPECT_EQ(LockFile::stateOf(path), State::Left) << "whoever looks does not hold it";
}

TEST_F(LockFileTest, IsGoneOnceItIsRemoved) {
    LockFile file(path, "note");
    file.remove();
    EXPECT_EQ(LockFile::stateOf(path), State::Absent);
    file.remove();
}

TEST_F(LockFileTest, ReplacesNoFileAndLeavesNoneBeside) {
    writeFile(path, "there");
    EXPECT_EQ(errorOfCreating(path), EEXIST);
    EXPECT_EQ(contentsOf(path), "there");
    EXPECT_EQ(filesInFolder(), 1U);
    EXPECT_EQ(errorOfCreating(folder / "no folder/lock"), ENOENT);
}

TEST_F(LockFileTest, IsPrivate) {
    const LockFile file(path, "note");
    EXPECT_EQ(std::filesystem::status(path).permissions(),
              std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
}

TEST_F(LockFileTest, IsHeldByALivingProcessAndLeftByAKilledOne) {
    const Holder holder(path);
    EXPECT_EQ(LockFile::stateOf(path), State::Held);
    EXPECT_EQ(errorOfCreating(path), EEXIST);
    holder.kill();
    EXPECT_EQ(LockFile::stateOf(path), State::Left);
    EXPECT_EQ(errorOfCreating(path), EEXIST) << "nobody takes it over";
}

TEST_F(LockFileTest, IsNotKeptAliveByAProgramThatWasStarted) {
    std::optional<LockFile> file(std::in_place, path, "note");
    std::array<int, 2> started{};
    ASSERT_EQ(pipe2(started.data(), O_CLOEXEC), 0);
    const pid_t process = fork();
    if (process == 0) {
        execlp("sleep", "sleep", "60", nullptr);
        _exit(1);
    }
    close(started[1]);
    char byte = 0;
    EXPECT_EQ(read(started[0], &byte, 1), 0) << "the program has closed its end";
    close(started[0]);
    file.reset();
    EXPECT_EQ(LockFile::stateOf(path), State::Left);
    ::kill(process, SIGKILL);
    waitpid(process, nullptr, 0);
}

TEST_F(LockFileTest, CountsAsHeldWhereNobodyCanTell) {
    writeFile(path, "");
    EXPECT_EQ(LockFile::stateOf(path), State::Held) << "another process is about to put its own here";
    std::filesystem::remove(path);
    std::filesystem::create_directory(path);
    EXPECT_EQ(LockFile::stateOf(path), State::Held);
    EXPECT_EQ(LockFile::stateOf(folder / "lock/below"), State::Absent);
    std::filesystem::remove(path);
    ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
    EXPECT_EQ(LockFile::stateOf(path), State::Held);
}

} // namespace

} // namespace ZULMetaData::Test
