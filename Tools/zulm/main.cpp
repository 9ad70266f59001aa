#include "Tools/zulm/Commands.h"
#include "Tools/zulm/StandardStreams.h"

#include <new>

using namespace Zulm;

int main(int argc, char** argv) {
    try {
        secureStandardStreams();
        const ExitCode code = runCommandLine(argc, argv, commandGroups());
        return flushStandardOutput() ? code : ExitFailed;
    } catch (const std::bad_alloc&) { // before or behind the command, or while it complained of something else
        complainAboutMemory();
        return ExitFailed;
    }
}
