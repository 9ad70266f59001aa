// Files that commands write: who may read them, what they replace, and what is left of them.

#include "Tools/zulm/OutputFile.h"
#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"
#include "Tools/zulm/Failure.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <csignal>
#include <filesystem>
#include <sys/stat.h>
#include <thread>

namespace ZULMetaData::Test {

namespace {

using testing::HasSubstr;
using testing::IsEmpty;
namespace fs = std::filesystem;

constexpr mode_t s_private = 0600;
constexpr mode_t s_open = 0644;

mode_t modeOf(const std::string& path) {
    struct stat status {};
    EXPECT_EQ(stat(path.c_str(), &status), 0) << path;
    return status.st_mode & 07777;
}

std::string given(const std::string& path, const std::string& contents, mode_t mode) {
    writeFile(path, contents);
    chmod(path.c_str(), mode);
    return path;
}

class OutputFileTest : public testing::Test {
protected:
    OutputFileTest() { umask(022); }
    ~OutputFileTest() override { umask(oldMask); }

    std::string movie(mode_t mode) const {
        return given(folder / "Movie.mp4", movieWith(extendedAtom("DATA", locations())), mode);
    }

    static void expectSuccess(const std::vector<std::string>& arguments) {
        const ToolResult result = runTool(arguments);
        EXPECT_EQ(result.exitCode, 0) << testing::PrintToString(arguments) << result.errors;
    }

