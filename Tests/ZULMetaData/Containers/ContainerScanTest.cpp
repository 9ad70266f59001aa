// What the scan finds in movies, RIFF files and bare streams, and how it ends in damaged ones.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "Tests/ZULMetaData/WatchedStream.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <algorithm>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <sstream>
#include <string>
#include <tuple>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr const char* s_foreignAtom = "Found a non DATA atom mixed in the ZUL meta data\n";
constexpr const char* s_foreignChunk = "Found a non DATA chunk mixed in the ZUL meta data\n";

class ContainerScan : public testing::Test {
protected:
    /// The same from a file and from a stream. `messages` then holds what was written on standard error.
    std::vector<FoundStream> foundIn(MetaDataParser::StreamType type, const std::string& contents) {
        const std::string path = folder / names.at(type);
        writeFile(path, contents);
        testing::internal::CaptureStderr();
        const auto fromFile = MetaDataParser::create(path);
        messages = testing::internal::GetCapturedStderr();

        std::istringstream stream(contents);
        testing::internal::CaptureStderr();
        const auto fromStream = MetaDataParser::create(stream, type);
        EXPECT_EQ(testing::internal::GetCapturedStderr(), messages);
        if (!fromFile || !fromStream) {
            ADD_FAILURE() << "no parser";
            return {};
        }
        EXPECT_EQ(streamsOf(*fromFile), streamsOf(*fromStream));
        return streamsOf(*fromFile);
    }

    std::vector<FoundStream> foundInMovie(const std::string& contents) {
        return foundIn(MetaDataParser::QuickTime, contents);
    }
    std::vector<FoundStream> foundInRiff(const std::string& contents) {
        return foundIn(MetaDataParser::Riff, contents);
    }
    std::vector<FoundStream> foundInRawStream(const std::string& contents) {
        return foundIn(MetaDataParser::RawStream, contents);
    }

    TemporaryFolder folder;
    const std::map<MetaDataParser::StreamType, std::string> names = {{MetaDataParser::QuickTime, "Recording.mp4"},
                                                                     {MetaDataParser::Riff, "Recording.avi"},
                                                                     {MetaDataParser::RawStream, "Recording.dat"}};
    std::string messages;

    const uuid locations = kind(s_cursorLocations);
    const uuid appNames = kind(s_appNames);
    const uuid scale = kind(s_scaleFactors);
};

/// An extended header that claims any size.
std::string extendedHeader(const std::string& type, std::uint64_t size, std::uint32_t marker = 1) {
    return be32(marker) + type + be64(size);
}

std::string shortHeader(const std::string& type, std::uint64_t size) {
    return be32(static_cast<std::uint32_t>(size)) + type;
}

std::string chunkHeader(const std::string& type, std::uint64_t size) {
    return type + le32(static_cast<std::uint32_t>(size));
}

// Movies -------------------------------------------------------------------------------------------------------

TEST_F(ContainerScan, FindsTheStreamsOfAMovie) {
    EXPECT_THAT(foundInMovie(media() + zulmAtom({locationStream(), appNameStream()})),
                ElementsAre(FoundStream{appNames, 134, 56}, FoundStream{locations, 62, 56}));
    EXPECT_EQ(messages, "");
}

TEST_F(ContainerScan, FindsNothingInAMovieWithoutMetaData) {
    EXPECT_THAT(foundInMovie(media()), IsEmpty());
    EXPECT_EQ(messages, "");
}

TEST_F(ContainerScan, FindsNothingInAMetaDataAtomWithoutStreams) {
    EXPECT_THAT(foundInMovie(media() + zulmAtom({})), IsEmpty());
}

TEST_F(ContainerScan, FindsAMetaDataAtomWithAnOrdinaryHeader) {
    EXPECT_THAT(foundInMovie(media() + atom("ZULM", extendedAtom("DATA", locationStream()))),
                ElementsAre(FoundStream{locations, 54, 56}));
}

TEST_F(ContainerScan, FindsMetaDataAtTheStartOfAMovie) {
    EXPECT_THAT(foundInMovie(zulmAtom({locationStream()}) + media()), ElementsAre(FoundStream{locations, 32, 56}));
}

