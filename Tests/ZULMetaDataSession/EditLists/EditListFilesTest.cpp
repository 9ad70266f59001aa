#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataSession/EditListTexts.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

constexpr const char* s_own = R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [{"start": 1, "end": 2}]})";

EditListOptions inForm(EditListFormat format) {
    EditListOptions options;
    options.format = format;
    return options;
}

TEST(EditListFiles, KnowsAListByItsContents) {
    EXPECT_THAT(piecesOf(s_own, "a"), ElementsAre("1-2@1=1"));
    EXPECT_THAT(piecesOf(s_own, "a.csv"), ElementsAre("1-2@1=1"));
    EXPECT_THAT(piecesOf(std::string("\xef\xbb\xbf \n") + s_own, "a.txt"), ElementsAre("1-2@1=1"));
    EXPECT_THAT(piecesOf("ffconcat version 1.0\nfile a\noutpoint 1\n", "a.edl"), ElementsAre("0-1@1=1"));
    EXPECT_THAT(piecesOf("{version: 1, cutSegments: []}", "a.json"), IsEmpty());
    EXPECT_THAT(piecesOf(R"({"version": "1", "source": "", "chunks": []})", "a", atFrameRate(30)), IsEmpty());
    EXPECT_THAT(piecesOf(R"({"OTIO_SCHEMA": "Timeline.1", "tracks": {"OTIO_SCHEMA": "Stack.1", "children": []}})", "a"),
                IsEmpty());
    EXPECT_THAT(piecesOf("001 A V C 00:00:00:00 00:00:01:00 00:00:00:00 00:00:01:00", "a", atFrameRate(25)),
                ElementsAre("0-1@1=1"));
    EXPECT_THAT(piecesOf("1,2,a", "a"), ElementsAre("1-2@1=1"));
}

TEST(EditListFiles, KnowsAListByItsNameIfTheContentsSayNothing) {
    EXPECT_THAT(piecesOf(",,\n", "A.CSV", ofDuration(5)), ElementsAre("0-5@1=5"));
    EXPECT_THAT(piecesOf("// mine\n{version: 1, cutSegments: [{end: 1}]}", "a.LLC"), ElementsAre("0-1@1=1"));
    EXPECT_THAT(piecesOf("* FROM SOMEWHERE\n", "a.edl", atFrameRate(25)),
                ElementsAre("a.edl: the list has no events of pictures"));
}

TEST(EditListFiles, RefusesEveryOtherFile) {
    for (const char* contents : {"", " \n", "hello", "{}", "[]", "{\"a\": 1}", "\0\1\2", "RIFF"})
        EXPECT_THAT(piecesOf(contents, "a.txt"), ElementsAre(StartsWith("a.txt: this is no edit list of a known form")))
            << contents;
    EXPECT_THAT(piecesOf("{", "a.txt"), ElementsAre("a.txt: at 1: the document is cut short"));
    EXPECT_THAT(piecesOf(R"({"schema": "zulm.edits", "cutSegments": []})", "a.json"),
                ElementsAre("a.json: the document could be edit lists of several forms; name the one that it has"));
}

TEST(EditListFiles, TakesOurOwnFormAsStrictly) {
    EXPECT_THAT(piecesOf(R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [],})", "a.json"),
                ElementsAre("a.json: at 59: the name of a member is missing"));
    EXPECT_THAT(piecesOf("{schema: 'zulm.edits'}", "a.json"),
                ElementsAre(HasSubstr("the name of a member is missing")));
}

TEST(EditListFiles, ReadsTheFormThatTheCallerNames) {
    EXPECT_THAT(piecesOf(s_own, "a", inForm(EditListFormat::Own)), ElementsAre("1-2@1=1"));
    EXPECT_THAT(piecesOf(s_own, "a", inForm(EditListFormat::LosslessCut)), ElementsAre("a: \"version\" is missing"));
    EXPECT_THAT(piecesOf(s_own, "a", inForm(EditListFormat::AutoEditor)), ElementsAre("a: \"version\" is missing"));
    EXPECT_THAT(piecesOf(s_own, "a", inForm(EditListFormat::OpenTimeline)),
                ElementsAre("a: a timeline is no Timeline"));
    EXPECT_THAT(piecesOf(s_own, "a", inForm(EditListFormat::Concat)), ElementsAre(StartsWith("a: line 1: ")));
    EXPECT_THAT(piecesOf(s_own, "a", inForm(EditListFormat::CMX3600)),
                ElementsAre(StartsWith("a: an edit decision list")));
    EXPECT_THAT(piecesOf(s_own, "a", inForm(EditListFormat::CutTable)), ElementsAre(StartsWith("a: row 1: ")));
    EXPECT_THAT(piecesOf(s_own, "a", inForm(EditListFormat::MovieEditList)), ElementsAre("a: the movie has no header"));
}

TEST(EditListFiles, OpensAFile) {
    const TemporaryFolder folder;
    writeFile(folder / "a.json", s_own);
    EXPECT_THAT(textsOf(EditList::open(folder / "a.json")), ElementsAre("1-2@1=1"));
    EXPECT_EQ(errorOf([&] { EditList::open(folder / "none.json"); }),
              folder / "none.json" + ": cannot be opened: No such file or directory");
    EXPECT_THAT(errorOf([&] { EditList::open(folder.path()); }), StartsWith(folder.path().string() + ": "));
}

TEST(EditListFiles, RefusesFilesThatAreTooLarge) {
    const ByteSource large((64 << 20) + 1, [](std::uint64_t, std::span<char> bytes) {
        std::fill(bytes.begin(), bytes.end(), 'x');
        return bytes.size();
    });
    EXPECT_EQ(errorOf([&] { EditList::open(large, "a.csv"); }),
              "a.csv: the file is larger than 64 MiB; no edit list is");
}

TEST(EditListFiles, CutsLongTextsShortInMessages) {
    const std::string error = piecesOf("file " + std::string(1 << 20, 'x') + " y\n", "a.ffconcat").front();
    EXPECT_THAT(error, HasSubstr("something follows: \"y\""));
    const std::string other =
        piecesOf(std::string("file a\noutpoint 1\nfile ") + std::string(1 << 20, 'x') + '\n', "a").front();
    EXPECT_THAT(other, HasSubstr("xxx...\""));
    EXPECT_LT(other.size(), 300u);
}

} // namespace
} // namespace ZULMetaData::Test
