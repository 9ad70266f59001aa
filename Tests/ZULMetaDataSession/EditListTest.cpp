#include "ZULMetaDataSession/EditList.h"
#include "Tests/ZULMetaDataSession/EditListTexts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

std::string errorOfReading(const std::string& json) {
    return errorOf([&json] { EditList::read(json, "a.json"); });
}

/// Returns a document with these pieces.
std::string documentOf(const std::string& pieces) {
    return R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [)" + pieces + "]}";
}

EditList listOf(const std::string& pieces) {
    return EditList::read(documentOf(pieces), "a.json");
}

std::vector<std::string> numberTexts(const std::vector<Rational>& numbers) {
    std::vector<std::string> texts;
    for (const Rational& number : numbers)
        texts.push_back(number.text());
    return texts;
}

TEST(EditList, IsEmptyAtFirst) {
    EXPECT_THAT(EditList().pieces(), IsEmpty());
    EXPECT_THAT(EditList().bases(), IsEmpty());
    EXPECT_EQ(EditList().duration(), 0);
}

TEST(EditList, KeepsTheOrderOfItsPieces) {
    EditList edits;
    edits.keep(10, {61, 3}, {3, 2});
    edits.hold({25, 2}, 2);
    edits.keep(0, 1);
    EXPECT_THAT(textsOf(edits), ElementsAre("10-61/3@3/2=62/9", "25/2+2", "0-1@1=1"));
    EXPECT_TRUE(edits.pieces()[1].isHeld());
    EXPECT_FALSE(edits.pieces()[2].isHeld());
}

TEST(EditList, KnowsWhereItsPiecesBegin) {
    EditList edits;
    edits.keep(0, 1, 3);
    edits.keep(0, 1, 3);
    edits.hold(9, {1, 3});
    edits.keep(5, 6);
    EXPECT_THAT(numberTexts(edits.bases()), ElementsAre("0", "1/3", "2/3", "1"));
    EXPECT_EQ(edits.duration(), 2);
}

TEST(EditList, RefusesImpossiblePieces) {
    EditList edits;
    EXPECT_EQ(errorOf([&] { edits.keep(10, 10); }), "end is 10, which is not after start, 10");
    EXPECT_EQ(errorOf([&] { edits.keep({21, 2}, 10); }), "end is 10, which is not after start, 21/2");
    EXPECT_EQ(errorOf([&] { edits.keep(-1, 10); }), "start is negative: -1");
    EXPECT_EQ(errorOf([&] { edits.keep(-3, -1); }), "start is negative: -3");
    EXPECT_EQ(errorOf([&] { edits.keep(1, 10, 0); }), "speed is 0; it must be above 0");
    EXPECT_EQ(errorOf([&] { edits.keep(1, 10, {-1, 2}); }), "speed is negative: -1/2");
    EXPECT_EQ(errorOf([&] { edits.hold(-1, 10); }), "at is negative: -1");
    EXPECT_EQ(errorOf([&] { edits.hold(1, 0); }), "duration is 0; it must be above 0");
    EXPECT_EQ(errorOf([&] { edits.hold(1, -2); }), "duration is negative: -2");
    EXPECT_THAT(edits.pieces(), IsEmpty());
}

TEST(EditList, RefusesNumbersThatItCouldNotReadBack) {
    const Rational small = *Rational::parse("1/1" + std::string(999, '0'));
    EditList edits;
    EXPECT_EQ(errorOf([&] { edits.keep(0, small / 10); }), "end has more than 1,000 digits");
    EXPECT_EQ(errorOf([&] { edits.hold(small / 10, 1); }), "at has more than 1,000 digits");
    edits.keep(0, small);
    EXPECT_EQ(EditList::read(edits.json(), "a.json").duration(), small);
}

