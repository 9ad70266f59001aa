#include "Tools/zulm/Help.h"

#include "Tools/zulm/Manual.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>

namespace Zulm {

namespace {

constexpr std::size_t s_pageWidth = 80;

using Row = std::pair<std::string, std::string>;

/// `text` in lines behind a margin of `indent`; the first line follows what is there already.
std::string wrapped(const std::string& text, std::size_t indent) {
    std::string lines;
    std::size_t column = indent;
    for (std::size_t begin = 0; begin < text.size();) {
        const std::size_t end = std::min(text.find(' ', begin), text.size());
        const std::size_t width = end - begin;
        if (column > indent && column + 1 + width > s_pageWidth) {
            lines += '\n' + std::string(indent, ' ');
            column = indent;
        } else if (column > indent) {
            lines += ' ';
            ++column;
        }
        lines += text.substr(begin, width);
        column += width;
        begin = end + 1;
    }
    return lines;
}

/// Two columns.
std::string table(const std::vector<Row>& rows) {
    constexpr std::size_t widest = 26;
    std::size_t width = 0;
    for (const Row& row : rows)
        if (row.first.size() <= widest)
            width = std::max(width, row.first.size());
    std::string lines;
    for (const auto& [left, right] : rows) {
        const bool fits = left.size() <= width;
        lines += fmt::format("  {:<{}}", left, fits ? width + 2 : 0);
        lines += (fits ? "" : "\n" + std::string(width + 4, ' ')) + wrapped(right, width + 4) + '\n';
    }
    return lines;
}

std::string section(const std::string& title, const std::string& body) {
    return body.empty() ? std::string() : '\n' + heading(title) + '\n' + body;
}

std::string left(const ManualOption& option) {
    const std::string names = fmt::format("{}", fmt::join(option.names, ", "));
    return option.value.empty() ? names : names + ' ' + option.value;
}

std::vector<Row> rowsOf(const std::vector<ManualOption>& options, bool positional) {
    std::vector<Row> rows;
    for (const ManualOption& option : options)
        if (option.isPositional == positional)
            rows.emplace_back(left(option), option.description);
    return rows;
}

std::string examplesOf(const std::vector<std::string>& examples) {
    std::string lines;
    for (const std::string& example : examples)
        lines += "  " + example + '\n';
    return lines;
}

std::string commandsOf(const Manual& manual) {
    std::string lines;
    for (const std::string& group : groupsOf(manual)) {
        std::vector<Row> rows;
        for (const ManualCommand& command : manual.commands)
            if (command.group == group)
                rows.emplace_back(fmt::format("{:<9}", command.name), command.summary());
        lines += section(group, table(rows));
    }
    return lines;
}

std::string toolPage(const Manual& manual) {
    std::vector<Row> codes;
    for (const auto& [code, meaning] : s_exitCodes)
        codes.emplace_back(fmt::format("{:<5}", code), meaning);
    return wrapped(manual.description, 0) + "\n\nUsage: zulm [OPTIONS] COMMAND ...\n" + commandsOf(manual) +
           section("Options of every command", table(rowsOf(manual.options, false))) +
           section("Examples", examplesOf(manual.examples)) + section("Exit codes", table(codes)) +
           section("Output", "  " + wrapped(s_aboutOutput, 2) + '\n') +
           "\n'zulm COMMAND --help' shows the options of a command and an example.\n";
}

std::string commandPage(const CLI::App& app) {
    const ManualCommand command = manualOfCommand(app);
    return wrapped(command.description, 0) + "\n\nUsage: " + command.usage() + '\n' +
           section("Arguments", table(rowsOf(command.options, true))) +
           section("Options", table(rowsOf(command.options, false))) +
           section("Options of every command",
                   table(rowsOf(globalOptions(manualOf(*app.get_parent()), command), false))) +
           section(command.examples.size() == 1 ? "Example" : "Examples", examplesOf(command.examples));
}

} // namespace

std::string HelpPage::make_help(const CLI::App* app, std::string, CLI::AppFormatMode) const {
    return app->get_parent() ? commandPage(*app) : toolPage(manualOf(*app));
}

} // namespace Zulm
