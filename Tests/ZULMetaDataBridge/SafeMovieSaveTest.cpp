// Attaching and stamping without loss: what the plain operations lose, and what the safe ones keep.

#include "ZULMetaDataBridge/Source/SafeMovieSave.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/FileSizeLimit.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/ZULMetaData.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <map>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace ZULMetaData::Test {

namespace {

using testing::HasSubstr;

constexpr std::uint64_t s_4GiB = 0x100000000;

/// A movie whose media was never given its size.
std::string openEndedMedia() {
    return atom("ftyp", "mp42") + be32(0) + "mdat" + "0123456789";
}

class SafeSave : public testing::Test {
protected:
    /// A stream file in the folder.
    std::string stream(const std::string& name, const std::string& bytes) {
        writeFile(folder / name, bytes);
        return folder / name;
    }

    static std::vector<StreamSource> sources(const std::vector<std::string>& files) {
        std::vector<StreamSource> result;
        for (const std::string& file : files)
            result.push_back(StreamSource::file(file));
        return result;
    }

    static std::vector<StreamSource> unchecked(std::vector<StreamSource> sources) {
        for (StreamSource& source : sources)
            source = source.unchecked();
        return sources;
    }

    std::map<uuid, std::string> streamsInMovie() const {
        std::map<uuid, std::string> streams;
        MetaDataParser::create(movie)->loadAllData(streams);
        return streams;
    }

    std::size_t streamCount() const { return MetaDataParser::create(movie)->getAvailableMetaDataUUIDs().size(); }

    /// What the operation complains of; the movie must be what it was.
    template <class Operation>
    std::string refusal(Operation operation) {
        const std::string before = contentsOf(movie);
        std::string sentence;
        try {
            operation();
            ADD_FAILURE() << "not refused";
        } catch (const SaveError& error) {
            sentence = error.what();
        }
        EXPECT_EQ(contentsOf(movie), before);
        return sentence;
    }

    std::string bytesAt(std::uint64_t position, std::size_t count) const {
        std::ifstream file(movie, std::ios::binary);
        file.seekg(static_cast<std::streamoff>(position));
        std::string bytes(count, '\0');
        file.read(bytes.data(), static_cast<std::streamsize>(count));
        return bytes;
    }

    TemporaryFolder folder;
    const std::string movie = folder / "Recording.mp4";
};

// Attaching -------------------------------------------------------------------------------------------------------

TEST_F(SafeSave, WritesWhatThePlainAppendWritesWhereNothingIsTorn) {
    const std::vector<std::string> files{stream("a.dat", locationStream()), stream("b.dat", appNameStream())};
    const std::string plain = folder / "Plain.mp4";
    writeFile(movie, openEndedMedia());
    writeFile(plain, openEndedMedia());
    ZULMAtomWriter().writeMetaDataFiles({files.begin(), files.end()}, plain);
    SafeMovieSave(movie).attach(sources(files));
    EXPECT_EQ(contentsOf(movie), contentsOf(plain));
    EXPECT_EQ(contentsOf(movie), media() + zulmAtom({locationStream(), appNameStream()}));
}

TEST_F(SafeSave, TellsWhatWasAttachedAndRepaired) {
    writeFile(movie, openEndedMedia());
    const AttachResult result = SafeMovieSave(movie).attach(
        sources({stream("a.dat", locationStream()), stream("b.dat", appNameStream() + "torn")}));
    EXPECT_EQ(result.repair.state, RepairPlan::Repairable);
    ASSERT_EQ(result.repair.changes.size(), 1U);
    EXPECT_EQ(result.repair.changes[0].offset, 12U);
    ASSERT_EQ(result.streams.size(), 2U);
    EXPECT_EQ(result.streams[0].name, folder / "a.dat");
    EXPECT_EQ(result.streams[0].type, kind(s_cursorLocations));
    EXPECT_EQ(result.streams[0].offset, 30U + 16 + 16);
    EXPECT_EQ(result.streams[0].bytes, 56U);
    EXPECT_EQ(result.streams[0].entries, 2U);
    EXPECT_EQ(result.streams[0].bytesCut, 0U);
    EXPECT_EQ(result.streams[1].offset, 30U + 16 + 16 + 56 + 16);
    EXPECT_EQ(result.streams[1].entries, 2U);
    EXPECT_EQ(result.streams[1].bytesCut, 4U);
    EXPECT_EQ(result.streams[1].cutBecause, StreamExtent::InsideEntry);
}

TEST_F(SafeSave, AttachesStreamsFromMemory) {
    std::map<uuid, std::string> streams;
    writeFile(movie, media() + zulmAtom({locationStream(), appNameStream()}));
    MetaDataParser::create(movie)->loadAllData(streams);
    writeFile(movie, media());
    std::vector<StreamSource> fromMemory;
    for (const auto& [type, bytes] : streams)
        fromMemory.push_back(StreamSource::memory(bytes, "loaded"));
    SafeMovieSave(movie).attach(fromMemory);
    EXPECT_EQ(streamsInMovie(), streams);
}

TEST_F(SafeSave, ReadsNothingBehindTheEndOfMemory) {
    const ByteSource source = StreamSource::memory("abc", "loaded").open();
    std::string bytes = "....";
    EXPECT_EQ(source.read(1, bytes), 2U);
    EXPECT_EQ(bytes, "bc..");
    EXPECT_EQ(source.read(3, bytes), 0U);
    EXPECT_EQ(source.read(4, bytes), 0U);
}

TEST_F(SafeSave, AttachesPartsOfAnotherRecording) {
    const std::string riff = stream("old.avi", riffMedia() + zulmChunk({locationStream(), appNameStream()}));
    const auto old = MetaDataParser::create(riff);
    std::vector<StreamSource> parts;
    for (const uuid& type : old->getAvailableMetaDataUUIDs()) {
        const auto [offset, length] = old->fileDataForUUID(type);
        parts.push_back(StreamSource::part(riff, offset, length));
    }
    writeFile(movie, media());
    SafeMovieSave(movie).attach(parts);
    EXPECT_EQ(streamsInMovie()[kind(s_cursorLocations)], locationStream());
    EXPECT_EQ(streamsInMovie()[kind(s_appNames)], appNameStream());
}

TEST_F(SafeSave, TakesOfAPartOnlyWhatIsThere) {
    const std::string file = stream("old.bin", "front" + locationStream());
    writeFile(movie, media());
    const auto result = SafeMovieSave(movie).attach({StreamSource::part(file, 5, 0xfffffffffffffff0)});
    EXPECT_EQ(result.streams[0].bytes, 56U);
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).attach({StreamSource::part(file, 1000, 100)}); }),
                HasSubstr("too short for a stream: 0 bytes"));
}

