// The manual as completions for the shells.

#include "Tools/zulm/Choice.h"
#include "Tools/zulm/Manual.h"
#include "Tools/zulm/Substitutes.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

namespace Zulm {

namespace {

std::vector<std::string> namesOf(const std::vector<ManualOption>& options) {
    std::vector<std::string> names;
    for (const ManualOption& option : options)
        if (!option.isPositional)
            names.insert(names.end(), option.names.begin(), option.names.end());
    return names;
}

std::vector<ManualOption> withGlobalOptions(const Manual& manual, const ManualCommand& command) {
    std::vector<ManualOption> options = globalOptions(manual, command);
    options.insert(options.begin(), command.options.begin(), command.options.end());
    return options;
}

bool isFolder(const ManualOption& option) {
    return option.value == "DIR" || option.names.front() == "DIR";
}

bool isFile(const ManualOption& option) {
    return option.isPositional || option.value == "FILE" || option.value == "MOVIE" || option.value == "OUT" ||
           option.value == "OLDMOVIE" || option.value == "EDITED";
}

/// In single quotes of a shell.
std::string quoted(const std::string& text) {
    return "'" + substituted(text, {{'\'', "'\\''"}}) + "'";
}

/// What an option's value is completed with, as a line of bash. Names of files are left to bash itself, which knows how
/// they are quoted: without candidates it completes them.
std::string bashValue(const ManualOption& option) {
    if (const auto choices = option.choices(); !choices.empty())
        return fmt::format("COMPREPLY=($(compgen -W '{}' -- \"$current\"))", fmt::join(choices, " "));
    if (isFolder(option))
        return "compopt +o default -o dirnames 2>/dev/null";
    return isFile(option) ? ":" : "compopt +o default 2>/dev/null";
}

/// The cases of options that take a value; `command` is a pattern for what stands in front of them.
std::string bashCases(const std::vector<ManualOption>& options, const std::string& command) {
    std::string cases;
    for (const ManualOption& option : options) {
        if (option.isPositional || option.value.empty())
            continue;
        std::vector<std::string> patterns;
        for (const std::string& name : option.names)
            patterns.push_back(fmt::format("{}' {}'", command, name));
        cases += fmt::format("    {}) {}; return ;;\n", fmt::join(patterns, "|"), bashValue(option));
    }
    return cases;
}

/// The characters that mean something in an option given to _arguments.
std::string zshText(const std::string& text) {
    return substituted(text, {{'[', "\\["}, {']', "\\]"}, {':', "\\:"}, {'\\', "\\\\"}});
}

std::string zshAction(const ManualOption& option) {
    if (const auto choices = option.choices(); !choices.empty())
        return fmt::format("({})", fmt::join(choices, " "));
    return isFolder(option) ? "_files -/" : isFile(option) ? "_files" : " ";
}

std::string zshOption(const ManualOption& option) {
    std::string lines;
    const std::string value =
        option.value.empty() ? std::string() : fmt::format(":{}:{}", zshText(option.value), zshAction(option));
    for (const std::string& name : option.names) {
        const std::string exclusions = option.isRepeatable ? "*" : fmt::format("({})", fmt::join(option.names, " "));
        lines += ' ' + quoted(fmt::format("{}{}[{}]{}", exclusions, name, zshText(option.description), value));
    }
    return lines;
}

std::string zshArguments(const std::vector<ManualOption>& options) {
    std::string lines;
    for (const ManualOption& option : options)
        if (option.isPositional)
            lines += ' ' + quoted(fmt::format("{}:{}:{}", option.isRepeatable ? "*" : "", zshText(option.names.front()),
                                              zshAction(option)));
        else
            lines += zshOption(option);
    return lines;
}

std::string fishOption(const ManualOption& option, const std::string& condition) {
    std::string line = "complete -c zulm";
    if (!condition.empty())
        line += " -n " + quoted(condition);
    for (const std::string& name : option.names)
        line += name.starts_with("--") ? " -l " + name.substr(2) : " -s " + name.substr(1);
    if (const auto choices = option.choices(); !choices.empty())
        line += fmt::format(" -x -a '{}'", fmt::join(choices, " "));
    else if (isFolder(option))
        line += " -x -a '(__fish_complete_directories)'";
    else if (!option.value.empty())
        line += isFile(option) ? " -r -F" : " -x";
    return line + " -d " + quoted(option.description) + '\n';
}

} // namespace

std::string bashCompletion(const Manual& manual) {
    std::string cases = bashCases(manual.options, "*");
    std::string options;
    for (const ManualCommand& command : manual.commands) {
        cases += bashCases(command.options, command.name);
        options += fmt::format("        {}) options='{}' ;;\n", command.name,
                               fmt::join(namesOf(withGlobalOptions(manual, command)), " "));
    }
    std::string script = R"(# bash completion of zulm, made from its options
_zulm() {
    COMPREPLY=()
    local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD-1]} command='' word options
    for word in "${COMP_WORDS[@]:1:COMP_CWORD-1}"; do
        case $word in
        COMMANDS) command=$word; break ;;
        esac
    done
    case "$command $previous" in
CASES    esac
    case $command in
OPTIONS        *) options='GLOBAL' ;;
    esac
    if [[ $current == -* ]]; then
        COMPREPLY=($(compgen -W "$options" -- "$current"))
    elif [[ -z $command ]]; then
        COMPREPLY=($(compgen -W 'NAMES' -- "$current"))
    fi
}
complete -o default -F _zulm zulm
)";
    const auto fill = [&script](const std::string& place, const std::string& text) {
        script.replace(script.find(place), place.size(), text);
    };
    fill("COMMANDS", fmt::format("{}", fmt::join(namesIn(manual.commands), "|")));
    fill("CASES", cases);
    fill("OPTIONS", options);
    fill("GLOBAL", fmt::format("{}", fmt::join(namesOf(manual.options), " ")));
    fill("NAMES", fmt::format("{}", fmt::join(namesIn(manual.commands), " ")));
    return script;
}

std::string zshCompletion(const Manual& manual) {
    std::string script = "#compdef zulm\n# zsh completion of zulm, made from its options\n_zulm() {\n"
                         "    local context state state_descr line\n    typeset -A opt_args\n    local -a commands\n"
                         "    commands=(\n";
    for (const ManualCommand& command : manual.commands)
        script += "        " + quoted(command.name + ":" + zshText(command.summary())) + '\n';
    script += "    )\n    _arguments -C" + zshArguments(manual.options) +
              " '1:command:->command' '*::argument:->argument'\n    case $state in\n"
              "    command) _describe command commands ;;\n    argument)\n        case $words[1] in\n";
    for (const ManualCommand& command : manual.commands)
        script += fmt::format("        {}) _arguments{} ;;\n", command.name,
                              zshArguments(withGlobalOptions(manual, command)));
    return script +
           "        esac ;;\n    esac\n}\nif [[ $funcstack[1] == _zulm ]]; then _zulm \"$@\"; else compdef _zulm "
           "zulm; fi\n";
}

std::string fishCompletion(const Manual& manual) {
    std::string script = "# fish completion of zulm, made from its options\n";
    for (const ManualOption& option : manual.options)
        script += fishOption(option, option.names.back() == "--version" ? "__fish_use_subcommand" : "");
    for (const ManualCommand& command : manual.commands) {
        script += fmt::format("complete -c zulm -n __fish_use_subcommand -f -a {} -d {}\n", command.name,
                              quoted(command.summary()));
        for (const ManualOption& option : command.options)
            if (!option.isPositional)
                script += fishOption(option, "__fish_seen_subcommand_from " + command.name);
    }
    return script;
}

} // namespace Zulm
