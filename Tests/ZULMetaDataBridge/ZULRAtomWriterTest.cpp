// The atom that says which program and which system made a recording.

#include "ZULMetaDataBridge/Source/ZULRAtomWriter.h"

#include "Platform/ProcessInfo.h"
#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <cstddef>
#include <cstdlib>
#include <filesystem>
#include <string>

#include <unistd.h>

namespace ZULMetaData::Test {

namespace {

std::string padded(const std::string& text, std::size_t size) {
    return text + std::string(size - text.size(), '\0');
}

std::string systemVersion() {
    const auto version = ProcessInfo::current().operatingSystemVersion;
    return std::to_string(version.major) + '.' + std::to_string(version.minor) + '.' + std::to_string(version.patch);
}

/// All 80 bytes.
std::string infoAtom(const std::string& creatorVersion) {
    return hex("00000001 5a554c52 0000000000000050"
               "01000000 00000000"
               "4d616300 00000000 00000000 00000000 00000000 00000000") +
           padded(creatorVersion, 16) + padded(systemVersion(), 16);
}

class RecordingInfoWriter : public testing::Test {
protected:
    RecordingInfoWriter() { writeFile(movie, media()); }

    void write(const std::string& creatorName, const std::string& creatorVersion) const {
        ZULRAtomWriter().writeZULRtoFile(movie, creatorName, creatorVersion);
    }

    TemporaryFolder folder;
    FileLocation movie = folder / "Recording.mp4";
};

TEST_F(RecordingInfoWriter, AppendsEightyBytes) {
    write("Recorder", "10.2.1");
    EXPECT_EQ(infoAtom("10.2.1").size(), 80u);
    EXPECT_EQ(contentsOf(movie), media() + infoAtom("10.2.1"));
}

TEST_F(RecordingInfoWriter, NamesTheSystemByThreeNumbers) {
    write("Recorder", "10.2.1");
    EXPECT_THAT(contentsOf(movie).substr(30 + 64).c_str(), testing::MatchesRegex("[0-9]+\\.[0-9]+\\.[0-9]+"));
}

TEST_F(RecordingInfoWriter, NamesThePlatformWhateverTheCreatorsName) {
    for (const std::string& name :
         {std::string("Recorder"), std::string(), std::string("Mac"), std::string(100, 'n')}) {
        writeFile(movie, media());
        write(name, "1.0");
        EXPECT_EQ(contentsOf(movie), media() + infoAtom("1.0")) << name;
    }
}

TEST_F(RecordingInfoWriter, StoresAnEmptyVersion) {
    write("Recorder", "");
    EXPECT_EQ(contentsOf(movie), media() + infoAtom(""));
}

TEST_F(RecordingInfoWriter, CutsAVersionThatIsTooLong) {
    write("Recorder", "123456789012345678901234567890");
    EXPECT_EQ(contentsOf(movie), media() + infoAtom("123456789012345"));
}

TEST_F(RecordingInfoWriter, AppendsAnotherAtomWithEveryCall) {
    write("Recorder", "1.0");
    write("Recorder", "2.0");
    EXPECT_EQ(contentsOf(movie), media() + infoAtom("1.0") + infoAtom("2.0"));
}

TEST_F(RecordingInfoWriter, SizesAnOpenEndedMediaAtomFirst) {
    writeFile(movie, atom("ftyp", "mp42") + be32(0) + "mdat" + "0123456789");
    write("Recorder", "1.0");
    EXPECT_EQ(contentsOf(movie), media() + infoAtom("1.0"));
}

TEST_F(RecordingInfoWriter, SizesAnInterruptedAppendFirst) {
    writeFile(movie, media() + be32(1) + "ZULM" + be64(0) + extendedAtom("DATA", locationStream()));
    write("Recorder", "1.0");
    EXPECT_EQ(contentsOf(movie), media() + zulmAtom({locationStream()}) + infoAtom("1.0"));
}

TEST_F(RecordingInfoWriter, AppendsToAMovieThatIsBeyondRepair) {
    const std::string overrun = media() + be32(100) + "free";
    writeFile(movie, overrun);
    write("Recorder", "1.0");
    EXPECT_EQ(contentsOf(movie), overrun + infoAtom("1.0"));
}

TEST_F(RecordingInfoWriter, MakesAMovieThatIsNotThere) {
    movie = folder / "new.mp4";
    write("Recorder", "1.0");
    EXPECT_EQ(contentsOf(movie), infoAtom("1.0"));
}

TEST_F(RecordingInfoWriter, LeavesTheStreamsOfAMovieToBeFound) {
    writeFile(movie, media() + zulmAtom({locationStream()}));
    write("Recorder", "1.0");
    EXPECT_THAT(streamsOf(*MetaDataParser::create(movie.string())),
                testing::ElementsAre(FoundStream{kind(s_cursorLocations), 62, 56}));
}

TEST_F(RecordingInfoWriter, OpensAMovieByItsPathInUTF8) {
    movie = FileLocation(folder.path()) / u8"Café 記録.mp4";
    write("Recorder", "1.0");
    EXPECT_EQ(contentsOf(folder / "Caf\xC3\xA9 \xE8\xA8\x98\xE9\x8C\xB2.mp4"), infoAtom("1.0"));
}

// Movies that cannot be opened ---------------------------------------------------------------------------------

#if defined(__APPLE__)
constexpr const char* s_cannotAppend =
    "Assertion failed: \\(outfile\\.is_open\\(\\)\\), function appendZCAPAtomInfo, file ZULRAtomWriter, line 40";
constexpr const char* s_cannotUpdate =
    "Assertion failed: \\(stream\\.is_open\\(\\)\\), function writeAtomSize, file ZULRAtomWriter, line 26";
#else
constexpr const char* s_cannotAppend =
    "ZULRAtomWriter:40: appendZCAPAtomInfo: Assertion `outfile\\.is_open\\(\\)' failed\\.";
constexpr const char* s_cannotUpdate = "ZULRAtomWriter:26: writeAtomSize: Assertion `stream\\.is_open\\(\\)' failed\\.";
#endif

class RecordingInfoWriterDeathTest : public RecordingInfoWriter {
protected:
    /// A file that can be appended to, but not read; to root too, once it became someone else.
    void makeMovieWriteOnly() const {
        using std::filesystem::perms;
        std::filesystem::permissions(folder.path(), perms::group_exec | perms::others_exec,
                                     std::filesystem::perm_options::add);
        std::filesystem::permissions(movie, perms::owner_write | perms::group_write | perms::others_write);
    }