TEST_F(SafeSave, RefusesTwoStreamsOfOneKind) {
    writeFile(movie, media());
    const auto twice = sources({stream("a.dat", locationStream()), stream("b.dat", locationStream())});
    EXPECT_EQ(refusal([&] { SafeMovieSave(movie).attach(twice); }),
              (folder / "b.dat") + ": a second stream of the kind cursorLocation, beside " + (folder / "a.dat"));
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).attach(twice, ExistingStreams::Supersede); }),
                HasSubstr("a second stream"));
}

TEST_F(SafeSave, NamesAKindThatIsNotRegisteredByItsIdentifier) {
    writeFile(movie, media());
    const std::string bytes = streamHeader("2b7b6aff", 1, 12) + f64(1) + le32(2);
    const auto twice = sources({stream("a.dat", bytes), stream("b.dat", bytes)});
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).attach(unchecked(twice)); }),
                HasSubstr("a second stream of the kind 2b7b6aff-7a1f-11e2-83d0-0017f200be7f, beside"));
}

TEST_F(SafeSave, RefusesAKindThatTheMovieHasUnlessItSupersedes) {
    writeFile(movie, media() + zulmAtom({appNameStream(), locationStream()}));
    const std::string newer = streamHeader(s_cursorLocations, 1, 16) + pointEntry(9.0, 9, 9);
    const auto files = sources({stream("a.dat", newer)});
    EXPECT_EQ(refusal([&] { SafeMovieSave(movie).attach(files); }),
              movie + ": has a stream of the kind cursorLocation already, at offset 134");
    SafeMovieSave(movie).attach(files, ExistingStreams::Supersede);
    EXPECT_EQ(streamsInMovie()[kind(s_cursorLocations)], newer);
    EXPECT_EQ(streamsInMovie()[kind(s_appNames)], appNameStream());
}

TEST_F(SafeSave, PutsTheRepairBackWhereItRefusesAfterwards) {
    writeFile(movie, media() + be32(1) + "ZULM" + be64(0) + extendedAtom("DATA", locationStream()));
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).attach(sources({stream("a.dat", locationStream())})); }),
                HasSubstr("already"));
}

TEST_F(SafeSave, LooksForStreamsBeforeItOpensTheMovie) {
    EXPECT_THAT(
        [&] {
            try {
                SafeMovieSave(folder / "missing.mp4").attach(std::vector<StreamSource>{});
            } catch (const SaveError& error) {
                return error.sentence();
            }
            return std::string();
        }(),
        HasSubstr("no streams to attach"));
}

TEST_F(SafeSave, ChecksWithoutChangingAnything) {
    const std::string before = be32(0) + "mdat" + "0123456789";
    writeFile(movie, before);
    const auto check = [&](const std::vector<StreamSource>& streams) {
        return refusal([&] { AttachPlan(streams).requireFor(ByteSource::file(movie), movie); });
    };
    const auto locations = sources({stream("a.dat", locationStream())});
    AttachPlan(locations).requireFor(ByteSource::file(movie), movie);
    EXPECT_THAT(check({}), HasSubstr("no streams to attach"));
    EXPECT_THAT(check(sources({stream("b.dat", "x")})), HasSubstr("too short for a stream"));
    EXPECT_EQ(contentsOf(movie), before);
    writeFile(movie, media() + zulmAtom({locationStream()}));
    EXPECT_THAT(check(locations), HasSubstr("has a stream of the kind cursorLocation already"));
    AttachPlan(locations, ExistingStreams::Supersede).requireFor(ByteSource::file(movie), movie);
    EXPECT_EQ(contentsOf(movie), media() + zulmAtom({locationStream()}));
}

