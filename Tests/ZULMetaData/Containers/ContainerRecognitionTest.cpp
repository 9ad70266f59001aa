// Containers told apart by their first bytes.

#include "ZULMetaData/Containers/ContainerRecognition.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <map>
#include <stdexcept>
#include <system_error>

namespace ZULMetaData::Test {
namespace {

using enum MetaDataParser::StreamType;

TEST(ContainerRecognition, TakesASizeAndAPrintableTypeForAMovie) {
    EXPECT_EQ(streamTypeOfContents(atom("ftyp", "isom")), QuickTime);
    EXPECT_EQ(streamTypeOfContents(extendedAtom("mdat")), QuickTime);
    EXPECT_EQ(streamTypeOfContents(be32(0) + "mdat"), QuickTime); // an open end
    EXPECT_EQ(streamTypeOfContents(be32(8) + "wide"), QuickTime);
    EXPECT_EQ(streamTypeOfContents(be32(8) + "~ ~ "), QuickTime);
}

TEST(ContainerRecognition, RefusesAtomsThatCannotBe) {
    EXPECT_EQ(streamTypeOfContents(be32(7) + "mdat"), Unknown);
    EXPECT_EQ(streamTypeOfContents(be32(16) + "\x01\x02\x03\x04"), Unknown);
    EXPECT_EQ(streamTypeOfContents(be32(16) + "wid\x7f"), Unknown);
    EXPECT_EQ(streamTypeOfContents(be32(8) + "wid"), Unknown); // cut short
    EXPECT_EQ(streamTypeOfContents(""), Unknown);
    EXPECT_EQ(streamTypeOfContents(std::string(64, '\0')), Unknown);
}

TEST(ContainerRecognition, TakesTheSignatureForRIFF) {
    EXPECT_EQ(streamTypeOfContents(chunk("RIFF", "WAVE")), Riff);
    EXPECT_EQ(streamTypeOfContents("RIFF"), Unknown);
}

TEST(ContainerRecognition, TakesAnIdentifierOfTheFamilyForAStream) {
    EXPECT_EQ(streamTypeOfContents(streamHeader("2b7b6af2", 1, 16)), RawStream);
    EXPECT_EQ(streamTypeOfContents(streamHeader("2b7b6aff", 1, 16)), RawStream); // nobody's
}

TEST(ContainerRecognition, KnowsTheFamilyByAllBehindTheFirstGroup) {
    EXPECT_EQ(streamTypeOfContents(hex("00000000 7a1f 11e2 83d0 0017f200be7f")), RawStream);
    EXPECT_EQ(streamTypeOfContents(hex("2b7b6af2 7b1f 11e2 83d0 0017f200be7f")), Unknown);
    EXPECT_EQ(streamTypeOfContents(hex("2b7b6af2 7a1f 11e2 83d0 0017f200be70")), Unknown);
    EXPECT_EQ(streamTypeOfContents(hex("2b7b6af2 7a1f 11e2 83d0 0017f200be")), Unknown); // cut short
}

TEST(ContainerRecognition, TakesTheSignaturesOf64BitRIFF) {
    for (const char* signature : {"RF64", "BW64"})
        EXPECT_EQ(streamTypeOfContents(signature + le32(0xffffffff) + "WAVE"), Riff) << signature;
}

RecognizedContainer recognized(const std::string& bytes, const std::string& name) {
    return recognizeContainer(bytes, bytes.size(), name);
}

TEST(ContainerRecognition, GoesByTheContentsWhateverTheName) {
    for (const char* name : {"a.mp4", "a.m4v", "a.dat", "a.avi", "a.ismv", "/dev/stdin", ""}) {
        EXPECT_EQ(recognized(atom("ftyp", "isom"), name).type, QuickTime) << name;
        EXPECT_EQ(recognized(chunk("RIFF", "WAVE"), name).type, Riff) << name;
        EXPECT_EQ(recognized(streamHeader("2b7b6af2", 1, 16), name).type, RawStream) << name;
    }
}

TEST(ContainerRecognition, SaysWhereTheNameTellsAnotherContainer) {
    EXPECT_TRUE(recognized(atom("ftyp", "isom"), "a.dat").contradictsName);
    EXPECT_TRUE(recognized(chunk("RIFF", "WAVE"), "a.mp4").contradictsName);
    EXPECT_FALSE(recognized(atom("ftyp", "isom"), "a.mov").contradictsName);
    EXPECT_FALSE(recognized(atom("ftyp", "isom"), "a.m4v").contradictsName);
}

TEST(ContainerRecognition, GoesByTheNameWhereTheContentsSayNothing) {
    for (const std::string& bytes : {std::string(), std::string("\0\0\0", 3), std::string("RIFF")}) {
        EXPECT_EQ(recognized(bytes, "a.mp4").type, QuickTime);
        EXPECT_EQ(recognized(bytes, "a.wav").type, Riff);
        EXPECT_EQ(recognized(bytes, "a.dat").type, RawStream);
        EXPECT_EQ(recognized(bytes, "a.txt").type, Unknown);
    }
    EXPECT_EQ(recognized(std::string(24, 'k'), "a.dat").type, RawStream); // a kind of somebody's own
    EXPECT_EQ(recognized(be32(5) + "abcd" + std::string(16, ' '), "a.mov").type, QuickTime);
}

TEST(ContainerRecognition, TakesZerosForNoMovieWhateverTheName) {
    const RecognizedContainer zeros = recognized(std::string(5000, '\0'), "a.mp4");
    EXPECT_EQ(zeros.type, Unknown);
    EXPECT_TRUE(zeros.contradictsName);
    EXPECT_EQ(zeros.refusal(), "begins neither like a movie, nor a RIFF file, nor a stream, although its name says so");
    EXPECT_EQ(recognized(std::string(5000, '\0'), "a.wav").type, Unknown);
}

TEST(ContainerRecognition, TakesATextForNoMovie) {
    EXPECT_EQ(recognized("Hello, world. This is no movie.", "a.txt").type, Unknown);
    EXPECT_EQ(recognized(be32(12) + "abcd" + "1234", "a.bin").type, QuickTime);
}

TEST(ContainerRecognition, NamesOtherContainers) {
    std::string packets;
    for (int i = 0; i < 3; ++i)
        packets += 'G' + std::string(187, '\0');
    const std::map<std::string, std::string> beginnings{
        {"a Matroska file", hex("1a45dfa3 9f 4286 81 01") + "B\x82\x88matroska"},
        {"a WebM file", hex("1a45dfa3 9f 4286 81 01") + "B\x82\x84webm"},
        {"an Ogg file", std::string("OggS\0\2", 6) + std::string(20, '\0')},
        {"an FLV file", "FLV\1" + std::string(20, '\0')},
        {"an ASF file (WMV or WMA)", hex("3026b2758e66cf11a6d900aa0062ce6c")},
        {"an MPEG program stream", hex("000001ba44000400")},
        {"an MPEG transport stream", packets},
        {"a big-endian RIFF file (RIFX)", "RIFX" + be32(4) + "WAVE"},
    };
    for (const auto& [name, bytes] : beginnings)
        for (const char* file : {"a.bin", "a.mp4", "a.dat"}) {
            const RecognizedContainer foreign = recognized(bytes, file);
            EXPECT_EQ(foreign.type, Unknown) << name;
            EXPECT_EQ(foreign.foreignName, name);
            EXPECT_EQ(foreign.refusal().find("is " + name + "; recording metadata is in movies"), 0U);
        }
}

TEST(ContainerRecognition, OpensAFileByItsContents) {
    const TemporaryFolder folder;
    writeFile(folder / "Recording.m4v", media() + zulmAtom({locationStream()}));
    EXPECT_EQ(MetaDataParser::create(folder / "Recording.m4v"), nullptr); // as it always did
    const auto parser = openContainer(folder / "Recording.m4v");
    EXPECT_EQ(parser->getStreamType(), QuickTime);
    EXPECT_EQ(streamsOf(*parser), (std::vector<FoundStream>{{kind(s_cursorLocations), 62, 56}}));
}

TEST(ContainerRecognition, ClosesTheFileThatItOpened) {
    const TemporaryFolder folder;
    writeFile(folder / "Recording.mp4", media() + zulmAtom({locationStream()}));
    const auto parser = openContainer(folder / "Recording.mp4");
    std::map<uuid, std::string> streams;
    parser->loadAllData(streams);
    EXPECT_EQ(streams.at(kind(s_cursorLocations)), locationStream());
    parser->close();
    EXPECT_EQ(parser->fileDataForUUID(kind(s_cursorLocations)).length, 56U);
    streams.clear();
    parser->loadAllData(streams);
    EXPECT_TRUE(streams.empty() || streams.at(kind(s_cursorLocations)).empty());
}

TEST(ContainerRecognition, ThrowsForWhatItCannotOpen) {
    const TemporaryFolder folder;
    writeFile(folder / "Zeros.mp4", std::string(5000, '\0'));
    EXPECT_THROW(openContainer(folder / "missing.mp4"), std::system_error);
    EXPECT_THROW(openContainer(folder / "."), std::system_error);
    EXPECT_THROW(openContainer(folder / "Zeros.mp4"), std::runtime_error);
}

TEST(ContainerRecognition, OmitsTheMessagesOfTheSearchIfItIsToldTo) {
    const std::string child = chunk("JUNK", "junk") + chunk("DATA", locationStream());
    for (const auto& [type, bytes] :
         {std::pair(QuickTime,
                    extendedAtom("ZULM", extendedAtom("free", "junk") + extendedAtom("DATA", locationStream()))),
          std::pair(Riff, riffMedia() + chunk("ZULM", child))}) {
        std::istringstream stream(bytes);
        testing::internal::CaptureStderr();
        const auto silent = streamsOf(*openContainer(stream, type, ScanMessages::Omitted));
        EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
        testing::internal::CaptureStderr();
        EXPECT_EQ(streamsOf(*openContainer(stream, type)), silent);
        EXPECT_EQ(testing::internal::GetCapturedStderr().find("Found a non DATA "), 0U);
        EXPECT_EQ(silent.size(), 1U);
    }
}

TEST(ContainerRecognition, NamesTheExtensionThatTellsTheSame) {
    for (const auto type : {QuickTime, Riff, RawStream})
        EXPECT_EQ(MetaDataParser::streamTypeOf("file" + std::string(extensionFor(type))), type);
    EXPECT_EQ(extensionFor(Unknown), "");
}

} // namespace
} // namespace ZULMetaData::Test
