#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

#include <sstream>
#include <tuple>
#include <vector>

namespace ZULMetaData {

namespace {

using namespace Test;

using testing::internal::CaptureStdout;
using testing::internal::GetCapturedStdout;

std::string bytesOf(const uuid& type) {
    return {reinterpret_cast<const char*>(type.data), sizeof type.data};
}

struct Row {
    const char* name;
    const char* firstGroup;
    uuid constant;
    int version;
};

const std::vector<Row> s_rows{
    {"caretPosition", "2b7b6aef", s_caretPositionUUID, 1},
    {"cursorAction", "2b7b6af0", s_cursorActionUUID, 1},
    {"cursorImage", "2b7b6af1", s_cursorImageUUID, 2},
    {"cursorLocation", "2b7b6af2", s_cursorLocationUUID, 1},
    {"cursorOpacity", "2b7b6af3", s_cursorOpacityUUID, 1},
    {"keyboardAction", "2b7b6af5", s_keyboardActionUUID, 1},
    {"recordingRegion", "2b7b6af6", s_recordingRegionUUID, 1},
    {"topmostWindow", "2b7b6af7", s_topmostWindowUUID, 1},
    {"slideTitles", "2b7b6af8", s_slideTitlesUUID, 1},
    {"slideText", "2b7b6af9", s_slideTextUUID, 1},
    {"slideComment", "2b7b6afa", s_slideCommentUUID, 1},
    {"recordingScaleFactor", "2b7b6afb", s_recordingScaleFactorUUID, 1},
    {"systemData", "2b7b6afc", s_systemDataUUID, 1},
    {"miscellany", "2b7b6a00", s_miscellanyUUID, 1},
    {"recordingCutTimes", "2b7b6a01", s_recordingCutTimesUUID, 1},
    {"deviceFrameCoordinates", "2b7b6a02", s_deviceFrameCoordinatesUUID, 1},
    {"deviceFrameAspectRatio", "2b7b6a03", s_deviceFrameAspectRatioUUID, 1},
    {"deviceFrameDisplayNames", "2b7b6a04", s_deviceFrameDisplayNamesUUID, 1},
    {"scrollAction", "2b7b6a05", s_scrollActionUUID, 1},
    {"topmostAppName", "2b7b6a06", s_topmostAppNameUUID, 1},
    {"topmostWindowTitle", "2b7b6a07", s_topmostWindowTitleUUID, 1},
    {"cpuUsage", "2b7b6a08", s_cpuUsageUUID, 1},
    {"hoverRect", "2b7b6a09", s_hoverRectUUID, 1},
};

TEST(KindRegistry, HoldsEveryKindInOrderWithItsIdentifierAndVersion) {
    ASSERT_EQ(s_metaDataKinds.size(), s_rows.size());
    for (std::size_t i = 0; i < s_rows.size(); ++i) {
        const Row& row = s_rows[i];
        EXPECT_EQ(s_metaDataKinds[i].name, row.name);
        EXPECT_EQ(s_metaDataKinds[i].currentVersion, row.version) << row.name;
        EXPECT_EQ(bytesOf(row.constant), hex(row.firstGroup) + hex("7a1f11e283d00017f200be7f")) << row.name;
        EXPECT_EQ(s_metaDataKinds[i].type, row.constant) << row.name;
        EXPECT_EQ(MetaDataUUID::currentVersionForUUID(row.constant), row.version) << row.name;
        EXPECT_EQ(findMetaDataKind(row.constant), &s_metaDataKinds[i]) << row.name;
    }
}

TEST(KindRegistry, LeavesTheGapInTheNumberingToNobody) {
    EXPECT_EQ(findMetaDataKind(detail::kindUUID(0x2b7b6af4)), nullptr);
    EXPECT_EQ(findMetaDataKind(uuid{}), nullptr);
}

TEST(KindRegistry, HasTheCursorImageIdentifierAsText) {
    std::ostringstream text;
    text << s_cursorImageUUID;
    EXPECT_EQ(text.str(), s_cursorImageUUIDAsString);
    EXPECT_STREQ(s_cursorImageUUIDAsString, "2b7b6af1-7a1f-11e2-83d0-0017f200be7f");
}

TEST(KindRegistry, SaysOnStandardOutputThatAKindIsUnknown) {
    CaptureStdout();
    const int version = MetaDataUUID::currentVersionForUUID(detail::kindUUID(0x2b7b6af4));
    EXPECT_EQ(GetCapturedStdout(), "MetaDataUUID::currentVersionForUUID - unsupported UUID = "
                                   "2b7b6af4-7a1f-11e2-83d0-0017f200be7f\n");
    EXPECT_EQ(version, -1);
}

TEST(KindRegistry, SaysNothingOfAKindThatItHolds) {
    CaptureStdout();
    MetaDataUUID::currentVersionForUUID(s_hoverRectUUID);
    EXPECT_EQ(GetCapturedStdout(), "");
}

TEST(MetaDataHeader, IsUnreadAtFirst) {
    const MetaDataHeader header;
    EXPECT_EQ(header.uuid, uuid{});
    EXPECT_EQ(header.version, -1);
    EXPECT_EQ(header.fixedEntrySize, 0U);
}

TEST(MetaDataHeader, Takes24BytesInTheOrderOfItsFields) {
    MetaDataHeader header;
    header.uuid = s_cursorLocationUUID;
    header.version = 1;
    header.fixedEntrySize = 16;
    EXPECT_EQ(raw(header), streamHeader("2b7b6af2", 1, 16));
}

} // namespace

} // namespace ZULMetaData
