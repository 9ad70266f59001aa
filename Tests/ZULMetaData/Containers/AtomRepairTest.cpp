// Giving the last atom of a movie its size, and reading the scale factor back.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

namespace ZULMetaData::Test {

namespace {

using testing::Contains;
using testing::ThrowsMessage;

constexpr std::uint64_t s_4GiB = 0x100000000;

std::string extendedHeader(const std::string& type, std::uint64_t size) {
    return be32(1) + type + be64(size);
}

class AtomRepair : public testing::Test {
protected:
    bool repair() { return Util::finalizeAtomsInFile(movie); }

    /// The movie after a repair that gives true.
    std::string repaired(const std::string& contents) {
        writeFile(movie, contents);
        EXPECT_TRUE(repair());
        return contentsOf(movie);
    }

    /// What the repair gives for a movie that it must not write to.
    bool resultForUntouched(const std::string& contents) {
        writeFile(movie, contents);
        const bool result = repairWithoutWriting();
        EXPECT_EQ(contentsOf(movie), contents);
        return result;
    }

    bool repairWithoutWriting() {
        const auto longAgo = std::filesystem::file_time_type::clock::now() - std::chrono::hours(100);
        std::filesystem::last_write_time(movie, longAgo);
        const auto before = std::filesystem::last_write_time(movie);
        const bool result = repair();
        EXPECT_EQ(std::filesystem::last_write_time(movie), before) << "written to";
        return result;
    }

    /// For movies that are too large to be read as a whole.
    std::string bytesAt(std::uint64_t position, std::size_t count) const {
        std::ifstream stream(movie, std::ios_base::binary);
        stream.seekg(static_cast<std::streamoff>(position));
        std::string bytes(count, '\0');
        stream.read(bytes.data(), static_cast<std::streamsize>(count));
        EXPECT_TRUE(stream.good());
        return bytes;
    }

