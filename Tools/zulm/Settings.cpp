#include "Tools/zulm/Settings.h"

#include "Tools/zulm/Choice.h"

#include <cstdlib>
#include <string_view>
#include <unistd.h>

namespace Zulm {

Settings& settings() {
    static Settings current;
    return current;
}

void addSettings(CLI::App& app) {
    CLI::Option* quiet = app.add_flag("-q,--quiet", settings().quiet,
                                      "Print no warnings, no progress and no account of what was done. grep prints "
                                      "nothing then, diff only which streams "
                                      "differ, verify only what it finds");
    app.add_flag("-v,--verbose", settings().verbose, "Print what is done on standard error")->excludes(quiet);
    app.add_flag("--no-progress", settings().noProgress, "Print no progress on a terminal");
    addChoice(app, "--color", settings().color, "Whether headings and messages are coloured (auto: on a terminal)",
              {{"auto", ColorMode::Auto}, {"always", ColorMode::Always}, {"never", ColorMode::Never}});
}

bool isTerminal(std::FILE* stream) {
    return isatty(fileno(stream)) == 1;
}

bool useColor(std::FILE* stream) {
    if (settings().color != ColorMode::Auto)
        return settings().color == ColorMode::Always;
    const char* noColor = std::getenv("NO_COLOR");
    const char* terminal = std::getenv("TERM");
    const bool isDumb = !terminal || std::string_view(terminal) == "dumb";
    return isTerminal(stream) && !isDumb && (!noColor || !*noColor);
}

} // namespace Zulm
