#include "Tools/render/Film.h"
#include "Tools/render/Guide.h"
#include "Tools/zulm/CommandLine.h"
#include "Tools/zulm/Interruptions.h"
#include "Tools/zulm/OutOfMemory.h"
#include "Tools/zulm/StandardStreams.h"

extern "C" {
#include <libavutil/log.h>
}

#include <memory>
#include <new>

namespace {

void addRenderCommand(CLI::App& app, Zulm::Action& chosen) {
    const auto options = std::make_shared<Render::RenderOptions>();
    Render::addRenderOptions(app, *options)->callback([options, &chosen] {
        Render::requireSense(*options);
        chosen = [options] { return Render::render(*options); };
    });
}

void addGuideCommand(CLI::App& app, Zulm::Action& chosen) {
    const auto options = std::make_shared<Render::GuideOptions>();
    Render::addGuideOptions(app, *options)->callback([options, &chosen] {
        chosen = [options] { return Render::makeGuide(*options); };
    });
}

} // namespace

int main(int argc, char** argv) {
    Zulm::endWhereMemoryRunsOut();
    Zulm::secureStandardStreams();
    av_log_set_level(AV_LOG_FATAL);
    try {
        const Zulm::ExitCode code = Zulm::runCommandLine({{"Show", {addRenderCommand, addGuideCommand}}}, argc, argv);
        return Zulm::flushStandardOutput() ? code : Zulm::ExitFailed;
    } catch (const Zulm::Interruption& interruption) {
        Zulm::complain("interrupted; no part of the result is left");
        Zulm::endBy(interruption);
    } catch (const std::bad_alloc&) {
        Zulm::complainAboutMemory();
        return Zulm::ExitFailed;
    }
}
