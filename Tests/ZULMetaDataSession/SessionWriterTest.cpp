// Recording a session: its bytes, when they reach the disk, what is lost and who is told, and what is found afterwards.

#include "ZULMetaDataSession/SessionWriter.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/FileSizeLimit.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <chrono>
#include <csignal>
#include <filesystem>
#include <functional>
#include <limits>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;

class SessionFixture : public testing::Test {
protected:
    /// The stream file of a kind; empty if there is none.
    template <class Kind>
    std::string stored() const {
        const std::string file = fileOf<Kind>();
        return std::filesystem::exists(file) ? contentsOf(file) : "";
    }

    template <class Kind>
    std::string fileOf() const {
        return (path / (metaDataKindName(Kind::type) + ".dat")).string();
    }

    std::vector<std::string> filesInFolder() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(path))
            names.push_back(entry.path().filename().string());
        std::sort(names.begin(), names.end());
        return names;
    }

    /// What an operation complains of.
    template <class Operation>
    static std::string refusal(Operation operation) {
        try {
            operation();
        } catch (const Error& error) {
            return error.what();
        }
        return "none";
    }

    std::string newMovie(const std::string& name = "Movie.mp4") const {
        writeFile(folder / name, atom("ftyp", "mp42"));
        return folder / name;
    }

    TemporaryFolder folder;
    FileLocation path = folder.path() / "session";
};

// ---- The bytes of every kind ------------------------------------------------------------------------------------

template <class S>
class SessionOfAKind : public SessionFixture {
protected:
    using Kind = typename S::Kind;

    /// Writes the samples as values of the stream.
    static void record(SessionWriter& session) {
        if constexpr (std::is_same_v<Kind, SystemDataKind>)
            session.write<SystemDataKind>(ProcessInfo::current());
        else
            for (const auto& sample : S::samples()) {
                const auto entry = decodeEntry<typename Kind::Value>(sample.bytes, Kind::version);
                session.write<Kind>(entry->time, entry->value);
            }
    }
};

template <class... Samples>
testing::Types<Samples...> typesOf(std::tuple<Samples...>*);
using AllSamples = decltype(typesOf(static_cast<EveryKind*>(nullptr)));
TYPED_TEST_SUITE(SessionOfAKind, AllSamples, KindName);

TYPED_TEST(SessionOfAKind, HasTheBytesThatTheWriterOfTheKindWrites) {
    SessionWriter session(this->path);
    this->record(session);
    session.finish();
    typename TypeParam::Writer writer(this->folder / "writer.dat");
    recordSamples<TypeParam>(writer);
    finish(writer);
    const std::string bytes = this->template stored<typename TypeParam::Kind>();
    EXPECT_EQ(bytes, contentsOf(this->folder / "writer.dat"));
    EXPECT_EQ(bytes, recordedStream<TypeParam>());
    EXPECT_TRUE(session.isHealthy());
}

TYPED_TEST(SessionOfAKind, IsInAFileOfItsNameAndNoOtherStreamIsCreated) {
    SessionWriter session(this->path);
    EXPECT_THAT(this->filesInFolder(), ElementsAre("session.lock"));
    this->record(session);
    EXPECT_THAT(this->filesInFolder(),
                testing::UnorderedElementsAre("session.lock", std::string(TypeParam::name) + ".dat"));
    const bool isOnce = TypeParam::Kind::role == StreamRole::Once;
    EXPECT_EQ(session.entriesWritten(TypeParam::Kind::type), isOnce ? 1 : TypeParam::samples().size());
    EXPECT_EQ(session.entriesWritten(s_caretPositionUUID), 0U);
}

TYPED_TEST(SessionOfAKind, CanBeReadByTheParserOfTheKindOnceItIsInAMovie) {
    const std::string movie = this->newMovie();
    SessionWriter session(this->path);
    this->record(session);
    session.saveInto(movie, "Recorder", "4.2");
    typename TypeParam::Parser parser(movie);
    EXPECT_EQ(parser.read()->size(), session.entriesWritten(TypeParam::Kind::type));
}

// ---- Values -----------------------------------------------------------------------------------------------------

class SessionValues : public SessionFixture {
protected:
    template <class Kind>
    std::string entries() {
        session.flush();
        return stored<Kind>().substr(s_metaDataHeaderSize);
    }

    SessionWriter session{path};
};

template <class Kind, class Value>
constexpr bool isWritable = requires(SessionWriter& session, const Value& value) {
    session.write<Kind>(0.0, value);
};

TEST_F(SessionValues, OfAnotherTypeDoNotCompile) {
    static_assert(isWritable<CursorLocationKind, Point> && isWritable<CursorLocationKind, ScreenPoint>);
    static_assert(!isWritable<CursorLocationKind, Rect> && !isWritable<CursorLocationKind, int>);
    static_assert(isWritable<HoverRectKind, Rect> && !isWritable<HoverRectKind, Point>);
    static_assert(isWritable<CPUUsageKind, float> && !isWritable<CPUUsageKind, double>);
    static_assert(isWritable<CursorOpacityKind, double> && !isWritable<CursorOpacityKind, float>);
    static_assert(isWritable<CursorActionKind, std::int32_t> && isWritable<CursorActionKind, ButtonAction>);
    static_assert(!isWritable<CursorActionKind, double> && !isWritable<CursorActionKind, bool>);
    static_assert(isWritable<KeyboardActionKind, KeyStroke> && isWritable<KeyboardActionKind, KeyInput>);
    static_assert(!isWritable<KeyboardActionKind, Point> && !isWritable<KeyboardActionKind, std::uint32_t>);
    static_assert(isWritable<CursorImageKind, CursorImage> && isWritable<CursorImageKind, CursorAppearance>);
    static_assert(isWritable<SlideInfoTextKind, std::string_view> && isWritable<SlideInfoTextKind, char[6]>);
    static_assert(!isWritable<SlideInfoTextKind, int> && !isWritable<SlideInfoTextKind, std::list<std::string>>);
    static_assert(isWritable<SystemDataKind, ProcessInfo> && isWritable<SystemDataKind, SystemData>);
    static_assert(!isWritable<SystemDataKind, std::string> && !isWritable<ScaleFactorKind, double>);
}

