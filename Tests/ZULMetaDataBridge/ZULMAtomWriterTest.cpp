// What the application sees when it attaches its streams to a movie.

#include "ZULMetaDataBridge/Source/ZULMAtomWriter.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <stdexcept>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;
using testing::ThrowsMessage;

class AtomWriter : public testing::Test {
protected:
    FileLocation streamFile(const std::string& name, const std::string& contents) {
        writeFile(folder / name, contents);
        return folder / name;
    }

    /// The movie after streams were attached to it. `output` then holds what was written on standard output.
    std::string attached(const std::string& contents, const std::vector<FileLocation>& files) {
        writeFile(movie, contents);
        attach(files);
        return contentsOf(movie);
    }

    void attach(const std::vector<FileLocation>& files) {
        testing::internal::CaptureStdout();
        ZULMAtomWriter().writeMetaDataFiles(files, movie);
        output = testing::internal::GetCapturedStdout();
    }

    TemporaryFolder folder;
    FileLocation movie = folder / "Recording.mp4";
    std::string output;
};

TEST_F(AtomWriter, AttachesStreamsInTheirListsOrder) {
    const auto scale = streamFile("scale.dat", scaleStream(2.0));
    const auto names = streamFile("names.dat", appNameStream());
    EXPECT_EQ(attached(media(), {scale, names, scale}),
              media() + zulmAtom({scaleStream(2.0), appNameStream(), scaleStream(2.0)}));
    EXPECT_EQ(output, "");
}

TEST_F(AtomWriter, AttachesAnEmptyAtomForNoStreams) {
    EXPECT_EQ(attached(media(), {}), media() + hex("00000001 5a554c4d 0000000000000010"));
}

TEST_F(AtomWriter, SizesAnOpenEndedMediaAtomFirst) {
    const std::string openEnded = atom("ftyp", "mp42") + be32(0) + "mdat" + "0123456789";
    EXPECT_EQ(attached(openEnded, {streamFile("names.dat", appNameStream())}), media() + zulmAtom({appNameStream()}));
}

TEST_F(AtomWriter, SizesAnInterruptedAppendFirst) {
    const std::string unfinished = be32(1) + "ZULM" + be64(0) + extendedAtom("DATA", locationStream());
    EXPECT_EQ(attached(media() + unfinished, {streamFile("names.dat", appNameStream())}),
              media() + zulmAtom({locationStream()}) + zulmAtom({appNameStream()}));
}

TEST_F(AtomWriter, AttachesStreamsToAMovieThatIsBeyondRepair) {
    const std::string overrun = media() + be32(100) + "free";
    EXPECT_EQ(attached(overrun, {streamFile("names.dat", appNameStream())}), overrun + zulmAtom({appNameStream()}));
}

TEST_F(AtomWriter, AttachesAnotherAtomWithEveryCall) {
    const std::vector<FileLocation> files = {streamFile("names.dat", appNameStream())};
    const std::string once = attached(media(), files);
    EXPECT_EQ(attached(once, files), media() + zulmAtom({appNameStream()}) + zulmAtom({appNameStream()}));
}

TEST_F(AtomWriter, AttachesTheOtherStreamsWhereOneIsMissing) {
    const auto names = streamFile("names.dat", appNameStream());
    EXPECT_EQ(attached(media(), {folder / "missing.dat", names}), media() + zulmAtom({appNameStream()}));
    EXPECT_EQ(output, "Couldn't open meta data file: " + movie.string() + "\n");
}

TEST_F(AtomWriter, SaysWhichMovieItCannotOpen) {
    movie = folder / "missing/movie.mp4";
    attach({streamFile("names.dat", appNameStream())});
    EXPECT_EQ(output, "Couldn't open output file for appending meta data: " + movie.string() + "\n");
}

TEST_F(AtomWriter, MakesAMovieThatIsNotThere) {
    attach({streamFile("names.dat", appNameStream())});
    EXPECT_EQ(contentsOf(movie), zulmAtom({appNameStream()}));
}

TEST_F(AtomWriter, OpensFilesByTheirPathInUTF8) {
    movie = FileLocation(folder.path()) / u8"Café 記録.mp4";
    const FileLocation names = FileLocation(folder.path()) / u8"Übung.dat";
    writeFile(folder / "\xC3\x9C"
                       "bung.dat",
              appNameStream());
    attach({names});
    EXPECT_EQ(contentsOf(folder / "Caf\xC3\xA9 \xE8\xA8\x98\xE9\x8C\xB2.mp4"), zulmAtom({appNameStream()}));
}

TEST_F(AtomWriter, LetsTheErrorOfAnEntryOfNoSizeThrough) {
    const auto broken = streamFile("broken.dat", streamHeader(s_appNames, 1, 0) + le32(0));
    writeFile(movie, media());
    EXPECT_THAT([&] { ZULMAtomWriter().writeMetaDataFiles({broken}, movie); },
                ThrowsMessage<std::runtime_error>("Got an entry size of 0"));
    EXPECT_EQ(contentsOf(movie), media() + be32(1) + "ZULM" + be64(0));
}

TEST_F(AtomWriter, AttachesStreamsAgainAfterAnEntryOfNoSize) {
    const auto broken = streamFile("broken.dat", streamHeader(s_appNames, 1, 0) + le32(0));
    writeFile(movie, media());
    EXPECT_THROW(ZULMAtomWriter().writeMetaDataFiles({broken}, movie), std::runtime_error);
    attach({streamFile("names.dat", appNameStream())});
    EXPECT_EQ(contentsOf(movie), media() + zulmAtom({}) + zulmAtom({appNameStream()}));
}

TEST_F(AtomWriter, AttachesStreamsThatAParserFinds) {
    attached(media(), {streamFile("names.dat", appNameStream()), streamFile("points.dat", locationStream())});
    EXPECT_THAT(streamsOf(*MetaDataParser::create(movie.string())),
                ElementsAre(FoundStream{kind(s_appNames), 62, 56}, FoundStream{kind(s_cursorLocations), 134, 56}));
}

} // namespace

} // namespace ZULMetaData::Test
