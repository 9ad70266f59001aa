#include "Tools/render/Film.h"
#include "Tools/render/Guide.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/Interruptions.h"
#include "Tools/zulm/OutOfMemory.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaDataSession/Error.h"

extern "C" {
#include <libavutil/log.h>
}

#include <CLI/CLI.hpp>
#include <fmt/core.h>

#include <algorithm>
#include <exception>
#include <string>
#include <system_error>
#include <vector>

namespace {

constexpr auto s_usage =
    "zulm-render is started by 'zulm render' and 'zulm guide'; their --help shows what can be given";

Zulm::ExitCode run(const std::string& command, const std::vector<std::string>& words) {
    if (command == "render") {
        const auto options = Render::renderOptionsOf(words);
        return options ? Render::render(*options) : Zulm::ExitFine;
    }
    if (command == "guide") {
        const auto options = Render::guideOptionsOf(words);
        return options ? Render::makeGuide(*options) : Zulm::ExitFine;
    }
    Zulm::complain(s_usage);
    return Zulm::ExitUsage;
}

/// The same, but what goes wrong is told as `zulm` tells it.
Zulm::ExitCode runOrComplain(const std::string& command, const std::vector<std::string>& words) {
    std::exception_ptr usage;
    const Zulm::ExitCode code = Zulm::orComplaint([&] {
        try {
            return run(command, words);
        } catch (const CLI::ParseError&) {
            usage = std::current_exception();
            return Zulm::ExitUsage;
        }
    });
    if (usage)
        std::rethrow_exception(usage);
    return code;
}

} // namespace

int main(int argc, char** argv) {
    Zulm::endWhereMemoryRunsOut();
    Zulm::secureStandardStreams();
    av_log_set_level(AV_LOG_FATAL);
    const std::string command = argc > 1 ? argv[1] : "";
    try {
        const Zulm::ExitCode code = runOrComplain(command, {argv + std::min(argc, 2), argv + argc});
        return Zulm::flushStandardOutput() ? code : Zulm::ExitFailed;
    } catch (const CLI::ParseError& error) {
        Zulm::complain(error.what());
        Zulm::complain(fmt::format("'zulm {} --help' shows what can be given", command));
        return Zulm::ExitUsage;
    } catch (const Zulm::Interruption& interruption) {
        Zulm::complain("interrupted; no part of the result is left");
        Zulm::endBy(interruption);
    } catch (const std::system_error& error) { // only standard output throws this
        Zulm::complainAboutOutput(error.code().value());
        return Zulm::ExitFailed;
    } catch (const std::exception& error) {
        Zulm::complain(error.what());
        return Zulm::ExitFailed;
    }
}
