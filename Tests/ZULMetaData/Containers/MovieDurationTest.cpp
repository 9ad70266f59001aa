// The duration that a movie's header declares.

#include "ZULMetaData/Containers/MovieDuration.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

namespace ZULMetaData::Test {
namespace {

/// Version 0: the times 1 and 2, the timescale, the duration, and what else such a header holds.
std::string header(std::uint32_t timescale, std::uint32_t duration) {
    return atom("mvhd",
                hex("00 000000") + be32(1) + be32(2) + be32(timescale) + be32(duration) + std::string(80, '\7'));
}

std::string wideHeader(std::uint32_t timescale, std::uint64_t duration) {
    return atom("mvhd",
                hex("01 000000") + be64(1) + be64(2) + be32(timescale) + be64(duration) + std::string(80, '\7'));
}

std::optional<double> durationOf(const std::string& bytes,
                                 MetaDataParser::StreamType type = MetaDataParser::QuickTime) {
    std::stringstream stream(bytes);
    return movieDuration(*MetaDataParser::create(stream, type));
}

TEST(MovieDuration, IsTheDurationInItsTimescale) {
    EXPECT_EQ(durationOf(atom("ftyp", "isom") + atom("moov", header(600, 12345))), 20.575);
    EXPECT_EQ(durationOf(atom("moov", atom("udta") + header(1000, 0))), 0);
}

TEST(MovieDuration, MayHave64Bits) {
    EXPECT_EQ(durationOf(atom("moov", wideHeader(2, std::uint64_t{1} << 40))), 549755813888.0);
}

TEST(MovieDuration, IsFoundBehindTheMedia) {
    EXPECT_EQ(durationOf(atom("ftyp") + extendedAtom("mdat", "media") + extendedAtom("moov", header(10, 5))), 0.5);
}

TEST(MovieDuration, IsNotToldWhereItIsLeftOpen) {
    EXPECT_EQ(durationOf(atom("moov", header(600, 0xffffffff))), std::nullopt);
    EXPECT_EQ(durationOf(atom("moov", wideHeader(600, 0xffffffffffffffff))), std::nullopt);
    EXPECT_EQ(durationOf(atom("moov", header(0, 5))), std::nullopt);
}

TEST(MovieDuration, IsNotToldWithoutAHeader) {
    EXPECT_EQ(durationOf(""), std::nullopt);
    EXPECT_EQ(durationOf(atom("mdat", header(600, 600))), std::nullopt);
    EXPECT_EQ(durationOf(atom("moov", atom("trak", header(600, 600)))), std::nullopt);
    EXPECT_EQ(durationOf(chunk("RIFF", "AVI "), MetaDataParser::Riff), std::nullopt);
}

TEST(MovieDuration, IsNotToldByAHeaderThatIsCutShort) {
    const std::string whole = header(600, 12345).substr(0, 28);
    for (std::size_t size = 8; size < whole.size(); ++size)
        EXPECT_EQ(durationOf(atom("moov", be32(static_cast<std::uint32_t>(size)) + whole.substr(4, size - 4))),
                  std::nullopt)
            << size;
    for (std::size_t size = 8; size < whole.size(); ++size)
        EXPECT_EQ(durationOf(be32(116) + "moov" + whole.substr(0, size)), std::nullopt) << size;
}

// Fragmented movies -----------------------------------------------------------------------------------------------

std::string versionAndFlags(std::uint8_t version, std::uint32_t flags) {
    return be32(static_cast<std::uint32_t>(version) << 24 | flags);
}

std::string track(std::uint32_t id, std::uint32_t timescale, std::uint32_t duration = 0) {
    const std::string times = be32(0) + be32(0);
    return atom("trak", atom("tkhd", versionAndFlags(0, 7) + times + be32(id) + std::string(68, '\0')) +
                            atom("mdia", atom("mdhd", versionAndFlags(0, 0) + times + be32(timescale) + be32(duration) +
                                                          be32(0))));
}

std::string defaults(std::uint32_t id, std::uint32_t duration) {
    return atom("trex", versionAndFlags(0, 0) + be32(id) + be32(1) + be32(duration) + be32(0) + be32(0));
}

/// Samples of the track's default duration.
std::string run(std::uint32_t samples) {
    return atom("trun",
                versionAndFlags(0, 0x201) + be32(samples) + be32(0) + std::string(std::size_t{4} * samples, 's'));
}

std::string runOf(const std::vector<std::uint32_t>& durations) {
    std::string samples;
    for (const std::uint32_t duration : durations)
        samples += be32(duration) + be32(100); // and a size
    return atom("trun", versionAndFlags(0, 0x305) + be32(static_cast<std::uint32_t>(durations.size())) + be32(8) +
                            be32(0) + samples);
}

std::string fragment(std::uint32_t id, const std::string& runs, const std::string& begin = {}) {
    return atom("moof", atom("mfhd", be32(0) + be32(1)) +
                            atom("traf", atom("tfhd", versionAndFlags(0, 0x020000) + be32(id)) + begin + runs)) +
           atom("mdat", "samples");
}

std::string beginsAt(std::uint64_t time) {
    return atom("tfdt", versionAndFlags(1, 0) + be64(time));
}

std::string fragmentedMovie(const std::string& fragments, const std::string& extension = {}) {
    return atom("ftyp", "iso5") +
           atom("moov", header(1000, 0) + track(1, 30) + track(2, 48000) +
                            atom("mvex", extension + defaults(1, 1) + defaults(2, 1024))) +
           fragments;
}

TEST(MovieDuration, OfFragmentsIsWhatTheirHeaderDeclares) {
    const std::string extension = atom("mehd", versionAndFlags(0, 0) + be32(12500));
    EXPECT_EQ(durationOf(fragmentedMovie(fragment(1, run(30)), extension)), 12.5);
    EXPECT_EQ(durationOf(fragmentedMovie({}, atom("mehd", versionAndFlags(1, 0) + be64(12500)))), 12.5);
}

TEST(MovieDuration, OfFragmentsIsCountedWhereNoHeaderDeclaresIt) {
    EXPECT_EQ(durationOf(fragmentedMovie(fragment(1, run(30)) + fragment(1, run(15) + run(15)))), 2);
    EXPECT_EQ(durationOf(fragmentedMovie(fragment(1, run(30)) + fragment(2, runOf({48000, 24000})))), 1.5);
    EXPECT_EQ(durationOf(fragmentedMovie(fragment(1, run(30), beginsAt(60)) + fragment(1, run(30), beginsAt(90)))), 2);
    EXPECT_EQ(durationOf(fragmentedMovie(fragment(1, run(30), beginsAt(0)) + fragment(1, run(30), beginsAt(300)))), 11);
}

TEST(MovieDuration, OfFragmentsBeginsBehindTheSamplesOfTheMovie) {
    const std::string movie = atom("moov", header(1000, 2000) + track(1, 30, 60) + atom("mvex", defaults(1, 1))) +
                              fragment(1, run(30)) + fragment(1, run(30));
    EXPECT_EQ(durationOf(movie), 4);
}

TEST(MovieDuration, OfSegmentsIsWhatTheirIndexesSay) {
    const std::string index =
        atom("sidx", versionAndFlags(0, 0) + be32(1) + be32(1000) + be32(500) + be32(0) + be32(2) +
                         (be32(100) + be32(2000) + be32(0)) + (be32(100) + be32(1500) + be32(0)));
    EXPECT_EQ(durationOf(atom("styp", "msdh") + index + fragment(1, run(30))), 3.5);
}

TEST(MovieDuration, ReadsOnlyTheLastOfVeryManyFragments) {
    std::string fragments;
    for (std::uint64_t i = 0; i < 50500; ++i)
        fragments += fragment(1, run(1), beginsAt(i));
    EXPECT_DOUBLE_EQ(*durationOf(fragmentedMovie(fragments)), 50500 / 30.0);
}

TEST(MovieDuration, OfFragmentsIsFoundWhereverTheyAreCutShort) {
    const std::string movie = fragmentedMovie(fragment(1, run(30)) + fragment(2, runOf({48000, 24000})));
    for (std::size_t size = 0; size < movie.size(); ++size) {
        const auto duration = durationOf(movie.substr(0, size));
        EXPECT_TRUE(!duration || (*duration >= 0 && *duration <= 1.5)) << size;
    }
}

} // namespace
} // namespace ZULMetaData::Test
