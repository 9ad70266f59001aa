#include "ZULMetaDataSession/Recording.h"

#include "Tests/Support/Files.h"
#include "Tests/Support/InvalidCorpus.h"
#include "Tests/ZULMetaDataSession/SessionSamples.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>
#include <system_error>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;

/// Runs `work` and returns its `Error`.
template <class Work>
Error errorOf(Work work) {
    try {
        work();
    } catch (const Error& error) {
        return error;
    }
    return {"nothing was thrown", ""};
}

template <class Kind>
std::vector<std::string> readEntries(const Recording& recording, std::size_t most = 1000) {
    std::vector<std::string> entries;
    recording.read<Kind>([&](double time, const TrackValueOf<Kind>& value) {
        entries.push_back(shown(time, shown(value)));
        return entries.size() < most;
    });
    return entries;
}

// ---- Every kind -----------------------------------------------------------------------------------------------

template <class S>
struct RecordingOfKind : testing::Test {
    using Kind = typename S::Kind;

    /// The track of a stream file of these bytes.
    static std::vector<std::string> trackOf(const std::string& stream) {
        return shown(MemoryRecording(stream, "a.dat")->template track<Kind>());
    }

    /// The size of the samples without their last `count`.
    static std::size_t sizeWithoutLast(std::size_t count) {
        std::size_t size = goldenStream<S>().size();
        const auto samples = S::samples();
        for (std::size_t i = 0; i < count; ++i)
            size -= samples[samples.size() - 1 - i].bytes.size();
        return size;
    }
};
TYPED_TEST_SUITE(RecordingOfKind, TestedKinds, KindName);

TYPED_TEST(RecordingOfKind, HasTheEntriesOfAStreamFile) {
    EXPECT_THAT(this->trackOf(goldenStream<TypeParam>()), ElementsAreArray(entriesInTrack<TypeParam>()));
}

TYPED_TEST(RecordingOfKind, HasTheEntriesOfAMovieOfEveryKind) {
    const MemoryRecording recording(movieOfEveryKind());
    EXPECT_TRUE(recording->has(TypeParam::Kind::type));
    EXPECT_THAT(shown(recording->track<typename TypeParam::Kind>()), ElementsAreArray(entriesInTrack<TypeParam>()));
}

TYPED_TEST(RecordingOfKind, IsEmptyWithoutAStreamAndWithoutEntries) {
    const MemoryRecording none(movieOf({}));
    EXPECT_FALSE(none->has(TypeParam::Kind::type));
    EXPECT_TRUE(none->track<typename TypeParam::Kind>().empty());
    EXPECT_THAT(readEntries<typename TypeParam::Kind>(*none), IsEmpty());
    EXPECT_THAT(this->trackOf(TypeParam::header()), IsEmpty());
}

TYPED_TEST(RecordingOfKind, HasTheWholeEntriesBeforeATornOne) {
    const std::string whole = goldenStream<TypeParam>();
    const std::size_t lastEntry = this->sizeWithoutLast(1);
    const std::vector<std::string> before = this->trackOf(whole.substr(0, lastEntry));
    EXPECT_EQ(before.size(), TypeParam::samples().size() - 1);
    for (std::size_t size = lastEntry + 1; size < whole.size(); ++size)
        EXPECT_EQ(this->trackOf(whole.substr(0, size)), before) << size;
}

TYPED_TEST(RecordingOfKind, VisitsTheEntriesInTheOrderOfTheStream) {
    using Recorded = typename TypeParam::Kind;
    const MemoryRecording recording(goldenStream<TypeParam>(), "a.dat");
    std::vector<double> times;
    recording->read<Recorded>([&times](double time, const TrackValueOf<Recorded>&) {
        times.push_back(time);
        return true;
    });
    EXPECT_EQ(times.size(), TypeParam::samples().size());
    std::sort(times.begin(), times.end());
    const auto inTrack = recording->track<Recorded>().times();
    EXPECT_TRUE(std::equal(times.begin(), times.end(), inTrack.begin(), inTrack.end()));
}

TYPED_TEST(RecordingOfKind, EndsAVisitThatHasSeenEnough) {
    EXPECT_EQ(readEntries<typename TypeParam::Kind>(*MemoryRecording(goldenStream<TypeParam>(), "a.dat"), 1).size(),
              1U);
}

