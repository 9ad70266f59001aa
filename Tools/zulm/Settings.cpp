#include "Tools/zulm/Settings.h"

#include <cstdlib>
#include <map>
#include <string_view>
#include <unistd.h>

namespace Zulm {

Settings& settings() {
    static Settings current;
    return current;
}

void addSettings(CLI::App& app) {
    static const std::map<std::string, ColorMode> modes{
        {"auto", ColorMode::Auto}, {"always", ColorMode::Always}, {"never", ColorMode::Never}};
    app.add_flag("-q,--quiet", settings().quiet, "Print no messages but errors");
    app.add_flag("-v,--verbose", settings().verbose, "Say on standard error what is done");
    app.add_flag("--no-progress", settings().noProgress, "Show no progress on a terminal");
    app.add_option("--color", settings().color, "Colour: auto, always or never")
        ->type_name("WHEN")
        ->transform(CLI::CheckedTransformer(modes).description(""));
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
