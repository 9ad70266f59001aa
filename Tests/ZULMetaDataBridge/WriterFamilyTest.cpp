#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "Tests/ZULMetaDataBridge/StreamFixture.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <memory>
#include <new>
#include <string>

namespace ZULMetaData::Test {

namespace {

constexpr double s_infinity = std::numeric_limits<double>::infinity();
constexpr double s_notANumber = std::numeric_limits<double>::quiet_NaN();

// ---- What becomes of values and times -------------------------------------------------------------------------

class Conversions : public StreamFixture {
protected:
    template <class R>
    std::string storedRect(const R& rect) const {
        TopmostWindowMetaDataWriter writer(file);
        writer.write(rect, {1, 1});
        return storedEntries().substr(8);
    }

    template <class P>
    std::string storedPoint(const P& point) const {
        ScrollActionMetaDataWriter writer(file);
        writer.write(point, {1, 1});
        return storedEntries().substr(8);
    }

    template <class T>
    std::string storedTime(const T& time) const {
        CPUUsageMetaDataWriter writer(file);
        writer.write(1, time);
        return storedEntries().substr(0, 8);
    }

    std::string storedText(const char* text) const {
        SlideInfoTextMetaDataWriter writer(file);
        writer.write(text, {1, 4});
        return storedEntries();
    }
};

TEST_F(Conversions, CutTheFractionOffARectangle) {
    EXPECT_EQ(storedRect(ScreenRect(10.9, -3.7, 100.5, 50.99)), hex("0a000000 fdffffff 64000000 32000000"));
    EXPECT_EQ(storedRect(ScreenRect(-0.99, 0.99, -1.0, -1.99)), hex("00000000 00000000 ffffffff ffffffff"));
}

TEST_F(Conversions, CutTheFractionOffAPoint) {
    EXPECT_EQ(storedPoint(ScreenPoint(10.9, -3.7)), hex("0a000000 fdffffff"));
}

TEST_F(Conversions, KeepCoordinatesWithin32Bits) {
    EXPECT_EQ(storedRect(ScreenRect(2147483647.9, -2147483648.9, 3e9, -1e300)),
              hex("ffffff7f 00000080 ffffff7f 00000080"));
    EXPECT_EQ(storedRect(ScreenRect(2147483646.5, -2147483647.5, s_infinity, -s_infinity)),
              hex("feffff7f 01000080 ffffff7f 00000080"));
}

TEST_F(Conversions, MakeZeroOfACoordinateThatIsNotANumber) {
    EXPECT_EQ(storedPoint(ScreenPoint(s_notANumber, -s_notANumber)), hex("00000000 00000000"));
}

TEST_F(Conversions, DivideATimeByItsTimescale) {
    EXPECT_EQ(storedTime(MediaTime(1001, 30000)), hex("7240388c6f15a13f"));
    EXPECT_EQ(storedTime(MediaTime(1, 3)), hex("555555555555d53f"));
    EXPECT_EQ(storedTime(MediaTime(-1, 2)), hex("000000000000e0bf"));
    EXPECT_EQ(storedTime(MediaTime(1, -2)), hex("000000000000e0bf"));
    EXPECT_EQ(storedTime(MediaTime(9007199254740993, 1)), hex("0000000000004043"));
}

TEST_F(Conversions, StoreAnInfiniteTimeForATimescaleOfZero) {
    EXPECT_EQ(storedTime(MediaTime(1, 0)), hex("000000000000f07f"));
    EXPECT_EQ(storedTime(MediaTime(-1, 0)), hex("000000000000f0ff"));
}

TEST_F(Conversions, StoreATimeThatIsNotANumberForNothingOverNothing) {
    const std::string bytes = storedTime(MediaTime(0, 0));
    double seconds = 0;
    std::memcpy(&seconds, bytes.data(), sizeof seconds);
    EXPECT_TRUE(std::isnan(seconds));
    EXPECT_EQ(storedEntries().substr(8), hex("0000803f"));
}

TEST_F(Conversions, IgnoreFlagsAndEpochOfATime) {
    EXPECT_EQ(storedTime(MediaTime(1, 4, 0, 0)), hex("000000000000d03f"));
    EXPECT_EQ(storedTime(MediaTime(1, 4, 0xffffffff, -7)), hex("000000000000d03f"));
}

namespace Platform {

struct Point {
    double x, y;
};
struct Size {
    double width, height;
};
struct Rect {
    Point origin;
    Size size;
};
struct Time {
    std::int64_t value;
    std::int32_t timescale;
    std::uint32_t flags;
    std::int64_t epoch;
};

} // namespace Platform

TEST_F(Conversions, TakeThePlatformsOwnRecords) {
    EXPECT_EQ(storedRect(Platform::Rect{{10.9, -3.7}, {100.5, 50.99}}), hex("0a000000 fdffffff 64000000 32000000"));
    EXPECT_EQ(storedPoint(Platform::Point{10.9, -3.7}), hex("0a000000 fdffffff"));
    EXPECT_EQ(storedTime(Platform::Time{1001, 30000, 1, 2}), hex("7240388c6f15a13f"));
}

TEST_F(Conversions, LeaveFloatingPointValuesAsTheyAre) {
    CPUUsageMetaDataWriter usage(file);
    usage.write(-0.0F, {0, 1});
    usage.write(std::numeric_limits<float>::denorm_min(), {0, 1});
    usage.write(std::numeric_limits<float>::infinity(), {0, 1});
    EXPECT_EQ(storedEntries(), hex("0000000000000000 00000080 0000000000000000 01000000 0000000000000000 0000807f"));

    CursorOpacityMetaDataWriter opacity(file);
    opacity.write(-0.0, {0, 1});
    opacity.write(1.5, {0, 1});
    EXPECT_EQ(storedEntries(), hex("0000000000000000 0000000000000080 0000000000000000 000000000000f83f"));
}

TEST_F(Conversions, LeaveTheBytesOfATextAsTheyAre) {
    EXPECT_EQ(storedText("\xc3\xa9"), hex("0a000000 000000000000d03f c3a9"));
    EXPECT_EQ(storedText("\xff\x01"), hex("0a000000 000000000000d03f ff01"));
    EXPECT_EQ(storedText("ab\0cd"), hex("0a000000 000000000000d03f 6162"));
    EXPECT_EQ(storedText(std::string(100000, 'z').c_str()),
              hex("a8860100 000000000000d03f") + std::string(100000, 'z'));
}

template <class S>
class TextKind : public StreamFixture {};

using TextKinds = testing::Types<SlideInfoTitleSamples, SlideInfoTextSamples, SlideInfoCommentSamples,
                                 TopmostWindowTitleSamples, TopmostAppNameSamples>;
TYPED_TEST_SUITE(TextKind, TextKinds, KindName);

TYPED_TEST(TextKind, IgnoresATextThatIsNotThere) {
    typename TypeParam::Writer writer(this->file);
    writer.write(nullptr, {1, 4});
    writer.write("x", {1, 4});
    writer.write(nullptr, {1, 4});
    EXPECT_EQ(this->storedEntries(), hex("09000000 000000000000d03f 78"));
}

// ---- When entries reach the file ------------------------------------------------------------------------------

template <class S>
class ContinuousWriter : public StreamFixture {};

using ContinuousKinds =
    testing::Types<CursorActionSamples, CursorOpacitySamples, KeyboardActionSamples, TopmostWindowSamples,
                   SlideInfoTitleSamples, SlideInfoTextSamples, SlideInfoCommentSamples, ScrollActionSamples,
                   TopmostAppNameSamples, TopmostWindowTitleSamples, CPUUsageSamples>;
TYPED_TEST_SUITE(ContinuousWriter, ContinuousKinds, KindName);

TYPED_TEST(ContinuousWriter, FlushesEveryEntry) {
    typename TypeParam::Writer writer(this->file);
    EXPECT_TRUE(writer.flushEveryWrite());
    std::string expected = TypeParam::header();
    for (const auto& sample : TypeParam::samples()) {
        sample.record(writer);
        expected += sample.bytes;
        EXPECT_EQ(contentsOf(this->file), expected);
    }
}

TYPED_TEST(ContinuousWriter, LeavesEntriesInTheFileBufferUntilItFinishesOnceFlushingIsSwitchedOff) {
    typename TypeParam::Writer writer(this->file);
    writer.setFlushEveryWrite(false);
    EXPECT_FALSE(writer.flushEveryWrite());
    recordSamples<TypeParam>(writer);
    EXPECT_EQ(contentsOf(this->file), TypeParam::header());
    writer.finish();
    EXPECT_EQ(contentsOf(this->file), goldenStream<TypeParam>());
}

TYPED_TEST(ContinuousWriter, FlushesWhatWasLeftInTheBufferWithTheNextEntryThatIsFlushed) {
    typename TypeParam::Writer writer(this->file);
    const auto samples = TypeParam::samples();
    writer.setFlushEveryWrite(false);
    samples.at(0).record(writer);
    writer.setFlushEveryWrite(true);
    samples.at(1).record(writer);
    EXPECT_EQ(this->storedEntries(), samples.at(0).bytes + samples.at(1).bytes);
}

TYPED_TEST(ContinuousWriter, FlushesAgainAfterItWasSetUpAnew) {
    typename TypeParam::Writer writer(this->file);
    writer.setFlushEveryWrite(false);
    writer.initWithMetaDataFile(this->file);
    EXPECT_TRUE(writer.flushEveryWrite());
}

template <class S>
class CountedWriter : public StreamFixture {
protected:
    typename S::Writer writer{file};