    void writeAsOrdinaryUser() const {
        constexpr uid_t nobody = 65534;
        if (geteuid() == 0 && seteuid(nobody) != 0)
            std::_Exit(EXIT_FAILURE);
        write("Recorder", "1.0");
    }
};

TEST_F(RecordingInfoWriterDeathTest, AssertsThatTheMovieCanBeAppendedTo) {
    movie = folder / "missing/movie.mp4";
    EXPECT_DEATH(write("Recorder", "1.0"), s_cannotAppend);
    EXPECT_EXIT(write("Recorder", "1.0"), testing::KilledBySignal(SIGABRT), "");
}

TEST_F(RecordingInfoWriterDeathTest, AssertsThatAFolderIsNoMovie) {
    movie = folder.path();
    EXPECT_DEATH(write("Recorder", "1.0"), s_cannotAppend);
}

TEST_F(RecordingInfoWriterDeathTest, AssertsThatTheMovieCanBeReadAndWrittenOnceTheAtomIsAppended) {
    makeMovieWriteOnly();
    EXPECT_DEATH(writeAsOrdinaryUser(), s_cannotUpdate);
}

TEST_F(RecordingInfoWriterDeathTest, LeavesTheAtomWithoutASizeWhereItCannotWriteIt) {
    GTEST_FLAG_SET(death_test_style, "fast"); // the child writes to the movie of this very test
    makeMovieWriteOnly();
    EXPECT_EXIT(writeAsOrdinaryUser(), testing::KilledBySignal(SIGABRT), "");
    std::filesystem::permissions(movie, std::filesystem::perms::owner_read, std::filesystem::perm_options::add);
    EXPECT_EQ(contentsOf(movie), media() + infoAtom("1.0").replace(8, 8, be64(0)));
}

} // namespace

} // namespace ZULMetaData::Test
