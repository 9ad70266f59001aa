#pragma once

// What the tool's options are, taken from the one definition of them, and the pages and completions made from it.

#include <CLI/CLI.hpp>

#include <string>
#include <utility>
#include <vector>

namespace Zulm {

struct ManualOption {
    std::vector<std::string> names; ///< "-q", "--quiet"; the bare name of a positional
    std::string value;              ///< "DIR", or "text|json" for a choice; empty for a flag
    std::string description;
    bool isRequired = false;
    bool isRepeatable = false;
    bool isPositional = false;

    /// The names that `value` lists, where it lists any.
    std::vector<std::string> choices() const;
};

struct ManualCommand {
    std::string name;
    std::string group;
    std::string description;
    std::vector<ManualOption> options; ///< positionals first
    std::vector<std::string> examples; ///< command lines

    /// The first statement of its description.
    std::string summary() const;

    /// "zulm dump [OPTIONS] FILE"
    std::string usage() const;
};

struct Manual {
    std::string description;
    std::vector<ManualOption> options;   ///< those that every command has
    std::vector<ManualCommand> commands; ///< in the order in which they were added
    std::vector<std::string> examples;   ///< command lines
};

Manual manualOf(const CLI::App& app);
ManualCommand manualOfCommand(const CLI::App& command);

/// The commands that are programs of their own.
///@{
inline constexpr auto s_recordCommand = "record";
inline constexpr auto s_renderCommand = "render";
inline constexpr auto s_guideCommand = "guide";
///@}

/// The options of the tool that may also follow the command: all but --version, and without the names that the command
/// has for options of its own. The recorder knows --help alone.
std::vector<ManualOption> globalOptions(const Manual& manual, const ManualCommand& command);

/// The commands' groups in their order.
std::vector<std::string> groupsOf(const Manual& manual);

/// All exit codes with their meanings, for every page.
inline constexpr std::pair<const char*, const char*> s_exitCodes[]{
    {"0", "Everything is fine."},
    {"1", "A file could not be read, or a result could not be written."},
    {"2", "The command line is wrong. Nothing was done."},
    {"3", "The command did its work, but found loss or damage."},
    {"4", "The file can be read, but holds no recording metadata."},
    {"128+n", "Signal n ended the command. Unfinished files were removed."},
};

/// What every page says about what is printed.
extern const char* const s_aboutOutput;

/// `format` is "man", "man-record", "man-render", "markdown", "bash", "zsh" or "fish"; empty for any other.
std::string generated(const Manual& manual, const std::string& format);

std::string manPage(const Manual& manual);
std::string recorderManPage(const Manual& manual);
std::string rendererManPage(const Manual& manual);
std::string markdownPage(const Manual& manual);
std::string bashCompletion(const Manual& manual);
std::string zshCompletion(const Manual& manual);
std::string fishCompletion(const Manual& manual);

} // namespace Zulm
