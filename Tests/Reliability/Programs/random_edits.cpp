// random_edits FIRST COUNT: retimes COUNT small recordings that are made of the numbers from FIRST on, and compares
// every stream with what a slow and obvious computation makes of it. Prints the number of cases, and on standard error
// what does not hold.

#include "Tests/ZULMetaDataSession/RandomEdits.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <string>

using ZULMetaData::Test::RandomEdits;

namespace {

std::string differenceOf(std::uint64_t seed) {
    try {
        return RandomEdits(seed).difference();
    } catch (const std::exception& error) {
        return error.what();
    }
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 3)
        return 2;
    const std::uint64_t first = std::strtoull(argv[1], nullptr, 10);
    const std::uint64_t count = std::strtoull(argv[2], nullptr, 10);
    for (std::uint64_t seed = first; seed < first + count; ++seed)
        if (const std::string difference = differenceOf(seed); !difference.empty())
            std::fprintf(stderr, "random edit %llu: %s\n", static_cast<unsigned long long>(seed), difference.c_str());
    std::printf("%llu\n", static_cast<unsigned long long>(count));
}