template <class Kind>
constexpr bool isWrittenWithoutATime = requires(SessionWriter& session, const typename Kind::Value& value) {
    session.write<Kind>(value);
};

TEST_F(SessionValues, HaveATimeUnlessTheirKindIsWrittenOnce) {
    static_assert(isWrittenWithoutATime<RecordingRegionKind> && isWrittenWithoutATime<SystemDataKind>);
    static_assert(!isWrittenWithoutATime<CursorLocationKind> && !isWrittenWithoutATime<SlideInfoTitleKind>);
}

TEST_F(SessionValues, MayHaveFractionsThatAreCutOff) {
    session.write<CursorLocationKind>(0.25, ScreenPoint(10.9, -3.7));
    session.write<CursorLocationKind>(0.5, {640, 360});
    session.write<TopmostWindowKind>(0.25, ScreenRect(10.9, -3.7, 100.5, 50.99));
    EXPECT_EQ(entries<CursorLocationKind>(),
              hex("000000000000d03f 0a000000 fdffffff 000000000000e03f 80020000 68010000"));
    EXPECT_EQ(entries<TopmostWindowKind>(), hex("000000000000d03f 0a000000 fdffffff 64000000 32000000"));
}

TEST_F(SessionValues, MayBeTextsOfAnyType) {
    using namespace std::string_literals;
    session.write<SlideInfoTitleKind>(0.25, "abc");
    session.write<SlideInfoTitleKind>(0.25, "ab\0cd"s);
    session.write<SlideInfoTitleKind>(0.25, std::string_view("xyz").substr(1));
    session.write<SlideInfoTitleKind>(0.25, {});
    EXPECT_EQ(entries<SlideInfoTitleKind>(), hex("0b000000 000000000000d03f 616263 0d000000 000000000000d03f 6162006364"
                                                 "0a000000 000000000000d03f 797a 08000000 000000000000d03f"));
}

TEST_F(SessionValues, MayBeWhatTracksHold) {
    session.write<CursorActionKind>(0.25, ButtonAction{MouseButton::Left, true, {Modifier::Shift}, 17});
    session.write<KeyboardActionKind>(0.25, KeyInput{false, 65, {Modifier::Shift}, {65, 0x20000}});
    session.write<SystemDataKind>(SystemData{"a", "b", "c", "d"});
    EXPECT_EQ(entries<CursorActionKind>(), hex("000000000000d03f 11000000"));
    EXPECT_EQ(entries<KeyboardActionKind>(), hex("000000000000d03f 41000000 00000200"));
    EXPECT_EQ(entries<SystemDataKind>(), hex("38000000 04000000") + hex("09000000 0000000000000000 61") +
                                             hex("09000000 0000000000000000 62") + hex("09000000 0000000000000000 63") +
                                             hex("09000000 0000000000000000 64"));
}

TEST_F(SessionValues, AreWrittenOnceIfTheyAreValidForTheWholeRecording) {
    session.write<RecordingRegionKind>(Rect(1, 2, 3, 4));
    session.write<RecordingRegionKind>(Rect(5, 6, 7, 8));
    session.write<ScaleFactorKind>(3.5, 2);
    session.write<ScaleFactorKind>(4.5, 3);
    const std::string region = hex("0000000000000000 01000000 02000000 03000000 04000000");
    EXPECT_EQ(stored<RecordingRegionKind>().substr(s_metaDataHeaderSize), region) << "without a flush";
    EXPECT_EQ(stored<ScaleFactorKind>().substr(s_metaDataHeaderSize), hex("0000000000000000 02000000"));
    EXPECT_TRUE(session.isHealthy());
}

class SessionCursors : public SessionValues {
protected:
    static std::shared_ptr<const CursorPicture> picture(std::uint8_t byte, Point hotSpot = {1, 2}) {
        return std::make_shared<const CursorPicture>(CursorPicture{{byte, byte}, hotSpot, CursorTypeID(5)});
    }

    void show(std::uint64_t id, std::shared_ptr<const CursorPicture> shown, std::uint32_t flags = 3) {
        session.write<CursorImageKind>(0.25, CursorAppearance{id, std::move(shown), false, flags});
    }

    static std::string withPicture(const std::string& id, const std::string& hotSpot, const std::string& bytes) {
        return hex("2a000000 000000000000d03f" + id + "16000000 02000000" + hotSpot + bytes + "05000000 03000000");
    }
    static std::string without(const std::string& id, const std::string& flags = "03000000") {
        return hex("1c000000 000000000000d03f" + id + "08000000 00000000" + flags);
    }

    const std::string seven = "0700000000000000";
    const std::string eight = "0800000000000000";
    const std::string oneTwo = "01000000 02000000";
};

