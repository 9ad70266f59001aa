#pragma once

// Option values that are names out of a short list, and the help for names that are not.

#include "Reports/Number.h"

#include <CLI/CLI.hpp>
#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace Zulm {

/// "; did you mean X?" or nothing.
std::string suggestionFor(std::string_view word, const std::vector<std::string>& candidates);

/// Returns the names of a table's rows.
template <class Table>
std::vector<std::string> namesIn(const Table& table) {
    std::vector<std::string> names;
    names.reserve(table.size());
    for (const auto& row : table)
        names.emplace_back(row.name);
    return names;
}

/// The time that `word` stands for, as `secondsFrom` takes it. Throws the usage error of the option `name` if it stands
/// for none.
double requireSeconds(const std::string& name, const std::string& word, Sign sign = Sign::NeverNegative);

/// An option whose value is a time in seconds or a time code.
CLI::Option* addSeconds(CLI::App& command, const std::string& name, std::optional<double>& value,
                        const std::string& description, Sign sign = Sign::NeverNegative);

/// An option whose value is a whole number.
CLI::Option* addCount(CLI::App& command, const std::string& name, std::uint64_t& value, const std::string& description);

/// An option whose value is the one of `values` that is named. Its type name lists the names, as "text|json".
template <class Value>
CLI::Option* addChoice(CLI::App& command, const std::string& name, Value& value, const std::string& description,
                       std::vector<std::pair<std::string, Value>> values) {
    std::vector<std::string> names;
    names.reserve(values.size());
    for (const auto& choice : values)
        names.push_back(choice.first);
    const auto choose = [&value, values = std::move(values), names, name](const std::string& word) {
        const auto found = std::find(names.begin(), names.end(), word);
        if (found == names.end())
            throw CLI::ValidationError(
                name, fmt::format("{} is not one of {}{}", word, fmt::join(names, ", "), suggestionFor(word, names)));
        value = values[static_cast<std::size_t>(found - names.begin())].second;
    };
    return command.add_option_function<std::string>(name, choose, description)
        ->type_name(fmt::format("{}", fmt::join(names, "|")));
}

} // namespace Zulm
