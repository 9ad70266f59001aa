#include "Tools/record/PrivacyFilter.h"

#include "Tools/record/Failure.h"

#include <fmt/core.h>

#include <algorithm>

namespace Recorder {

namespace {

/// A window manager names the window on top a little after keys go to it.
constexpr Instant s_lateWindow = 100 * s_millisecond;
/// News of the focus may be this late.
constexpr Instant s_lateFocus = 250 * s_millisecond;

std::vector<std::regex> expressionsOf(const std::vector<std::string>& patterns) {
    std::vector<std::regex> expressions;
    for (const std::string& pattern : patterns) {
        try {
            expressions.emplace_back(pattern, std::regex::ECMAScript | std::regex::icase);
        } catch (const std::regex_error&) {
            throw Refusal(fmt::format("'{}' is no regular expression; write '\\(' for a bracket", pattern));
        }
    }
    return expressions;
}

/// The search needs stack for each character of a text, and any program may have a title of any length.
bool hasMatch(const std::vector<std::regex>& expressions, std::string text) {
    constexpr std::size_t longest = 4096;
    text.resize(std::min(text.size(), longest));
    return std::any_of(expressions.begin(), expressions.end(),
                       [&text](const std::regex& expression) { return std::regex_search(text, expression); });
}

} // namespace

PrivacyFilter::PrivacyFilter(KeyMode mode, const std::vector<std::string>& deniedApps,
                             const std::vector<std::string>& deniedTitles)
    : mode_(mode), deniedApps_(expressionsOf(deniedApps)), deniedTitles_(expressionsOf(deniedTitles)) {}

bool PrivacyFilter::denies(const std::string& app, const std::string& title) const {
    return hasMatch(deniedApps_, app) || hasMatch(deniedTitles_, title);
}

PrivacyFilter::Verdict PrivacyFilter::judge(Instant pressed) const {
    if (denied_.had(true, pressed, pressed + s_lateWindow))
        return Verdict::LeaveOut;
    if (!needsFocus_)
        return Verdict::Record;
    if (focus_.at(pressed) != Focus::Ordinary || focus_.had(Focus::Password, pressed, pressed + s_longestAnswer))
        return Verdict::LeaveOut;
    const bool isConfirmed = confirmedUntil_ >= pressed + s_lateFocus;
    const bool changedAtOnce = focus_.had(Focus::Unknown, pressed, pressed + s_lateWindow);
    if (isConfirmed && (!changedAtOnce || focus_.last() == Focus::Ordinary))
        return Verdict::Record;
    return now() > pressed + s_longestAnswer ? Verdict::LeaveOut : Verdict::Wait;
}

} // namespace Recorder
