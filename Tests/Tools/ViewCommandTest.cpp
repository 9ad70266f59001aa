// The pages that `zulm view` writes, with a small page in place of the built-in one.

#include "Tests/Support/Bytes.h"
#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <zlib.h>

#include <filesystem>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::ordered_json;
using testing::EndsWith;
using testing::HasSubstr;
using testing::StartsWith;

const std::string s_front = "<!doctype html>\n<html><head><title>Page</title>\n";
const std::string s_back = "</head><body>&lt;/head&gt;</body></html>\n";
const std::string s_element = "<script type=\"application/json\" id=\"zulm-recording\">";
const std::string s_metaData = "<script type=\"text/plain\" id=\"zulm-metadata\">";
const std::string s_elementEnd = "</script>\n";

std::string decoded(const std::string& base64) {
    const TemporaryFolder folder;
    writeFile(folder / "text", base64);
    return outputOf("base64 -d '" + (folder / "text") + "'");
}

/// What a browser makes of packed bytes.
std::string unpacked(const std::string& packed, std::size_t size) {
    std::string bytes(size, '\0');
    uLongf length = bytes.size();
    EXPECT_EQ(uncompress(reinterpret_cast<Bytef*>(bytes.data()), &length, reinterpret_cast<const Bytef*>(packed.data()),
                         packed.size()),
              Z_OK);
    EXPECT_EQ(length, size);
    for (std::size_t i = 16; i < bytes.size(); ++i)
        bytes[i] = static_cast<char>(bytes[i] + bytes[i - 16]);
    return bytes;
}

class ViewCommand : public RecordedSession {
protected:
    void SetUp() override { writeFile(page(), s_front + s_back); }

    std::string page() const { return folder / "page.html"; }
    std::string output() const { return folder / "out.html"; }

    ToolResult view(const std::string& file, std::vector<std::string> further = {}) const {
        std::vector<std::string> arguments{"view", file, "-o", output(), "--page", page()};
        arguments.insert(arguments.end(), further.begin(), further.end());
        return runTool(arguments);
    }

    /// What is inside of the page that was written, between the parts of the small one.
    static Json recordingIn(const std::string& file) {
        const std::string written = contentsOf(file);
        EXPECT_THAT(written, StartsWith(s_front + s_element));
        EXPECT_THAT(written, EndsWith(s_elementEnd + s_back));
        const std::size_t start = s_front.size() + s_element.size();
        const std::string text = written.substr(start, written.find(s_elementEnd + s_metaData) - start);
        EXPECT_EQ(text.find('<'), std::string::npos);
        return Json::parse(text);
    }

    /// The metadata in the page that was written, as a file.
    static std::string metaDataIn(const std::string& file) {
        const std::string written = contentsOf(file);
        const std::size_t start = written.find(s_metaData) + s_metaData.size();
        const std::string text = written.substr(start, written.find(s_elementEnd, start) - start);
        return unpacked(decoded(text), recordingIn(file).at("metadata_size"));
    }

    Json viewed(const std::string& file, std::vector<std::string> further = {}) const {
        const ToolResult result = view(file, std::move(further));
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        EXPECT_EQ(result.output, "");
        return recordingIn(output());
    }

    /// As the page has it: nobody is told where the recording lay.
    Json reportOf(const std::string& command, const std::string& file) const {
        Json report = Json::parse(runTool({command, "--json", file}).output).at("files").at(0);
        report["path"] = std::filesystem::path(file).filename().string();
        return report;
    }
};

TEST_F(ViewCommand, PutsWhatIsKnownOfARecordingIntoThePage) {
    const Json recording = viewed(movie());
    EXPECT_EQ(recording.at("schema"), "zulm.view");
    EXPECT_EQ(recording.at("schema_version"), 2);
    EXPECT_EQ(recording.at("name"), std::filesystem::path(movie()).filename().string());
    EXPECT_EQ(recording.at("info"), reportOf("info", movie()));
    EXPECT_EQ(recording.at("verify"), reportOf("verify", movie()));
}