TEST_F(ContainerScan, FindsEveryMetaDataAtom) {
    const std::string movie = zulmAtom({locationStream()}) + media() + zulmAtom({appNameStream()}) + atom("free");
    EXPECT_THAT(foundInMovie(movie), ElementsAre(FoundStream{appNames, 150, 56}, FoundStream{locations, 32, 56}));
}

TEST_F(ContainerScan, LooksForMetaDataAtTheTopLevelOnly) {
    EXPECT_THAT(foundInMovie(atom("moov", zulmAtom({locationStream()}))), IsEmpty());
}

TEST_F(ContainerScan, ComparesAtomTypesWithTheirCase) {
    EXPECT_THAT(foundInMovie(extendedAtom("zulm", extendedAtom("DATA", locationStream()))), IsEmpty());
    EXPECT_THAT(foundInMovie(extendedAtom("ZULM", extendedAtom("data", locationStream()))), IsEmpty());
    EXPECT_EQ(messages, s_foreignAtom);
}

TEST_F(ContainerScan, KeepsTheLaterOfTwoAtomsOfOneKind) {
    EXPECT_THAT(foundInMovie(zulmAtom({locationStream(), locationStream()})),
                ElementsAre(FoundStream{locations, 104, 56}));
    EXPECT_THAT(foundInMovie(zulmAtom({locationStream()}) + media() + zulmAtom({locationStream()})),
                ElementsAre(FoundStream{locations, 150, 56}));
}

TEST_F(ContainerScan, GivesKindsInAscendingOrderWhereverTheyStand) {
    const std::string movie = zulmAtom({scaleStream(2.0), locationStream(), appNameStream()});
    const auto found = foundInMovie(movie);
    EXPECT_THAT(
        found, ElementsAre(FoundStream{appNames, 160, 56}, FoundStream{locations, 88, 56}, FoundStream{scale, 32, 40}));
}

TEST_F(ContainerScan, TakesTheLengthOfAStreamAtomWithAnOrdinaryHeaderEightBytesShort) {
    EXPECT_THAT(foundInMovie(media() + extendedAtom("ZULM", atom("DATA", locationStream()))),
                ElementsAre(FoundStream{locations, 54, 48}));
}

TEST_F(ContainerScan, GoesOnBehindAStreamAtomWithAnOrdinaryHeader) {
    EXPECT_THAT(foundInMovie(extendedAtom("ZULM", atom("DATA", locationStream()) + atom("DATA", appNameStream()))),
                ElementsAre(FoundStream{appNames, 88, 48}, FoundStream{locations, 24, 48}));
}

TEST_F(ContainerScan, ReadsAnExtendedSizeBehindEverySizeBelowEight) {
    for (std::uint32_t marker = 0; marker < 8; ++marker) {
        const std::string movie = extendedHeader("mdat", 20, marker) + "abcd" +
                                  extendedHeader("ZULM", 16 + 16 + 56, marker) +
                                  extendedHeader("DATA", 16 + 56, marker) + locationStream();
        EXPECT_THAT(foundInMovie(movie), ElementsAre(FoundStream{locations, 52, 56})) << marker;
        EXPECT_EQ(messages, "");
    }
}

TEST_F(ContainerScan, TakesASizeOfEightAsItStands) {
    EXPECT_THAT(foundInMovie(atom("wide") + zulmAtom({locationStream()})), ElementsAre(FoundStream{locations, 40, 56}));
}

TEST_F(ContainerScan, SkipsAForeignChildAtomWithAMessage) {
    const std::string children = atom("free", "abc") + extendedAtom("DATA", locationStream()) + extendedAtom("uuid");
    EXPECT_THAT(foundInMovie(extendedAtom("ZULM", children)), ElementsAre(FoundStream{locations, 43, 56}));
    EXPECT_EQ(messages, std::string(s_foreignAtom) + s_foreignAtom);
}

TEST_F(ContainerScan, TakesAMetaDataAtomInsideAnotherForForeign) {
    EXPECT_THAT(foundInMovie(extendedAtom("ZULM", zulmAtom({locationStream()}))), IsEmpty());
    EXPECT_EQ(messages, s_foreignAtom);
}

