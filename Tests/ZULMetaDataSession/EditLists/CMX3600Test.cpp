#include "Tests/ZULMetaDataSession/EditListTexts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

std::vector<std::string> piecesOfEvents(const std::string& events, const Rational& frameRate = 25) {
    return piecesOf("TITLE: A TALK\n" + events, "a.edl", atFrameRate(frameRate));
}

TEST(CMX3600, PlaysItsEvents) {
    EXPECT_THAT(piecesOfEvents("FCM: NON-DROP FRAME\n\n"
                               "001  AX       V     C        00:00:10:00 00:00:20:05 01:00:00:00 01:00:10:05  \n"
                               "* FROM CLIP NAME: Recording.mp4\n"
                               "* COMMENT: anything\n"
                               "002  AX       AA/V  C        00:01:00:00 00:01:01:00 01:00:10:05 01:00:11:05\r\n"
                               "* FROM CLIP NAME: Recording.mp4\r\n"
                               "003  AX       A     C        00:09:00:00 00:09:09:00 01:00:00:00 01:00:09:00\n"
                               "004  AX       B     C        00:00:00:01 00:00:01:01 01:00:11:05 01:00:12:05\n"
                               "* FROM CLIP NAME: Recording.mp4\n"
                               ">>> SOURCE AX\n"),
                ElementsAre("10-101/5@1=51/5", "60-61@1=1", "1/25-26/25@1=1"));
}

TEST(CMX3600, PlaysEventsInTheOrderOfTheEditedMovie) {
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:10:00 00:00:20:00 01:00:10:00 01:00:20:00\n"
                               "002 A V C 00:00:50:00 00:01:00:00 01:00:00:00 01:00:10:00\n"),
                ElementsAre("50-60@1=10", "10-20@1=10"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:10:00 00:00:20:00 01:00:00:00 01:00:10:00\n"
                               "002 A V C 00:00:50:00 00:01:00:00 01:00:10:01 01:00:20:01\n"),
                ElementsAre("a.edl: line 3: the event does not begin where the event before it ends; an edit list has "
                            "neither gaps nor layers"));
}

TEST(CMX3600, NeedsAFrameRate) {
    const std::string event = "001 A V C 00:00:10:00 00:00:20:00 01:00:00:00 01:00:10:00\n";
    EXPECT_THAT(piecesOf(event, "a.edl"),
                ElementsAre("a.edl: an edit decision list counts frames; name its frame rate"));
    EXPECT_THAT(piecesOfEvents("FCM: NON-DROP FRAME\n" + event, {24000, 1001}),
                ElementsAre("1001/100-1001/50@1=1001/100"));
    for (const Rational& rate : {Rational(25, 2), Rational(0), Rational(-25), Rational(101), Rational(299, 10)})
        EXPECT_THAT(piecesOfEvents(event, rate),
                    ElementsAre("a.edl: time codes cannot count " + rate.text() + " frames for each second"));
}

TEST(CMX3600, CountsDropFrames) {
    const std::string drop = "FCM: DROP FRAME\n";
    const Rational rate(30000, 1001);
    // 00:01:00;02 is the frame after 00:00:59;29, which is frame 1,799. 00:10:00;00 is frame 17,982.
    EXPECT_THAT(piecesOfEvents(drop + "001 A V C 00:00:59:29 00:01:00:02 00:00:00:00 00:00:00:01\n", rate),
                ElementsAre("1800799/30000-3003/50@1=1001/30000"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:10:00;00 01:00:00;00 00:10:00;00 01:00:00;00\n", rate),
                ElementsAre("2999997/5000-8999991/2500@1=2999997/1000"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:59;59 00:01:00;04 00:00:00;00 00:00:00;01\n", {60000, 1001}),
                ElementsAre("3602599/60000-3003/50@1=1001/60000"));
    EXPECT_THAT(piecesOfEvents(drop + "001 A V C 00:01:00:00 00:02:00:02 00:00:00:00 00:01:00:02\n", rate),
                ElementsAre("a.edl: line 3: no frame has the time code 00:01:00:00"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:01:00 00:00:02:00 00:00:00:00 00:00:01:00\n", rate),
                ElementsAre(HasSubstr("the list does not say whether it counts drop frames")));
    EXPECT_THAT(
        piecesOfEvents("FCM: NON-DROP FRAME\n001 A V C 00:00:01:00 00:00:02:00 00:00:00:00 00:00:01:00\n", rate),
        ElementsAre("1001/1000-1001/500@1=1001/1000"));
    EXPECT_THAT(
        piecesOfEvents("FCM: NON-DROP FRAME\n001 A V C 00:00:01;00 00:00:02;00 00:00:00;00 00:00:01;00\n", rate),
        ElementsAre("a.edl: line 3: the time code 00:00:01;00 counts drop frames, and the list says that it does "
                    "not"));
    for (const Rational& other : {Rational(25), Rational(30), Rational(24000, 1001)})
        EXPECT_THAT(piecesOfEvents(drop + "001 A V C 00:00:01:00 00:00:02:00 00:00:00:00 00:00:01:00\n", other),
                    ElementsAre("a.edl: line 3: drop-frame time codes need a frame rate of 30000/1001 or 60000/1001"));
    EXPECT_THAT(piecesOfEvents("FCM: MAYBE\n"),
                ElementsAre("a.edl: line 2: \"MAYBE\" is neither DROP FRAME nor NON-DROP FRAME"));
}

TEST(CMX3600, ChangesTheSpeedByItsMotion) {
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:10:00 00:00:20:00 01:00:00:00 01:00:05:00\n"
                               "M2   A             050.0                00:00:10:00\n"),
                ElementsAre("10-20@2=5"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:10:00 00:00:15:00 01:00:00:00 01:00:05:00\n"
                               "M2 A 012.5 00:00:10:00\n"),
                ElementsAre("10-25/2@1/2=5"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:10:00 00:00:15:00 01:00:00:00 01:00:05:00\n"
                               "M2 A 000.0 00:00:10:00\n"),
                ElementsAre("10+5"));
    // 33 frames at a speed of 3/2 are 49.5 frames.
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:00:00 00:00:01:24 01:00:00:00 01:00:01:08\nM2 A 037.5 00:00:00:00\n"),
                ElementsAre("0-99/50@3/2=33/25"));
}

