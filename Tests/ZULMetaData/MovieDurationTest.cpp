// The duration that a movie's header declares.

#include "ZULMetaData/MovieDuration.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

#include <sstream>

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

} // namespace
} // namespace ZULMetaData::Test
