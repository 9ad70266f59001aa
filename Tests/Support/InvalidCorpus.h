#pragma once

// The invalid recordings in Tests/Data/invalid, and what must be found in each.

#include <cstdint>
#include <ostream>
#include <string>
#include <tuple>
#include <vector>

namespace ZULMetaData::Test {

struct ExpectedFinding {
    std::string code;
    std::uint64_t offset = 0;

    friend bool operator==(const ExpectedFinding&, const ExpectedFinding&) = default;
    friend bool operator<(const ExpectedFinding& left, const ExpectedFinding& right) {
        return std::tie(left.code, left.offset) < std::tie(right.code, right.offset);
    }
    friend void PrintTo(const ExpectedFinding& finding, std::ostream* out) {
        *out << finding.code << '@' << finding.offset;
    }
};

struct InvalidFile {
    std::string name;
    std::string path;
    std::vector<ExpectedFinding> findings; ///< what the file is about first
};

/// Fails the test where the corpus cannot be read.
std::vector<InvalidFile> invalidCorpus();

} // namespace ZULMetaData::Test