TEST_F(SessionCursors, StoreAPictureWithTheFirstEntryOfItsIdentifier) {
    const auto arrow = picture(0xaa);
    show(7, arrow);
    show(7, arrow);
    show(7, picture(0xaa));
    show(8, arrow);
    show(7, nullptr, 1);
    EXPECT_EQ(entries<CursorImageKind>(), withPicture(seven, oneTwo, "aaaa") + without(seven) + without(seven) +
                                              withPicture(eight, oneTwo, "aaaa") + without(seven, "01000000"));
}

TEST_F(SessionCursors, StoreAnotherPictureOfAnIdentifier) {
    show(7, picture(0xaa));
    show(7, picture(0xbb));
    show(7, picture(0xbb, {3, 4}));
    show(7, picture(0xaa));
    EXPECT_EQ(entries<CursorImageKind>(), withPicture(seven, oneTwo, "aaaa") + withPicture(seven, oneTwo, "bbbb") +
                                              withPicture(seven, "03000000 04000000", "bbbb") +
                                              withPicture(seven, oneTwo, "aaaa"));
}

TEST_F(SessionCursors, StoreAPictureAgainAfterAnEntryThatWasWrittenAsItIs) {
    std::string bytes = hex("cccc");
    CursorImage image(7, 1, 2, reinterpret_cast<unsigned char*>(bytes.data()), 2, CursorTypeID(5),
                      CursorImage::DefaultFlags);
    show(7, picture(0xaa));
    session.write<CursorImageKind>(0.25, image);
    image.freeImageData(false);
    show(7, picture(0xaa));
    EXPECT_EQ(entries<CursorImageKind>(), withPicture(seven, oneTwo, "aaaa") + withPicture(seven, oneTwo, "cccc") +
                                              withPicture(seven, oneTwo, "aaaa"));
}

// ---- When entries reach the disk --------------------------------------------------------------------------------

class SessionFlushing : public SessionFixture {
protected:
    SessionOptions options(std::chrono::nanoseconds interval = 500ms) {
        SessionOptions options;
        options.flushInterval = interval;
        options.clock = [this] {
            ++readings;
            return time;
        };
        return options;
    }

    template <class Kind>
    std::size_t entriesOnDisk() const {
        const std::size_t bytes = stored<Kind>().size();
        return bytes == 0 ? 0 : (bytes - s_metaDataHeaderSize) / (8 + sizeof(typename Kind::Value));
    }

    void point(SessionWriter& session) { session.write<CursorLocationKind>(1, {1, 2}); }

    std::chrono::nanoseconds time{0};
    int readings = 0;
};

TEST_F(SessionFlushing, HappensAtTheFirstEntryAndThenOnceTheIntervalHasPassed) {
    SessionWriter session(path, options());
    point(session);
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 1U);
    for (int i = 0; i < 499; ++i) {
        time += 1ms;
        point(session);
    }
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 1U);
    time += 1ms;
    point(session);
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 501U);
    time += 499999999ns;
    point(session);
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 501U);
    time += 1ns;
    point(session);
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 503U);
}

TEST_F(SessionFlushing, OfAllKindsHappensAtTheNextEntryOfAnyKind) {
    SessionWriter session(path, options());
    point(session);
    session.write<CursorActionKind>(1, 1);
    session.write<CursorOpacityKind>(1, 0.5);
    EXPECT_EQ(stored<CursorActionKind>(), "");
    time += 500ms;
    session.write<CPUUsageKind>(2, 0.5F);
    EXPECT_EQ(entriesOnDisk<CursorActionKind>(), 1U);
    EXPECT_EQ(entriesOnDisk<CursorOpacityKind>(), 1U);
    EXPECT_EQ(entriesOnDisk<CPUUsageKind>(), 1U);
}

TEST_F(SessionFlushing, DoesNotDependOnTheTimesOfEntries) {
    SessionWriter session(path, options());
    point(session);
    session.write<CursorLocationKind>(1000, {1, 2});
    session.write<CursorLocationKind>(-1000, {1, 2});
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 1U);
    time += 500ms;
    session.write<CursorLocationKind>(-1000, {1, 2});
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 4U);
}

TEST_F(SessionFlushing, HappensWhenItIsAskedFor) {
    SessionWriter session(path, options());
    point(session);
    point(session);
    session.flush();
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 2U);
    point(session);
    time += 499ms;
    session.flushIfDue();
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 2U);
    time += 1ms;
    session.flushIfDue();
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 3U);
}

TEST_F(SessionFlushing, HappensAtEveryEntryOfAnIntervalOfZero) {
    SessionWriter session(path, options(0ms));
    for (std::size_t i = 1; i <= 5; ++i) {
        point(session);
        EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), i);
    }
    SessionOptions systemClock;
    systemClock.flushInterval = -1s;
    path = folder / "other";
    SessionWriter other(path, systemClock);
    point(other);
    point(other);
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 2U);
}

TEST_F(SessionFlushing, HappensOnlyAtTheFirstEntryOfAnEndlessInterval) {
    SessionWriter session(path, options(std::chrono::nanoseconds::max()));
    point(session);
    time = std::chrono::nanoseconds::max() - 1ns;
    point(session);
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 1U);
    session.finish();
    EXPECT_EQ(entriesOnDisk<CursorLocationKind>(), 2U);
}

