// Entries as documents, and these as lines.

#include "Reports/EntryFormat.h"

#include "Tests/Support/Bytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <string>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using Zulm::csvLine;
using Zulm::entryDocument;
using Zulm::tableKeys;
using Zulm::textLine;
using Json = nlohmann::ordered_json;

TEST(EntryFormat, HasTheExactTimeAndTheOneOf32Bits) {
    EXPECT_EQ(entryDocument<CursorLocationKind>(0.5, {3, -4}).dump(), R"({"x":3,"y":-4,"timestamp":0.5})");
    EXPECT_EQ(entryDocument<CursorLocationKind>(0.1, {3, -4}).dump(),
              R"({"x":3,"y":-4,"timestamp":0.1,"timestamp_f32":0.10000000149011612})");
    EXPECT_EQ(entryDocument<CursorLocationKind>(std::numeric_limits<double>::infinity(), {3, -4}).dump(),
              R"({"x":3,"y":-4,"timestamp":"Infinity"})");
}

TEST(EntryFormat, ShowsAShortNumberWithItsOwnDigits) {
    EXPECT_EQ(entryDocument<CPUUsageKind>(1, 0.1F).dump(), R"({"cpuUsage":0.1,"timestamp":1.0})");
}

TEST(EntryFormat, KeepsTheBytesOfATextThatIsNotUTF8) {
    const Json entry = entryDocument<TopmostAppNameKind>(1, "caf\xe9");
    EXPECT_EQ(entry["name"], "caf\xef\xbf\xbd");
    EXPECT_EQ(entry["name_base64"], "Y2Fm6Q==");
    EXPECT_EQ(textLine(entry), "    1.000000  name=\"caf\\xe9\"");
    EXPECT_EQ(csvLine(entry, tableKeys<TopmostAppNameKind>()), "caf\\xe9,1.0");
}

TEST(EntryFormat, QuotesTexts) {
    const Json entry = entryDocument<TopmostWindowTitleKind>(2.25, "a \"b\",\nc");
    EXPECT_EQ(textLine(entry), "    2.250000  title=\"a \\\"b\\\",\\x0ac\"");
    EXPECT_EQ(csvLine(entry, tableKeys<TopmostWindowTitleKind>()), "\"a \"\"b\"\",\nc\",2.25");
    EXPECT_EQ(Zulm::csvHeader(tableKeys<TopmostWindowTitleKind>()), "title,timestamp");
}

TEST(EntryFormat, NamesKeysByCodeAndFlags) {
    EXPECT_EQ(entryDocument<KeyboardActionKind>(1, {119, 0})["characterString"], "w");
    EXPECT_EQ(entryDocument<KeyboardActionKind>(1, {119, 0x40000000})["characterString"], "f8");
}

TEST(EntryFormat, ListsTextsThatHaveNoKey) {
    const Json longer = entryDocument<SystemDataKind>(0, {"2", "2", "11", "8", "\xe9"});
    EXPECT_EQ(longer["processorCount"], "2");
    EXPECT_EQ(longer["further"], Json({"\xc3\xa9"}));
    EXPECT_EQ(longer["further_base64"], Json({"6Q=="}));
    EXPECT_EQ(Zulm::damageOf(longer), "");
    const Json shorter = entryDocument<SystemDataKind>(0, {"2"});
    EXPECT_EQ(shorter["ram"], nullptr);
    EXPECT_EQ(Zulm::damageOf(shorter), "1 texts, fewer than its kind has");
    EXPECT_THAT(tableKeys<SystemDataKind>(),
                ElementsAre("processorCount", "activeProcessorCount", "osVersion", "ram", "further", "timestamp"));
}

TEST(EntryFormat, MeasuresAnImageInsteadOfShowingIt) {
    std::string bytes = "no image";
    CursorImage cursor;
    cursor.uniqueId = 18446744073709551615U;
    cursor.imageData = reinterpret_cast<unsigned char*>(bytes.data());
    cursor.imageDataSize = 8;
    const Json broken = entryDocument<CursorImageKind>(1, cursor);
    EXPECT_EQ(broken["image"].dump(), R"({"damage":"cannot be decoded","bytes":8})");
    EXPECT_EQ(broken["id"], "18446744073709551615");
    EXPECT_EQ(Zulm::damageOf(broken), "its image cannot be decoded");
    EXPECT_THAT(textLine(broken), testing::HasSubstr("image=(8 bytes, cannot be decoded)"));
    cursor.imageData = nullptr;
    cursor.imageDataSize = 0;
    EXPECT_EQ(entryDocument<CursorImageKind>(1, cursor)["image"], nullptr);
}

} // namespace
} // namespace ZULMetaData::Test