    TemporaryFolder folder;
    const std::string movie = folder / "Recording.mp4";
    const std::string openEnded = be32(0) + "mdat";
};

// Movies that need nothing ----------------------------------------------------------------------------------------

TEST_F(AtomRepair, LeavesAConsistentMovieAsItIs) {
    EXPECT_TRUE(resultForUntouched(media()));
    EXPECT_TRUE(resultForUntouched(media() + zulmAtom({locationStream()})));
    EXPECT_TRUE(resultForUntouched(atom("wide")));
    EXPECT_TRUE(resultForUntouched(extendedAtom("mdat")));
}

TEST_F(AtomRepair, TakesAnEmptyMovieForConsistent) {
    EXPECT_TRUE(resultForUntouched(""));
}

TEST_F(AtomRepair, LooksAtTopLevelAtomsOnly) {
    EXPECT_TRUE(resultForUntouched(atom("moov", openEnded)));
}

TEST_F(AtomRepair, TakesSizesFromTwoToSevenAsTheyStand) {
    for (std::uint32_t size = 4; size < 8; ++size)
        EXPECT_TRUE(resultForUntouched(be32(size) + std::string(size - 4, 'x') + atom("free"))) << size;
}

TEST_F(AtomRepair, TakesASizeOfTwoOrThreeAsItStands) {
    // Its own bytes, read on from there, are the size of the next atom.
    writeSparseFile(movie, 2 + 0x00020000, be32(2));
    EXPECT_TRUE(repairWithoutWriting());
    writeSparseFile(movie, 3 + 0x03000000, be32(3));
    EXPECT_TRUE(repairWithoutWriting());
}

TEST_F(AtomRepair, ReadsNoExtendedSizeBehindSizesFromTwoToSeven) {
    for (std::uint32_t size = 4; size < 8; ++size)
        EXPECT_FALSE(resultForUntouched(be32(size) + "free" + be64(24) + "12345678")) << size;
}

// Movies beyond repair -------------------------------------------------------------------------------------------

TEST_F(AtomRepair, RefusesAMovieWhoseAtomsOverrunItsEnd) {
    EXPECT_FALSE(resultForUntouched(media().substr(0, 29)));
    EXPECT_FALSE(resultForUntouched(media() + be32(9) + "free"));
    EXPECT_FALSE(resultForUntouched(media() + be32(0xffffffff) + "mdat"));
    EXPECT_FALSE(resultForUntouched(media() + extendedHeader("mdat", 17)));
    EXPECT_FALSE(resultForUntouched(media() + extendedHeader("mdat", std::uint64_t{1} << 62)));
}

TEST_F(AtomRepair, RefusesAMovieWhoseLastHeaderIsTorn) {
    for (std::size_t size = 1; size < 8; ++size)
        EXPECT_FALSE(resultForUntouched(media() + openEnded.substr(0, size))) << size;
    for (std::size_t size = 8; size < 16; ++size)
        EXPECT_FALSE(resultForUntouched(media() + extendedAtom("mdat").substr(0, size))) << size;
}

TEST_F(AtomRepair, RefusesEndsThatWrapAround) {
    for (std::uint64_t end = 0; end < 30; ++end)
        EXPECT_FALSE(resultForUntouched(media() + extendedHeader("mdat", minus(30 - end)) + "payload")) << end;
}

TEST_F(AtomRepair, RefusesEndsThatNoFilePositionCanHold) {
    for (const std::uint64_t size :
         {std::uint64_t{1} << 63, (std::uint64_t{1} << 63) - 1, (std::uint64_t{1} << 63) - 30, minus(1), minus(31)})
        EXPECT_FALSE(resultForUntouched(media() + extendedHeader("mdat", size))) << size;
}

TEST_F(AtomRepair, RefusesAMovieThatCannotBeOpened) {
    EXPECT_FALSE(Util::finalizeAtomsInFile(folder.path().string()));
    EXPECT_FALSE(Util::finalizeAtomsInFile(folder / "missing/movie.mp4"));
    EXPECT_FALSE(Util::finalizeAtomsInFile(""));
}

TEST_F(AtomRepair, MakesNoMovieThatIsNotThere) {
    EXPECT_FALSE(Util::finalizeAtomsInFile(folder / "missing.mp4"));
    EXPECT_FALSE(std::filesystem::exists(folder / "missing.mp4"));
}

// Open-ended atoms ------------------------------------------------------------------------------------------------

TEST_F(AtomRepair, GivesAnOpenEndedAtomItsSize) {
    EXPECT_EQ(repaired(hex("0000000c 66747970 6d703432  00000000 6d646174 01020304 05060708 090a")),
              hex("0000000c 66747970 6d703432  00000012 6d646174 01020304 05060708 090a"));
}

TEST_F(AtomRepair, GivesAnOpenEndedAtomOfAnyTypeItsSize) {
    EXPECT_EQ(repaired(be32(0) + "free" + "abc"), atom("free", "abc"));
    EXPECT_EQ(repaired(media() + be32(0) + std::string(4, '\0')), media() + be32(8) + std::string(4, '\0'));
}

TEST_F(AtomRepair, GivesAnOpenEndedAtomThatIsAllOfTheMovieItsSize) {
    EXPECT_EQ(repaired(openEnded), atom("mdat"));
}

TEST_F(AtomRepair, TakesEverythingBehindAnOpenEndedAtomForPartOfIt) {
    EXPECT_EQ(repaired(openEnded + zulmAtom({locationStream()})), atom("mdat", zulmAtom({locationStream()})));
}

TEST_F(AtomRepair, LeavesTheSpareBytesOfASmallMovieAlone) {
    EXPECT_EQ(repaired(atom("wide") + openEnded + "media"), atom("wide") + atom("mdat", "media"));
}

TEST_F(AtomRepair, RepairsTheSameOnceOrTwice) {
    for (const std::string& contents : {openEnded + "media", atom("wide") + openEnded, extendedHeader("ZULM", 0)}) {
        const std::string once = repaired(contents);
        EXPECT_TRUE(resultForUntouched(once));
    }
}

TEST_F(AtomRepair, FindsStreamsAppendedBehindARepairedAtom) {
    const std::string whole = repaired(openEnded + "media");
    writeFile(movie, whole + zulmAtom({locationStream()}));
    EXPECT_THAT(streamsOf(*MetaDataParser::create(movie)), Contains(FoundStream{kind(s_cursorLocations), 45, 56}));
}

// Large movies -------------------------------------------------------------------------------------------------

TEST_F(AtomRepair, GivesAnAtomOfOneByteLessThan4GiBAnOrdinarySize) {
    writeSparseFile(movie, 12 + s_4GiB - 1, atom("ftyp", "mp42") + openEnded, "end");
    EXPECT_TRUE(repair());
    EXPECT_EQ(bytesAt(0, 24), atom("ftyp", "mp42") + be32(0xffffffff) + "mdat" + be32(0));
    EXPECT_EQ(bytesAt(12 + s_4GiB - 4, 3), "end");
    EXPECT_TRUE(repairWithoutWriting());
}

TEST_F(AtomRepair, GivesAnAtomOfOneByteLessThan4GiBAnOrdinarySizeEvenBehindSpareBytes) {
    writeSparseFile(movie, 8 + s_4GiB - 1, atom("wide") + openEnded);
    EXPECT_TRUE(repair());
    EXPECT_EQ(bytesAt(0, 24), atom("wide") + be32(0xffffffff) + "mdat" + be64(0));
}

TEST_F(AtomRepair, NeedsSpareBytesFrom4GiBOn) {
    for (const std::uint64_t size : {s_4GiB, s_4GiB + 1, 5 * s_4GiB / 4}) {
        writeSparseFile(movie, 12 + size, atom("ftyp", "mp42") + openEnded);
        EXPECT_FALSE(repairWithoutWriting());
        EXPECT_EQ(bytesAt(0, 20), atom("ftyp", "mp42") + openEnded);
    }
}

TEST_F(AtomRepair, GivesAnAtomFrom4GiBOnTheLengthThatItHadWithoutTheSpareBytes) {
    for (const std::uint64_t size : {s_4GiB, s_4GiB + 1, 5 * s_4GiB / 4}) {
        writeSparseFile(movie, 20 + size, atom("ftyp", "mp42") + atom("wide") + openEnded + "media", "end");
        EXPECT_TRUE(repair());
        EXPECT_EQ(bytesAt(0, 33), atom("ftyp", "mp42") + be32(1) + "mdat" + be64(size) + "media");
        EXPECT_EQ(bytesAt(20 + size - 3, 3), "end");
        EXPECT_EQ(std::filesystem::file_size(movie), 20 + size);
    }
}

TEST_F(AtomRepair, UsesTheTypeOfTheOpenEndedAtom) {
    writeSparseFile(movie, 8 + s_4GiB, atom("wide") + be32(0) + "free");
    EXPECT_TRUE(repair());
    EXPECT_EQ(bytesAt(0, 16), extendedHeader("free", s_4GiB));
}

TEST_F(AtomRepair, UsesNoOtherAtomForSpareBytes) {
    for (const std::string& before : {atom("free"), atom("wide", "12345678"), extendedAtom("wide"), atom("WIDE"),
                                      atom("wide") + atom("skip"), atom("wide") + atom("free", "1")}) {
        writeSparseFile(movie, before.size() + s_4GiB, before + openEnded);
        EXPECT_FALSE(repairWithoutWriting());
        EXPECT_EQ(bytesAt(0, before.size() + 8), before + openEnded);
    }
}

TEST_F(AtomRepair, TakesTheLastMediaBytesForAnAtomOnceItGaveUpTheSpareBytes) {
    writeSparseFile(movie, 8 + s_4GiB, atom("wide") + openEnded, hex("00000000 01020304"));
    EXPECT_TRUE(repair());
    EXPECT_TRUE(repair());
    EXPECT_EQ(bytesAt(s_4GiB, 8), hex("00000008 01020304"));
    EXPECT_EQ(bytesAt(0, 16), extendedHeader("mdat", s_4GiB));
}

TEST_F(AtomRepair, RefusesTheLastMediaBytesForAnAtomOnceItGaveUpTheSpareBytes) {
    writeSparseFile(movie, 8 + s_4GiB, atom("wide") + openEnded, "lastlast");
    EXPECT_TRUE(repair());
    EXPECT_FALSE(repairWithoutWriting());
}

TEST_F(AtomRepair, WalksOverExtendedAtomsToAnOpenEndedOne) {
    writeSparseFile(movie, s_4GiB + 21, extendedHeader("mdat", s_4GiB + 8), be32(0) + "free" + "12345");
    EXPECT_TRUE(repair());
    EXPECT_EQ(bytesAt(s_4GiB + 8, 13), atom("free", "12345"));
}

TEST_F(AtomRepair, RepairsAnInterruptedAppendOfMoreThan32Bits) {
    writeSparseFile(movie, 30 + s_4GiB, media() + extendedHeader("ZULM", 0));
    EXPECT_TRUE(repair());
    EXPECT_EQ(bytesAt(0, 46), media() + extendedHeader("ZULM", s_4GiB));
}

// Interrupted appends ----------------------------------------------------------------------------------------------

TEST_F(AtomRepair, GivesAnInterruptedAppendItsSizeWhereverItEnded) {
    const std::string payload = extendedAtom("DATA", locationStream()) + extendedAtom("DATA", appNameStream());
    for (std::size_t size = 0; size <= payload.size(); ++size) {
        const std::string written = payload.substr(0, size);
        EXPECT_EQ(repaired(media() + extendedHeader("ZULM", 0) + written), media() + extendedAtom("ZULM", written));
    }
}

TEST_F(AtomRepair, CannotRepairAnAppendThatEndedInsideItsHeader) {
    for (std::size_t size = 1; size < 16; ++size)
        EXPECT_FALSE(resultForUntouched(media() + extendedHeader("ZULM", 0).substr(0, size))) << size;
}

TEST_F(AtomRepair, LetsTheNextAppendBeFoundBehindAnInterruptedOne) {
    const std::string unfinished = extendedHeader("ZULM", 0) + extendedAtom("DATA", locationStream());
    for (std::size_t size = 16; size <= unfinished.size(); ++size) {
        const std::string whole = repaired(media() + unfinished.substr(0, size));
        writeFile(movie, whole + zulmAtom({appNameStream()}));
        testing::internal::CaptureStderr(); // a torn child takes what follows it for the rest of its header
        const auto found = streamsOf(*MetaDataParser::create(movie));
        testing::internal::GetCapturedStderr();
        EXPECT_THAT(found, Contains(FoundStream{kind(s_appNames), 30 + size + 32, 56})) << size;
    }
}

TEST_F(AtomRepair, LetsTheStreamsOfAnInterruptedAppendBeFound) {
    repaired(media() + extendedHeader("ZULM", 0) + extendedAtom("DATA", locationStream()));
    EXPECT_THAT(streamsOf(*MetaDataParser::create(movie)), Contains(FoundStream{kind(s_cursorLocations), 62, 56}));
}

// Hostile sizes ----------------------------------------------------------------------------------------------------

TEST_F(AtomRepair, WritesForNoSizeThatLeadsPastItsHeader) {
    for (const std::uint64_t size : s_hostileSizes)
        if (size >= 16)
            resultForUntouched(media() + extendedHeader("mdat", size) + std::string(40, 'x'));
}

TEST_F(AtomRepair, EndsForEverySizeAndChangesOneSizeFieldAtMost) {
    for (const std::uint64_t size : s_hostileSizes)
        for (const std::string& header :
             {extendedHeader("mdat", size), be32(static_cast<std::uint32_t>(size)) + "mdat"}) {
            const std::string before = media() + header + zulmAtom({locationStream()});
            writeFile(movie, before);
            repair();
            const std::string after = contentsOf(movie);
            const auto [was, is] = std::mismatch(before.begin(), before.end(), after.begin(), after.end());
            // What is left is below 256 bytes: one byte.
            EXPECT_EQ(after.size(), before.size());
            EXPECT_TRUE(is == after.end() || std::equal(is + 1, after.end(), was + 1, before.end())) << size;
        }
}

// The scale factor of a movie ------------------------------------------------------------------------------------

class RecordingScale : public testing::Test {
protected:
    double scaleOf(const std::string& contents, const std::string& name = "Recording.mp4") {
        writeFile(folder / name, contents);
        return Util::recordingScaleForMP4AtPath(folder / name);
    }

