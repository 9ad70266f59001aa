// What is well is left alone, what is worth knowing is said, and nothing that a file says leads astray. What is wrong
// with the invalid recordings stands in InvalidCorpusTest.

#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"
#include "Tests/Support/Files.h"
#include "Tests/Support/MemoryWatch.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "Tests/ZULMetaData/WatchedStream.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <limits>
#include <new>
#include <set>
#include <sstream>
#include <stdexcept>
#include <tuple>

namespace ZULMetaData::Test {
namespace {

constexpr auto s_movie = MetaDataParser::QuickTime;
constexpr auto s_riff = MetaDataParser::Riff;
constexpr auto s_raw = MetaDataParser::RawStream;

const std::string s_images = "2b7b6af1";
const std::string s_unknown = "12345678";
const double s_noNumber = std::numeric_limits<double>::quiet_NaN();

ValidationReport validated(const std::string& bytes, MetaDataParser::StreamType type) {
    return validateRecording(ByteSource::memory(bytes), type);
}

/// "code@offset code@offset", in the order of the offsets.
std::string findingsOf(const ValidationReport& report) {
    std::string text;
    for (const Finding& finding : report.allFindings())
        text +=
            (text.empty() ? "" : " ") + std::string(ruleOf(finding.code).name) + '@' + std::to_string(finding.offset);
    return text;
}

std::string findingsIn(const std::string& bytes, MetaDataParser::StreamType type) {
    return findingsOf(validated(bytes, type));
}

/// Every recorded kind with its samples.
std::vector<std::string> goldenStreams() {
    return std::apply(
        [](const auto&... samples) {
            return std::vector<std::string>{goldenStream<std::remove_cvref_t<decltype(samples)>>()...};
        },
        EveryKind{});
}

std::string goldenMovie() {
    return media() + zulmAtom(goldenStreams()) + atom("ZULR", std::string(64, '\0'));
}

std::string cursorEntry(double time, const std::string& image, const std::string& tail = {}) {
    const std::string fields = le32(static_cast<std::uint32_t>(image.size())) +
                               (image.empty() ? "" : le32(1) + le32(2) + image + le32(0)) + le32(3) + tail;
    const auto size = static_cast<std::uint32_t>(fields.size());
    return le32(20 + size) + f64(time) + le64(7) + le32(size) + fields;
}

// ---- what is well ----

TEST(MetaDataValidator, FindsNothingInAMovie) {
    const std::string movie =
        media() + zulmAtom({locationStream(), appNameStream()}) + atom("ZULR", std::string(64, '\0'));
    EXPECT_EQ(findingsIn(movie, s_movie), "");
    EXPECT_EQ(findingsIn(riffMedia() + zulmChunk({locationStream(), appNameStream()}), s_riff), "");
    EXPECT_EQ(findingsIn(locationStream(), s_raw), "");
}

TEST(MetaDataValidator, FindsNoDamageInEveryRecordedKind) {
    for (const auto& [bytes, type] :
         {std::pair(goldenMovie(), s_movie), {riffMedia() + zulmChunk(goldenStreams()), s_riff}}) {
        const ValidationReport report = validated(bytes, type);
        EXPECT_FALSE(report.isDamaged()) << findingsOf(report);
        EXPECT_EQ(report.streams.size(), std::tuple_size_v<EveryKind>);
        for (const StreamReport& stream : report.streams)
            EXPECT_GT(stream.wholeEntries, 0U) << stream.name();
    }
    for (const std::string& stream : goldenStreams())
        EXPECT_FALSE(validated(stream, s_raw).isDamaged()) << stream;
}

TEST(MetaDataValidator, FindsNothingInStreamsWithoutEntries) {
    for (const std::string& stream : goldenStreams()) {
        const ValidationReport report = validated(stream.substr(0, 24), s_raw);
        EXPECT_EQ(findingsOf(report), "");
        EXPECT_EQ(report.wholeEntries, 0U);
        EXPECT_TRUE(report.hasMetaData());
    }
}

TEST(MetaDataValidator, TakesAMovieWithoutMetaDataForWhole) {
    for (const std::string& movie : {std::string(), media(), media() + zulmAtom({}), media() + atom("ZULM")}) {
        const ValidationReport report = validated(movie, s_movie);
        EXPECT_EQ(findingsOf(report), "");
        EXPECT_FALSE(report.hasMetaData());
    }
}

TEST(MetaDataValidator, ReadsVersionOneOfTheCursorImages) {
    const std::string picture = redAndGreenPNG();
    const auto size = static_cast<std::uint32_t>(picture.size());
    const std::string withImage = le32(28 + size) + f64(1) + le64(7) + le32(8 + size) + le32(1) + le32(2) + picture;
    const std::string withoutImage = le32(20) + f64(2) + le64(7) + le32(0);
    const ValidationReport report = validated(streamHeader(s_images, 1, 0) + withImage + withoutImage, s_raw);
    EXPECT_EQ(findingsOf(report), "");
    EXPECT_EQ(report.wholeEntries, 2U);
}

TEST(MetaDataValidator, TakesAnImageOfNoBytesInVersionOneForWhole) {
    const std::string entry = le32(28) + f64(1) + le64(7) + le32(8) + le32(1) + le32(2);
    const ValidationReport report = validated(streamHeader(s_images, 1, 0) + entry, s_raw);
    EXPECT_EQ(findingsOf(report), "cursor-without-image@24"); // a notice
    EXPECT_EQ(report.wholeEntries, 1U);
}

// ---- the report ----

TEST(MetaDataValidator, TellsWhatAStreamIs) {
    const std::string movie = media() + zulmAtom({appNameStream(), locationStream()});
    const ValidationReport report = validated(movie, s_movie);
    ASSERT_EQ(report.streams.size(), 2U);
    const StreamReport& names = report.streams[0];
    EXPECT_EQ(names.type, s_topmostAppNameUUID);
    EXPECT_EQ(names.kind, "topmostAppName");
    EXPECT_EQ(names.name(), "topmostAppName");
    EXPECT_EQ(names.version, 1);
    EXPECT_EQ(names.fixedEntrySize, 0U);
    EXPECT_EQ(names.offset, 62U);
    EXPECT_EQ(names.declaredBytes, 56U);
    EXPECT_EQ(names.presentBytes, 56U);
    EXPECT_EQ(names.wholeEntries, 2U);
    EXPECT_EQ(names.firstTime, 0.5);
    EXPECT_EQ(names.lastTime, 2.0);
    EXPECT_TRUE(names.isReachable);
    EXPECT_EQ(report.streams[1].fixedEntrySize, 16U);
    EXPECT_EQ(report.container, s_movie);
    EXPECT_EQ(report.bytes, movie.size());
    EXPECT_EQ(report.wholeEntries, 4U);
}

TEST(MetaDataValidator, CountsWholeEntriesInFrontOfATornOne) {
    const ValidationReport report = validated(locationStream() + f64(9), s_raw);
    EXPECT_EQ(findingsOf(report), "torn-entry@56");
    EXPECT_EQ(report.streams[0].wholeEntries, 2U);
    EXPECT_EQ(report.streams[0].lastTime, 1.0);
    EXPECT_EQ(report.damageCount, 1U);
    EXPECT_EQ(report.noticeCount, 0U);
}

TEST(MetaDataValidator, SaysHowFarAReaderCanBeTrusted) {
    const auto readable = [](const std::string& stream) { return validated(stream, s_raw).streams[0].readableBytes; };
    EXPECT_EQ(readable(locationStream()), 56U);
    EXPECT_EQ(readable(locationStream() + "torn"), 56U);
    EXPECT_EQ(readable(appNameStream() + le32(0xffffffff) + f64(1)), 56U);
    EXPECT_EQ(readable(locationStream().substr(0, 23)), 0U);
    const std::string good = cursorEntry(1, "");
    const std::string contradicting = le32(29) + f64(1) + le64(7) + le32(8) + le32(0) + le32(3) + "x";
    const std::string images = streamHeader(s_images, 2, 0) + good + contradicting + good;
    EXPECT_EQ(findingsIn(images, s_raw), "cursor-without-image@24 cursor-sizes@56");
    EXPECT_EQ(readable(images), 56U);
    EXPECT_EQ(validated(images, s_raw).wholeEntries, 2U);
}

TEST(MetaDataValidator, TellsDeclaredFromPresentBytes) {
    const std::string movie = media() + zulmAtom({locationStream()});
    const ValidationReport report = validated(movie.substr(0, movie.size() - 6), s_movie);
    EXPECT_EQ(report.streams[0].declaredBytes, 56U);
    EXPECT_EQ(report.streams[0].presentBytes, 50U);
}

TEST(MetaDataValidator, SaysWhichStreamsADroppedTailHides) {
    const std::string cutStream = be32(1) + "DATA" + be64(16 + 56 + 5) + locationStream();
    const std::string children = cutStream + extendedAtom("DATA", appNameStream());
    const ValidationReport report = validated(media() + extendedAtom("ZULM", children), s_movie);
    ASSERT_EQ(report.streams.size(), 2U);
    EXPECT_TRUE(report.streams[0].isReachable);
    EXPECT_EQ(report.streams[0].presentBytes, 56U);
    EXPECT_EQ(report.streams[0].declaredBytes, 61U);
    EXPECT_FALSE(report.streams[1].isReachable);
    EXPECT_EQ(report.streams[1].wholeEntries, 2U);
}

TEST(MetaDataValidator, FindsTheDroppedTailsThatAnAppendLeaves) {
    TemporaryFolder folder;
    writeFile(folder / "Movie.mp4", media());
    writeFile(folder / "Names.dat", appNameStream() + le32(99) + f64(3) + "torn");
    writeFile(folder / "Locations.dat", locationStream() + "torn");
    MP4MetaData::appendMetaDataFiles(folder / "Movie.mp4", {folder / "Names.dat", folder / "Locations.dat"});
    const ValidationReport report = validateRecording(folder / "Movie.mp4");
    EXPECT_EQ(findingsOf(report), "dropped-tail@46 dropped-tail@118 unreachable-stream@134");
    EXPECT_EQ(report.wholeEntries, 4U);
}

TEST(MetaDataValidator, NamesTheKindOrTheAtomAndSaysASentence) {
    const auto findings = validated(media() + zulmAtom({locationStream() + "x"}) + "abc", s_movie).allFindings();
    ASSERT_EQ(findings.size(), 2U);
    EXPECT_EQ(findings[0].place, "cursorLocation");
    EXPECT_EQ(findings[0].sentence, "the last entry has 1 of 16 bytes");
    EXPECT_EQ(findings[0].severity(), Severity::Damage);
    EXPECT_EQ(findings[1].place, "file");
    EXPECT_EQ(findings[1].sentence, "it ends with 3 bytes, too few for a header");
}

TEST(MetaDataValidator, ShowsTypesThatCannotBePrintedByTheirNumbers) {
    const auto findings = validated(media() + extendedAtom("ZULM", atom(hex("0041 ff7e"))), s_movie).allFindings();
    ASSERT_EQ(findings.size(), 1U);
    EXPECT_EQ(findings[0].place, "\\x00A\\xff~");
}

TEST(MetaDataValidator, ReadsNoEntriesOfAnotherSizeThanTheirKindHas) {
    std::string points = streamHeader("2b7b6af6", 1, 16); // of regions, which take 24 bytes
    for (int i = 0; i < 2400; ++i)
        points += pointEntry(i, 2, 3);
    const ValidationReport report = validated(points, s_raw);
    EXPECT_EQ(findingsOf(report), "entry-size-mismatch@20");
    EXPECT_EQ(report.streams.at(0).wholeEntries, 0U);
    EXPECT_EQ(report.streams.at(0).readableBytes, 24U);
    EXPECT_EQ(report.streams.at(0).firstTime, std::nullopt);
}

// ---- notices ----

struct Noticed {
    std::string findings;
    MetaDataParser::StreamType type;
    std::string bytes;
};

std::string asTIFF(std::uint32_t width, std::uint32_t height) {
    const Image image(width, height, std::vector<std::uint8_t>(std::size_t{4} * width * height, 0x55));
    const auto tiff = image.tiffRepresentation();
    return {tiff.begin(), tiff.end()};
}

/// A picture that has to be turned by a quarter takes its pixels twice.
std::string turned(std::string tiff) {
    const std::string orientation("\x12\x01\x03\x00\x01\x00\x00\x00", 8);
    return tiff.replace(tiff.rfind(orientation) + orientation.size(), 1, 1, '\x06');
}

std::string asPNG(std::uint32_t width, std::uint32_t height) {
    const std::string tiff = asTIFF(width, height);
    const auto* bytes = reinterpret_cast<const std::uint8_t*>(tiff.data());
    const auto png = BitmapImageRep::fromTIFF({bytes, tiff.size()})->pngRepresentation();
    return {png.begin(), png.end()};
}

/// A movie of 106 bytes that lasts so many thousandths of a second.
std::string movieOf(std::uint32_t milliseconds) {
    return atom("moov",
                atom("mvhd", be32(0) + be32(0) + be32(0) + be32(1000) + be32(milliseconds) + std::string(70, '\0')));
}

std::vector<Noticed> noticedFiles() {
    const std::string images = streamHeader(s_images, 2, 0);
    return {
        {"unknown-kind@0", s_raw, streamHeader(s_unknown, 1, 16) + pointEntry(1, 2, 3)},
        {"newer-version@16", s_raw, streamHeader(s_cursorLocations, 2, 16) + pointEntry(1, 2, 3)},
        {"newer-version@16", s_raw, streamHeader(s_images, 3, 0) + cursorEntry(1, "", "new fields")},
        {"leftover-bytes@56", s_raw, images + cursorEntry(1, "", "xyz") + cursorEntry(2, "")},
        {"time-backwards@56", s_raw, locationStream() + pointEntry(0.75, 0, 0)},
        {"several-metadata-atoms@118", s_movie, media() + zulmAtom({locationStream()}) + zulmAtom({appNameStream()})},
        {"missing-pad@20", s_riff,
         riffMedia() + "ZULM" + le32(8 + 55) + "DATA" + le32(55) + streamHeader(s_unknown, 1, 31) + f64(1) +
             std::string(23, 'x')},
        {"image-not-decoded@60", s_raw, images + cursorEntry(1, turned(asTIFF(2048, 2048)))},
        {"absurd-image@60", s_raw, images + cursorEntry(1, asPNG(2049, 1))},
        {"absurd-image@60", s_raw, images + cursorEntry(1, asPNG(2000, 1000))},
        {"absurd-image@60", s_raw, images + cursorEntry(1, std::string((32 << 20) + 1, 'x'))},
        {"image-surplus@" + std::to_string(60 + asPNG(2, 1).size()), s_raw,
         images + cursorEntry(1, asPNG(2, 1) + "further")},
        {"duplicate-stream@134", s_movie, media() + zulmAtom({locationStream(), locationStream()})},
        {"duplicate-stream@150", s_movie, media() + zulmAtom({locationStream()}) + zulmAtom({locationStream()})},
        {"wide-riff@0", s_riff, "RIFF" + le32(0) + "AVI " + zulmChunk({locationStream()})},
        {"beyond-duration@178", s_movie, movieOf(600) + zulmAtom({locationStream()})},
        {"cursor-without-image@24", s_raw, images + cursorEntry(1, "")},
    };
}

TEST(MetaDataValidator, SaysOfEachStreamHowMuchLiesBehindTheMovie) {
    const ValidationReport report = validated(movieOf(900) + zulmAtom({locationStream(), appNameStream()}), s_movie);
    EXPECT_EQ(report.duration, 0.9);
    ASSERT_EQ(report.streams.size(), 2U);
    ASSERT_EQ(report.streams[0].findings.size(), 1U);
    EXPECT_EQ(report.streams[0].findings[0].sentence,
              "1 entry lies after the end of the movie at 0.9 seconds, the first at 1");
    EXPECT_EQ(validated(movieOf(2000) + zulmAtom({locationStream(), appNameStream()}), s_movie).noticeCount, 0U);
    EXPECT_EQ(validated(movieOf(1995) + zulmAtom({appNameStream()}), s_movie).noticeCount, 0U); // rounded
    EXPECT_EQ(validated(movieOf(0) + zulmAtom({appNameStream()}), s_movie).noticeCount, 0U);
}

TEST(MetaDataValidator, NamesEveryCursorWithoutAnImageOnce) {
    const std::string bytes =
        streamHeader(s_images, 2, 0) + cursorEntry(1, "") + cursorEntry(2, "") + cursorEntry(3, "");
    EXPECT_EQ(findingsIn(bytes, s_raw), "cursor-without-image@24");
}

TEST(MetaDataValidator, LeavesOutWhatItIsToIgnore) {
    std::istringstream stream(locationStream() + "torn");
    EXPECT_TRUE(validateRecording(ByteSource::stream(stream), s_raw).isDamaged());
    const ValidationReport report = validateRecording(ByteSource::stream(stream), s_raw, {FindingCode::TornEntry});
    EXPECT_FALSE(report.isDamaged());
    EXPECT_EQ(findingsOf(report), "");
    EXPECT_EQ(report.wholeEntries, 2U);
}

TEST(MetaDataValidator, WalksRIFFFilesWithoutTheirSizeIn32Bits) {
    const std::string ds64 = chunk("ds64", raw(std::uint64_t{4 + 36}) + std::string(20, '\0'));
    const std::string rf64 = "RF64" + le32(0xffffffff) + "WAVE" + ds64;
    EXPECT_EQ(findingsIn(rf64, s_riff), "");
    EXPECT_EQ(findingsIn(rf64 + zulmChunk({locationStream()}), s_riff), "wide-riff@0");
    for (const std::uint32_t size : {0U, 0xffffffffU}) {
        const std::string piped = "RIFF" + le32(size) + "WAVEdata" + le32(size) + "odd";
        EXPECT_EQ(findingsIn(piped, s_riff), "");
        EXPECT_EQ(findingsIn(piped + '\0' + zulmChunk({locationStream()}), s_riff), "wide-riff@0");
        EXPECT_EQ(validated(piped + '\0' + zulmChunk({locationStream()}), s_riff).streamCount, 1U);
    }
}

TEST(MetaDataValidator, NoticesWhatIsUnusualAndCallsItNoDamage) {
    for (const Noticed& file : noticedFiles()) {
        const ValidationReport report = validated(file.bytes, file.type);
        EXPECT_FALSE(report.isDamaged()) << file.findings;
        EXPECT_NE((' ' + findingsOf(report) + ' ').find(' ' + file.findings + ' '), std::string::npos)
            << file.findings << " among " << findingsOf(report).substr(0, 200);
        EXPECT_GT(report.noticeCount, 0U);
    }
}

TEST(MetaDataValidator, KnowsNoNoticeThatIsNotShownHere) {
    std::set<std::string> shown;
    for (const Noticed& file : noticedFiles())
        shown.insert(file.findings.substr(0, file.findings.find('@')));
    for (const FindingRule& rule : s_findingRules)
        EXPECT_EQ(shown.contains(std::string(rule.name)), rule.severity == Severity::Notice) << rule.name;
}

TEST(MetaDataValidator, WalksStreamsOfUnknownKindsByTheirHeaders) {
    const ValidationReport fixed = validated(streamHeader(s_unknown, 7, 9) + f64(1) + "a" + f64(2) + "b", s_raw);
    EXPECT_EQ(findingsOf(fixed), "unknown-kind@0");
    EXPECT_EQ(fixed.wholeEntries, 2U);
    EXPECT_EQ(fixed.streams[0].lastTime, 2.0);
    const ValidationReport sized = validated(streamHeader(s_unknown, 7, 0) + le32(1) + "a" + le32(2) + "bc", s_raw);
    EXPECT_EQ(sized.wholeEntries, 2U);
    EXPECT_EQ(sized.streams[0].lastTime, std::nullopt);
    EXPECT_EQ(sized.streams[0].name(), "12345678-7a1f-11e2-83d0-0017f200be7f");
}

// ---- texts ----

TEST(MetaDataValidator, FollowsACharacterFromOnePieceOfAText) {
    for (std::size_t before = 16370; before < 16400; ++before) {
        const std::string stream =
            streamHeader(s_appNames, 1, 0) +
            textEntry(1, std::string(before, 'x') + "\xf0\x9f\x99\x82" + std::string(20000, 'y'));
        EXPECT_EQ(findingsIn(stream, s_raw), "") << before;
    }
}

TEST(MetaDataValidator, TellsTheFirstBadByteOfALongText) {
    for (std::size_t before = 16370; before < 16400; ++before)
        for (const std::string& rest : {std::string(), std::string("z"), std::string(40000, 'z')}) {
            const std::string text = std::string(before, 'x') + "\xe2\x82" + rest;
            const std::string stream = streamHeader(s_appNames, 1, 0) + textEntry(1, text);
            EXPECT_EQ(findingsIn(stream, s_raw), "not-utf8@" + std::to_string(36 + before)) << rest.size();
        }
}

TEST(MetaDataValidator, LeavesTextsOfSystemDataInWhateverEncodingTheyAre) {
    const std::string elements = textEntry(0, "\xff") + textEntry(0, "b") + textEntry(0, "c") + textEntry(0, "d");
    const std::string list = le32(static_cast<std::uint32_t>(4 + elements.size())) + le32(4) + elements;
    EXPECT_EQ(findingsIn(streamHeader("2b7b6afc", 1, 0) + list, s_raw), "");
}

// ---- hostile files ----

TEST(MetaDataValidator, FindsDamageInAMovieCutShortAnywhereButBetweenAtoms) {
    const std::string movie = goldenMovie();
    const std::set<std::size_t> between{0, 12, 30, movie.size() - 72};
    for (std::size_t size = 0; size < movie.size(); ++size) {
        const ValidationReport report = validated(movie.substr(0, size), s_movie);
        EXPECT_EQ(report.isDamaged(), !between.contains(size)) << size << ": " << findingsOf(report);
        for (const Finding& finding : report.allFindings())
            EXPECT_LE(finding.offset, size);
    }
}

TEST(MetaDataValidator, SurvivesEveryByteOfAMovieTurnedOver) {
    const std::string movie = goldenMovie();
    for (std::size_t position = 0; position < movie.size(); ++position)
        for (const int mask : {0x01, 0x80, 0xff}) {
            std::string changed = movie;
            changed[position] = static_cast<char>(changed[position] ^ mask);
            for (const auto type : {s_movie, s_riff, s_raw})
                EXPECT_NO_THROW(validated(changed, type)) << position;
        }
}

TEST(MetaDataValidator, SurvivesHostileSizesAnywhere) {
    const std::string movie = media() + zulmAtom({locationStream(), appNameStream()});
    const std::string riff = riffMedia() + zulmChunk({locationStream(), appNameStream()});
    for (std::size_t position = 0; position + 8 <= movie.size(); ++position)
        for (const std::uint64_t size : s_hostileSizes) {
            std::string changed = movie;
            EXPECT_NO_THROW(validated(changed.replace(position, 8, be64(size)), s_movie)) << position;
            if (position + 4 <= riff.size() && size <= 0xffffffff) {
                changed = riff;
                changed.replace(position, 4, le32(static_cast<std::uint32_t>(size)));
                EXPECT_NO_THROW(validated(changed, s_riff)) << position;
            }
        }
}

/// Each atom says that it holds the rest of the file, as does the stream inside it.
std::string nestedMovie(int depth) {
    std::string movie;
    for (int i = 0; i < depth; ++i)
        movie += be32(16 + 16 + 24) + "ZULM" + be32(1) + "DATA" + be64(std::uint64_t{1} << 40) +
                 streamHeader(s_cursorLocations, 1, 16);
    return movie;
}

TEST(MetaDataValidator, ReadsNoByteManyTimes) {
    std::vector<std::pair<std::string, MetaDataParser::StreamType>> files{
        {nestedMovie(2000), s_movie},
        {media() + zulmAtom(std::vector<std::string>(2000, locationStream())), s_movie},
        {media() + extendedAtom("ZULM", std::string(64000, 'x')), s_movie},
    };
    std::string tinyAtoms;
    for (int i = 0; i < 20000; ++i)
        tinyAtoms += atom("free");
    files.emplace_back(tinyAtoms, s_movie);
    files.emplace_back(extendedAtom("ZULM", tinyAtoms), s_movie);
    for (const auto& [bytes, type] : files) {
        WatchedStream stream(bytes);
        validateRecording(ByteSource::stream(stream), type);
        EXPECT_LE(stream.buffer().bytesRead(), 3 * bytes.size()); // once to find the duration
    }
}

TEST(MetaDataValidator, ListsOnlySoManyFindingsButCountsThemAll) {
    std::string stream = streamHeader(s_cursorLocations, 1, 16);
    for (int i = 0; i < 5000; ++i)
        stream += pointEntry(i % 2 ? s_noNumber : -i, 0, 0);
    const ValidationReport report = validated(stream, s_raw);
    EXPECT_EQ(report.damageCount, 2500U);
    EXPECT_EQ(report.noticeCount, 2499U);
    EXPECT_EQ(report.allFindings().size(), 2 * ValidationReport::s_maximumFindings);
    EXPECT_EQ(report.wholeEntries, 5000U);
}

TEST(MetaDataValidator, NeverHidesDamageBehindNotices) {
    std::string stream = streamHeader(s_cursorLocations, 1, 16);
    for (int i = 0; i < 3000; ++i)
        stream += pointEntry(-i, 0, 0);
    const auto findings = validated(stream + "torn", s_raw).allFindings();
    EXPECT_EQ(findings.back().code, FindingCode::TornEntry);
}

TEST(MetaDataValidator, ChecksStreamsThatItNoLongerLists) {
    std::vector<std::string> streams(ValidationReport::s_maximumStreams, streamHeader(s_unknown, 1, 0));
    for (std::uint32_t i = 0; i < streams.size(); ++i)
        streams[i].replace(0, 4, be32(i));
    streams.push_back(locationStream() + "torn");
    const ValidationReport report = validated(media() + zulmAtom(streams), s_movie);
    EXPECT_EQ(report.streams.size(), ValidationReport::s_maximumStreams);
    EXPECT_EQ(report.streamCount, ValidationReport::s_maximumStreams + 1);
    EXPECT_EQ(report.wholeEntries, 2U);
    EXPECT_TRUE(report.isDamaged());
}

TEST(MetaDataValidator, AsksForNoMoreMemoryThanTwiceTheFileAnd16MiB) {
    std::string tinyAtoms; // enough of each that a record for every one would take more
    for (int i = 0; i < 450000; ++i)
        tinyAtoms += atom("free");
    std::string tinyStreams;
    for (std::uint32_t i = 0; i < 150000; ++i)
        tinyStreams += extendedAtom("DATA", streamHeader(s_unknown, 0, 3).replace(0, 4, be32(i)));
    std::string badTimes = streamHeader(s_cursorLocations, 1, 16);
    for (int i = 0; i < 200000; ++i)
        badTimes += pointEntry(s_noNumber, 0, 0);
    const std::string images = streamHeader(s_images, 2, 0) + cursorEntry(1, asPNG(2048, 2048));
    const std::vector<std::pair<std::string, MetaDataParser::StreamType>> files{
        {tinyAtoms, s_movie},
        {extendedAtom("ZULM", tinyAtoms), s_movie},
        {extendedAtom("ZULM", tinyStreams), s_movie},
        {badTimes, s_raw},
        {images, s_raw},
        {streamHeader(s_appNames, 1, 0) + textEntry(1, std::string(3 << 20, 'x')), s_raw},
        {streamHeader(s_appNames, 1, 0) + le32(0xffffffff) + f64(1), s_raw},
    };
    for (const auto& [bytes, type] : files) {
        std::istringstream stream(bytes);
        const MemoryWatch memory;
        validateRecording(ByteSource::stream(stream), type);
        EXPECT_LE(memory.peak(), 2 * bytes.size() + (std::size_t{16} << 20)) << bytes.size();
    }
}

std::string le16(std::uint16_t value) {
    return raw(value);
}

/// A field of a TIFF directory with 32-bit numbers: the number itself, or where they are.
std::string tiffField(std::uint16_t tag, std::uint32_t count, std::uint32_t value) {
    return le16(tag) + le16(4) + le32(count) + le32(value);
}

/// A grey picture of 2048 x 3600 pixels in 113 KiB: 36 strips of 100 rows, in each of which 128 zeros are packed into
/// two bytes 16 times. Its pixels take 28 MiB.
std::string packedTIFF() {
    constexpr std::uint32_t strips = 36;
    constexpr std::uint32_t stripSize = 100 * 16 * 2;
    std::string file = "II*" + std::string(1, '\0') + le32(8 + strips * stripSize + strips * 8);
    for (std::uint32_t i = 0; i < strips * stripSize / 2; ++i)
        file += std::string("\x81\0", 2);
    const auto offsets = static_cast<std::uint32_t>(file.size());
    for (std::uint32_t i = 0; i < strips; ++i)
        file += le32(8 + i * stripSize);
    const auto sizes = static_cast<std::uint32_t>(file.size());
    for (std::uint32_t i = 0; i < strips; ++i)
        file += le32(stripSize);
    return file + le16(9) + tiffField(256, 1, 2048) + tiffField(257, 1, 3600) + tiffField(258, 1, 8) +
           tiffField(259, 1, 32773) + tiffField(262, 1, 1) + tiffField(273, strips, offsets) + tiffField(277, 1, 1) +
           tiffField(278, 1, 100) + tiffField(279, strips, sizes) + le32(0);
}

TEST(MetaDataValidator, LetsGoOfALargeImageBeforeItDecodesASmallTIFF) {
    const std::string tiff = packedTIFF();
    ASSERT_EQ(Image::checkEncodedBytes({reinterpret_cast<const std::uint8_t*>(tiff.data()), tiff.size()}).state,
              EncodedImageCheck::Decodable);
    const std::string bytes =
        streamHeader(s_images, 2, 0) + cursorEntry(1, std::string(21 << 19, 'x')) + cursorEntry(2, tiff);
    std::istringstream stream(bytes);
    const MemoryWatch memory;
    EXPECT_EQ(validateRecording(ByteSource::stream(stream), s_raw).wholeEntries, 2U);
    EXPECT_GE(memory.peak(), std::size_t{28} << 20) << "it was decoded";
    EXPECT_LE(memory.peak(), 2 * bytes.size() + (std::size_t{16} << 20));
}

// ---- sizes that readers believe ----

/// 37 bytes, of which a text says that it goes on for a gigabyte.
std::istringstream greedyStream() {
    return std::istringstream(streamHeader(s_appNames, 1, 0) + le32(1U << 30) + f64(1) + "a");
}

TEST(BelievedSize, MakesAReaderOfAFewBytesAskForAllTheMemoryThatItSays) {
    std::istringstream stream = greedyStream();
    struct : DataStreamObserver<std::string> {
        bool dataRead(double, const std::string&) override { return true; }
    } observer;
    MemoryWatch memory;
    memory.refuseAbove(std::size_t{16} << 20);
    EXPECT_THROW(MetaDataReader<std::string>::parseStream(observer, stream, 0, 37, -1), std::bad_alloc);
    EXPECT_GE(memory.largestRequest(), (std::size_t{1} << 30) - 8);
}

TEST(BelievedSize, IsFoundByValidationInAlmostNoMemory) {
    std::istringstream stream = greedyStream();
    MemoryWatch memory;
    memory.refuseAbove(std::size_t{1} << 20);
    EXPECT_TRUE(validateRecording(ByteSource::stream(stream), s_raw).isDamaged());
}

// ---- what cannot be read ----

TEST(MetaDataValidator, ThrowsForWhatIsNoFileToRead) {
    TemporaryFolder folder;
    writeFile(folder / "Movie.mkv", hex("1a45dfa3 9f 4286 81 01") + "B\x82\x88matroska");
    std::filesystem::create_directory(folder / "Folder.mp4");
    for (const char* name : {"Missing.mp4", "Movie.mkv", "Folder.mp4"})
        EXPECT_THROW(validateRecording(folder / name), std::runtime_error) << name;
    std::istringstream stream(media());
    EXPECT_THROW(validateRecording(ByteSource::stream(stream), MetaDataParser::Unknown), std::runtime_error);
}

TEST(MetaDataValidator, TellsWhyAFileCannotBeOpened) {
    const TemporaryFolder folder;
    try {
        validateRecording(folder / "Missing.mp4");
        FAIL();
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "cannot be opened: No such file or directory");
    }
}

TEST(MetaDataValidator, ThrowsWhereTheDeviceFails) {
    struct FailingBuffer final : WatchedBuffer {
        using WatchedBuffer::WatchedBuffer;
        std::streamsize xsgetn(char* to, std::streamsize count) override {
            const auto left = static_cast<std::streamsize>(32 - std::min<std::size_t>(32, bytesRead()));
            return WatchedBuffer::xsgetn(to, std::min(count, left));
        }
        int_type underflow() override { return bytesRead() >= 32 ? traits_type::eof() : WatchedBuffer::underflow(); }
    } buffer(locationStream());
    std::istream stream(&buffer);
    EXPECT_THROW(validateRecording(ByteSource::stream(stream), s_raw), std::runtime_error);
}

TEST(MetaDataValidator, ThrowsForADeviceWithoutPositions) {
    struct PositionlessBuffer final : std::streambuf {
    } buffer;
    std::istream stream(&buffer);
    EXPECT_THROW(validateRecording(ByteSource::stream(stream), s_raw), std::runtime_error);
}

TEST(MetaDataValidator, TellsTheContainerByTheContentsOfTheFile) {
    TemporaryFolder folder;
    writeFile(folder / "a.MOV", media() + zulmAtom({locationStream()}));
    writeFile(folder / "b.wav", riffMedia() + zulmChunk({locationStream()}));
    writeFile(folder / "c.dat", locationStream());
    EXPECT_EQ(validateRecording(folder / "a.MOV").container, s_movie);
    EXPECT_EQ(validateRecording(folder / "b.wav").container, s_riff);
    EXPECT_EQ(validateRecording(folder / "c.dat").container, s_raw);
    for (const char* name : {"a.MOV", "b.wav", "c.dat"})
        EXPECT_EQ(validateRecording(folder / name).wholeEntries, 2U) << name;
    std::filesystem::rename(folder / "a.MOV", folder / "a.m4v");
    EXPECT_EQ(validateRecording(folder / "a.m4v").container, s_movie);
}

} // namespace
} // namespace ZULMetaData::Test
