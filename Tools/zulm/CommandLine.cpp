#include "Tools/zulm/CommandLine.h"

#include "Tools/zulm/Choice.h"
#include "Tools/zulm/Help.h"
#include "Tools/zulm/Manual.h"
#include "Tools/zulm/OutOfMemory.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <algorithm>
#include <filesystem>
#include <iterator>
#include <memory>
#include <new>
#include <sstream>
#include <system_error>
#include <utility>

namespace Zulm {

namespace {

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

std::string unexpectedText(const CLI::App& app) {
    const CLI::App& command = namedCommand(app);
    const auto words = app.remaining(true);
    const auto isOption = [](const std::string& word) { return word.starts_with("-"); };
    const auto isCommand = [&](const std::string& word) { return &command == &app && !isOption(word); };
    const auto word = std::find_if(words.begin(), words.end(), isCommand);
    if (word != words.end())
        return fmt::format("no command is called {}{}", *word, suggestionFor(*word, commandNames(app)));
    const std::string& first = words.front();
    auto names = optionNames(command);
    for (const std::string& name : optionNames(app))
        names.push_back(name);
    return isOption(first) ? fmt::format("no option is called {}{}", first, suggestionFor(first, names))
                           : fmt::format("{} is one argument too many", first);
}

ExitCode refuse(const CLI::App& app, const std::string& message) {
    const CLI::App& command = namedCommand(app);
    complain(message);
    complain(fmt::format("'zulm {}--help' shows what can be given", &command == &app ? "" : command.get_name() + " "));
    return ExitUsage;
}

ExitCode refuse(const CLI::App& app, const CLI::ParseError& error) {
    const bool isUnexpected = dynamic_cast<const CLI::ExtrasError*>(&error) && !app.remaining(true).empty();
    return refuse(app, isUnexpected ? unexpectedText(app) : error.what());
}

ExitCode run(const Action& action) {
    try {
        return action();
    } catch (const Failure& failure) {
        complain(failure.what());
    } catch (const std::bad_alloc&) {
        complainAboutMemory();
    } catch (const std::filesystem::filesystem_error& error) {
        complain(fmt::format("{}: {}", error.path1().string(), error.code().message()));
    } catch (const std::system_error& error) { // only output is written by what throws this
        complainAboutOutput(error.code().value());
    } catch (const std::exception& error) {
        complain(error.what());
    }
    return ExitFailed;
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
/// parser would take the next word as its value.
std::vector<std::string> wordsOf(int argc, char** argv) {
    std::vector<std::string> words;
    bool areOptions = true;
    for (int i = 1; i < argc; ++i) {
        std::string word = argv[i];
        areOptions = areOptions && word != "--";
        const bool hasEmptyValue = areOptions && word.starts_with("--") && word.find('=') == word.size() - 1;
        if (hasEmptyValue)
            word.pop_back();
        words.push_back(std::move(word));
        if (hasEmptyValue)
            words.emplace_back();
    }
    return words;
}

constexpr auto s_examples = "zulm info Recording.mp4                                   # what is in it\n"
                            "zulm verify Recording.mp4 || zulm salvage Recording.mp4 -o rescued\n"
                            "zulm dump --stream cursorLocation --format csv Recording.mp4 > cursor.csv";

void define(CLI::App& app, Action& chosen, const std::vector<CommandGroup>& groups) {
    app.set_version_flag("--version", "zulm " ZULM_VERSION, "Print the version and end");
    app.set_help_flag("-h,--help", "Print this help and end");
    app.formatter(std::make_shared<HelpPage>());
    app.require_subcommand(0, 1);
    app.fallthrough();
    addSettings(app);
    for (const CommandGroup& group : groups)
        for (const auto addCommand : group.commands) {
            addCommand(app, chosen);
            app.get_subcommands([](CLI::App*) { return true; }).back()->group(group.heading);
        }
    app.footer(s_examples); // last: commands would inherit it
}

} // namespace

ExitCode runCommandLine(int argc, char** argv, const std::vector<CommandGroup>& groups) {
    CLI::App app("Looks into the metadata of screen recordings, checks and rescues it, and puts it into movies.",
                 "zulm");
    Action chosen;
    std::string format;
    define(app, chosen, groups);
    app.add_option("--generate", format)->group("");
    try {
        std::vector<std::string> words = wordsOf(argc, argv);
        std::reverse(words.begin(), words.end()); // the parser takes them from the end
        app.parse(std::move(words));
    } catch (const CLI::Success& shown) { // help or version
        return print(app, shown);
    } catch (const CLI::ParseError& error) {
        return refuse(app, error);
    }
    if (!format.empty())
        return generate(app, format);
    return chosen ? run(chosen) : refuse(app, "which command?");
}

} // namespace Zulm