TEST_F(SafeSave, RefusesStreamsThatAreNone) {
    writeFile(movie, media());
    for (const std::size_t length : {0U, 1U, 23U})
        EXPECT_EQ(refusal([&] {
                      SafeMovieSave(movie).attach(
                          sources({stream("a.dat", locationStream()), stream("b.dat", std::string(length, 'x'))}));
                  }),
                  (folder / "b.dat") + ": too short for a stream: " + std::to_string(length) +
                      " bytes of a 24-byte header");
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).attach({}); }), HasSubstr("no streams to attach"));
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).attach({StreamSource::file(folder / "missing.dat")}); }),
                HasSubstr("missing.dat: cannot be opened"));
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).attach({StreamSource::file(folder.path())}); }),
                HasSubstr("is not a regular file"));
}

TEST_F(SafeSave, RefusesMoviesThatAreNone) {
    const auto files = sources({stream("a.dat", locationStream())});
    EXPECT_THROW(SafeMovieSave(folder / "missing.mp4").attach(files), SaveError);
    EXPECT_THROW(SafeMovieSave(folder.path()).attach(files), SaveError);
    EXPECT_THROW(SafeMovieSave("/dev/full").attach(files), SaveError);
    EXPECT_FALSE(std::filesystem::exists(folder / "missing.mp4"));
    writeFile(movie, "");
    EXPECT_EQ(refusal([&] { SafeMovieSave(movie).attach(files); }), movie + ": is empty");
    writeFile(movie, media() + be32(100) + "free");
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).attach(files); }), HasSubstr("declares 100 bytes"));
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).stamp("Recorder", "1"); }), HasSubstr("declares 100 bytes"));
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie).repair(); }), HasSubstr("declares 100 bytes"));
}

TEST_F(SafeSave, RefusesDoubtfulSourcesUnlessTheyAreAskedFor) {
    const std::map<std::string, std::string> doubtful{
        {"is no stream of a known kind", media() + std::string(1000, 'm')},
        {"in version 0, which is not known: the last known one is 1",
         streamHeader(s_cursorLocations, 0, 16) + pointEntry(1, 2, 3)},
        {"has 15 bytes after its header, but not one whole entry",
         streamHeader(s_cursorLocations, 1, 16) + std::string(15, 'x')},
        {"has 4 bytes after its header, but not one whole entry", streamHeader(s_appNames, 1, 0) + le32(0)},
    };
    for (const auto& [sentence, bytes] : doubtful) {
        SCOPED_TRACE(sentence);
        writeFile(movie, media());
        const auto source = sources({stream("a.dat", bytes)});
        EXPECT_THAT(refusal([&] { SafeMovieSave(movie).attach(source); }), HasSubstr(sentence));
        try {
            SafeMovieSave(movie).attach(source);
        } catch (const SaveError& error) {
            EXPECT_EQ(error.reason(), SaveError::Reason::Doubtful);
        }
        SafeMovieSave(movie).attach(unchecked(source));
        EXPECT_EQ(streamCount(), 1U);
    }
    for (const std::string& empty : {streamHeader(s_cursorLocations, 1, 16), streamHeader("2b7b6aef", 1, 16)}) {
        writeFile(movie, media());
        SafeMovieSave(movie).attach(sources({stream("a.dat", empty)}));
        EXPECT_EQ(contentsOf(movie), media() + zulmAtom({empty}));
    }
}

TEST_F(SafeSave, AttachesEveryByteOfAStreamAsItIsStored) {
    const std::string torn = locationStream() + "torn";
    const std::string odd = streamHeader("2b7b6aff", 1, 0) + "odd";
    writeFile(movie, media());
    const AttachResult result = SafeMovieSave(movie).attach(
        {StreamSource::memory(torn, "torn").asStored(), StreamSource::memory(odd, "odd").asStored()});
    EXPECT_EQ(contentsOf(movie), media() + zulmAtom({torn, odd}));
    EXPECT_EQ(result.streams[0].bytes, torn.size());
    EXPECT_EQ(result.streams[0].bytesCut, 0U);
    EXPECT_EQ(result.streams[0].entries, 2U);
}

TEST_F(SafeSave, CutsHostileStreamsDownToWhatIsWhole) {
    const std::map<std::string, std::string> hostile{
        {"an entry of size 0", streamHeader(s_appNames, 1, 0) + textEntry(0.5, "Abc") + le32(0) + "rest"},
        {"a huge entry", streamHeader(s_appNames, 1, 0) + textEntry(0.5, "Abc") + le32(0xffffffff) + "rest"},
        {"a torn size", streamHeader(s_appNames, 1, 0) + textEntry(0.5, "Abc") + "\x05"},
    };
    for (const auto& [what, bytes] : hostile) {
        SCOPED_TRACE(what);
        writeFile(movie, media());
        SafeMovieSave(movie).attach(sources({stream("a.dat", bytes), stream("b.dat", locationStream())}));
        EXPECT_EQ(contentsOf(movie), media() + zulmAtom({bytes.substr(0, 39), locationStream()}));
    }
    writeFile(movie, media());
    SafeMovieSave(movie).attach(
        unchecked(sources({stream("a.dat", streamHeader(s_cursorLocations, 1, 0xffffffff) + "rest")})));
    EXPECT_EQ(contentsOf(movie), media() + zulmAtom({streamHeader(s_cursorLocations, 1, 0xffffffff)}));
}