TEST(EditList, RefusesTimesThatNoEntryCanHave) {
    const Rational large = *Rational::parse('1' + std::string(308, '0'));
    const std::string tooLarge = " is larger than the largest 64-bit floating-point number";
    EditList edits;
    EXPECT_EQ(errorOf([&] { edits.keep(0, large * 2); }), "end" + tooLarge);
    EXPECT_EQ(errorOf([&] { edits.keep(0, 1, large * 2); }), "speed" + tooLarge);
    EXPECT_EQ(errorOf([&] { edits.hold(large * 2, 1); }), "at" + tooLarge);
    EXPECT_EQ(errorOf([&] { edits.hold(0, large * 2); }), "duration" + tooLarge);
    EXPECT_EQ(errorOf([&] { edits.keep(0, 1, Rational(1) / large / large); }),
              "speed is nearer to 0 than any 64-bit floating-point number");
    edits.keep(0, large);
    const std::string tooLong =
        "the edited movie would last more seconds than the largest 64-bit floating-point number";
    EXPECT_EQ(errorOf([&] { edits.keep(0, large); }), tooLong);
    EXPECT_EQ(errorOf([&] { edits.keep(0, 1, Rational(1) / large); }), tooLong);
    EXPECT_EQ(edits.duration(), large);
}

TEST(EditList, RefusesDenominatorsWithoutEnd) {
    EditList edits;
    const std::string error = errorOf([&edits] {
        for (int i = 0; i < 3000; ++i) // the speeds have little in common
            edits.keep(0, 1, Rational::of(1 + 1 / (i + 3.14159)));
    });
    EXPECT_THAT(error, HasSubstr("too many different denominators"));
    EXPECT_GT(edits.pieces().size(), 1000u);
    EXPECT_LT(edits.pieces().size(), 3000u);
}

TEST(EditList, AddsUpTenThousandOddPieces) {
    EditList edits;
    for (std::int64_t i = 0; i < 10000; ++i)
        edits.keep(Rational(1001 * i, 30000), Rational(1001 * (i + 1), 30000), Rational(100 + i % 7, 100));
    Rational sum; // of seven harmonic series
    for (std::int64_t i = 0; i < 7; ++i)
        sum = sum + Rational(1001, 30000) * Rational(100, 100 + i) * ((10000 - i + 6) / 7);
    EXPECT_EQ(edits.duration(), sum);
}

TEST(EditList, WritesItsNumbersExactly) {
    EditList edits;
    edits.keep(10, {61, 3}, {3, 2});
    edits.hold({25, 2}, 2);
    edits.keep(Rational::of(0.1), 1);
    EXPECT_EQ(edits.json(), R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [
  {"start": "10", "end": "61/3", "speed": "3/2"},
  {"at": "25/2", "duration": "2"},
  {"start": "3602879701896397/36028797018963968", "end": "1"}
]}
)");
    EXPECT_EQ(EditList().json(), R"({"schema": "zulm.edits", "schema_version": 1, "pieces": []}
)");
}

TEST(EditList, ReadsWhatItWrites) {
    EditList edits;
    edits.keep(10, {61, 3}, {3, 2});
    edits.hold({25, 2}, Rational::of(5e-324));
    edits.keep(Rational::of(0.1), Rational::of(1.7976931348623157e308));
    EXPECT_EQ(EditList::read(edits.json(), "a.json").json(), edits.json());
    EXPECT_THAT(EditList::read(EditList().json(), "a.json").pieces(), IsEmpty());
}

TEST(EditList, ReadsNumbersAndTexts) {
    EXPECT_THAT(textsOf(listOf(R"({"start": "10", "end": "61/3", "speed": "3/2"}, {"at": "12.5", "duration": "2"})")),
                ElementsAre("10-61/3@3/2=62/9", "25/2+2"));
    EXPECT_THAT(textsOf(listOf(R"({"end": 2.5e1, "start": 0.5, "speed": 2})")), ElementsAre("1/2-25@2=49/4"));
    EXPECT_THAT(textsOf(listOf(R"({"start": 0, "end": 0.1})")),
                ElementsAre("0-3602879701896397/36028797018963968@1=3602879701896397/36028797018963968"));
    EXPECT_THAT(textsOf(listOf(R"({"start": 0, "end": "0.1"})")), ElementsAre("0-1/10@1=1/10"));
    EXPECT_THAT(textsOf(listOf(R"({"start": -0, "end": 1E0})")), ElementsAre("0-1@1=1"));
    EXPECT_THAT(textsOf(listOf(R"({"start": 0.0e999, "end": 10e-1})")), ElementsAre("0-1@1=1"));
    EXPECT_THAT(textsOf(EditList::read(
                    " \n{\"pieces\" : [ ],\t\"schema_version\": 1.0, \"schema\":\"zulm.e\\u0064its\"}\r\n", "a.json")),
                IsEmpty());
}

