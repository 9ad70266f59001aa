// Streams for a movie that begins at another time.

#include "ZULMetaDataBridge/Source/StreamRetiming.h"

#include "Tests/Support/Bytes.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <limits>
#include <sstream>
#include <string>

namespace ZULMetaData::Test {
namespace {

struct Retimed {
    RetimedStream result;
    std::string bytes;
};

Retimed retimed(const std::string& stream, double shift, std::optional<double> trimmedTo = {}) {
    std::ostringstream out;
    Retiming retiming;
    retiming.shift = shift;
    retiming.trimmedTo = trimmedTo;
    const RetimedStream result = retimeStream(ByteSource::memory(stream), retiming, out);
    return {result, out.str()};
}

std::string locations(const std::vector<double>& times) {
    std::string stream = streamHeader(s_cursorLocations, 1, 16);
    for (std::size_t i = 0; i < times.size(); ++i)
        stream += pointEntry(times[i], static_cast<std::int32_t>(i), 7);
    return stream;
}

std::string pointsOf(const std::vector<std::pair<double, std::int32_t>>& points) {
    std::string stream = streamHeader(s_cursorLocations, 1, 16);
    for (const auto& [time, x] : points)
        stream += pointEntry(time, x, 7);
    return stream;
}

std::string cursor(double time, std::uint64_t id, const std::string& image) {
    const std::string data =
        image.empty() ? le32(0) + le32(3)
                      : le32(static_cast<std::uint32_t>(image.size())) + le32(0) + le32(0) + image + le32(1) + le32(3);
    const std::string record = f64(time) + raw(id) + le32(static_cast<std::uint32_t>(data.size())) + data;
    return le32(static_cast<std::uint32_t>(record.size())) + record;
}

TEST(StreamRetiming, ChangesNothingButTheTimes) {
    EXPECT_EQ(retimed(locations({0, 1, 2}), 0).bytes, locations({0, 1, 2}));
    EXPECT_EQ(retimed(locations({0, 1, 2}), 2.5).bytes, locations({2.5, 3.5, 4.5}));
    EXPECT_EQ(retimed(locations({0, 1, 2}), -1).bytes, locations({-1, 0, 1}));
    EXPECT_EQ(retimed(appNameStream(), 1).bytes,
              streamHeader(s_appNames, 1, 0) + textEntry(1.5, "Abc") + textEntry(3.0, "Notes"));
    const std::string header = streamHeader("2b7b6af1", 2, 0);
    EXPECT_EQ(retimed(header + cursor(1, 9, "image") + cursor(2, 9, ""), -0.5).bytes,
              header + cursor(0.5, 9, "image") + cursor(1.5, 9, ""));
}

TEST(StreamRetiming, TellsWhatItDid) {
    const RetimedStream result = retimed(locations({0, 1, 2, 3}) + "torn", 1, 3.0).result;
    EXPECT_TRUE(result.isReadable);
    EXPECT_EQ(result.entries, 3U);
    EXPECT_EQ(result.entriesRemoved, 1U);
    EXPECT_EQ(result.bytesLeftOut, 4U);
    EXPECT_EQ(result.firstTime, 1.0);
    EXPECT_EQ(result.lastTime, 3.0);
}

TEST(StreamRetiming, LeavesTheDescriptionOfTheMachineAtItsTime) {
    const std::string text = textEntry(0, "Debian");
    const std::string stream =
        streamHeader("2b7b6afc", 1, 0) + le32(static_cast<std::uint32_t>(4 + text.size())) + le32(1) + text;
    EXPECT_EQ(retimed(stream, -5, 1.0).bytes, stream);
}

TEST(StreamRetiming, KeepsWhatIsInForceAtTheBeginning) {
    EXPECT_EQ(retimed(locations({0, 1, 2, 3}), -1.5, 60.0).bytes, pointsOf({{0, 1}, {0.5, 2}, {1.5, 3}}));
    EXPECT_EQ(retimed(locations({0, 1}), -10, 60.0).bytes, pointsOf({{0, 1}}));
    EXPECT_EQ(retimed(locations({0, 1, 2}), 0, 1.0).bytes, locations({0, 1}));
}

TEST(StreamRetiming, DropsEventsBeforeTheBeginning) {
    const std::string header = streamHeader("2b7b6a05", 1, 16); // scroll deltas
    EXPECT_EQ(retimed(header + pointEntry(1, 2, 3) + pointEntry(5, 6, 7), -2, 60.0).bytes,
              header + pointEntry(3, 6, 7));
}

TEST(StreamRetiming, KeepsThePicturesOfCursorsFromBeforeTheBeginning) {
    const std::string header = streamHeader("2b7b6af1", 2, 0);
    const std::string stream =
        header + cursor(0, 1, "one") + cursor(1, 2, "two") + cursor(2, 1, "") + cursor(3, 2, "") + cursor(8, 1, "");
    EXPECT_EQ(retimed(stream, -5, 60.0).bytes,
              header + cursor(0, 1, "one") + cursor(0, 2, "two") + cursor(0, 2, "") + cursor(3, 1, ""));
}

TEST(StreamRetiming, TrimsTimesThatAreNoNumbers) {
    const double none = std::numeric_limits<double>::quiet_NaN();
    EXPECT_EQ(retimed(locations({1, none}), 0, 60.0).bytes, locations({1}));
    EXPECT_EQ(retimed(locations({1, none}), 1).result.lastTime, 2.0);
}

TEST(StreamRetiming, RefusesStreamsWhoseTimesNobodyKnows) {
    for (const std::string& stream : {streamHeader("12345678", 1, 0) + textEntry(1, "x"), std::string("short")}) {
        const Retimed none = retimed(stream, 1);
        EXPECT_FALSE(none.result.isReadable);
        EXPECT_EQ(none.bytes, "");
    }
    const std::string unknown = streamHeader("12345678", 1, 16);
    EXPECT_EQ(retimed(unknown + pointEntry(1, 2, 3), 1).bytes, unknown + pointEntry(2, 2, 3));
}

TEST(StreamRetiming, MeasuresTimes) {
    const auto span = timeSpanOf(ByteSource::memory(locations({3, -1, 8, 9})), 7);
    EXPECT_EQ(span.first, -1.0);
    EXPECT_EQ(span.last, 9.0);
    EXPECT_EQ(span.entriesAfter, 2U);
    EXPECT_EQ(timeSpanOf(ByteSource::memory("short"), 7).last, std::nullopt);
}

} // namespace
} // namespace ZULMetaData::Test
