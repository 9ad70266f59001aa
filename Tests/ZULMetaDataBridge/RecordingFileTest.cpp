#include "ZULMetaDataBridge/Source/RecordingFile.h"

#include "Tests/Support/Files.h"
#include "Tests/Support/InvalidCorpus.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <system_error>
#include <tuple>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

const uuid s_locations = kind(s_cursorLocations);

std::string movie(const std::string& children) {
    return media() + extendedAtom("ZULM", children);
}

/// A recording in memory.
class Opened {
public:
    explicit Opened(const std::string& bytes, const std::string& name = "Recording.mp4")
        : bytes_(bytes), recording_(ByteSource::memory(bytes_), name) {}

    RecordingFile* operator->() { return &recording_; }

    /// The positions in the stream: time, x, y.
    template <class Stream>
    std::vector<std::tuple<double, int, int>> positionsIn(const Stream& stream) {
        std::vector<std::tuple<double, int, int>> positions;
        recording_.readEntries<Point>(stream, [&](double time, const Point& point) {
            positions.emplace_back(time, point.x, point.y);
            return true;
        });
        return positions;
    }

private:
    std::string bytes_;
    RecordingFile recording_;
};

template <class Error, class Work>
std::string errorOf(Work work) {
    try {
        work();
    } catch (const Error& error) {
        return error.what();
    }
    return "nothing was thrown";
}

TEST(RecordingFile, FindsTheStreamsOfAMovie) {
    Opened recording(movie(extendedAtom("DATA", locationStream()) + extendedAtom("DATA", appNameStream())));
    EXPECT_STREQ(containerName(recording->container()), "movie");
    const std::vector<StreamInfo> streams = recording->streams();
    ASSERT_EQ(streams.size(), 2U);
    EXPECT_EQ(streams[0].name(), "topmostAppName"); // in the order of the identifiers
    EXPECT_EQ(streams[1].type, s_locations);
    EXPECT_EQ(streams[1].offset, media().size() + 16 + 16);
    EXPECT_EQ(streams[1].declaredBytes, locationStream().size());
    EXPECT_FALSE(streams[1].isCutShort());
    EXPECT_THAT(recording.positionsIn(streams[1]), ElementsAre(std::tuple(0.5, 10, 20), std::tuple(1.0, -3, 7)));
}

TEST(RecordingFile, CallsAFileByItsPathUnlessItHasAnotherName) {
    const TemporaryFolder folder;
    writeFile(folder / "a.dat", locationStream());
    RecordingFile recording(folder / "a.dat");
    EXPECT_EQ(recording.path(), folder / "a.dat");
    EXPECT_EQ(recording.name(), folder / "a.dat");
    EXPECT_STREQ(containerName(recording.container()), "stream");
    EXPECT_EQ(recording.size(), locationStream().size());
    EXPECT_EQ(RecordingFile(folder / "a.dat", "-").name(), "-");
}

TEST(RecordingFile, SaysWhichFileCannotBeOpened) {
    const TemporaryFolder folder;
    const std::string missing = folder / "missing.mp4";
    EXPECT_EQ(errorOf<FileError>([&] { RecordingFile{missing}; }),
              missing + ": cannot be opened: No such file or directory");
    EXPECT_THAT(errorOf<FileError>([&] { RecordingFile(missing, "-"); }), StartsWith("-: cannot be opened: "));
    EXPECT_EQ(errorOf<std::system_error>([&] { RecordingFile{missing}; }),
              errorOf<FileError>([&] { RecordingFile{missing}; }));
}

TEST(RecordingFile, RefusesAFileThatCanHoldNoMetaData) {
    const TemporaryFolder folder;
    writeFile(folder / "notes.txt", std::string(100, '\0'));
    const std::string refusal = ": begins neither like a movie, nor a RIFF file, nor a stream";
    EXPECT_EQ(errorOf<std::runtime_error>([&] { RecordingFile{folder / "notes.txt"}; }),
              folder / "notes.txt" + refusal);
    EXPECT_EQ(errorOf<std::runtime_error>([] { Opened(std::string(100, '\0'), "notes.txt"); }), "notes.txt" + refusal);
}

TEST(RecordingFile, KnowsHowMuchOfAStreamTheFileHolds) {
    const std::string whole = movie(extendedAtom("DATA", locationStream()));
    Opened recording(whole.substr(0, whole.size() - 20));
    const StreamInfo stream = recording->streams().at(0);
    EXPECT_TRUE(stream.isCutShort());
    EXPECT_EQ(stream.presentBytes, locationStream().size() - 20);
    EXPECT_THAT(recording.positionsIn(stream), testing::IsEmpty());
}

TEST(RecordingFile, ExaminesAStream) {
    Opened recording(movie(extendedAtom("DATA", locationStream())));
    const StreamReport report = recording->examine(recording->streams().at(0));
    EXPECT_TRUE(isDecodable(report.header()));
    EXPECT_EQ(report.wholeEntries, 2U);
    EXPECT_EQ(report.firstTime, 0.5);
    EXPECT_EQ(report.lastTime, 1.0);
    EXPECT_EQ(recording.positionsIn(report).size(), 2U);
    EXPECT_FALSE(recording->validation().isDamaged());
}

