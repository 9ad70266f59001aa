#include "Tests/ZULMetaDataSession/EditListTexts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

std::vector<std::string> piecesOfConcat(const std::string& text, const EditListOptions& options = {}) {
    return piecesOf("ffconcat version 1.0\n" + text, "a.ffconcat", options);
}

TEST(Concat, PlaysFromTheInPointToTheOutPoint) {
    EXPECT_THAT(piecesOfConcat("file a.mp4\ninpoint 10\noutpoint 20.5\nfile a.mp4\noutpoint 0:01:02.25\n"),
                ElementsAre("10-41/2@1=21/2", "0-249/4@1=249/4"));
}

TEST(Concat, PlaysAsLongAsTheDurationSays) {
    EXPECT_THAT(piecesOfConcat("file a.mp4\ninpoint 10\nduration 2\n"), ElementsAre("10-12@1=2"));
    EXPECT_THAT(piecesOfConcat("file a.mp4\nduration 2.5\n"), ElementsAre("0-5/2@1=5/2"));
    EXPECT_THAT(piecesOfConcat("file a.mp4\ninpoint 1\noutpoint 3\nduration 2\n"), ElementsAre("1-3@1=2"));
    EXPECT_THAT(
        piecesOfConcat("file a.mp4\ninpoint 1\noutpoint 3\nduration 5\n"),
        ElementsAre("a.ffconcat: line 2: the duration is not the time from the in point to the out point, so the "
                    "last frame stays or files overlap, which an edit list cannot say"));
}

TEST(Concat, PlaysToTheEndOfARecordingOfKnownDuration) {
    EXPECT_THAT(piecesOfConcat("file a.mp4\ninpoint 10\n", ofDuration({61, 3})), ElementsAre("10-61/3@1=31/3"));
    EXPECT_THAT(
        piecesOfConcat("file a.mp4\n"),
        ElementsAre(
            "a.ffconcat: line 2: the file is played to its end, and the duration of the recording is not known"));
}

TEST(Concat, ReadsTimesWithUnits) {
    EXPECT_THAT(piecesOfConcat("file a.mp4\ninpoint 500ms\noutpoint 2000000us\n"), ElementsAre("1/2-2@1=3/2"));
    EXPECT_THAT(piecesOfConcat("file a.mp4\ninpoint 1.5s\noutpoint 2.\n"), ElementsAre("3/2-2@1=1/2"));
    for (const char* time : {"", "x", "1e3", "-1", "1/2", ".5", "0:70", "1:30s", "'1'"})
        EXPECT_THAT(
            piecesOfConcat("file a.mp4\ninpoint " + std::string(time) + "\n"),
            ElementsAre("a.ffconcat: line 3: \"" + std::string(time) + "\" is no time such as 12.5, 1:30.5 or 500ms"));
}

TEST(Concat, KnowsTheFileByItsNameWithoutQuotationMarks) {
    EXPECT_THAT(piecesOfConcat("file 'a b.mp4'\noutpoint 1\n"
                               "file a\\ b.mp4\noutpoint 2\n"
                               "file a' 'b.'m'p4 # the same\noutpoint 3\n"),
                ElementsAre("0-1@1=1", "0-2@1=2", "0-3@1=3"));
    EXPECT_THAT(piecesOfConcat("file 'it'\\''s.mp4'\noutpoint 1\nfile it\\'s.mp4\noutpoint 1"),
                ElementsAre("0-1@1=1", "0-1@1=1"));
    EXPECT_THAT(piecesOfConcat("file 'a.mp4\noutpoint 1"),
                ElementsAre("a.ffconcat: line 2: a quotation mark has no second one"));
    EXPECT_THAT(piecesOfConcat("file a b.mp4\noutpoint 1"),
                ElementsAre("a.ffconcat: line 2: something follows: \"b.mp4\""));
    EXPECT_THAT(piecesOfConcat("file\noutpoint 1"), ElementsAre("a.ffconcat: line 2: the name of the file is missing"));
}

TEST(Concat, HasOneSource) {
    EXPECT_THAT(
        piecesOfConcat("file a.mp4\noutpoint 1\nfile b.mp4\noutpoint 1\n"),
        ElementsAre("a.ffconcat: line 4: the source is \"b.mp4\", but that of an earlier piece is \"a.mp4\"; an "
                    "edit list has one recording as its source"));
}

TEST(Concat, PassesOverCommentsAndOtherDirectives) {
    EXPECT_THAT(
        piecesOfConcat("\n  # a comment\r\n  stream\r\n file a.mp4 \r\n\tfile_packet_meta k v\r\n outpoint 1\r\n"),
        ElementsAre("0-1@1=1"));
    EXPECT_THAT(piecesOfConcat("file a.mp4\noption seek 1\noutpoint 1\n"),
                ElementsAre("a.ffconcat: line 3: \"option\" is no directive that an edit list can follow"));
    EXPECT_THAT(piecesOfConcat("file a.mp4\nspeed 2\noutpoint 1\n"),
                ElementsAre("a.ffconcat: line 3: \"speed\" is no directive that an edit list can follow"));
}

TEST(Concat, RefusesDirectivesInTheWrongPlace) {
    EXPECT_THAT(piecesOfConcat("inpoint 1\nfile a.mp4\n"),
                ElementsAre("a.ffconcat: line 2: it stands before the first file"));
    EXPECT_THAT(piecesOfConcat("file a.mp4\ninpoint 1\ninpoint 2\n"),
                ElementsAre("a.ffconcat: line 4: a second inpoint of one file"));
    EXPECT_THAT(piecesOf("ffconcat version 2.0\n", "a.ffconcat"),
                ElementsAre("a.ffconcat: line 1: the list is not of version 1.0"));
}

TEST(Concat, NamesTheLineOfAnImpossiblePiece) {
    EXPECT_THAT(piecesOfConcat("file a.mp4\noutpoint 1\n\nfile a.mp4\ninpoint 2\noutpoint 1\n"),
                ElementsAre("a.ffconcat: line 5: end is 1, which is not after start, 2"));
}

TEST(Concat, MayBeEmptyOrWithoutItsFirstLine) {
    EXPECT_THAT(piecesOfConcat(""), IsEmpty());
    EXPECT_THAT(piecesOf("# mine\nfile a.mp4\noutpoint 1\n", "list.txt"), ElementsAre("0-1@1=1"));
}

} // namespace
} // namespace ZULMetaData::Test