// Trap: a size that counts a torn tail ----------------------------------------------------------------------------

struct TornStream {
    const char* name;
    std::string whole;
    std::string torn;

    /// Else its bytes are shown, also those between its members that nobody has written.
    friend std::ostream& operator<<(std::ostream& out, const TornStream& stream) { return out << stream.name; }
};

class TornTail : public SafeSave, public testing::WithParamInterface<TornStream> {
protected:
    std::vector<std::string> files() {
        return {stream("torn.dat", GetParam().torn), stream("b.dat", scaleStream(2.0)),
                stream("c.dat", streamHeader("2b7b6af3", 1, 16) + f64(0) + f64(0.5))};
    }
};

TEST_P(TornTail, HidesEveryStreamBehindItWhereThePlainAppendWritesIt) {
    writeFile(movie, media());
    const auto list = files();
    MP4MetaData::appendMetaDataFiles(movie, list);
    EXPECT_EQ(streamCount(), 1U);
}

TEST_P(TornTail, IsCutOffByTheSafeAttach) {
    writeFile(movie, media());
    const AttachResult result = SafeMovieSave(movie).attach(sources(files()));
    EXPECT_EQ(streamCount(), 3U);
    EXPECT_EQ(result.streams[0].bytesCut, GetParam().torn.size() - GetParam().whole.size());
    EXPECT_EQ(contentsOf(movie).substr(30 + 32, GetParam().whole.size()), GetParam().whole);
    EXPECT_EQ(contentsOf(folder / "torn.dat"), GetParam().torn) << "the stream file itself is left alone";
}

INSTANTIATE_TEST_SUITE_P(Streams, TornTail,
                         testing::Values(TornStream{"FixedSize", locationStream(), locationStream() + "torn"},
                                         TornStream{"VariableSize", appNameStream(),
                                                    appNameStream() + textEntry(3.0, "Mail").substr(0, 13)},
                                         TornStream{"TornSize", appNameStream(), appNameStream() + "\x0c\x00"}),
                         [](const auto& tested) { return tested.param.name; });

// Trap: the repair of 4 GiB and more ------------------------------------------------------------------------------

class LargeMovie : public SafeSave, public testing::WithParamInterface<std::uint64_t> {
protected:
    void SetUp() override {
        writeSparseFile(movie, 20 + GetParam(), atom("ftyp", "mp42") + atom("wide") + be32(0) + "mdat");
    }

    /// The last bytes of the media, which are zeros.
    std::string lastBytes() const { return bytesAt(20 + GetParam() - 8, 8); }
};

TEST_P(LargeMovie, HidesItsMetaDataAfterThePlainRepairAndIsWrittenIntoByASecondOne) {
    const std::string file = stream("a.dat", locationStream());
    ZULMAtomWriter().writeMetaDataFiles({file}, movie);
    EXPECT_EQ(streamCount(), 0U);
    EXPECT_EQ(lastBytes(), be64(0));
    ZULMAtomRepair::finalizeAtomsInFile(movie);
    EXPECT_NE(lastBytes(), be64(0));
}

TEST_P(LargeMovie, ShowsItsMetaDataAfterTheSafeAttachAndIsWholeFromThenOn) {
    SafeMovieSave(movie).attach(sources({stream("a.dat", locationStream())}));
    EXPECT_EQ(streamsInMovie()[kind(s_cursorLocations)], locationStream());
    EXPECT_EQ(bytesAt(0, 28), atom("ftyp", "mp42") + be32(1) + "mdat" + be64(GetParam() + 8));
    SafeMovieSave(movie).stamp("Recorder", "4.2");
    EXPECT_EQ(SafeMovieSave(movie).repair().state, RepairPlan::Whole);
    EXPECT_TRUE(ZULMAtomRepair::finalizeAtomsInFile(movie)) << "the plain repair agrees";
    EXPECT_EQ(lastBytes(), be64(0));
    EXPECT_EQ(streamCount(), 1U);
}

TEST_P(LargeMovie, GetsMetaDataBackThatThePlainRepairHid) {
    const std::string file = stream("a.dat", locationStream());
    ZULMAtomWriter().writeMetaDataFiles({file}, movie);
    ASSERT_EQ(streamCount(), 0U);
    EXPECT_EQ(SafeMovieSave(movie).repair().changes.size(), 1U);
    EXPECT_EQ(streamsInMovie()[kind(s_cursorLocations)], locationStream());
    EXPECT_EQ(lastBytes(), be64(0));
}

