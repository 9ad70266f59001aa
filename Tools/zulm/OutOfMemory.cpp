#include "Tools/zulm/OutOfMemory.h"

#include "Tools/zulm/Command.h"
#include "Tools/zulm/TemporaryFile.h"

#include <cstdio>
#include <cstdlib>
#include <string_view>

namespace Zulm {

namespace {

[[noreturn]] void end() {
    removeTemporaryFiles();
    complainAboutMemory();
    std::_Exit(ExitFailed);
}

} // namespace

void complainAboutMemory() noexcept {
    constexpr std::string_view line = "zulm: out of memory\n";
    std::fwrite(line.data(), 1, line.size(), stderr);
}

void endWhereMemoryRunsOut() noexcept {
    std::set_new_handler(end);
}

} // namespace Zulm
