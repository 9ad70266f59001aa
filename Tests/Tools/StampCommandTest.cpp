// Stamping movies from the command line.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/ZULMetaData.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <filesystem>

namespace ZULMetaData::Test {

namespace {

using testing::HasSubstr;

class StampCommand : public testing::Test {
protected:
    ToolResult stamp(const std::vector<std::string>& more, const std::string& version = "4.2") const {
        std::vector<std::string> arguments{"stamp", movie, "--creator", "Recorder", "--creator-version", version};
        arguments.insert(arguments.end(), more.begin(), more.end());
        return runTool(arguments);
    }

    TemporaryFolder folder;
    const std::string movie = folder / "Recording.mp4";
    const std::string out = folder / "Out.mp4";
};

TEST_F(StampCommand, AppendsTheRecordingInfo) {
    writeFile(movie, media());
    const ToolResult result = stamp({"--in-place"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output, HasSubstr(movie + ": stamped as Mac 4.2 on version "));
    const std::string stamped = contentsOf(movie);
    ASSERT_EQ(stamped.size(), media().size() + 80);
    EXPECT_EQ(stamped.substr(0, 30 + 16 + 8 + 24 + 4),
              media() + be32(1) + "ZULR" + be64(80) + le64(1) + "Mac" + std::string(21, '\0') + "4.2" + '\0');
}

TEST_F(StampCommand, SaysThatThePlatformStandsInPlaceOfTheCreator) {
    writeFile(movie, media());
    EXPECT_THAT(stamp({"--in-place"}).output,
                HasSubstr("Mac stands in place of Recorder: a movie stores the platform's name, not its creator's\n"));
    const std::string help = runTool({"stamp", "--help"}).output;
    EXPECT_THAT(help, HasSubstr("This name is not stored"));
    EXPECT_THAT(runTool({"info", movie}).output, HasSubstr("creator: Mac 4.2 on version "));
    EXPECT_THAT(runTool({"info", movie}).output,
                HasSubstr("(the name is the platform's: no stamp stores the creator's)"));
}

TEST_F(StampCommand, RepairsAndStampsACopy) {
    const std::string open = atom("ftyp", "mp42") + be32(0) + "mdat" + "0123456789";
    writeFile(movie, open);
    const ToolResult result = stamp({"-o", out, "--json"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    const auto file = nlohmann::json::parse(result.output).at("files").at(0);
    EXPECT_EQ(file.at("output"), out);
    EXPECT_EQ(file.at("repair").at("state"), "repairable");
    EXPECT_EQ(file.at("creator").at("name"), "Mac");
    EXPECT_EQ(file.at("creator").at("version"), "4.2");
    EXPECT_EQ(contentsOf(movie), open);
    EXPECT_TRUE(contentsOf(out).starts_with(media()));
}

TEST_F(StampCommand, SaysThatAVersionWasCut) {
    writeFile(movie, media());
    const ToolResult result = stamp({"--in-place"}, "4.2 with a long tail");
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("the version was cut to what its field holds: 4.2 with a long"));
}

TEST_F(StampCommand, WantsToKnowWhichFileIsWrittenAndByWhom) {
    writeFile(movie, media());
    EXPECT_EQ(stamp({}).exitCode, 2);
    EXPECT_EQ(stamp({"--in-place", "-o", out}).exitCode, 2);
    EXPECT_EQ(runTool({"stamp", movie, "--in-place"}).exitCode, 2);
    EXPECT_EQ(contentsOf(movie), media());
}

TEST_F(StampCommand, FailsWithoutAnAssertionWhereTheMovieCannotBeChanged) {
    const ToolResult missing = stamp({"--in-place"});
    EXPECT_EQ(missing.exitCode, 1);
    EXPECT_THAT(missing.errors, HasSubstr("no such file"));
    writeFile(movie, media() + be32(100) + "free");
    EXPECT_EQ(stamp({"--in-place"}).exitCode, 1);
    EXPECT_EQ(contentsOf(movie), media() + be32(100) + "free");
    writeFile(movie, media());
    const ToolResult full = runProgram("sh", {"-c", "ulimit -f 0; exec \"$0\" \"$@\"", ZULM_PATH, "stamp", movie,
                                              "--creator", "Recorder", "--creator-version", "1", "--in-place"});
    EXPECT_EQ(full.exitCode, 1) << full.errors;
    EXPECT_THAT(full.errors, HasSubstr(movie + ": cannot be written at offset 30"));
    EXPECT_EQ(contentsOf(movie), media());
}

} // namespace

} // namespace ZULMetaData::Test
