// The atom that streams are appended to a movie in, byte by byte, from files and from memory.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <stdexcept>
#include <string>
#include <vector>

#include <sys/resource.h>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;
using testing::ThrowsMessage;

/// The header of an extended atom of any size.
std::string header(const std::string& type, std::uint64_t size) {
    return be32(1) + type + be64(size);
}

class MovieTest : public testing::Test {
protected:
    MovieTest() { writeFile(movie, media()); }

    std::string streamFile(const std::string& name, const std::string& contents) {
        writeFile(folder / name, contents);
        return folder / name;
    }

    /// What stands behind the media, which must be untouched.
    std::string appended() const {
        const std::string bytes = contentsOf(movie);
        EXPECT_EQ(bytes.substr(0, media().size()), media());
        return bytes.substr(media().size());
    }

    /// `output` then holds what was written on standard output.
    bool appendFiles(const std::vector<std::string>& files) {
        testing::internal::CaptureStdout();
        const bool result = MP4MetaData::appendMetaDataFiles(movie, files);
        output = testing::internal::GetCapturedStdout();
        return result;
    }

    TemporaryFolder folder;
    std::string movie = folder / "Recording.mp4";
    std::string output;
};

// One stream, from a file or from memory ------------------------------------------------------------------------

enum Source { FromFile, FromMemory };

class AppendedStream : public MovieTest, public testing::WithParamInterface<Source> {
protected:
    void append(const std::vector<std::string>& streams) {
        if (GetParam() == FromMemory) {
            std::map<uuid, std::string> inMemory;
            for (const std::string& stream : streams)
                inMemory[uuid{{static_cast<std::uint8_t>(inMemory.size())}}] = stream;
            return MP4MetaData::appendMetaData(movie, inMemory);
        }
        std::vector<std::string> files;
        for (const std::string& stream : streams)
            files.push_back(streamFile(std::to_string(files.size()) + ".dat", stream));
        EXPECT_TRUE(MP4MetaData::appendMetaDataFiles(movie, files));
    }

    /// The `DATA` atom of a stream, taken out of its `ZULM` atom.
    std::string atomOf(const std::string& stream) {
        writeFile(movie, media());
        append({stream});
        const std::string bytes = appended();
        EXPECT_EQ(bytes.substr(0, 16), header("ZULM", bytes.size()));
        return bytes.substr(16);
    }

    /// That of a stream of which only the first `kept` bytes are copied.
    static std::string atomWith(const std::string& stream, std::size_t kept) {
        return header("DATA", stream.size() + 16) + stream.substr(0, kept);
    }
};

INSTANTIATE_TEST_SUITE_P(Sources, AppendedStream, testing::Values(FromFile, FromMemory),
                         [](const auto& source) { return source.param == FromFile ? "FromFile" : "FromMemory"; });

TEST_P(AppendedStream, IsWrappedInTwoExtendedAtoms) {
    append({hex("2b7b6af2 7a1f11e2 83d00017 f200be7f 01000000 10000000"
                "000000000000e03f 0a000000 14000000")});
    EXPECT_EQ(appended(), hex("00000001 5a554c4d 0000000000000048"
                              "00000001 44415441 0000000000000038"
                              "2b7b6af2 7a1f11e2 83d00017 f200be7f 01000000 10000000"
                              "000000000000e03f 0a000000 14000000"));
}

TEST_P(AppendedStream, FollowsTheOneBeforeIt) {
    append({locationStream(), appNameStream()});
    EXPECT_EQ(appended(), zulmAtom({locationStream(), appNameStream()}));
}

TEST_P(AppendedStream, OfNoEntriesIsItsHeader) {
    for (const std::uint32_t entrySize : {16u, 0u, 1u, 0xffffffffu}) {
        const std::string stream = streamHeader(s_cursorLocations, 1, entrySize);
        EXPECT_EQ(atomOf(stream), be32(1) + "DATA" + be64(40) + stream);
    }
}

