#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>

namespace ZULMetaData::Test {

namespace {

std::filesystem::path newFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "zulm-test-XXXXXX").string();
    if (!mkdtemp(pattern.data()))
        throw std::filesystem::filesystem_error("no temporary folder", pattern, std::error_code());
    return pattern;
}

} // namespace

TemporaryFolder::TemporaryFolder() : path_(newFolder()) {}

TemporaryFolder::~TemporaryFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

std::vector<std::string> namesIn(const std::filesystem::path& folder) {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(folder))
        names.push_back(entry.path().filename());
    std::sort(names.begin(), names.end());
    return names;
}

std::string contentsOf(const std::filesystem::path& file) {
    std::ifstream stream(file, std::ios::binary);
    EXPECT_TRUE(stream.is_open()) << file;
    return {std::istreambuf_iterator<char>(stream), std::istreambuf_iterator<char>()};
}

void writeFile(const std::filesystem::path& file, const std::string& contents) {
    std::ofstream stream(file, std::ios::binary | std::ios::trunc);
    stream << contents;
    stream.close();
    ASSERT_TRUE(stream.good()) << file;
}

void writeSparseFile(const std::filesystem::path& file, std::uint64_t size, const std::string& head,
                     const std::string& tail) {
    writeFile(file, head);
    std::filesystem::resize_file(file, size);
    std::fstream stream(file, std::ios::binary | std::ios::in | std::ios::out);
    stream.seekp(static_cast<std::streamoff>(size - tail.size()));
    stream << tail;
    stream.close();
    ASSERT_TRUE(stream.good()) << file;
}

std::string outputOf(const std::string& command) {
    std::string output;
    FILE* pipe = popen(command.c_str(), "r");
    std::array<char, 4096> piece;
    for (std::size_t size; (size = std::fread(piece.data(), 1, piece.size(), pipe)) > 0;)
        output.append(piece.data(), size);
    EXPECT_EQ(pclose(pipe), 0) << command;
    return output;
}

} // namespace ZULMetaData::Test
