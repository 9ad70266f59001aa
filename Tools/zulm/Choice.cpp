#include "Tools/zulm/Choice.h"

#include <cctype>
#include <cstddef>
#include <limits>
#include <numeric>

namespace Zulm {

namespace {

char lower(char c) {
    return static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
}

/// The least number of characters to insert, remove, replace or swap with their neighbour.
std::size_t distance(std::string_view left, std::string_view right) {
    std::vector<std::vector<std::size_t>> rows(left.size() + 1, std::vector<std::size_t>(right.size() + 1));
    std::iota(rows[0].begin(), rows[0].end(), 0);
    for (std::size_t i = 1; i <= left.size(); ++i) {
        rows[i][0] = i;
        for (std::size_t j = 1; j <= right.size(); ++j) {
            const auto same = [&](std::size_t a, std::size_t b) { return lower(left[a]) == lower(right[b]); };
            const std::size_t replaced = rows[i - 1][j - 1] + (same(i - 1, j - 1) ? 0 : 1);
            rows[i][j] = std::min({rows[i - 1][j] + 1, rows[i][j - 1] + 1, replaced});
            if (i > 1 && j > 1 && same(i - 1, j - 2) && same(i - 2, j - 1))
                rows[i][j] = std::min(rows[i][j], rows[i - 2][j - 2] + 1);
        }
    }
    return rows[left.size()][right.size()];
}

/// The candidate that `word` was probably meant to be; empty where none is near.
std::string nearestTo(std::string_view word, const std::vector<std::string>& candidates) {
    constexpr std::size_t longestWord = 64; // nobody mistypes more
    std::string nearest;
    std::size_t least = std::numeric_limits<std::size_t>::max();
    for (const std::string& candidate : candidates) {
        const std::size_t found = word.size() > longestWord ? least : distance(word, candidate);
        if (found < least) {
            least = found;
            nearest = candidate;
        }
    }
    return least <= 1 + word.size() / 4 ? nearest : std::string();
}

} // namespace

double requireSeconds(const std::string& name, const std::string& word, Sign sign) {
    const std::optional<double> seconds = secondsFrom(word, sign);
    if (!seconds)
        throw CLI::ValidationError(
            name, fmt::format("'{}' is not a time; give seconds (90, 12.5) or a time code (1:30, 0:01:02.5){}", word,
                              sign == Sign::NeverNegative ? " that is not negative" : ""));
    return *seconds;
}

CLI::Option* addSeconds(CLI::App& command, const std::string& name, std::optional<double>& value,
                        const std::string& description, Sign sign) {
    const auto take = [&value, name, sign](const std::string& word) { value = requireSeconds(name, word, sign); };
    return command.add_option_function<std::string>(name, take, description)->type_name("SECONDS");
}

CLI::Option* addCount(CLI::App& command, const std::string& name, std::uint64_t& value,
                      const std::string& description) {
    const auto take = [&value, name](const std::string& word) {
        const std::optional<std::uint64_t> number = wholeNumber(word);
        if (!number)
            throw CLI::ValidationError(name, fmt::format("'{}' is not a whole number such as 0 or 100", word));
        value = *number;
    };
    return command.add_option_function<std::string>(name, take, description)->type_name("N");
}

std::string suggestionFor(std::string_view word, const std::vector<std::string>& candidates) {
    const std::string nearest = nearestTo(word, candidates);
    return nearest.empty() ? std::string() : fmt::format("; did you mean {}?", nearest);
}

} // namespace Zulm
