// What the JSON documents of all commands have in common: they are whole whatever happens, say what went wrong, and are
// written as they come.

#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

#include <filesystem>

namespace ZULMetaData::Test {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::StartsWith;

class JsonReport : public RecordedSession {
protected:
    std::string written(const std::string& name, const std::string& bytes) const {
        writeFile(folder / name, bytes);
        return folder / name;
    }

    /// The errors of the document that the tool prints, after a run that ends with `exitCode`.
    static json errorsOf(const std::vector<std::string>& arguments, int exitCode) {
        const ToolResult result = runTool(arguments);
        EXPECT_EQ(result.exitCode, exitCode) << result.errors;
        const json document = json::parse(result.output, nullptr, false);
        EXPECT_TRUE(document.is_object()) << arguments.front() << '\n' << result.output;
        return document.is_object() ? document.at("errors") : json();
    }

    static void expectError(const std::vector<std::string>& arguments, int exitCode, const std::string& path,
                            const std::string& message) {
        const json errors = errorsOf(arguments, exitCode);
        ASSERT_EQ(errors.size(), 1U) << arguments.front() << '\n' << errors;
        EXPECT_EQ(errors[0].at("path"), path);
        EXPECT_THAT(errors[0].at("message").get<std::string>(), StartsWith(message));
    }

    /// In kilobytes.
    long memoryOf(const std::vector<std::string>& arguments, int exitCode) const {
        ToolOptions options;
        options.environment = {{"ASAN_OPTIONS", "quarantine_size_mb=1"}};
        options.folder = folder.path().string();
        const ToolResult result = runTool(arguments, options);
        EXPECT_EQ(result.exitCode, exitCode) << result.errors;
        EXPECT_TRUE(json::accept(result.output)) << arguments.front();
        return result.peakMemoryKB;
    }

    /// Fails if the second run needs more memory than the first, which does less.
    void expectNoMoreMemory(const std::vector<std::string>& little, const std::vector<std::string>& much,
                            int exitCode) const {
        const long few = memoryOf(little, exitCode);
        EXPECT_LT(memoryOf(much, exitCode) - few, 8192) << much.front();
    }