TEST_P(LargeMovie, IsWhatItWasAfterAnAppendThatFails) {
    const auto files = sources({stream("a.dat", locationStream())});
    {
        const FileSizeLimit limit(20 + GetParam() + 50);
        EXPECT_THROW(SafeMovieSave(movie).attach(files), SaveError);
    }
    EXPECT_EQ(std::filesystem::file_size(movie), 20 + GetParam());
    EXPECT_EQ(bytesAt(0, 36), atom("ftyp", "mp42") + atom("wide") + be32(0) + "mdat" + be64(0));
}

INSTANTIATE_TEST_SUITE_P(Sizes, LargeMovie, testing::Values(s_4GiB, s_4GiB + 1, 5 * (s_4GiB / 4)));

TEST_F(SafeSave, RefusesToAppendBehindFourGiBThatCannotBeSized) {
    writeSparseFile(movie, 12 + s_4GiB, atom("ftyp", "mp42") + be32(0) + "mdat");
    const auto files = sources({stream("a.dat", locationStream())});
    try {
        SafeMovieSave(movie).attach(files);
        ADD_FAILURE() << "appended where no reader comes";
    } catch (const SaveError& error) {
        EXPECT_THAT(error.what(), HasSubstr("there is no spare 'wide' atom before it"));
    }
    EXPECT_EQ(std::filesystem::file_size(movie), 12 + s_4GiB);
    ZULMAtomWriter().writeMetaDataFiles({folder / "a.dat"}, movie);
    EXPECT_EQ(streamCount(), 0U) << "the plain append writes it all the same";
}

// Trap: an append that fails or is interrupted --------------------------------------------------------------------

TEST_F(SafeSave, IsNotWhatItWasAfterAPlainAppendThatFails) {
    writeFile(movie, openEndedMedia());
    const std::string file = stream("a.dat", locationStream());
    {
        const FileSizeLimit limit(media().size() + 40);
        ZULMAtomWriter().writeMetaDataFiles({file}, movie);
    }
    EXPECT_GT(contentsOf(movie).size(), media().size());
    EXPECT_EQ(SafeMovieSave(movie).plan().state, RepairPlan::Repairable);
}

TEST_F(SafeSave, IsWhatItWasWhereverAnAppendFails) {
    const auto files = sources({stream("a.dat", locationStream()), stream("b.dat", appNameStream())});
    const std::string whole = media() + zulmAtom({locationStream(), appNameStream()});
    for (std::size_t limit = media().size(); limit < whole.size(); ++limit)
        for (const std::string& before : {media(), openEndedMedia()}) {
            writeFile(movie, before);
            {
                const FileSizeLimit fullDisk(limit);
                EXPECT_THROW(SafeMovieSave(movie).attach(files), SaveError) << limit;
            }
            EXPECT_EQ(contentsOf(movie), before) << limit;
        }
}

TEST_F(SafeSave, IsWhatItWasWhereverAStampFails) {
    for (std::size_t limit = media().size(); limit < media().size() + 80; ++limit) {
        writeFile(movie, openEndedMedia());
        {
            const FileSizeLimit fullDisk(limit);
            EXPECT_THROW(SafeMovieSave(movie).stamp("Recorder", "4.2"), SaveError) << limit;
        }
        EXPECT_EQ(contentsOf(movie), openEndedMedia()) << limit;
    }
}

TEST_F(SafeSave, PutsTornBytesBackWhereAnAppendBehindThemFails) {
    const auto files = sources({stream("b.dat", appNameStream())});
    for (std::size_t torn = 0; torn <= 16; ++torn) {
        const std::string before =
            media() + be32(1) + "ZULM" + be64(0) + be32(1) + "DATA" + be64(72) + locationStream().substr(0, 40 + torn);
        writeFile(movie, before);
        {
            const FileSizeLimit fullDisk(before.size() + 20);
            EXPECT_THROW(SafeMovieSave(movie).attach(files), SaveError) << torn;
        }
        EXPECT_EQ(contentsOf(movie), before) << torn;
    }
}

TEST_F(SafeSave, IsUndoneByWhatItsProgressThrows) {
    writeFile(movie, openEndedMedia());
    const auto files = sources({stream("a.dat", locationStream()), stream("b.dat", appNameStream())});
    for (int calls = 1; calls <= 4; ++calls) { // each stream is written and read back in one piece
        int left = calls;
        const auto stop = [&left](std::uint64_t, std::uint64_t) {
            if (--left == 0)
                throw 17;
        };
        EXPECT_THROW(SafeMovieSave(movie, stop).attach(files), int);
        EXPECT_EQ(contentsOf(movie), openEndedMedia()) << calls;
    }
}

TEST_F(SafeSave, TellsHowFarItIs) {
    writeFile(movie, media());
    std::vector<std::uint64_t> seen;
    const auto note = [&seen](std::uint64_t done, std::uint64_t total) {
        EXPECT_EQ(total, 2U * (56 + 56));
        seen.push_back(done);
    };
    SafeMovieSave(movie, note).attach(sources({stream("a.dat", locationStream()), stream("b.dat", appNameStream())}));
    EXPECT_EQ(seen, (std::vector<std::uint64_t>{56, 112, 168, 224}));
}

