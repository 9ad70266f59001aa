// Real media with metadata attached: players and inspectors see what they saw before. Runs ffmpeg, ffprobe, exiftool
// and mediainfo.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaDataBridge/Source/ZULMAtomRepair.h"
#include "ZULMetaDataBridge/Source/ZULMAtomWriter.h"
#include "ZULMetaDataBridge/Source/ZULRAtomWriter.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;

const std::string s_movies[] = {"Recording.mp4", "Recording.mov"};
const std::string s_riffFiles[] = {"Recording.avi", "Recording.wav"};

std::string quoted(const std::filesystem::path& file) {
    return "'" + file.string() + "'";
}

/// A picture that changes and a tone, 1.5 seconds of each.
std::string makeMedia(const std::filesystem::path& file) {
    const std::string picture = "-f lavfi -i testsrc=size=160x120:rate=10 ";
    const std::string tone = "-f lavfi -i sine=frequency=440 ";
    const std::string extension = file.extension();
    const std::string inputs = extension == ".wav" ? tone : picture + tone;
    const std::string codecs = extension == ".wav"   ? "-c:a pcm_s16le "
                               : extension == ".avi" ? "-c:v mjpeg -c:a pcm_s16le "
                                                     : "-c:v mpeg4 -c:a aac -movflags +faststart ";
    return outputOf("ffmpeg -v error -y " + inputs + "-t 1.5 " + codecs + quoted(file) + " 2>&1");
}

std::string streamsAndDurations(const std::filesystem::path& file) {
    return outputOf("ffprobe -v warning -of compact -show_entries format=format_name,nb_streams,duration,start_time:"
                    "format_tags:stream:stream_tags " +
                    quoted(file) + " 2>&1");
}

std::string packetChecksums(const std::filesystem::path& file) {
    return outputOf("ffmpeg -v error -i " + quoted(file) + " -map 0 -c copy -f streamhash - 2>&1");
}

std::string frameChecksums(const std::filesystem::path& file) {
    return outputOf("ffmpeg -v error -i " + quoted(file) + " -map 0 -f framemd5 - 2>&1");
}

std::string playbackErrors(const std::filesystem::path& file) {
    return outputOf("ffmpeg -v error -i " + quoted(file) + " -f null - 2>&1");
}

std::string warnings(const std::filesystem::path& file) {
    return outputOf("exiftool -a -G1 -warning -error " + quoted(file) + " 2>&1");
}

std::string validation(const std::filesystem::path& file) {
    return outputOf("exiftool -a -validate -warning -error " + quoted(file) + " 2>&1");
}

/// All that does not follow from the size of the file.
std::string mediaInformation(const std::filesystem::path& file) {
    std::istringstream report(outputOf("mediainfo " + quoted(file) + " 2>&1"));
    std::string kept;
    for (std::string line; std::getline(report, line);)
        if (!line.starts_with("Complete name") && !line.starts_with("File size") &&
            !line.starts_with("Overall bit rate  ") && !line.starts_with("Stream size"))
            kept += line + '\n';
    return kept;
}

/// Made when it is first asked for.
std::filesystem::path mediaFile(const std::string& name) {
    static const TemporaryFolder folder;
    if (!std::filesystem::exists(folder / name)) {
        EXPECT_EQ(makeMedia(folder / name), "");
    }
    return folder / name;
}

class MediaFiles : public testing::TestWithParam<std::string> {
protected:
    MediaFiles() { std::filesystem::copy_file(original, copy); }

    std::string streamFile(const std::string& name, const std::string& contents) {
        writeFile(folder / name, contents);
        return folder / name;
    }

    std::string attached() const {
        const std::string before = contentsOf(original);
        const std::string after = contentsOf(copy);
        EXPECT_TRUE(after.starts_with(before));
        return after.substr(before.size());
    }

    TemporaryFolder folder;
    const std::filesystem::path original = mediaFile(GetParam());
    const std::filesystem::path copy = folder / GetParam();
};

