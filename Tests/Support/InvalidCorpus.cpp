#include "Tests/Support/InvalidCorpus.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>

namespace ZULMetaData::Test {

namespace {

ExpectedFinding findingFrom(const std::string& word) {
    const std::size_t at = word.find('@');
    return {word.substr(0, at), std::stoull(word.substr(at + 1))};
}

} // namespace

std::vector<InvalidFile> invalidCorpus() {
    const std::filesystem::path folder = ZULM_INVALID_CORPUS;
    std::vector<InvalidFile> files;
    std::ifstream table(folder / "expected.tsv");
    for (std::string line; std::getline(table, line);) {
        std::istringstream words(line);
        InvalidFile file;
        words >> file.name;
        file.path = (folder / file.name).string();
        for (std::string word; words >> word;)
            file.findings.push_back(findingFrom(word));
        files.push_back(file);
    }
    EXPECT_FALSE(files.empty()) << folder;
    return files;
}

} // namespace ZULMetaData::Test