TEST_F(SessionFlushing, HappensByTheClockOfTheSystemToo) {
    SessionOptions systemClock;
    systemClock.flushInterval = 30ms;
    SessionWriter session(path, systemClock);
    point(session);
    const auto start = std::chrono::steady_clock::now();
    std::size_t written = 1;
    for (; entriesOnDisk<CursorLocationKind>() == 1; ++written)
        point(session);
    EXPECT_GE(std::chrono::steady_clock::now() - start, 30ms - 20ms) << "a tick early at most";
    EXPECT_GE(written, 2U);
}

TEST_F(SessionFlushing, ReadsTheClockForEveryEntryUnlessThousandsComeAtOneTime) {
    SessionWriter session(path, options());
    for (int i = 1; i <= 4096; ++i) {
        point(session);
        ASSERT_EQ(readings, i);
    }
    for (int i = 0; i < 8000; ++i)
        point(session);
    EXPECT_LT(readings, 4096 + 1002);
    time += 500ms;
    for (int i = 0; i < 8; ++i)
        point(session);
    EXPECT_GE(entriesOnDisk<CursorLocationKind>(), 12097U);
    readings = 0;
    for (int i = 0; i < 100; ++i) {
        time += 1ms;
        point(session);
    }
    EXPECT_GE(readings, 93) << "the burst is over";
}

// ---- Losses -----------------------------------------------------------------------------------------------------

class SessionLosses : public SessionFixture {
protected:
    SessionOptions options(std::chrono::nanoseconds interval = 0ms) {
        SessionOptions options;
        options.flushInterval = interval;
        options.onLoss = [this](const Error& loss) { told.emplace_back(loss.what()); };
        return options;
    }

    std::vector<std::string> told;
};

TEST_F(SessionLosses, AreToldOnceWhenTheDiskIsFull) {
    SessionWriter session(path, options());
    session.write<CursorLocationKind>(1, {1, 2});
    session.write<CPUUsageKind>(1, 0.5F);
    EXPECT_TRUE(session.isHealthy());
    EXPECT_EQ(session.loss(), nullptr);
    {
        const FileSizeLimit limit(50);
        session.write<CursorLocationKind>(2, {3, 4});
        EXPECT_THAT(told, ElementsAre(fileOf<CursorLocationKind>() +
                                      ": cannot be written at offset 50: File too large; no more entries of "
                                      "cursorLocation are recorded"));
        session.write<CursorLocationKind>(3, {5, 6});
        session.write<TopmostAppNameKind>(3, std::string(100, 'x'));
    }
    EXPECT_EQ(told.size(), 1U);
    EXPECT_FALSE(session.isHealthy());
    EXPECT_EQ(session.loss()->file(), fileOf<CursorLocationKind>());
}

TEST_F(SessionLosses, EndTheirStreamAndNoOther) {
    SessionWriter session(path, options());
    session.write<CursorLocationKind>(1, {1, 2});
    session.write<CPUUsageKind>(1, 0.5F);
    {
        const FileSizeLimit limit(50);
        session.write<CursorLocationKind>(2, {3, 4});
    }
    session.write<CursorLocationKind>(3, {5, 6});
    session.write<CPUUsageKind>(3, 0.5F);
    session.finish();
    EXPECT_EQ(stored<CursorLocationKind>().size(), 50U) << "a torn entry, and nothing after it";
    EXPECT_EQ(stored<CPUUsageKind>().size(), 24U + 2 * 12);
    EXPECT_EQ(session.entriesWritten(s_cursorLocationUUID), 2U) << "one of them was in memory";
    EXPECT_EQ(session.entriesWritten(s_cpuUsageUUID), 2U);
    EXPECT_EQ(told.size(), 1U);
}

TEST_F(SessionLosses, AreToldByTheFlushAndTheEndToo) {
    for (const bool isFlushed : {true, false}) {
        path = folder / (isFlushed ? "flushed" : "finished");
        told.clear();
        SessionWriter session(path, options(1h));
        session.write<CursorLocationKind>(1, {1, 2});
        session.write<CursorLocationKind>(2, {1, 2});
        session.write<CPUUsageKind>(2, 0.5F);
        const FileSizeLimit limit(0);
        if (isFlushed)
            session.flush();
        else
            session.finish();
        EXPECT_EQ(told.size(), 1U) << isFlushed;
        session.finish();
        EXPECT_EQ(told.size(), 1U) << isFlushed;
    }
}

TEST_F(SessionLosses, AreToldWhenAFileCannotBeCreated) {
    SessionWriter session(path, options());
    std::filesystem::remove_all(path);
    session.write<CursorLocationKind>(1, {1, 2});
    session.write<CPUUsageKind>(1, 0.5F);
    EXPECT_THAT(told, ElementsAre(fileOf<CursorLocationKind>() +
                                  ": cannot be created: No such file or directory; no more entries of cursorLocation "
                                  "are recorded"));
    EXPECT_EQ(session.entriesWritten(s_cursorLocationUUID), 0U);
}

TEST_F(SessionLosses, DoNotReplaceAFileThatAppearedMeanwhile) {
    SessionWriter session(path, options());
    writeFile(fileOf<CursorLocationKind>(), "of somebody else");
    session.write<CursorLocationKind>(1, {1, 2});
    EXPECT_EQ(told.size(), 1U);
    EXPECT_EQ(stored<CursorLocationKind>(), "of somebody else");
}

