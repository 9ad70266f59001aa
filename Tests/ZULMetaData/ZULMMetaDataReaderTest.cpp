// Which streams are read, which of their entries, and what is made of damage.

#include "ZULMetaData/ZULMMetaDataReader.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/Support/MemoryWatch.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "Tests/ZULMetaData/ReadStream.h"
#include "Tests/ZULMetaData/StandardOutput.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <bit>
#include <cstddef>
#include <cstdint>
#include <fstream>
#include <limits>
#include <list>
#include <new>
#include <sstream>
#include <stdexcept>
#include <streambuf>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

using Texts = std::list<std::string>;

const std::string s_refused = "MetaDataReader<T>::parseFile - Version is larger than what we can handle\n";
const std::string s_unknown =
    "MetaDataUUID::currentVersionForUUID - unsupported UUID = 00000000-0000-0000-0000-000000000000\n";

constexpr const char* s_invalidEntry = "invalid meta data entry";

// ---- Supported versions ---------------------------------------------------------------------------------------

template <class T = Point>
bool isSupported(const uuid& type, std::int32_t streamVersion, int version) {
    return MetaDataReader<T>::IsSupportedVersion(MetaDataHeader{type, streamVersion, 0}, version);
}

TEST(SupportedVersion, IsAnyUpToTheCurrentOneWhereNoneIsAskedFor) {
    EXPECT_TRUE(isSupported(s_cursorImageUUID, 1, -1));
    EXPECT_TRUE(isSupported(s_cursorImageUUID, 2, -1));
    EXPECT_FALSE(isSupported(s_cursorImageUUID, 3, -1));
    EXPECT_TRUE(isSupported(s_cursorLocationUUID, 1, -1));
    EXPECT_FALSE(isSupported(s_cursorLocationUUID, 2, -1));
}

TEST(SupportedVersion, IsNeverBelowOneWhereNoneIsAskedFor) {
    for (const std::int32_t version : {0, -1, -2, std::numeric_limits<std::int32_t>::min()})
        EXPECT_FALSE(isSupported(s_cursorLocationUUID, version, -1)) << version;
}

TEST(SupportedVersion, IsAlsoExactlyTheOneAskedFor) {
    EXPECT_TRUE(isSupported(s_cursorImageUUID, 3, 3));
    EXPECT_TRUE(isSupported(s_cursorLocationUUID, 0, 0));
    EXPECT_TRUE(isSupported(s_cursorLocationUUID, -5, -5));
    EXPECT_TRUE(isSupported(s_cursorLocationUUID, 2147483647, 2147483647));
}

TEST(SupportedVersion, IsNoOtherThanTheOneAskedFor) {
    EXPECT_FALSE(isSupported(s_cursorImageUUID, 3, 2));
    EXPECT_FALSE(isSupported(s_cursorImageUUID, 3, 4));
    EXPECT_FALSE(isSupported(s_cursorLocationUUID, 0, 1));
    EXPECT_FALSE(isSupported(s_cursorLocationUUID, -5, 5));
}

TEST(SupportedVersion, IsStillAnyUpToTheCurrentOneWhereAnotherIsAskedFor) {
    EXPECT_TRUE(isSupported(s_cursorImageUUID, 1, 2));
    EXPECT_TRUE(isSupported(s_cursorImageUUID, 2, 1));
    EXPECT_TRUE(isSupported(s_cursorImageUUID, 2, 100));
}

TEST(SupportedVersion, OfAnUnknownKindIsOnlyTheOneAskedForAndTheKindIsReportedEachTime) {
    EXPECT_EQ(printedBy([] { EXPECT_FALSE(isSupported(uuid{}, 1, -1)); }), s_unknown);
    EXPECT_EQ(printedBy([] { EXPECT_FALSE(isSupported(uuid{}, 1, 2)); }), s_unknown);
    EXPECT_EQ(printedBy([] { EXPECT_TRUE(isSupported(uuid{}, 1, 1)); }), s_unknown);
}

TEST(SupportedVersion, BelowOneOfAnUnknownKindIsNotReported) {
    EXPECT_EQ(printedBy([] { EXPECT_FALSE(isSupported(uuid{}, 0, -1)); }), "");
    EXPECT_EQ(printedBy([] { EXPECT_FALSE(isSupported(uuid{}, -1, -1)); }), "");
    EXPECT_EQ(printedBy([] { EXPECT_TRUE(isSupported(uuid{}, 0, 0)); }), "");
}