TYPED_TEST(RecordingOfKind, RefusesAVersionThatDoesNotExist) {
    for (const std::int32_t version : {0, -1, TypeParam::Kind::version + 1}) {
        std::string stream = goldenStream<TypeParam>();
        stream.replace(16, 4, raw(version));
        const MemoryRecording recording(movieOf({stream}), "b.mp4");
        const Error error = errorOf([&] { recording->track<typename TypeParam::Kind>(); });
        EXPECT_EQ(error.file(), "b.mp4");
        EXPECT_EQ(error.offset(), media().size() + 32);
        EXPECT_THAT(error.sentence(), HasSubstr("the stream " + std::string(TypeParam::name) + " has version " +
                                                std::to_string(version)));
        EXPECT_EQ(errorOf([&] { readEntries<typename TypeParam::Kind>(*recording); }).sentence(), error.sentence());
    }
}

TYPED_TEST(RecordingOfKind, RefusesAnotherEntrySize) {
    std::string stream = goldenStream<TypeParam>();
    stream.replace(20, 4, le32(13));
    const MemoryRecording recording(stream, "a.dat");
    const Error error = errorOf([&] { recording->track<typename TypeParam::Kind>(); });
    EXPECT_EQ(error.file(), "a.dat");
    EXPECT_EQ(error.offset(), 0U);
    EXPECT_THAT(error.sentence(), HasSubstr(" states entries of 13 bytes instead of "));
}

// ---- Opening --------------------------------------------------------------------------------------------------

TEST(SessionRecording, IsRecognizedByItsContents) {
    const TemporaryFolder folder;
    writeFile(folder / "movie.txt", movieOfEveryKind());
    const Recording movie(folder / "movie.txt");
    EXPECT_EQ(movie.name(), folder / "movie.txt");
    EXPECT_EQ(movie.container(), Container::QuickTime);
    EXPECT_EQ(movie.streams().size(), 17U);
    EXPECT_EQ(MemoryRecording(riffMedia() + zulmChunk({locationStream()}), "a")->container(), Container::Riff);
    EXPECT_EQ(MemoryRecording(locationStream(), "a")->container(), Container::RawStream);
}

TEST(SessionRecording, SaysWhyItCannotBeOpened) {
    const TemporaryFolder folder;
    const Error missing = errorOf([&] { Recording(folder / "missing.mp4"); });
    EXPECT_EQ(missing.file(), folder / "missing.mp4");
    EXPECT_THAT(missing.sentence(), HasSubstr("cannot be opened"));
    EXPECT_EQ(missing.offset(), std::nullopt);
    EXPECT_STREQ(missing.what(), (folder / "missing.mp4: cannot be opened: No such file or directory").c_str());
    EXPECT_EQ(errorOf([&] { Recording(folder.path()); }).file(), folder.path().string());

    const Error text = errorOf([] { MemoryRecording(std::string(100, '\0'), "notes.txt"); });
    EXPECT_EQ(text.file(), "notes.txt");
    EXPECT_EQ(text.sentence(), "begins neither like a movie, nor a RIFF file, nor a stream");
}

TEST(SessionRecording, KnowsItsStreamsCreatorsAndDuration) {
    const std::string later = streamHeader(s_cursorLocations, 1, 16) + pointEntry(1, 8, 9);
    const MemoryRecording recording(movieOf({locationStream(), later, appNameStream()}));
    ASSERT_EQ(recording->streams().size(), 2U);
    EXPECT_EQ(recording->streams()[0].name(), "topmostAppName");
    EXPECT_EQ(recording->streams()[1].name(), "cursorLocation");
    EXPECT_THAT(shown(recording->track<CursorLocationKind>()), ElementsAre("1: (8,9)"));
    ASSERT_EQ(recording->hiddenStreams().size(), 1U);
    EXPECT_EQ(recording->hiddenStreams()[0].offset, media().size() + 32);
    EXPECT_THAT(recording->creators(), IsEmpty());
    EXPECT_EQ(recording->duration(), std::nullopt);
}

TEST(SessionRecording, HandsOutTheBytesOfAStream) {
    const MemoryRecording recording(movieOf({locationStream()}));
    const ByteSource bytes = recording->bytesOf(recording->streams().at(0));
    std::string copy(static_cast<std::size_t>(bytes.size()), '\0');
    EXPECT_EQ(bytes.read(0, copy), locationStream().size());
    EXPECT_EQ(copy, locationStream());
}

