// How a container is put together, item by item.

#include "Reports/Layout.h"

#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaDataBridge/Source/RecordingFile.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using Zulm::LayoutEnd;
using Zulm::LayoutItem;
using Zulm::LayoutPart;

/// Lines such as "ftyp 0+12 32-bit"; children are indented, and a walk that ends early says where and why.
std::vector<std::string> layoutOf(const std::string& bytes, const std::string& name,
                                  LayoutPart part = LayoutPart::Whole) {
    RecordingFile recording(ByteSource::memory(bytes), name);
    std::vector<std::string> lines;
    walkLayout(recording, part,
               {[&](const LayoutItem& item, bool isChild) {
                    lines.push_back(
                        (isChild ? "  " : "") + item.item.type.text() + ' ' + std::to_string(item.item.offset) + '+' +
                        std::to_string(item.size) + ' ' + item.headerForm() + (item.isMetaData ? " metadata" : "") +
                        (item.isForeign ? " foreign" : "") + (item.stream ? ' ' + metaDataKindName(*item.stream) : ""));
                },
                [&] { lines.push_back("end of children"); },
                [&](const LayoutEnd& end) { lines.push_back(std::to_string(end.offset) + ": " + end.reason); }});
    return lines;
}

TEST(Layout, ListsTheAtomsOfAMovieAndWhatIsInItsMetadata) {
    const std::string movie = media() + extendedAtom("ZULM", extendedAtom("DATA", locationStream()) + atom("free"));
    EXPECT_THAT(layoutOf(movie, "a.mp4"),
                ElementsAre("ftyp 0+12 32-bit", "mdat 12+18 32-bit", "ZULM 30+96 extended metadata",
                            "  DATA 46+72 extended cursorLocation", "  free 118+8 32-bit foreign", "end of children"));
    EXPECT_THAT(layoutOf(movie, "a.mp4", LayoutPart::MetaData),
                ElementsAre("ZULM 30+96 extended metadata", "  DATA 46+72 extended cursorLocation",
                            "  free 118+8 32-bit foreign", "end of children"));
}

TEST(Layout, ListsTheChunksOfARIFFFile) {
    EXPECT_THAT(layoutOf(riffMedia() + zulmChunk({appNameStream()}), "a.avi"),
                ElementsAre("RIFF 0+20 32-bit", "ZULM 20+72 32-bit metadata", "  DATA 28+64 32-bit topmostAppName",
                            "end of children"));
}

TEST(Layout, HasNoItemsInABareStream) {
    EXPECT_THAT(layoutOf(locationStream(), "a.dat"), IsEmpty());
}

TEST(Layout, TellsWhyAMovieEndsTooEarly) {
    EXPECT_THAT(layoutOf(atom("ftyp", "mp42") + be32(0) + "mdat0123456789", "a.mp4"),
                ElementsAre("ftyp 0+12 32-bit", "mdat 12+18 open-ended",
                            "12: atom 'mdat' is open-ended, as an interrupted recording leaves it; 'zulm repair' gives "
                            "it its size"));
    EXPECT_THAT(layoutOf(atom("ftyp", "mp42") + be32(1) + "ZULM" + be64(0), "a.mp4"),
                ElementsAre("ftyp 0+12 32-bit", "ZULM 12+0 extended metadata", "end of children",
                            "12: atom 'ZULM' declares size 0, as an interrupted save leaves it; 'zulm repair' gives it "
                            "its size"));
    EXPECT_THAT(layoutOf(atom("ftyp", "mp42") + be32(20) + "mdat", "a.mp4"),
                ElementsAre("ftyp 0+12 32-bit", "mdat 12+20 32-bit",
                            "12: atom 'mdat' reaches 12 bytes beyond the end of the file"));
    EXPECT_THAT(layoutOf(atom("ftyp", "mp42") + be32(1) + "mdat" + be64(9), "a.mp4"),
                ElementsAre("ftyp 0+12 32-bit", "mdat 12+9 extended",
                            "12: atom 'mdat' declares 9 bytes, less than its header of 16"));
    EXPECT_THAT(layoutOf(atom("ftyp", "mp42") + "12345", "a.mp4"),
                ElementsAre("ftyp 0+12 32-bit", "12: 5 bytes are left, too few for another header"));
}

TEST(Layout, TellsWhereARIFFFileHidesWhatFollows) {
    EXPECT_THAT(layoutOf(riffMedia() + chunk("JUNK") + zulmChunk({appNameStream()}), "a.avi"),
                ElementsAre("RIFF 0+20 32-bit", "JUNK 20+8 32-bit",
                            "20: chunk 'JUNK' has size 0, where the search for metadata ends"));
}

} // namespace
} // namespace ZULMetaData::Test
