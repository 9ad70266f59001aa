#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;
using testing::HasSubstr;

class SalvageCommand : public RecordedSession {
protected:
    std::string write(const std::string& name, const std::string& contents) const {
        writeFile(folder / name, contents);
        return folder / name;
    }

    Json reportOf(const ToolResult& result) const { return Json::parse(result.output)["files"][0]; }

    void expectAllStreams() const {
        for (const std::string& file : streamFiles()) {
            const std::string name = std::filesystem::path(file).filename().string();
            EXPECT_TRUE(contentsOf(folder / ("out/" + name)) == contentsOf(file)) << name;
        }
    }
};

TEST_F(SalvageCommand, GivesTheStreamsOfAWholeMovie) {
    const ToolResult result = runTool({"salvage", movie(), "-o", folder / "out"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output, HasSubstr("reachable"));
    expectAllStreams();
}

TEST_F(SalvageCommand, GivesEveryStreamBehindABrokenAtom) {
    std::string bytes = contentsOf(movie());
    bytes.replace(0, 4, be32(0x7fffffff)); // the first atom swallows the file
    const std::string file = write("broken.mp4", bytes);
    EXPECT_EQ(runTool({"extract", file, "-o", folder / "none"}).exitCode, 4);
    const ToolResult result = runTool({"salvage", file, "-o", folder / "out", "--json"});
    EXPECT_EQ(result.exitCode, 3);
    expectAllStreams();
    const Json report = reportOf(result);
    for (const Json& stream : report["streams"])
        EXPECT_EQ(stream["found"], "behind a broken atom");
}

TEST_F(SalvageCommand, GivesEveryStreamOfAFileWhoseFrontIsLost) {
    const std::string bytes = contentsOf(movie());
    const std::string file = write("front.bin", bytes.substr(bytes.find("ZULM") + 3));
    EXPECT_EQ(runTool({"salvage", file, "-o", folder / "out"}).exitCode, 3);
    expectAllStreams();
}

TEST_F(SalvageCommand, GivesWhatIsWholeOfAFileCutShort) {
    const std::string whole = media() + zulmAtom({locationStream(), appNameStream()});
    const std::string file = write("cut.mp4", whole.substr(0, whole.size() - 3));
    const ToolResult result = runTool({"salvage", file, "-o", folder / "out"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.output, HasSubstr("cut short"));
    EXPECT_EQ(contentsOf(folder / "out/topmostAppName.dat"), appNameStream().substr(0, 39));
    EXPECT_EQ(contentsOf(folder / "out/cursorLocation.dat"), locationStream());
}

TEST_F(SalvageCommand, GivesTheStreamsBehindATornOne) {
    writeFile(folder / "torn.dat", locationStream() + "torn");
    writeFile(folder / "names.dat", appNameStream());
    const std::string file = write("torn.mp4", media());
    ZULMAtomWriter().writeMetaDataFiles({folder / "torn.dat", folder / "names.dat"}, file);
    EXPECT_EQ(runTool({"extract", file, "-o", folder / "none", "--stream", "topmostAppName"}).exitCode, 4);
    EXPECT_EQ(runTool({"salvage", file, "-o", folder / "out"}).exitCode, 3);
    EXPECT_EQ(contentsOf(folder / "out/topmostAppName.dat"), appNameStream());
    EXPECT_EQ(contentsOf(folder / "out/cursorLocation.dat"), locationStream());
}

TEST_F(SalvageCommand, SearchesASparseMovieWhoseRepairedSizeLeavesEightBytesOver) {
    const std::uint64_t size = (5ULL << 30);
    const std::string file = folder / "large.mp4";
    writeSparseFile(file, size, atom("ftyp", "mp42") + atom("wide") + be32(0) + "mdat");
    ASSERT_TRUE(ZULMAtomRepair::finalizeAtomsInFile(file));
    writeFile(folder / "locations.dat", locationStream());
    ASSERT_TRUE(MP4MetaData::appendMetaDataFiles(file, {folder / "locations.dat"})); // without another repair
    EXPECT_EQ(runTool({"extract", file, "-o", folder / "none"}).exitCode, 4);
    const ToolResult result = runTool({"salvage", file, "-o", folder / "out", "--json"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(reportOf(result)["streams"][0]["offset"], size + 32);
    EXPECT_EQ(contentsOf(folder / "out/cursorLocation.dat"), locationStream());
}

TEST_F(SalvageCommand, NumbersSeveralStreamsOfOneKindTheBestFirst) {
    const std::string small = streamHeader(s_cursorLocations, 1, 16) + pointEntry(1, 1, 1);
    const std::string file = write("several.mp4", media() + zulmAtom({locationStream()}) + zulmAtom({small}));
    EXPECT_EQ(runTool({"salvage", file, "-o", folder / "out"}).exitCode, 0);
    EXPECT_EQ(contentsOf(folder / "out/cursorLocation.dat"), locationStream());
    EXPECT_EQ(contentsOf(folder / "out/cursorLocation-2.dat"), small);
}

TEST_F(SalvageCommand, WritesWhatAttachTakesAndVerifyFindsWhole) {
    const std::string bytes = contentsOf(movie());
    const std::string file = write("front.bin", bytes.substr(bytes.find("ZULM") + 3));
    ASSERT_EQ(runTool({"salvage", file, "-o", folder / "out"}).exitCode, 3);
    std::vector<std::string> arguments{"attach", write("plain.mp4", tinyMovie()), "-o", folder / "whole.mp4"};
    for (const auto& stream : std::filesystem::directory_iterator(folder / "out"))
        arguments.push_back(stream.path().string());
    ASSERT_EQ(runTool(arguments).exitCode, 0);
    EXPECT_EQ(runTool({"diff", movie(), folder / "whole.mp4"}).exitCode, 0);
    EXPECT_EQ(runTool({"verify", folder / "whole.mp4"}).exitCode, 0);
}

TEST_F(SalvageCommand, FindsNothingInOrdinaryMedia) {
    const ToolResult result = runTool({"salvage", write("plain.mp4", tinyMovie()), "-o", folder / "out"});
    EXPECT_EQ(result.exitCode, 4);
    EXPECT_THAT(result.errors, HasSubstr("no metadata streams anywhere in it"));
    EXPECT_FALSE(std::filesystem::exists(folder / "out"));
    EXPECT_EQ(runTool({"salvage", write("empty.mp4", ""), "-o", folder / "out"}).exitCode, 4);
}

TEST_F(SalvageCommand, LeavesExistingFilesAloneWithoutForce) {
    ASSERT_EQ(runTool({"salvage", movie(), "-o", folder / "out"}).exitCode, 0);
    EXPECT_EQ(runTool({"salvage", movie(), "-o", folder / "out"}).exitCode, 1);
    EXPECT_EQ(runTool({"salvage", movie(), "-o", folder / "out", "--force"}).exitCode, 0);
}

} // namespace
} // namespace ZULMetaData::Test
