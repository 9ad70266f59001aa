// Creating a parser, loading streams through it, scanning anew and closing it.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "Tests/ZULMetaData/WatchedStream.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <ios>
#include <limits>
#include <list>
#include <map>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;

using Streams = std::map<uuid, std::string>;

class Parser : public testing::Test {
protected:
    /// `messages` then holds what was written on standard error.
    std::unique_ptr<MetaDataParser> create(const std::string& path) {
        testing::internal::CaptureStderr();
        auto parser = MetaDataParser::create(path);
        messages = testing::internal::GetCapturedStderr();
        return parser;
    }

    std::unique_ptr<MetaDataParser> createFor(const std::string& name, const std::string& contents) {
        writeFile(folder / name, contents);
        return create(folder / name);
    }

    std::unique_ptr<MetaDataParser> createFromStream(std::istream& stream, MetaDataParser::StreamType type) {
        testing::internal::CaptureStderr();
        auto parser = MetaDataParser::create(stream, type);
        messages = testing::internal::GetCapturedStderr();
        return parser;
    }

    /// What an observer gets of the one stream of a movie.
    template <class T>
    Entries<T> loaded(const std::string& group, const std::string& stream, int version = -1) {
        Entries<T> entries;
        createFor("Recording.mp4", media() + zulmAtom({stream}))->loadDataType(kind(group), entries, version);
        return entries;
    }

    TemporaryFolder folder;
    std::string messages;
};

// Recognising files --------------------------------------------------------------------------------------------

struct NamedFile {
    std::string name;
    MetaDataParser::StreamType type;
};

TEST_F(Parser, KnowsAContainerByItsExtensionInAnyCase) {
    const NamedFile files[] = {{"a.avi", MetaDataParser::Riff},
                               {"a.wav", MetaDataParser::Riff},
                               {"a.zcap", MetaDataParser::QuickTime},
                               {"a.mp4", MetaDataParser::QuickTime},
                               {"a.mov", MetaDataParser::QuickTime},
                               {"a.dat", MetaDataParser::RawStream},
                               {"Movie.MP4", MetaDataParser::QuickTime},
                               {"a.Dat", MetaDataParser::RawStream},
                               {"x.ZCAP", MetaDataParser::QuickTime},
                               {"A.AVI", MetaDataParser::Riff},
                               {"b.WaV", MetaDataParser::Riff},
                               {"c.mOv", MetaDataParser::QuickTime},
                               {"archive.tar.mp4", MetaDataParser::QuickTime},
                               {"a.mp4.wav", MetaDataParser::Riff},
                               {".mov", MetaDataParser::QuickTime},
                               {"a..dat", MetaDataParser::RawStream},
                               {"Caf\xC3\x89 \xE8\xA8\x98.mp4", MetaDataParser::QuickTime}};
    for (const NamedFile& file : files) {
        const auto parser = createFor(file.name, "");
        ASSERT_TRUE(parser) << file.name;
        EXPECT_EQ(parser->getStreamType(), file.type) << file.name;
        EXPECT_EQ(messages, "") << file.name;
    }
}

TEST_F(Parser, RefusesEveryOtherExtensionWithoutAMessage) {
    for (const std::string name : {"a.mkv", "a", "mp4", "a.", "a.mp", "a.mp4x", "a.mp4 ", "a.mp4.", "a.dat.bak",
                                   "a.m4v", "a.mp\xC3\x84", "a.xmp4"}) {
        EXPECT_FALSE(createFor(name, media())) << name;
        EXPECT_EQ(messages, "") << name;
    }
}

TEST_F(Parser, RefusesAFileWhoseLastDotIsInTheNameOfAFolder) {
    std::filesystem::create_directory(folder / "folder.mp4");
    EXPECT_FALSE(createFor("folder.mp4/movie", media()));
    EXPECT_EQ(messages, "");
}

TEST_F(Parser, TakesTheExtensionOfAFileInAFolderWithADot) {
    std::filesystem::create_directory(folder / "folder.mp4");
    EXPECT_EQ(createFor("folder.mp4/sound.wav", "")->getStreamType(), MetaDataParser::Riff);
}

