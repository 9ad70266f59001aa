#include "Tests/ZULMetaDataSession/EditListTexts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

std::vector<std::string> piecesOfProject(const std::string& segments, const EditListOptions& options = {},
                                         const std::string& version = "1") {
    return piecesOf("{version: " + version + ", mediaFileName: 'a.mp4', cutSegments: [" + segments + "]}", "a.llc",
                    options);
}

TEST(LosslessCut, KeepsItsSegmentsInTheirOrder) {
    EXPECT_THAT(piecesOf("{\n  version: 1,\n  mediaFileName: 'a.mp4',\n  cutSegments: [\n    {\n      start: 70.5,\n"
                         "      end: 80,\n      name: '',\n    },\n    {\n      start: 1e1,\n      end: 20.125,\n"
                         "      name: 'It\\'s \"b\"',\n      tags: {\n        a: 'b',\n      },\n    },\n  ],\n}\n",
                         "a-proj.llc"),
                ElementsAre("141/2-80@1=19/2", "10-161/8@1=81/8"));
}

TEST(LosslessCut, TakesNumbersAsTheyAreWritten) {
    EXPECT_THAT(piecesOfProject("{start: 0.1, end: 1e-7}"),
                ElementsAre("a.llc: segment 1: end is 1/10000000, which is not after start, 1/10"));
    EXPECT_THAT(piecesOfProject("{start: .5, end: +0.7,}, // and a comment\n {/* another */ end: 2.}"),
                ElementsAre("1/2-7/10@1=1/5", "0-2@1=2"));
}

TEST(LosslessCut, BeginsAtTheStartAndEndsAtTheEndIfASegmentDoesNotSayIt) {
    EXPECT_THAT(piecesOfProject("{end: 5}, {start: 6}, {}", ofDuration(10)),
                ElementsAre("0-5@1=5", "6-10@1=4", "0-10@1=10"));
    EXPECT_THAT(piecesOfProject("{start: 6}"),
                ElementsAre("a.llc: segment 1: it has no end, and the duration of the recording is not known"));
}

TEST(LosslessCut, LeavesOutWhatIsNotSelectedAndMarkers) {
    EXPECT_THAT(
        piecesOfProject("{start: 1, end: 2, selected: false}, {start: 3, end: 4, selected: true}, {start: 5}", {}, "2"),
        ElementsAre("3-4@1=1"));
    EXPECT_THAT(piecesOfProject("{start: 1, end: 2, selected: 0}", {}, "2"),
                ElementsAre("a.llc: segment 1: \"selected\" is neither true nor false"));
}

TEST(LosslessCut, RefusesOtherProjects) {
    EXPECT_THAT(piecesOfProject("", {}, "3"),
                ElementsAre("a.llc: the project is of version 3; versions 1 and 2 can be read"));
    EXPECT_THAT(piecesOf("{cutSegments: []}", "a.llc"), ElementsAre("a.llc: \"version\" is missing"));
    EXPECT_THAT(piecesOf("{version: 1, cutSegments: {}}", "a.llc"), ElementsAre("a.llc: \"cutSegments\" is no array"));
    EXPECT_THAT(piecesOfProject("1"), ElementsAre("a.llc: segment 1: a segment is an object"));
    EXPECT_THAT(piecesOfProject("{start: '1', end: 2}"),
                ElementsAre("a.llc: segment 1: \"start\" is no number, or one of more than 400 places"));
    EXPECT_THAT(piecesOfProject("{start: 1e-401, end: 2}"),
                ElementsAre("a.llc: segment 1: \"start\" is no number, or one of more than 400 places"));
    EXPECT_THAT(piecesOfProject("{start: -1, end: 2}"), ElementsAre("a.llc: segment 1: start is negative: -1"));
    EXPECT_THAT(piecesOfProject("{start: 2, end: 2}"),
                ElementsAre("a.llc: segment 1: end is 2, which is not after start, 2"));
    EXPECT_THAT(piecesOfProject("{start: NaN, end: 2}"), ElementsAre(HasSubstr("a.llc: at 59: this is no value")));
    EXPECT_THAT(piecesOfProject("{start: 0x10, end: 2}"), ElementsAre(HasSubstr("this is no decimal number")));
    EXPECT_THAT(piecesOfProject("{'start': 1, start: 1}"),
                ElementsAre(HasSubstr("an object has two members \"start\"")));
}