TEST_F(SessionLosses, AreEntriesAtTimesThatAreNotFinite) {
    SessionWriter session(path, options());
    session.write<CursorLocationKind>(std::numeric_limits<double>::quiet_NaN(), {1, 2});
    session.write<CursorLocationKind>(std::numeric_limits<double>::infinity(), {1, 2});
    EXPECT_EQ(stored<CursorLocationKind>(), "");
    session.write<CursorLocationKind>(1, {1, 2});
    session.write<CursorLocationKind>(-std::numeric_limits<double>::infinity(), {1, 2});
    session.write<CursorLocationKind>(2, {1, 2});
    EXPECT_EQ(stored<CursorLocationKind>().size(), 24U + 2 * 16) << "the stream goes on";
    EXPECT_THAT(
        told, ElementsAre(fileOf<CursorLocationKind>() + ": an entry at a time that is not finite cannot be recorded"));
    EXPECT_FALSE(session.isHealthy());
}

TEST_F(SessionLosses, AreEntriesAfterTheEnd) {
    SessionWriter session(path, options());
    session.write<CursorLocationKind>(1, {1, 2});
    session.finish();
    EXPECT_TRUE(told.empty());
    session.write<CursorLocationKind>(2, {1, 2});
    session.write<CPUUsageKind>(2, 0.5F);
    EXPECT_EQ(told.size(), 1U);
    EXPECT_EQ(stored<CursorLocationKind>().size(), 24U + 16);
    EXPECT_EQ(stored<CPUUsageKind>(), "");
    session.flush();
    session.flushIfDue();
}

TEST_F(SessionLosses, MayEndTheSession) {
    std::optional<SessionWriter> session;
    SessionOptions ending = options();
    ending.onLoss = [&](const Error&) {
        told.emplace_back("loss");
        session->finish();
        session->write<CPUUsageKind>(3, 0.5F);
    };
    session.emplace(path, ending);
    session->write<CursorLocationKind>(1, {1, 2});
    session->write<TopmostAppNameKind>(1, "Editor");
    {
        const FileSizeLimit limit(40);
        session->write<CursorLocationKind>(2, {3, 4});
    }
    EXPECT_THAT(told, ElementsAre("loss"));
    EXPECT_EQ(stored<TopmostAppNameKind>().size(), 24U + 18);
}

TEST_F(SessionLosses, ThatAreToldByTheDestructorThrowNothing) {
    SessionOptions throwing = options(1h);
    throwing.onLoss = [](const Error&) { throw std::runtime_error("of the application"); };
    {
        SessionWriter session(path, throwing);
        session.write<CursorLocationKind>(1, {1, 2});
        session.write<CursorLocationKind>(2, {1, 2});
        const FileSizeLimit limit(0);
        EXPECT_THROW(session.write<CPUUsageKind>(std::numeric_limits<double>::infinity(), 0.5F), std::runtime_error);
    }
    {
        path = folder / "other";
        SessionWriter session(path, throwing);
        session.write<CursorLocationKind>(1, {1, 2});
        session.write<CursorLocationKind>(2, {1, 2});
        const FileSizeLimit limit(0);
        { const SessionWriter ended = std::move(session); }
    }
    EXPECT_EQ(SessionWriter::abandoned(folder.path()).size(), 2U);
}

// ---- The folder -------------------------------------------------------------------------------------------------

class SessionFolder : public SessionFixture {};

TEST_F(SessionFolder, AndItsFilesArePrivate) {
    const mode_t mask = umask(0);
    SessionWriter session(path);
    session.write<KeyboardActionKind>(1, KeyStroke(65, 0));
    umask(mask);
    using std::filesystem::perms;
    EXPECT_EQ(std::filesystem::status(path).permissions(), perms::owner_all);
    for (const std::string& name : filesInFolder())
        EXPECT_EQ(std::filesystem::status(path / name).permissions(), perms::owner_read | perms::owner_write) << name;
}

TEST_F(SessionFolder, MayExistAndHoldOtherFiles) {
    std::filesystem::create_directory(path);
    writeFile(path / "movie.mp4", "pictures");
    SessionWriter session(path);
    session.write<CursorLocationKind>(1, {1, 2});
    session.finish();
    EXPECT_THAT(filesInFolder(), ElementsAre("cursorLocation.dat", "movie.mp4", "session.lock"));
    EXPECT_EQ(contentsOf(path / "movie.mp4"), "pictures");
    EXPECT_EQ(session.folder(), path);
}

TEST_F(SessionFolder, OfAnotherSessionIsRefused) {
    const std::string refused =
        path.string() +
        ": holds another session; record into another folder, or save that session and remove its files";
    {
        SessionWriter session(path);
        session.write<CursorLocationKind>(1, {1, 2});
        EXPECT_EQ(refusal([&] { SessionWriter second(path); }), refused) << "while it is alive";
        session.flush();
    }
    EXPECT_EQ(refusal([&] { SessionWriter second(path); }), refused) << "after it was abandoned";
    EXPECT_EQ(stored<CursorLocationKind>().size(), 24U + 16);
}

TEST_F(SessionFolder, WithAStreamFileIsRefused) {
    std::filesystem::create_directory(path);
    std::filesystem::create_symlink("nowhere", path / "hoverRect.dat");
    EXPECT_EQ(refusal([&] { SessionWriter session(path); }),
              path.string() + "/hoverRect.dat: exists already; record into another folder");
    EXPECT_THAT(filesInFolder(), ElementsAre("hoverRect.dat"));
}