template <class... Types>
void expectTheSameRuleForEvery() {
    EXPECT_TRUE((isSupported<Types>(s_cursorImageUUID, 2, -1) && ...));
    EXPECT_TRUE((isSupported<Types>(s_cursorImageUUID, 3, 3) && ...));
    EXPECT_FALSE((isSupported<Types>(s_cursorImageUUID, 3, -1) || ...));
    EXPECT_FALSE((isSupported<Types>(s_cursorImageUUID, 3, 2) || ...));
}

TEST(SupportedVersion, DoesNotDependOnTheValueType) {
    expectTheSameRuleForEvery<Point, Rect, KeyStroke, int, float, double, std::string, Texts, CursorImage>();
}

// ---- Streams of points ----------------------------------------------------------------------------------------

/// Points whose coordinates number the entries: (1,1), (2,2) and so on.
class StreamReader : public testing::Test {
protected:
    const std::string header = streamHeader("2b7b6af2", 1, 16);
    Entries<Point> points;
    std::istringstream stream;

    static std::string entry(std::int32_t number) { return pointEntry(number * 0.5, number, number); }

    std::string threePoints() const { return header + entry(1) + entry(2) + entry(3); }

    void parseStretch(std::uint64_t start, std::uint64_t length, int version = -1) {
        MetaDataReader<Point>::parseStream(points, stream, start, length, version);
    }

    /// From the first byte to the last.
    void parse(const std::string& bytes, int version = -1) {
        stream.str(bytes);
        parseStretch(0, bytes.size(), version);
    }

    /// Where whoever reads on would do so. Asking takes a stream that has not failed.
    std::streamoff position() {
        stream.clear();
        return stream.tellg();
    }
};

TEST_F(StreamReader, DeliversEveryEntryInOrder) {
    parse(threePoints());
    EXPECT_THAT(points.times, ElementsAre(0.5, 1.0, 1.5));
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(2, 2), Point(3, 3)));
}

TEST_F(StreamReader, DeliversNothingOfAHeaderAlone) {
    EXPECT_EQ(printedBy([this] { parse(header); }), "");
    EXPECT_THAT(points.values, IsEmpty());
}

TEST_F(StreamReader, DoesNotNeedTheEntrySizeOfTheHeader) {
    for (const std::uint32_t size : {0U, 1U, 24U, 0xffffffffU})
        parse(streamHeader("2b7b6af2", 1, size) + entry(1));
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(1, 1), Point(1, 1), Point(1, 1)));
}

TEST_F(StreamReader, DoesNotNeedTheKindOfItsValues) {
    parse(streamHeader("2b7b6af1", 2, 0) + entry(1));
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1)));
}

// ---- Headers --------------------------------------------------------------------------------------------------

TEST_F(StreamReader, RefusesALaterVersionWithOneLine) {
    EXPECT_EQ(printedBy([this] { parse(streamHeader("2b7b6af2", 2, 16) + entry(1)); }), s_refused);
    EXPECT_THAT(points.values, IsEmpty());
}

TEST_F(StreamReader, RefusesAVersionBelowOneWithTheSameLine) {
    EXPECT_EQ(printedBy([this] { parse(streamHeader("2b7b6af2", 0, 16) + entry(1)); }), s_refused);
    EXPECT_EQ(printedBy([this] { parse(streamHeader("2b7b6af2", -1, 16) + entry(1)); }), s_refused);
    EXPECT_EQ(printedBy([this] { parse(streamHeader("2b7b6af2", 0, 16) + entry(1), 1); }), s_refused);
    EXPECT_THAT(points.values, IsEmpty());
}

TEST_F(StreamReader, ReadsAnyVersionThatIsAskedFor) {
    parse(streamHeader("2b7b6af2", 2, 16) + entry(1), 2);
    parse(streamHeader("2b7b6af2", 0, 16) + entry(2), 0);
    parse(streamHeader("2b7b6af2", -7, 16) + entry(3), -7);
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(2, 2), Point(3, 3)));
}

TEST_F(StreamReader, ReportsAnUnknownKindInFrontOfItsRefusal) {
    const std::string unknown = std::string(16, '\0') + hex("01000000 10000000") + entry(1);
    EXPECT_EQ(printedBy([&] { parse(unknown); }), s_unknown + s_refused);
    EXPECT_THAT(points.values, IsEmpty());
}