    static std::string manyLocations(int count, int x) {
        std::string stream = streamHeader("2b7b6af2", 1, 16);
        for (int i = 0; i < count; ++i)
            stream += pointEntry(i, x, i);
        return stream;
    }
};

TEST_F(JsonReport, SaysThatAFileCannotBeOpened) {
    const std::string none = folder / "none.mp4";
    const std::string out = folder / "out.mp4";
    for (const auto& arguments :
         std::vector<std::vector<std::string>>{{"info", none},
                                               {"verify", none},
                                               {"atoms", none},
                                               {"grep", "a", none},
                                               {"state", none, "--at", "1"},
                                               {"dump", "--format", "json", none},
                                               {"diff", none, movie()},
                                               {"diff", movie(), none},
                                               {"extract", none, "-o", folder / "streams"},
                                               {"salvage", none, "-o", folder / "streams"},
                                               {"attach", none, streamFile("cpuUsage"), "-o", out},
                                               {"attach", movie(), none, "-o", out},
                                               {"stamp", none, "--creator", "a", "--creator-version", "1", "-o", out},
                                               {"repair", "--dry-run", none},
                                               {"redact", none, "-o", out, "--keys"}}) {
        std::vector<std::string> withJson = arguments;
        if (arguments.front() != "dump")
            withJson.emplace_back("--json");
        SCOPED_TRACE(arguments.front());
        expectError(withJson, 1, none, "no such file");
    }
}

TEST_F(JsonReport, SaysThatThereIsNothing) {
    const std::string plain = written("plain.mp4", tinyMovie());
    const std::string message = "has no recording metadata";
    expectError({"info", "--json", plain}, 4, plain, message);
    expectError({"verify", "--json", plain}, 4, plain, message);
    expectError({"dump", "--format", "json", plain}, 4, plain, message);
    expectError({"extract", "--json", plain, "-o", folder / "streams"}, 4, plain, message);
    expectError({"salvage", "--json", plain, "-o", folder / "streams"}, 4, plain, "no metadata streams");
    expectError({"redact", "--json", plain, "-o", folder / "out.mp4", "--keys"}, 4, plain, message);
    expectError({"attach", "--json", plain, "--from", plain, "-o", folder / "out.mp4"}, 4, plain, "no recording");
    expectError({"state", "--json", plain, "--at", "1"}, 4, plain, message);
    expectError({"grep", "--json", "nowhere at all", movie()}, 4, movie(), "no text in it matches");
    EXPECT_EQ(errorsOf({"diff", "--json", plain, plain}, 4).size(), 2U);
    expectError({"dump", "--format", "json", "--stream", "systemData", streamFile("cpuUsage")}, 4,
                streamFile("cpuUsage"), "has no stream systemData");
}

TEST_F(JsonReport, HasNoErrorsIfAllIsFine) {
    EXPECT_EQ(errorsOf({"info", "--json", movie()}, 0), json::array());
    EXPECT_EQ(errorsOf({"dump", "--format", "json", movie()}, 0), json::array());
    EXPECT_EQ(errorsOf({"state", "--json", movie(), "--at", "1"}, 0), json::array());
    EXPECT_EQ(errorsOf({"grep", "--json", "README", movie(), streamFile("topmostWindowTitle")}, 0), json::array());
}

TEST_F(JsonReport, GoesOnAfterAFileThatCannotBeRead) {
    const std::string none = folder / "none.mp4";
    for (const std::string command : {"info", "verify", "atoms"}) {
        const json document = json::parse(runTool({command, "--json", none, movie()}).output);
        EXPECT_EQ(document.at("files").size(), 1U) << command;
        EXPECT_EQ(document.at("files")[0].at("path"), movie());
        EXPECT_EQ(document.at("errors").size(), 1U);
    }
}

TEST_F(JsonReport, SaysWhatElseIsComplainedOf) {
    const std::string output = written("exists.mp4", "");
    expectError({"redact", "--json", movie(), "-o", output, "--keys"}, 1, output, "exists already");
    const std::string torn = written("torn.dat", locations() + "1234");
    const std::string none = folder / "none.dat";
    EXPECT_THAT(errorsOf({"diff", "--json", torn, written("other.dat", locations())}, 3).dump(),
                HasSubstr("cannot be read from offset"));
    EXPECT_EQ(errorsOf({"info", "--json", torn}, 3), json::array()); // the findings are in the file's object
}

TEST_F(JsonReport, KeepsTheBytesOfNamesThatAreNotUTF8) {
    const json errors = errorsOf({"info", "--json", folder / "na\xff.mp4"}, 1);
    EXPECT_THAT(errors.at(0).at("path").get<std::string>(), testing::EndsWith("/na\xef\xbf\xbd.mp4"));
    EXPECT_TRUE(errors.at(0).contains("path_base64"));
}

/// Under an emulator these take minutes, and would count its memory.
class JsonReportMemory : public JsonReport {};

TEST_F(JsonReportMemory, NeedsNoMoreForMoreDifferences) {
    constexpr int many = 100'000;
    for (const int x : {0, 1}) {
        written("few" + std::to_string(x) + ".dat", manyLocations(100, x));
        written("many" + std::to_string(x) + ".dat", manyLocations(many, x));
    }
    expectNoMoreMemory({"diff", "--json", "--limit", "0", "few0.dat", "few1.dat"},
                       {"diff", "--json", "--limit", "0", "many0.dat", "many1.dat"}, 3);
}

TEST_F(JsonReportMemory, NeedsNoMoreForMoreMatches) {
    const auto names = [](int count) {
        std::string stream = streamHeader("2b7b6a06", 1, 0);
        for (int i = 0; i < count; ++i)
            stream += textEntry(i, "window " + std::to_string(i));
        return stream;
    };
    written("few.dat", names(100));
    written("many.dat", names(100'000));
    expectNoMoreMemory({"grep", "--json", "window", "few.dat"}, {"grep", "--json", "window", "many.dat"}, 0);
}

TEST_F(JsonReportMemory, NeedsNoMoreForMoreAtoms) {
    const auto children = [](int count) {
        std::string atoms = extendedAtom("DATA", locations());
        for (int i = 0; i < count; ++i)
            atoms += atom("skip", "");
        return atoms;
    };
    written("few.mp4", movieWith(children(10)));
    written("many.mp4", movieWith(children(100'000)));
    expectNoMoreMemory({"atoms", "--json", "few.mp4"}, {"atoms", "--json", "many.mp4"}, 0);
    expectNoMoreMemory({"info", "--json", "few.mp4"}, {"info", "--json", "many.mp4"}, 3);
}

TEST_F(JsonReportMemory, NeedsNoMoreForMoreFiles) {
    std::vector<std::string> info{"info", "--json"};
    std::vector<std::string> verify{"verify", "--json"};
    copyOf(movie(), "a.mp4");
    for (int i = 0; i < 300; ++i)
        for (std::vector<std::string>* arguments : {&info, &verify})
            arguments->push_back("a.mp4");
    expectNoMoreMemory({"info", "--json", "a.mp4"}, info, 0);
    expectNoMoreMemory({"verify", "--json", "a.mp4"}, verify, 0);
}

} // namespace
} // namespace ZULMetaData::Test
