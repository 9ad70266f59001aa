// What is told of a file and of its streams.

#include "Reports/InfoReport.h"

#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <string>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::ordered_json;

/// The document about a file with these bytes.
Json infoOn(const std::string& bytes, const std::string& name) {
    RecordingFile recording(ByteSource::memory(bytes), name);
    return Zulm::infoDocument(recording);
}

/// A movie header in thousandths of a second: [version and flags][created][changed][timescale][duration].
std::string movieHeader(std::uint32_t milliseconds) {
    return atom("moov", atom("mvhd", be32(0) + be32(0) + be32(0) + be32(1000) + be32(milliseconds)));
}

/// A record of recording info that a program named "Recorder" has written.
std::string recordingInfo() {
    std::string creator(56, '\0');
    creator.replace(0, 8, "Recorder");
    return extendedAtom("ZULR", le64(1) + creator);
}

TEST(InfoReport, TellsWhatAMovieHolds) {
    const Json info = infoOn(media() + movieHeader(2500) + recordingInfo() +
                                 extendedAtom("ZULM", extendedAtom("DATA", locationStream()) + atom("free")),
                             "a.mp4");
    EXPECT_EQ(info["path"], "a.mp4");
    EXPECT_EQ(info["container"], "movie");
    EXPECT_EQ(info["bytes"], 30 + 36 + 80 + 96);
    EXPECT_EQ(info["duration"], 2.5);
    EXPECT_EQ(info["streams"].size(), 1U);
    EXPECT_EQ(info["streams"][0].dump(),
              R"({"kind":"cursorLocation","uuid":"2b7b6af2-7a1f-11e2-83d0-0017f200be7f","version":1,"entries":2,)"
              R"("first_time":0.5,"last_time":1.0,"entries_per_second":2.0,"offset":178,"bytes":56})");
    EXPECT_EQ(info["creators"][0]["name"], "Recorder");
    EXPECT_EQ(info["foreign_atoms"].dump(), R"([{"type":"free","offset":234,"size":8}])");
    ASSERT_EQ(info["warnings"].size(), 1U);
    EXPECT_EQ(info["warnings"][0]["code"], "foreign-child");
}

TEST(InfoReport, CountsNoEntriesThatCannotBeDecoded) {
    const Json info = infoOn(streamHeader("12345678", 1, 16) + f64(1) + le64(0), "a.dat");
    EXPECT_EQ(info["container"], "stream");
    EXPECT_EQ(info["duration"], nullptr);
    EXPECT_EQ(info["streams"][0]["kind"], nullptr);
    EXPECT_EQ(info["streams"][0]["entries"], nullptr);
}

TEST(InfoReport, NamesTheDamageOfAStream) {
    const Json info = infoOn(locationStream() + "1234", "a.dat");
    EXPECT_EQ(info["streams"][0]["entries"], 2);
    EXPECT_EQ(info["streams"][0]["damage"], "at offset 56: the last entry has 4 of 16 bytes");
}

TEST(InfoReport, HasNoRateWithoutTwoTimes) {
    StreamReport stream;
    stream.wholeEntries = 3;
    stream.firstTime = 1;
    EXPECT_FALSE(Zulm::entriesPerSecond(stream));
    stream.lastTime = 1;
    EXPECT_FALSE(Zulm::entriesPerSecond(stream)) << "all at one time";
    stream.lastTime = 2;
    EXPECT_EQ(Zulm::entriesPerSecond(stream), 2.0);
    stream.lastTime = 0.5;
    EXPECT_FALSE(Zulm::entriesPerSecond(stream)) << "times that go back";
    stream.wholeEntries = 1;
    stream.lastTime = 2;
    EXPECT_FALSE(Zulm::entriesPerSecond(stream));
}

TEST(InfoReport, ShowsACreatorInOneLine) {
    CreatorAttributes creator;
    creator.setName("Mac");
    creator.setVersion("1.2");
    creator.setPlatformVersion("6.1\n");
    EXPECT_EQ(Zulm::shownCreator(creator), "Mac 1.2 on version 6.1\\x0a");
}

} // namespace
} // namespace ZULMetaData::Test