TEST_F(StreamReader, ReadsAnUnknownKindOfTheVersionAskedFor) {
    const std::string unknown = std::string(16, '\0') + hex("01000000 10000000") + entry(1);
    EXPECT_EQ(printedBy([&] { parse(unknown, 1); }), s_unknown);
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1)));
}

TEST_F(StreamReader, RefusesInTheSameWordsForEveryValueType) {
    const std::string bytes = streamHeader("2b7b6af1", 3, 0) + "entries";
    EXPECT_EQ(printedBy([&] { readStream<std::string>(bytes); }), s_refused);
    EXPECT_EQ(printedBy([&] { readStream<Texts>(bytes); }), s_refused);
    EXPECT_EQ(printedBy([&] { readStream<CursorImage>(bytes); }), s_refused);
    EXPECT_EQ(printedBy([&] { readStream<double>(bytes); }), s_refused);
}

TEST_F(StreamReader, DoesNotFlushItsRefusal) {
    FlushCounter output;
    parse(streamHeader("2b7b6af2", 2, 16));
    EXPECT_EQ(output.str(), s_refused);
    EXPECT_EQ(output.flushes(), 0);
}

TEST_F(StreamReader, RefusesAHeaderThatEndsInFrontOfItsVersion) {
    for (std::size_t size = 0; size < 20; ++size)
        EXPECT_EQ(printedBy([&] { parse(header.substr(0, size)); }), s_refused) << size;
    EXPECT_THAT(points.values, IsEmpty());
}

TEST_F(StreamReader, StopsSilentlyWhereAHeaderEndsBehindItsVersion) {
    for (std::size_t size = 20; size < 24; ++size)
        EXPECT_EQ(printedBy([&] { parse(header.substr(0, size)); }), "") << size;
    EXPECT_THAT(points.values, IsEmpty());
}

TEST_F(StreamReader, RefusesAStartBehindTheEndOfTheInput) {
    stream.str(threePoints());
    EXPECT_EQ(printedBy([this] { parseStretch(1000, 72); }), s_refused);
    EXPECT_THAT(points.values, IsEmpty());
}

TEST_F(StreamReader, RefusesAStartBeyondEveryPosition) {
    stream.str(threePoints());
    EXPECT_EQ(printedBy([this] { parseStretch(0xffffffffffffff00, 72); }), s_refused);
    EXPECT_THAT(points.values, IsEmpty());
}

// ---- Where a stream ends --------------------------------------------------------------------------------------

TEST_F(StreamReader, ReadsOnlyItsStretchOfAContainer) {
    const std::string rects = streamHeader("2b7b6a09", 1, 24) + f64(0.5) + raw(1) + raw(2) + raw(3) + raw(4);
    std::istringstream container(std::string(100, 'x') + rects + rects.substr(24) + "more");
    Entries<Rect> entries;
    MetaDataReader<Rect>::parseStream(entries, container, 100, 48, -1);
    EXPECT_THAT(entries.values, ElementsAre(Rect(1, 2, 3, 4)));
}

TEST_F(StreamReader, DoesNotBeginAnEntryAtTheEndOrBehindIt) {
    stream.str(threePoints());
    parseStretch(0, 24 + 2 * 16);
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(2, 2)));
}

TEST_F(StreamReader, EntryThatBeginsBeforeTheEndIsReadWhole) {
    stream.str(threePoints());
    parseStretch(0, 24 + 16 + 1);
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(2, 2)));
}

TEST_F(StreamReader, ReadsTheHeaderWhateverItsLengthIsButNoEntryInsideIt) {
    for (const std::uint64_t length : {0U, 1U, 23U, 24U}) {
        stream.str(threePoints());
        EXPECT_EQ(printedBy([&] { parseStretch(0, length); }), "") << length;
        stream.str(streamHeader("2b7b6af2", 2, 16));
        EXPECT_EQ(printedBy([&] { parseStretch(0, length); }), s_refused) << length;
    }
    EXPECT_THAT(points.values, IsEmpty());
}

TEST_F(StreamReader, ReadsAnEntryWhereTheLengthHasOneByteOfIt) {
    stream.str(threePoints());
    parseStretch(0, 25);
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1)));
}

