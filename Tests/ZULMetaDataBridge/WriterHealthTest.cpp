// How an application learns that its disk is full, from a writer of every kind.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/FileSizeLimit.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "Tests/ZULMetaDataBridge/StreamFixture.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <tuple>

namespace ZULMetaData::Test {

namespace {

template <class S>
class WriterHealth : public StreamFixture {
protected:
    using Writer = typename S::Writer;

    static std::uint64_t sampleCount() { return S::samples().size(); }
    static void recordFirst(Writer& writer) { S::samples().at(0).record(writer); }
};

/// Writes one entry at `time`. False for the kinds whose one entry always has the time 0.
template <class Writer>
bool recordAt(Writer& writer, const MediaTime& time) {
    if constexpr (requires { writer.writeCharacterCode(65, 0, time); })
        writer.writeCharacterCode(65, 0, time);
    else if constexpr (requires { writer.writeCursorWithExistingUID(7, time); })
        writer.writeCursorWithExistingUID(7, time);
    else if constexpr (requires { writer.write("text", time); })
        writer.write("text", time);
    else if constexpr (requires { writer.write(ScreenPoint(1, 2), time); })
        writer.write(ScreenPoint(1, 2), time);
    else if constexpr (requires { writer.write(ScreenRect(1, 2, 3, 4), time); })
        writer.write(ScreenRect(1, 2, 3, 4), time);
    else if constexpr (requires { writer.write(1, time); })
        writer.write(1, time);
    else
        return false;
    return true;
}

template <class Kinds>
struct TypesOf;
template <class... Samples>
struct TypesOf<std::tuple<Samples...>> {
    using Types = testing::Types<Samples...>;
};
TYPED_TEST_SUITE(WriterHealth, TypesOf<EveryKind>::Types, KindName);

TYPED_TEST(WriterHealth, IsGoodAndCountsTheEntriesAsLongAsTheyAreTaken) {
    typename TypeParam::Writer writer(this->file);
    EXPECT_TRUE(writer.isHealthy());
    EXPECT_EQ(writer.entriesWritten(), 0U);
    recordSamples<TypeParam>(writer);
    finish(writer);
    EXPECT_TRUE(writer.isHealthy());
    EXPECT_EQ(writer.entriesWritten(), this->sampleCount());
    EXPECT_EQ(contentsOf(this->file), recordedStream<TypeParam>());
}

TYPED_TEST(WriterHealth, CanBeAskedOfTheBaseOfAllWriters) {
    typename TypeParam::Writer writer(this->file);
    recordSamples<TypeParam>(writer);
    const BaseMetaDataWriter& base = writer;
    EXPECT_TRUE(base.isHealthy());
    EXPECT_EQ(base.entriesWritten(), this->sampleCount());
    EXPECT_FALSE(BaseMetaDataWriter().isHealthy());
    EXPECT_EQ(BaseMetaDataWriter().entriesWritten(), 0U);
}

TYPED_TEST(WriterHealth, IsBadOfAWriterThatWasNeverOpened) {
    typename TypeParam::Writer writer;
    EXPECT_FALSE(writer.isHealthy());
    this->recordFirst(writer);
    EXPECT_FALSE(writer.isHealthy());
    EXPECT_EQ(writer.entriesWritten(), 0U);
}

TYPED_TEST(WriterHealth, IsBadWhereTheFileCannotBeCreated) {
    typename TypeParam::Writer writer(this->folder / "no folder/Stream.dat");
    EXPECT_FALSE(writer.isHealthy());
    this->recordFirst(writer);
    EXPECT_EQ(writer.entriesWritten(), 0U);
}

TYPED_TEST(WriterHealth, IsBadFromTheHeaderOnWhereTheDiskHasNoRoomForIt) {
    const FileSizeLimit limit(this->headerSize - 1);
    typename TypeParam::Writer writer(this->file);
    EXPECT_FALSE(writer.isHealthy());
    this->recordFirst(writer);
    EXPECT_EQ(writer.entriesWritten(), 0U);
}

TYPED_TEST(WriterHealth, IsBadOnceTheDiskIsFull) {
    const FileSizeLimit limit(this->headerSize + 4);
    typename TypeParam::Writer writer(this->file);
    EXPECT_TRUE(writer.isHealthy());
    this->recordFirst(writer); // the first entry of every kind is flushed, or the file closed
    EXPECT_FALSE(writer.isHealthy());
    EXPECT_EQ(writer.entriesWritten(), 0U);
    finish(writer);
    EXPECT_FALSE(writer.isHealthy());
}

TYPED_TEST(WriterHealth, TurnsBadWithWhatIsWrittenBehindTheEnd) {
    typename TypeParam::Writer writer(this->file);
    this->recordFirst(writer);
    finish(writer);
    if constexpr (requires { writer.setHasWritten(false); })
        writer.setHasWritten(false);
    EXPECT_TRUE(writer.isHealthy());
    this->recordFirst(writer);
    EXPECT_FALSE(writer.isHealthy());
    EXPECT_EQ(writer.entriesWritten(), 1U);
}

TYPED_TEST(WriterHealth, IsGoodAgainAfterItWasSetUpAnew) {
    typename TypeParam::Writer writer(this->folder / "no folder/Stream.dat");
    this->recordFirst(writer);
    if constexpr (requires { writer.setHasWritten(false); })
        writer.setHasWritten(false);
    writer.initWithMetaDataFile(this->file);
    EXPECT_TRUE(writer.isHealthy());
    this->recordFirst(writer);
    EXPECT_EQ(writer.entriesWritten(), 1U);
    writer.setup();
    EXPECT_EQ(writer.entriesWritten(), 0U);
}

TYPED_TEST(WriterHealth, IsBadAfterATimeThatIsNotFinite) {
    for (const MediaTime& time : {MediaTime(), MediaTime(1, 0), MediaTime(-1, 0)}) {
        typename TypeParam::Writer writer(this->file);
        if (!recordAt(writer, time))
            GTEST_SKIP() << "its entry always has the time 0";
        EXPECT_FALSE(writer.isHealthy());
        EXPECT_TRUE(recordAt(writer, MediaTime(1, 4)));
        EXPECT_FALSE(writer.isHealthy());
        EXPECT_EQ(writer.entriesWritten(), 2U); // both are in the file
        finish(writer);
        const auto extent = measureStream(ByteSource::file(this->file));
        EXPECT_EQ(extent->entries, 2U);
        writer.setup();
        EXPECT_TRUE(writer.isHealthy());
    }
}

class WriterHealthOfABuffer : public StreamFixture {};

TEST_F(WriterHealthOfABuffer, TurnsBadOnlyWhenTheBytesMeetTheDisk) {
    const FileSizeLimit limit(headerSize + 20);
    CursorLocationMetaDataWriter writer(file);
    writer.write({1, 2}, {1, 4}); // flushed
    writer.write({3, 4}, {2, 4}); // not yet
    EXPECT_TRUE(writer.isHealthy());
    EXPECT_EQ(writer.entriesWritten(), 2U);
    writer.finish();
    EXPECT_FALSE(writer.isHealthy());
}

TEST_F(WriterHealthOfABuffer, DoesNotCountATextThatIsNotThere) {
    SlideInfoTextMetaDataWriter writer(file);
    writer.write(nullptr, {1, 4});
    EXPECT_TRUE(writer.isHealthy());
    EXPECT_EQ(writer.entriesWritten(), 0U);
}

TEST_F(WriterHealthOfABuffer, IsBadInAWriterThatCreatesNoFile) {
    BaseMetaDataWriter writer;
    writer.initWithMetaDataFile(file);
    EXPECT_FALSE(writer.isHealthy());
    EXPECT_EQ(writer.entriesWritten(), 0U);
    EXPECT_FALSE(std::filesystem::exists(file));
}

TEST_F(WriterHealthOfABuffer, IsBadWithoutAStreamWriter) {
    CursorLocationMetaDataWriter writer(file);
    auto* original = writer.metaDataWriter();
    writer.setMetaDataWriter(nullptr);
    EXPECT_FALSE(writer.isHealthy());
    writer.setMetaDataWriter(original);
    EXPECT_TRUE(writer.isHealthy());
}

} // namespace

} // namespace ZULMetaData::Test