TEST(LosslessCut, ReadsEveryTextOfJSON5) {
    EXPECT_THAT(
        piecesOf("\xef\xbb\xbf{version: 1, cutSegments: [{$_\xc3\xa9: 'a\\x41\\u00e9\\\n\\v\\0\\q\t', end: 1}]}",
                 "a.llc"),
        ElementsAre("0-1@1=1"));
    for (const char* text : {"'a\nb'", "'\\xg0'", "'\\1'", "'", "/*", "'\\ud800'"})
        EXPECT_THAT(piecesOfProject("{end: 1, name: " + std::string(text) + '}'), ElementsAre(HasSubstr("a.llc: at ")))
            << text;
}

TEST(LosslessCut, MayHaveNoSegments) {
    EXPECT_THAT(piecesOfProject(""), IsEmpty());
}

TEST(CutTable, ReadsRowsOfStartEndAndLabel) {
    EXPECT_THAT(piecesOf(",56.9568,First segment starting at 0\n70,842.33,\"Another, \"\"quoted\"\"\nlabel\"\n"
                         "1234,,Last segment\n",
                         "a.csv", ofDuration(1300)),
                ElementsAre("0-35598/625@1=35598/625", "70-84233/100@1=77233/100", "1234-1300@1=66"));
    EXPECT_THAT(piecesOf("1,2\r\n\r\n3,4,a,b,\"c\"\r\n", "cuts.txt"), ElementsAre("1-2@1=1", "3-4@1=1"));
}

TEST(CutTable, TakesQuotationMarksInsideAFieldForThemselves) {
    EXPECT_THAT(piecesOf("1,2,a,12\"\n3,4,b,15\"\n5,6,7\",\n", "a.csv"), ElementsAre("1-2@1=1", "3-4@1=1", "5-6@1=1"));
    EXPECT_THAT(piecesOf("1,2,a,\"12\n\",\"\"\n3,4\n", "a.csv"), ElementsAre("1-2@1=1", "3-4@1=1"));
}

TEST(CutTable, KnowsItsTabsAfterEmptyLines) {
    EXPECT_THAT(piecesOf("\n\r\n1\t2,5\n", "a.tsv"),
                ElementsAre("a.tsv: row 3: \"2,5\" is no time such as 12.5 or 00:01:30.5"));
}

TEST(CutTable, ReadsTabsAndTimeCodes) {
    EXPECT_THAT(piecesOf("00:00:10.500\t00:01:00.000\ta, b\n", "a.tsv"), ElementsAre("21/2-60@1=99/2"));
    EXPECT_THAT(piecesOf("\t00:01:00.000\t\n", "a.tsv"), ElementsAre("0-60@1=60"));
}

TEST(CutTable, NamesTheRowThatIsWrong) {
    EXPECT_THAT(piecesOf("1,2,\n3,,\n", "a.csv"),
                ElementsAre("a.csv: row 2: it has no end, and the duration of the recording is not known"));
    EXPECT_THAT(piecesOf("1,2,\nstart,end,name\n", "a.csv"),
                ElementsAre("a.csv: row 2: \"start\" is no time such as 12.5 or 00:01:30.5"));
    EXPECT_THAT(piecesOf("1,2,\n3;4;x\n", "a.csv"),
                ElementsAre("a.csv: row 2: it has no columns for the start, the end and the label"));
    EXPECT_THAT(piecesOf("1,2,\"a\n", "a.csv"), ElementsAre("a.csv: row 1: a quotation mark has no second one"));
    EXPECT_THAT(piecesOf("1,2\n-3,4\n", "a.csv"),
                ElementsAre("a.csv: row 2: \"-3\" is no time such as 12.5 or 00:01:30.5"));
    EXPECT_THAT(piecesOf("2,1,x\n", "a.csv"), ElementsAre("a.csv: row 1: end is 1, which is not after start, 2"));
    EXPECT_THAT(piecesOf("\n\n", "a.csv"), ElementsAre("a.csv: the table has no rows"));
}

} // namespace
} // namespace ZULMetaData::Test