TEST_F(StreamReader, EndsWithTheInputWhereItsLengthGoesBeyond) {
    stream.str(threePoints());
    parseStretch(0, 0x7fffffffffffffff);
    EXPECT_EQ(points.values.size(), 3U);
}

TEST_F(StreamReader, EndsAtOnceWhereItsEndWrapsAround) {
    stream.str("0123456789" + threePoints());
    parseStretch(10, 0xfffffffffffffff8);
    EXPECT_THAT(points.values, IsEmpty());
}

TEST_F(StreamReader, TakesTheInputForCutWhereItsLengthPromisesEntriesBehindABareHeader) {
    stream.str(header);
    EXPECT_THROW(parseStretch(0, 40), std::runtime_error);
}

TEST_F(StreamReader, ReadsStreamsBeyondFourGiB) {
    constexpr std::uint64_t start = 5ULL << 30;
    const TemporaryFolder folder;
    writeSparseFile(folder / "Movie.mov", start + threePoints().size(), "", threePoints());
    std::ifstream movie(folder / "Movie.mov", std::ios_base::binary);
    MetaDataReader<Point>::parseStream(points, movie, start, 72, -1);
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(2, 2), Point(3, 3)));
}

// ---- The state of the input -----------------------------------------------------------------------------------

TEST_F(StreamReader, DeliversTheSameTwiceInARow) {
    stream.str(threePoints());
    parseStretch(0, 72);
    parseStretch(0, 72);
    EXPECT_THAT(points.times, ElementsAre(0.5, 1.0, 1.5, 0.5, 1.0, 1.5));
    EXPECT_EQ(points.values.size(), 6U);
}

TEST_F(StreamReader, ClearsWhateverStateTheInputIsIn) {
    for (const auto state : {std::ios_base::eofbit, std::ios_base::failbit, std::ios_base::badbit}) {
        stream.str(header + entry(1));
        stream.setstate(state);
        parseStretch(0, 40);
    }
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(1, 1), Point(1, 1)));
}

TEST_F(StreamReader, ReadsSeveralStreamsOfOneInput) {
    stream.str(header + entry(1) + header + entry(2));
    parseStretch(40, 40);
    parseStretch(0, 40);
    EXPECT_THAT(points.values, ElementsAre(Point(2, 2), Point(1, 1)));
}

TEST_F(StreamReader, ReportsTheEndOfTheInputBehindTheLastEntry) {
    parse(threePoints());
    EXPECT_TRUE(stream.eof());
    EXPECT_FALSE(stream.fail());
    EXPECT_EQ(position(), 72);
}

TEST_F(StreamReader, LeavesAnInputThatGoesOnBehindTheLastEntry) {
    stream.str(threePoints() + "more");
    parseStretch(0, 72);
    EXPECT_TRUE(stream.good());
    EXPECT_EQ(position(), 72);
}

// ---- Observers ------------------------------------------------------------------------------------------------

TEST_F(StreamReader, StopsWhereTheObserverHasEnough) {
    points.limit = 2;
    parse(threePoints());
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(2, 2)));
    EXPECT_TRUE(stream.good());
    EXPECT_EQ(position(), 56);
}

TEST_F(StreamReader, DoesNotLookBehindTheEntryThatWasEnough) {
    points.limit = 3;
    parse(threePoints());
    EXPECT_TRUE(stream.good());
    EXPECT_EQ(position(), 72);
}

TEST_F(StreamReader, DoesNotTouchDamageBehindTheEntryThatWasEnough) {
    points.limit = 1;
    parse(header + entry(1) + "torn");
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1)));
}

TEST_F(StreamReader, LetsExceptionsOfTheObserverThrough) {
    struct Thrower final : DataStreamObserver<Point> {
        bool dataRead(double, const Point& point) override {
            return point.x < 2 ? true : throw std::logic_error("enough");
        }
    } thrower;
    stream.str(threePoints());
    EXPECT_THROW(MetaDataReader<Point>::parseStream(thrower, stream, 0, 72, -1), std::logic_error);
    EXPECT_EQ(position(), 56);
    parseStretch(0, 72);
    EXPECT_EQ(points.values.size(), 3U);
}