TEST(SessionRecording, CanBeMoved) {
    EXPECT_TRUE(std::is_nothrow_move_constructible_v<Recording>);
    EXPECT_TRUE(std::is_nothrow_move_assignable_v<Recording>);
    EXPECT_FALSE(std::is_copy_constructible_v<Recording>);
    const std::string bytes = movieOf({locationStream()});
    Recording first(ByteSource::memory(bytes), "a.mp4");
    const auto* track = &first.track<CursorLocationKind>();
    Recording second = std::move(first);
    EXPECT_EQ(&second.track<CursorLocationKind>(), track);
    first = std::move(second);
    EXPECT_EQ(first.track<CursorLocationKind>().size(), 2U);
}

TEST(SessionRecording, HasSystemDataAtTheStart) {
    const std::string list = le32(8) + f64(42) + le32(0);
    std::string texts;
    for (const char* text : {"a", "b", "c", "d"})
        texts += textEntry(42, text);
    const std::string stream =
        streamHeader("2b7b6afc", 1, 0) + le32(static_cast<std::uint32_t>(4 + texts.size())) + le32(4) + texts;
    EXPECT_THAT(shown(MemoryRecording(stream, "a.dat")->track<SystemDataKind>()), ElementsAre("0: a|b|c|d"));
}

TEST(SessionRecording, KeepsBytesThatAreNotUTF8) {
    const std::string stream =
        streamHeader(s_appNames, 1, 0) + textEntry(1, "\xff") + textEntry(2, std::string("a\0b", 3));
    const MemoryRecording recording(stream, "a.dat");
    EXPECT_THAT(recording->track<TopmostAppNameKind>().values(), ElementsAre("\xff", std::string("a\0b", 3)));
}

TEST(SessionRecording, CountsEntriesAtNoTime) {
    const std::string stream = locationStream() + pointEntry(std::nan(""), 1, 1) + pointEntry(0.25, 2, 2);
    const MemoryRecording recording(stream, "a.dat");
    EXPECT_THAT(shown(recording->track<CursorLocationKind>()), ElementsAre("0.25: (2,2)", "0.5: (10,20)", "1: (-3,7)"));
    EXPECT_EQ(recording->track<CursorLocationKind>().leftOut(), 1U);
}

TEST(SessionRecording, ReadsStreamsOfManyBlocks) {
    std::string stream = streamHeader(s_cursorLocations, 1, 16);
    constexpr int count = 100000;
    for (int i = 0; i < count; ++i)
        stream += pointEntry(i / 1000.0, i, -i);
    const MemoryRecording ordered(stream, "a.dat");
    const auto& track = ordered->track<CursorLocationKind>();
    ASSERT_EQ(track.size(), static_cast<std::size_t>(count));
    for (int i = 0; i < count; ++i)
        ASSERT_TRUE(track.values()[static_cast<std::size_t>(i)] == Point(i, -i) &&
                    track.times()[static_cast<std::size_t>(i)] == i / 1000.0)
            << i;

    // The first entry of the second block is the only one that is not in order.
    constexpr std::size_t block = 256 * 1024;
    stream.replace(24 + block, 16, pointEntry(0.5005, 7, 7));
    const MemoryRecording unordered(stream, "a.dat");
    const auto& sorted = unordered->track<CursorLocationKind>();
    EXPECT_TRUE(std::is_sorted(sorted.times().begin(), sorted.times().end()));
    EXPECT_EQ(*sorted.at(0.5007), Point(7, 7));
    EXPECT_EQ(sorted.size(), static_cast<std::size_t>(count));
}

// ---- What is read ---------------------------------------------------------------------------------------------

/// Bytes that remember which of them were read.
struct WatchedBytes {
    std::string bytes;
    std::vector<bool> wasRead = std::vector<bool>(bytes.size());

    ByteSource source() {
        return {bytes.size(), [this](std::uint64_t position, std::span<char> to) {
                    const std::size_t count = bytes.copy(to.data(), to.size(), static_cast<std::size_t>(position));
                    std::fill_n(wasRead.begin() + static_cast<std::ptrdiff_t>(position), count, true);
                    return count;
                }};
    }
    bool wasAnyRead(std::uint64_t from, std::uint64_t to) const {
        return std::find(wasRead.begin() + static_cast<std::ptrdiff_t>(from),
                         wasRead.begin() + static_cast<std::ptrdiff_t>(to),
                         true) != wasRead.begin() + static_cast<std::ptrdiff_t>(to);
    }
};