TEST_F(SessionFolder, ThatCannotBeCreatedIsRefused) {
    EXPECT_EQ(refusal([&] { SessionWriter session(path / "below"); }),
              (path / "below").string() + ": cannot be created: No such file or directory");
    writeFile(path, "a file");
    EXPECT_EQ(refusal([&] { SessionWriter session(path); }), path.string() + ": cannot be created: File exists");
}

TEST_F(SessionFolder, IsNotThereIfTheDiskIsFullAtTheStart) {
    {
        const FileSizeLimit limit(0);
        EXPECT_THAT(refusal([&] { SessionWriter session(path); }),
                    HasSubstr("session.lock: cannot be written at offset 0: File too large"));
    }
    EXPECT_FALSE(std::filesystem::exists(path));
}

TEST_F(SessionFolder, IsRemovedWithTheFilesOfTheSessionAndNoOthers) {
    SessionWriter session(path);
    session.write<CursorLocationKind>(1, {1, 2});
    session.removeFiles();
    EXPECT_FALSE(std::filesystem::exists(path));
    SessionWriter second(path);
    second.write<CursorLocationKind>(1, {1, 2});
    writeFile(path / "movie.mp4", "pictures");
    second.removeFiles();
    EXPECT_THAT(filesInFolder(), ElementsAre("movie.mp4"));
}

TEST_F(SessionFolder, StaysWithASessionThatIsMoved) {
    SessionWriter first(path);
    first.write<CursorLocationKind>(1, {1, 2});
    SessionWriter second(std::move(first));
    second.write<CursorLocationKind>(2, {1, 2});
    SessionWriter third(folder / "third");
    third = std::move(second);
    third.write<CursorLocationKind>(3, {1, 2});
    third.finish();
    EXPECT_EQ(stored<CursorLocationKind>().size(), 24U + 3 * 16);
}

// ---- Saving -----------------------------------------------------------------------------------------------------

class SessionSaving : public SessionFixture {
protected:
    void record(SessionWriter& session) {
        session.write<RecordingRegionKind>(Rect(0, 0, 1920, 1080));
        session.write<CursorLocationKind>(0.25, {1, 2});
        session.write<CursorLocationKind>(0.5, {3, 4});
        session.write<TopmostAppNameKind>(0.25, "Editor");
    }
};

TEST_F(SessionSaving, AttachesTheStreamsAndStampsTheMovie) {
    const std::string movie = newMovie();
    SessionWriter session(path);
    record(session);
    const AttachResult saved = session.saveInto(movie, "Recorder", "4.2");
    ASSERT_EQ(saved.streams.size(), 3U);
    EXPECT_EQ(saved.streams[0].entries, 2U);
    EXPECT_EQ(saved.streams[0].type, s_cursorLocationUUID);
    EXPECT_EQ(CursorLocationMetaDataParser(movie).read()->back().get<std::int32_t>("x"), 3);
    const auto creators = readRecordingInfo(*MetaDataParser::create(movie));
    ASSERT_EQ(creators.size(), 1U);
    EXPECT_EQ(creators[0].creator.version(), "4.2");
    EXPECT_FALSE(validateRecording(movie).isDamaged());
    EXPECT_THAT(filesInFolder(), ElementsAre("cursorLocation.dat", "recordingRegion.dat", "topmostAppName.dat"));
}

TEST_F(SessionSaving, OfASessionWithoutEntriesStampsOnly) {
    const std::string movie = newMovie();
    SessionWriter session(path);
    EXPECT_TRUE(session.saveInto(movie).streams.empty());
    EXPECT_TRUE(MetaDataParser::create(movie)->getAvailableMetaDataUUIDs().empty());
    EXPECT_EQ(readRecordingInfo(*MetaDataParser::create(movie)).size(), 1U);
}

TEST_F(SessionSaving, RefusesAMovieThatHasAStreamOfAKindAndChangesNothing) {
    const std::string movie = newMovie();
    SessionWriter first(path);
    record(first);
    first.saveInto(movie);
    const std::string before = contentsOf(movie);
    SessionWriter session(folder / "second");
    session.write<CursorLocationKind>(1, {1, 2});
    EXPECT_EQ(refusal([&] { session.saveInto(movie); }),
              movie + ": has a stream of the kind cursorLocation already, at offset 44");
    EXPECT_EQ(contentsOf(movie), before);
    session.saveInto(newMovie("Other.mp4"));
    EXPECT_EQ(CursorLocationMetaDataParser(folder / "Other.mp4").read()->size(), 1U) << "it can be saved elsewhere";
}

TEST_F(SessionSaving, SaysWhichMovieIsMissingOrIsNone) {
    SessionWriter session(path);
    record(session);
    EXPECT_EQ(refusal([&] { session.saveInto(folder / "No.mp4"); }),
              folder / "No.mp4" + ": cannot be opened for changing: No such file or directory");
    writeFile(folder / "No.mp4", "text that is no movie, and has more than a few bytes");
    EXPECT_THAT(refusal([&] { session.saveInto(folder / "No.mp4"); }), HasSubstr(folder / "No.mp4: "));
}

TEST_F(SessionSaving, LeavesTheMovieAsItWasWhenTheDiskIsFull) {
    const std::string movie = newMovie();
    SessionWriter session(path);
    record(session);
    session.finish();
    for (std::uint64_t limit = 12; limit < 12 + 16 + 3 * 16 + 100; ++limit) {
        {
            const FileSizeLimit fullDisk(limit);
            EXPECT_NE(refusal([&] { session.saveInto(movie, "Recorder", "4.2"); }), "none") << limit;
        }
        EXPECT_EQ(contentsOf(movie), atom("ftyp", "mp42"));
    }
    EXPECT_EQ(session.saveInto(movie, "Recorder", "4.2").streams.size(), 3U);
}