TEST_F(StreamReader, StandsBehindAnEntryWhileItIsDelivered) {
    struct Witness final : DataStreamObserver<Point> {
        explicit Witness(std::istream& in) : input(in) {}
        bool dataRead(double, const Point&) override {
            positions.push_back(input.tellg());
            return true;
        }
        std::istream& input;
        std::vector<std::streamoff> positions;
    } witness(stream);
    stream.str(threePoints());
    MetaDataReader<Point>::parseStream(witness, stream, 0, 72, -1);
    EXPECT_THAT(witness.positions, ElementsAre(40, 56, 72));
}

// ---- Entries that are cut short -------------------------------------------------------------------------------

TEST_F(StreamReader, ThrowsInsideATimeBehindTheEntriesBefore) {
    EXPECT_THROW(parse(header + entry(1) + entry(2) + entry(3).substr(0, 4)), std::runtime_error);
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(2, 2)));
    EXPECT_TRUE(stream.eof());
}

TEST_F(StreamReader, SaysThatTheEntryIsInvalid) {
    const Reading reading = readStream<Point>(header + "torn");
    EXPECT_EQ(reading.error, "invalid meta data entry");
}

TEST_F(StreamReader, DeliversAValueCutShortWithZerosForTheRest) {
    parse(header + entry(1) + f64(1.0) + hex("0a0b0c0d 1e"));
    EXPECT_THAT(points.values, ElementsAre(Point(1, 1), Point(0x0d0c0b0a, 0x1e)));
    EXPECT_THAT(points.times, ElementsAre(0.5, 1.0));
    EXPECT_TRUE(stream.eof());
}

TEST_F(StreamReader, DeliversATimeWithoutAValue) {
    parse(header + f64(1.0));
    EXPECT_THAT(points.values, ElementsAre(Point(0, 0)));
    EXPECT_THAT(points.times, ElementsAre(1.0));
}

/// A device that fails behind its last byte instead of ending there.
class BrokenBuffer : public std::stringbuf {
public:
    using std::stringbuf::stringbuf;

protected:
    int_type underflow() override { throw std::runtime_error("device failed"); }
};

TEST_F(StreamReader, TakesADeviceThatFailsForOneThatEnds) {
    BrokenBuffer buffer(header + entry(1) + "torn");
    std::istream broken(&buffer);
    const Reading reading = readStream<Point>(broken, 0, 56);
    EXPECT_EQ(reading.entries.size(), 1U);
    EXPECT_EQ(reading.error, s_invalidEntry);
}

// ---- One entry ------------------------------------------------------------------------------------------------

template <class T>
struct Entry {
    double time = -1.0;
    T value{};
    std::string error;

    /// Reads the first of these bytes.
    explicit Entry(const std::string& bytes, T before = T()) : value(before) {
        std::istringstream stream(bytes);
        try {
            metaDataRead<T>(stream, &time, &value, 1);
        } catch (const std::runtime_error& exception) {
            error = exception.what();
        }
    }
};

TEST(EntryReader, BeginsAtThePositionOfTheInputAndStopsBehindTheEntry) {
    std::istringstream stream("front" + pointEntry(1.5, 10, -4) + "behind");
    stream.seekg(5);
    double time = 0;
    Point point;
    metaDataRead<Point>(stream, &time, &point, 1);
    EXPECT_EQ(time, 1.5);
    EXPECT_EQ(point, Point(10, -4));
    EXPECT_EQ(stream.tellg(), 21);
}

TEST(EntryReader, KeepsWhatAValueHeldBehindTheCut) {
    EXPECT_EQ(Entry<Point>(pointEntry(1.5, 10, -4).substr(0, 12), Point(1, 2)).value, Point(10, 2));
}

TEST(EntryReader, ThrowsWithoutAWholeTime) {
    for (std::size_t size = 0; size < 8; ++size)
        EXPECT_EQ(Entry<double>(f64(0.25).substr(0, size)).error, s_invalidEntry) << size;
}

// ---- Texts ----------------------------------------------------------------------------------------------------

TEST(TextReader, ReadsAnyBytes) {
    const Entry<std::string> entry(hex("0e000000 0000000000001440 000aff0dc3bc"));
    EXPECT_EQ(entry.time, 5.0);
    EXPECT_EQ(entry.value, std::string("\0\n\xff\r\xc3\xbc", 6));
}

