// hostile_sizes FOLDER FILE...: does everything with each file. Prints "CASES DEMANDING"; on standard error what does
// not hold.

#include "Tests/Reliability/Programs/Exercise.h"
#include "Tests/Reliability/Programs/Watch.h"

#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <string>
#include <unistd.h>

using namespace Reliability;

int main(int argc, char** argv) {
    std::FILE* const results = fdopen(dup(STDOUT_FILENO), "w");
    silence();
    std::uint64_t demanding = 0;
    for (int i = 2; i < argc; ++i) {
        const std::filesystem::path file(argv[i]);
        beginCase(file.filename().string());
        Exercise exercise(argv[1], file.extension().string());
        try {
            exercise.run(contentsOf(file.string()));
        } catch (const std::exception& error) {
            tell(file.filename().string() + ": " + error.what());
        }
        demanding += exercise.demanding();
    }
    std::fprintf(results, "%d %llu\n", argc - 2, static_cast<unsigned long long>(demanding));
    std::fclose(results);
}