TYPED_TEST(RecordingOfKind, ReadsTheBytesOfItsStreamAlone) {
    WatchedBytes watched{movieOfEveryKind()};
    const Recording recording(watched.source(), "a.mp4");
    for (int round = 0; round < 2; ++round) {
        watched.wasRead.assign(watched.bytes.size(), false);
        if (round == 0)
            recording.track<typename TypeParam::Kind>();
        else
            readEntries<typename TypeParam::Kind>(recording);
        for (const StreamInfo& stream : recording.streams())
            EXPECT_EQ(watched.wasAnyRead(stream.offset, stream.offset + stream.presentBytes),
                      stream.type == TypeParam::Kind::type)
                << stream.name();
        const auto& own = *std::find_if(recording.streams().begin(), recording.streams().end(),
                                        [](const StreamInfo& stream) { return stream.type == TypeParam::Kind::type; });
        EXPECT_FALSE(watched.wasAnyRead(0, own.offset));
        EXPECT_FALSE(watched.wasAnyRead(own.offset + own.presentBytes, watched.bytes.size()));
    }
}

TEST(SessionRecording, ReadsATrackOnce) {
    WatchedBytes watched{movieOfEveryKind()};
    const Recording recording(watched.source(), "a.mp4");
    const auto* first = &recording.track<CursorLocationKind>();
    watched.wasRead.assign(watched.bytes.size(), false);
    EXPECT_EQ(&recording.track<CursorLocationKind>(), first);
    EXPECT_FALSE(watched.wasAnyRead(0, watched.bytes.size()));
}

TEST(SessionRecording, ReportsThatReadingFailed) {
    const std::string bytes = movieOf({locationStream(), appNameStream()});
    bool fails = false;
    const ByteSource source(bytes.size(), [&](std::uint64_t position, std::span<char> to) {
        if (fails)
            throw std::system_error(EIO, std::generic_category(), "cannot be read");
        return bytes.copy(to.data(), to.size(), static_cast<std::size_t>(position));
    });
    const Recording recording(source, "disk.mp4");
    const ByteSource stream = recording.bytesOf(recording.streams().at(0));
    fails = true;
    for (const Error& error :
         {errorOf([&] { recording.track<CursorLocationKind>(); }),
          errorOf([&] { recording.track<TopmostAppNameKind>(); }),
          errorOf([&] { readEntries<CursorLocationKind>(recording); }), errorOf([&] { recording.duration(); }),
          errorOf([&] { recording.hiddenStreams(); }), errorOf([&] { recording.hidesStreams(); }), errorOf([&] {
              char byte = 0;
              stream.read(0, {&byte, 1});
          })}) {
        EXPECT_EQ(error.file(), "disk.mp4");
        EXPECT_THAT(error.sentence(), HasSubstr("cannot be read"));
    }
    fails = false;
    EXPECT_EQ(recording.track<CursorLocationKind>().size(), 2U); // a failure is not remembered
    EXPECT_EQ(recording.track<TopmostAppNameKind>().size(), 2U);
}

// ---- Kinds that are none --------------------------------------------------------------------------------------

/// Has the identifier of a kind, but another type of values.
struct PositionsAsRectangles {
    using Value = Rect;
    static constexpr uuid type = CursorLocationKind::type;
    static constexpr int version = CursorLocationKind::version;
    static constexpr StreamRole role = StreamRole::State;
};

/// A kind that the library lists and nobody records.
struct Miscellany {
    using Value = std::string;
    static constexpr uuid type = s_miscellanyUUID;
    static constexpr int version = 1;
    static constexpr StreamRole role = StreamRole::State;
};

template <class Kind>
constexpr bool hasTrack = requires(const Recording& recording) {
    recording.track<Kind>();
};

template <class Kind>
constexpr bool isRead = requires(const Recording& recording) {
    recording.read<Kind>([](double, const auto&) { return true; });
};

TEST(SessionRecording, HasOnlyTracksOfKindsThatAreRecorded) {
    EXPECT_TRUE(hasTrack<CursorLocationKind>);
    EXPECT_TRUE(isRead<CursorLocationKind>);
    EXPECT_FALSE(hasTrack<PositionsAsRectangles>);
    EXPECT_FALSE(isRead<PositionsAsRectangles>);
    EXPECT_FALSE(hasTrack<Miscellany>);
    EXPECT_FALSE(isRead<Miscellany>);
    EXPECT_FALSE(hasTrack<Point>);
}

