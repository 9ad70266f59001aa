#include "Tools/zulm/CommandLine.h"

#include "Tools/zulm/Choice.h"
#include "Tools/zulm/Help.h"
#include "Tools/zulm/Manual.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/SisterProgram.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <algorithm>
#include <memory>
#include <sstream>
#include <string_view>
#include <system_error>
#include <utility>

namespace Zulm {

namespace {

/// All commands, in the order of the help.
const std::vector<CommandGroup> s_commandGroups{
    {"Record", {addRecordCommand}},
    {"Look",
     {addInfoCommand, addAtomsCommand, addDumpCommand, addStateCommand, addInsightsCommand, addDiffCommand,
      addGrepCommand, addViewCommand}},
    {"Check and rescue", {addVerifyCommand, addRepairCommand, addSalvageCommand}},
    {"Change",
     {addAttachCommand, addStampCommand, addRetimeCommand, addCutCommand, addRedactCommand, addCompactCommand,
      addDetachCommand}},
    {"Convert", {addExtractCommand, addConvertCommand, addExportCommand}},
    {"Show", {addRenderCommand, addGuideCommand}},
    {"Try", {addDemoCommand}}};

std::vector<std::string> commandNames(const CLI::App& app) {
    std::vector<std::string> names;
    for (const CLI::App* command : app.get_subcommands([](const CLI::App*) { return true; }))
        names.push_back(command->get_name());
    return names;
}

std::vector<std::string> optionNames(const CLI::App& app) {
    std::vector<std::string> names;
    for (const CLI::Option* option : app.get_options())
        for (const std::string& name : option->get_lnames())
            names.push_back("--" + name);
    return names;
}

/// The command that was named, or the tool itself.
const CLI::App& namedCommand(const CLI::App& app) {
    const auto commands = app.get_subcommands();
    return commands.empty() ? app : *commands.front();
}

bool isOption(const std::string& word) {
    return word.starts_with("-");
}

/// Whether a word stands where a command is expected, and is none.
bool namesNoCommand(const CLI::App& app) {
    const auto words = app.remaining(true);
    return app.get_subcommands().empty() && !std::all_of(words.begin(), words.end(), isOption);
}

std::string unexpectedText(const CLI::App& app) {
    const CLI::App& command = namedCommand(app);
    const auto words = app.remaining(true);
    const auto word = std::find_if_not(words.begin(), words.end(), isOption);
    if (namesNoCommand(app))
        return fmt::format("no command is called {}{}", *word, suggestionFor(*word, commandNames(app)));
    const std::string& first = words.front();
    if (!isOption(first))
        return fmt::format("{} is one argument too many", first);
    const std::string name = first.substr(0, first.find('='));
    auto names = optionNames(command);
    if (std::find(names.begin(), names.end(), name) != names.end())
        return fmt::format("{0} is an option of 'zulm {1}': it follows {1}", name, command.get_name());
    for (const std::string& global : optionNames(app))
        names.push_back(global);
    return fmt::format("no option is called {}{}", name, suggestionFor(name, names));
}

/// What is wrong with the values of an option, or with options that are given together, in words that say what to do.
/// The parser's own words are all that tells these errors apart.
std::string usageText(const CLI::ParseError& error) {
    std::string text = error.what();
    const auto has = [&text](const char* words) { return text.find(words) != std::string::npos; };
    const auto replaced = [&text](std::string_view words, const char* better) {
        const std::size_t position = text.find(words);
        return text.substr(0, position) + better + text.substr(position + words.size());
    };
    const std::string name = text.substr(0, text.find_first_of(": "));
    if (dynamic_cast<const CLI::ArgumentMismatch*>(&error) && has(" missing"))
        return fmt::format("{} is given without its value", name);
    if (dynamic_cast<const CLI::ArgumentMismatch*>(&error) && has("At Most"))
        return fmt::format("{} is given more than once", name);
    if (dynamic_cast<const CLI::ArgumentMismatch*>(&error) && has("flag override"))
        return fmt::format("{}{} takes no value", name.size() > 1 ? "--" : "-", name);
    if (dynamic_cast<const CLI::ExcludesError*>(&error) && has(" excludes "))
        return replaced(" excludes ", " cannot be given together with ");
    if (dynamic_cast<const CLI::RequiresError*>(&error) && has(" requires "))
        return replaced(" requires ", " can only be given together with ");
    return text;
}

ExitCode refuse(const CLI::App& app, const std::string& message) {
    const CLI::App& command = namedCommand(app);
    complain(message);
    complain(fmt::format("'zulm {}--help' shows what can be given", &command == &app ? "" : command.get_name() + " "));
    return ExitUsage;
}

ExitCode refuse(const CLI::App& app, const CLI::ParseError& error) {
    const bool isUnexpected = dynamic_cast<const CLI::ExtrasError*>(&error) && !app.remaining(true).empty();
    return refuse(app, isUnexpected ? unexpectedText(app) : usageText(error));
}

ExitCode run(const Action& action) {
    try {
        return orComplaint(action);
    } catch (const std::system_error& error) { // only standard output throws this
        complainAboutOutput(error.code().value());
        return ExitFailed;
    }
}

ExitCode print(const std::string& text) {
    return run([&text] {
        writeOutput(text);
        return ExitFine;
    });
}

ExitCode print(const CLI::App& app, const CLI::Success& shown) {
    std::ostringstream text;
    app.exit(shown, text, text);
    return print(text.str());
}

ExitCode generate(const CLI::App& app, const std::string& format) {
    const std::string text = generated(manualOf(app), format);
    return text.empty() ? refuse(app, fmt::format("nothing is generated as {}", format)) : print(text);
}

/// The words after the program's name. An option with an empty value ("--titles=") becomes two words, because the
/// parser would take the next word as its value. "help COMMAND" becomes "COMMAND --help".
std::vector<std::string> wordsOf(int argc, char** argv) {
    std::vector<std::string> words;
    const bool asksForHelp = argc > 1 && std::string_view(argv[1]) == "help";
    bool areOptions = true;
    for (int i = asksForHelp ? 2 : 1; i < argc; ++i) {
        std::string word = argv[i];
        areOptions = areOptions && word != "--";
        const bool hasEmptyValue = areOptions && word.starts_with("--") && word.find('=') == word.size() - 1;
        if (hasEmptyValue)
            word.pop_back();
        words.push_back(std::move(word));
        if (hasEmptyValue)
            words.emplace_back();
    }
    if (asksForHelp)
        words.emplace_back("--help");
    return words;
}

constexpr auto s_examples = "zulm info Recording.mp4                                   # what is in it\n"
                            "zulm verify Recording.mp4 || zulm salvage Recording.mp4 -o rescued\n"
                            "zulm dump --stream cursorLocation --format csv Recording.mp4 > cursor.csv";

/// A flag is given or not: the parser would take "--json=false" too, and "--json=3".
void refuseValuesOfFlags(CLI::App& app) {
    for (CLI::Option* option : app.get_options())
        if (option->get_expected_max() == 0)
            option->disable_flag_override();
}

/// What is put in place when it is whole cannot go to standard output, and nobody means a file that is called "-".
void refuseStandardOutput(CLI::App& command) {
    const auto refused = [](const std::string& path) {
        return path == "-" ? std::string("'-' does not stand for standard output here; name a file or a folder ('./-' "
                                         "is one that is called so)")
                           : std::string();
    };
    for (CLI::Option* option : command.get_options())
        if (option->get_type_name() == "OUT" || option->get_type_name() == "DIR" || option->get_name() == "DIR")
            option->check(CLI::Validator(refused, ""));
}

void define(CLI::App& app, const std::vector<CommandGroup>& groups, Action& chosen) {
    app.set_version_flag("--version", "zulm " ZULM_VERSION, "Print the version and end");
    app.set_help_flag("-h,--help", "Print this help and end");
    app.formatter(std::make_shared<HelpPage>());
    app.require_subcommand(0, 1);
    app.fallthrough();
    addSettings(app);
    for (const CommandGroup& group : groups)
        for (const auto addCommand : group.commands) {
            addCommand(app, chosen);
            CLI::App* command = app.get_subcommands([](CLI::App*) { return true; }).back();
            command->group(group.heading);
            if (command->get_name() != "convert") // its result is text that is written when it is whole
                refuseStandardOutput(*command);
        }
    refuseValuesOfFlags(app);
    for (CLI::App* command : app.get_subcommands([](CLI::App*) { return true; }))
        refuseValuesOfFlags(*command);
    app.footer(s_examples); // last: commands would inherit it
}

} // namespace

ExitCode runCommandLine(const std::vector<CommandGroup>& groups, int argc, char** argv) {
    CLI::App app("Looks into the metadata of screen recordings, checks and rescues it, and puts it into movies.",
                 "zulm");
    Action chosen;
    std::string format;
    define(app, groups, chosen);
    app.add_option("--generate", format)->group("");
    try {
        std::vector<std::string> words = wordsOf(argc, argv);
        std::reverse(words.begin(), words.end()); // the parser takes them from the end
        app.parse(std::move(words));
    } catch (const CLI::Success& shown) { // help or version
        return namesNoCommand(app) ? refuse(app, unexpectedText(app)) : print(app, shown);
    } catch (const CLI::ParseError& error) {
        return refuse(app, error);
    }
    if (!format.empty())
        return generate(app, format);
    return chosen ? run(chosen) : refuse(app, "no command is given");
}

ExitCode runCommandLine(int argc, char** argv) {
    if (const SisterProgram* sister = argc > 1 ? sisterProgramOf(argv[1]) : nullptr)
        return become(*sister, {argv + 2, argv + argc});
    return runCommandLine(s_commandGroups, argc, argv);
}

} // namespace Zulm