TEST_F(SessionSaving, LeavesOutWhatIsNotWhole) {
    const std::string movie = newMovie();
    SessionOptions options;
    options.flushInterval = 0ms;
    SessionWriter session(path, options);
    record(session);
    {
        const FileSizeLimit limit(24 + 2 * 16 + 3);
        session.write<CursorLocationKind>(0.75, {5, 6});
        session.write<SlideInfoTitleKind>(0.75, std::string(100, 'x'));
    }
    const AttachResult saved = session.saveInto(movie);
    ASSERT_EQ(saved.streams.size(), 3U) << "none of the titles is whole";
    EXPECT_EQ(saved.streams[0].entries, 2U);
    EXPECT_EQ(saved.streams[0].bytesCut, 3U);
}

TEST_F(SessionSaving, CanBeLeftToTheApplication) {
    SessionWriter session(path);
    record(session);
    session.finish();
    const std::vector<StreamSource> sources = session.sources();
    ASSERT_EQ(sources.size(), 3U);
    EXPECT_EQ(sources[0].name(), fileOf<CursorLocationKind>());
    EXPECT_EQ(sources[1].name(), fileOf<RecordingRegionKind>());
}

// ---- Sessions that died -----------------------------------------------------------------------------------------

class SessionRemains : public SessionFixture {
protected:
    std::vector<AbandonedSession> found() const { return SessionWriter::abandoned(folder.path()); }

    void record(SessionWriter& session) {
        session.write<CursorLocationKind>(0.25, {1, 2});
        session.write<CursorLocationKind>(1.5, {3, 4});
        session.write<TopmostWindowTitleKind>(1.25, "Inbox");
    }
};

TEST_F(SessionRemains, AreWhatASessionLeavesThatWasNeitherFinishedNorSaved) {
    {
        SessionWriter session(path);
        record(session);
        EXPECT_TRUE(found().empty()) << "it is alive";
    }
    const auto sessions = found();
    ASSERT_EQ(sessions.size(), 1U);
    EXPECT_EQ(sessions[0].folder(), path);
    EXPECT_EQ(sessions[0].lastTime(), 1.5);
    ASSERT_EQ(sessions[0].streams().size(), 2U);
    const SessionStream& positions = sessions[0].streams()[0];
    EXPECT_EQ(positions.name(), "cursorLocation");
    EXPECT_EQ(positions.file, FileLocation(fileOf<CursorLocationKind>()));
    EXPECT_EQ(positions.entries, 2U);
    EXPECT_EQ(positions.tornBytes, 0U);
    EXPECT_EQ(positions.lastTime, 1.5);
    EXPECT_EQ(sessions[0].streams()[1].name(), "topmostWindowTitle");
    EXPECT_EQ(sessions[0].streams()[1].lastTime, 1.25);
}

TEST_F(SessionRemains, AreNotLeftByASessionThatWasFinishedSavedOrRemoved) {
    SessionWriter(folder / "finished").finish();
    SessionWriter(folder / "saved").saveInto(newMovie());
    SessionWriter(folder / "removed").removeFiles();
    EXPECT_TRUE(found().empty());
}

TEST_F(SessionRemains, AreLeftByASessionThatCouldNotBeSaved) {
    {
        SessionWriter session(path);
        record(session);
        session.finish();
        EXPECT_NE(refusal([&] { session.saveInto(folder / "missing.mp4"); }), "none");
        EXPECT_TRUE(found().empty()) << "it is alive";
    }
    EXPECT_EQ(found().size(), 1U);
}

TEST_F(SessionRemains, AreFoundInTheFolderItselfAndInFoldersInIt) {
    { SessionWriter b(folder / "b"); }
    { SessionWriter a(folder / "a"); }
    { SessionWriter c(folder.path() / "a" / "c"); }
    std::filesystem::create_directory(folder / "empty");
    writeFile(folder / "file", "file");
    const auto sessions = found();
    ASSERT_EQ(sessions.size(), 2U);
    EXPECT_EQ(sessions[0].folder(), folder.path() / "a");
    EXPECT_EQ(sessions[1].folder(), folder.path() / "b");
    EXPECT_TRUE(sessions[0].streams().empty());
    EXPECT_EQ(sessions[0].lastTime(), std::nullopt);
    const auto nested = SessionWriter::abandoned(folder.path() / "a");
    ASSERT_EQ(nested.size(), 2U);
    EXPECT_EQ(nested[0].folder(), folder.path() / "a");
    EXPECT_EQ(nested[1].folder(), folder.path() / "a" / "c");
    EXPECT_EQ(refusal([&] { SessionWriter::abandoned(folder.path() / "missing"); }),
              folder / "missing" + ": No such file or directory");
}

