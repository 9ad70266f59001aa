#include "ZULMetaData/ZULMMetaDataReader.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

#include <limits>
#include <sstream>
#include <stdexcept>

namespace ZULMetaData {

namespace {

using namespace Test;
using testing::internal::CaptureStdout;
using testing::internal::GetCapturedStdout;

constexpr auto s_refused = "MetaDataReader<T>::parseFile - Version is larger than what we can handle\n";
constexpr auto s_unknown = "MetaDataUUID::currentVersionForUUID - unsupported UUID = "
                           "00000000-0000-0000-0000-000000000000\n";

const std::string s_locations = streamHeader("2b7b6af2", 1, 16);
const std::string s_titles = streamHeader("2b7b6af8", 1, 0);
const std::string s_systemData = streamHeader("2b7b6afc", 1, 0);

std::string point(double time, std::uint32_t x, std::uint32_t y) {
    return f64(time) + le32(x) + le32(y);
}

template <class T>
struct Collector : DataStreamObserver<T> {
    std::vector<double> times;
    std::vector<T> values;
    std::size_t limit = std::numeric_limits<std::size_t>::max();

    bool dataRead(double time, const T& value) override {
        times.push_back(time);
        values.push_back(value);
        return values.size() < limit;
    }
};

template <class T>
class Reading {
public:
    explicit Reading(const std::string& bytes) : stream(bytes), length_(bytes.size()) {}

    void parse(int version = -1) { parse(0, length_, version); }
    void parse(std::uint64_t start, std::uint64_t length, int version = -1) {
        MetaDataReader<T>::parseStream(observer, stream, start, length, version);
    }

