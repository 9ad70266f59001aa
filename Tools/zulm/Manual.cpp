#include "Tools/zulm/Manual.h"

#include "Tools/zulm/Choice.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"
#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include <algorithm>
#include <sstream>

namespace Zulm {

namespace {

bool isShown(const CLI::Option* option) {
    return !option->get_group().empty();
}

/// What the option's own description of its value says. Validators would append to it, if they had descriptions.
std::string valueOf(const CLI::Option& option) {
    return option.get_type_size() == 0 ? std::string() : option.get_type_name();
}

ManualOption manualOfOption(const CLI::Option& option) {
    ManualOption entry;
    entry.isPositional = option.get_positional();
    if (entry.isPositional)
        entry.names.push_back(option.get_name(true));
    for (const std::string& name : option.get_snames())
        entry.names.push_back("-" + name);
    for (const std::string& name : option.get_lnames())
        entry.names.push_back("--" + name);
    entry.value = entry.isPositional ? std::string() : valueOf(option);
    entry.description = option.get_description();
    entry.isRequired = option.get_required();
    entry.isRepeatable = option.get_expected_max() > 1;
    return entry;
}

std::vector<ManualOption> optionsOf(const CLI::App& app) {
    std::vector<ManualOption> options;
    for (const CLI::Option* option : app.get_options(isShown))
        options.push_back(manualOfOption(*option));
    std::stable_partition(options.begin(), options.end(),
                          [](const ManualOption& option) { return option.isPositional; });
    return options;
}

std::vector<std::string> linesOf(const std::string& text) {
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);)
        lines.push_back(line);
    return lines;
}

} // namespace

const char* const s_aboutOutput =
    "Results are printed to standard output, and everything else to standard error. With --json, a command that "
    "reports something prints one JSON document: {\"schema\": \"zulm.COMMAND\", \"schema_version\": 1, "
    "\"tool_version\": ..., \"files\": [...], \"errors\": [...]}. The document is complete even if no file could "
    "be read: its errors name every file that could not be read and everything that was not found. A time is "
    "given in seconds (90, 12.5) or as a time code (1:30, 0:01:02.5). If a command reads a file, the name - "
    "stands for standard input. Files that a command writes appear whole or not at all. An existing file is "
    "replaced only with --force, and nobody may read an output who may not read its inputs. In texts and names of "
    "files, what cannot be seen is an escape: \\xNN for a control character of ASCII and for a byte that is not "
    "UTF-8, \\u{N} for another character, two backslashes for one. JSON has the texts themselves, and the bytes "
    "of one that is not UTF-8 beside it as KEY_base64.";

std::vector<std::string> ManualOption::choices() const {
    if (value == "KIND")
        return namesIn(ZULMetaData::s_metaDataKinds);
    if (value == "RULE")
        return namesIn(ZULMetaData::s_findingRules);
    std::vector<std::string> found;
    if (value.find('|') == std::string::npos)
        return found;
    std::istringstream stream(value);
    for (std::string name; std::getline(stream, name, '|');)
        found.push_back(name);
    return found;
}

std::string ManualCommand::summary() const {
    return description.substr(0, std::min({description.find(". "), description.find(": "), description.find(" (")}));
}

std::string ManualCommand::usage() const {
    std::string line = "zulm " + name + " [OPTIONS]";
    for (const ManualOption& option : options) {
        const std::string word = option.isPositional ? option.names.front() : option.names.back() + ' ' + option.value;
        if (option.isRequired)
            line += ' ' + word + (option.isPositional && option.isRepeatable ? "..." : "");
        else if (option.isPositional)
            line += " [" + word + (option.isRepeatable ? "...]" : "]");
    }
    return line;
}

ManualCommand manualOfCommand(const CLI::App& command) {
    ManualCommand entry{command.get_name(), command.get_group(), command.get_description(), optionsOf(command),
                        linesOf(command.get_footer())};
    std::erase_if(entry.options, [](const ManualOption& option) { return option.names.back() == "--help"; });
    return entry;
}

Manual manualOf(const CLI::App& app) {
    Manual manual{app.get_description(), optionsOf(app), {}, linesOf(app.get_footer())};
    for (const CLI::App* command : app.get_subcommands([](const CLI::App*) { return true; }))
        manual.commands.push_back(manualOfCommand(*command));
    return manual;
}

std::vector<ManualOption> globalOptions(const Manual& manual, const ManualCommand& command) {
    std::vector<ManualOption> options = manual.options;
    const bool isRecorder = command.name == s_recordCommand;
    std::erase_if(options, [isRecorder](const ManualOption& option) {
        return isRecorder ? option.names.back() != "--help" : option.names.back() == "--version";
    });
    for (const ManualOption& own : command.options)
        for (ManualOption& option : options)
            std::erase_if(option.names, [&](const std::string& name) {
                return std::find(own.names.begin(), own.names.end(), name) != own.names.end();
            });
    return options;
}

std::vector<std::string> groupsOf(const Manual& manual) {
    std::vector<std::string> groups;
    for (const ManualCommand& command : manual.commands)
        if (std::find(groups.begin(), groups.end(), command.group) == groups.end())
            groups.push_back(command.group);
    return groups;
}

std::string generated(const Manual& manual, const std::string& format) {
    using Render = std::string (*)(const Manual&);
    constexpr std::pair<const char*, Render> renders[]{
        {"man", manPage},           {"man-record", recorderManPage}, {"man-render", rendererManPage},
        {"markdown", markdownPage}, {"bash", bashCompletion},        {"zsh", zshCompletion},
        {"fish", fishCompletion}};
    for (const auto& [name, render] : renders)
        if (format == name)
            return render(manual);
    return {};
}

} // namespace Zulm