TEST_P(AppendedStream, OfAnyKindAndVersionIsCopied) {
    const std::string stream = std::string(16, '\0') + raw(-7) + le32(12) + std::string(24, 'e');
    EXPECT_EQ(atomOf(stream), extendedAtom("DATA", stream));
}

TEST_P(AppendedStream, LeavesOutATornFixedEntryButCountsIt) {
    for (std::size_t torn = 1; torn < 16; ++torn) {
        const std::string stream = locationStream() + std::string(torn, 't');
        EXPECT_EQ(atomOf(stream), be32(1) + "DATA" + be64(16 + 56 + torn) + locationStream());
    }
}

TEST_P(AppendedStream, LeavesOutATornOnlyEntryOfFixedSize) {
    const std::string stream = locationStream().substr(0, 24 + 15);
    EXPECT_EQ(atomOf(stream), atomWith(stream, 24));
}

TEST_P(AppendedStream, GoesByTheEntrySizeInTheHeaderAlone) {
    const std::string entries = "0123456789";
    const auto stream = [&](std::uint32_t entrySize) {
        return streamHeader(s_cursorLocations, 1, entrySize) + entries;
    };
    EXPECT_EQ(atomOf(stream(1)), atomWith(stream(1), 34));
    EXPECT_EQ(atomOf(stream(4)), atomWith(stream(4), 32));
    EXPECT_EQ(atomOf(stream(10)), atomWith(stream(10), 34));
    EXPECT_EQ(atomOf(stream(11)), atomWith(stream(11), 24));
    EXPECT_EQ(atomOf(stream(0xffffffff)), atomWith(stream(0xffffffff), 24));
}

TEST_P(AppendedStream, OfWholeSizedEntriesIsCopiedWhole) {
    EXPECT_EQ(atomOf(appNameStream()), extendedAtom("DATA", appNameStream()));
}

TEST_P(AppendedStream, LeavesOutATornSizedEntryButCountsIt) {
    const std::size_t whole = 24 + 15; // the header and the first entry
    for (std::size_t size = whole + 1; size < appNameStream().size(); ++size) {
        const std::string stream = appNameStream().substr(0, size);
        EXPECT_EQ(atomOf(stream), atomWith(stream, whole)) << size;
    }
}

TEST_P(AppendedStream, IsCopiedWholeWhereNotEvenItsFirstSizedEntryIs) {
    for (std::size_t size = 24 + 4; size < 24 + 15; ++size) {
        const std::string stream = appNameStream().substr(0, size);
        EXPECT_EQ(atomOf(stream), extendedAtom("DATA", stream)) << size;
    }
}

TEST_P(AppendedStream, IsItsHeaderWhereNotEvenTheSizeOfItsFirstEntryIsWhole) {
    for (std::size_t size = 24 + 1; size < 24 + 4; ++size) {
        const std::string stream = appNameStream().substr(0, size);
        EXPECT_EQ(atomOf(stream), atomWith(stream, 24)) << size;
    }
}

TEST_P(AppendedStream, EndsBeforeASizedEntryThatClaimsTooMuch) {
    for (const std::uint32_t size : {9u, 0x7fffffffu, 0xfffffff0u, 0xffffffffu}) {
        const std::string stream = appNameStream() + le32(size) + "12345678";
        EXPECT_EQ(atomOf(stream), atomWith(stream, appNameStream().size())) << size;
    }
}

TEST_P(AppendedStream, GoesByTheSizesOfItsEntriesAlone) {
    const std::string stream = streamHeader(s_appNames, 1, 0) + le32(1) + "a" + le32(8) + "12345678" + le32(3) + "bcd";
    EXPECT_EQ(atomOf(stream), extendedAtom("DATA", stream));
}

TEST_P(AppendedStream, WithoutAWholeHeaderIsLeftOut) {
    for (std::size_t size = 0; size < 24; ++size) {
        EXPECT_EQ(atomOf(locationStream().substr(0, size)), "") << size;
        EXPECT_EQ(atomOf(appNameStream().substr(0, size)), "") << size;
    }
}