TEST_F(ViewCommand, HasItsOwnPageOrSaysHowToGetIt) {
    const ToolResult result = runTool({"view", movie(), "-o", output()});
    if (ZULM_HAS_PAGE) {
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        const std::string written = contentsOf(output());
        EXPECT_LT(written.find("Content-Security-Policy"), written.find(s_element));
        EXPECT_LT(written.find(s_element), written.find("</head>"));
    } else {
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_THAT(result.errors, HasSubstr("was built without the viewer's page, for which emscripten and npm are"));
        EXPECT_FALSE(std::filesystem::exists(output()));
    }
}

TEST_F(ViewCommand, PutsTheMetaDataInAsAFileThatReadsTheSame) {
    const std::string excerpt = folder / "excerpt.mp4";
    viewed(movie());
    writeFile(excerpt, metaDataIn(output()));
    const auto entriesOf = [](const std::string& file) {
        return Json::parse(runTool({"dump", "--format", "json", file}).output).at("files").at(0).at("streams");
    };
    EXPECT_EQ(entriesOf(excerpt), entriesOf(movie()));
    EXPECT_EQ(reportOf("info", excerpt).at("creators"), reportOf("info", movie()).at("creators"));
    EXPECT_LT(contentsOf(excerpt).size(), contentsOf(movie()).size());
}

TEST_F(ViewCommand, NamesTheMovieFromThePagesFolder) {
    std::filesystem::create_directories(folder / "movies/Größe & 100%");
    const std::string odd = folder / "movies/Größe & 100%/a:b #1?.mp4";
    std::filesystem::copy_file(movie(), odd);
    EXPECT_EQ(viewed(odd).at("movie"), "movies/Gr%C3%B6%C3%9Fe%20%26%20100%25/a%3Ab%20%231%3F.mp4");
    std::filesystem::create_directories(folder / "pages/new");
    const ToolResult below = runTool({"view", odd, "-o", folder / "pages/new/out.html", "--page", page()});
    EXPECT_EQ(below.exitCode, 0) << below.errors;
    EXPECT_EQ(recordingIn(folder / "pages/new/out.html").at("movie"),
              "../../movies/Gr%C3%B6%C3%9Fe%20%26%20100%25/a%3Ab%20%231%3F.mp4");
}

TEST_F(ViewCommand, NamesTheMovieFromTheFolderItRunsIn) {
    const std::string copy = copyOf(movie(), "Recording.mp4");
    ToolOptions options;
    options.folder = folder.path();
    const ToolResult result = runTool({"view", "Recording.mp4", "-o", "out.html", "--page", "page.html"}, options);
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(recordingIn(output()).at("movie"), "Recording.mp4");
}

TEST_F(ViewCommand, ShowsStreamsWithoutAMovie) {
    EXPECT_EQ(viewed(streamFile("cursorLocation")).at("movie"), nullptr);
    ToolOptions options;
    options.input = contentsOf(movie());
    const ToolResult result = runTool({"view", "-", "-o", output(), "--page", page(), "--force"}, options);
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    const Json recording = recordingIn(output());
    EXPECT_EQ(recording.at("movie"), nullptr);
    EXPECT_EQ(recording.at("name"), "-");
}