TEST(TextReader, ReadsAnEmptyText) {
    const Entry<std::string> entry(hex("08000000 0000000000001440") + "behind");
    EXPECT_EQ(entry.time, 5.0);
    EXPECT_EQ(entry.value, "");
}

TEST(TextReader, AppendsToTheTextThatWasThere) {
    EXPECT_EQ(Entry<std::string>(textEntry(5.0, "bc"), "a").value, "abc");
}

TEST(TextReader, RepeatsTheLastCharacterForThoseThatAreMissing) {
    EXPECT_EQ(Entry<std::string>(hex("12000000 0000000000001440") + "abc").value, "abcccccccc");
}

TEST(TextReader, RepeatsTheLastCharacterWhereverALongTextIsCut) {
    const std::string whole = std::string(5000, 'x') + std::string(5000, 'y');
    for (const std::size_t size : {1U, 4095U, 4096U, 4097U, 5001U, 8191U, 8192U, 8193U, 9999U}) {
        const std::string bytes = textEntry(5.0, whole).substr(0, 12 + size);
        const std::string text = whole.substr(0, size) + std::string(10000 - size, size > 5000 ? 'y' : 'x');
        EXPECT_TRUE(Entry<std::string>(bytes).value == text) << size;
    }
}

TEST(TextReader, RepeatsNothingOfTheTextThatWasThere) {
    EXPECT_EQ(Entry<std::string>(hex("0a000000 0000000000001440"), "a").value, std::string("a\0\0", 3));
}

TEST(TextReader, FillsATextWithZerosOfWhichNoCharacterIsThere) {
    EXPECT_EQ(Entry<std::string>(hex("0b000000 0000000000001440")).value, std::string(3, '\0'));
    EXPECT_EQ(Entry<std::string>(hex("0b000000")).value, std::string(3, '\0'));
}

TEST(TextReader, KeepsWhatATimeHeldBehindTheCut) {
    EXPECT_EQ(Entry<std::string>(hex("08000000") + hex("000000000000 00")).time,
              std::bit_cast<double>(0xbf00000000000000));
}

TEST(TextReader, ThrowsWithoutAWholeSize) {
    for (std::size_t size = 0; size < 4; ++size)
        EXPECT_EQ(Entry<std::string>(hex("080000").substr(0, size)).error, s_invalidEntry) << size;
}

TEST(TextReader, WrapsASizeBelowThatOfTheTimeAround) {
    for (std::uint32_t size = 0; size < 8; ++size) {
        MemoryWatch memory;
        memory.refuseAbove(1U << 30);
        EXPECT_THROW(Entry<std::string>(le32(size) + f64(5.0) + "abc"), std::bad_alloc) << size;
        EXPECT_GE(memory.largestRequest(), 0x100000000 + size - 8) << size;
        EXPECT_LT(memory.largestRequest(), 0x100000000 + 64) << size;
    }
}

TEST(TextReader, AsksForLittleMoreMemoryThanThereIsInputUntilItEnds) {
    MemoryWatch memory;
    memory.refuseAbove(1U << 20);
    EXPECT_THROW(Entry<std::string>(hex("ffffff7f 0000000000001440") + std::string(100000, 'x')), std::bad_alloc);
    EXPECT_GE(memory.largestRequest(), 0x7ffffff7U);
}

TEST(TextReader, ReadsTheNextEntryBehindTheText) {
    const std::string header = streamHeader("2b7b6af9", 1, 0);
    const Reading reading = readStream<std::string>(header + textEntry(0.25, "a") +
                                                    textEntry(0.25, std::string(9000, 'x')) + textEntry(0.25, "bc"));
    EXPECT_THAT(reading.entries,
                ElementsAre("000000000000d03f \"a\"", "000000000000d03f \"" + std::string(9000, 'x') + '"',
                            "000000000000d03f \"bc\""));
}

// ---- Lists of texts -------------------------------------------------------------------------------------------

/// The list "a", "bc" at time 5.
const std::string s_list = hex("1f000000 02000000 09000000 0000000000001440 61 0a000000 0000000000001440 6263");

TEST(ListReader, DeliversAListAtTimeZero) {
    Entries<Texts> lists;
    std::istringstream stream(streamHeader("2b7b6afc", 1, 0) + s_list + s_list);
    MetaDataReader<Texts>::parseStream(lists, stream, 0, 24 + 2 * s_list.size(), -1);
    EXPECT_THAT(lists.times, ElementsAre(0.0, 0.0));
    EXPECT_THAT(lists.values, Each(Texts{"a", "bc"}));
}