TEST_F(Parser, SaysWhichFileItCannotOpen) {
    for (const std::string& path : {folder / "missing.mp4", folder / "missing.mkv", folder / "missing",
                                    folder / "missing/movie.mp4", std::string()}) {
        EXPECT_FALSE(create(path));
        EXPECT_EQ(messages, "Can't parse metadata. Unable to open file: " + path + "\n");
    }
}

TEST_F(Parser, RefusesAStreamThatIsNotGoodWithAMessage) {
    for (const auto state : {std::ios_base::badbit, std::ios_base::failbit, std::ios_base::eofbit}) {
        std::istringstream stream(media());
        stream.setstate(state);
        for (const auto type : {MetaDataParser::QuickTime, MetaDataParser::Unknown}) {
            EXPECT_FALSE(createFromStream(stream, type));
            EXPECT_EQ(messages, "Can't parse metadata. Stream is not good.\n");
            EXPECT_EQ(stream.rdstate(), state);
        }
    }
}

TEST_F(Parser, RefusesAStreamOfUnknownTypeWithoutTouchingIt) {
    std::istringstream stream(media());
    stream.seekg(5);
    EXPECT_FALSE(createFromStream(stream, MetaDataParser::Unknown));
    EXPECT_EQ(messages, "");
    EXPECT_EQ(stream.tellg(), std::streampos(5));
}

TEST_F(Parser, NumbersTheTypesOfStreams) {
    EXPECT_EQ(MetaDataParser::Unknown, 0);
    EXPECT_EQ(MetaDataParser::Riff, 1);
    EXPECT_EQ(MetaDataParser::QuickTime, 2);
    EXPECT_EQ(MetaDataParser::RawStream, 3);
}

TEST_F(Parser, KeepsTheTypeThatAStreamWasGiven) {
    for (const auto type : {MetaDataParser::Riff, MetaDataParser::QuickTime, MetaDataParser::RawStream}) {
        std::istringstream stream(media());
        EXPECT_EQ(createFromStream(stream, type)->getStreamType(), type);
    }
}

TEST_F(Parser, ScansAStreamFromItsStartWhereverItStands) {
    std::istringstream stream(zulmAtom({locationStream()}));
    stream.seekg(7);
    const auto parser = createFromStream(stream, MetaDataParser::QuickTime);
    EXPECT_THAT(streamsOf(*parser), ElementsAre(FoundStream{kind(s_cursorLocations), 32, 56}));
}

// Things that are no ordinary files ----------------------------------------------------------------------------

TEST_F(Parser, FindsNothingInAnEmptyMovieOrRiffFile) {
    EXPECT_THAT(streamsOf(*createFor("a.mp4", "")), IsEmpty());
    EXPECT_THAT(streamsOf(*createFor("a.avi", "")), IsEmpty());
}

TEST_F(Parser, FindsNothingInAFolderThatIsNamedLikeAMovie) {
    for (const std::string name : {"a.mp4", "a.avi"}) {
        std::filesystem::create_directory(folder / name);
        if (const auto parser = create(folder / name)) // where a folder can be opened at all
            EXPECT_THAT(streamsOf(*parser), IsEmpty());
        else
            EXPECT_EQ(messages, "Can't parse metadata. Unable to open file: " + folder / name + "\n");
    }
}

TEST_F(Parser, LoadsNothingFromAFolderThatIsNamedLikeAStream) {
    std::filesystem::create_directory(folder / "a.dat");
    Streams streams;
    if (const auto parser = create(folder / "a.dat"))
        parser->loadAllData(streams);
    for (const auto& [type, bytes] : streams)
        EXPECT_EQ(bytes, "");
}

TEST_F(Parser, FindsNothingInADeviceThatIsNamedLikeAMovie) {
    for (const std::string device : {"/dev/null", "/dev/zero"})
        for (const std::string name : {"movie.mp4", "movie.avi"}) {
            std::filesystem::remove(folder / name);
            std::filesystem::create_symlink(device, folder / name);
            const auto parser = create(folder / name);
            ASSERT_TRUE(parser) << device;
            EXPECT_THAT(streamsOf(*parser), IsEmpty()) << device;
            EXPECT_EQ(messages, "");
        }
}