TEST_F(ViewCommand, EmbedsTheMovieWithAWarning) {
    const ToolResult result = view(movie(), {"--embed"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_THAT(result.errors, HasSubstr("zulm: warning: " + output() + ": the movie of "));
    const std::string address = recordingIn(output()).at("movie");
    const std::string start = "data:video/mp4;base64,";
    ASSERT_THAT(address, StartsWith(start));
    EXPECT_EQ(decoded(address.substr(start.size())), contentsOf(movie()));
}

TEST_F(ViewCommand, EmbedsMoviesOfAnySizeInOnePiece) {
    const std::string large = folder / "large.mp4";
    writeFile(large, movieWith(extendedAtom("DATA", locations())) + atom("free", std::string((3 << 18) + 1, '\xff')));
    const std::string address = viewed(large, {"--embed"}).at("movie");
    EXPECT_EQ(decoded(address.substr(address.find(',') + 1)), contentsOf(large));
}

TEST_F(ViewCommand, RefusesToEmbedWhatNoBrowserWouldOpen) {
    const std::string huge = folder / "huge.mp4";
    const std::string metaData = movieWith(extendedAtom("DATA", locations())).substr(tinyMovie().size());
    const std::uint64_t media = std::uint64_t{400} << 20;
    writeSparseFile(huge, media + metaData.size(), be32(static_cast<std::uint32_t>(media)) + "mdat", metaData);
    const ToolResult result = view(huge, {"--embed"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("too much to embed"));
    EXPECT_FALSE(std::filesystem::exists(output()));
    EXPECT_EQ(viewed(huge).at("movie"), "huge.mp4");
}

TEST_F(ViewCommand, RefusesToEmbedAStreamAlone) {
    const ToolResult result = view(streamFile("cursorLocation"), {"--embed"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("without a movie to embed"));
}

TEST_F(ViewCommand, ReplacesNothingUnasked) {
    writeFile(output(), "mine");
    const ToolResult result = view(movie());
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.errors, "zulm: " + output() + ": exists already; --force replaces it\n");
    EXPECT_EQ(contentsOf(output()), "mine");
    EXPECT_EQ(view(movie(), {"--force"}).exitCode, 0);
    EXPECT_THAT(contentsOf(output()), HasSubstr("zulm.view"));
}

TEST_F(ViewCommand, NeverReplacesItsInputs) {
    const std::string copy = copyOf(movie(), "Recording.mp4");
    EXPECT_EQ(runTool({"view", copy, "-o", copy, "--page", page(), "--force"}).exitCode, 1);
    EXPECT_EQ(contentsOf(copy), contentsOf(movie()));
    EXPECT_EQ(runTool({"view", copy, "-o", page(), "--page", page(), "--force"}).exitCode, 1);
    EXPECT_EQ(contentsOf(page()), s_front + s_back);
}

TEST_F(ViewCommand, LeavesNothingBehindWhereThePageCannotBeWritten) {
    EXPECT_EQ(runTool({"view", movie(), "-o", folder / "none/out.html", "--page", page()}).exitCode, 1);
    writeFile(page(), "no page");
    const ToolResult result = view(movie());
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.errors, "zulm: " + page() +
                                 ": is not a page of the viewer, since it has no </head>; "
                                 "name the page that zulm was built with\n");
    EXPECT_FALSE(std::filesystem::exists(output()));
}

TEST_F(ViewCommand, RefusesAPageThatHoldsARecording) {
    ASSERT_EQ(view(movie()).exitCode, 0);
    std::filesystem::rename(output(), page());
    const ToolResult result = view(movie());
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(result.errors, "zulm: " + page() +
                                 ": holds a recording already; name the page that zulm was built with, "
                                 "or leave out --page\n");
    EXPECT_FALSE(std::filesystem::exists(output()));
}

TEST_F(ViewCommand, SaysThatThereIsNothingToShow) {
    writeFile(folder / "plain.mp4", tinyMovie());
    const ToolResult result = view(folder / "plain.mp4");
    EXPECT_EQ(result.exitCode, 4);
    EXPECT_FALSE(std::filesystem::exists(output()));
}

TEST_F(ViewCommand, ShowsWhatCanBeReadOfADamagedRecording) {
    writeFile(folder / "torn.dat", locations() + "1234");
    const ToolResult result = view(folder / "torn.dat");
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("is damaged"));
    EXPECT_EQ(recordingIn(output()).at("verify").at("damaged"), true);
}

TEST_F(ViewCommand, KeepsTextsFromEndingTheElement) {
    const std::string name = folder / "a<script>b.dat";
    writeFile(name, locations());
    EXPECT_EQ(viewed(name).at("name"), "a<script>b.dat"); // and no < is in the text of the element
}

} // namespace
} // namespace ZULMetaData::Test