TEST_F(ContainerScan, ZeroSizeChildAtomEndsTheWalkOfItsMetaDataAtomOnly) {
    const std::string movie = extendedAtom("ZULM", extendedAtom("DATA", locationStream()) + extendedHeader("DATA", 0) +
                                                       extendedAtom("DATA", scaleStream(1.0))) +
                              zulmAtom({appNameStream()});
    EXPECT_THAT(foundInMovie(movie), ElementsAre(FoundStream{appNames, 192, 56}, FoundStream{locations, 32, 56}));
    EXPECT_EQ(messages, "");
}

TEST_F(ContainerScan, ZeroSizeAtomEndsTheScan) {
    EXPECT_THAT(foundInMovie(zulmAtom({appNameStream()}) + extendedHeader("mdat", 0) + zulmAtom({locationStream()})),
                ElementsAre(FoundStream{appNames, 32, 56}));
}

TEST_F(ContainerScan, TakesTheMediaOfAnOpenEndedAtomForItsSize) {
    const std::string movie = be32(0) + "mdat" + be64(24) + "skipped!" + zulmAtom({locationStream()});
    EXPECT_THAT(foundInMovie(movie), ElementsAre(FoundStream{locations, 56, 56}));
}

TEST_F(ContainerScan, FindsTheStreamsOfAnAppendThatWasInterruptedOnlyOnceItIsRepaired) {
    const std::string unfinished = extendedHeader("ZULM", 0) + extendedAtom("DATA", locationStream());
    EXPECT_THAT(foundInMovie(media() + unfinished), IsEmpty());
}

TEST_F(ContainerScan, StopsAtAnAtomWhoseHeaderIsTorn) {
    const std::string next = extendedAtom("free");
    for (std::size_t size = 1; size < next.size(); ++size)
        EXPECT_THAT(foundInMovie(zulmAtom({locationStream()}) + next.substr(0, size)),
                    ElementsAre(FoundStream{locations, 32, 56}));
}

TEST_F(ContainerScan, StopsAtAChildAtomWhoseHeaderIsTorn) {
    const std::string next = extendedAtom("DATA");
    for (std::size_t size = 1; size < next.size(); ++size) {
        const std::string children = extendedAtom("DATA", locationStream()) + next.substr(0, size);
        EXPECT_THAT(foundInMovie(extendedAtom("ZULM", children)), ElementsAre(FoundStream{locations, 32, 56}));
        EXPECT_EQ(messages, "");
    }
}

TEST_F(ContainerScan, FindsStreamsInAMetaDataAtomThatOverrunsTheFile) {
    EXPECT_THAT(foundInMovie(extendedHeader("ZULM", 1000000) + extendedAtom("DATA", locationStream())),
                ElementsAre(FoundStream{locations, 32, 56}));
}

TEST_F(ContainerScan, KeepsTheDeclaredLengthOfAStreamAtomThatOverrunsTheFile) {
    EXPECT_THAT(foundInMovie(extendedHeader("ZULM", 88) + extendedHeader("DATA", 5016) + locationStream()),
                ElementsAre(FoundStream{locations, 32, 5000}));
}

TEST_F(ContainerScan, GoesOnBehindAMetaDataAtomWhoseChildOverrunsIt) {
    const std::string torn = extendedHeader("ZULM", 88) + extendedHeader("DATA", 5016) + locationStream();
    EXPECT_THAT(foundInMovie(torn + zulmAtom({appNameStream()})),
                ElementsAre(FoundStream{appNames, 120, 56}, FoundStream{locations, 32, 5000}));
}

TEST_F(ContainerScan, ReadsAChildHeaderThatLiesAcrossTheEndOfItsMetaDataAtom) {
    const std::string stream = locationStream();
    EXPECT_THAT(foundInMovie(extendedHeader("ZULM", 17) + extendedAtom("DATA", stream)),
                ElementsAre(FoundStream{locations, 32, 56}));
}