TEST(RecordingFile, HasNothingReadableInAStreamWithoutAHeader) {
    Opened recording(movie(extendedAtom("DATA", locationStream().substr(0, 20))));
    for (const StreamReport& report : recording->examinedStreams()) {
        EXPECT_EQ(report.readableBytes, 0U);
        EXPECT_FALSE(isDecodable(report.header()));
        EXPECT_EQ(recording->readEntries<Point>(report, [](double, const Point&) { return true; }), 0U);
    }
}

TEST(RecordingFile, ListsWhatALaterStreamOfTheKindHides) {
    const std::string later = streamHeader(s_cursorLocations, 1, 16) + pointEntry(1, 8, 9);
    Opened recording(movie(extendedAtom("DATA", locationStream()) + extendedAtom("DATA", later)));
    EXPECT_THAT(recording.positionsIn(recording->streams().at(0)), ElementsAre(std::tuple(1.0, 8, 9)));
    const std::vector<StreamReport> hidden = recording->hiddenStreams();
    ASSERT_EQ(hidden.size(), 1U);
    EXPECT_EQ(recording.positionsIn(hidden[0]).size(), 2U);
}

TEST(RecordingFile, EndsWhereItIsToldTo) {
    Opened recording(locationStream(), "a.dat");
    int count = 0;
    const std::uint64_t bytes =
        recording->readEntries<Point>(recording->streams().at(0), [&](double, const Point&) { return ++count < 1; });
    EXPECT_EQ(count, 1);
    EXPECT_EQ(bytes, 24U + 16);
}

TEST(RecordingFile, EndsBeforeAnEntryThatDoesNotFitItsKind) {
    const std::string list = le32(4 + 13) + le32(1) + textEntry(7, "a");
    const std::string wrong = le32(4 + 13) + le32(2) + textEntry(7, "a");
    Opened recording(streamHeader("2b7b6afc", 1, 0) + list + wrong + list, "a.dat");
    std::vector<double> times;
    const std::uint64_t bytes = recording->readEntries<std::list<std::string>>(
        recording->streams().at(0), [&](double time, const std::list<std::string>& texts) {
            EXPECT_THAT(texts, ElementsAre("a"));
            times.push_back(time);
            return true;
        });
    EXPECT_THAT(times, ElementsAre(0)); // as for every reader of lists
    EXPECT_EQ(bytes, 24U + list.size());
}

TEST(RecordingFile, DoesNotDecodeAnotherVersion) {
    Opened recording(streamHeader(s_cursorLocations, 9, 16) + pointEntry(1, 2, 3), "a.dat");
    EXPECT_THAT(recording.positionsIn(recording->streams().at(0)), testing::IsEmpty());
    EXPECT_EQ(recording->entriesOf(recording->streams().at(0)).header()->version, 9);
}

TEST(RecordingFile, DeliversWhatReadersDeliverOfEveryDamagedFile) {
    for (const InvalidFile& file : invalidCorpus()) {
        RecordingFile recording(file.path);
        for (const StreamReport& stream : recording.examinedStreams())
            RecordedKinds::visit(stream.type, [&]<class Kind>() {
                using Value = typename Kind::Value;
                struct Times final : DataStreamObserver<Value> {
                    bool dataRead(double time, const Value&) override { return times.push_back(raw(time)), true; }
                    std::vector<std::string> times;
                } observed;
                std::vector<std::string> read;
                recording.readEntries<Value>(stream, [&](double time, const Value&) {
                    read.push_back(raw(time));
                    return true;
                });
                if (isDecodable(stream.header()))
                    MetaDataReader<Value>::parseStream(observed, recording.parser().getStream(), stream.offset,
                                                       stream.readableBytes, -1);
                EXPECT_EQ(read, observed.times) << file.name;
            });
    }
}

TEST(FileError, NamesTheFileOnce) {
    const std::system_error failed(EIO, std::generic_category(), "cannot be read");
    const auto twice = [&] { orFileError("outer", [&] { orFileError("inner", [&]() -> int { throw failed; }); }); };
    EXPECT_EQ(errorOf<FileError>(twice), "inner: cannot be read: Input/output error");
    EXPECT_EQ(FileError("a", failed).file(), "a");
    EXPECT_EQ(FileError("a", failed).code(), failed.code());
    EXPECT_EQ(orFileError("a", [] { return 7; }), 7);
}

TEST(ReportedNames, AreWhatReportsSay) {
    EXPECT_STREQ(containerName(Container::Riff), "RIFF");
    EXPECT_STREQ(repairStateName(RepairPlan::Whole), "whole");
    EXPECT_STREQ(repairStateName(RepairPlan::Repairable), "repairable");
    EXPECT_STREQ(repairStateName(RepairPlan::Unrepairable), "unrepairable");
}

} // namespace
} // namespace ZULMetaData::Test