TEST(EditList, RoundsNumbersToTheNearestDouble) {
    const auto endOf = [](const std::string& number) {
        return listOf(R"({"start": 0, "end": )" + number + '}').pieces().front().end;
    };
    EXPECT_EQ(endOf("9007199254740993"), Rational(9007199254740992));
    EXPECT_EQ(endOf("9007199254740993." + std::string(2000, '0') + '1'), Rational(9007199254740994));
    EXPECT_EQ(endOf("0.3"), Rational::of(0.3));
    EXPECT_EQ(endOf("1.7976931348623158e308"), Rational::of(1.7976931348623157e308));
    EXPECT_EQ(endOf("2.4703282292062327209e-324"), Rational::of(5e-324)); // a little more than half of it
    EXPECT_EQ(endOf("4." + std::string(900, '9') + "e-324"), Rational::of(5e-324));
    EXPECT_EQ(endOf("100000000000000000000000e-22"), Rational(10));
    EXPECT_EQ(endOf("0." + std::string(3000, '0') + "1e3001"), Rational(1));
}

TEST(EditList, NamesThePieceAndTheMemberThatIsWrong) {
    const std::pair<const char*, const char*> wrong[] = {
        {R"({"start": 5, "end": 4})", "end is 4, which is not after start, 5"},
        {R"({"start": 5, "end": 5})", "end is 5, which is not after start, 5"},
        {R"({"start": 5, "end": 6, "speed": 0})", "speed is 0; it must be above 0"},
        {R"({"start": 5, "end": 6, "speed": -1})", "speed is negative: -1"},
        {R"({"start": 5, "end": 6, "speed": 1e-400})", "speed is 0; it must be above 0"},
        {R"({"at": 5, "duration": 0})", "duration is 0; it must be above 0"},
        {R"({"at": 5, "duration": -1})", "duration is negative: -1"},
        {R"({"at": -0.5, "duration": 1})", "at is negative: -1/2"},
        {R"({"start": -1, "end": 1})", "start is negative: -1"},
        {R"({"start": 0, "end": 1, "at": 1})", "it has both \"start\" and \"at\""},
        {R"({"end": 1})", "it has neither \"start\" nor \"at\""},
        {R"({})", "it has neither \"start\" nor \"at\""},
        {R"({"start": 1})", "\"end\" is missing"},
        {R"({"at": 1})", "\"duration\" is missing"},
        {R"({"at": 1, "duration": 1, "speed": 1})", "\"speed\" cannot stand beside \"at\""},
        {R"({"at": 1, "duration": 1, "end": 2})", "\"end\" cannot stand beside \"at\""},
        {R"({"start": 1, "end": 2, "duration": 1})", "\"duration\" cannot stand beside \"start\""},
        {R"({"start": 1, "end": 2, "note": ""})", "\"note\" is no member that can stand here"},
        {R"({"start": null, "end": 2})", "\"start\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"({"start": 1, "end": 1e400})", "\"end\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"({"start": "-1", "end": 2})", "\"start\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"({"start": "1e1", "end": 20})", "\"start\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"({"start": " 1", "end": 20})", "\"start\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"({"start": "1/0", "end": 20})", "\"start\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"({"start": "", "end": 20})", "\"start\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"({"start": "0:10", "end": 20})", "\"start\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"({"start": true, "end": 20})", "\"start\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"({"start": [1], "end": 20})", "\"start\" is no finite number such as 12.5, \"12.5\" or \"61/3\""},
        {R"([1, 2])", "a piece is a JSON object"},
        {R"(1)", "a piece is a JSON object"},
    };
    for (const auto& [piece, sentence] : wrong)
        EXPECT_EQ(errorOfReading(documentOf(std::string(R"({"start": 0, "end": 1}, )") + piece)),
                  std::string("a.json: piece 2: ") + sentence);
    EXPECT_EQ(errorOf([] { EditList::read(documentOf(R"({"start": 5, "end": 4})"), ""); }),
              "piece 1: end is 4, which is not after start, 5");
}