    /// The bits tell numbers apart that are too small to be printed.
    std::uint64_t bitsOfScaleOf(const std::string& contents) { return std::bit_cast<std::uint64_t>(scaleOf(contents)); }

    TemporaryFolder folder;
    const std::string integerHeader = streamHeader(s_scaleFactors, 1, 12);
};

TEST_F(RecordingScale, IsTheOneInTheStream) {
    EXPECT_EQ(scaleOf(media() + zulmAtom({locationStream(), scaleStream(2.5)})), 2.5);
}

TEST_F(RecordingScale, IsTheLastOneInTheStream) {
    EXPECT_EQ(scaleOf(zulmAtom({scaleStream(2.0) + f64(1.0) + f64(3.0), locationStream()})), 3.0);
}

TEST_F(RecordingScale, IsReadFromEveryContainer) {
    EXPECT_EQ(scaleOf(zulmAtom({scaleStream(2.0)}), "a.MOV"), 2.0);
    EXPECT_EQ(scaleOf(riffMedia() + zulmChunk({scaleStream(2.0)}), "a.avi"), 2.0);
    EXPECT_EQ(scaleOf(scaleStream(2.0), "a.dat"), 2.0);
}

TEST_F(RecordingScale, IsOneWhereThereIsNone) {
    EXPECT_EQ(scaleOf(media()), 1.0);
    EXPECT_EQ(scaleOf(""), 1.0);
    EXPECT_EQ(scaleOf(media() + zulmAtom({locationStream()})), 1.0);
    EXPECT_EQ(scaleOf(media() + zulmAtom({scaleStream(2.0).substr(0, 24)})), 1.0);
    EXPECT_EQ(scaleOf(zulmAtom({scaleStream(2.0)}), "a.mkv"), 1.0);
}

TEST_F(RecordingScale, IsOneWhereTheMovieCannotBeOpened) {
    testing::internal::CaptureStderr();
    EXPECT_EQ(Util::recordingScaleForMP4AtPath(folder / "missing.mp4"), 1.0);
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              "Can't parse metadata. Unable to open file: " + folder / "missing.mp4" + "\n");
}

TEST_F(RecordingScale, IsOneWhereTheStreamIsOfANewerVersion) {
    testing::internal::CaptureStdout();
    EXPECT_EQ(scaleOf(zulmAtom({scaleStream(2.0).replace(16, 4, le32(2))})), 1.0);
    EXPECT_EQ(testing::internal::GetCapturedStdout(),
              "MetaDataReader<T>::parseFile - Version is larger than what we can handle\n");
}

TEST_F(RecordingScale, OfAnIntegerAtTheEndOfTheFileIsTheBitsOfThatInteger) {
    EXPECT_EQ(bitsOfScaleOf(zulmAtom({integerHeader + f64(0.0) + le32(2)})), 0x00000000'00000002u);
}

TEST_F(RecordingScale, OfAnIntegerTakesTheFourBytesBehindItForItsUpperHalf) {
    EXPECT_EQ(bitsOfScaleOf(zulmAtom({integerHeader + f64(0.0) + le32(2)}) + extendedAtom("ZULR")),
              0x01000000'00000002u);
}

TEST_F(RecordingScale, OfATornEntryIsAnError) {
    EXPECT_THAT([&] { scaleOf(zulmAtom({integerHeader + "torn"})); },
                ThrowsMessage<std::runtime_error>("invalid meta data entry"));
}

} // namespace

} // namespace ZULMetaData::Test