TEST_F(ContainerScan, NeedsTheWholeHeaderOfAStream) {
    const std::string movie = extendedHeader("ZULM", 56) + extendedHeader("DATA", 40) + locationStream();
    for (std::size_t size = 32; size < 32 + 24; ++size)
        EXPECT_THAT(foundInMovie(movie.substr(0, size)), IsEmpty());
    EXPECT_THAT(foundInMovie(movie.substr(0, 32 + 24)), ElementsAre(FoundStream{locations, 32, 24}));
}

TEST_F(ContainerScan, LetsTheLengthOfAStreamAtomSmallerThanItsHeaderWrapAround) {
    for (std::uint64_t size = 9; size < 16; ++size) {
        const auto found = foundInMovie(extendedHeader("ZULM", 72) + extendedHeader("DATA", size) + locationStream());
        EXPECT_THAT(found, testing::Contains(FoundStream{locations, 32, minus(16 - size)})) << size;
    }
}

TEST_F(ContainerScan, AMetaDataAtomSmallerThanItsHeaderHasNoChildren) {
    EXPECT_THAT(foundInMovie(extendedHeader("ZULM", 16) + extendedAtom("DATA", locationStream())), IsEmpty());
    EXPECT_THAT(foundInMovie(extendedHeader("ZULM", 15) + extendedAtom("DATA", locationStream())), IsEmpty());
}

TEST_F(ContainerScan, FindsStreamsBehindMoreMediaThan32BitsCount) {
    const std::string movie = folder / "Long.mov";
    const std::uint64_t mediaSize = 5'000'000'000;
    const std::string metaData = zulmAtom({locationStream()});
    writeSparseFile(movie, mediaSize + metaData.size(), extendedHeader("mdat", mediaSize), metaData);
    const auto parser = MetaDataParser::create(movie);
    EXPECT_THAT(streamsOf(*parser), ElementsAre(FoundStream{locations, mediaSize + 32, 56}));
    Entries<Point> entries;
    parser->loadDataType(locations, entries, -1);
    EXPECT_THAT(entries.values, ElementsAre(Point(10, 20), Point(-3, 7)));
}

TEST_F(ContainerScan, NeverReadsTheMediaOfAMovie) {
    const std::string head = atom("ftyp", "mp42") + atom("mdat", std::string(1'000'000, 'm'));
    WatchedStream movie(head + zulmAtom({locationStream(), appNameStream()}));
    MetaDataParser::create(movie, MetaDataParser::QuickTime);
    EXPECT_EQ(movie.buffer().lastReadBefore(head.size()), 12u + 8);
    EXPECT_LE(movie.buffer().bytesRead(), head.size() - 1'000'000 + 16 + 2 * (16 + 56));
}

// RIFF files ---------------------------------------------------------------------------------------------------

TEST_F(ContainerScan, FindsTheStreamsOfARiffFile) {
    EXPECT_THAT(foundInRiff(riffMedia() + zulmChunk({locationStream(), appNameStream()})),
                ElementsAre(FoundStream{appNames, 100, 56}, FoundStream{locations, 36, 56}));
    EXPECT_EQ(messages, "");
}

TEST_F(ContainerScan, FindsNothingInARiffFileWithoutMetaData) {
    EXPECT_THAT(foundInRiff(riffMedia()), IsEmpty());
    EXPECT_EQ(messages, "");
}

TEST_F(ContainerScan, SkipsTheWholeRiffChunkWithWhatIsInIt) {
    EXPECT_THAT(foundInRiff(chunk("RIFF", "AVI " + zulmChunk({locationStream()}))), IsEmpty());
}

TEST_F(ContainerScan, FindsEveryMetaDataChunk) {
    EXPECT_THAT(foundInRiff(zulmChunk({locationStream()}) + riffMedia() + zulmChunk({appNameStream()})),
                ElementsAre(FoundStream{appNames, 108, 56}, FoundStream{locations, 16, 56}));
}

TEST_F(ContainerScan, KeepsTheLaterOfTwoChunksOfOneKind) {
    EXPECT_THAT(foundInRiff(zulmChunk({locationStream(), locationStream()})),
                ElementsAre(FoundStream{locations, 80, 56}));
}

