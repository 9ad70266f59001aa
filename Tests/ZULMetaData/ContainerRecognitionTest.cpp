// Containers told apart by their first bytes.

#include "ZULMetaData/ContainerRecognition.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

namespace ZULMetaData::Test {
namespace {

using enum MetaDataParser::StreamType;

TEST(ContainerRecognition, TakesASizeAndAPrintableTypeForAMovie) {
    EXPECT_EQ(streamTypeOfContents(atom("ftyp", "isom")), QuickTime);
    EXPECT_EQ(streamTypeOfContents(extendedAtom("mdat")), QuickTime);
    EXPECT_EQ(streamTypeOfContents(be32(0) + "mdat"), QuickTime); // an open end
    EXPECT_EQ(streamTypeOfContents(be32(8) + "wide"), QuickTime);
    EXPECT_EQ(streamTypeOfContents(be32(8) + "~ ~ "), QuickTime);
}

TEST(ContainerRecognition, RefusesAtomsThatCannotBe) {
    EXPECT_EQ(streamTypeOfContents(be32(7) + "mdat"), Unknown);
    EXPECT_EQ(streamTypeOfContents(be32(16) + "\x01\x02\x03\x04"), Unknown);
    EXPECT_EQ(streamTypeOfContents(be32(16) + "wid\x7f"), Unknown);
    EXPECT_EQ(streamTypeOfContents(be32(8) + "wid"), Unknown); // cut short
    EXPECT_EQ(streamTypeOfContents(""), Unknown);
    EXPECT_EQ(streamTypeOfContents(std::string(64, '\0')), Unknown);
}

TEST(ContainerRecognition, TakesTheSignatureForRIFF) {
    EXPECT_EQ(streamTypeOfContents(chunk("RIFF", "WAVE")), Riff);
    EXPECT_EQ(streamTypeOfContents("RIFF"), Unknown);
}

TEST(ContainerRecognition, TakesAnIdentifierOfTheFamilyForAStream) {
    EXPECT_EQ(streamTypeOfContents(streamHeader("2b7b6af2", 1, 16)), RawStream);
    EXPECT_EQ(streamTypeOfContents(streamHeader("2b7b6aff", 1, 16)), RawStream); // nobody's
}

TEST(ContainerRecognition, KnowsTheFamilyByAllBehindTheFirstGroup) {
    EXPECT_EQ(streamTypeOfContents(hex("00000000 7a1f 11e2 83d0 0017f200be7f")), RawStream);
    EXPECT_EQ(streamTypeOfContents(hex("2b7b6af2 7b1f 11e2 83d0 0017f200be7f")), Unknown);
    EXPECT_EQ(streamTypeOfContents(hex("2b7b6af2 7a1f 11e2 83d0 0017f200be70")), Unknown);
    EXPECT_EQ(streamTypeOfContents(hex("2b7b6af2 7a1f 11e2 83d0 0017f200be")), Unknown); // cut short
}

TEST(ContainerRecognition, NamesTheExtensionThatTellsTheSame) {
    for (const auto type : {QuickTime, Riff, RawStream})
        EXPECT_EQ(MetaDataParser::streamTypeOf("file" + std::string(extensionFor(type))), type);
    EXPECT_EQ(extensionFor(Unknown), "");
}

} // namespace
} // namespace ZULMetaData::Test