TEST(EditList, RefusesOtherDocuments) {
    EXPECT_EQ(errorOfReading("[]"), "a.json: an edit list is a JSON object");
    EXPECT_EQ(errorOfReading(R"({"schema_version": 1, "pieces": []})"), "a.json: \"schema\" is not \"zulm.edits\"");
    EXPECT_EQ(errorOfReading(R"({"schema": "zulm.info", "schema_version": 1, "pieces": []})"),
              "a.json: \"schema\" is not \"zulm.edits\"");
    for (const char* version : {"2", "0", "\"1\"", "null", "1.5", "1e99999"})
        EXPECT_EQ(
            errorOfReading(R"({"schema": "zulm.edits", "pieces": [], "schema_version": )" + std::string(version) + '}'),
            "a.json: \"schema_version\" is not 1, which is the only version that can be read")
            << version;
    EXPECT_EQ(errorOfReading(R"({"schema": "zulm.edits", "schema_version": 1})"), "a.json: \"pieces\" is no array");
    EXPECT_EQ(errorOfReading(R"({"schema": "zulm.edits", "schema_version": 1, "pieces": {}})"),
              "a.json: \"pieces\" is no array");
    EXPECT_EQ(errorOfReading(R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [], "fps": 30})"),
              "a.json: \"fps\" is no member that can stand here");
}

TEST(EditList, RefusesWhatIsNoJson) {
    EXPECT_EQ(errorOfReading(documentOf("") + " x"), "a.json: at 60: something follows the document");
    EXPECT_THAT(errorOfReading(documentOf("") + documentOf("")), HasSubstr("something follows the document"));
    EXPECT_THAT(errorOfReading(documentOf(R"({"start": 0, "end": 1, "end": 2})")),
                HasSubstr("an object has two members \"end\""));
    for (const char* document : {"",
                                 " ",
                                 "{",
                                 "{\"schema\"",
                                 "{\"schema\":",
                                 "{\"a\":1,}",
                                 "[1,]",
                                 "[1 2]",
                                 "{'a':1}",
                                 "{a:1}",
                                 "// x\n{}",
                                 "[01]",
                                 "[1.]",
                                 "[.5]",
                                 "[+1]",
                                 "[1e]",
                                 "[0x1]",
                                 "[NaN]",
                                 "[Infinity]",
                                 "[-]",
                                 "\"\\x41\"",
                                 "\"\\ud800\"",
                                 "\"\\ud800\\u0041\"",
                                 "\"\\udc00\"",
                                 "\"\t\"",
                                 "\"abc",
                                 "\"\\",
                                 "nul",
                                 "truefalse",
                                 "\xff\xfe",
                                 "\"\xc3\"",
                                 "\"\xed\xa0\x80\""})
        EXPECT_THAT(errorOfReading(document), StartsWith("a.json: at ")) << document;
}

TEST(EditList, RefusesDeepAndLargeDocuments) {
    EXPECT_THAT(errorOfReading(std::string(100000, '[')), HasSubstr("more than 64 levels"));
    EXPECT_THAT(errorOfReading(documentOf(std::string(64, '[') + std::string(64, ']'))),
                HasSubstr("more than 64 levels"));
    std::string zeros = "0";
    for (int i = 0; i < 1'000'000; ++i)
        zeros += ",0";
    EXPECT_THAT(errorOfReading(documentOf(zeros)), HasSubstr("more than 1000000 values"));
}