    void record() { S::samples().at(0).record(writer); }
    void recordTimes(int times) {
        for (; times > 0; --times)
            record();
    }

    std::size_t entriesOnDisk() const { return storedBytes() / S::samples().at(0).bytes.size(); }

    std::uint32_t count() const {
        if constexpr (requires { writer.rectsWritten(); })
            return writer.rectsWritten();
        else
            return writer.locationsWritten();
    }

    void setCount(std::uint32_t count) {
        if constexpr (requires { writer.setRectsWritten(count); })
            writer.setRectsWritten(count);
        else
            writer.setLocationsWritten(count);
    }
};

using CountedKinds = testing::Types<HoverRectSamples, CursorLocationSamples>;
TYPED_TEST_SUITE(CountedWriter, CountedKinds, KindName);

TYPED_TEST(CountedWriter, FlushesTheFirstEntryAndEveryFifteenthAfterIt) {
    for (std::size_t number = 1; number <= 50; ++number) {
        this->record();
        const std::size_t lastFlushed = number < 16 ? 1 : number < 31 ? 16 : number < 46 ? 31 : 46;
        EXPECT_EQ(this->entriesOnDisk(), lastFlushed) << "after entry " << number;
    }
    this->writer.finish();
    EXPECT_EQ(this->entriesOnDisk(), 50U);
}

TYPED_TEST(CountedWriter, CountsFromTheLastFlushedEntryOn) {
    EXPECT_EQ(this->count(), 0U);
    this->record();
    EXPECT_EQ(this->count(), 1U);
    this->recordTimes(14);
    EXPECT_EQ(this->count(), 15U);
    this->record();
    EXPECT_EQ(this->count(), 1U);
    this->recordTimes(14);
    EXPECT_EQ(this->count(), 15U) << "after 30 entries";
}

TYPED_TEST(CountedWriter, FlushesAtEveryMultipleOfFifteenThatTheApplicationSets) {
    for (const std::uint32_t count : {15U, 30U, 4294967295U}) {
        this->setCount(count);
        const std::size_t before = this->entriesOnDisk();
        this->record();
        EXPECT_GT(this->entriesOnDisk(), before) << count;
        EXPECT_EQ(this->count(), 1U) << count;
    }
}

TYPED_TEST(CountedWriter, DoesNotFlushAtOtherCountsThatTheApplicationSets) {
    for (const std::uint32_t count : {1U, 14U, 16U, 29U, 4294967294U}) {
        this->setCount(count);
        this->record();
        EXPECT_EQ(this->entriesOnDisk(), 0U) << count;
        EXPECT_EQ(this->count(), count + 1);
    }
}

TYPED_TEST(CountedWriter, StartsToCountAnewWhenItSaysThatItFlushes) {
    this->setCount(30);
    EXPECT_TRUE(this->writer.shouldFlush());
    EXPECT_EQ(this->count(), 0U);
    EXPECT_TRUE(this->writer.shouldFlush());
    this->setCount(31);
    EXPECT_FALSE(this->writer.shouldFlush());
    EXPECT_EQ(this->count(), 31U);
}

TYPED_TEST(CountedWriter, CountsAlsoWhatIsLost) {
    typename TypeParam::Writer idle;
    this->writer.finish();
    this->recordTimes(2);
    EXPECT_EQ(this->count(), 2U);
    EXPECT_EQ(this->entriesOnDisk(), 0U);
}

class OneShotWriters : public StreamFixture {};

TEST_F(OneShotWriters, WriteTheirOnlyEntryAtTimeZeroAndCloseTheFileAtOnce) {
    RecordingRegionMetaDataWriter region(file);
    EXPECT_FALSE(region.hasWritten());
    region.writeAndFinalize({10.9, -3.7, 100.5, 50.99});
    EXPECT_TRUE(region.hasWritten());
    EXPECT_FALSE(region.metaDataWriter()->getStream().is_open());
    EXPECT_EQ(storedEntries(), hex("0000000000000000 0a000000 fdffffff 64000000 32000000"));

    ScaleFactorMetaDataWriter scale(file);
    EXPECT_FALSE(scale.hasWritten());
    scale.writeAndFinalize(-2);
    EXPECT_TRUE(scale.hasWritten());
    EXPECT_FALSE(scale.metaDataWriter()->getStream().is_open());
    EXPECT_EQ(storedEntries(), hex("0000000000000000 feffffff"));
}

TEST_F(OneShotWriters, IgnoreEveryLaterEntry) {
    RecordingRegionMetaDataWriter region(file);
    region.writeAndFinalize({1, 2, 3, 4});
    region.writeAndFinalize({5, 6, 7, 8});
    EXPECT_EQ(storedEntries(), hex("0000000000000000 01000000 02000000 03000000 04000000"));
    EXPECT_TRUE(region.metaDataWriter()->getStream().good());

    ScaleFactorMetaDataWriter scale(file);
    scale.writeAndFinalize(1);
    scale.writeAndFinalize(2);
    EXPECT_EQ(storedEntries(), hex("0000000000000000 01000000"));
    EXPECT_TRUE(scale.metaDataWriter()->getStream().good());
}

TEST_F(OneShotWriters, WriteNothingOnceTheApplicationSaysThatTheyHave) {
    RecordingRegionMetaDataWriter region(file);
    region.setHasWritten(true);
    region.writeAndFinalize({1, 2, 3, 4});
    EXPECT_TRUE(region.metaDataWriter()->getStream().is_open());
    EXPECT_EQ(storedEntries(), "");
}

TEST_F(OneShotWriters, LoseAnEntryThatTheApplicationLetsThroughAfterTheEnd) {
    ScaleFactorMetaDataWriter scale(file);
    scale.writeAndFinalize(1);
    scale.setHasWritten(false);
    scale.writeAndFinalize(2);
    EXPECT_TRUE(scale.hasWritten());
    EXPECT_EQ(storedEntries(), hex("0000000000000000 01000000"));
}

// ---- The stream writer and its owner --------------------------------------------------------------------------

class StreamWriterOwner : public StreamFixture {
protected:
    using StreamWriter = CursorLocationMetaDataWriter::StreamWriter;

