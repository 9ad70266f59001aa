// Mending movies from the command line.

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

const std::string s_openEnded = atom("ftyp", "mp42") + be32(0) + "mdat" + "0123456789";

class RepairCommand : public testing::Test {
protected:
    TemporaryFolder folder;
    const std::string movie = folder / "Recording.mp4";
    const std::string out = folder / "Out.mp4";
};

TEST_F(RepairCommand, SaysWhatWouldChangeWithoutChangingIt) {
    writeFile(movie, s_openEnded);
    std::filesystem::permissions(movie, std::filesystem::perms::owner_read);
    const ToolResult result = runTool({"repair", movie, "--dry-run"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.output, movie + ": the atom 'mdat' at offset 12 has an open end\n" +
                                 "  offset 12: 00000000 -> 00000012  The atom 'mdat' ends where the file does.\n" +
                                 movie + ": would be repaired; nothing was changed\n");
    EXPECT_EQ(result.errors, "");
    EXPECT_EQ(contentsOf(movie), s_openEnded);
}

TEST_F(RepairCommand, ChangesWhatItSaid) {
    writeFile(movie, s_openEnded);
    const ToolResult copied = runTool({"repair", movie, "-o", out});
    EXPECT_EQ(copied.exitCode, 0) << copied.errors;
    EXPECT_THAT(copied.output, HasSubstr(out + ": repaired\n"));
    EXPECT_EQ(contentsOf(out), media());
    EXPECT_EQ(contentsOf(movie), s_openEnded);
    const ToolResult inPlace = runTool({"repair", movie, "--in-place"});
    EXPECT_EQ(inPlace.exitCode, 0) << inPlace.errors;
    EXPECT_EQ(contentsOf(movie), media());
}

TEST_F(RepairCommand, FindsNothingToDoInAWholeMovie) {
    writeFile(movie, media());
    for (const std::string how : {"--dry-run", "--in-place"}) {
        const ToolResult result = runTool({"repair", movie, how});
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        EXPECT_EQ(result.output, movie + ": nothing to repair\n");
        EXPECT_EQ(contentsOf(movie), media());
    }
}

TEST_F(RepairCommand, WantsToKnowWhichFileIsWritten) {
    writeFile(movie, s_openEnded);
    const ToolResult result = runTool({"repair", movie});
    EXPECT_EQ(result.exitCode, 2);
    EXPECT_THAT(result.errors, HasSubstr("either -o OUT, which writes a changed copy, or --in-place"));
    EXPECT_EQ(runTool({"repair", movie, "--dry-run", "--in-place"}).exitCode, 2);
    EXPECT_EQ(runTool({"repair", movie, "--dry-run", "-o", out}).exitCode, 2);
    EXPECT_EQ(runTool({"repair", movie, "--in-place", "-o", out}).exitCode, 2);
    EXPECT_EQ(contentsOf(movie), s_openEnded);
}

TEST_F(RepairCommand, MakesAMovieOfFiveGiBFillItsFile) {
    constexpr std::uint64_t size = 0x140000000;
    writeSparseFile(movie, 20 + size, atom("ftyp", "mp42") + atom("wide") + be32(0) + "mdat");
    const ToolResult result = runTool({"repair", movie, "--in-place"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output, HasSubstr("offset 12: 0000000877696465000000006d646174 -> "
                                         "000000016d6461740000000140000008"));
    EXPECT_EQ(runTool({"repair", movie, "--dry-run"}).exitCode, 0);
}

TEST_F(RepairCommand, TakesInWhatThePlainRepairLeftOver) {
    constexpr std::uint64_t size = 0x100000000;
    writeSparseFile(movie, 20 + size, atom("ftyp", "mp42") + atom("wide") + be32(0) + "mdat");
    ASSERT_TRUE(Util::finalizeAtomsInFile(movie));
    const ToolResult result = runTool({"repair", movie, "--in-place"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output, HasSubstr("offset 20: 0000000100000000 -> 0000000100000008"));
}

TEST_F(RepairCommand, MendsAnAppendThatWasInterrupted) {
    const std::string torn = be32(1) + "DATA" + be64(72) + locationStream().substr(0, 45);
    const std::string interrupted = media() + be32(1) + "ZULM" + be64(0) + extendedAtom("DATA", appNameStream()) + torn;
    writeFile(movie, interrupted);
    const ToolResult result = runTool({"repair", movie, "--in-place"});
    EXPECT_EQ(result.exitCode, 3) << "part of a stream never got into the movie";
    EXPECT_THAT(result.output, HasSubstr("the atom 'ZULM' at offset 30 was appended, but never given its size"));
    EXPECT_THAT(result.output, HasSubstr("-> (cut off)"));
    EXPECT_THAT(result.errors,
                HasSubstr("the stream of the kind cursorLocation ends after 1 entry. Every whole entry is kept"));
    EXPECT_EQ(contentsOf(movie), media() + zulmAtom({appNameStream(), locationStream().substr(0, 40)}));
}

TEST_F(RepairCommand, MendsMetadataThatLacksItsLastByte) {
    const std::string whole = media() + zulmAtom({locationStream()}) + extendedAtom("ZULR", std::string(64, 's'));
    writeFile(movie, whole.substr(0, whole.size() - 1));
    const ToolResult result = runTool({"repair", movie, "--in-place"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("the name and the versions in it are incomplete and are dropped"));
    EXPECT_EQ(runTool({"repair", movie, "--dry-run"}).exitCode, 0);
    EXPECT_EQ(runTool({"verify", movie}).exitCode, 0);
    EXPECT_THAT(contentsOf(movie), testing::StartsWith(media() + zulmAtom({locationStream()})));
}

TEST_F(RepairCommand, CutsOffStrayBytesBehindMetadata) {
    const std::string whole = media() + zulmAtom({locationStream()});
    writeFile(movie, whole + "\n");
    const ToolResult result = runTool({"repair", movie, "--in-place"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output, HasSubstr("the last 1 byte, from offset 118 on, belong to no atom"));
    EXPECT_EQ(contentsOf(movie), whole);
}

TEST_F(RepairCommand, ReportsAsJSON) {
    writeFile(movie, s_openEnded);
    const auto planned = nlohmann::json::parse(runTool({"repair", movie, "--dry-run", "--json"}).output);
    EXPECT_EQ(planned.at("schema"), "zulm.repair");
    const auto file = planned.at("files").at(0);
    EXPECT_EQ(file.at("path"), movie);
    EXPECT_TRUE(file.at("output").is_null());
    EXPECT_EQ(file.at("state"), "repairable");
    EXPECT_EQ(file.at("finding"), "the atom 'mdat' at offset 12 has an open end");
    EXPECT_EQ(file.at("loss"), false);
    EXPECT_EQ(file.at("changes").size(), 1U);
    EXPECT_EQ(file.at("changes").at(0).at("offset"), 12);
    EXPECT_EQ(file.at("changes").at(0).at("before"), "00000000");
    EXPECT_EQ(file.at("changes").at(0).at("after"), "00000012");
    const auto done = nlohmann::json::parse(runTool({"repair", movie, "-o", out, "--json"}).output);
    EXPECT_EQ(done.at("files").at(0).at("output"), out);
}

TEST_F(RepairCommand, SaysWhyItCannotMendAndWhatToRunNext) {
    const std::string broken = media() + be32(100) + "free";
    writeFile(movie, broken);
    for (const std::vector<std::string>& how : {std::vector<std::string>{"--dry-run"}, {"--in-place"}, {"-o", out}}) {
        std::vector<std::string> arguments{"repair", movie};
        arguments.insert(arguments.end(), how.begin(), how.end());
        const ToolResult result = runTool(arguments);
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_THAT(result.errors, HasSubstr("the atom 'free' at offset 30 declares 100 bytes, but the file ends"));
        EXPECT_THAT(result.errors, HasSubstr("'zulm salvage " + movie + " -o DIR'"));
    }
    const auto document = nlohmann::json::parse(runTool({"repair", movie, "--dry-run", "--json"}).output);
    EXPECT_EQ(document.at("files").at(0).at("state"), "unrepairable");
    EXPECT_EQ(document.at("files").at(0).at("offset"), 30);
    EXPECT_EQ(contentsOf(movie), broken);
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(RepairCommand, RefusesWhatIsNoMovie) {
    writeFile(folder / "a.dat", locationStream());
    EXPECT_EQ(runTool({"repair", folder / "a.dat", "--dry-run"}).exitCode, 1);
    EXPECT_EQ(runTool({"repair", folder.path(), "--dry-run"}).exitCode, 1);
    EXPECT_EQ(runTool({"repair", folder / "missing.mp4", "--in-place"}).exitCode, 1);
    std::filesystem::create_symlink("/dev/zero", folder / "device.mp4");
    EXPECT_EQ(runTool({"repair", folder / "device.mp4", "--in-place"}).exitCode, 1);
}

} // namespace

} // namespace ZULMetaData::Test