/// Ends this process's child when `calls` pieces were written.
void attachAndDie(const std::string& movie, const std::vector<StreamSource>& files, int calls) {
    const pid_t child = fork();
    if (child == 0) {
        SafeMovieSave(movie, [&](std::uint64_t, std::uint64_t) {
            if (--calls == 0)
                _exit(0);
        }).attach(files);
        _exit(1);
    }
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    ASSERT_EQ(status, 0);
}

TEST_F(SafeSave, LeavesWhatTheNextAttachMendsWhereTheProcessEnds) {
    const auto files = sources({stream("a.dat", locationStream()), stream("b.dat", appNameStream())});
    for (int calls = 1; calls <= 2; ++calls) {
        writeFile(movie, openEndedMedia());
        attachAndDie(movie, files, calls);
        EXPECT_EQ(bytesAt(media().size(), 16), be32(1) + "ZULM" + be64(0)) << "the size comes last";
        const AttachResult result = SafeMovieSave(movie).attach(sources({stream("c.dat", scaleStream(2.0))}));
        EXPECT_EQ(result.repair.state, RepairPlan::Repairable);
        EXPECT_EQ(contentsOf(movie).substr(0, 30), media());
        EXPECT_EQ(streamsInMovie()[kind(s_cursorLocations)], locationStream());
        EXPECT_EQ(streamCount(), static_cast<std::size_t>(calls) + 1);
    }
}

TEST_F(SafeSave, KeepsTwoSavesOfOneMovieApart) {
    writeFile(movie, media());
    const auto other = sources({stream("b.dat", appNameStream())});
    std::string refused;
    const auto interfere = [&](std::uint64_t, std::uint64_t) {
        try {
            SafeMovieSave(movie).attach(other);
        } catch (const SaveError& error) {
            refused = error.what();
        }
    };
    SafeMovieSave(movie, interfere).attach(sources({stream("a.dat", locationStream())}));
    EXPECT_THAT(refused, HasSubstr("is being changed by another program"));
    EXPECT_EQ(contentsOf(movie), media() + zulmAtom({locationStream()}));
}

TEST_F(SafeSave, FailsWhereASourceShrinksWhileItIsRead) {
    writeFile(movie, media());
    const std::string shrinking = stream("b.dat", appNameStream());
    const auto shrink = [&](std::uint64_t, std::uint64_t) { std::filesystem::resize_file(shrinking, 30); };
    EXPECT_THAT(refusal([&] {
                    SafeMovieSave(movie, shrink).attach(sources({stream("a.dat", locationStream()), shrinking}));
                }),
                HasSubstr("b.dat: cannot be read at offset 0"));
}

TEST_F(SafeSave, ReadsBackWhatItWrote) {
    writeFile(movie, media());
    int calls = 0;
    const auto damage = [&](std::uint64_t, std::uint64_t) { // somebody writes into the movie after its first stream
        if (++calls == 1)
            std::fstream(movie, std::ios::binary | std::ios::in | std::ios::out).seekp(30 + 32 + 25).put('x');
    };
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie, damage).attach(sources({stream("a.dat", locationStream())})); }),
                HasSubstr("does not hold what was written at offset 62"));
}

TEST_F(SafeSave, FindsOutThatAReaderWouldNotFindTheStream) {
    writeFile(movie, media());
    int calls = 0;
    const auto damage = [&](std::uint64_t, std::uint64_t) { // somebody writes into the type of the stream's atom
        if (++calls == 1)
            std::fstream(movie, std::ios::binary | std::ios::in | std::ios::out).seekp(30 + 16 + 4).put('x');
    };
    EXPECT_THAT(refusal([&] { SafeMovieSave(movie, damage).attach(sources({stream("a.dat", locationStream())})); }),
                HasSubstr("does not show its stream of the kind cursorLocation at offset 62 to a reader"));
}

TEST_F(SafeSave, FindsOutThatTheMovieIsGoneOrAnother) {
    const auto removal = [&](std::uint64_t, std::uint64_t) { std::filesystem::remove(std::string(movie)); };
    const auto replacement = [&](std::uint64_t, std::uint64_t) {
        std::filesystem::remove(std::string(movie));
        writeFile(movie, media());
    };
    for (const SafeMovieSave::Progress& change :
         {SafeMovieSave::Progress(removal), SafeMovieSave::Progress(replacement)})
        try {
            writeFile(movie, media());
            SafeMovieSave(movie, change).attach(sources({stream("a.dat", locationStream())}));
            ADD_FAILURE() << "nothing noticed";
        } catch (const SaveError& error) {
            EXPECT_THAT(error.what(), HasSubstr("was removed or replaced by another program meanwhile"));
        }
}

// Trap: the scale factor ------------------------------------------------------------------------------------------

