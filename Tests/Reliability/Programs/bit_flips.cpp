// bit_flips FOLDER PART PARTS RANDOM FILE...: flips every bit of each file, then three bits at random places RANDOM
// times, and does everything with what comes of it. Of the bits, every PARTS-th from the one numbered PART on is its
// own. Prints "CASES DEMANDING", and on standard error what does not hold. The parsers of files take turns.

#include "Tests/Reliability/Programs/Exercise.h"
#include "Tests/Reliability/Programs/Watch.h"

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <initializer_list>
#include <random>
#include <string>
#include <unistd.h>

using namespace Reliability;

namespace {

void flip(std::string& bytes, std::size_t bit) {
    bytes[bit / 8] = static_cast<char>(bytes[bit / 8] ^ 1 << bit % 8);
}

class Flipper {
public:
    Flipper(const std::string& folder, const std::string& file)
        : name_(std::filesystem::path(file).filename().string()), original_(contentsOf(file)),
          exercise_(folder, std::filesystem::path(file).extension().string(), Exercise::InTurn) {}

    void flipEach(std::size_t part, std::size_t parts) {
        for (std::size_t bit = part; bit < bits(); bit += parts)
            run({bit});
    }

    void flipAtRandom(std::uint64_t count, std::mt19937_64& random) {
        std::uniform_int_distribution<std::size_t> anywhere(0, bits() - 1);
        for (; count > 0; --count) {
            const std::size_t first = anywhere(random);
            const std::size_t second = anywhere(random);
            run({first, second, anywhere(random)});
        }
    }

    std::uint64_t cases() const { return cases_; }
    std::uint64_t demanding() const { return exercise_.demanding(); }

private:
    std::size_t bits() const { return original_.size() * 8; }

    void run(std::initializer_list<std::size_t> flipped) {
        std::string bytes = original_;
        std::string name = name_ + ", bits flipped:";
        for (const std::size_t bit : flipped) {
            flip(bytes, bit);
            name += ' ' + std::to_string(bit);
        }
        ++cases_;
        beginCase(name);
        try {
            exercise_.run(bytes);
        } catch (const std::exception& error) {
            tell(name + ": " + error.what());
        }
    }

    std::string name_;
    std::string original_;
    Exercise exercise_;
    std::uint64_t cases_ = 0;
};

} // namespace

int main(int argc, char** argv) {
    std::FILE* const results = fdopen(dup(STDOUT_FILENO), "w");
    silence();
    const auto number = [&](int i) { return std::strtoull(argv[i], nullptr, 10); };
    constexpr int firstFile = 5;
    const auto files = static_cast<std::uint64_t>(argc - firstFile);
    const std::uint64_t part = number(2);
    const std::uint64_t randomCases = number(4);
    std::mt19937_64 random(part);
    std::uint64_t cases = 0;
    std::uint64_t demanding = 0;
    for (int i = firstFile; i < argc; ++i) {
        Flipper flipper(argv[1], argv[i]);
        flipper.flipEach(part, number(3));
        flipper.flipAtRandom((randomCases + files - 1) / files, random);
        cases += flipper.cases();
        demanding += flipper.demanding();
    }
    std::fprintf(results, "%llu %llu\n", static_cast<unsigned long long>(cases),
                 static_cast<unsigned long long>(demanding));
    std::fclose(results);
}
