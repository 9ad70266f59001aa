// What validating a file has found, as text and as JSON.

#include "Reports/Findings.h"

#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <string>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::ordered_json;

ValidationReport reportOn(const std::string& bytes, Container::Type type) {
    return validateRecording(ByteSource::memory(bytes), type);
}

/// A stream whose last entry has 4 of 16 bytes.
std::string tornStream() {
    return locationStream() + "1234";
}

TEST(Findings, SayWhatIsWrongInOneLine) {
    const ValidationReport report = reportOn(tornStream(), Container::RawStream);
    ASSERT_EQ(report.allFindings().size(), 1U);
    const Finding finding = report.allFindings().front();
    EXPECT_EQ(Zulm::findingText(finding), "cursorLocation at offset 56: the last entry has 4 of 16 bytes [torn-entry]");
    EXPECT_EQ(Zulm::findingDocument(finding),
              Json::parse(R"({"code": "torn-entry", "severity": "damage", "place": "cursorLocation", "offset": 56,
                              "message": "the last entry has 4 of 16 bytes"})"));
}

TEST(Findings, MarkWhatIsNoDamage) {
    const ValidationReport report =
        reportOn(media() + zulmAtom({locationStream()}) + zulmAtom({appNameStream()}), Container::QuickTime);
    ASSERT_EQ(report.allFindings().size(), 1U);
    const Finding finding = report.allFindings().front();
    EXPECT_STREQ(Zulm::severityText(finding.severity()), "notice");
    EXPECT_EQ(Zulm::findingText(finding), "ZULM at offset 118: notice: this is not the first ZULM: an earlier one is "
                                          "at offset 30 [several-metadata-atoms]");
}

TEST(Findings, NameTheFirstDamageInAStreamAndCountTheRest) {
    EXPECT_EQ(Zulm::damageIn(reportOn(locationStream(), Container::RawStream).streams.front()), "");
    EXPECT_EQ(Zulm::damageIn(reportOn(tornStream(), Container::RawStream).streams.front()),
              "at offset 56: the last entry has 4 of 16 bytes");
    const std::string noNumber = hex("000000000000f07f");
    const std::string times = streamHeader(s_cursorLocations, 1, 16) + noNumber + le64(0) + noNumber + le64(0) + "1";
    EXPECT_EQ(Zulm::damageIn(reportOn(times, Container::RawStream).streams.front()),
              "at offset 24: the entry's time is inf (2 more)");
    EXPECT_EQ(Zulm::damageIn(StreamReport()), "it could not be examined");
}

TEST(Findings, AreListedForTheFileAndForEachStream) {
    const Json document = Zulm::verifyDocument("a.dat", reportOn(tornStream(), Container::RawStream));
    EXPECT_EQ(document["path"], "a.dat");
    EXPECT_EQ(document["bytes"], 60);
    EXPECT_EQ(document["damaged"], true);
    EXPECT_EQ(document["damage_count"], 1);
    EXPECT_EQ(document["duration"], nullptr);
    EXPECT_EQ(document["findings"], Json::array());
    const Json& stream = document["streams"][0];
    EXPECT_EQ(stream["kind"], "cursorLocation");
    EXPECT_EQ(stream["readable_bytes"], 56);
    EXPECT_EQ(stream["entries"], 2);
    EXPECT_EQ(stream["first_time"], 0.5);
    EXPECT_EQ(stream["last_time"], 1.0);
    EXPECT_EQ(stream["findings"][0]["code"], "torn-entry");
}

} // namespace
} // namespace ZULMetaData::Test
