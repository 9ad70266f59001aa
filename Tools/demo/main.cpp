#include "Tools/demo/Demo.h"

#include <fmt/core.h>

int main(int argc, char** argv) {
    if (argc != 3) {
        fmt::print(stderr, "usage: {} STREAM-FOLDER MOVIE\n", argv[0]);
        return 2;
    }
    const bool allSame = ZULMetaData::Demo::runDemo(argv[1], argv[2]);
    fmt::print("{}\n", allSame ? "Everything that was recorded has been read back."
                               : "What was read back is NOT what was recorded.");
    return allSame ? 0 : 1;
}
