#include "ZULMetaDataBridge/Source/StreamRedaction.h"

#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <sstream>

namespace ZULMetaData::Test {
namespace {

struct Redacted {
    RedactedStream result;
    std::string bytes;
};

Redacted redacted(const std::string& stream, const Redaction& redaction) {
    std::ostringstream out;
    const RedactedStream result = redactStream(ByteSource::memory(stream), redaction, out);
    return {result, out.str()};
}

std::string keyStream(const std::string& entries) {
    return streamHeader("2b7b6af5", 1, 16) + entries;
}

Redaction hiding(const std::string& word) {
    Redaction redaction;
    redaction.hidesText = [word](const std::string& text) { return text.find(word) != std::string::npos; };
    return redaction;
}

constexpr double s_endless = std::numeric_limits<double>::infinity();
const double s_directlyAfter2 = std::nextafter(2.0, 3.0);
const double s_directlyAfter10 = std::nextafter(10.0, 11.0);

Redaction within(double from, double to) {
    Redaction redaction;
    redaction.removedTimes = {{from, to}};
    return redaction;
}

TEST(StreamRedaction, CopiesByteForByteWhereNothingMustGo) {
    for (const std::string& stream : {locationStream(), appNameStream(), streamHeader("deadbeef", 7, 3) + "abcdef"})
        EXPECT_EQ(redacted(stream, {}).bytes, stream);
}

TEST(StreamRedaction, RemovesAKind) {
    Redaction redaction;
    redaction.removedKinds = {s_cursorLocationUUID};
    EXPECT_EQ(redacted(locationStream(), redaction).result.removal, RedactedStream::Asked);
    EXPECT_TRUE(redacted(locationStream(), redaction).bytes.empty());
    EXPECT_EQ(redacted(appNameStream(), redaction).bytes, appNameStream());
}

TEST(StreamRedaction, ClearsKeysAndTheirModifiers) {
    Redaction redaction;
    redaction.clearsKeys = true;
    const Redacted copy =
        redacted(keyStream(f64(1) + le32('a') + le32(0x20000) + f64(2) + le32(0) + le32(0)), redaction);
    EXPECT_EQ(copy.bytes, keyStream(f64(1) + le32(0) + le32(0) + f64(2) + le32(0) + le32(0)));
    EXPECT_EQ(copy.result.entriesChanged, 1U);
    EXPECT_EQ(copy.result.entries, 2U);
}

TEST(StreamRedaction, HidesWholeTexts) {
    const Redacted copy = redacted(appNameStream(), hiding("ote"));
    EXPECT_EQ(copy.bytes, streamHeader(s_appNames, 1, 0) + textEntry(0.5, "Abc") + textEntry(2.0, "\xe2\x80\xa6"));
    EXPECT_EQ(copy.result.entriesChanged, 1U);
}

TEST(StreamRedaction, RemovesEntriesOfATimeBothEndsIncluded) {
    Redaction redaction;
    redaction.removedTimes = {{1, 2}};
    const std::string header = streamHeader(s_cursorLocations, 1, 16);
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const Redacted copy = redacted(header + pointEntry(0.999, 1, 1) + pointEntry(1, 2, 2) + pointEntry(2, 3, 3) +
                                       pointEntry(s_directlyAfter2, 4, 4) + pointEntry(nan, 5, 5),
                                   redaction);
    EXPECT_EQ(copy.bytes, header + pointEntry(0.999, 1, 1) + pointEntry(s_directlyAfter2, 4, 4));
    EXPECT_EQ(copy.result.entriesRemoved, 3U);
    EXPECT_EQ(copy.result.entriesAdded, 0U);
}

TEST(StreamRedaction, CarriesAStateOverTheRangeThatRemovedIt) {
    const std::string header = streamHeader(s_cursorLocations, 1, 16);
    const std::string before = header + pointEntry(0, 1, 1);
    const Redacted copy =
        redacted(before + pointEntry(1, 2, 2) + pointEntry(2, 3, 3) + pointEntry(9, 4, 4), within(1, 2));
    EXPECT_EQ(copy.bytes, before + pointEntry(s_directlyAfter2, 3, 3) + pointEntry(9, 4, 4));
    EXPECT_EQ(copy.result.entriesAdded, 1U);
    EXPECT_EQ(copy.result.entries, 3U);
    EXPECT_EQ(redacted(before + pointEntry(1, 3, 3), within(1, 2)).bytes, before + pointEntry(s_directlyAfter2, 3, 3))
        << "nothing follows";
    EXPECT_EQ(redacted(before + pointEntry(1, 2, 2) + pointEntry(2, 1, 1) + pointEntry(9, 4, 4), within(1, 2)).bytes,
              before + pointEntry(9, 4, 4))
        << "what was in force before still is";
    EXPECT_EQ(redacted(before + pointEntry(1, 2, 2), within(1, s_endless)).bytes, before) << "nothing is left";
}

TEST(StreamRedaction, CarriesAStateFromOneRangeToTheNext) {
    const std::string before = streamHeader(s_cursorLocations, 1, 16) + pointEntry(0, 1, 1);
    Redaction redaction = within(1, 2);
    redaction.removedTimes.push_back({4, 10});
    EXPECT_EQ(redacted(before + pointEntry(1, 2, 2) + pointEntry(5, 3, 3) + pointEntry(11, 4, 4), redaction).bytes,
              before + pointEntry(s_directlyAfter2, 2, 2) + pointEntry(s_directlyAfter10, 3, 3) + pointEntry(11, 4, 4));
    redaction.removedTimes.push_back({s_directlyAfter2, 3});
    EXPECT_EQ(redacted(before + pointEntry(1, 2, 2) + pointEntry(2.5, 5, 5) + pointEntry(11, 4, 4), redaction).bytes,
              before + pointEntry(std::nextafter(3, s_endless), 5, 5) + pointEntry(11, 4, 4))
        << "there is no time between the first two";
}

TEST(StreamRedaction, CarriesNoEvent) {
    const std::string after = f64(9) + le32('b') + le32(0);
    EXPECT_EQ(redacted(keyStream(f64(1) + le32('a') + le32(0) + after), within(1, 2)).bytes, keyStream(after));
    const std::string scrolls = streamHeader("2b7b6a05", 1, 16);
    EXPECT_EQ(redacted(scrolls + pointEntry(1, 0, 9) + pointEntry(9, 0, 1), within(1, 2)).bytes,
              scrolls + pointEntry(9, 0, 1));
}

TEST(StreamRedaction, KeepsWhatDescribesTheWholeRecording) {
    const std::string region = streamHeader("2b7b6af6", 1, 24) + f64(0) + le32(1) + le32(2) + le32(3) + le32(4);
    EXPECT_EQ(redacted(region, within(0, 9)).bytes, region);
    const std::string scale = streamHeader(s_scaleFactors, 1, 12) + f64(0) + le32(2);
    EXPECT_EQ(redacted(scale, within(0, 9)).bytes, scale);
    const std::string system = streamHeader("2b7b6afc", 1, 0) + le32(4 + 16) + le32(1) + textEntry(0, "RAM:");
    EXPECT_EQ(redacted(system, within(0, 9)).bytes, system);
}

TEST(StreamRedaction, MergesRangesThatOverlapOrTouch) {
    Redaction redaction;
    redaction.removedTimes = {{2, 3}, {1, 2}, {2.5, 2.75}, {7, 6}};
    const std::string header = streamHeader(s_cursorLocations, 1, 16);
    EXPECT_EQ(redacted(header + pointEntry(2, 1, 1) + pointEntry(6.5, 2, 2), redaction).bytes,
              header + pointEntry(std::nextafter(3.0, 4.0), 1, 1) + pointEntry(6.5, 2, 2));
}

std::string names(const std::string& entries) {
    return streamHeader(s_appNames, 1, 0) + entries;
}

const std::string s_ellipsis = s_hiddenText;

TEST(StreamRedaction, HidesATextThatIsInForceInsideTheRangeWhereverItIsRecorded) {
    const Redacted copy = redacted(names(textEntry(0, "Mail") + textEntry(5, "Salary") + textEntry(12, "Bank") +
                                         textEntry(30, "Salary") + textEntry(40, "Mail")),
                                   within(10, 20));
    EXPECT_EQ(copy.bytes, names(textEntry(0, "Mail") + textEntry(5, s_ellipsis) + textEntry(30, s_ellipsis) +
                                textEntry(40, "Mail")));
    EXPECT_EQ(copy.result.entriesChanged, 2U);
    EXPECT_EQ(copy.result.entriesRemoved, 1U);
    EXPECT_EQ(redacted(names(textEntry(5, "Salary")), within(10, 20)).bytes, names(textEntry(5, s_ellipsis)))
        << "the last text holds to the end";
}

TEST(StreamRedaction, LetsNoTextHoldOnIntoTheRange) {
    EXPECT_EQ(redacted(names(textEntry(5, "Mail") + textEntry(10, "Bank") + textEntry(11, "") + textEntry(30, "Notes")),
                       within(10, 20))
                  .bytes,
              names(textEntry(5, "Mail") + textEntry(10, s_ellipsis) + textEntry(30, "Notes")));
}

TEST(StreamRedaction, AddsNoEntryBeforeAllTime) {
    const std::string stream = streamHeader(s_appNames, 1, 0) + textEntry(5, "Shown") + textEntry(1, "Secret");
    EXPECT_EQ(redacted(stream, within(-s_endless, 2)).bytes,
              streamHeader(s_appNames, 1, 0) + textEntry(5, "Shown") + textEntry(1, s_hiddenText));
}

TEST(StreamRedaction, HidesATextWhoseEndATimeThatGoesBackDoesNotTell) {
    EXPECT_EQ(
        redacted(names(textEntry(5, "Salary") + textEntry(4, "Mail") + textEntry(6, "Notes")), within(10, 20)).bytes,
        names(textEntry(5, s_ellipsis) + textEntry(4, "Mail") + textEntry(6, s_ellipsis)));
}

std::string cursorEntry(double time, std::uint64_t id, const std::string& picture) {
    const auto size = static_cast<std::uint32_t>(picture.size());
    const std::string fields = picture.empty() ? "" : le32(4) + le32(5) + picture + le32(7);
    const std::string data = le32(size) + fields + le32(3);
    return le32(static_cast<std::uint32_t>(20 + data.size())) + f64(time) + le64(id) +
           le32(static_cast<std::uint32_t>(data.size())) + data;
}

TEST(StreamRedaction, CarriesThePictureOfACursorToItsNextEntry) {
    const std::string header = streamHeader("2b7b6af1", 2, 0);
    const std::string before = header + cursorEntry(0, 1, "arrow");
    const Redacted copy = redacted(before + cursorEntry(1, 2, "hand") + cursorEntry(1.5, 1, "") +
                                       cursorEntry(8, 2, "") + cursorEntry(9, 2, ""),
                                   within(1, 2));
    EXPECT_EQ(copy.bytes, before + cursorEntry(8, 2, "hand") + cursorEntry(9, 2, ""));
    EXPECT_EQ(copy.result.entriesChanged, 1U);
    EXPECT_EQ(redacted(before + cursorEntry(1, 2, "hand") + cursorEntry(9, 2, ""), within(1, 2)).bytes,
              before + cursorEntry(s_directlyAfter2, 2, "hand") + cursorEntry(9, 2, ""))
        << "the entry that is added has it";
    EXPECT_EQ(
        redacted(before + cursorEntry(1, 2, "hand") + cursorEntry(1.5, 1, "") + cursorEntry(9, 2, "fist"), within(1, 2))
            .bytes,
        before + cursorEntry(9, 2, "fist"))
        << "a picture of its own stays";
}

TEST(StreamRedaction, KeepsOnlyChosenKinds) {
    Redaction redaction;
    redaction.keptKinds = {s_cursorLocationUUID};
    EXPECT_EQ(redacted(locationStream(), redaction).bytes, locationStream());
    EXPECT_EQ(redacted(appNameStream(), redaction).result.removal, RedactedStream::Asked);
    EXPECT_EQ(redacted(streamHeader("deadbeef", 1, 12), redaction).result.removal, RedactedStream::Asked);
}

TEST(StreamRedaction, TellsWhatBecomesOfEachEntry) {
    std::vector<std::string> steps;
    Redaction redaction = hiding("ote");
    redaction.removedTimes = {{0, 1}};
    redaction.onEntry = [&](const RedactedEntry& entry) {
        steps.push_back(std::to_string(entry.action) + " " + std::to_string(static_cast<int>(entry.time)) + " " +
                        std::to_string(entry.original.size()));
    };
    redacted(appNameStream(), redaction);
    redacted(locationStream(), redaction);
    redaction.removedKinds = {s_cursorLocationUUID};
    redacted(locationStream(), redaction);
    EXPECT_EQ(steps, (std::vector<std::string>{"0 0 15", "1 2 17", "0 0 16", "0 1 16", "2 1 0", "0 0 16", "0 1 16"}));
}

TEST(StreamRedaction, CollectsTheTextsThatGo) {
    RedactedTexts texts;
    const auto collect = [&](const std::string& stream, const Redaction& redaction) {
        collectRedactedTexts(ByteSource::memory(stream), redaction, texts);
    };
    collect(appNameStream(), hiding("ote"));
    collect(names(textEntry(0, "early") + textEntry(1, "") + textEntry(2, "late")), within(2, 3));
    EXPECT_EQ(texts.hidden, (std::set<std::string>{"Notes", "late"}));
    EXPECT_TRUE(texts.removed.empty());
    Redaction removing;
    removing.removedKinds = {s_systemDataUUID};
    collect(streamHeader("2b7b6afc", 1, 0) + le32(4 + 16) + le32(1) + textEntry(0, "RAM:"), removing);
    EXPECT_EQ(texts.removed, (std::set<std::string>{"RAM:"}));
}

TEST(StreamRedaction, RemovesWhatItCannotLookInto) {
    Redaction times;
    times.removedTimes = {{1, 2}};
    Redaction keys;
    keys.clearsKeys = true;
    const std::string unknown = streamHeader("deadbeef", 1, 12) + f64(1) + raw(2);
    const std::string newer = streamHeader("2b7b6af5", 2, 16) + f64(1) + le32('a') + le32(0);
    EXPECT_EQ(redacted(unknown, times).result.removal, RedactedStream::Undecodable);
    EXPECT_EQ(redacted(unknown, hiding("x")).result.removal, RedactedStream::Undecodable);
    EXPECT_EQ(redacted(unknown, keys).bytes, unknown);
    EXPECT_EQ(redacted(newer, keys).result.removal, RedactedStream::Undecodable);
    EXPECT_TRUE(redacted(newer, keys).bytes.empty());
}

TEST(StreamRedaction, LeavesOutATornTailAndWhatDoesNotFit) {
    const Redacted torn = redacted(locationStream() + "secret", hiding("x"));
    EXPECT_EQ(torn.bytes, locationStream());
    EXPECT_EQ(torn.result.bytesLeftOut, 6U);
    const Redacted misfit = redacted(appNameStream() + le32(4) + "four" + textEntry(3, "secret"), {});
    EXPECT_EQ(misfit.bytes, appNameStream());
    EXPECT_EQ(misfit.result.bytesLeftOut, 8U + 18U);
}

TEST(StreamRedaction, LooksIntoNoStreamWhoseHeaderStatesAnotherEntrySizeThanItsKindHas) {
    const std::string points = streamHeader("2b7b6af6", 1, 16) + pointEntry(1, 2, 3) + pointEntry(2, 3, 4);
    EXPECT_EQ(redacted(points, {}).bytes, points);
    Redaction range;
    range.removedTimes.push_back({0, 1});
    EXPECT_EQ(redacted(points, range).result.removal, RedactedStream::Undecodable);
}

TEST(StreamRedaction, LeavesOutWhatHasNoHeader) {
    EXPECT_EQ(redacted("too short", {}).result.removal, RedactedStream::Headless);
}

TEST(StreamRedaction, KeepsNumbersThatAreNone) {
    const float none = std::numeric_limits<float>::quiet_NaN();
    const std::string usage = streamHeader("2b7b6a08", 1, 12) + f64(1) + raw(none) + f64(9) + raw(none);
    const Redacted copy = redacted(usage, within(2, 3));
    EXPECT_EQ(copy.bytes, usage);
    EXPECT_EQ(copy.result.entriesChanged, 0U);
}

} // namespace
} // namespace ZULMetaData::Test