TEST(ListReader, ReadsOnlyTheListsOfItsStretch) {
    std::istringstream container(streamHeader("2b7b6afc", 1, 0) + s_list + s_list + s_list);
    EXPECT_THAT(readStream<Texts>(container, 0, 24 + 2 * s_list.size()).entries, SizeIs(2));
}

TEST(ListReader, LeavesTheTimeAlone) {
    const Entry<Texts> entry(s_list);
    EXPECT_EQ(entry.time, -1.0);
    EXPECT_EQ(entry.value, (Texts{"a", "bc"}));
}

TEST(ListReader, AppendsToTheListThatWasThere) {
    EXPECT_EQ(Entry<Texts>(s_list, {"before"}).value, (Texts{"before", "a", "bc"}));
}

TEST(ListReader, DoesNotNeedTheTotal) {
    for (const std::uint32_t total : {0U, 4U, 0xffffffffU})
        EXPECT_EQ(Entry<Texts>(le32(total) + s_list.substr(4)).value, (Texts{"a", "bc"})) << total;
}

TEST(ListReader, ReadsAsManyTextsAsAreCounted) {
    EXPECT_EQ(Entry<Texts>(hex("1f000000 01000000") + s_list.substr(8)).value, (Texts{"a"}));
    EXPECT_EQ(Entry<Texts>(hex("1f000000 00000000") + s_list.substr(8)).value, Texts());
}

TEST(ListReader, TakesAMissingCountForNone) {
    const Entry<Texts> entry(hex("1f000000"));
    EXPECT_EQ(entry.error, "");
    EXPECT_EQ(entry.value, Texts());
}

TEST(ListReader, ThrowsWithoutAWholeTotal) {
    for (std::size_t size = 0; size < 4; ++size)
        EXPECT_EQ(Entry<Texts>(s_list.substr(0, size)).error, s_invalidEntry) << size;
}

TEST(ListReader, ThrowsWhereACountedTextHasNoWholeSize) {
    for (const std::size_t size : {5U, 7U, 8U, 11U, 20U, 21U, 24U})
        EXPECT_EQ(Entry<Texts>(s_list.substr(0, size)).error, s_invalidEntry) << size;
}

TEST(ListReader, ThrowsWhereFewerTextsAreThereThanCounted) {
    EXPECT_EQ(Entry<Texts>(hex("1f000000 03000000") + s_list.substr(8)).error, s_invalidEntry);
    EXPECT_EQ(Entry<Texts>(hex("1f000000 ffffffff") + s_list.substr(8)).error, s_invalidEntry);
}

TEST(ListReader, DeliversItsLastTextCutShort) {
    EXPECT_EQ(Entry<Texts>(s_list.substr(0, s_list.size() - 1)).value, (Texts{"a", "bb"}));
    EXPECT_EQ(Entry<Texts>(s_list.substr(0, s_list.size() - 2)).value, (Texts{"a", std::string(2, '\0')}));
}

// ---- Cursor images --------------------------------------------------------------------------------------------

TEST(CursorImageStream, IsReadInTheVersionOfItsHeaderWhateverIsAskedFor) {
    const std::string entry = hex("1d000000 000000000000d03f 0700000000000000 09000000 03000000 feffffff 21");
    for (const int version : {-1, 1, 2})
        EXPECT_THAT(readStream<CursorImage>(streamHeader("2b7b6af1", 1, 0) + entry, version).entries,
                    ElementsAre("000000000000d03f id 7, hotspot 3 -2, type -1, flags 3, 1 bytes 21"))
            << version;
}

TEST(CursorImageStream, OfAVersionWithoutFieldsDeliversOneEntryAndEnds) {
    for (const int version : {0, -2, 100}) {
        const std::string header = streamHeader("2b7b6af1", version, 0);
        EXPECT_THAT(readStream<CursorImage>(header + std::string(100, 'x'), version).entries,
                    ElementsAre("0000000000000000 id 0, hotspot 0 0, type -1, flags 3, no image"))
            << version;
        EXPECT_THAT(readStream<CursorImage>(header, version).entries, IsEmpty()) << version;
    }
}

} // namespace

} // namespace ZULMetaData::Test