TEST_F(ContainerScan, ComparesChunkTypesAsTheyAreSpelled) {
    EXPECT_THAT(foundInRiff(chunk("MLUZ", chunk("DATA", locationStream()))), IsEmpty());
    EXPECT_EQ(messages, "");
    EXPECT_THAT(foundInRiff(chunk("ZULM", chunk("ATAD", locationStream()))), IsEmpty());
    EXPECT_EQ(messages, s_foreignChunk);
}

TEST_F(ContainerScan, SkipsThePadByteBehindAnOddChunk) {
    EXPECT_THAT(foundInRiff(chunk("RIFF", "AVI odd") + zulmChunk({locationStream()})),
                ElementsAre(FoundStream{locations, 32, 56}));
}

TEST_F(ContainerScan, SkipsThePadByteBehindAnOddStreamChunk) {
    const std::string odd = streamHeader(s_appNames, 1, 0) + textEntry(1.0, "a");
    ASSERT_EQ(odd.size(), 37u);
    EXPECT_THAT(foundInRiff(zulmChunk({odd, locationStream()})),
                ElementsAre(FoundStream{appNames, 16, 37}, FoundStream{locations, 62, 56}));
}

TEST_F(ContainerScan, SkipsThePadByteBehindAnOddForeignChunk) {
    EXPECT_THAT(foundInRiff(chunk("ZULM", chunk("JUNK", "abc") + chunk("DATA", locationStream()))),
                ElementsAre(FoundStream{locations, 28, 56}));
    EXPECT_EQ(messages, s_foreignChunk);
}

TEST_F(ContainerScan, SkipsThePadByteBehindAnOddMetaDataChunk) {
    const std::string odd = chunk("DATA", locationStream()) + chunk("JUNK", "ab") + "x";
    EXPECT_THAT(foundInRiff(chunk("ZULM", odd) + zulmChunk({appNameStream()})),
                ElementsAre(FoundStream{appNames, 100, 56}, FoundStream{locations, 16, 56}));
}

TEST_F(ContainerScan, SkipsAForeignChildChunkWithAMessage) {
    const std::string children = chunk("JUNK", "abcd") + chunk("DATA", locationStream()) + chunk("LIST", "12");
    EXPECT_THAT(foundInRiff(chunk("ZULM", children)), ElementsAre(FoundStream{locations, 28, 56}));
    EXPECT_EQ(messages, std::string(s_foreignChunk) + s_foreignChunk);
}

TEST_F(ContainerScan, ZeroSizeChildChunkEndsTheWholeScan) {
    for (const std::string type : {"DATA", "JUNK"}) {
        const std::string children = chunk("DATA", locationStream()) + chunk(type) + chunk("DATA", scaleStream(1.0));
        EXPECT_THAT(foundInRiff(chunk("ZULM", children) + zulmChunk({appNameStream()})),
                    ElementsAre(FoundStream{locations, 16, 56}));
        EXPECT_EQ(messages, "");
    }
}

TEST_F(ContainerScan, ZeroSizeChunkEndsTheScan) {
    EXPECT_THAT(foundInRiff(zulmChunk({appNameStream()}) + chunk("JUNK") + zulmChunk({locationStream()})),
                ElementsAre(FoundStream{appNames, 16, 56}));
}

TEST_F(ContainerScan, StopsAtAChunkWhoseHeaderIsTorn) {
    for (std::size_t size = 1; size < 8; ++size)
        EXPECT_THAT(foundInRiff(zulmChunk({locationStream()}) + chunk("JUNK", "ab").substr(0, size)),
                    ElementsAre(FoundStream{locations, 16, 56}));
}

TEST_F(ContainerScan, StopsAtAChildChunkWhoseHeaderIsTorn) {
    for (std::size_t size = 1; size < 8; ++size)
        EXPECT_THAT(foundInRiff(chunk("ZULM", chunk("DATA", locationStream()) + chunk("DATA", "ab").substr(0, size))),
                    ElementsAre(FoundStream{locations, 16, 56}));
}

TEST_F(ContainerScan, FindsStreamsInAMetaDataChunkThatOverrunsTheFile) {
    for (const std::uint64_t size : {1000u, 0x7fffffffu, 0xfffffffeu, 0xffffffffu})
        EXPECT_THAT(foundInRiff(chunkHeader("ZULM", size) + chunk("DATA", locationStream())),
                    ElementsAre(FoundStream{locations, 16, 56}));
}

