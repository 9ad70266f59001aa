#include "Tools/zulm/Commands.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/TemporaryFile.h"

#include <cstdlib>
#include <exception>
#include <new>

using namespace Zulm;

namespace {

/// Called where an exception cannot travel on, as out of the destructor of a JSON document, which asks for memory.
[[noreturn]] void endWhereMemoryRanOut() {
    try {
        if (const auto exception = std::current_exception())
            std::rethrow_exception(exception);
    } catch (const std::bad_alloc&) {
        removeTemporaryFiles();
        complainAboutMemory();
        std::_Exit(ExitFailed);
    } catch (...) { // a mistake in this program
    }
    std::abort();
}

} // namespace

int main(int argc, char** argv) {
    std::set_terminate(endWhereMemoryRanOut);
    try {
        secureStandardStreams();
        const ExitCode code = runCommandLine(argc, argv, commandGroups());
        return flushStandardOutput() ? code : ExitFailed;
    } catch (const std::bad_alloc&) { // before or behind the command, or while it complained of something else
        complainAboutMemory();
        return ExitFailed;
    }
}
