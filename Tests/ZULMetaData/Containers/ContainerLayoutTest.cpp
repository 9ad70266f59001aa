// The items of containers as their headers declare them.

#include "ZULMetaData/Containers/ContainerLayout.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

namespace ZULMetaData::Test {
namespace {

std::vector<ContainerItem> itemsOf(const std::string& bytes, Container::Type type = Container::QuickTime) {
    return topLevelItems(ByteSource::memory(bytes), type);
}

TEST(ContainerLayout, GivesPlaceAndSizeOfEveryAtom) {
    const auto atoms = itemsOf(atom("ftyp", "isom") + extendedAtom("mdat", "12345") + atom("free"));
    ASSERT_EQ(atoms.size(), 3U);
    EXPECT_EQ(atoms[1].type, "mdat");
    EXPECT_EQ(atoms[1].offset, 12U);
    EXPECT_EQ(atoms[1].headerSize, 16U);
    EXPECT_EQ(atoms[1].size, 21U);
    EXPECT_EQ(atoms[1].payloadOffset(), 28U);
    EXPECT_EQ(atoms[1].payloadSize(), 5U);
    EXPECT_EQ(atoms[2].offset, 33U);
}

TEST(ContainerLayout, TellsTheFormsOfHeadersApart) {
    const auto atoms = itemsOf(atom("ftyp") + be32(5) + "oddl" + be64(16) + extendedAtom("mdat"));
    ASSERT_EQ(atoms.size(), 3U);
    EXPECT_FALSE(atoms[0].isExtended());
    EXPECT_EQ(atoms[0].sizeField, 8U);
    EXPECT_TRUE(atoms[1].isExtended()); // any number below 8 announces it
    EXPECT_EQ(atoms[1].sizeField, 5U);
    EXPECT_EQ(atoms[1].size, 16U);
    EXPECT_EQ(atoms[2].sizeField, 1U);
}

TEST(ContainerLayout, KeepsThe32BitNumberOfAnOpenEnd) {
    const auto atoms = itemsOf(atom("ftyp") + be32(0) + "mdat" + "pictures");
    ASSERT_EQ(atoms.size(), 2U);
    EXPECT_EQ(atoms[1].sizeField, 0U);
    const auto shortAtoms = itemsOf(be32(0) + "mdat" + "media");
    ASSERT_EQ(shortAtoms.size(), 1U);
    EXPECT_EQ(shortAtoms[0].size, 0U);
    EXPECT_EQ(shortAtoms[0].headerSize, 8U);
}

TEST(ContainerLayout, KnowsWhatHoldsMetaDataAndStreams) {
    const auto atoms = itemsOf(atom("ZULM") + atom("DATA") + atom("mdat"));
    EXPECT_TRUE(atoms[0].holdsMetaData() && !atoms[0].holdsStream());
    EXPECT_TRUE(atoms[1].holdsStream() && !atoms[1].holdsMetaData());
    EXPECT_FALSE(atoms[2].holdsStream() || atoms[2].holdsMetaData());
    const auto chunks = itemsOf(chunk("ZULM", chunk("DATA")), Container::Riff);
    EXPECT_TRUE(chunks[0].holdsMetaData());
}

TEST(ContainerLayout, KnowsWhatHoldsRecordingInfo) {
    const auto atoms = itemsOf(extendedAtom("ZULR", std::string(64, '\0')) + atom("ZULM"));
    ASSERT_EQ(atoms.size(), 2U);
    EXPECT_TRUE(atoms[0].holdsRecordingInfo());
    EXPECT_FALSE(atoms[1].holdsRecordingInfo());
}

TEST(ContainerLayout, GivesChunksWithoutTheirPadByte) {
    const auto chunks = itemsOf(chunk("RIFF", "odd") + chunk("junk", "even"), Container::Riff);
    ASSERT_EQ(chunks.size(), 2U);
    EXPECT_EQ(chunks[0].size, 11U);
    EXPECT_EQ(chunks[0].sizeField, 3U);
    EXPECT_EQ(chunks[1].offset, 12U);
}

TEST(ContainerLayout, EndsAfterAnItemThatNothingCanFollow) {
    EXPECT_EQ(itemsOf(be32(100) + "mdat" + atom("free")).size(), 1U);         // reaches beyond the end
    EXPECT_EQ(itemsOf(be32(1) + "mdat" + be64(0) + atom("free")).size(), 1U); // has no size yet
    EXPECT_EQ(itemsOf(atom("ftyp") + "1234567").size(), 1U);                  // too few bytes for a header
    EXPECT_EQ(itemsOf(chunk("RIFF") + "1234567", Container::Riff).size(), 1U);
    EXPECT_TRUE(itemsOf("").empty());
}

TEST(ContainerLayout, WalksOverTheInsideOfAnAtom) {
    const std::string bytes = atom("moov", atom("mvhd") + atom("trak", "x")) + atom("free");
    ItemWalk atoms(ByteSource::memory(bytes), Container::QuickTime);
    ItemWalk children = atoms.inside(*atoms.next());
    EXPECT_EQ(children.next()->type, "mvhd");
    EXPECT_EQ(atoms.next()->type, "free") << "walks do not disturb each other";
    EXPECT_EQ(children.next()->type, "trak");
    EXPECT_FALSE(children.next());
}

TEST(ContainerLayout, TellsHowManyBytesAreTooFewForAHeader) {
    const std::string bytes = atom("ftyp", "isom") + "1234567";
    ItemWalk atoms(ByteSource::memory(bytes), Container::QuickTime);
    EXPECT_TRUE(atoms.next());
    EXPECT_FALSE(atoms.next());
    EXPECT_EQ(atoms.end() - atoms.position(), 7U);
}

TEST(ContainerLayout, TakesTheSizesBelowAHeaderLiterallyIfAskedTo) {
    const std::string bytes = be32(5) + "oddl" + be64(16);
    ItemWalk atoms(ByteSource::memory(bytes), Container::QuickTime);
    atoms.takeSizesLiterally();
    EXPECT_EQ(atoms.next()->size, 5U);
}

TEST(FourCC, IsFourCharactersInTheOrderOfTheFile) {
    EXPECT_EQ(FourCC("moov").value, 0x6d6f6f76U);
    EXPECT_EQ(FourCC(0x6d6f6f76).text(), "moov");
    EXPECT_TRUE(FourCC("a ~b").isPrintable());
    EXPECT_FALSE(FourCC("\xa9too").isPrintable());
}

TEST(ContainerLayout, HasNothingToListInABareStream) {
    EXPECT_TRUE(itemsOf(streamHeader("2b7b6af2", 1, 16), Container::RawStream).empty());
}

} // namespace
} // namespace ZULMetaData::Test