TEST(CMX3600, TakesTheSpeedFromTheLengthsIfTheRateIsNoWholeNumber) {
    const Rational rate(30000, 1001);
    const std::string code = "FCM: NON-DROP FRAME\n";
    EXPECT_THAT(piecesOfEvents(
                    code + "001 A V C 00:00:10:00 00:00:20:00 01:00:00:00 01:00:05:00\nM2 A 059.9 00:00:10:00\n", rate),
                ElementsAre("1001/100-1001/50@2=1001/200"));
    EXPECT_THAT(piecesOfEvents(
                    code + "001 A V C 00:00:10:00 00:00:20:00 01:00:00:00 01:00:10:00\nM2 A 029.9 00:00:10:00\n", rate),
                ElementsAre("1001/100-1001/50@1=1001/100"));
    EXPECT_THAT(piecesOfEvents(
                    code + "001 A V C 00:00:10:00 00:00:20:00 01:00:00:00 01:00:10:00\nM2 A 059.9 00:00:10:00\n", rate),
                ElementsAre("a.edl: line 3: the motion does not say how the length in the source becomes that in the "
                            "edited movie"));
}

TEST(CMX3600, RefusesMotionThatContradictsTheEvent) {
    EXPECT_THAT(
        piecesOfEvents("001 A V C 00:00:10:00 00:00:20:00 01:00:00:00 01:00:05:00\n"),
        ElementsAre("a.edl: line 2: the event has another length in the source than in the edited movie, and no "
                    "motion"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:10:00 00:00:20:00 01:00:00:00 01:00:05:00\nM2 A 075.0 00:00:10:00\n"),
                ElementsAre("a.edl: line 2: the motion does not say how the length in the source becomes that in the "
                            "edited movie"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:10:00 00:00:15:00 01:00:00:00 01:00:05:00\nM2 A -025.0 00:00:10:00\n"),
                ElementsAre("a.edl: line 3: it runs backwards, which an edit list cannot say"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:10:00 00:00:15:00 01:00:00:00 01:00:05:00\nM2 B 050.0 00:00:10:00\n"),
                ElementsAre("a.edl: line 3: the motion does not belong to the event before it"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:10:00 00:00:15:00 01:00:00:00 01:00:05:00\nM2 A fast 00:00:10:00\n"),
                ElementsAre("a.edl: line 3: \"fast\" is no number of frames for each second"));
    EXPECT_THAT(piecesOfEvents("001 A A C 00:00:10:00 00:00:15:00 01:00:00:00 01:00:05:00\nM2 A 050.0 00:00:10:00\n"),
                ElementsAre("a.edl: the list has no events of pictures"));
}

TEST(CMX3600, RefusesWhatAnEditListCannotSay) {
    EXPECT_THAT(piecesOfEvents("001 A V D 025 00:00:10:00 00:00:15:00 01:00:00:00 01:00:05:00\n"),
                ElementsAre("a.edl: line 2: the transition \"D\" is no cut, which is all that an edit list can say"));
    EXPECT_THAT(piecesOfEvents("001 BL V C 00:00:00:00 00:00:05:00 01:00:00:00 01:00:05:00\n"),
                ElementsAre("a.edl: line 2: the event is black, which an edit list cannot say"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:00:00 00:00:05:00 01:00:00:00 01:00:05:00\n"
                               "002 B V C 00:00:00:00 00:00:05:00 01:00:05:00 01:00:10:00\n"),
                ElementsAre(HasSubstr("a.edl: line 3: the source is \"B\", but that of an earlier piece is \"A\"")));
    EXPECT_THAT(piecesOfEvents("001 AX V C 00:00:00:00 00:00:05:00 01:00:00:00 01:00:05:00\n* FROM CLIP NAME: a.mp4\n"
                               "002 AX V C 00:00:00:00 00:00:05:00 01:00:05:00 01:00:10:00\n* FROM CLIP NAME: b.mp4\n"),
                ElementsAre(HasSubstr("a.edl: line 4: the source is \"b.mp4\"")));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:00:00 00:00:05:00 01:00:00:00 01:00:00:00\n"),
                ElementsAre("a.edl: line 2: the event does not end after its beginning"));
}

TEST(CMX3600, RefusesWhatIsNoEvent) {
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:00:00 00:00:05:00 01:00:00:00\n"),
                ElementsAre("a.edl: line 2: the event does not end in four time codes"));
    EXPECT_THAT(piecesOfEvents("001 A V C 0:00:00:00 00:00:05:00 01:00:00:00 01:00:05:00\n"),
                ElementsAre("a.edl: line 2: the event does not end in four time codes"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:00:00:25 00:00:05:00 01:00:00:00 01:00:05:00\n"),
                ElementsAre("a.edl: line 2: no frame has the time code 00:00:00:25"));
    EXPECT_THAT(piecesOfEvents("001 A V C 00:60:00:00 00:00:05:00 01:00:00:00 01:00:05:00\n"),
                ElementsAre("a.edl: line 2: no frame has the time code 00:60:00:00"));
    EXPECT_THAT(piecesOfEvents(""), ElementsAre("a.edl: the list has no events of pictures"));
}

} // namespace
} // namespace ZULMetaData::Test