std::string streamOfSize(std::size_t size, std::uint32_t entrySize) {
    std::string stream = streamHeader(s_cursorLocations, 1, entrySize);
    while (stream.size() < size)
        stream += static_cast<char>(stream.size() * 7 >> 3);
    return stream;
}

TEST_P(AppendedStream, OfAnyLengthIsCopied) {
    for (const std::size_t size : {2047u, 2048u, 2049u, 4095u, 4096u, 4097u, 100'000u}) {
        EXPECT_TRUE(atomOf(streamOfSize(size, 1)) == extendedAtom("DATA", streamOfSize(size, 1))) << size;
        const std::string torn = streamOfSize(size, 5);
        EXPECT_TRUE(atomOf(torn) == atomWith(torn, size - (size - 24) % 5)) << size;
    }
}

TEST_P(AppendedStream, OfAnEntryOfNoSizeIsRefused) {
    const std::string stream = appNameStream() + le32(0) + textEntry(3.0, "lost");
    EXPECT_THAT([&] { append({stream}); }, ThrowsMessage<std::runtime_error>("Got an entry size of 0"));
    EXPECT_EQ(appended(), header("ZULM", 0));
}

TEST_P(AppendedStream, ThatIsRefusedLeavesTheOnesBeforeItAndNoSize) {
    const std::string refused = streamHeader(s_appNames, 1, 0) + le32(0);
    EXPECT_THAT(
        [&] {
            append({locationStream(), refused, scaleStream(1.0)});
        },
        ThrowsMessage<std::runtime_error>("Got an entry size of 0"));
    EXPECT_EQ(appended(), header("ZULM", 0) + extendedAtom("DATA", locationStream()));
}

TEST_P(AppendedStream, ThatIsRefusedCanBeFollowedByAnotherOnceTheMovieIsRepaired) {
    const std::string refused = streamHeader(s_appNames, 1, 0) + le32(0);
    EXPECT_THROW(append({locationStream(), refused}), std::runtime_error);
    EXPECT_TRUE(Util::finalizeAtomsInFile(movie));
    append({scaleStream(2.0)});
    EXPECT_EQ(appended(), zulmAtom({locationStream()}) + zulmAtom({scaleStream(2.0)}));
}

TEST_P(AppendedStream, OfZerosThatAreNoWholeSizeIsNotRefused) {
    for (std::size_t zeros = 1; zeros < 4; ++zeros) {
        const std::string stream = appNameStream() + std::string(zeros, '\0');
        EXPECT_EQ(atomOf(stream), atomWith(stream, appNameStream().size()));
    }
}

TEST_P(AppendedStream, IsFoundAgain) {
    append({locationStream(), appNameStream()});
    EXPECT_THAT(streamsOf(*MetaDataParser::create(movie)),
                ElementsAre(FoundStream{kind(s_appNames), 134, 56}, FoundStream{kind(s_cursorLocations), 62, 56}));
}

TEST_P(AppendedStream, HidesTheOneBehindItWhereItsTailIsTorn) {
    append({locationStream() + "torn!", appNameStream()});
    testing::internal::CaptureStderr();
    EXPECT_THAT(streamsOf(*MetaDataParser::create(movie)), ElementsAre(FoundStream{kind(s_cursorLocations), 62, 61}));
    testing::internal::GetCapturedStderr();
}

TEST_P(AppendedStream, MakesAnotherAtomWithEveryAppend) {
    append({locationStream()});
    append({appNameStream()});
    EXPECT_EQ(appended(), zulmAtom({locationStream()}) + zulmAtom({appNameStream()}));
}

/// No file grows beyond `size` bytes while this lives: what a full disk does.
class FullDisk {
public:
    explicit FullDisk(rlim_t size) : handler_(std::signal(SIGXFSZ, SIG_IGN)) {
        getrlimit(RLIMIT_FSIZE, &limit_);
        const rlimit smaller{size, limit_.rlim_max};
        EXPECT_EQ(setrlimit(RLIMIT_FSIZE, &smaller), 0);
    }
    ~FullDisk() {
        setrlimit(RLIMIT_FSIZE, &limit_);
        std::signal(SIGXFSZ, handler_);
    }
    FullDisk(const FullDisk&) = delete;
    FullDisk& operator=(const FullDisk&) = delete;

private:
    void (*handler_)(int);
    rlimit limit_{};
};

TEST_P(AppendedStream, ThatDoesNotFitOnTheDiskLeavesASizeThatCountsFromMinusOne) {
    const std::string stream = streamHeader(s_cursorLocations, 1, 1) + std::string(60'000, 'e');
    const std::string file = streamFile("large.dat", stream);
    {
        const FullDisk disk(4096);
        if (GetParam() == FromFile)
            EXPECT_TRUE(MP4MetaData::appendMetaDataFiles(movie, {file}));
        else
            MP4MetaData::appendMetaData(movie, {{uuid{}, stream}});
    }
    EXPECT_EQ(appended().substr(0, 16), header("ZULM", minus(1 + 30)));
}

// Streams from files ----------------------------------------------------------------------------------------------

using AppendedFiles = MovieTest;

TEST_F(AppendedFiles, AreInTheirListsOrder) {
    const std::string scale = streamFile("scale.dat", scaleStream(1.0));
    const std::string names = streamFile("names.dat", appNameStream());
    EXPECT_TRUE(appendFiles({scale, names, scale}));
    EXPECT_EQ(appended(), zulmAtom({scaleStream(1.0), appNameStream(), scaleStream(1.0)}));
    EXPECT_EQ(output, "");
}

TEST_F(AppendedFiles, MakeAnAtomEvenWhereThereAreNone) {
    EXPECT_TRUE(appendFiles({}));
    EXPECT_EQ(appended(), hex("00000001 5a554c4d 0000000000000010"));
    EXPECT_EQ(output, "");
}

TEST_F(AppendedFiles, AreTheOnlyAtomsOfAMovieThatWasEmptyOrNotThere) {
    const std::string names = streamFile("names.dat", appNameStream());
    writeFile(movie, "");
    EXPECT_TRUE(appendFiles({names}));
    EXPECT_EQ(contentsOf(movie), zulmAtom({appNameStream()}));
    std::filesystem::remove(movie);
    EXPECT_TRUE(appendFiles({names}));
    EXPECT_EQ(contentsOf(movie), zulmAtom({appNameStream()}));
}

TEST_F(AppendedFiles, StayAsTheyAre) {
    const std::string torn = streamFile("torn.dat", locationStream() + "torn");
    EXPECT_TRUE(appendFiles({torn}));
    EXPECT_EQ(contentsOf(torn), locationStream() + "torn");
}

TEST_F(AppendedFiles, AreAllThereButForOneThatIsMissing) {
    const std::string names = streamFile("names.dat", appNameStream());
    const std::string scale = streamFile("scale.dat", scaleStream(1.0));
    EXPECT_FALSE(appendFiles({names, folder / "missing.dat", scale}));
    EXPECT_EQ(appended(), zulmAtom({appNameStream(), scaleStream(1.0)}));
}

TEST_F(AppendedFiles, ThatAreMissingAreReportedUnderTheMoviesName) {
    EXPECT_FALSE(appendFiles({folder / "missing.dat", folder / "missing/too.dat", ""}));
    const std::string line = "Couldn't open meta data file: " + movie + "\n";
    EXPECT_EQ(output, line + line + line);
    EXPECT_EQ(appended(), header("ZULM", 16));
}

TEST_F(AppendedFiles, HaveOneThatIsMissingInTheEndRememberedToo) {
    const std::string names = streamFile("names.dat", appNameStream());
    EXPECT_FALSE(appendFiles({folder / "missing.dat", names}));
    EXPECT_EQ(output, "Couldn't open meta data file: " + movie + "\n");
}

TEST_F(AppendedFiles, NeedAMovieThatCanBeOpened) {
    const std::string names = streamFile("names.dat", appNameStream());
    for (const std::string& unopenable : {folder / "missing/movie.mp4", folder.path().string(), std::string()}) {
        movie = unopenable;
        EXPECT_FALSE(appendFiles({names}));
        EXPECT_EQ(output, "Couldn't open output file for appending meta data: " + unopenable + "\n");
    }
    EXPECT_FALSE(std::filesystem::exists(folder / "missing"));
}

TEST_F(AppendedFiles, CanFollowMoreMediaThan32BitsCount) {
    const std::uint64_t size = 5'000'000'000;
    writeSparseFile(movie, size, header("mdat", size));
    EXPECT_TRUE(appendFiles({streamFile("names.dat", appNameStream())}));
    std::ifstream stream(movie, std::ios_base::binary);
    stream.seekg(static_cast<std::streamoff>(size));
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(stream), {}), zulmAtom({appNameStream()}));
}