    std::istringstream stream;
    Collector<T> observer;

private:
    std::uint64_t length_;
};

MetaDataHeader headerOf(const uuid& type, int version) {
    MetaDataHeader header;
    header.uuid = type;
    header.version = version;
    return header;
}

TEST(SupportedVersions, MinusOneAcceptsEveryVersionUpToTheCurrentOne) {
    for (int version = 1; version <= 2; ++version)
        EXPECT_TRUE(MetaDataReader<CursorImage>::IsSupportedVersion(headerOf(s_cursorImageUUID, version), -1));
    for (int version : {-2, -1, 0, 3})
        EXPECT_FALSE(MetaDataReader<CursorImage>::IsSupportedVersion(headerOf(s_cursorImageUUID, version), -1));
}

TEST(SupportedVersions, AnExplicitVersionIsAcceptedHoweverNewOrOld) {
    EXPECT_TRUE(MetaDataReader<int>::IsSupportedVersion(headerOf(s_cursorImageUUID, 3), 3));
    EXPECT_TRUE(MetaDataReader<int>::IsSupportedVersion(headerOf(s_cursorLocationUUID, 0), 0));
    EXPECT_TRUE(MetaDataReader<int>::IsSupportedVersion(headerOf(s_cursorLocationUUID, -5), -5));
    EXPECT_TRUE(MetaDataReader<int>::IsSupportedVersion(headerOf(s_cursorImageUUID, 1), 2));
    EXPECT_FALSE(MetaDataReader<int>::IsSupportedVersion(headerOf(s_cursorLocationUUID, 0), 1));
    EXPECT_FALSE(MetaDataReader<int>::IsSupportedVersion(headerOf(s_cursorImageUUID, 3), 2));
}

TEST(SupportedVersions, AnUnknownKindIsNamedOncePerCheck) {
    CaptureStdout();
    EXPECT_FALSE(MetaDataReader<Point>::IsSupportedVersion(headerOf(uuid{}, 1), -1));
    EXPECT_EQ(GetCapturedStdout(), s_unknown);
    CaptureStdout();
    EXPECT_TRUE(MetaDataReader<Point>::IsSupportedVersion(headerOf(uuid{}, 1), 1));
    EXPECT_EQ(GetCapturedStdout(), s_unknown);
}

TEST(SupportedVersions, AnUnknownKindWithoutAPositiveVersionIsNotNamed) {
    CaptureStdout();
    EXPECT_FALSE(MetaDataReader<Point>::IsSupportedVersion(headerOf(uuid{}, 0), -1));
    EXPECT_EQ(GetCapturedStdout(), "");
}

TEST(StreamReader, DeliversEveryEntryInOrder) {
    Reading<Point> reading(s_locations + point(0.5, 1, 2) + point(0.25, 3, 4));
    reading.parse();
    EXPECT_EQ(reading.observer.times, (std::vector<double>{0.5, 0.25}));
    EXPECT_EQ(reading.observer.values, (std::vector<Point>{{1, 2}, {3, 4}}));
}

TEST(StreamReader, AHeaderAloneDeliversNothing) {
    Reading<Point> reading(s_locations);
    CaptureStdout();
    reading.parse();
    EXPECT_EQ(GetCapturedStdout(), "");
    EXPECT_TRUE(reading.observer.values.empty());
}

TEST(StreamReader, AHeaderCutShortDeliversNothing) {
    for (std::size_t size = 0; size < 24; ++size) {
        Reading<Point> reading(s_locations.substr(0, size));
        CaptureStdout();
        reading.parse(1);
        const bool versionIsThere = size >= 20;
        EXPECT_EQ(GetCapturedStdout(), versionIsThere ? "" : s_refused) << size;
        EXPECT_TRUE(reading.observer.values.empty()) << size;
    }
}

TEST(StreamReader, ARefusedVersionIsNamedAndDeliversNothing) {
    Reading<Point> reading(streamHeader("2b7b6af2", 2, 16) + point(0, 1, 2));
    CaptureStdout();
    reading.parse();
    EXPECT_EQ(GetCapturedStdout(), s_refused);
    EXPECT_TRUE(reading.observer.values.empty());
}

TEST(StreamReader, AnUnknownKindIsNamedInFrontOfTheRefusal) {
    Reading<Point> reading(std::string(16, '\0') + le32(1) + le32(16) + point(0, 1, 2));
    CaptureStdout();
    reading.parse();
    EXPECT_EQ(GetCapturedStdout(), std::string(s_unknown) + s_refused);
}

TEST(StreamReader, ReadsAnUnknownKindOfExactlyTheVersionAskedFor) {
    Reading<Point> reading(std::string(16, '\0') + le32(4) + le32(16) + point(0, 1, 2));
    CaptureStdout();
    reading.parse(4);
    EXPECT_EQ(GetCapturedStdout(), s_unknown);
    EXPECT_EQ(reading.observer.values, std::vector<Point>{Point(1, 2)});
}

TEST(StreamReader, AFileEndingInsideATimeThrowsAfterTheEntriesInFrontOfIt) {
    Reading<Point> reading(s_locations + point(1, 1, 1) + f64(2).substr(0, 4));
    try {
        reading.parse();
        FAIL() << "nothing was thrown";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "invalid meta data entry");
    }
    EXPECT_EQ(reading.observer.values.size(), 1U);
    EXPECT_TRUE(reading.stream.eof());
}

TEST(StreamReader, AFileEndingInsideAValueDeliversWhatIsThere) {
    Reading<Point> reading(s_locations + point(1, 1, 1) + point(2, 0x01020304, 5).substr(0, 10));
    reading.parse();
    EXPECT_EQ(reading.observer.values, (std::vector<Point>{{1, 1}, {0x0304, 0}}));
    EXPECT_EQ(reading.observer.times[1], 2);
    EXPECT_TRUE(reading.stream.eof());
}

TEST(StreamReader, AFileEndingBehindATimeDeliversTheDefaultValue) {
    Reading<double> reading(streamHeader("2b7b6af3", 1, 16) + f64(2));
    reading.parse();
    EXPECT_EQ(reading.observer.values, std::vector<double>{0});
}

TEST(StreamReader, ReadsOnlyItsStretchOfALongerFile) {
    const std::string rect = f64(1) + le32(1) + le32(2) + le32(3) + le32(4);
    Reading<Rect> reading(std::string(100, 'x') + streamHeader("2b7b6a09", 1, 24) + rect + rect + rect);
    reading.parse(100, 48);
    EXPECT_EQ(reading.observer.values, std::vector<Rect>{Rect(1, 2, 3, 4)});
}

TEST(StreamReader, AnEntryThatBeginsInFrontOfTheEndIsReadWhole) {
    Reading<Point> reading(s_locations + point(1, 1, 1) + point(2, 2, 2) + point(3, 3, 3));
    reading.parse(0, 24 + 16 + 1);
    EXPECT_EQ(reading.observer.values.size(), 2U);
}

TEST(StreamReader, ALengthThatWrapsAroundDeliversNothing) {
    Reading<Point> reading("0123456789" + s_locations + point(1, 1, 1));
    reading.parse(10, std::numeric_limits<std::uint64_t>::max() - 7);
    EXPECT_TRUE(reading.observer.values.empty());
}

TEST(StreamReader, ALengthBeyondTheFileEndsWithTheFile) {
    Reading<Point> reading(s_locations + point(1, 1, 1));
    reading.parse(0, std::uint64_t{1} << 62);
    EXPECT_EQ(reading.observer.values.size(), 1U);
}

TEST(StreamReader, AStartThatNoFilePositionHoldsDeliversNothing) {
    Reading<Point> reading(s_locations + point(1, 1, 1));
    CaptureStdout();
    reading.parse(std::numeric_limits<std::uint64_t>::max() - 100, 40);
    EXPECT_EQ(GetCapturedStdout(), s_refused);
    EXPECT_TRUE(reading.observer.values.empty());
}

TEST(StreamReader, TheSameStreamCanBeParsedAgain) {
    Reading<Point> reading(s_locations + point(1, 1, 1) + point(2, 2, 2));
    reading.parse();
    EXPECT_TRUE(reading.stream.eof());
    reading.parse();
    EXPECT_EQ(reading.observer.values.size(), 4U);
}

TEST(StreamReader, ClearsAFailedStateFirst) {
    Reading<Point> reading(s_locations + point(1, 1, 1));
    reading.stream.setstate(std::ios_base::failbit | std::ios_base::badbit);
    reading.parse();
    EXPECT_EQ(reading.observer.values.size(), 1U);
}

TEST(StreamReader, AnObserverEndsTheParseBehindItsEntry) {
    Reading<Point> reading(s_locations + point(1, 1, 1) + point(2, 2, 2) + point(3, 3, 3));
    reading.observer.limit = 2;
    reading.parse();
    EXPECT_EQ(reading.observer.values.size(), 2U);
    EXPECT_TRUE(reading.stream.good());
    EXPECT_EQ(reading.stream.tellg(), std::streampos(24 + 32));
}

TEST(StreamReader, WhatAnObserverThrowsReachesTheCaller) {
    struct Thrower : DataStreamObserver<Point> {
        bool dataRead(double, const Point&) override { throw std::logic_error("enough"); }
    } thrower;
    std::istringstream stream(s_locations + point(1, 1, 1) + point(2, 2, 2));
    EXPECT_THROW(MetaDataReader<Point>::parseStream(thrower, stream, 0, 56, -1), std::logic_error);
    EXPECT_EQ(stream.tellg(), std::streampos(24 + 16));
}

TEST(StreamReader, TheStreamStandsBehindEveryEntryWhileItIsDelivered) {
    struct Watcher : DataStreamObserver<Point> {
        explicit Watcher(std::istream& watched) : stream(watched) {}
        bool dataRead(double, const Point&) override {
            positions.push_back(stream.tellg());
            return true;
        }
        std::istream& stream;
        std::vector<std::streamoff> positions;
    };
    std::istringstream stream(s_locations + point(1, 1, 1) + point(2, 2, 2) + point(3, 3, 3));
    Watcher watcher(stream);
    MetaDataReader<Point>::parseStream(watcher, stream, 0, 72, -1);
    EXPECT_EQ(watcher.positions, (std::vector<std::streamoff>{40, 56, 72}));
}

TEST(StreamReader, SeesTheEndOfTheInputRightBehindTheLastEntry) {
    Reading<Point> reading(s_locations + point(1, 1, 1));
    reading.parse();
    EXPECT_TRUE(reading.stream.eof());
    EXPECT_FALSE(reading.stream.fail());
}

TEST(StringReader, ReadsTextsWithAnyBytes) {
    Reading<std::string> reading(s_titles + le32(11) + f64(1) + hex("61 00 ff") + le32(8) + f64(2));
    reading.parse();
    EXPECT_EQ(reading.observer.values, (std::vector<std::string>{std::string("a\0\xff", 3), ""}));
    EXPECT_EQ(reading.observer.times, (std::vector<double>{1, 2}));
}

TEST(StringReader, RepeatsTheLastCharacterForEveryMissingOne) {
    Reading<std::string> reading(s_titles + le32(8 + 6) + f64(1) + "abc");
    reading.parse();
    EXPECT_EQ(reading.observer.values, std::vector<std::string>{"abcccc"});
}

TEST(StringReader, FillsWithZerosWhereNoCharacterIsThere) {
    Reading<std::string> reading(s_titles + le32(8 + 3) + f64(1));
    reading.parse();
    EXPECT_EQ(reading.observer.values, std::vector<std::string>{std::string(3, '\0')});
}

TEST(StringReader, RepeatsTheLastCharacterOfALongTextToo) {
    Reading<std::string> reading(s_titles + le32(8 + 20000) + f64(1) + std::string(9999, 'a') + "z");
    reading.parse();
    EXPECT_EQ(reading.observer.values, std::vector<std::string>{std::string(9999, 'a') + std::string(10001, 'z')});
}

TEST(StringReader, ThrowsWhereTheSizeIsCutShort) {
    for (std::size_t size = 1; size < 4; ++size) {
        Reading<std::string> reading(s_titles + le32(9) + f64(1) + "a" + le32(9).substr(0, size));
        EXPECT_THROW(reading.parse(), std::runtime_error) << size;
        EXPECT_EQ(reading.observer.values, std::vector<std::string>{"a"});
    }
}

TEST(StringReader, AppendsToTheTextThatItIsGiven) {
    std::istringstream stream(le32(10) + f64(7) + "bc");
    double time = 0;
    std::string text = "a";
    metaDataRead(stream, &time, &text, 1);
    EXPECT_EQ(text, "abc");
    EXPECT_EQ(time, 7);
}

TEST(ListReader, DropsTheTimesOfItsElements) {
    Reading<std::list<std::string>> reading(s_systemData + le32(31) + le32(2) + le32(9) + f64(5) + "a" + le32(10) +
                                            f64(5) + "bc" + le32(4) + le32(0));
    reading.parse();
    EXPECT_EQ(reading.observer.times, (std::vector<double>{0, 0}));
    EXPECT_EQ(reading.observer.values, (std::vector<std::list<std::string>>{{"a", "bc"}, {}}));
}

TEST(ListReader, BelievesTheCountAndNotTheTotal) {
    Reading<std::list<std::string>> reading(s_systemData + le32(999) + le32(1) + le32(9) + f64(5) + "a");
    reading.parse();
    EXPECT_EQ(reading.observer.values, (std::vector<std::list<std::string>>{{"a"}}));
}

TEST(ListReader, ThrowsWhereAnElementIsMissing) {
    Reading<std::list<std::string>> reading(s_systemData + le32(31) + le32(0xffffffff) + le32(9) + f64(5) + "a");
    EXPECT_THROW(reading.parse(), std::runtime_error);
}

TEST(ListReader, DeliversAListWhoseLastElementIsCutShort) {
    Reading<std::list<std::string>> reading(s_systemData + le32(18) + le32(1) + le32(12) + f64(5) + "ab");
    reading.parse();
    EXPECT_EQ(reading.observer.values, (std::vector<std::list<std::string>>{{"abbb"}}));
}

TEST(ListReader, ThrowsWhereTheTotalIsCutShort) {
    Reading<std::list<std::string>> reading(s_systemData + le32(4) + le32(0) + "xy");
    EXPECT_THROW(reading.parse(), std::runtime_error);
    EXPECT_EQ(reading.observer.values.size(), 1U);
}

TEST(CursorImageReading, AVersionWithoutFieldsDeliversOneEntryAndEnds) {
    Reading<CursorImage> reading(streamHeader("2b7b6af1", 0, 0) + std::string(100, 'x'));
    reading.parse(0);
    EXPECT_EQ(reading.observer.values, std::vector<CursorImage>(1));
}

TEST(EntryReader, ReadsOneEntryAtThePositionOfTheStream) {
    std::istringstream stream("skip" + point(1.5, 7, 8) + "rest");
    stream.seekg(4);
    double time = 0;
    Point value;
    metaDataRead(stream, &time, &value, 1);
    EXPECT_EQ(time, 1.5);
    EXPECT_EQ(value, Point(7, 8));
    EXPECT_EQ(stream.tellg(), std::streampos(20));
}

TEST(EntryReader, KeepsWhatTheInputDoesNotReplace) {
    std::istringstream stream(point(1.5, 7, 8).substr(0, 12));
    double time = 0;
    Point value(1, 2);
    metaDataRead(stream, &time, &value, 1);
    EXPECT_EQ(value, Point(7, 2));
}

} // namespace

} // namespace ZULMetaData