    const mode_t oldMask = umask(022);
    const TemporaryFolder folder;
    const std::string out = folder / "Out.mp4";
};

TEST_F(OutputFileTest, GivesNobodyMoreThanTheInputDoes) {
    const std::string secret = movie(s_private);
    const std::string page = given(folder / "page.html", "<head></head>", s_open);
    const std::string stream = given(folder / "scroll.dat", streamHeader("2b7b6a05", 1, 16), s_open);
    const std::vector<std::pair<std::vector<std::string>, std::string>> commands{
        {{"redact", secret, "--keys", "-o", out}, out},
        {{"attach", secret, stream, "-o", folder / "a.mp4"}, folder / "a.mp4"},
        {{"repair", secret, "-o", folder / "r.mp4"}, folder / "r.mp4"},
        {{"stamp", secret, "--creator", "n", "--creator-version", "1", "-o", folder / "s.mp4"}, folder / "s.mp4"},
        {{"extract", secret, "-o", folder / "streams"}, folder / "streams/cursorLocation.dat"},
        {{"salvage", secret, "-o", folder / "rescued"}, folder / "rescued/cursorLocation.dat"},
        {{"view", secret, "--page", page, "-o", folder / "v.html"}, folder / "v.html"},
    };
    for (const auto& [arguments, output] : commands) {
        expectSuccess(arguments);
        EXPECT_EQ(modeOf(output), s_private) << arguments.front();
    }
}

TEST_F(OutputFileTest, GivesNobodyMoreThanAnyOfItsInputsDoes) {
    const std::string secret = given(folder / "cursorLocation.dat", locations(), s_private);
    const std::string plain = given(folder / "Plain.mp4", tinyMovie(), s_open);
    expectSuccess({"attach", plain, secret, "-o", out});
    EXPECT_EQ(modeOf(out), s_private);
}

TEST_F(OutputFileTest, HasTheUsualPermissionsIfItsInputHasThem) {
    expectSuccess({"repair", movie(0666), "-o", out});
    EXPECT_EQ(modeOf(out), s_open);
}

TEST_F(OutputFileTest, TakesItsPermissionsFromTheFileThatIsStandardInput) {
    const std::string command = "umask 022; '" ZULM_PATH "' extract - -o '" + (folder / "s") + "' ";
    const std::string stream = folder / "s/cursorLocation.dat";
    const std::string secret = movie(s_private);
    outputOf(command + "< '" + secret + "'");
    EXPECT_EQ(modeOf(stream), s_private);
    fs::remove(stream);
    outputOf("cat '" + secret + "' | (" + command + ")");
    EXPECT_EQ(modeOf(stream), s_open); // a pipe has no owner
}

TEST_F(OutputFileTest, KeepsThePermissionsOfTheFileThatItReplaces) {
    for (const mode_t mode : {mode_t(0600), mode_t(0640), mode_t(0664)}) {
        given(out, "old", mode);
        expectSuccess({"repair", movie(s_open), "-o", out, "--force"});
        EXPECT_EQ(modeOf(out), mode);
    }
}

TEST_F(OutputFileTest, ShowsNoSecretUnderThePermissionsOfTheFileThatItReplaces) {
    given(out, "old", s_open);
    expectSuccess({"repair", movie(s_private), "-o", out, "--force"});
    EXPECT_EQ(modeOf(out), s_private);
}

TEST_F(OutputFileTest, IsPrivateUntilItIsInPlace) {
    Zulm::OutputFile file(out, {movie(s_open)}, false);
    EXPECT_EQ(modeOf(file.temporaryPath()), s_private);
    file.commit();
    EXPECT_EQ(modeOf(out), s_open);
}

TEST_F(OutputFileTest, LeavesAFileAloneThatAppearsMeanwhile) {
    Zulm::OutputFile first(out, {}, false);
    Zulm::OutputFile second(out, {}, false);
    writeFile(first.temporaryPath(), "first");
    writeFile(second.temporaryPath(), "second");
    first.commit();
    try {
        second.commit();
        FAIL() << "replaced it";
    } catch (const Zulm::Failure& failure) {
        EXPECT_EQ(failure.what(), out + ": exists already; --force replaces it");
    }
    EXPECT_EQ(contentsOf(out), "first");
}

TEST_F(OutputFileTest, IsWrittenByOneOfTwoCommandsAtOnce) {
    const std::string whole = movie(s_open);
    std::array<ToolResult, 2> results;
    {
        std::jthread other([&] { results[0] = runTool({"repair", whole, "-o", out}); });
        results[1] = runTool({"repair", whole, "-o", out});
    }
    EXPECT_EQ(results[0].exitCode + results[1].exitCode, 1) << results[0].errors << results[1].errors;
    EXPECT_EQ(contentsOf(out), contentsOf(whole));
    EXPECT_EQ(namesIn(folder.path()).size(), 2U);
}

TEST_F(OutputFileTest, MayHaveTheLongestNameThereIs) {
    for (const std::size_t length : {std::size_t(248), std::size_t(255)}) {
        const std::string path = folder / (std::string(length - 4, 'n') + ".mp4");
        expectSuccess({"repair", movie(s_open), "-o", path});
        EXPECT_TRUE(fs::exists(path));
    }
}

TEST_F(OutputFileTest, KeepsTheHolesOfItsInput) {
    constexpr std::uint64_t size = std::uint64_t(1) << 30;
    const std::string sparse = folder / "Sparse.mp4";
    writeSparseFile(sparse, 12 + size, atom("ftyp", "mp42") + be32(size) + "mdat");
    expectSuccess({"repair", sparse, "-o", out});
    struct stat status {};
    ASSERT_EQ(stat(out.c_str(), &status), 0);
    EXPECT_EQ(status.st_size, static_cast<off_t>(12 + size));
    EXPECT_LT(status.st_blocks * 512, 1 << 20);
}

class EndingSignalTest : public testing::TestWithParam<int> {};

TEST_P(EndingSignalTest, LeavesNoFile) {
    const TemporaryFolder folder;
    const auto countFiles = [&] { return std::distance(fs::directory_iterator(folder.path()), {}); };
    ToolOptions options;
    options.environment = {{"TMPDIR", folder.path().string()}};
    options.input = tinyMovie() + atom("free", std::string(1 << 17, ' ')); // more than the tool reads at once
    options.keepsInputOpen = true;
    options.killAfterMilliseconds = 1;
    options.killWhen = [&] {
        const fs::directory_iterator files(folder.path());
        return std::any_of(begin(files), end(files), [](const auto& entry) { return entry.file_size() > 0; });
    };
    options.killSignal = GetParam();
    options.beforeKill = [&] {
        EXPECT_EQ(countFiles(), 1);
        for (const auto& entry : fs::directory_iterator(folder.path()))
            EXPECT_EQ(modeOf(entry.path()), s_private);
    };
    EXPECT_EQ(runTool({"info", "-"}, options).exitCode, 128 + GetParam());
    EXPECT_EQ(countFiles(), 0);
}

INSTANTIATE_TEST_SUITE_P(Of, EndingSignalTest,
                         testing::Values(SIGHUP, SIGINT, SIGQUIT, SIGALRM, SIGTERM, SIGUSR1, SIGUSR2, SIGXCPU),
                         [](const auto& tested) { return std::string(sigabbrev_np(tested.param)); });

} // namespace

} // namespace ZULMetaData::Test