TEST_F(Parser, LoadsNothingFromADeviceThatIsNamedLikeAStream) {
    for (const std::string device : {"/dev/null", "/dev/zero"}) {
        std::filesystem::remove(folder / "a.dat");
        std::filesystem::create_symlink(device, folder / "a.dat");
        const auto parser = create(folder / "a.dat");
        ASSERT_TRUE(parser) << device;
        EXPECT_THAT(streamsOf(*parser), ElementsAre(FoundStream{uuid{}, 0, 0})) << device;
        Streams streams;
        parser->loadAllData(streams);
        EXPECT_THAT(streams, ElementsAre(Pair(uuid{}, "")));
    }
}

// The stream behind a parser -----------------------------------------------------------------------------------

TEST_F(Parser, GivesTheStreamOfItsFile) {
    const auto parser = createFor("a.dat", locationStream());
    std::istream& stream = parser->getStream();
    stream.clear();
    stream.seekg(0);
    std::string bytes(56, '\0');
    stream.read(bytes.data(), 56);
    EXPECT_EQ(bytes, locationStream());
}

TEST_F(Parser, GivesTheStreamOfItsCaller) {
    std::istringstream stream(locationStream());
    const auto parser = createFromStream(stream, MetaDataParser::RawStream);
    EXPECT_EQ(&parser->getStream(), &stream);
}

TEST_F(Parser, ClosesItsFile) {
    const auto parser = createFor("a.dat", locationStream());
    parser->close();
    EXPECT_FALSE(dynamic_cast<std::ifstream&>(parser->getStream()).is_open());
}

TEST_F(Parser, SetsTheFailBitWhereClosingFails) {
    const auto parser = createFor("a.mp4", media());
    parser->getStream().clear();
    parser->close();
    EXPECT_FALSE(parser->getStream().fail());
    parser->close();
    EXPECT_TRUE(parser->getStream().fail());
}

TEST_F(Parser, LeavesTheStreamOfItsCallerOpen) {
    writeFile(folder / "a.bin", locationStream());
    std::ifstream stream(folder / "a.bin", std::ios_base::binary);
    auto parser = createFromStream(stream, MetaDataParser::RawStream);
    parser->close();
    Entries<Point> entries;
    parser->loadDataType(kind(s_cursorLocations), entries, -1);
    EXPECT_EQ(entries.values.size(), 2u);
    parser.reset();
    EXPECT_TRUE(stream.is_open());
}

TEST_F(Parser, KeepsItsFileOpenWhenItIsRemoved) {
    const auto parser = createFor("a.dat", locationStream());
    std::filesystem::remove(folder / "a.dat");
    Streams streams;
    parser->loadAllData(streams);
    EXPECT_EQ(streams[kind(s_cursorLocations)], locationStream());
}

TEST_F(Parser, KnowsTheRangeOfAStreamAndNoneOfAnother) {
    const auto parser = createFor("a.mp4", zulmAtom({locationStream()}));
    const auto range = parser->fileDataForUUID(kind(s_cursorLocations));
    EXPECT_EQ(range.offset, 32u);
    EXPECT_EQ(range.length, 56u);
    const auto none = parser->fileDataForUUID(kind(s_appNames));
    EXPECT_EQ(none.offset, 0u);
    EXPECT_EQ(none.length, 0u);
}

TEST_F(Parser, ListsTheKindsInAscendingOrder) {
    const auto parser = createFor("a.mp4", zulmAtom({scaleStream(1.0), appNameStream(), locationStream()}));
    EXPECT_THAT(parser->getAvailableMetaDataUUIDs(),
                ElementsAre(kind(s_appNames), kind(s_cursorLocations), kind(s_scaleFactors)));
}

// Loading entries ----------------------------------------------------------------------------------------------

TEST_F(Parser, LoadsPoints) {
    const auto entries = loaded<Point>(s_cursorLocations, locationStream());
    EXPECT_THAT(entries.times, ElementsAre(0.5, 1.0));
    EXPECT_THAT(entries.values, ElementsAre(Point(10, 20), Point(-3, 7)));
}