// Streams from memory -------------------------------------------------------------------------------------------

class AppendedFromMemory : public MovieTest {
protected:
    /// `output` then holds what was written on standard output and standard error.
    void append(const std::map<uuid, std::string>& streams) {
        testing::internal::CaptureStdout();
        testing::internal::CaptureStderr();
        MP4MetaData::appendMetaData(movie, streams);
        output = testing::internal::GetCapturedStdout() + testing::internal::GetCapturedStderr();
    }
};

TEST_F(AppendedFromMemory, AreInTheOrderOfTheirKinds) {
    append({{kind(s_scaleFactors), scaleStream(1.0)},
            {kind(s_appNames), appNameStream()},
            {kind(s_cursorLocations), locationStream()}});
    EXPECT_EQ(appended(), zulmAtom({appNameStream(), locationStream(), scaleStream(1.0)}));
    EXPECT_EQ(output, "");
}

TEST_F(AppendedFromMemory, KeepTheKindInTheirHeader) {
    append({{kind(s_scaleFactors), appNameStream()}});
    EXPECT_EQ(appended(), zulmAtom({appNameStream()}));
}

TEST_F(AppendedFromMemory, MakeAnAtomEvenWhereThereAreNone) {
    append({});
    EXPECT_EQ(appended(), header("ZULM", 16));
}