TEST_F(ContainerScan, KeepsTheDeclaredLengthOfAStreamChunkThatOverrunsTheFile) {
    EXPECT_THAT(foundInRiff(chunkHeader("ZULM", 64) + chunkHeader("DATA", 5000) + locationStream()),
                ElementsAre(FoundStream{locations, 16, 5000}));
}

TEST_F(ContainerScan, GoesOnBehindAMetaDataChunkWhoseChildOverrunsIt) {
    const std::string torn = chunkHeader("ZULM", 64) + chunkHeader("DATA", 5000) + locationStream();
    EXPECT_THAT(foundInRiff(torn + zulmChunk({appNameStream()})),
                ElementsAre(FoundStream{appNames, 88, 56}, FoundStream{locations, 16, 5000}));
}

TEST_F(ContainerScan, ReadsTheWholeHeaderOfAStreamFromASmallerChunk) {
    EXPECT_THAT(foundInRiff(chunkHeader("ZULM", 4) + chunkHeader("DATA", 10) + locationStream()),
                ElementsAre(FoundStream{locations, 16, 10}));
}

TEST_F(ContainerScan, NeedsTheWholeHeaderOfAStreamInAChunk) {
    const std::string file = chunkHeader("ZULM", 32) + chunkHeader("DATA", 24) + locationStream();
    for (std::size_t size = 16; size < 16 + 24; ++size)
        EXPECT_THAT(foundInRiff(file.substr(0, size)), IsEmpty());
    EXPECT_THAT(foundInRiff(file.substr(0, 16 + 24)), ElementsAre(FoundStream{locations, 16, 24}));
}

TEST_F(ContainerScan, TheLargestChunkSizePaddedIsNone) {
    const std::string inner = chunk("DATA", locationStream());
    EXPECT_THAT(foundInRiff(chunkHeader("ZULM", 8 + inner.size()) + chunkHeader("JUNK", 0xffffffff) + inner),
                ElementsAre(FoundStream{locations, 24, 56}));
    EXPECT_EQ(messages, s_foreignChunk);
}

TEST_F(ContainerScan, NeverReadsTheMediaOfARiffFile) {
    const std::string head = chunk("RIFF", std::string(1'000'000, 'm'));
    WatchedStream file(head + zulmChunk({locationStream(), appNameStream()}));
    MetaDataParser::create(file, MetaDataParser::Riff);
    EXPECT_EQ(file.buffer().lastReadBefore(head.size()), 8u);
    EXPECT_LE(file.buffer().bytesRead(), 8u + 8 + 2 * (8 + 56));
}

// Bare streams -------------------------------------------------------------------------------------------------

TEST_F(ContainerScan, TakesABareStreamAsAWhole) {
    EXPECT_THAT(foundInRawStream(locationStream()), ElementsAre(FoundStream{locations, 0, 56}));
    EXPECT_THAT(foundInRawStream(locationStream() + "torn"), ElementsAre(FoundStream{locations, 0, 60}));
    EXPECT_THAT(foundInRawStream(locationStream().substr(0, 24)), ElementsAre(FoundStream{locations, 0, 24}));
}

TEST_F(ContainerScan, TakesABareStreamWithoutAWholeHeaderWithZerosInItsPlace) {
    for (std::size_t size = 0; size < 24; ++size) {
        uuid type{};
        std::memcpy(type.data, locationStream().data(), std::min<std::size_t>(size, 16));
        EXPECT_THAT(foundInRawStream(locationStream().substr(0, size)), ElementsAre(FoundStream{type, 0, size}));
    }
}

TEST_F(ContainerScan, TakesAMovieThatIsNamedABareStreamForOne) {
    EXPECT_EQ(foundInRawStream(media() + zulmAtom({locationStream()})).at(0).length, 118u);
}

// Damage -------------------------------------------------------------------------------------------------------

