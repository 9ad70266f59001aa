// What a repair would change in a movie, byte by byte.

#include "ZULMetaData/Containers/RepairPlan.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <map>
#include <sstream>
#include <string>

namespace ZULMetaData::Test {

namespace {

using testing::HasSubstr;

constexpr std::uint64_t s_4GiB = 0x100000000;

RepairPlan planFor(const std::string& movie) {
    return planRepair(ByteSource::memory(movie));
}

/// A movie of `size` bytes that begins and ends as told and is empty in between.
RepairPlan planForLarge(std::uint64_t size, const std::string& head, const std::string& tail = {}) {
    const TemporaryFolder folder;
    writeSparseFile(folder / "movie.mp4", size, head, tail);
    return planRepair(ByteSource::file(folder / "movie.mp4"));
}

std::string carriedOut(std::string movie, const RepairPlan& plan) {
    for (const RepairChange& change : plan.changes) {
        EXPECT_EQ(movie.substr(change.offset, change.before.size()), change.before);
        if (change.after.empty())
            EXPECT_EQ(change.offset + change.before.size(), movie.size());
        else
            EXPECT_EQ(change.after.size(), change.before.size());
        movie.replace(change.offset, change.before.size(), change.after);
    }
    return movie;
}

std::string repaired(const std::string& movie) {
    const RepairPlan plan = planFor(movie);
    EXPECT_EQ(plan.state, RepairPlan::Repairable) << plan.finding;
    return carriedOut(movie, plan);
}

void expectWhole(const RepairPlan& plan) {
    EXPECT_EQ(plan.state, RepairPlan::Whole) << plan.finding;
    EXPECT_TRUE(plan.changes.empty());
    EXPECT_EQ(plan.finding, "");
}

void expectUnrepairable(const RepairPlan& plan, std::uint64_t offset, const std::string& finding) {
    EXPECT_EQ(plan.state, RepairPlan::Unrepairable);
    EXPECT_TRUE(plan.changes.empty());
    EXPECT_EQ(plan.offset, offset);
    EXPECT_THAT(plan.finding, HasSubstr(finding));
}

void expectOneChangeWithLoss(const RepairPlan& plan, std::uint64_t offset, const std::string& before,
                             const std::string& after) {
    EXPECT_EQ(plan.state, RepairPlan::Repairable) << plan.finding;
    ASSERT_EQ(plan.changes.size(), 1U);
    EXPECT_EQ(plan.changes[0].offset, offset);
    EXPECT_EQ(plan.changes[0].before, before);
    EXPECT_EQ(plan.changes[0].after, after);
}

void expectOneChange(const RepairPlan& plan, std::uint64_t offset, const std::string& before,
                     const std::string& after) {
    expectOneChangeWithLoss(plan, offset, before, after);
    EXPECT_FALSE(plan.hasLoss);
    EXPECT_EQ(plan.loss, "");
}

std::string interrupted(const std::string& type, const std::string& payload) {
    return be32(1) + type + be64(0) + payload;
}

// Movies that need nothing ----------------------------------------------------------------------------------------

TEST(RepairPlan, LeavesAMovieWhoseAtomsFillIt) {
    expectWhole(planFor(media()));
    expectWhole(planFor(media() + zulmAtom({locationStream()}) + extendedAtom("ZULR", std::string(64, '\0'))));
    expectWhole(planFor(atom("wide")));
    expectWhole(planFor(""));
}

// An open end -----------------------------------------------------------------------------------------------------

TEST(RepairPlan, GivesAnOpenEndedAtomItsSize) {
    const RepairPlan plan = planFor(atom("ftyp", "mp42") + be32(0) + "mdat0123456789");
    expectOneChange(plan, 12, be32(0), be32(18));
    EXPECT_EQ(plan.finding, "the atom 'mdat' at offset 12 has an open end");
    EXPECT_EQ(plan.offset, 12U);
}

TEST(RepairPlan, SaysWhichAtomTakesTheSpareOneIn) {
    const RepairPlan plan = planForLarge(20 + s_4GiB, atom("ftyp", "mp42") + atom("wide") + be32(0) + "mdat");
    EXPECT_EQ(plan.finding, "the atom 'mdat' at offset 20 has an open end");
    EXPECT_EQ(plan.offset, 20U);
}

TEST(RepairPlan, KeepsThe32BitSizeUpToItsLastNumber) {
    expectOneChange(planForLarge(12 + std::uint64_t(0xffffffff), atom("ftyp", "mp42") + be32(0) + "mdat"), 12, be32(0),
                    be32(0xffffffff));
}

TEST(RepairPlan, TakesTheSpareAtomInAtFourGiBAndMore) {
    for (const std::uint64_t length : {s_4GiB, s_4GiB + 1, 5 * (s_4GiB / 4)})
        expectOneChange(planForLarge(20 + length, atom("ftyp", "mp42") + atom("wide") + be32(0) + "mdat"), 12,
                        atom("wide") + be32(0) + "mdat", be32(1) + "mdat" + be64(length + 8));
}

TEST(RepairPlan, CannotSizeAnOpenEndOfFourGiBWithoutTheSpareAtomDirectlyInFront) {
    for (const std::string& front : {atom("ftyp", "mp42"), atom("wide", "more"), atom("wide") + atom("free")})
        expectUnrepairable(planForLarge(front.size() + s_4GiB, front + be32(0) + "mdat"), front.size(),
                           "has an open end, and its 4294967296 bytes do not fit in a 32-bit size");
}

// Eight bytes short -----------------------------------------------------------------------------------------------

/// What `Util::finalizeAtomsInFile` makes of a movie of 4 GiB and more, then `behind`.
RepairPlan planForShortMovie(const std::string& lastBytes, const std::string& behind = {}) {
    const std::string head = atom("ftyp", "mp42") + be32(1) + "mdat" + be64(s_4GiB);
    return planForLarge(12 + s_4GiB + 8 + behind.size(), head, lastBytes + behind);
}

TEST(RepairPlan, TakesInTheEightBytesThatARepairLeftOver) {
    for (const std::string& last : {hex("0000000000000000"), hex("0001020304050607"), hex("ffffffffffffffff")}) {
        const RepairPlan plan = planForShortMovie(last);
        expectOneChange(plan, 20, be64(s_4GiB), be64(s_4GiB + 8));
        EXPECT_EQ(plan.finding, "the atom 'mdat' at offset 12 was given a length that leaves out its last 8 bytes");
    }
}

TEST(RepairPlan, TakesThemInWhereSomethingWasAppendedBehindThem) {
    const std::string stamp = extendedAtom("ZULR", std::string(64, '\0'));
    for (const std::string& last : {hex("0000000000000000"), std::string("\0\0\0\x64moov", 8), std::string("textmdat")})
        for (const std::string& behind :
             {zulmAtom({locationStream()}), zulmAtom({}), stamp, stamp + zulmAtom({locationStream()})})
            expectOneChange(planForShortMovie(last, behind), 20, be64(s_4GiB), be64(s_4GiB + 8));
}

TEST(RepairPlan, GoesOnToAnInterruptedAppendBehindThem) {
    const RepairPlan plan =
        planForShortMovie(hex("0000000000000000"), interrupted("ZULM", extendedAtom("DATA", locationStream())));
    ASSERT_EQ(plan.changes.size(), 2U);
    EXPECT_EQ(plan.changes[0].after, be64(s_4GiB + 8));
    EXPECT_EQ(plan.changes[1].offset, 12 + s_4GiB + 8 + 8);
    EXPECT_EQ(plan.changes[1].after, be64(16 + 16 + 56));
}

TEST(RepairPlan, CannotMendAMovieWhoseAtomBehindThemReachesBeyondTheEnd) {
    const std::string stamp = extendedAtom("ZULR", std::string(64, '\0'));
    expectUnrepairable(planForShortMovie(hex("ffffffffffffffff"), stamp + be32(100) + "moov"),
                       12 + s_4GiB + 8 + stamp.size(), "but the file ends after 8");
}

TEST(RepairPlan, LeavesEightBytesThatAreAnAtom) {
    expectWhole(planForShortMovie(atom("free")));
    expectWhole(planForShortMovie(atom("free"), zulmAtom({locationStream()})));
}

TEST(RepairPlan, LeavesEightBytesThatMayBeTheHeaderOfAnAtomThatWasCutShort) {
    expectUnrepairable(planForShortMovie(be32(5000000) + "moov"), 12 + s_4GiB, "but the file ends after 8");
}

TEST(RepairPlan, KnowsAnAtomByATypeOfLettersDigitsSpacesAndTheCopyrightSign) {
    for (const char* type : {"moov", "azAZ", "mp09", "URL ", "\xa9nam"})
        expectUnrepairable(planForShortMovie(be32(5000000) + type), 12 + s_4GiB, "but the file ends after 8");
    for (const char* other : {"moo`", "moo{", "moo@", "moo[", "moo/", "moo:"})
        EXPECT_EQ(planForShortMovie(be32(5000000) + other).changes.size(), 1U) << other;
}

TEST(RepairPlan, TakesNothingForAppendedThatThisLibraryDoesNotAppend) {
    const std::string last = hex("ffffffffffffffff");
    for (const std::string& behind : {atom("free"), atom("ZULM", locationStream()), extendedAtom("mdat"),
                                      be32(1) + "ZULM" + be64(15), be32(1) + "ZULM" + be64(17), be32(1) + "ZULM"})
        expectUnrepairable(planForShortMovie(last, behind), 12 + s_4GiB, "without a readable type");
}

TEST(RepairPlan, LeavesWhatIsNeitherShortNorAppended) {
    expectUnrepairable(planForShortMovie(hex("ffffffffffffffff"), "junk and more junk"), 12 + s_4GiB,
                       "without a readable type");
    const std::string small = atom("ftyp", "mp42") + extendedAtom("mdat", "media") + hex("ffffffffffffffff");
    expectUnrepairable(planFor(small), 12 + 21, "without a readable type");
}

TEST(RepairPlan, TakesNoAtomForShortWhoseLengthFitsIn32Bits) {
    const std::string head = be32(1) + "mdat" + be64(s_4GiB - 1);
    expectUnrepairable(planForLarge(s_4GiB - 1 + 8, head, hex("ffffffffffffffff")), s_4GiB - 1,
                       "without a readable type");
}

// An append that was interrupted ----------------------------------------------------------------------------------

TEST(RepairPlan, GivesAnInterruptedAtomItsSize) {
    expectOneChange(planFor(media() + interrupted("mdat", "0123")), 30 + 8, be64(0), be64(20));
    const RepairPlan plan = planFor(media() + interrupted("ZULR", "0123"));
    expectOneChange(plan, 30 + 8, be64(0), be64(20));
    EXPECT_EQ(plan.finding, "the atom 'ZULR' at offset 30 was appended, but never given its size");
}

TEST(RepairPlan, KeepsEveryStreamOfAnInterruptedAppendThatIsWhole) {
    const std::string children = extendedAtom("DATA", locationStream()) + extendedAtom("DATA", appNameStream());
    expectOneChange(planFor(media() + interrupted("ZULM", children)), 30 + 8, be64(0), be64(16 + 72 + 72));
    expectOneChange(planFor(media() + interrupted("ZULM", "")), 30 + 8, be64(0), be64(16));
    const std::string empty = extendedAtom("DATA", locationStream().substr(0, 24));
    expectOneChange(planFor(media() + interrupted("ZULM", empty + children)), 30 + 8, be64(0), be64(16 + 40 + 72 + 72));
}

TEST(RepairPlan, SetsTheBytesOfATornEntryAside) {
    const std::string torn = be32(1) + "DATA" + be64(72) + locationStream().substr(0, 24 + 16 + 11);
    const std::string movie = media() + interrupted("ZULM", torn);
    const RepairPlan plan = planFor(movie);
    EXPECT_TRUE(plan.hasLoss);
    const std::string leftOver = be32(11) + "free" + pointEntry(1.0, -3, 7).substr(8, 3);
    EXPECT_EQ(carriedOut(movie, plan), media() + zulmAtom({locationStream().substr(0, 40)}) + leftOver);
}

TEST(RepairPlan, CutsOffTornBytesThatAreTooFewForAnAtom) {
    const std::string torn = be32(1) + "DATA" + be64(72) + locationStream().substr(0, 24 + 16 + 7);
    EXPECT_EQ(repaired(media() + interrupted("ZULM", torn)), media() + zulmAtom({locationStream().substr(0, 40)}));
}

TEST(RepairPlan, ChangesNothingButOneSizeWhereStreamsCannotBeFollowed) {
    // The first stream's size counts a torn tail that is not there, as the plain append writes it.
    for (const std::uint64_t size : {72U + 5, 72U + 500}) {
        const std::string children =
            be32(1) + "DATA" + be64(size) + appNameStream() + extendedAtom("DATA", locationStream());
        const RepairPlan plan = planFor(media() + interrupted("ZULM", children));
        ASSERT_EQ(plan.changes.size(), 1U) << size;
        EXPECT_EQ(plan.changes[0].after, be64(16 + 72 + 72));
        EXPECT_TRUE(plan.hasLoss);
    }
}

TEST(RepairPlan, KeepsBytesThatAreNoStreamInAnInterruptedAppend) {
    const std::string header = be32(1) + "DATA";
    for (const std::string& child :
         {extendedAtom("free", locationStream()), atom("DATA", locationStream()), header + be64(39) + locationStream(),
          header + be64(0xfffffffffffffff0) + locationStream()}) {
        const RepairPlan plan = planFor(media() + interrupted("ZULM", child));
        ASSERT_EQ(plan.changes.size(), 1U) << child;
        EXPECT_EQ(plan.changes[0].after, be64(16 + child.size()));
        EXPECT_TRUE(plan.hasLoss);
    }
}

/// Every stream found in the movie holds only what was written, in whole entries, and another one that is appended
/// is found too.
void expectSound(const std::string& movie, const std::map<uuid, std::string>& written) {
    expectWhole(planFor(movie));
    ASSERT_TRUE(movie.starts_with(media()));
    std::istringstream stream(movie + zulmAtom({scaleStream(2.0)}));
    const auto parser = MetaDataParser::create(stream, MetaDataParser::QuickTime);
    std::map<uuid, std::string> found;
    parser->loadAllData(found);
    ASSERT_EQ(found.erase(kind(s_scaleFactors)), 1U);
    for (const auto& [type, bytes] : found) {
        ASSERT_TRUE(written.contains(type));
        EXPECT_TRUE(written.at(type).starts_with(bytes));
        EXPECT_EQ(measureStream(ByteSource::memory(bytes))->wholeBytes, bytes.size());
    }
}

TEST(RepairPlan, MendsAnAppendThatWasInterruptedAtAnyByte) {
    const std::string children = extendedAtom("DATA", locationStream()) + extendedAtom("DATA", appNameStream());
    const std::string movie = media() + interrupted("ZULM", children);
    const std::map<uuid, std::string> written{{kind(s_cursorLocations), locationStream()},
                                              {kind(s_appNames), appNameStream()}};
    for (std::size_t length = media().size() + 16; length <= movie.size(); ++length) {
        SCOPED_TRACE(length);
        expectSound(repaired(movie.substr(0, length)), written);
    }
}

TEST(RepairPlan, CutsOffTheHeaderOfAnAppendThatIsCutShort) {
    for (const char* type : {"ZULM", "ZULR"}) {
        const std::string movie = media() + interrupted(type, "");
        for (std::size_t length = 31; length < 46; ++length) {
            const RepairPlan plan = planFor(movie.substr(0, length));
            EXPECT_EQ(plan.state, RepairPlan::Repairable) << length;
            EXPECT_THAT(plan.finding, testing::HasSubstr("begin an atom that was never appended"));
            EXPECT_FALSE(plan.hasLoss);
            EXPECT_EQ(repaired(movie.substr(0, length)), media());
        }
    }
}

TEST(RepairPlan, TakesNothingForAnAppendThatNoMovieIsInFrontOf) {
    for (const char* type : {"ZULM", "ZULR"})
        expectUnrepairable(planFor(be32(1) + type), 0, "do not hold an atom's header");
}

TEST(RepairPlan, CannotMendAnotherHeaderThatIsCutShort) {
    const std::string movie = media() + interrupted("ZULX", "");
    for (std::size_t length = 38; length < 46; ++length)
        expectUnrepairable(planFor(movie.substr(0, length)), 30, "do not hold an atom's header");
    expectUnrepairable(planFor(media() + "x"), 30, "the last 1 byte, from offset 30 on, do not hold an atom's header");
}

// Metadata at the end that is torn --------------------------------------------------------------------------------

TEST(RepairPlan, ClosesMetadataThatIsCutShortAtAnyByte) {
    const std::string stamp = extendedAtom("ZULR", std::string(64, 's'));
    const std::string metadata = zulmAtom({locationStream(), appNameStream()});
    const std::map<uuid, std::string> written{{kind(s_cursorLocations), locationStream()},
                                              {kind(s_appNames), appNameStream()}};
    for (const std::string& tail : {metadata, metadata + stamp, stamp + metadata, stamp})
        for (std::size_t length = media().size() + 1; length < media().size() + tail.size(); ++length) {
            SCOPED_TRACE(length);
            const std::string movie = (media() + tail).substr(0, length);
            if (planFor(movie).state != RepairPlan::Whole) // between two atoms
                expectSound(repaired(movie), written);
        }
}

TEST(RepairPlan, KeepsEveryWholeEntryOfMetadataThatLacksItsLastByte) {
    const std::string movie = media() + zulmAtom({appNameStream(), locationStream()});
    const RepairPlan plan = planFor(movie.substr(0, movie.size() - 1));
    EXPECT_TRUE(plan.hasLoss);
    EXPECT_EQ(plan.finding, "the atom 'ZULM' at offset 30 declares 160 bytes, but the file ends after 159");
    EXPECT_EQ(plan.loss, "the stream of the kind cursorLocation ends after 1 entry");
    EXPECT_EQ(carriedOut(movie.substr(0, movie.size() - 1), plan),
              media() + zulmAtom({appNameStream(), locationStream().substr(0, 40)}) + be32(15) + "free" +
                  pointEntry(1.0, -3, 7).substr(8, 7));
}

TEST(RepairPlan, SetsRecordingInfoThatIsCutShortAside) {
    const std::string whole = media() + zulmAtom({locationStream()});
    const std::string movie = whole + extendedAtom("ZULR", std::string(64, 's'));
    const RepairPlan plan = planFor(movie.substr(0, movie.size() - 1));
    EXPECT_TRUE(plan.hasLoss);
    EXPECT_EQ(plan.loss, "the name and the versions in it are incomplete and are dropped");
    EXPECT_TRUE(repaired(movie.substr(0, movie.size() - 1)).starts_with(whole + be32(79) + "free"));
}

TEST(RepairPlan, SaysWhereAllButAHeaderIsMissing) {
    const RepairPlan plan = planFor(media() + be32(1) + "ZULM" + be32(7));
    expectOneChangeWithLoss(plan, 30, be32(1) + "ZULM" + be32(7), "");
    EXPECT_EQ(plan.loss, "all of the atom but the beginning of its header is missing");
}

TEST(RepairPlan, SetsStrayBytesBehindItsOwnAtomsAside) {
    const std::string stamp = extendedAtom("ZULR", std::string(64, '\0'));
    for (const std::string& tail : {zulmAtom({locationStream()}), stamp})
        for (const std::string& stray : {std::string("\n"), std::string("1234567"), std::string(7, '\0')}) {
            const RepairPlan plan = planFor(media() + tail + stray);
            expectOneChange(plan, 30 + tail.size(), stray, "");
            EXPECT_THAT(plan.finding, HasSubstr("belong to no atom"));
        }
    for (const std::string& stray : {std::string("some text"), std::string(9, '\0'), std::string(300, '\n')}) {
        const auto count = static_cast<std::uint32_t>(stray.size());
        expectOneChange(planFor(media() + stamp + stray), 110, stray.substr(0, 8), be32(count) + "free");
    }
    const std::string torn = be32(100) + "mfra" + "index";
    expectOneChange(planFor(media() + stamp + torn), 110, torn.substr(0, 8), be32(13) + "free");
}

TEST(RepairPlan, LeavesMediaThatIsCutShortBehindItsOwnAtoms) {
    const std::string stamp = extendedAtom("ZULR", std::string(64, '\0'));
    for (const char* type : {"moov", "mdat", "moof"})
        expectUnrepairable(planFor(media() + stamp + be32(100) + type + "cut"), 110, "but the file ends after 11");
}

// No movies -------------------------------------------------------------------------------------------------------

TEST(RepairPlan, TakesZerosForNoMovie) {
    expectUnrepairable(planFor(std::string(5000, '\0')), 0, "the file does not begin like a movie");
    expectOneChange(planFor(media() + std::string(5000, '\0')), 30, std::string(8, '\0'), be32(5000) + "free");
}

TEST(RepairPlan, NamesAnAtomByItsTypeWhereThatIsReadable) {
    expectUnrepairable(planFor(media() + be32(100) + "a b~"), 30, "the atom 'a b~' at offset 30");
    expectUnrepairable(planFor(media() + be32(100) + "a\x1f" + "bc"), 30,
                       "the atom without a readable type at offset 30");
    expectUnrepairable(planFor(media() + be32(100) + "a\x7f" + "bc"), 30,
                       "the atom without a readable type at offset 30");
}

// Movies that are broken ------------------------------------------------------------------------------------------

TEST(RepairPlan, CannotMendAnAtomThatReachesBeyondTheEnd) {
    expectUnrepairable(planFor(media() + be32(100) + "free"), 30,
                       "the atom 'free' at offset 30 declares 100 bytes, but the file ends after 8");
    expectUnrepairable(planFor(media() + be32(1) + "free" + be64(0xffffffffffffffff)), 30,
                       "but the file ends after 16");
}

TEST(RepairPlan, CannotMendAnAtomSmallerThanItsHeader) {
    for (std::uint32_t size = 2; size < 8; ++size)
        expectUnrepairable(planFor(media() + be32(size) + "free" + std::string(30, '\0')), 30,
                           "which its own header does not fit in");
    for (std::uint64_t size = 1; size < 16; ++size)
        expectUnrepairable(planFor(media() + be32(1) + "free" + be64(size)), 30,
                           "which its own header does not fit in");
}

TEST(RepairPlan, AlwaysComesToAnEnd) {
    for (const std::uint64_t size : s_hostileSizes)
        for (const std::string type : {"free", "ZULM", "ZULR", "mdat"}) {
            const std::string hostile = be32(1) + type + be64(size) + extendedAtom("DATA", locationStream());
            for (const std::string& movie : {hostile, media() + hostile, hostile + be32(0) + "mdat"}) {
                const RepairPlan plan = planFor(movie);
                if (plan.state == RepairPlan::Repairable)
                    expectWhole(planFor(carriedOut(movie, plan)));
            }
        }
    for (const std::uint64_t size : s_hostileSizes) {
        const std::string movie = media() + interrupted("ZULM", be32(1) + "DATA" + be64(size) + locationStream());
        expectWhole(planFor(repaired(movie)));
    }
}

TEST(RepairPlan, TouchesNothingAfterMetadataWithAWrongSize) {
    const std::string streams = extendedAtom("DATA", locationStream()) + extendedAtom("DATA", appNameStream());
    for (const auto missing : std::initializer_list<std::uint64_t>{1, 3, 8, 20, 60}) {
        const std::string metaData = be32(1) + "ZULM" + be64(16 + streams.size() - missing) + streams;
        const RepairPlan plan = planFor(media() + metaData);
        EXPECT_EQ(plan.state, RepairPlan::Unrepairable) << missing;
        EXPECT_TRUE(plan.changes.empty()) << missing;
    }
}

TEST(RepairPlan, HidesNoMetadataWhoseSizeIsLessThanItsHeader) {
    const std::string streams = extendedAtom("DATA", locationStream());
    const std::string movie = media() + extendedAtom("ZULM", streams) + be32(1) + "ZULM" + be64(5) + streams;
    EXPECT_EQ(planFor(movie).state, RepairPlan::Unrepairable);
}

} // namespace

} // namespace ZULMetaData::Test
