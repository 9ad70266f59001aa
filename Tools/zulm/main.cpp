#include "Tools/zulm/Command.h"
#include "Tools/zulm/Settings.h"

#include <fmt/core.h>

#include <new>

using namespace Zulm;

namespace {

constexpr auto s_footer = "Results go to standard output, everything else to standard error.\n"
                          "Ends with 0 when all is fine, 1 failed, 2 wrong usage, 3 done but damage was found,\n"
                          "4 readable but without recording metadata.";

ExitCode run(const Action& action) {
    try {
        return action();
    } catch (const Failure& failure) {
        complain(failure.what());
    } catch (const std::bad_alloc&) {
        complain("out of memory");
    } catch (const std::exception& error) {
        complain(error.what());
    }
    return ExitFailed;
}

} // namespace

int main(int argc, char** argv) {
    CLI::App app("Looks into the metadata of screen recordings, and puts it into movies.", "zulm");
    app.footer(s_footer);
    app.set_version_flag("--version", "zulm " ZULM_VERSION);
    app.require_subcommand(1);
    app.fallthrough();
    addSettings(app);
    Action chosen;
    addInfoCommand(app, chosen);
    addDumpCommand(app, chosen);
    addAttachCommand(app, chosen);
    addStampCommand(app, chosen);
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        return app.exit(error) == 0 ? ExitFine : ExitUsage;
    }
    return run(chosen);
}
