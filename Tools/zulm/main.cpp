#include "Tools/zulm/CommandLine.h"
#include "Tools/zulm/OutOfMemory.h"
#include "Tools/zulm/StandardStreams.h"

#include <new>

using namespace Zulm;

int main(int argc, char** argv) {
    endWhereMemoryRunsOut();
    try {
        secureStandardStreams();
        const ExitCode code = runCommandLine(argc, argv);
        return flushStandardOutput() ? code : ExitFailed;
    } catch (const std::bad_alloc&) { // more than any program can have, while it complained of something else
        complainAboutMemory();
        return ExitFailed;
    }
}