TEST_F(Parser, LoadsRects) {
    const auto entries = loaded<Rect>("2b7b6af7", streamHeader("2b7b6af7", 1, 24) + f64(1.5) + le32(1) + le32(2) +
                                                      le32(640) + le32(480));
    EXPECT_THAT(entries.times, ElementsAre(1.5));
    EXPECT_THAT(entries.values, ElementsAre(Rect(1, 2, 640, 480)));
}

TEST_F(Parser, LoadsKeyStrokes) {
    const auto entries =
        loaded<KeyStroke>("2b7b6af5", streamHeader("2b7b6af5", 1, 16) + f64(1.5) + le32(0x61) + le32(0x80000102));
    EXPECT_THAT(entries.times, ElementsAre(1.5));
    EXPECT_THAT(entries.values, ElementsAre(KeyStroke(0x61, 0x80000102)));
}

TEST_F(Parser, LoadsIntegers) {
    const auto entries = loaded<int>("2b7b6af0", streamHeader("2b7b6af0", 1, 12) + f64(1.5) + raw(-2));
    EXPECT_THAT(entries.times, ElementsAre(1.5));
    EXPECT_THAT(entries.values, ElementsAre(-2));
}

TEST_F(Parser, LoadsFloats) {
    const auto entries = loaded<float>("2b7b6a08", streamHeader("2b7b6a08", 1, 12) + f64(1.5) + f32(0.25f));
    EXPECT_THAT(entries.times, ElementsAre(1.5));
    EXPECT_THAT(entries.values, ElementsAre(0.25f));
}

TEST_F(Parser, LoadsDoubles) {
    const auto entries = loaded<double>("2b7b6af3", streamHeader("2b7b6af3", 1, 16) + f64(1.5) + f64(0.1));
    EXPECT_THAT(entries.times, ElementsAre(1.5));
    EXPECT_THAT(entries.values, ElementsAre(0.1));
}

TEST_F(Parser, LoadsTexts) {
    const auto entries = loaded<std::string>(s_appNames, appNameStream());
    EXPECT_THAT(entries.times, ElementsAre(0.5, 2.0));
    EXPECT_THAT(entries.values, ElementsAre("Abc", "Notes"));
}

TEST_F(Parser, LoadsListsOfTexts) {
    const auto entries = loaded<std::list<std::string>>(
        "2b7b6afc", streamHeader("2b7b6afc", 1, 0) + le32(31) + le32(2) + textEntry(5.0, "a") + textEntry(5.0, "bc"));
    EXPECT_THAT(entries.times, ElementsAre(0.0));
    EXPECT_THAT(entries.values, ElementsAre(ElementsAre("a", "bc")));
}

TEST_F(Parser, LoadsCursorImages) {
    const auto entries =
        loaded<CursorImage>("2b7b6af1", streamHeader("2b7b6af1", 2, 0) + le32(43) + f64(1.5) + le64(99) + le32(23) +
                                            le32(3) + raw(-4) + raw(5) + "PNG" + raw(7) + le32(1));
    EXPECT_THAT(entries.times, ElementsAre(1.5));
    ASSERT_EQ(entries.values.size(), 1u);
    const CursorImage& image = entries.values[0];
    EXPECT_EQ(image.uniqueId, 99u);
    EXPECT_EQ(image.hotspotOffsetX, -4);
    EXPECT_EQ(image.hotspotOffsetY, 5);
    EXPECT_EQ(std::string(image.imageData, image.imageData + image.imageDataSize), "PNG");
    EXPECT_EQ(image.cursorTypeId, static_cast<CursorTypeID>(7));
    EXPECT_EQ(image.flags, static_cast<CursorImage::CursorImageFlags>(1));
}

TEST_F(Parser, LoadsEntriesFromARiffFileAndABareStream) {
    for (const auto& [name, contents] : std::map<std::string, std::string>{
             {"a.wav", riffMedia() + zulmChunk({locationStream()})}, {"a.dat", locationStream()}}) {
        Entries<Point> entries;
        createFor(name, contents)->loadDataType(kind(s_cursorLocations), entries, -1);
        EXPECT_THAT(entries.values, ElementsAre(Point(10, 20), Point(-3, 7))) << name;
    }
}

