#include "ZULMetaDataBridge/Source/StreamRedaction.h"

#include "Tests/ZULMetaData/ContainerBytes.h"

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
    const RedactedStream result = redactStream(StreamSource::memory(stream, "test").open(), redaction, out);
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
    redaction.removedTimes = TimeRange{1, 2};
    const std::string header = streamHeader(s_cursorLocations, 1, 16);
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const Redacted copy = redacted(header + pointEntry(0.999, 1, 1) + pointEntry(1, 2, 2) + pointEntry(2, 3, 3) +
                                       pointEntry(2.001, 4, 4) + pointEntry(nan, 5, 5),
                                   redaction);
    EXPECT_EQ(copy.bytes, header + pointEntry(0.999, 1, 1) + pointEntry(2.001, 4, 4));
    EXPECT_EQ(copy.result.entriesRemoved, 3U);
}

TEST(StreamRedaction, RemovesWhatItCannotLookInto) {
    Redaction times;
    times.removedTimes = TimeRange{1, 2};
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

TEST(StreamRedaction, WritesTheEntrySizeThatReadersGoBy) {
    const std::string entries = pointEntry(1, 2, 3);
    EXPECT_EQ(redacted(streamHeader(s_cursorLocations, 1, 0) + entries, {}).bytes,
              streamHeader(s_cursorLocations, 1, 16) + entries);
}

TEST(StreamRedaction, LeavesOutWhatHasNoHeader) {
    EXPECT_EQ(redacted("too short", {}).result.removal, RedactedStream::Headless);
}

} // namespace
} // namespace ZULMetaData::Test
