// The helpers that every walk over a container is made of.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <fstream>
#include <ios>
#include <limits>
#include <sstream>
#include <string>

namespace ZULMetaData::Test {

namespace {

constexpr std::uint64_t s_most = std::numeric_limits<std::uint64_t>::max();

class ParserUtilities : public testing::Test {
protected:
    bool readAtom(const std::string& bytes) { return readAtom(bytes, bytes.size()); }
    bool readAtom(const std::string& bytes, std::uint64_t total) {
        stream = std::istringstream(bytes);
        return ParserUtil::readAtomSizeAndType(stream, total, atomSize, type);
    }

    bool readChunk(const std::string& bytes) { return readChunk(bytes, bytes.size()); }
    bool readChunk(const std::string& bytes, std::uint64_t total) {
        stream = std::istringstream(bytes);
        return ParserUtil::readChunkTypeAndSize(stream, total, type, chunkSize);
    }

    bool enoughBytesLeft(std::streamoff position, std::uint64_t total, std::uint64_t needed) {
        stream = std::istringstream(std::string(100, 'x'));
        stream.seekg(position);
        return ParserUtil::enoughBytesLeft(stream, total, needed);
    }

    std::istringstream stream;
    std::uint64_t atomSize = 0;
    std::uint32_t chunkSize = 0;
    std::uint32_t type = 0;
};

std::int64_t calcFileSize(std::istream& stream) {
    return ParserUtil::calcFileSize(stream);
}

TEST_F(ParserUtilities, GivesTheSizeOfAStreamAndKeepsItsPosition) {
    for (const std::streamoff position : {0, 3, 10}) {
        stream = std::istringstream("0123456789");
        stream.seekg(position);
        EXPECT_EQ(calcFileSize(stream), 10);
        EXPECT_EQ(stream.tellg(), std::streampos(position));
    }
}

TEST_F(ParserUtilities, GivesTheSizeOfAnEmptyStream) {
    stream = std::istringstream("");
    EXPECT_EQ(calcFileSize(stream), 0);
}

TEST_F(ParserUtilities, GivesTheSizeOfAFileThatGrows) {
    const TemporaryFolder folder;
    writeFile(folder / "a", "0123");
    std::ifstream file(folder / "a", std::ios_base::binary);
    EXPECT_EQ(calcFileSize(file), 4);
    std::ofstream(folder / "a", std::ios_base::app | std::ios_base::binary) << "456";
    EXPECT_EQ(calcFileSize(file), 7);
}

TEST_F(ParserUtilities, GivesTheSizeOfAFileOfMoreThan32Bits) {
    const TemporaryFolder folder;
    writeSparseFile(folder / "large", 5'000'000'000, "");
    std::ifstream file(folder / "large", std::ios_base::binary);
    EXPECT_EQ(calcFileSize(file), 5'000'000'000);
}

TEST_F(ParserUtilities, GivesNoSizeOfAStreamThatHasFailed) {
    stream = std::istringstream("0123456789");
    stream.setstate(std::ios_base::failbit);
    EXPECT_EQ(calcFileSize(stream), -1);
}

TEST_F(ParserUtilities, EnoughIsLeftUpToTheLastByte) {
    EXPECT_TRUE(enoughBytesLeft(0, 100, 100));
    EXPECT_TRUE(enoughBytesLeft(92, 100, 8));
    EXPECT_FALSE(enoughBytesLeft(93, 100, 8));
    EXPECT_TRUE(enoughBytesLeft(100, 100, 0));
    EXPECT_FALSE(enoughBytesLeft(100, 100, 1));
}

TEST_F(ParserUtilities, EnoughIsNeverLeftOfAFileThatIsTooSmall) {
    EXPECT_FALSE(enoughBytesLeft(0, 7, 8));
    EXPECT_FALSE(enoughBytesLeft(0, 0, 1));
    EXPECT_FALSE(enoughBytesLeft(0, 100, s_most));
    EXPECT_TRUE(enoughBytesLeft(0, 0, 0));
}

TEST_F(ParserUtilities, NothingIsLeftBehindTheEnd) {
    EXPECT_FALSE(enoughBytesLeft(11, 10, 0));
    EXPECT_FALSE(enoughBytesLeft(11, 10, 1));
}

TEST_F(ParserUtilities, EnoughIsLeftOfTheTotalThatIsGivenEvenIfTheStreamHoldsLess) {
    EXPECT_TRUE(enoughBytesLeft(100, s_most, 8));
    EXPECT_TRUE(enoughBytesLeft(0, s_most, s_most));
    EXPECT_FALSE(enoughBytesLeft(1, s_most, s_most));
}

TEST_F(ParserUtilities, ReadsAnOrdinaryAtomHeader) {
    EXPECT_TRUE(readAtom(hex("01020304 5a554c4d") + "payload"));
    EXPECT_EQ(atomSize, 0x01020304u);
    EXPECT_EQ(type, 0x5a554c4du); // "ZULM"
    EXPECT_EQ(stream.tellg(), std::streampos(8));
}

TEST_F(ParserUtilities, ReadsAnExtendedAtomHeaderForEverySizeBelowEight) {
    for (std::uint32_t marker = 0; marker < 8; ++marker) {
        EXPECT_TRUE(readAtom(be32(marker) + "DATA" + hex("0102030405060708") + "payload"));
        EXPECT_EQ(atomSize, 0x0102030405060708u) << marker;
        EXPECT_EQ(type, 0x44415441u) << marker;
        EXPECT_EQ(stream.tellg(), std::streampos(16)) << marker;
    }
}

TEST_F(ParserUtilities, ReadsASizeOfEightAndTheLargestAsTheyStand) {
    EXPECT_TRUE(readAtom(be32(8) + "wide" + be64(99)));
    EXPECT_EQ(atomSize, 8u);
    EXPECT_EQ(stream.tellg(), std::streampos(8));
    EXPECT_TRUE(readAtom(be32(0xffffffff) + "mdat" + be64(99)));
    EXPECT_EQ(atomSize, 0xffffffffu);
}

TEST_F(ParserUtilities, ReadsAnExtendedSizeOfAnyValue) {
    for (const std::uint64_t size : {std::uint64_t{0}, std::uint64_t{1}, std::uint64_t{15}, s_most}) {
        EXPECT_TRUE(readAtom(be32(1) + "mdat" + be64(size)));
        EXPECT_EQ(atomSize, size);
    }
}

TEST_F(ParserUtilities, RefusesAnAtomHeaderThatIsTorn) {
    for (std::size_t size = 0; size < 8; ++size)
        EXPECT_FALSE(readAtom((be32(20) + "mdat").substr(0, size)));
    for (std::size_t size = 8; size < 16; ++size)
        EXPECT_FALSE(readAtom((be32(1) + "mdat" + be64(20)).substr(0, size)));
}

TEST_F(ParserUtilities, RefusesAnAtomHeaderBehindTheTotal) {
    const std::string header = be32(1) + "mdat" + be64(20);
    EXPECT_FALSE(readAtom(header, 0));
    EXPECT_FALSE(readAtom(header, 7));
    EXPECT_FALSE(readAtom(header, 15));
    EXPECT_TRUE(readAtom(header, 16));
    EXPECT_TRUE(readAtom(be32(20) + "mdat" + "payload", 8));
}

TEST_F(ParserUtilities, RefusesAnAtomHeaderThatTheStreamLacksThoughTheTotalClaimsIt) {
    EXPECT_FALSE(readAtom("1234", 1000));
    EXPECT_FALSE(readAtom(be32(1) + "mdat" + "1234", 1000));
}

TEST_F(ParserUtilities, ReadsAtomHeadersOneBehindTheOther) {
    ASSERT_TRUE(readAtom(be32(8) + "wide" + be32(1) + "mdat" + be64(16)));
    EXPECT_TRUE(ParserUtil::readAtomSizeAndType(stream, 24, atomSize, type));
    EXPECT_EQ(atomSize, 16u);
    EXPECT_EQ(type, 0x6d646174u);
    EXPECT_FALSE(ParserUtil::readAtomSizeAndType(stream, 24, atomSize, type));
}

TEST_F(ParserUtilities, ReadsAChunkHeader) {
    EXPECT_TRUE(readChunk("DATA" + hex("04030201") + "payload"));
    EXPECT_EQ(raw(type), "DATA");
    EXPECT_EQ(chunkSize, 0x01020304u);
    EXPECT_EQ(stream.tellg(), std::streampos(8));
}

TEST_F(ParserUtilities, ReadsAChunkSizeOfAnyValue) {
    for (const std::uint32_t size : {0u, 1u, 7u, 0x80000000u, 0xffffffffu}) {
        EXPECT_TRUE(readChunk("DATA" + le32(size)));
        EXPECT_EQ(chunkSize, size);
    }
}

TEST_F(ParserUtilities, RefusesAChunkHeaderThatIsTorn) {
    for (std::size_t size = 0; size < 8; ++size)
        EXPECT_FALSE(readChunk(("DATA" + le32(20)).substr(0, size)));
}

TEST_F(ParserUtilities, RefusesAChunkHeaderBehindTheTotal) {
    const std::string header = "DATA" + le32(20) + "payload";
    EXPECT_FALSE(readChunk(header, 0));
    EXPECT_FALSE(readChunk(header, 3));
    EXPECT_FALSE(readChunk(header, 7));
    EXPECT_TRUE(readChunk(header, 8));
}

TEST_F(ParserUtilities, ReadsTheTypeOfAChunkWhoseSizeIsMissing) {
    EXPECT_FALSE(readChunk("DATA12", 6));
    EXPECT_EQ(raw(type), "DATA");
}

TEST_F(ParserUtilities, RefusesAChunkHeaderThatTheStreamLacksThoughTheTotalClaimsIt) {
    EXPECT_FALSE(readChunk("DA", 1000));
    EXPECT_FALSE(readChunk("DATA12", 1000));
}

} // namespace

} // namespace ZULMetaData::Test
