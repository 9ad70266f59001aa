#include "ZULMetaDataBridge/Source/StreamSalvage.h"

#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sstream>
#include <system_error>

namespace ZULMetaData::Test {
namespace {

using Origin = SalvagedStream::Origin;

std::vector<SalvagedStream> salvaged(const std::string& bytes,
                                     MetaDataParser::StreamType type = MetaDataParser::QuickTime) {
    return StreamSalvage(ByteSource::memory(bytes), type).run().streams;
}

std::string bytesOf(const std::string& file, const SalvagedStream& stream) {
    return file.substr(static_cast<std::size_t>(stream.offset), static_cast<std::size_t>(stream.bytes));
}

/// A kind that no reader here knows the values of.
std::string caretStream() {
    return streamHeader("2b7b6aef", 1, 24) + f64(1) + raw(1) + raw(2) + raw(3) + raw(4);
}

TEST(StreamSalvage, FindsWhatAWalkReaches) {
    const std::string file = media() + zulmAtom({locationStream(), appNameStream()});
    const auto streams = salvaged(file);
    ASSERT_EQ(streams.size(), 2U);
    EXPECT_EQ(streams[0].header.uuid, s_topmostAppNameUUID); // in the order of the identifiers
    EXPECT_EQ(streams[1].header.uuid, s_cursorLocationUUID);
    for (const SalvagedStream& stream : streams) {
        EXPECT_EQ(stream.origin, Origin::Reachable);
        EXPECT_EQ(stream.entries, 2U);
        EXPECT_FALSE(stream.isCutShort);
    }
    EXPECT_EQ(bytesOf(file, streams[0]), appNameStream());
    EXPECT_EQ(bytesOf(file, streams[1]), locationStream());
}

TEST(StreamSalvage, FindsStreamsBehindABrokenAtom) {
    const std::string broken = be32(0x7fffffff) + "mdat" + "pictures";
    const std::string file = broken + zulmAtom({locationStream(), appNameStream(), caretStream()});
    const auto streams = salvaged(file);
    ASSERT_EQ(streams.size(), 3U);
    for (const SalvagedStream& stream : streams) {
        EXPECT_EQ(stream.origin, Origin::Unreachable);
        EXPECT_FALSE(stream.isCutShort);
    }
    EXPECT_EQ(bytesOf(file, streams[0]), appNameStream());
    EXPECT_EQ(bytesOf(file, streams[1]), caretStream());
    EXPECT_EQ(bytesOf(file, streams[2]), locationStream());
}

TEST(StreamSalvage, TakesTheLengthFromADataAtomOfEitherForm) {
    const std::string broken = be32(0x7fffffff) + "mdat" + "pictures";
    for (const std::string& data : {atom("DATA", locationStream()), extendedAtom("DATA", locationStream()),
                                    be32(2) + "DATA" + be64(0) + atom("DATA", locationStream())}) {
        const auto streams = salvaged(broken + data + pointEntry(3, 7, 8)); // which is not the stream's
        ASSERT_EQ(streams.size(), 1U);
        EXPECT_EQ(streams[0].origin, Origin::Unreachable);
        EXPECT_EQ(streams[0].bytes, 56U);
        EXPECT_EQ(streams[0].declaredBytes, 56U);
    }
}

TEST(StreamSalvage, FindsKindsWhoseValuesNobodyReads) {
    const std::string broken = be32(0x7fffffff) + "mdat" + "pictures";
    const std::string texts = textEntry(5, "a") + textEntry(5, "bc");
    for (const std::string& stream :
         {streamHeader("2b7b6a00", 1, 0) + textEntry(1, "miscellany"),
          streamHeader("2b7b6a01", 1, 16) + f64(1) + f64(2), streamHeader("2b7b6a02", 1, 12) + f64(1) + raw(2),
          streamHeader("2b7b6a04", 1, 0) + le32(static_cast<std::uint32_t>(4 + texts.size())) + le32(2) + texts}) {
        const auto streams = salvaged(broken + stream);
        ASSERT_EQ(streams.size(), 1U);
        EXPECT_EQ(streams[0].bytes, stream.size());
    }
    EXPECT_TRUE(salvaged(broken + streamHeader("2b7b6a03", 1, 20) + std::string(20, '\0')).empty());
    EXPECT_TRUE(salvaged(broken + streamHeader("2b7b6a03", 1, 16) + f64(-1e9) + f64(2)).empty());
}

TEST(StreamSalvage, EndsWhereTheDeviceFails) {
    struct FailingBuffer final : std::stringbuf {
        using std::stringbuf::stringbuf;
        std::streamsize xsgetn(char*, std::streamsize) override { return 0; }
    } buffer(media() + zulmAtom({locationStream()}));
    std::istream file(&buffer);
    EXPECT_TRUE(StreamSalvage(ByteSource::stream(file), MetaDataParser::RawStream).run().streams.empty());
}

TEST(StreamSalvage, CannotSearchAFileWhoseSizeCannotBeTold) {
    struct UnseekableBuffer final : std::stringbuf {
        using std::stringbuf::stringbuf;
        pos_type seekoff(off_type, std::ios_base::seekdir, std::ios_base::openmode) override { return off_type(-1); }
    } buffer(media() + zulmAtom({locationStream()}));
    std::istream file(&buffer);
    EXPECT_THROW(StreamSalvage(ByteSource::stream(file), MetaDataParser::QuickTime), std::system_error);
}

TEST(StreamSalvage, CannotSearchAFileThatCannotBeRead) {
    struct UnreadableBuffer final : std::stringbuf {
        using std::stringbuf::stringbuf;
        std::streamsize xsgetn(char*, std::streamsize) override { throw std::ios_base::failure("cannot be read"); }
    } buffer(media() + zulmAtom({locationStream()}));
    std::istream file(&buffer);
    EXPECT_THROW(StreamSalvage(ByteSource::stream(file), MetaDataParser::QuickTime).run(), std::system_error);
}

TEST(StreamSalvage, FindsStreamsBehindADataAtomThatCountsATornTail) {
    const std::string torn = be32(1) + "DATA" + be64(16 + 56 + 5) + locationStream(); // 5 bytes were left out
    const std::string file = media() + extendedAtom("ZULM", torn + extendedAtom("DATA", appNameStream()) +
                                                                extendedAtom("DATA", scaleStream(2)));
    const auto streams = salvaged(file);
    ASSERT_EQ(streams.size(), 2U) << "the scale's stream has entries of another size than its kind";
    EXPECT_EQ(bytesOf(file, streams[0]), appNameStream());
    EXPECT_EQ(streams[0].origin, Origin::Unreachable);
    EXPECT_EQ(bytesOf(file, streams[1]), locationStream());
    EXPECT_EQ(streams[1].origin, Origin::Reachable);
    EXPECT_TRUE(streams[1].isCutShort);
}

TEST(StreamSalvage, KeepsEveryByteOfAReachableStreamWhoseEntriesAreOfAnotherSize) {
    const std::string file = media() + zulmAtom({scaleStream(2), locationStream()});
    const auto streams = salvaged(file);
    ASSERT_EQ(streams.size(), 2U);
    EXPECT_EQ(bytesOf(file, streams[0]), locationStream());
    EXPECT_EQ(bytesOf(file, streams[1]), scaleStream(2));
    EXPECT_EQ(streams[1].entries, 0U);
    EXPECT_FALSE(streams[1].isCutShort);
}

TEST(StreamSalvage, FindsATornStreamOfTextsUpToTheNextOne) {
    const std::string torn = be32(1) + "DATA" + be64(16 + 56 + 9) + appNameStream();
    const std::string file = media() + extendedAtom("ZULM", torn + extendedAtom("DATA", locationStream()));
    const auto streams = salvaged(file);
    ASSERT_EQ(streams.size(), 2U);
    EXPECT_EQ(bytesOf(file, streams[0]), appNameStream());
    EXPECT_EQ(bytesOf(file, streams[1]), locationStream());
}

TEST(StreamSalvage, GivesTheWholeEntriesOfAFileCutShortAtEveryByte) {
    const std::string whole = media() + zulmAtom({locationStream(), appNameStream()});
    const std::size_t firstEntry = 30 + 16 + 16 + 24 + 16;
    for (std::size_t length = firstEntry; length < whole.size(); ++length) {
        const std::string file = whole.substr(0, length);
        const auto streams = salvaged(file);
        ASSERT_FALSE(streams.empty()) << length;
        std::uint64_t entries = 0;
        for (const SalvagedStream& stream : streams) {
            entries += stream.entries;
            EXPECT_LE(stream.end(), length);
            EXPECT_EQ(whole.substr(stream.offset, stream.bytes), bytesOf(file, stream));
        }
        const std::size_t secondStream = 30 + 16 + 72 + 16 + 24;
        EXPECT_EQ(entries, 1U + (length >= firstEntry + 16) + (length >= secondStream + 15)) << length;
    }
}

TEST(StreamSalvage, FindsABareHeader) {
    const std::string file = "noise" + locationStream();
    const auto streams = salvaged(file, MetaDataParser::Unknown);
    ASSERT_EQ(streams.size(), 1U);
    EXPECT_EQ(streams[0].origin, Origin::Bare);
    EXPECT_FALSE(streams[0].declaredBytes);
    EXPECT_EQ(bytesOf(file, streams[0]), locationStream());
}

TEST(StreamSalvage, EndsABareStreamWhereTheNextItemBegins) {
    for (const std::string& behind : {extendedAtom("ZULR", std::string(64, '\0')), zulmAtom({}), appNameStream(),
                                      atom("moov", "0123456789abcdef0123456789abcdef")}) {
        const std::string file = "xx" + locationStream() + behind;
        const auto streams = salvaged(file, MetaDataParser::Unknown);
        ASSERT_FALSE(streams.empty());
        EXPECT_EQ(bytesOf(file, streams.back()), locationStream());
    }
}

TEST(StreamSalvage, FindsStreamsOfARIFFFileThatWasCut) {
    const std::string file = riffMedia().substr(0, 10) + zulmChunk({locationStream(), appNameStream()});
    const auto streams = salvaged(file, MetaDataParser::Riff);
    ASSERT_EQ(streams.size(), 2U);
    EXPECT_EQ(streams[0].origin, Origin::Unreachable);
    EXPECT_EQ(streams[0].declaredBytes, 56U);
    EXPECT_EQ(bytesOf(file, streams[0]), appNameStream());
}

TEST(StreamSalvage, ReachesStreamsOfAWholeRIFFFile) {
    for (const SalvagedStream& stream :
         salvaged(riffMedia() + zulmChunk({locationStream(), appNameStream()}), MetaDataParser::Riff))
        EXPECT_EQ(stream.origin, Origin::Reachable);
}

TEST(StreamSalvage, TakesABareStreamFileForReachable) {
    const auto streams = salvaged(locationStream(), MetaDataParser::RawStream);
    ASSERT_EQ(streams.size(), 1U);
    EXPECT_EQ(streams[0].origin, Origin::Reachable);
    EXPECT_EQ(streams[0].bytes, 56U);
}

TEST(StreamSalvage, KeepsReachableStreamsOfUnknownKinds) {
    const std::string unknown = streamHeader("deadbeef", 1, 12) + f64(1) + raw(2);
    const std::string file = media() + zulmAtom({unknown});
    const auto streams = salvaged(file);
    ASSERT_EQ(streams.size(), 1U);
    EXPECT_EQ(bytesOf(file, streams[0]), unknown);
}

TEST(StreamSalvage, IsNotTakenInByMediaThatLookLikeAHeader) {
    const std::string entry = pointEntry(1, 2, 3);
    for (const std::string& payload : {
             hex("2b7b6af2 7a1f 11e2 83d0 0017f200be7f"),                       // an identifier alone
             streamHeader("2b7b6af4", 1, 16) + entry,                           // of nobody
             streamHeader(s_cursorLocations, 0, 16) + entry,                    // of no version
             streamHeader(s_cursorLocations, 2, 16) + entry,                    // of a version to come
             streamHeader(s_cursorLocations, 1, 24) + entry + entry,            // with entries of another kind
             streamHeader(s_cursorLocations, 1, 16),                            // without an entry
             streamHeader(s_cursorLocations, 1, 16) + entry.substr(0, 15),      // with a part of one
             streamHeader(s_cursorLocations, 1, 16) + pointEntry(-1e300, 2, 3), // at no time
             streamHeader(s_cursorLocations, 1, 16) + std::string(16, '\xff'),  // at no number
             streamHeader(s_appNames, 1, 0) + le32(4) + "four",                 // without room for a time
             streamHeader("2b7b6a00", 1, 20) + std::string(20, '\0'),           // of no value's size
         }) {
        const std::string file = atom("ftyp", "mp42") + atom("mdat", payload);
        EXPECT_TRUE(salvaged(file, MetaDataParser::Unknown).empty()) << testing::PrintToString(payload);
    }
}

TEST(StreamSalvage, LeavesAHeaderInsideATextToTheText) {
    const std::string title = "see " + locationStream() + " there";
    const std::string stream = streamHeader(s_appNames, 1, 0) + textEntry(1, title) + textEntry(2, "Notes");
    for (const std::string& file : {media() + zulmAtom({stream}), "broken" + zulmAtom({stream}), "bare" + stream}) {
        const auto streams = salvaged(file);
        ASSERT_EQ(streams.size(), 1U);
        EXPECT_EQ(bytesOf(file, streams[0]), stream);
    }
}

TEST(StreamSalvage, LeavesAWholeReachableStreamAloneWhateverItHolds) {
    const std::string title = extendedAtom("DATA", locationStream());
    const std::string stream = streamHeader(s_appNames, 1, 0) + textEntry(1, title);
    const std::string file = media() + zulmAtom({stream});
    const auto streams = salvaged(file);
    ASSERT_EQ(streams.size(), 1U);
    EXPECT_EQ(bytesOf(file, streams[0]), stream);
}

TEST(StreamSalvage, PutsTheBestOfSeveralStreamsOfAKindFirst) {
    const std::string small = streamHeader(s_cursorLocations, 1, 16) + pointEntry(1, 1, 1);
    const std::string file = be32(0) + "mdat" + zulmAtom({small}) + zulmAtom({locationStream()}) + zulmAtom({small});
    const auto streams = salvaged(file);
    ASSERT_EQ(streams.size(), 3U);
    EXPECT_EQ(streams[0].entries, 2U);
    EXPECT_GT(streams[1].offset, streams[2].offset) << "of equal ones, readers take the last";
}

TEST(StreamSalvage, KeepsAnEmptyStreamInItsDataAtom) {
    const std::string file = "broken" + zulmAtom({streamHeader(s_cursorLocations, 1, 16)});
    const auto streams = salvaged(file);
    ASSERT_EQ(streams.size(), 1U);
    EXPECT_EQ(streams[0].bytes, 24U);
    EXPECT_EQ(streams[0].entries, 0U);
    EXPECT_FALSE(streams[0].isCutShort);
}

TEST(StreamSalvage, FindsHeadersAcrossTheEdgesOfItsPieces) {
    const std::string atoms = zulmAtom({locationStream()});
    for (std::size_t before = 0; before < 80; ++before) {
        const std::string file = std::string((4 << 20) - before, 'm') + atoms + std::string(9, 'n');
        const auto streams = salvaged(file, MetaDataParser::Unknown);
        ASSERT_EQ(streams.size(), 1U) << before;
        EXPECT_EQ(streams[0].origin, Origin::Unreachable) << before;
        EXPECT_EQ(bytesOf(file, streams[0]), locationStream());
    }
}

TEST(StreamSalvage, StopsCountingInAFileFullOfHeaders) {
    std::string file;
    const std::string stream = streamHeader(s_cursorLocations, 1, 16) + pointEntry(1, 2, 3);
    for (std::size_t i = 0; i <= SalvageReport::s_maximumStreams; ++i)
        file += stream;
    const SalvageReport report = StreamSalvage(ByteSource::memory(file), MetaDataParser::Unknown).run();
    EXPECT_EQ(report.streams.size(), SalvageReport::s_maximumStreams);
    EXPECT_TRUE(report.hasMore);
}

TEST(StreamSalvage, SurvivesEveryHostileSize) {
    for (const std::uint64_t size : s_hostileSizes) {
        const std::string data = be32(1) + "DATA" + be64(size) + locationStream();
        for (const std::string& file :
             {media() + extendedAtom("ZULM", data), media() + be32(1) + "ZULM" + be64(size) + data}) {
            const auto streams = salvaged(file);
            ASSERT_EQ(streams.size(), 1U) << size;
            EXPECT_LE(streams[0].end(), file.size());
            EXPECT_EQ(streams[0].header.uuid, s_cursorLocationUUID);
        }
    }
}

TEST(StreamSalvage, CallsNothingReachableInMetadataWithoutAnEnd) {
    for (const std::uint64_t size : {~std::uint64_t{0}, ~std::uint64_t{0} - 20}) {
        const auto streams = salvaged(media() + be32(1) + "ZULM" + be64(size) + extendedAtom("DATA", locationStream()));
        ASSERT_EQ(streams.size(), 1U);
        EXPECT_EQ(streams[0].origin, Origin::Unreachable);
    }
}

TEST(StreamSalvage, TellsHowFarItIs) {
    std::istringstream file(media() + zulmAtom({locationStream()}));
    std::uint64_t last = 0;
    StreamSalvage(ByteSource::stream(file), MetaDataParser::QuickTime, [&](std::uint64_t done) { last = done; }).run();
    EXPECT_EQ(last, file.str().size());
}

TEST(StreamSalvage, FindsNothingInAnEmptyFile) {
    EXPECT_TRUE(salvaged("").empty());
    EXPECT_TRUE(salvaged("", MetaDataParser::RawStream).empty());
}

} // namespace
} // namespace ZULMetaData::Test
