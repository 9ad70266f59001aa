// RIFF files whose first chunk does not have its size in 32 bits.

#include "ZULMetaData/Containers/ContainerLayout.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"

#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

namespace ZULMetaData::Test {
namespace {

std::string le64(std::uint64_t value) {
    return raw(value);
}

/// `size` stands in the `ds64` chunk.
std::string rf64(const std::string& signature, std::uint64_t size, const std::string& body) {
    return signature + le32(0xffffffff) + "WAVE" + chunk("ds64", le64(size) + le64(0) + le64(0) + le32(0)) + body;
}

std::string rf64(const std::string& body, const std::string& signature = "RF64") {
    return rf64(signature, 4 + 8 + 28 + body.size(), body);
}

/// As a program writes it that cannot go back to set the sizes.
std::string piped(std::uint32_t size, const std::string& samples) {
    return "RIFF" + le32(size) + "WAVE" + chunk("fmt ", std::string(16, '\1')) + "data" + le32(size) + samples;
}

std::optional<ContainerItem> widthOf(const std::string& file) {
    const auto first = ItemWalk(ByteSource::memory(file), Container::Riff).next();
    return first && first->sizeSource != ContainerItem::Header ? first : std::nullopt;
}

std::vector<FoundStream> foundIn(const std::string& file) {
    std::istringstream stream(file);
    return streamsOf(*openContainer(stream, MetaDataParser::Riff));
}

TEST(WideRIFF, LeavesFilesWithTheirSizeIn32Bits) {
    for (const std::string& file : {riffMedia(), riffMedia() + zulmChunk({locationStream()}), std::string("RIFF"),
                                    chunk("JUNK", "1234"), std::string(), "RF64" + le32(4) + "WAVE"})
        EXPECT_FALSE(widthOf(file)) << file;
}

TEST(WideRIFF, TakesTheSizeInTheSizeChunk) {
    for (const std::string signature : {"RF64", "BW64"}) {
        const std::string file = rf64(chunk("data", "12345678"), signature);
        const auto wide = widthOf(file + zulmChunk({locationStream()}));
        ASSERT_TRUE(wide) << signature;
        EXPECT_EQ(wide->sizeSource, ContainerItem::SizeChunk);
        EXPECT_EQ(wide->end(), file.size());
        EXPECT_EQ(foundIn(file + zulmChunk({locationStream()})),
                  (std::vector<FoundStream>{{kind(s_cursorLocations), file.size() + 16, 56}}));
    }
}

TEST(WideRIFF, FindsNothingBehindASizeBeyondTheFile) {
    for (const std::uint64_t size : {std::uint64_t(5000), minus(1) - 1, minus(8), minus(16), minus(20)}) {
        const std::string file = rf64("RF64", size, chunk("data", "12345678")) + zulmChunk({locationStream()});
        EXPECT_EQ(widthOf(file)->sizeSource, ContainerItem::SizeChunk);
        EXPECT_GT(widthOf(file)->end(), file.size());
        EXPECT_TRUE(foundIn(file).empty());
    }
}

TEST(WideRIFF, SearchesFilesFromAPipe) {
    for (const std::uint32_t size : {0U, 0xffffffffU})
        for (const std::string& samples :
             {std::string("samples."), std::string("a ZULM of nothing..."), std::string()}) {
            const std::string file = piped(size, samples);
            EXPECT_EQ(widthOf(file)->end(), file.size()) << size;
            EXPECT_TRUE(foundIn(file).empty());
            const auto wide = widthOf(file + zulmChunk({locationStream(), appNameStream()}));
            ASSERT_TRUE(wide);
            EXPECT_EQ(wide->sizeSource, ContainerItem::FileEnd);
            EXPECT_EQ(wide->end(), file.size());
            EXPECT_EQ(foundIn(file + zulmChunk({locationStream(), appNameStream()})).size(), 2U);
            EXPECT_EQ(foundIn(file + zulmChunk({locationStream()}) + zulmChunk({appNameStream()})).size(), 2U);
        }
}

TEST(WideRIFF, SearchesA64BitFileThatCameFromAPipe) {
    const std::string file = rf64("RF64", 0, chunk("data", "12345678"));
    EXPECT_EQ(widthOf(file + zulmChunk({locationStream()}))->end(), file.size());
}

TEST(WideRIFF, FindsMetadataThatWasCutShort) {
    const std::string file = piped(0xffffffff, "samples.");
    const std::string whole = file + zulmChunk({locationStream()});
    EXPECT_EQ(widthOf(whole.substr(0, whole.size() - 9))->end(), file.size());
    EXPECT_EQ(foundIn(whole.substr(0, whole.size() - 9)).size(), 1U);
}

TEST(WideRIFF, SearchesNoMoreThanTheTailOfALargeFile) {
    const TemporaryFolder folder;
    const std::string metadata = zulmChunk({locationStream()});
    constexpr std::uint64_t size = std::uint64_t{6} << 30;
    writeSparseFile(folder / "large.wav", size, piped(0xffffffff, ""), metadata);
    const auto parser = openContainer(folder / "large.wav");
    EXPECT_EQ(streamsOf(*parser),
              (std::vector<FoundStream>{{kind(s_cursorLocations), size - metadata.size() + 16, 56}}));
}

TEST(WideRIFF, IsListedWithItsTrueSize) {
    const std::string file = rf64(chunk("data", "12345678"));
    const std::string whole = file + zulmChunk({locationStream()});
    const auto items = topLevelItems(ByteSource::memory(whole), Container::Riff);
    ASSERT_EQ(items.size(), 2U);
    EXPECT_EQ(items[0].type, "RF64");
    EXPECT_EQ(items[0].size, file.size());
    EXPECT_EQ(items[0].sizeSource, ContainerItem::SizeChunk);
    EXPECT_EQ(items[1].type, "ZULM");
    EXPECT_EQ(items[1].sizeSource, ContainerItem::Header);
    const std::string pipe = piped(0, "samples.") + zulmChunk({locationStream()});
    EXPECT_EQ(topLevelItems(ByteSource::memory(pipe), Container::Riff)[0].sizeSource, ContainerItem::FileEnd);
}

TEST(WideRIFF, AlwaysComesToAnEnd) {
    const std::string whole = piped(0, "samples.") + zulmChunk({locationStream()}) + chunk("LIST", "1234");
    for (std::size_t size = 0; size <= whole.size(); ++size)
        foundIn(whole.substr(0, size));
    for (std::size_t at = 0; at < whole.size(); ++at)
        for (const char byte : {'\0', '\x7f', '\xff'}) {
            std::string changed = whole;
            changed[at] = byte;
            foundIn(changed);
        }
}

} // namespace
} // namespace ZULMetaData::Test
