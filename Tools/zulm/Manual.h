#pragma once

// What the tool's options are, taken from the one definition of them, and the pages and completions made from it.

#include <CLI/CLI.hpp>

#include <string>
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

/// The options of the tool that may also follow the command: all but --version, and without the names that the command
/// has for options of its own.
std::vector<ManualOption> globalOptions(const Manual& manual, const ManualCommand& command);

/// The commands' groups in their order.
std::vector<std::string> groupsOf(const Manual& manual);

struct ExitCodeMeaning {
    const char* code;
    const char* meaning;
};

/// All of them, for every page.
const std::vector<ExitCodeMeaning>& exitCodeMeanings();

/// What every page says about what is printed.
extern const char* const s_aboutOutput;

/// `format` is "man", "markdown", "bash", "zsh" or "fish"; empty for any other.
std::string generated(const Manual& manual, const std::string& format);

std::string manPage(const Manual& manual);
std::string markdownPage(const Manual& manual);
std::string bashCompletion(const Manual& manual);
std::string zshCompletion(const Manual& manual);
std::string fishCompletion(const Manual& manual);

} // namespace Zulm
