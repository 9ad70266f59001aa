#include "Tools/render/Film.h"
#include "Tools/render/Guide.h"
#include "Tools/zulm/Interruptions.h"
#include "ZULMetaDataSession/Error.h"

extern "C" {
#include <libavutil/log.h>
}

#include <CLI/CLI.hpp>
#include <fmt/core.h>

#include <algorithm>
#include <exception>
#include <string>
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

} // namespace

int main(int argc, char** argv) {
    av_log_set_level(AV_LOG_FATAL);
    const std::string command = argc > 1 ? argv[1] : "";
    try {
        return run(command, {argv + std::min(argc, 2), argv + argc});
    } catch (const CLI::ParseError& error) {
        Zulm::complain(error.what());
        Zulm::complain(fmt::format("'zulm {} --help' shows what can be given", command));
        return Zulm::ExitUsage;
    } catch (const Zulm::Interruption& interruption) {
        Zulm::complain("interrupted; nothing was written");
        Zulm::endBy(interruption);
    } catch (const std::exception& error) {
        Zulm::complain(error.what());
        return Zulm::ExitFailed;
    }
}
