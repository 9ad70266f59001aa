// The header of a stream and the registry of kinds.

#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include "Tests/Support/Bytes.h"
#include "Tests/ZULMetaData/StandardOutput.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <set>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

namespace {

// ---- The header -----------------------------------------------------------------------------------------------

TEST(MetaDataHeader, BeginsWithoutAKindAndOfNoVersion) {
    EXPECT_EQ(raw(MetaDataHeader()), std::string(16, '\0') + hex("ffffffff 00000000"));
}

TEST(MetaDataHeader, IsTwentyFourBytesWithoutPadding) {
    const MetaDataHeader header{s_cursorLocationUUID, 0x01020304, 0x11121314};
    EXPECT_EQ(raw(header), hex("2b7b6af2 7a1f 11e2 83d0 0017f200be7f 04030201 14131211"));
    EXPECT_EQ(s_metaDataHeaderSize, 24U);
}

// ---- The kinds ------------------------------------------------------------------------------------------------

struct Kind {
    const char* name;
    uuid constant;
    const char* identifier;
    int version;
};

const std::vector<Kind> s_kinds = {
    {"caretPosition", s_caretPositionUUID, "2b7b6aef-7a1f-11e2-83d0-0017f200be7f", 1},
    {"cursorAction", s_cursorActionUUID, "2b7b6af0-7a1f-11e2-83d0-0017f200be7f", 1},
    {"cursorImage", s_cursorImageUUID, "2b7b6af1-7a1f-11e2-83d0-0017f200be7f", 2},
    {"cursorLocation", s_cursorLocationUUID, "2b7b6af2-7a1f-11e2-83d0-0017f200be7f", 1},
    {"cursorOpacity", s_cursorOpacityUUID, "2b7b6af3-7a1f-11e2-83d0-0017f200be7f", 1},
    {"keyboardAction", s_keyboardActionUUID, "2b7b6af5-7a1f-11e2-83d0-0017f200be7f", 1},
    {"recordingRegion", s_recordingRegionUUID, "2b7b6af6-7a1f-11e2-83d0-0017f200be7f", 1},
    {"topmostWindow", s_topmostWindowUUID, "2b7b6af7-7a1f-11e2-83d0-0017f200be7f", 1},
    {"slideTitles", s_slideTitlesUUID, "2b7b6af8-7a1f-11e2-83d0-0017f200be7f", 1},
    {"slideText", s_slideTextUUID, "2b7b6af9-7a1f-11e2-83d0-0017f200be7f", 1},
    {"slideComment", s_slideCommentUUID, "2b7b6afa-7a1f-11e2-83d0-0017f200be7f", 1},
    {"recordingScaleFactor", s_recordingScaleFactorUUID, "2b7b6afb-7a1f-11e2-83d0-0017f200be7f", 1},
    {"systemData", s_systemDataUUID, "2b7b6afc-7a1f-11e2-83d0-0017f200be7f", 1},
    {"miscellany", s_miscellanyUUID, "2b7b6a00-7a1f-11e2-83d0-0017f200be7f", 1},
    {"recordingCutTimes", s_recordingCutTimesUUID, "2b7b6a01-7a1f-11e2-83d0-0017f200be7f", 1},
    {"deviceFrameCoordinates", s_deviceFrameCoordinatesUUID, "2b7b6a02-7a1f-11e2-83d0-0017f200be7f", 1},
    {"deviceFrameAspectRatio", s_deviceFrameAspectRatioUUID, "2b7b6a03-7a1f-11e2-83d0-0017f200be7f", 1},
    {"deviceFrameDisplayNames", s_deviceFrameDisplayNamesUUID, "2b7b6a04-7a1f-11e2-83d0-0017f200be7f", 1},
    {"scrollAction", s_scrollActionUUID, "2b7b6a05-7a1f-11e2-83d0-0017f200be7f", 1},
    {"topmostAppName", s_topmostAppNameUUID, "2b7b6a06-7a1f-11e2-83d0-0017f200be7f", 1},
    {"topmostWindowTitle", s_topmostWindowTitleUUID, "2b7b6a07-7a1f-11e2-83d0-0017f200be7f", 1},
    {"cpuUsage", s_cpuUsageUUID, "2b7b6a08-7a1f-11e2-83d0-0017f200be7f", 1},
    {"hoverRect", s_hoverRectUUID, "2b7b6a09-7a1f-11e2-83d0-0017f200be7f", 1},
};

/// Of an identifier's text.
std::string bytesOf(std::string text) {
    text.erase(std::remove(text.begin(), text.end(), '-'), text.end());
    return hex(text);
}

uuid identifier(const std::string& text) {
    uuid id{};
    std::memcpy(id.data, bytesOf(text).data(), sizeof id.data);
    return id;
}

TEST(Kinds, HaveTheirIdentifiers) {
    for (const Kind& kind : s_kinds)
        EXPECT_EQ(raw(kind.constant), bytesOf(kind.identifier)) << kind.name;
}

TEST(Kinds, HaveTheirCurrentVersionsAndSayNothing) {
    const std::string output = printedBy([] {
        for (const Kind& kind : s_kinds)
            EXPECT_EQ(MetaDataUUID::currentVersionForUUID(kind.constant), kind.version) << kind.name;
    });
    EXPECT_EQ(output, "");
}

TEST(Kinds, AreRegisteredInThisOrder) {
    ASSERT_EQ(s_metaDataKinds.size(), s_kinds.size());
    for (std::size_t index = 0; index < s_kinds.size(); ++index) {
        EXPECT_EQ(s_metaDataKinds[index].name, s_kinds[index].name);
        EXPECT_EQ(raw(s_metaDataKinds[index].type), bytesOf(s_kinds[index].identifier));
        EXPECT_EQ(s_metaDataKinds[index].currentVersion, s_kinds[index].version);
    }
}

TEST(Kinds, AreFoundByTheirIdentifier) {
    for (const Kind& kind : s_kinds) {
        const MetaDataKind* const found = findMetaDataKind(identifier(kind.identifier));
        ASSERT_NE(found, nullptr) << kind.name;
        EXPECT_EQ(found->name, kind.name);
    }
}

TEST(Kinds, DifferFromEachOther) {
    std::set<uuid> identifiers;
    for (const Kind& kind : s_kinds)
        identifiers.insert(kind.constant);
    EXPECT_EQ(identifiers.size(), 23U);
}

TEST(Kinds, HaveTheCursorImageAsText) {
    EXPECT_STREQ(s_cursorImageUUIDAsString, "2b7b6af1-7a1f-11e2-83d0-0017f200be7f");
}

// ---- Unknown kinds --------------------------------------------------------------------------------------------

/// Nobody's, among them the gap in the numbering and neighbours of it and of its ends.
const std::vector<std::string> s_unknown = {
    "00000000-0000-0000-0000-000000000000", "2b7b6af4-7a1f-11e2-83d0-0017f200be7f",
    "2b7b6aee-7a1f-11e2-83d0-0017f200be7f", "2b7b6afd-7a1f-11e2-83d0-0017f200be7f",
    "2b7b6a0a-7a1f-11e2-83d0-0017f200be7f", "2b7b69ff-7a1f-11e2-83d0-0017f200be7f",
    "2b7b6af1-7a1f-11e2-83d0-0017f200be7e", "2b7b6af1-7a1e-11e2-83d0-0017f200be7f",
};

TEST(UnknownKind, HasNoVersionAndIsReported) {
    for (const std::string& id : s_unknown) {
        const std::string output =
            printedBy([&id] { EXPECT_EQ(MetaDataUUID::currentVersionForUUID(identifier(id)), -1) << id; });
        EXPECT_EQ(output, "MetaDataUUID::currentVersionForUUID - unsupported UUID = " + id + "\n");
    }
}

TEST(UnknownKind, IsReportedEveryTimeItIsAskedFor) {
    const std::string output = printedBy([] {
        MetaDataUUID::currentVersionForUUID(uuid{});
        MetaDataUUID::currentVersionForUUID(uuid{});
    });
    EXPECT_EQ(output,
              "MetaDataUUID::currentVersionForUUID - unsupported UUID = 00000000-0000-0000-0000-000000000000\n"
              "MetaDataUUID::currentVersionForUUID - unsupported UUID = 00000000-0000-0000-0000-000000000000\n");
}

TEST(UnknownKind, IsReportedAtOnce) {
    FlushCounter output;
    MetaDataUUID::currentVersionForUUID(uuid{});
    EXPECT_EQ(output.flushes(), 1);
}

TEST(UnknownKind, IsNotFoundAndNotReportedThen) {
    const std::string output = printedBy([] {
        for (const std::string& id : s_unknown)
            EXPECT_EQ(findMetaDataKind(identifier(id)), nullptr) << id;
    });
    EXPECT_EQ(output, "");
}

TEST(KindName, IsThatOfTheRegistry) {
    EXPECT_EQ(metaDataKindName(s_cursorImageUUID), "cursorImage");
    EXPECT_EQ(metaDataKindName(s_hoverRectUUID), "hoverRect");
}

TEST(KindName, IsTheIdentifierWhereNoKindIsRegistered) {
    for (const std::string& id : s_unknown) {
        EXPECT_EQ(metaDataKindName(identifier(id)), id);
        EXPECT_EQ(uuidText(identifier(id)), id);
    }
}

} // namespace

} // namespace ZULMetaData::Test
