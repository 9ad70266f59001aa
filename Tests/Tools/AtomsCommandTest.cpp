// `zulm atoms`: how a container is put together.

#include "Tests/Tools/Golden.h"
#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

namespace ZULMetaData::Test {
namespace {

using nlohmann::json;
using testing::HasSubstr;

class AtomsCommand : public RecordedSession {
protected:
    ToolResult run(const std::vector<std::string>& arguments) const {
        ToolOptions options;
        options.folder = folder.path().string();
        return runTool(arguments, options);
    }

    json reportOn(const std::string& name, const std::string& bytes, int expectedCode) const {
        writeFile(folder / name, bytes);
        const ToolResult result = run({"atoms", "--json", name});
        EXPECT_EQ(result.exitCode, expectedCode) << result.errors;
        return json::parse(result.output).at("files").at(0);
    }

    /// Of a file where the walk ends early, once.
    std::string endOf(const std::string& name, const std::string& bytes, std::uint64_t expectedOffset) const {
        const json file = reportOn(name, bytes, 3);
        EXPECT_EQ(file.at("ends").size(), 1U) << file;
        EXPECT_EQ(file.at("ends").at(0).at("offset"), expectedOffset);
        return file.at("ends").at(0).at("reason");
    }
};

TEST_F(AtomsCommand, ShowsTheTreeOfARecording) {
    copyOf(movie());
    const ToolResult text = run({"atoms", "Recording.mp4"});
    EXPECT_EQ(text.exitCode, 0);
    EXPECT_EQ(text.errors, "");
    expectGolden(text.output, "atoms.txt");
    expectGolden(run({"atoms", "--json", "Recording.mp4"}).output, "atoms.json");
}

TEST_F(AtomsCommand, ShowsWhatIsForeignUnknownOrUnprintable) {
    writeFile(folder / "Odd.mp4", atom(std::string("\0\xff\\a", 4)) + oddMovie());
    expectGolden(run({"atoms", "Odd.mp4"}).output, "atoms-odd.txt");
    expectGolden(run({"atoms", "--json", "Odd.mp4"}).output, "atoms-odd.json");
}

TEST_F(AtomsCommand, ShowsTheChunksOfARIFFFile) {
    writeFile(folder / "Sound.wav", waveWithLocations());
    const ToolResult text = run({"atoms", "Sound.wav"});
    EXPECT_EQ(text.exitCode, 0) << text.errors;
    expectGolden(text.output, "atoms-riff.txt");
}

TEST_F(AtomsCommand, TellsTheFormsOfHeadersApart) {
    const json file = reportOn("a.mp4", atom("ftyp") + extendedAtom("free") + be32(0) + "mdat" + "media", 3);
    EXPECT_EQ(file.at("items").at(0).at("header"), "32-bit");
    EXPECT_EQ(file.at("items").at(1).at("header"), "extended");
    EXPECT_EQ(file.at("items").at(2).at("header"), "open-ended");
    EXPECT_EQ(file.at("items").at(2).at("size"), 13); // up to the end of the file
    EXPECT_EQ(file.at("items").at(2).at("offset"), 24);
}

TEST_F(AtomsCommand, SaysWhyAWalkEndsEarly) {
    const std::string type = atom("ftyp", "isom");
    EXPECT_THAT(endOf("open.mp4", type + be32(0) + "mdat" + "pictures", 12), HasSubstr("'mdat' is open-ended"));
    EXPECT_THAT(endOf("save.mp4", type + be32(1) + "ZULM" + be64(0) + "x", 12), HasSubstr("'ZULM' declares size 0"));
    EXPECT_THAT(endOf("long.mp4", type + be32(100) + "mdat" + "pictures", 12),
                HasSubstr("reaches 84 bytes beyond the end of the file"));
    EXPECT_THAT(endOf("rest.mp4", type + "1234567", 12), HasSubstr("7 bytes are left"));
    EXPECT_THAT(endOf("short.mp4", type + be32(1) + "mdat" + be64(9) + "x", 12),
                HasSubstr("declares 9 bytes, less than its header of 16"));
    EXPECT_THAT(endOf("huge.mp4", type + be32(1) + "mdat" + be64(0xffffffffffffffff), 12), HasSubstr("beyond the end"));
    EXPECT_THAT(endOf("long.wav", chunk("RIFF", "WAVE") + "ZULM" + le32(99), 12), HasSubstr("reaches 99 bytes"));
    EXPECT_THAT(endOf("none.wav", chunk("RIFF", "WAVE") + chunk("void"), 12), HasSubstr("has size 0"));
}

TEST_F(AtomsCommand, SaysWhereTheInsideOfTheMetaDataEnds) {
    EXPECT_THAT(endOf("a.mp4", extendedAtom("ZULM", be32(1) + "DATA" + be64(100) + locations()), 16),
                HasSubstr("reaches 12 bytes beyond the end of the metadata"));
}

TEST_F(AtomsCommand, HasNothingToShowOfABareStream) {
    writeFile(folder / "a.dat", locations());
    const ToolResult result = run({"atoms", "a.dat"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("a.dat: a bare stream has no atoms; 'zulm info a.dat' shows what it is"));
}

TEST_F(AtomsCommand, ReadsAnEmptyMovie) {
    EXPECT_TRUE(reportOn("empty.mp4", "", 0).at("items").empty());
}

} // namespace
} // namespace ZULMetaData::Test