TEST_F(SessionRemains, TellWhatIsWholeAndWhatIsTorn) {
    {
        SessionWriter session(path);
        record(session);
    }
    const std::string positions = stored<CursorLocationKind>();
    writeFile(fileOf<CursorLocationKind>(), positions.substr(0, 24 + 16 + 5));
    writeFile(fileOf<TopmostWindowTitleKind>(), stored<TopmostWindowTitleKind>().substr(0, 20));
    writeFile(fileOf<CPUUsageKind>(), positions);
    const auto sessions = found();
    ASSERT_EQ(sessions.size(), 1U);
    ASSERT_EQ(sessions[0].streams().size(), 3U);
    EXPECT_EQ(sessions[0].streams()[0].entries, 1U);
    EXPECT_EQ(sessions[0].streams()[0].tornBytes, 5U);
    EXPECT_EQ(sessions[0].streams()[0].lastTime, 0.25);
    EXPECT_EQ(sessions[0].streams()[1].entries, 0U) << "a part of a header";
    EXPECT_EQ(sessions[0].streams()[1].tornBytes, 20U);
    EXPECT_EQ(sessions[0].streams()[2].entries, 0U) << "another kind";
    EXPECT_EQ(sessions[0].streams()[2].tornBytes, positions.size());
    EXPECT_EQ(sessions[0].lastTime(), 0.25);
}

TEST_F(SessionRemains, CanBeSavedAndRemoved) {
    {
        SessionWriter session(path);
        record(session);
    }
    writeFile(path / "movie.mp4", atom("ftyp", "mp42"));
    const AbandonedSession session = found().at(0);
    EXPECT_NE(refusal([&] { session.saveInto(folder / "missing.mp4"); }), "none");
    EXPECT_EQ(found().size(), 1U) << "nothing was saved";
    const AttachResult saved = session.saveInto(path / "movie.mp4", "Recorder", "4.2");
    ASSERT_EQ(saved.streams.size(), 2U);
    EXPECT_EQ(CursorLocationMetaDataParser(path / "movie.mp4").read()->size(), 2U);
    EXPECT_TRUE(found().empty());
    session.removeFiles();
    EXPECT_THAT(filesInFolder(), ElementsAre("movie.mp4"));
}

TEST_F(SessionRemains, CanBeSavedAgain) {
    {
        SessionWriter session(path);
        record(session);
        EXPECT_EQ(refusal([&] { AbandonedSession opened(path); }),
                  path.string() + ": is still in use; finish the recording first");
    }
    AbandonedSession(path).saveInto(newMovie("First.mp4"));
    EXPECT_TRUE(found().empty());
    EXPECT_EQ(AbandonedSession(path).saveInto(newMovie("Second.mp4")).streams.size(), 2U);
    EXPECT_EQ(refusal([&] { AbandonedSession opened(folder / "missing"); }),
              folder / "missing" + ": is no folder, so it holds no session");
}

/// A process that does something until it is killed.
template <class Work>
class Victim {
public:
    explicit Victim(Work work) {
        EXPECT_EQ(pipe(pipe_.data()), 0);
        process_ = fork();
        if (process_ == 0) {
            work(pipe_[1]);
            _exit(1);
        }
        close(pipe_[1]);
    }
    ~Victim() { close(pipe_[0]); }
    Victim(const Victim&) = delete;
    Victim& operator=(const Victim&) = delete;

    int output() const { return pipe_[0]; }

    void kill() const {
        ::kill(process_, SIGKILL);
        int status = 0;
        waitpid(process_, &status, 0);
        EXPECT_TRUE(WIFSIGNALED(status));
    }

private:
    std::array<int, 2> pipe_{};
    pid_t process_ = -1;
};

TEST_F(SessionRemains, AreNotThoseOfALivingProcessButThoseOfAKilledOne) {
    const Victim victim([this](int output) {
        SessionWriter session(path);
        record(session);
        session.flush();
        static_cast<void>(write(output, "!", 1) == 1);
        pause();
    });
    char byte = 0;
    ASSERT_EQ(read(victim.output(), &byte, 1), 1);
    EXPECT_TRUE(found().empty());
    EXPECT_NE(refusal([&] { SessionWriter session(path); }), "none");
    victim.kill();
    ASSERT_EQ(found().size(), 1U);
    EXPECT_EQ(found()[0].lastTime(), 1.5);
}

/// The victim tells after each entry when it was written.
TEST_F(SessionRemains, OfAProcessThatIsKilledLackNoMoreThanTheLastInterval) {
    const Victim victim([this](int output) {
        SessionWriter session(path);
        for (std::int32_t number = 0;; ++number) {
            session.write<CursorLocationKind>(number * 0.001, Point(number, -number));
            const std::int64_t written =
                std::chrono::nanoseconds(std::chrono::steady_clock::now().time_since_epoch()).count();
            if (write(output, &written, sizeof written) != sizeof written)
                return;
            std::this_thread::sleep_for(1ms);
        }
    });
    std::vector<std::int64_t> times;
    std::int64_t time = 0;
    while (read(victim.output(), &time, sizeof time) == sizeof time) {
        times.push_back(time);
        if (times.back() - times.front() > std::chrono::nanoseconds(1300ms).count())
            break;
    }
    victim.kill();
    ASSERT_GE(times.size(), 3U);
    const std::int64_t lastWriteBegan = times[times.size() - 2]; // at the earliest
    std::uint64_t safe = 0;
    while (safe < times.size() && times[safe] + std::chrono::nanoseconds(500ms).count() <= lastWriteBegan)
        ++safe;
    EXPECT_GT(safe, 0U);
    const auto sessions = found();
    ASSERT_EQ(sessions.size(), 1U);
    ASSERT_EQ(sessions[0].streams().size(), 1U);
    EXPECT_GE(sessions[0].streams()[0].entries, safe);
}

} // namespace

} // namespace ZULMetaData::Test
