// The manual as a page for man(1) and as one for the documentation.

#include "Tools/zulm/Failure.h"
#include "Tools/zulm/Manual.h"
#include "Tools/zulm/Substitutes.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <string_view>

namespace Zulm {

namespace {

/// As running text of a manual page: nothing in it is a request or an escape.
std::string roff(const std::string& text) {
    const std::string escaped = substituted(text, {{'\\', "\\e"}, {'-', "\\-"}});
    return escaped.starts_with(".") || escaped.starts_with("'") ? "\\&" + escaped : escaped;
}

std::string roffOption(const ManualOption& option) {
    const char font = option.isPositional ? 'I' : 'B';
    std::string names;
    for (const std::string& name : option.names)
        names += fmt::format("{}\\f{}{}\\fR", names.empty() ? "" : ", ", font, roff(name));
    const std::string value = option.value.empty() ? "" : " \\fI" + roff(option.value) + "\\fR";
    return fmt::format(".TP\n{}{}\n{}\n", names, value, roff(option.description));
}

std::string roffOptions(const std::vector<ManualOption>& options) {
    std::string text;
    for (const ManualOption& option : options)
        text += roffOption(option);
    return text;
}

std::string roffExamples(const std::vector<std::string>& examples) {
    std::string text;
    for (const std::string& example : examples)
        text += fmt::format(".PP\n.EX\n{}\n.EE\n", roff(example));
    return text;
}

template <class Codes>
std::string roffCodes(const Codes& codes) {
    std::string text = ".SH EXIT STATUS\n";
    for (const auto& [code, meaning] : codes)
        text += fmt::format(".TP\n.B {}\n{}\n", code, roff(meaning));
    return text;
}

std::string roffCommand(const ManualCommand& command) {
    return fmt::format(".SS {}\n{}.\n.PP\n.B {}\n", command.name, roff(command.description), roff(command.usage())) +
           roffOptions(command.options) + roffExamples(command.examples);
}

/// A '|' would divide the cell of a table.
std::string cell(const std::string& text) {
    return substituted(text, {{'|', "\\|"}});
}

std::string markdownOptions(const std::vector<ManualOption>& options) {
    if (options.empty())
        return {};
    std::string text = "\n| | |\n| --- | --- |\n";
    for (const ManualOption& option : options) {
        std::string names = fmt::format("{}", fmt::join(option.names, ", "));
        if (!option.value.empty())
            names += ' ' + option.value;
        text += fmt::format("| `{}` | {} |\n", cell(names), cell(option.description));
    }
    return text;
}

std::string markdownExamples(const std::vector<std::string>& examples) {
    return examples.empty() ? std::string() : fmt::format("\n```sh\n{}\n```\n", fmt::join(examples, "\n"));
}

std::string markdownCommand(const ManualCommand& command) {
    return fmt::format("\n### {}\n\n{}.\n\n```\n{}\n```\n", command.name, command.description, command.usage()) +
           markdownOptions(command.options) + markdownExamples(command.examples);
}

template <class Render>
std::string eachCommand(const Manual& manual, const std::string& group, Render render) {
    std::string text;
    for (const ManualCommand& command : manual.commands)
        if (command.group == group)
            text += render(command);
    return text;
}

const ManualCommand& commandOf(const Manual& manual, std::string_view name) {
    const auto found = std::find_if(manual.commands.begin(), manual.commands.end(),
                                    [name](const ManualCommand& command) { return command.name == name; });
    if (found == manual.commands.end())
        throw Failure(fmt::format("{}: is no command of this program", name));
    return *found;
}

} // namespace

std::string manPage(const Manual& manual) {
    std::string page =
        fmt::format(".TH ZULM 1 \"\" \"zulm {}\" \"User Commands\"\n.nh\n.ad l\n.SH NAME\nzulm \\- metadata of screen "
                    "recordings\n.SH SYNOPSIS\n.B zulm\n[\\fIOPTIONS\\fR] \\fICOMMAND\\fR ...\n",
                    ZULM_VERSION);
    page += fmt::format(".SH DESCRIPTION\n{}\n.PP\n{}\n", roff(manual.description), roff(s_aboutOutput));
    for (const std::string& group : groupsOf(manual)) {
        std::string title = group;
        std::transform(title.begin(), title.end(), title.begin(),
                       [](char c) { return c >= 'a' && c <= 'z' ? static_cast<char>(c - 32) : c; });
        page += fmt::format(".SH COMMANDS: {}\n", title) + eachCommand(manual, group, roffCommand);
    }
    page += ".SH OPTIONS OF EVERY COMMAND\n" + roffOptions(manual.options) + roffCodes(s_exitCodes);
    page +=
        ".SH ENVIRONMENT\n.TP\n.B NO_COLOR\nIf this is set and not empty, nothing is coloured.\n.TP\n.B TERM\nIf this "
        "is dumb, nothing is coloured.\n.TP\n.B TMPDIR\nThe folder in which standard input is kept while it is "
        "read.\n.SH EXAMPLES\n";
    return page + roffExamples(manual.examples);
}

std::string recorderManPage(const Manual& manual) {
    constexpr std::pair<const char*, const char*> codes[]{
        {"0", "The recording has ended well, or what was asked for is done."},
        {"1", "Nothing could be made."},
        {"2", "Something was refused, and nothing was created."},
        {"3", "The disk became full, or something else is lost. What could be saved is saved."},
        {"128+n",
         "A second signal, with the number n, ended the recorder at once. The folder with the recording is kept."},
    };
    const ManualCommand& command = commandOf(manual, s_recordCommand);
    return fmt::format(".TH ZULM-RECORD 1 \"\" \"zulm {}\" \"User Commands\"\n.nh\n.ad l\n.SH NAME\nzulm\\-record \\- "
                       "record the screen of an X display\n.SH SYNOPSIS\n.B {}\n.SH DESCRIPTION\n{}.\n.SH OPTIONS\n",
                       ZULM_VERSION, roff(command.usage()), roff(command.description)) +
           roffOptions(command.options) + roffOptions(globalOptions(manual, command)) + roffCodes(codes) +
           ".SH ENVIRONMENT\n.TP\n.B DISPLAY\nThe X display.\n.TP\n.B XDG_RUNTIME_DIR\nThe folder with the socket by "
           "which the recorder is controlled.\n.SH EXAMPLES\n" +
           roffExamples(command.examples) + ".SH SEE ALSO\n.BR zulm (1)\n";
}

std::string rendererManPage(const Manual& manual) {
    const ManualCommand& film = commandOf(manual, s_renderCommand);
    const ManualCommand& guide = commandOf(manual, s_guideCommand);
    std::string page = fmt::format(
        ".TH ZULM-RENDER 1 \"\" \"zulm {}\" \"User Commands\"\n.nh\n.ad l\n.SH NAME\nzulm\\-render \\- make films and "
        "guides of screen recordings\n.SH SYNOPSIS\n.B {}\n.br\n.B {}\n.SH DESCRIPTION\nThis is the program that "
        "\\fBzulm "
        "render\\fR and \\fBzulm guide\\fR start.\n",
        ZULM_VERSION, roff(film.usage()), roff(guide.usage()));
    for (const ManualCommand* command : {&film, &guide})
        page += fmt::format(".SH ZULM {}\n{}.\n", command == &film ? "RENDER" : "GUIDE", roff(command->description)) +
                roffOptions(command->options);
    return page + ".SH OPTIONS OF BOTH\n" + roffOptions(globalOptions(manual, film)) + roffCodes(s_exitCodes) +
           ".SH EXAMPLES\n" + roffExamples(film.examples) + roffExamples(guide.examples) +
           ".SH SEE ALSO\n.BR zulm (1),\n.BR zulm\\-record (1)\n";
}

std::string markdownPage(const Manual& manual) {
    std::string page =
        fmt::format("# zulm\n\n{}\n{}\n{}\n", manual.description, markdownExamples(manual.examples), s_aboutOutput);
    page +=
        "\nThis page is generated from the tool's options by `zulm --generate markdown`. [schemas](schemas) has the "
        "schemas of the JSON documents.\n\n## Exit codes\n\n| code | meaning |\n| --- | --- |\n";
    for (const auto& [code, meaning] : s_exitCodes)
        page += fmt::format("| {} | {} |\n", code, meaning);
    page += "\n## Options of every command\n" + markdownOptions(manual.options);
    for (const std::string& group : groupsOf(manual))
        page += fmt::format("\n## {}\n", group) + eachCommand(manual, group, markdownCommand);
    return page;
}

} // namespace Zulm
