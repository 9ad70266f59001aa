#pragma once

// The invalid recordings in Tests/Data/invalid, and what must be found in each.

#include <compare>
#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

struct ExpectedFinding {
    std::string code;
    std::uint64_t offset = 0;

    friend auto operator<=>(const ExpectedFinding&, const ExpectedFinding&) = default;
    friend bool operator==(const ExpectedFinding&, const ExpectedFinding&) = default;
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