TEST_F(SafeSave, ShowsTheScaleFactorThroughTheParserOfItsKind) {
    writeFile(movie, media());
    const std::string file = folder / "scale.dat";
    ScaleFactorMetaDataWriter writer(file);
    writer.writeAndFinalize(2);
    SafeMovieSave(movie).attach(sources({file}));
    EXPECT_NE(Util::recordingScaleForMP4AtPath(movie), 2.0) << "an integer, read as a 64-bit float";
    const auto list = ScaleFactorMetaDataParser(movie).read();
    ASSERT_EQ(list->size(), 1U);
    EXPECT_EQ(list->front().get<std::int32_t>("scaleFactor"), 2);
}

// Trap: a size that is believed -----------------------------------------------------------------------------------

TEST_F(SafeSave, KeepsASizeThatIsNotThereAwayFromReaders) {
    const std::uint32_t huge = 1 << 24;
    const std::string hostile = streamHeader(s_appNames, 1, 0) + le32(huge) + f64(0) + "x";
    std::istringstream input(hostile);
    Entries<std::string> read;
    MetaDataReader<std::string>::parseStream(read, input, 0, hostile.size(), -1);
    ASSERT_EQ(read.values.size(), 1U);
    EXPECT_EQ(read.values[0].size(), huge - 8) << "the reader believes it";
    writeFile(movie, media());
    SafeMovieSave(movie).attach({StreamSource::memory(hostile, "hostile").unchecked()});
    Entries<std::string> attached;
    MetaDataParser::create(movie)->loadDataType<std::string>(kind(s_appNames), attached, -1);
    EXPECT_TRUE(attached.values.empty());
}

// Stamping and repairing ------------------------------------------------------------------------------------------

TEST_F(SafeSave, StampsAsThePlainWriterDoes) {
    const std::string plain = folder / "Plain.mp4";
    writeFile(movie, openEndedMedia());
    writeFile(plain, openEndedMedia());
    ZULRAtomWriter().writeZULRtoFile(plain, "Recorder", "4.2");
    const StampResult result = SafeMovieSave(movie).stamp("Recorder", "4.2");
    EXPECT_EQ(contentsOf(movie), contentsOf(plain));
    EXPECT_EQ(result.info.creator.name(), CreatorAttributes::platformNameMac());
    EXPECT_EQ(result.info.creator.version(), "4.2");
    EXPECT_EQ(result.repair.changes.size(), 1U);
}

TEST_F(SafeSave, StampsAgainBehindTheFirst) {
    writeFile(movie, media());
    SafeMovieSave(movie).stamp("Recorder", "1");
    SafeMovieSave(movie).stamp("Recorder", "2");
    const auto infos = readRecordingInfo(*MetaDataParser::create(movie));
    ASSERT_EQ(infos.size(), 2U);
    EXPECT_EQ(infos[1].creator.version(), "2");
}

TEST_F(SafeSave, AttachesAndStampsAsOneAfterTheOther) {
    const auto files = sources({stream("a.dat", locationStream() + "torn")});
    const std::string twice = folder / "Twice.mp4";
    writeFile(movie, openEndedMedia());
    writeFile(twice, openEndedMedia());
    SafeMovieSave(twice).attach(files);
    SafeMovieSave(twice).stamp("Recorder", "4.2");
    const AttachResult result = SafeMovieSave(movie).attachAndStamp(AttachPlan(files), "Recorder", "4.2");
    EXPECT_EQ(contentsOf(movie), contentsOf(twice));
    EXPECT_EQ(result.repair.changes.size(), 1U);
    ASSERT_EQ(result.streams.size(), 1U);
    EXPECT_EQ(result.streams[0].bytesCut, 4U);
    EXPECT_THROW(SafeMovieSave(movie).attachAndStamp(AttachPlan({}), "Recorder", "4.2"), SaveError);
}

TEST_F(SafeSave, DoesNeitherWhereAttachingOrStampingFails) {
    const AttachPlan plan(sources({stream("a.dat", locationStream())}));
    const std::size_t whole = media().size() + zulmAtom({locationStream()}).size() + 80;
    for (std::size_t limit = media().size(); limit < whole; ++limit) {
        writeFile(movie, openEndedMedia());
        {
            const FileSizeLimit fullDisk(limit);
            EXPECT_THROW(SafeMovieSave(movie).attachAndStamp(plan, "Recorder", "4.2"), SaveError) << limit;
        }
        EXPECT_EQ(contentsOf(movie), openEndedMedia()) << limit;
    }
}

TEST_F(SafeSave, MovesTheIndexOfFragmentsBehindTheStampToo) {
    writeFile(movie, media() + atom("mfra", "index"));
    const AttachPlan plan(sources({stream("a.dat", locationStream())}));
    const AttachResult result =
        SafeMovieSave(movie).attachAndStamp(plan, "Recorder", "4.2", SafeMovieSave::FragmentIndex::MoveToEnd);
    EXPECT_EQ(result.fragmentIndex, FragmentIndexState::AtEnd);
    EXPECT_EQ(bytesAt(std::filesystem::file_size(movie) - 13, 13), atom("mfra", "index"));
}

TEST_F(SafeSave, PlansWithoutChangingAnything) {
    writeFile(movie, openEndedMedia());
    std::filesystem::permissions(movie, std::filesystem::perms::owner_read);
    EXPECT_EQ(SafeMovieSave(movie).plan().changes.size(), 1U);
    EXPECT_EQ(contentsOf(movie), openEndedMedia());
}

