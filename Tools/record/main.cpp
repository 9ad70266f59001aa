#include "Tools/record/AccessibilityProcess.h"
#include "Tools/record/ControlSocket.h"
#include "Tools/record/Failure.h"
#include "Tools/record/Options.h"
#include "Tools/record/RecorderLoop.h"
#include "Tools/record/Recovery.h"
#include "Tools/record/VideoWriter.h"

extern "C" {
#include <libavutil/log.h>
}

#include <sys/resource.h>

#include <cstdio>
#include <exception>

namespace Recorder {

namespace {

/// Keys that wait or are left out are in memory, and an image of it would be a file. A limit of 0 bytes stops only the
/// kernel's own files: a program that collects crashes gets the image all the same. A limit of 1 byte stops both.
void keepMemoryOffTheDisk() {
    const rlimit nothing{1, 1};
    setrlimit(RLIMIT_CORE, &nothing);
}

int record(const Options& options) {
    keepMemoryOffTheDisk();
    VideoWriter::requireCodec(options.video.codec);
    RecorderLoop loop(options);
    return loop.run();
}

int run(const Options& options) {
    switch (options.task) {
    case Task::Record: return record(options);
    case Task::Recover: return recover(options.folder, options.output, options.deletesFolder);
    case Task::Pause: return sendCommand(Command::Pause, options.socket);
    case Task::Resume: return sendCommand(Command::Resume, options.socket);
    case Task::Stop: return sendCommand(Command::Stop, options.socket);
    case Task::WatchAccessibility: return watchAccessibility();
    }
    return ExitFailed;
}

} // namespace

} // namespace Recorder

int main(int argc, char** argv) {
    av_log_set_level(AV_LOG_FATAL);
    try {
        const auto options = Recorder::optionsOf(argc, argv);
        return options ? Recorder::run(*options) : Recorder::ExitFine;
    } catch (const Recorder::Failure& failure) {
        std::fprintf(stderr, "zulm record: %s\n", failure.what());
        return failure.code();
    } catch (const std::exception& error) {
        std::fprintf(stderr, "zulm record: %s\n", error.what());
        return Recorder::ExitFailed;
    }
}
