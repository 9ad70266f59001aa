// In the place of the fuzzer: runs the target once with every file of the folders that are named.

#include "Fuzz/Target.h"

#include <cstdio>
#include <filesystem>
#include <set>

int main(int argc, char** argv) {
    std::set<std::filesystem::path> files;
    for (int i = 1; i < argc; ++i)
        for (const auto& entry : std::filesystem::directory_iterator(argv[i]))
            files.insert(entry.path());
    for (const auto& file : files) {
        std::fprintf(stderr, "%s\n", file.filename().c_str());
        const std::string bytes = Fuzz::contentsOf(file.string());
        LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    }
    std::fprintf(stderr, "%zu inputs\n", files.size());
    return files.empty() ? 1 : 0;
}