    struct Deleter {
        void operator()(StreamWriter* writer) const {
            writer->StreamWriter::~StreamWriter(); // its destructor is not virtual
            ::operator delete(writer);
        }
    };
    using OwnedStreamWriter = std::unique_ptr<StreamWriter, Deleter>;

    StreamWriter* newStreamWriter(const std::string& name) const {
        auto* writer = new StreamWriter;
        writer->init(folder / name, s_cursorLocationUUID, 1);
        return writer;
    }
};

TEST_F(StreamWriterOwner, WritesThroughTheStreamWriterThatItWasGivenLast) {
    CursorLocationMetaDataWriter writer(file);
    const OwnedStreamWriter original(writer.metaDataWriter());
    writer.setMetaDataWriter(newStreamWriter("Other.dat"));
    writer.write({1, 2}, {1, 4});
    EXPECT_EQ(storedEntries(), "");
    EXPECT_EQ(contentsOf(folder / "Other.dat").substr(headerSize), hex("000000000000d03f 01000000 02000000"));
}

TEST_F(StreamWriterOwner, OnlyStoresAStreamWriterThatItIsGiven) {
    CursorLocationMetaDataWriter writer(file);
    const OwnedStreamWriter original(writer.metaDataWriter());
    StreamWriter* other = newStreamWriter("Other.dat");
    writer.setMetaDataWriter(other);
    EXPECT_EQ(writer.metaDataWriter(), other);
    EXPECT_TRUE(original->getStream().is_open());
    EXPECT_TRUE(other->getStream().is_open());
    original->write(0.25, Point(3, 4), true);
    EXPECT_EQ(storedEntries(), hex("000000000000d03f 03000000 04000000"));
}

TEST_F(StreamWriterOwner, ReleasesTheStreamWriterThatItHasInTheEnd) {
    auto writer = std::make_unique<CursorLocationMetaDataWriter>(file);
    const OwnedStreamWriter original(writer->metaDataWriter());
    writer->setMetaDataWriter(newStreamWriter("Other.dat"));
    writer->metaDataWriter()->write(0.25, Point(3, 4), false);
    writer.reset();
    EXPECT_EQ(contentsOf(folder / "Other.dat").substr(headerSize), hex("000000000000d03f 03000000 04000000"));
    EXPECT_TRUE(original->getStream().is_open());
}

TEST_F(StreamWriterOwner, DropsEverythingOnceItsStreamWriterIsTakenAway) {
    CursorLocationMetaDataWriter writer(file);
    const OwnedStreamWriter original(writer.metaDataWriter());
    writer.setMetaDataWriter(nullptr);
    writer.write({1, 2}, {1, 4});
    writer.finish();
    EXPECT_EQ(storedEntries(), "");
    EXPECT_TRUE(original->getStream().is_open());
}

TEST_F(StreamWriterOwner, ClosesItsFileWhenItIsGivenAnother) {
    TopmostWindowMetaDataWriter writer(file);
    writer.setFlushEveryWrite(false);
    writer.write({1, 2, 3, 4}, {1, 4});
    writer.initWithMetaDataFile(folder / "Other.dat");
    writer.write({5, 6, 7, 8}, {1, 2});
    EXPECT_EQ(storedEntries(), hex("000000000000d03f 01000000 02000000 03000000 04000000"));
    EXPECT_EQ(contentsOf(folder / "Other.dat").substr(headerSize),
              hex("000000000000e03f 05000000 06000000 07000000 08000000"));
}

TEST_F(StreamWriterOwner, DoesNotMoveToALocationThatIsOnlyStored) {
    TopmostWindowMetaDataWriter writer(file);
    EXPECT_EQ(writer.metaDataFile(), file);
    writer.setMetaDataFile(folder / "Other.dat");
    EXPECT_EQ(writer.metaDataFile(), FileLocation(folder / "Other.dat"));
    writer.write({1, 2, 3, 4}, {1, 4});
    EXPECT_EQ(storedBytes(), 24U);
    EXPECT_FALSE(exists(writer.metaDataFile()));
    writer.setup();
    EXPECT_EQ(file_size(writer.metaDataFile()), 24U);
}

TEST_F(StreamWriterOwner, KeepsItsStreamWriterAndItsFlushingAfterTheEnd) {
    TopmostWindowMetaDataWriter window(file);
    const auto* streamWriter = window.metaDataWriter();
    window.setFlushEveryWrite(false);
    window.finish();
    window.finish();
    EXPECT_EQ(window.metaDataWriter(), streamWriter);
    EXPECT_FALSE(window.flushEveryWrite());
    EXPECT_TRUE(window.metaDataWriter()->getStream().good());
}

TEST_F(StreamWriterOwner, LosesWhatIsWrittenAfterTheEnd) {
    TopmostWindowMetaDataWriter writer(file);
    writer.write({1, 2, 3, 4}, {1, 4});
    writer.finish();
    writer.write({5, 6, 7, 8}, {1, 2});
    EXPECT_TRUE(writer.metaDataWriter()->getStream().fail());
    EXPECT_EQ(storedEntries(), hex("000000000000d03f 01000000 02000000 03000000 04000000"));
}

TEST_F(StreamWriterOwner, SharesNothingWithOthersOfItsKind) {
    CursorLocationMetaDataWriter first(file);
    CursorLocationMetaDataWriter second(folder / "Second.dat");
    first.write({1, 1}, {1, 4});
    first.write({2, 2}, {1, 4});
    second.write({3, 3}, {1, 2});
    EXPECT_EQ(first.locationsWritten(), 2U);
    EXPECT_EQ(second.locationsWritten(), 1U);
    first.finish();
    EXPECT_EQ(storedEntries(), hex("000000000000d03f 01000000 01000000 000000000000d03f 02000000 02000000"));
    EXPECT_EQ(contentsOf(folder / "Second.dat").substr(headerSize), hex("000000000000e03f 03000000 03000000"));
}

class StreamWriterThatStays : public StreamFixture {};

TEST_F(StreamWriterThatStays, IsStillThereAfterAScaleFactorWriterThatWroteNothing) {
    auto writer = std::make_unique<ScaleFactorMetaDataWriter>(file);
    auto* streamWriter = writer->metaDataWriter();
    writer.reset();
    EXPECT_EQ(contentsOf(file), streamHeader("2b7b6afb", 1, 12));
    streamWriter->write(0.25, 7, true);
    EXPECT_EQ(storedEntries(), hex("000000000000d03f 07000000"));
    streamWriter->close();
}

TEST_F(StreamWriterThatStays, IsStillThereAfterASystemDataWriter) {
    auto writer = std::make_unique<SystemDataMetaDataWriter>(file);
    auto* streamWriter = writer->metaDataWriter();
    writer->write();
    const std::string written = contentsOf(file);
    writer.reset();
    EXPECT_FALSE(streamWriter->getStream().is_open());
    EXPECT_EQ(contentsOf(file), written);
}

/// Under a leak checker, the process ends with another code where it finds anything.
TEST_F(StreamWriterThatStays, IsNoLeak) {
    const auto useAndExit = [this] {
        ScaleFactorMetaDataWriter(file).writeAndFinalize(2);
        ScaleFactorMetaDataWriter{file};
        SystemDataMetaDataWriter(file).write();
        SystemDataMetaDataWriter{file};
        std::exit(0);
    };
    EXPECT_EXIT(useAndExit(), testing::ExitedWithCode(0), "^$");
}

} // namespace

} // namespace ZULMetaData::Test