/// What is left of a file's streams is what stands in front of the cut, with the lengths that were declared.
void expectPrefix(const std::vector<FoundStream>& left, const std::vector<FoundStream>& inFileOrder) {
    ASSERT_LE(left.size(), inFileOrder.size());
    for (std::size_t i = 0; i < left.size(); ++i)
        EXPECT_THAT(left, testing::Contains(inFileOrder[i]));
}

TEST_F(ContainerScan, FindsTheFirstStreamsOfAMovieThatIsCutAnywhere) {
    const std::string movie = media() + zulmAtom({scaleStream(2.0), locationStream()}) + zulmAtom({appNameStream()});
    const std::vector<FoundStream> all = {{scale, 62, 40}, {locations, 118, 56}, {appNames, 206, 56}};
    for (std::size_t size = 0; size <= movie.size(); ++size) {
        const auto found = foundInMovie(movie.substr(0, size));
        expectPrefix(found, all);
        EXPECT_EQ(found.size(),
                  (size >= 62 + 24 ? 1u : 0u) + (size >= 118 + 24 ? 1u : 0u) + (size >= 206 + 24 ? 1u : 0u));
        EXPECT_EQ(messages, "");
    }
}

TEST_F(ContainerScan, FindsTheFirstStreamsOfARiffFileThatIsCutAnywhere) {
    const std::string file =
        riffMedia() + zulmChunk({scaleStream(2.0), locationStream()}) + zulmChunk({appNameStream()});
    const std::vector<FoundStream> all = {{scale, 36, 40}, {locations, 84, 56}, {appNames, 156, 56}};
    for (std::size_t size = 0; size <= file.size(); ++size) {
        const auto found = foundInRiff(file.substr(0, size));
        expectPrefix(found, all);
        EXPECT_EQ(found.size(),
                  (size >= 36 + 24 ? 1u : 0u) + (size >= 84 + 24 ? 1u : 0u) + (size >= 156 + 24 ? 1u : 0u));
        EXPECT_EQ(messages, "");
    }
}

/// A container with a size field of which it can be said what it claims.
struct SizeField {
    std::string name;
    MetaDataParser::StreamType type;
    bool isWide;
    std::function<std::string(std::uint64_t)> fileClaiming;
};

void PrintTo(const SizeField& field, std::ostream* out) {
    *out << field.name;
}

std::string streamAtoms() {
    return extendedAtom("DATA", locationStream()) + extendedAtom("DATA", appNameStream());
}

std::string streamChunks() {
    return chunk("DATA", locationStream()) + chunk("DATA", appNameStream());
}

const SizeField s_sizeFields[] = {
    {"FirstAtom", MetaDataParser::QuickTime, false,
     [](std::uint64_t size) { return shortHeader("ftyp", size) + zulmAtom({locationStream()}); }},
    {"FirstAtomExtended", MetaDataParser::QuickTime, true,
     [](std::uint64_t size) { return extendedHeader("mdat", size) + zulmAtom({locationStream()}); }},
    {"Media", MetaDataParser::QuickTime, false,
     [](std::uint64_t size) { return media() + shortHeader("mdat", size) + zulmAtom({locationStream()}); }},
    {"MediaExtended", MetaDataParser::QuickTime, true,
     [](std::uint64_t size) { return media() + extendedHeader("mdat", size) + zulmAtom({locationStream()}); }},
    {"MetaDataAtom", MetaDataParser::QuickTime, false,
     [](std::uint64_t size) { return media() + shortHeader("ZULM", size) + streamAtoms(); }},
    {"MetaDataAtomExtended", MetaDataParser::QuickTime, true,
     [](std::uint64_t size) { return media() + extendedHeader("ZULM", size) + streamAtoms(); }},
    {"StreamAtom", MetaDataParser::QuickTime, false,
     [](std::uint64_t size) { return media() + extendedAtom("ZULM", shortHeader("DATA", size) + streamAtoms()); }},
    {"StreamAtomExtended", MetaDataParser::QuickTime, true,
     [](std::uint64_t size) { return media() + extendedAtom("ZULM", extendedHeader("DATA", size) + streamAtoms()); }},
    {"ForeignAtomExtended", MetaDataParser::QuickTime, true,
     [](std::uint64_t size) { return media() + extendedAtom("ZULM", extendedHeader("free", size) + streamAtoms()); }},
    {"FirstChunk", MetaDataParser::Riff, false,
     [](std::uint64_t size) { return chunkHeader("RIFF", size) + zulmChunk({locationStream()}); }},
    {"MetaDataChunk", MetaDataParser::Riff, false,
     [](std::uint64_t size) { return riffMedia() + chunkHeader("ZULM", size) + streamChunks(); }},
    {"StreamChunk", MetaDataParser::Riff, false,
     [](std::uint64_t size) { return riffMedia() + chunk("ZULM", chunkHeader("DATA", size) + streamChunks()); }},
    {"ForeignChunk", MetaDataParser::Riff, false,
     [](std::uint64_t size) { return riffMedia() + chunk("ZULM", chunkHeader("JUNK", size) + streamChunks()); }},
};