TEST_F(Parser, LoadsNoEntryBehindTheEndOfItsStream) {
    const auto parser =
        createFor("a.mp4", zulmAtom({locationStream(), locationStream().replace(24, 8, f64(9.0)), scaleStream(2.0)}));
    Entries<Point> entries;
    parser->loadDataType(kind(s_cursorLocations), entries, -1);
    EXPECT_THAT(entries.times, ElementsAre(9.0, 1.0));
}

TEST_F(Parser, LoadsNothingOfAKindThatIsNotThere) {
    testing::internal::CaptureStdout();
    const auto entries = loaded<Point>("2b7b6a05", locationStream());
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
    EXPECT_THAT(entries.values, IsEmpty());
}

TEST_F(Parser, LoadsANewerVersionOnlyWhereItIsAskedFor) {
    std::string newer = locationStream();
    newer.replace(16, 4, le32(2));
    testing::internal::CaptureStdout();
    EXPECT_THAT(loaded<Point>(s_cursorLocations, newer).values, IsEmpty());
    EXPECT_EQ(testing::internal::GetCapturedStdout(),
              "MetaDataReader<T>::parseFile - Version is larger than what we can handle\n");
    EXPECT_EQ(loaded<Point>(s_cursorLocations, newer, 2).values.size(), 2u);
}

TEST_F(Parser, LoadsAgainAndAgainAndEveryKindInTurn) {
    const auto parser = createFor("a.mp4", zulmAtom({locationStream(), appNameStream()}));
    for (int i = 0; i < 2; ++i) {
        Entries<std::string> texts; // ends at the end of the file
        parser->loadDataType(kind(s_appNames), texts, -1);
        EXPECT_EQ(texts.values.size(), 2u);
        Entries<Point> points;
        parser->loadDataType(kind(s_cursorLocations), points, -1);
        EXPECT_EQ(points.values.size(), 2u);
    }
}

TEST_F(Parser, LoadsNoMoreOnceTheObserverHasEnough) {
    const auto parser = createFor("a.mp4", zulmAtom({locationStream()}));
    Entries<Point> entries;
    entries.limit = 1;
    parser->loadDataType(kind(s_cursorLocations), entries, -1);
    EXPECT_THAT(entries.values, ElementsAre(Point(10, 20)));
}

TEST_F(Parser, LetsTheErrorOfATornEntryThrough) {
    const auto parser = createFor("a.dat", locationStream().substr(0, 24 + 16 + 3));
    Entries<Point> entries;
    EXPECT_THROW(parser->loadDataType(kind(s_cursorLocations), entries, -1), std::runtime_error);
    EXPECT_THAT(entries.values, ElementsAre(Point(10, 20)));
}

TEST_F(Parser, HasNothingLeftToReadOnceItIsClosed) {
    const auto parser = createFor("Recording.mp4", media());
    parser->getStream().seekg(4);
    EXPECT_EQ(parser->getStream().get(), 'f');
    parser->close();
    parser->getStream().clear();
    EXPECT_EQ(parser->getStream().get(), std::istream::traits_type::eof());
}

TEST_F(Parser, LoadsNothingOnceItIsClosed) {
    const auto parser = createFor("a.dat", locationStream());
    parser->close();
    Entries<Point> entries;
    testing::internal::CaptureStdout();
    parser->loadDataType(kind(s_cursorLocations), entries, -1);
    testing::internal::GetCapturedStdout();
    EXPECT_THAT(entries.values, IsEmpty());
}

// Copying streams out ------------------------------------------------------------------------------------------

TEST_F(Parser, CopiesEveryStreamWithItsHeader) {
    Streams streams;
    createFor("a.mp4", media() + zulmAtom({locationStream(), appNameStream()}))->loadAllData(streams);
    EXPECT_THAT(streams,
                ElementsAre(Pair(kind(s_appNames), appNameStream()), Pair(kind(s_cursorLocations), locationStream())));
}

TEST_F(Parser, CopiesTheStreamsOfARiffFileAndABareStream) {
    Streams streams;
    createFor("a.avi", riffMedia() + zulmChunk({locationStream()}))->loadAllData(streams);
    createFor("a.dat", appNameStream() + "torn")->loadAllData(streams);
    EXPECT_THAT(streams, ElementsAre(Pair(kind(s_appNames), appNameStream() + "torn"),
                                     Pair(kind(s_cursorLocations), locationStream())));
}

