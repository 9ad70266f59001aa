#include "Tools/render/JsonFields.h"

#include "Tests/Support/Files.h"
#include "Tests/Tools/render/RenderSamples.h"

#include <gtest/gtest.h>

namespace Render::Test {
namespace {

const std::string s_head = R"({"schema": "zulm.test", "schema_version": 1)";

JsonFields fieldsOf(const std::string& document) {
    return {document, "my.json", "zulm.test"};
}

/// Members that follow the head, on lines of their own.
JsonFields membersOf(const std::string& members) {
    return fieldsOf(s_head + ",\n" + members + "}");
}

std::string refusal(const std::string& document) {
    return failureOf([&] { fieldsOf(document); });
}

TEST(JsonFields, RefusesWhatIsNotTheDocument) {
    EXPECT_TRUE(refusal("").starts_with("my.json: line 1: is not a JSON document: "));
    EXPECT_TRUE(refusal("{\n\n\"a\" 1}").starts_with("my.json: line 3: is not a JSON document: "));
    EXPECT_TRUE(refusal("{\r\n\"a\": 1e999\r\n}").starts_with("my.json: line 2: is not a JSON document: "));
    EXPECT_TRUE(refusal(s_head + "}\n}").starts_with("my.json: line 2: is not a JSON document: "));
    EXPECT_EQ(refusal("[1]"), "my.json: line 1: is not an object");
    EXPECT_EQ(refusal("\"text\""), "my.json: line 1: is not an object");
    EXPECT_EQ(refusal("{}"), "my.json: line 1: \"schema\" must be \"zulm.test\"");
    EXPECT_EQ(refusal("{\n\"schema\": \"zulm.zooms\"}"), "my.json: line 2: \"schema\" must be \"zulm.test\"");
}

TEST(JsonFields, RefusesOtherVersions) {
    const std::string sentence = "\"schema_version\" must be 1; a newer version of zulm may read others";
    EXPECT_EQ(refusal("{\"schema\": \"zulm.test\"}"), "my.json: line 1: " + sentence);
    EXPECT_EQ(refusal("{\"schema\": \"zulm.test\",\n\"schema_version\": 2}"), "my.json: line 2: " + sentence);
    EXPECT_EQ(refusal("{\"schema\": \"zulm.test\",\n\"schema_version\": \"1\"}"), "my.json: line 2: " + sentence);
    EXPECT_EQ(refusal("{\"schema\": \"zulm.test\",\n\"schema_version\": null}"), "my.json: line 2: " + sentence);
}

TEST(JsonFields, RefusesMembersThatAreGivenTwiceOrPassForOthers) {
    EXPECT_EQ(failureOf([] { membersOf("\"a\": {\n\"b\": 1,\n\"b\": 2}"); }),
              "my.json: line 4: \"a.b\" is given twice");
    EXPECT_EQ(failureOf([] { membersOf("\"a.b\": 1"); }), "my.json: line 2: \"a.b\" is not known");
    EXPECT_EQ(failureOf([] { membersOf("\"a[0]\": 1"); }), "my.json: line 2: \"a[0]\" is not known");
    EXPECT_EQ(failureOf([] { membersOf("\"\": 1"); }), "my.json: line 2: \"\" is not known");
}

TEST(JsonFields, RefusesDocumentsThatAreTooLongOrTooDeep) {
    EXPECT_EQ(failureOf([] { membersOf("\"a\": " + std::string(100'000, '[')); }),
              "my.json: line 2: too long or too deep");
    std::string many = "\"a\": [0";
    for (int i = 0; i < 10'000; ++i)
        many += ",0";
    EXPECT_EQ(failureOf([&] { membersOf(many + "]"); }), "my.json: line 2: too long or too deep");
}

TEST(JsonFields, KeepsTheValueOfAMemberThatIsLeftOut) {
    JsonFields fields = membersOf("\"a\": {\"number\": 2.5, \"flag\": true, \"text\": \"x\"}");
    double number = 1;
    bool flag = false;
    std::string text = "before";
    EXPECT_FALSE(fields.number("a.other", 0, 9, number));
    fields.boolean("other", flag);
    fields.text("other", text);
    EXPECT_EQ(number, 1);
    EXPECT_FALSE(flag);
    EXPECT_EQ(text, "before");
    EXPECT_TRUE(fields.number("a.number", 0, 9, number));
    fields.boolean("a.flag", flag);
    fields.text("a.text", text);
    EXPECT_EQ(number, 2.5);
    EXPECT_TRUE(flag);
    EXPECT_EQ(text, "x");
}

TEST(JsonFields, TakesNumbersWithinTheirBounds) {
    double number = 0;
    for (const char* value : {"-1", "10", "-0.0001", "9.0001", "\"5\"", "true", "null", "[]", "{}"})
        EXPECT_EQ(failureOf([&] { membersOf("\"a\": " + std::string(value)).number("a", 0, 9, number); }),
                  "my.json: line 2: \"a\" must be a number from 0 to 9")
            << value;
    for (const char* value : {"0", "9", "-0", "9.0", "18e-1"})
        EXPECT_TRUE(membersOf("\"a\": " + std::string(value)).number("a", 0, 9, number)) << value;
}

TEST(JsonFields, TakesNullWhereANumberMayBeLeftOut) {
    std::optional<double> number = 3;
    membersOf("\"b\": 1").number("a", 0, 9, number);
    EXPECT_EQ(number, 3);
    membersOf("\"a\": 4").number("a", 0, 9, number);
    EXPECT_EQ(number, 4);
    membersOf("\"a\": null").number("a", 0, 9, number);
    EXPECT_FALSE(number);
    EXPECT_EQ(failureOf([&] { membersOf("\"a\": []").number("a", 0, 9, number); }),
              "my.json: line 2: \"a\" must be a number from 0 to 9");
}

TEST(JsonFields, RefusesOtherTypesAndLongTexts) {
    bool flag = false;
    std::string text;
    EXPECT_EQ(failureOf([&] { membersOf("\"a\": 1").boolean("a", flag); }),
              "my.json: line 2: \"a\" must be true or false");
    EXPECT_EQ(failureOf([&] { membersOf("\"a\": 1").text("a", text); }),
              "my.json: line 2: \"a\" must be a text of at most 200 bytes");
    EXPECT_EQ(failureOf([&] { membersOf("\"a\": \"" + std::string(201, 'x') + "\"").text("a", text); }),
              "my.json: line 2: \"a\" must be a text of at most 200 bytes");
    EXPECT_EQ(failureOf([&] { membersOf("\"a\": {}").array("a"); }), "my.json: line 2: \"a\" must be an array");
    EXPECT_EQ(failureOf([&] { membersOf("\"b\": {}").array("a"); }), "my.json: line 1: \"a\" is missing");
    EXPECT_EQ(failureOf([&] { membersOf("\"a\": []").section("a"); }), "my.json: line 2: \"a\" must be an object");
}

TEST(JsonFields, NamesTheElementsOfArrays) {
    JsonFields fields = membersOf("\"a\": [\n{\"b\": 1},\n{\"b\": 2},\n[3, 4]]");
    EXPECT_EQ(fields.array("a"), 3U);
    double number = 0;
    fields.number("a[1].b", 0, 9, number);
    EXPECT_EQ(number, 2);
    EXPECT_EQ(fields.array("a[2]"), 2U);
    EXPECT_EQ(failureOf([&] { fields.failAt("a[2][1]", "is odd"); }), "my.json: line 5: \"a[2][1]\" is odd");
}

TEST(JsonFields, TellsWhatNobodyTook) {
    JsonFields fields = membersOf("\"a\": 1,\n\"b\": {\n\"c\": 2}");
    double number = 0;
    fields.number("a", 0, 9, number);
    fields.section("b");
    EXPECT_EQ(failureOf([&] { fields.requireNothingLeft(); }), "my.json: line 4: \"b.c\" is not known");
    fields.number("b.c", 0, 9, number);
    fields.requireNothingLeft();
}

TEST(ShortFile, IsAtMostAMegabyte) {
    const ZULMetaData::Test::TemporaryFolder folder;
    const std::string file = folder / "style.json";
    ZULMetaData::Test::writeFile(file, std::string(1 << 20, ' '));
    EXPECT_EQ(shortFile(file, "a style").size(), 1U << 20);
    ZULMetaData::Test::writeFile(file, std::string((1 << 20) + 1, ' '));
    EXPECT_EQ(failureOf([&] { shortFile(file, "a style"); }), file + ": cannot be read, or is too large for a style");
    EXPECT_EQ(failureOf([&] { shortFile(folder / "none.json", "a style"); }),
              (folder / "none.json") + ": cannot be opened: No such file or directory");
    EXPECT_EQ(failureOf([&] { shortFile(folder.path().string(), "a style"); }),
              folder.path().string() + ": cannot be read, or is too large for a style");
}

} // namespace
} // namespace Render::Test