// ---- Threads --------------------------------------------------------------------------------------------------

template <class S>
void expectSamples(const Recording& recording) {
    EXPECT_EQ(shown(recording.track<typename S::Kind>()), entriesInTrack<S>());
    EXPECT_EQ(readEntries<typename S::Kind>(recording).size(), entriesInTrack<S>().size());
}

TEST(SessionRecording, MayBeReadByManyThreads) {
    const TemporaryFolder folder;
    writeFile(folder / "a.mp4", movieOfEveryKind());
    const Recording recording(folder / "a.mp4");
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i)
        threads.emplace_back([&recording] {
            EXPECT_EQ(recording.duration(), std::nullopt); // before the walk of another thread, during it or after it
            std::apply([&recording]<class... S>(S...) { (expectSamples<S>(recording), ...); }, EveryKind());
            EXPECT_THAT(recording.hiddenStreams(), IsEmpty());
            EXPECT_FALSE(recording.hidesStreams());
            EXPECT_TRUE(recording.at(1).cursor);
        });
    for (std::thread& thread : threads)
        thread.join();
}

// ---- Damage ---------------------------------------------------------------------------------------------------

/// In these, an atom that holds a stream contradicts the one around it or its own header. Readers believe the atom, and
/// the validator does not.
const std::set<std::string> s_otherEnds{
    "movie-zulm-too-small.mp4",
    "movie-data-beyond-zulm.mp4",
    "movie-short-data-header.mp4",
    "riff-data-beyond-zulm.wav",
};

template <class Kind>
void expectReadableEntries(const Recording& recording, const RecordingFile& lower, const StreamReport& report) {
    if (!isDecodable(report.header())) {
        if (report.readableBytes != 0) {
            EXPECT_EQ(errorOf([&] { recording.track<Kind>(); }).file(), recording.name());
        }
        return;
    }
    const Track<Kind>& track = recording.track<Kind>();
    std::size_t expected = 0;
    lower.readEntries<typename Kind::Value>(report, [&expected](double, const auto&) { return ++expected > 0; });
    EXPECT_EQ(track.size() + track.leftOut(), expected) << report.name();
}

TEST(DamagedRecordings, HaveTheEntriesThatTheValidatorCallsReadable) {
    for (const InvalidFile& file : invalidCorpus()) {
        SCOPED_TRACE(file.name);
        if (s_otherEnds.contains(file.name))
            continue;
        RecordingFile lower{FileLocation(file.path)};
        const Recording recording{FileLocation(file.path)};
        ASSERT_EQ(recording.streams().size(), lower.streams().size());
        for (const StreamReport& report : lower.examinedStreams())
            RecordedKinds::visit(report.type,
                                 [&]<class Kind>() { expectReadableEntries<Kind>(recording, lower, report); });
    }
}

TEST(DamagedRecordings, HaveTheEntriesThatReadersFindInAContradictingAtom) {
    std::size_t files = 0;
    for (const InvalidFile& file : invalidCorpus()) {
        if (!s_otherEnds.contains(file.name))
            continue;
        SCOPED_TRACE(file.name);
        ++files;
        RecordingFile lower{FileLocation(file.path)};
        const Recording recording{FileLocation(file.path)};
        for (const StreamInfo& stream : lower.streams()) {
            std::size_t expected = 0;
            lower.readEntries<Point>(stream, [&expected](double, const Point&) { return ++expected > 0; });
            EXPECT_EQ(recording.track<CursorLocationKind>().size(), expected);
        }
    }
    EXPECT_EQ(files, s_otherEnds.size());
}

TEST(SessionRecording, PrintsNothing) {
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    for (const InvalidFile& file : invalidCorpus())
        Recording{FileLocation(file.path)}.hiddenStreams();
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TEST(DamagedRecordings, OfEveryLengthAreReadOrRefused) {
    const std::string whole = movieOfEveryKind();
    for (std::size_t size = 0; size < whole.size(); ++size) {
        try {
            const MemoryRecording recording(whole.substr(0, size));
            RecordedKinds::forEach([&]<class Kind>() { recording->track<Kind>(); });
        } catch (const Error& error) {
            EXPECT_EQ(error.file(), "Recording.mp4");
        }
    }
}

} // namespace
} // namespace ZULMetaData::Test
