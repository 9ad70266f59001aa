#include "Reports/JsonWriter.h"
#include "Reports/Report.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <string>

namespace ZULMetaData::Test {

namespace {

using Zulm::JsonWriter;
using Json = nlohmann::ordered_json;

class JsonWriterTest : public testing::Test {
protected:
    JsonWriter writerOf(JsonWriter::Style style) {
        text.clear();
        return JsonWriter([this](std::string_view piece) { text += piece; }, style);
    }

    static void writeExample(JsonWriter& writer) {
        writer.beginObject();
        writer.member("name", "line\nend \"quoted\"");
        writer.beginArray("none");
        writer.end();
        writer.beginArray("some");
        writer.element(1);
        writer.beginObject();
        writer.end();
        writer.beginObject();
        writer.members({{"nested", {{"a", Json::array({1, 2})}, {"b", Json::object()}}}, {"last", nullptr}});
        writer.endTo(1);
        writer.member("end", true);
        writer.endTo(0);
    }

    static Json example() {
        return {{"name", "line\nend \"quoted\""},
                {"none", Json::array()},
                {"some",
                 Json::array({1,
                              Json::object(),
                              {{"nested", {{"a", Json::array({1, 2})}, {"b", Json::object()}}}, {"last", nullptr}}})},
                {"end", true}};
    }

    std::string text;
};

TEST_F(JsonWriterTest, IndentsAsAWholeDocumentIsIndented) {
    JsonWriter writer = writerOf(JsonWriter::Style::Indented);
    writeExample(writer);
    EXPECT_EQ(text, example().dump(2));
    EXPECT_EQ(writer.depth(), 0U);
}

TEST_F(JsonWriterTest, WritesNumbersInTheFewestDigits) {
    // The serializer alone writes one digit more.
    for (const char* number : {"16999.21443197597", "-7986.262166464448", "6219.204567222891"})
        EXPECT_EQ(Zulm::jsonLine(Json(std::strtod(number, nullptr))), number);
    for (const char* number : {"0.1", "1.0", "-0.0", "1e+300", "5e-324", "1.7976931348623157e+308", "100000000000000.0",
                               "0.30000000000000004", "1.2345678901234568e-05"})
        EXPECT_EQ(Zulm::jsonLine(Json(std::strtod(number, nullptr))), number);
    EXPECT_EQ(Zulm::jsonLine(18364758544493064720U), "18364758544493064720");
}

TEST_F(JsonWriterTest, LeavesNumbersInTextsAlone) {
    const Json document{{"1.00000000000000000000", "a\\\"1.00000000000000000000"}, {"b", {16999.21443197597, "\\"}}};
    EXPECT_EQ(Zulm::jsonLine(document), R"({"1.00000000000000000000":"a\\\"1.00000000000000000000",)"
                                        R"("b":[16999.21443197597,"\\"]})");
}

TEST_F(JsonWriterTest, WritesElementsInLines) {
    JsonWriter writer = writerOf(JsonWriter::Style::Lines);
    writeExample(writer);
    EXPECT_EQ(Json::parse(text), example());
    EXPECT_EQ(text, "{\"name\":\"line\\nend \\\"quoted\\\"\",\"none\":[],\"some\":[\n1,\n{},\n"
                    "{\"nested\":{\"a\":[1,2],\"b\":{}},\"last\":null}],\"end\":true}");
}

TEST_F(JsonWriterTest, ShowsBytesThatAreNotUTF8) {
    JsonWriter writer = writerOf(JsonWriter::Style::Lines);
    writer.beginObject();
    writer.member("\xff", "a\xff");
    writer.end();
    EXPECT_EQ(text, "{\"\xef\xbf\xbd\":\"a\xef\xbf\xbd\"}");
}

TEST_F(JsonWriterTest, EndsWhatIsOpenWhenAReportEnds) {
    JsonWriter writer = writerOf(JsonWriter::Style::Indented);
    Zulm::beginReport(writer, "test");
    writer.beginObject();
    writer.member("path", "a.mp4");
    writer.beginArray("streams");
    writer.beginObject();
    Zulm::endReport(writer, {{"a.mp4", "cannot be read"}, {"b\xff.mp4", "no such file"}});
    const Json report = Json::parse(text);
    EXPECT_EQ(report["schema"], "zulm.test");
    EXPECT_EQ(report["files"], Json::parse(R"([{"path": "a.mp4", "streams": [{}]}])"));
    EXPECT_EQ(report["errors"][0], Json::parse(R"({"path": "a.mp4", "message": "cannot be read"})"));
    EXPECT_EQ(report["errors"][1]["path_base64"], "Yv8ubXA0");
}

} // namespace

} // namespace ZULMetaData::Test