TEST_F(Parser, CopiesTheStreamOfOneKind) {
    const auto parser = createFor("a.mp4", media() + zulmAtom({locationStream(), appNameStream()}));
    EXPECT_EQ(parser->loadData(kind(s_cursorLocations)), locationStream());
    EXPECT_EQ(parser->loadData(kind(s_appNames)), appNameStream());
    EXPECT_EQ(parser->loadData(kind(s_scaleFactors)), "");
}

TEST_F(Parser, ReadsNoOtherStreamForTheStreamOfOneKind) {
    WatchedStream movie(zulmAtom({locationStream(), appNameStream(), scaleStream(1.0)}));
    const auto parser = createFromStream(movie, MetaDataParser::QuickTime);
    const std::size_t readByScan = movie.buffer().bytesRead();
    EXPECT_EQ(parser->loadData(kind(s_appNames)), appNameStream());
    EXPECT_EQ(movie.buffer().bytesRead() - readByScan, appNameStream().size());
}

TEST_F(Parser, CopiesNothingOfAStreamThatCannotBeReached) {
    WatchedStream movie(zulmAtom({locationStream()}));
    const auto parser = createFromStream(movie, MetaDataParser::QuickTime);
    movie.buffer().refuse(32);
    EXPECT_EQ(parser->loadData(kind(s_cursorLocations)), "");
}

TEST_F(Parser, CopiesOverAStreamOfTheSameKindAndKeepsOthers) {
    Streams streams = {{kind(s_cursorLocations), std::string(1000, 'x')}, {kind(s_appNames), "kept"}};
    createFor("a.mp4", zulmAtom({locationStream()}))->loadAllData(streams);
    EXPECT_THAT(streams, ElementsAre(Pair(kind(s_appNames), "kept"), Pair(kind(s_cursorLocations), locationStream())));
}

TEST_F(Parser, CopiesStreamsInAscendingOrder) {
    WatchedStream movie(zulmAtom({scaleStream(1.0), locationStream(), appNameStream()}));
    const auto parser = createFromStream(movie, MetaDataParser::QuickTime);
    const std::size_t seeksOfScan = movie.buffer().seeks().size();
    Streams streams;
    parser->loadAllData(streams);
    std::vector<std::size_t> visited;
    for (std::size_t i = seeksOfScan; i < movie.buffer().seeks().size(); ++i)
        for (const std::size_t offset : {32u, 88u, 160u})
            if (movie.buffer().seeks()[i] == offset && (visited.empty() || visited.back() != offset))
                visited.push_back(offset);
    EXPECT_THAT(visited, ElementsAre(160, 88, 32));
}

TEST_F(Parser, CopiesNoMoreThanTheFileHolds) {
    const std::string header = be32(1) + "ZULM" + be64(1000) + be32(1) + "DATA";
    for (const std::uint64_t size : {std::uint64_t{73}, std::uint64_t{1} << 32, std::uint64_t{1} << 62,
                                     std::numeric_limits<std::uint64_t>::max()}) {
        Streams streams;
        createFor("a.mp4", header + be64(size) + locationStream())->loadAllData(streams);
        EXPECT_THAT(streams, ElementsAre(Pair(kind(s_cursorLocations), locationStream()))) << size;
    }
}

TEST_F(Parser, CopiesWhatIsLeftOfAStreamThatIsCutAnywhere) {
    const std::string movie = zulmAtom({locationStream()});
    for (std::size_t size = 32 + 24; size <= movie.size(); ++size) {
        Streams streams;
        createFor("a.mp4", movie.substr(0, size))->loadAllData(streams);
        EXPECT_EQ(streams[kind(s_cursorLocations)], locationStream().substr(0, size - 32));
    }
}

TEST_F(Parser, CopiesWhatIsLeftOfAFileThatShrank) {
    const auto parser = createFor("a.mp4", zulmAtom({locationStream(), scaleStream(1.0)}));
    std::filesystem::resize_file(folder / "a.mp4", 60);
    Streams streams = {{kind(s_scaleFactors), "old"}};
    parser->loadAllData(streams);
    EXPECT_THAT(streams, ElementsAre(Pair(kind(s_cursorLocations), locationStream().substr(0, 28)),
                                     Pair(kind(s_scaleFactors), "")));
}