TEST_F(AppendedFromMemory, AreSilentlyLostWhereTheMovieCannotBeOpened) {
    for (const std::string& unopenable : {folder / "missing/movie.mp4", folder.path().string(), std::string()}) {
        movie = unopenable;
        append({{kind(s_appNames), appNameStream()}});
        EXPECT_EQ(output, "");
    }
    EXPECT_FALSE(std::filesystem::exists(folder / "missing"));
}

TEST_F(AppendedFromMemory, AreRefusedForAnEntryOfNoSizeEvenWhereTheMovieCannotBeOpened) {
    const std::map<uuid, std::string> streams = {{kind(s_appNames), streamHeader(s_appNames, 1, 0) + le32(0)}};
    EXPECT_THAT([&] { MP4MetaData::appendMetaData(folder / "missing/movie.mp4", streams); },
                ThrowsMessage<std::runtime_error>("Got an entry size of 0"));
}

TEST_F(AppendedFromMemory, CarryTheStreamsOfOneMovieIntoAnother) {
    const std::string other = zulmAtom({appNameStream(), locationStream()});
    writeFile(folder / "other.mov", atom("moov") + other);
    std::map<uuid, std::string> streams;
    MetaDataParser::create(folder / "other.mov")->loadAllData(streams);
    append(streams);
    EXPECT_EQ(appended(), other);
}

} // namespace

} // namespace ZULMetaData::Test