/// Has streams and recording info behind its media.
class AttachedMovie : public MediaFiles {
protected:
    AttachedMovie() {
        ZULMAtomWriter().writeMetaDataFiles(
            {streamFile("points.dat", locationStream()), streamFile("names.dat", appNameStream())}, copy);
        ZULRAtomWriter().writeZULRtoFile(copy, "Recorder", "1.0");
    }
};

/// Has a chunk with streams behind its media.
class AttachedRiffFile : public MediaFiles {
protected:
    AttachedRiffFile() {
        std::ofstream(copy, std::ios_base::app | std::ios_base::binary)
            << zulmChunk({locationStream(), appNameStream()});
    }
};

/// Ends with an open-ended media atom, as a recording does that was cut short.
class CutShortMovie : public MediaFiles {
protected:
    CutShortMovie() {
        const std::string movie = contentsOf(copy);
        const std::size_t type = movie.rfind("mdat");
        std::string openEnded = movie;
        writeFile(copy, openEnded.replace(type - 4, 4, be32(0)));
        EXPECT_EQ(movie.substr(type - 4, 4), be32(static_cast<std::uint32_t>(movie.size() - (type - 4))));
    }
};

INSTANTIATE_TEST_SUITE_P(Movies, AttachedMovie, testing::ValuesIn(s_movies),
                         [](const auto& file) { return file.param.substr(file.param.find('.') + 1); });
INSTANTIATE_TEST_SUITE_P(Movies, CutShortMovie, testing::ValuesIn(s_movies),
                         [](const auto& file) { return file.param.substr(file.param.find('.') + 1); });
INSTANTIATE_TEST_SUITE_P(RiffFiles, AttachedRiffFile, testing::ValuesIn(s_riffFiles),
                         [](const auto& file) { return file.param.substr(file.param.find('.') + 1); });

// Movies with streams and recording info ------------------------------------------------------------------------

TEST_P(AttachedMovie, KeepsEveryByteThatItHad) {
    const std::string streams = zulmAtom({locationStream(), appNameStream()});
    EXPECT_EQ(attached().size(), streams.size() + 80);
    EXPECT_EQ(attached().substr(0, streams.size()), streams);
    EXPECT_EQ(attached().substr(streams.size(), 16), be32(1) + "ZULR" + be64(80));
}

TEST_P(AttachedMovie, HasTheSameStreamsAndDurations) {
    EXPECT_THAT(streamsAndDurations(original), testing::HasSubstr("codec_name=mpeg4"));
    EXPECT_EQ(streamsAndDurations(copy), streamsAndDurations(original));
}

TEST_P(AttachedMovie, HasTheSamePackets) {
    EXPECT_THAT(packetChecksums(original), testing::HasSubstr("0,v,SHA256="));
    EXPECT_EQ(packetChecksums(copy), packetChecksums(original));
}

TEST_P(AttachedMovie, ShowsTheSameFrames) {
    EXPECT_THAT(frameChecksums(original), testing::HasSubstr("160x120"));
    EXPECT_EQ(frameChecksums(copy), frameChecksums(original));
}

TEST_P(AttachedMovie, PlaysWithoutAnError) {
    EXPECT_EQ(playbackErrors(copy), "");
}

TEST_P(AttachedMovie, GivesTheInspectorsNoReasonToComplain) {
    EXPECT_EQ(warnings(copy), warnings(original));
    EXPECT_EQ(validation(copy), validation(original));
    EXPECT_THAT(mediaInformation(original), testing::HasSubstr("MPEG-4 Visual"));
    EXPECT_EQ(mediaInformation(copy), mediaInformation(original));
}