TEST_F(SafeSave, CannotPlanForAMovieThatIsMissing) {
    EXPECT_THROW(SafeMovieSave(movie).plan(), SaveError);
}

TEST_F(SafeSave, RepairsOnceAndThenFindsNothingToDo) {
    writeFile(movie, openEndedMedia());
    EXPECT_EQ(SafeMovieSave(movie).repair().state, RepairPlan::Repairable);
    EXPECT_EQ(contentsOf(movie), media());
    EXPECT_EQ(SafeMovieSave(movie).repair().state, RepairPlan::Whole);
    EXPECT_EQ(contentsOf(movie), media());
}

// Memory ----------------------------------------------------------------------------------------------------------

long peakMemoryInKilobytes() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss;
}

// The index of a fragmented movie ---------------------------------------------------------------------------------

TEST_F(SafeSave, SaysWhereTheIndexOfFragmentsIs) {
    const auto attach = [&](SafeMovieSave::FragmentIndex index) {
        return SafeMovieSave(movie)
            .attach({StreamSource::memory(locationStream(), "stream")}, ExistingStreams::Refuse, index)
            .fragmentIndex;
    };
    writeFile(movie, media());
    EXPECT_EQ(attach(SafeMovieSave::FragmentIndex::MoveToEnd), FragmentIndexState::Absent);
    writeFile(movie, media() + atom("mfra", "index"));
    EXPECT_EQ(attach(SafeMovieSave::FragmentIndex::Leave), FragmentIndexState::NotAtEnd);
    EXPECT_EQ(SafeMovieSave(movie).stamp("a", "1").fragmentIndex, FragmentIndexState::NotAtEnd);
    EXPECT_EQ(SafeMovieSave(movie).stamp("a", "1", SafeMovieSave::FragmentIndex::MoveToEnd).fragmentIndex,
              FragmentIndexState::AtEnd);
    EXPECT_EQ(SafeMovieSave(movie).stamp("a", "1").fragmentIndex, FragmentIndexState::NotAtEnd);
}

TEST_F(SafeSave, MovesTheIndexOfFragmentsToTheEnd) {
    for (const std::string& index : {atom("mfra", "index"), extendedAtom("mfra", std::string(1 << 19, 'i'))}) {
        writeFile(movie, media() + index);
        SafeMovieSave(movie).attach({StreamSource::memory(locationStream(), "stream")}, ExistingStreams::Refuse,
                                    SafeMovieSave::FragmentIndex::MoveToEnd);
        std::string blank = index;
        blank.replace(4, 4, "free");
        EXPECT_EQ(contentsOf(movie), media() + blank + zulmAtom({locationStream()}) + index);
    }
}

TEST_F(SafeSave, IsWhatItWasWhereverAMoveOfTheIndexFails) {
    const std::string whole = media() + atom("mfra", std::string(5000, 'i'));
    writeFile(movie, whole);
    for (const std::uint64_t limit : {whole.size() + 10, whole.size() + 100, whole.size() + 2000}) {
        const FileSizeLimit limited(limit);
        EXPECT_THROW(SafeMovieSave(movie).attach({StreamSource::memory(locationStream(), "stream")},
                                                 ExistingStreams::Refuse, SafeMovieSave::FragmentIndex::MoveToEnd),
                     SaveError);
        EXPECT_EQ(contentsOf(movie), whole) << limit;
    }
}

TEST_F(SafeSave, TakesMoviesByTheirContents) {
    for (const std::string& bytes : {riffMedia(), locationStream(), std::string(5000, '\0')}) {
        writeFile(movie, bytes);
        EXPECT_THROW(SafeMovieSave(movie).plan(), SaveError);
        EXPECT_THROW(SafeMovieSave(movie).stamp("a", "1"), SaveError);
        EXPECT_EQ(contentsOf(movie), bytes);
    }
    writeFile(folder / "movie", media());
    EXPECT_NO_THROW(SafeMovieSave(folder / "movie").stamp("a", "1"));
}

TEST_F(SafeSave, HoldsNoStreamInMemory) {
    constexpr std::uint64_t size = 24 + 16 * 6250000; // 100 MB
    std::vector<StreamSource> files;
    for (const std::string group : {"2b7b6af2", "2b7b6af3", "2b7b6af0", "2b7b6a05", "2b7b6a08"}) {
        writeSparseFile(folder / group, size, streamHeader(group, 1, 16), pointEntry(1, 2, 3));
        files.push_back(StreamSource::file(folder / group));
    }
    writeFile(movie, media());
    const long before = peakMemoryInKilobytes();
    SafeMovieSave(movie).attach(files);
    EXPECT_LT(peakMemoryInKilobytes() - before, 16 * 1024);
    EXPECT_EQ(std::filesystem::file_size(movie), 30 + 16 + 5 * (16 + size));
    EXPECT_EQ(streamCount(), 5U);
}

} // namespace

} // namespace ZULMetaData::Test