class HostileSize : public testing::TestWithParam<SizeField> {
protected:
    /// Files that claim each size that the field can hold.
    std::vector<std::string> files() const {
        std::vector<std::string> files;
        for (const std::uint64_t size : s_hostileSizes)
            if (GetParam().isWide || size <= 0xffffffff)
                files.push_back(GetParam().fileClaiming(size));
        return files;
    }
};

TEST_P(HostileSize, EndsTheScanAfterAFewSteps) {
    for (const std::string& file : files()) {
        WatchedStream stream(file);
        testing::internal::CaptureStderr();
        EXPECT_TRUE(MetaDataParser::create(stream, GetParam().type));
        testing::internal::GetCapturedStderr();
        EXPECT_LT(stream.buffer().steps(), 60u);
    }
}

TEST_P(HostileSize, FindsOnlyStreamsWhoseHeaderIsThere) {
    for (const std::string& file : files()) {
        std::istringstream stream(file);
        testing::internal::CaptureStderr();
        const auto parser = MetaDataParser::create(stream, GetParam().type);
        testing::internal::GetCapturedStderr();
        for (const FoundStream& found : streamsOf(*parser))
            EXPECT_LE(found.offset + 24, file.size());
    }
}

TEST_P(HostileSize, LoadsNoMoreThanTheFileHolds) {
    for (const std::string& file : files()) {
        std::istringstream stream(file);
        testing::internal::CaptureStderr();
        const auto parser = MetaDataParser::create(stream, GetParam().type);
        testing::internal::GetCapturedStderr();
        std::map<uuid, std::string> loaded;
        parser->loadAllData(loaded);
        for (const FoundStream& found : streamsOf(*parser))
            EXPECT_EQ(loaded.at(found.type), file.substr(found.offset, found.length));
    }
}

INSTANTIATE_TEST_SUITE_P(EverySizeField, HostileSize, testing::ValuesIn(s_sizeFields),
                         [](const auto& field) { return field.param.name; });

TEST_F(ContainerScan, AnEndThatWrapsAroundEndsTheScan) {
    const std::string found = zulmAtom({appNameStream()}); // 88 bytes
    for (std::uint64_t end = 0; end <= 88; ++end)
        EXPECT_THAT(foundInMovie(found + extendedHeader("mdat", minus(88 - end)) + zulmAtom({locationStream()})),
                    ElementsAre(FoundStream{appNames, 32, 56}))
            << end;
}

TEST_F(ContainerScan, AChildEndThatWrapsAroundEndsTheWalkOfItsMetaDataAtomOnly) {
    const std::string children = extendedHeader("free", minus(16)) + extendedAtom("DATA", locationStream());
    EXPECT_THAT(foundInMovie(extendedAtom("ZULM", children) + zulmAtom({appNameStream()})),
                ElementsAre(FoundStream{appNames, 136, 56}));
    EXPECT_EQ(messages, s_foreignAtom);
}

TEST_F(ContainerScan, KeepsAStreamWhoseEndWrapsAround) {
    const std::string children = extendedHeader("DATA", minus(16)) + locationStream();
    EXPECT_THAT(foundInMovie(extendedAtom("ZULM", children)), ElementsAre(FoundStream{locations, 32, minus(32)}));
}

} // namespace

} // namespace ZULMetaData::Test