TEST_P(AttachedMovie, GivesItsStreamsBack) {
    const std::uint64_t start = std::filesystem::file_size(original);
    const auto parser = MetaDataParser::create(copy.string());
    EXPECT_THAT(streamsOf(*parser), ElementsAre(FoundStream{kind(s_appNames), start + 104, 56},
                                                FoundStream{kind(s_cursorLocations), start + 32, 56}));
    Entries<Point> points;
    parser->loadDataType(kind(s_cursorLocations), points, -1);
    EXPECT_THAT(points.values, ElementsAre(Point(10, 20), Point(-3, 7)));
}

TEST_P(AttachedMovie, IsConsistent) {
    const std::string before = contentsOf(copy);
    EXPECT_TRUE(ZULMAtomRepair::finalizeAtomsInFile(copy));
    EXPECT_TRUE(contentsOf(copy) == before);
}

// RIFF files with streams ---------------------------------------------------------------------------------------

TEST_P(AttachedRiffFile, HasTheSameStreamsAndDurations) {
    EXPECT_THAT(streamsAndDurations(original), testing::HasSubstr("codec_name=pcm_s16le"));
    EXPECT_EQ(streamsAndDurations(copy), streamsAndDurations(original));
}

TEST_P(AttachedRiffFile, HasTheSamePackets) {
    EXPECT_THAT(packetChecksums(original), testing::HasSubstr(",a,SHA256="));
    EXPECT_EQ(packetChecksums(copy), packetChecksums(original));
}

TEST_P(AttachedRiffFile, PlaysTheSameSamplesWithoutAnError) {
    EXPECT_EQ(frameChecksums(copy), frameChecksums(original));
    EXPECT_EQ(playbackErrors(copy), "");
}

TEST_P(AttachedRiffFile, GivesTheInspectorsNoReasonToComplain) {
    EXPECT_EQ(warnings(copy), warnings(original));
    EXPECT_THAT(mediaInformation(original), testing::HasSubstr("PCM"));
    EXPECT_EQ(mediaInformation(copy), mediaInformation(original));
}

TEST_P(AttachedRiffFile, GivesItsStreamsBack) {
    const std::uint64_t start = std::filesystem::file_size(original);
    const auto parser = MetaDataParser::create(copy.string());
    EXPECT_THAT(streamsOf(*parser), ElementsAre(FoundStream{kind(s_appNames), start + 80, 56},
                                                FoundStream{kind(s_cursorLocations), start + 16, 56}));
    Entries<std::string> names;
    parser->loadDataType(kind(s_appNames), names, -1);
    EXPECT_THAT(names.values, ElementsAre("Abc", "Notes"));
}

// Movies that were cut short --------------------------------------------------------------------------------------

TEST_P(CutShortMovie, IsRepairedToWhatItWas) {
    EXPECT_TRUE(ZULMAtomRepair::finalizeAtomsInFile(copy));
    EXPECT_TRUE(contentsOf(copy) == contentsOf(original));
}

TEST_P(CutShortMovie, PlaysWithoutAnErrorOnceItIsRepaired) {
    ZULMAtomRepair::finalizeAtomsInFile(copy);
    EXPECT_EQ(playbackErrors(copy), "");
    EXPECT_EQ(frameChecksums(copy), frameChecksums(original));
}

TEST_P(CutShortMovie, IsRepairedBeforeStreamsAreAttached) {
    ZULMAtomWriter().writeMetaDataFiles({streamFile("points.dat", locationStream())}, copy);
    EXPECT_EQ(attached(), zulmAtom({locationStream()}));
    EXPECT_EQ(playbackErrors(copy), "");
    EXPECT_EQ(packetChecksums(copy), packetChecksums(original));
}

TEST_P(CutShortMovie, IsRepairedBeforeItIsStamped) {
    ZULRAtomWriter().writeZULRtoFile(copy, "Recorder", "1.0");
    EXPECT_EQ(attached().size(), 80u);
    EXPECT_EQ(playbackErrors(copy), "");
    EXPECT_EQ(validation(copy), validation(original));
}

} // namespace

} // namespace ZULMetaData::Test