TEST(EditList, ReadsTimesAsPeopleWriteThem) {
    const auto time = [](const char* text) {
        const auto parsed = parseEditTime(text);
        return parsed ? parsed->text() : "none";
    };
    EXPECT_EQ(time("90"), "90");
    EXPECT_EQ(time("12.5"), "25/2");
    EXPECT_EQ(time("61/3"), "61/3");
    EXPECT_EQ(time("1:30"), "90");
    EXPECT_EQ(time("0:01:02.5"), "125/2");
    EXPECT_EQ(time("1:02:03.001"), "3723001/1000");
    EXPECT_EQ(time("90:00"), "5400");
    EXPECT_EQ(time("0:5"), "5");
    for (const char* text : {"", ":", ":30", "1:", "1:60", "1:60:00", "1:2:3:4", "1.5:30", "1:2.5:3", "1:030", "1:30/2",
                             "1/2:30", "-1", "-1:30", "1: 30", "1e3", "1:-3", "1:.5", "1:5."})
        EXPECT_EQ(time(text), "none") << text;
}

TEST(EditList, ReadsThePiecesOfACommandLine) {
    EditList edits;
    edits.keep("10-61/3@3/2");
    edits.keep("0:10-1:30.5");
    edits.keep("0-0.1@0.5");
    EXPECT_THAT(textsOf(edits), ElementsAre("10-61/3@3/2=62/9", "10-181/2@1=161/2", "0-1/10@1/2=1/5"));
    for (const char* text : {"", "-", "10", "10-", "-10", "1-2-3", "1--2", "a-b", "10-20 ", "10–20", "10,20"})
        EXPECT_THAT(errorOf([&] { edits.keep(text); }), HasSubstr("is no range; write two times such as")) << text;
    for (const char* text : {"1-2@", "1-2@x", "1-2@-1", "1-2@1:30", "1-2@2@2"})
        EXPECT_THAT(errorOf([&] { edits.keep(text); }), HasSubstr("is no speed; write a number such as")) << text;
    EXPECT_EQ(errorOf([&] { edits.keep("2-1"); }), "end is 1, which is not after start, 2");
    EXPECT_EQ(errorOf([&] { edits.keep("1-2@0"); }), "speed is 0; it must be above 0");
    EXPECT_EQ(edits.pieces().size(), 3u);
}

TEST(EditList, ReadsARange) {
    const EditRange range = parseEditRange("1:00-61.5");
    EXPECT_EQ(range.start, 60);
    EXPECT_EQ(range.end, Rational(123, 2));
    EXPECT_EQ(errorOf([] { parseEditRange("5-5"); }), "end is 5, which is not after start, 5");
}

TEST(EditList, LeavesOutTheUnionOfRanges) {
    EXPECT_THAT(textsOf(EditList::without({{1, 2}, {4, 5}}, 10)), ElementsAre("0-1@1=1", "2-4@1=2", "5-10@1=5"));
    EXPECT_THAT(textsOf(EditList::without({{4, 6}, {1, 5}, {2, 3}, {6, 7}}, 10)), ElementsAre("0-1@1=1", "7-10@1=3"));
    EXPECT_THAT(textsOf(EditList::without({{0, 1}}, 10)), ElementsAre("1-10@1=9"));
    EXPECT_THAT(textsOf(EditList::without({{9, 10}}, 10)), ElementsAre("0-9@1=9"));
    EXPECT_THAT(textsOf(EditList::without({{9, 100}, {20, 30}}, 10)), ElementsAre("0-9@1=9"));
    EXPECT_THAT(textsOf(EditList::without({{10, 100}}, {19, 2})), ElementsAre("0-19/2@1=19/2"));
    EXPECT_THAT(textsOf(EditList::without({}, 10)), ElementsAre("0-10@1=10"));
    EXPECT_THAT(textsOf(EditList::without({{0, 10}}, 10)), IsEmpty());
    EXPECT_THAT(textsOf(EditList::without({}, 0)), IsEmpty());
    EXPECT_EQ(errorOf([] { EditList::without({{1, 1}}, 10); }), "end is 1, which is not after start, 1");
}

} // namespace
} // namespace ZULMetaData::Test
