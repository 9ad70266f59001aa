// Every invalid recording is found out by the validator, and survived by everything that reads or changes files.

#include "Tests/Support/InvalidCorpus.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "ZULMetaData/ZULMetaData.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <stdexcept>
#include <tuple>

namespace ZULMetaData::Test {
namespace {

/// The reader believes the sizes of texts, and a size below 8 wraps around: these would fill gigabytes.
const std::set<std::string> s_believedSizes{
    "text-size-0.dat",     "text-size-7.dat",      "text-size-4-gib.dat",
    "text-size-2-gib.dat", "list-text-size-7.dat", "list-text-size-4-gib.dat",
};

struct InvalidCorpus : testing::Test {
    TemporaryFolder folder;

    std::string copyOf(const InvalidFile& file) const {
        const std::string copy = folder / file.name;
        std::filesystem::copy_file(file.path, copy, std::filesystem::copy_options::overwrite_existing);
        return copy;
    }
};

std::vector<ExpectedFinding> sorted(std::vector<ExpectedFinding> findings) {
    std::sort(findings.begin(), findings.end());
    return findings;
}

std::vector<ExpectedFinding> found(const std::string& path) {
    std::vector<ExpectedFinding> findings;
    for (const Finding& finding : validateRecording(path).allFindings())
        findings.push_back({std::string(ruleOf(finding.code).name), finding.offset});
    return sorted(std::move(findings));
}

TEST_F(InvalidCorpus, HoldsManySmallFilesAndNoOthers) {
    const auto files = invalidCorpus();
    EXPECT_GE(files.size(), 60U);
    std::set<std::string> names{"README.md", "expected.tsv", "make.py"};
    for (const InvalidFile& file : files) {
        names.insert(file.name);
        EXPECT_LT(std::filesystem::file_size(file.path), 4096U) << file.name;
    }
    for (const auto& entry : std::filesystem::directory_iterator(std::filesystem::path(files[0].path).parent_path()))
        EXPECT_TRUE(names.contains(entry.path().filename().string())) << entry.path();
}

TEST_F(InvalidCorpus, IsFoundOutFileByFileWithExactlyTheExpectedFindings) {
    for (const InvalidFile& file : invalidCorpus()) {
        EXPECT_EQ(found(file.path), sorted(file.findings)) << file.name;
        EXPECT_TRUE(validateRecording(file.path).isDamaged()) << file.name;
    }
}

TEST_F(InvalidCorpus, ShowsEveryKindOfDamage) {
    std::set<std::string> shown;
    for (const InvalidFile& file : invalidCorpus())
        shown.insert(file.findings.front().code);
    shown.insert("unreachable-stream"); // only ever a consequence
    for (const FindingRule& rule : s_findingRules)
        EXPECT_EQ(shown.contains(std::string(rule.name)), rule.severity == Severity::Damage) << rule.name;
}

template <class Parser>
void readWith(const std::string& path) {
    try {
        Parser(path).read();
    } catch (const std::invalid_argument&) { // a text that is not UTF-8
    } catch (const std::out_of_range&) {     // system data that lacks texts
    }
}

TEST_F(InvalidCorpus, IsSurvivedByEveryParser) {
    const auto readWithAll = [](const std::string& path) {
        std::apply(
            [&](const auto&... samples) {
                (readWith<typename std::remove_cvref_t<decltype(samples)>::Parser>(path), ...);
            },
            EveryKind{});
    };
    for (const InvalidFile& file : invalidCorpus())
        if (!s_believedSizes.contains(file.name)) {
            EXPECT_NO_THROW(readWithAll(file.path)) << file.name;
        }
}

TEST_F(InvalidCorpus, IsSurvivedByWhatLooksIntoContainers) {
    for (const InvalidFile& file : invalidCorpus()) {
        const auto parser = MetaDataParser::create(file.path);
        ASSERT_TRUE(parser) << file.name;
        std::map<uuid, std::string> streams;
        parser->loadAllData(streams);
        for (const auto& [type, bytes] : streams)
            EXPECT_LE(bytes.size(), std::filesystem::file_size(file.path)) << file.name;
        readRecordingInfo(*parser);
        topLevelItems(ByteSource::stream(parser->getStream()), parser->getStreamType());
        Util::recordingScaleForMP4AtPath(file.path);
    }
}

TEST_F(InvalidCorpus, IsSurvivedByRepair) {
    for (const InvalidFile& file : invalidCorpus()) {
        const std::string copy = copyOf(file);
        const auto size = std::filesystem::file_size(copy);
        const bool isWhole = ZULMAtomRepair::finalizeAtomsInFile(copy);
        EXPECT_EQ(std::filesystem::file_size(copy), size) << file.name;
        if (isWhole) {
            const std::string repaired = contentsOf(copy);
            EXPECT_TRUE(ZULMAtomRepair::finalizeAtomsInFile(copy)) << file.name;
            EXPECT_EQ(contentsOf(copy), repaired) << file.name;
        }
    }
}

TEST_F(InvalidCorpus, IsSurvivedByAnAppendToIt) {
    const std::string stream = folder / "Good.dat";
    writeFile(stream, locationStream());
    for (const InvalidFile& file : invalidCorpus()) {
        const std::string before = contentsOf(file.path);
        const std::string copy = copyOf(file);
        ZULMAtomWriter().writeMetaDataFiles({stream}, copy);
        EXPECT_EQ(contentsOf(copy).size(), before.size() + 16 + 16 + locationStream().size()) << file.name;
        validateRecording(copy);
    }
}

TEST_F(InvalidCorpus, IsSurvivedByAnAppendOfIt) {
    const std::string movie = folder / "Movie.mp4";
    for (const InvalidFile& file : invalidCorpus()) {
        writeFile(movie, media());
        try {
            MP4MetaData::appendMetaDataFiles(movie, {file.path});
        } catch (const std::runtime_error& error) {
            EXPECT_STREQ(error.what(), "Got an entry size of 0") << file.name;
        }
        EXPECT_LE(contentsOf(movie).size(), media().size() + 16 + 16 + std::filesystem::file_size(file.path));
        EXPECT_NO_THROW(validateRecording(movie)) << file.name;
    }
}

} // namespace
} // namespace ZULMetaData::Test
