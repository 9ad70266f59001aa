#pragma once

// The options that every command has.

#include <CLI/CLI.hpp>

namespace Zulm {

enum class ColorMode { Auto, Always, Never };

struct Settings {
    bool quiet = false;      ///< no messages but errors, and no account of what was done
    bool verbose = false;    ///< say what is done
    bool noProgress = false; ///< no progress line
    ColorMode color = ColorMode::Auto;
};

/// Of this run. Set by the command line, then only read.
Settings& settings();

void addSettings(CLI::App& app);

/// Whether what is printed on `stream` may be coloured. NO_COLOR and TERM=dumb are honoured.
bool useColor(std::FILE* stream);

bool isTerminal(std::FILE* stream);

} // namespace Zulm