TEST_F(Parser, CopiesAnEmptyBareStream) {
    Streams streams;
    createFor("a.dat", "")->loadAllData(streams);
    EXPECT_THAT(streams, ElementsAre(Pair(uuid{}, "")));
}

TEST_F(Parser, LeavesOutAStreamThatCannotBeReached) {
    WatchedStream movie(zulmAtom({locationStream(), appNameStream(), scaleStream(1.0)}));
    const auto parser = createFromStream(movie, MetaDataParser::QuickTime);
    movie.buffer().refuse(32);
    Streams streams = {{kind(s_cursorLocations), "kept"}};
    parser->loadAllData(streams);
    EXPECT_THAT(streams, ElementsAre(Pair(kind(s_appNames), appNameStream()), Pair(kind(s_cursorLocations), "kept"),
                                     Pair(kind(s_scaleFactors), scaleStream(1.0))));
}

TEST_F(Parser, CopiesNothingOnceItIsClosed) {
    const auto parser = createFor("a.mp4", zulmAtom({locationStream()}));
    parser->close();
    Streams streams;
    parser->loadAllData(streams);
    EXPECT_THAT(streams, IsEmpty());
}

TEST_F(Parser, CopiesFromAStreamInAnyState) {
    for (const auto state : {std::ios_base::badbit, std::ios_base::failbit, std::ios_base::eofbit}) {
        std::istringstream stream(zulmAtom({locationStream()}));
        const auto parser = createFromStream(stream, MetaDataParser::QuickTime);
        stream.setstate(state);
        Streams streams;
        parser->loadAllData(streams);
        EXPECT_EQ(streams[kind(s_cursorLocations)], locationStream());
    }
}

TEST_F(Parser, CopiesTheSameTwice) {
    const auto parser = createFor("a.dat", locationStream());
    Streams first;
    parser->loadAllData(first);
    Streams second;
    parser->loadAllData(second);
    EXPECT_EQ(first, second);
}

// Scanning anew ------------------------------------------------------------------------------------------------

TEST_F(Parser, FindsWhatWasAppendedOnlyOnceItScansAnew) {
    const auto parser = createFor("a.mp4", media());
    std::ofstream(folder / "a.mp4", std::ios_base::app | std::ios_base::binary) << zulmAtom({locationStream()});
    EXPECT_THAT(streamsOf(*parser), IsEmpty());
    EXPECT_TRUE(parser->cacheFileStreamInfo());
    EXPECT_THAT(streamsOf(*parser), ElementsAre(FoundStream{kind(s_cursorLocations), 62, 56}));
}

TEST_F(Parser, ForgetsWhatItFoundWhenItScansAnew) {
    std::stringstream stream(zulmAtom({locationStream()}));
    const auto parser = createFromStream(stream, MetaDataParser::QuickTime);
    stream.str(media() + zulmAtom({appNameStream()}));
    EXPECT_TRUE(parser->cacheFileStreamInfo());
    EXPECT_THAT(streamsOf(*parser), ElementsAre(FoundStream{kind(s_appNames), 62, 56}));
}

TEST_F(Parser, FindsNothingAnewInAStreamThatStandsAtItsEndUntilItIsCleared) {
    const auto parser = createFor("a.mp4", zulmAtom({locationStream()}));
    parser->getStream().setstate(std::ios_base::eofbit);
    EXPECT_TRUE(parser->cacheFileStreamInfo());
    EXPECT_THAT(streamsOf(*parser), IsEmpty());
    parser->getStream().clear();
    EXPECT_TRUE(parser->cacheFileStreamInfo());
    EXPECT_THAT(streamsOf(*parser), ElementsAre(FoundStream{kind(s_cursorLocations), 32, 56}));
}

TEST_F(Parser, FindsNothingAnewOnceItIsClosed) {
    const auto parser = createFor("a.avi", zulmChunk({locationStream()}));
    parser->close();
    EXPECT_TRUE(parser->cacheFileStreamInfo());
    EXPECT_THAT(streamsOf(*parser), IsEmpty());
}

} // namespace

} // namespace ZULMetaData::Test
