#include "ZULMetaDataSession/EditList.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_mostPieces = 1'000'000;
constexpr std::size_t s_mostBits = 65'536;
constexpr std::size_t s_mostBitsOfNumber = 3'321;              // a thousand decimal digits
constexpr std::size_t s_mostStoredBits = std::size_t{1} << 31; // 256 MiB
constexpr std::size_t s_freeBits = 64;                         // so many are stored without further memory

[[noreturn]] void refuse(const std::string& sentence) {
    throw Error({}, sentence);
}

/// Returns its text for a message.
std::string shownNumber(const Rational& number) {
    constexpr std::size_t most = 40;
    std::string text = number.text();
    if (text.size() > most)
        text.replace(most, text.size() - most, "...");
    return text;
}

void requireTime(const char* name, const Rational& time) {
    if (time.isNegative())
        refuse(std::string(name) + " is negative: " + shownNumber(time));
    if (time.bits() > s_mostBitsOfNumber)
        refuse(std::string(name) + " has more than 1,000 digits");
    if (!std::isfinite(time.nearest()))
        refuse(std::string(name) + " is larger than the largest 64-bit floating-point number");
}

void requirePositive(const char* name, const Rational& number) {
    requireTime(name, number);
    if (number.isZero())
        refuse(std::string(name) + " is 0; it must be above 0");
}

void requireOrder(const EditRange& range) {
    requireTime("start", range.start);
    requireTime("end", range.end);
    if (range.end <= range.start)
        refuse("end is " + shownNumber(range.end) + ", which is not after start, " + shownNumber(range.start));
}

/// Returns a part of a time code after a colon: one or two digits, and a fraction if this is the last part.
std::optional<Rational> sixtieths(std::string_view text, bool isLast) {
    const std::size_t digits = std::min(text.find('.'), text.size());
    const auto number = Rational::parse(text);
    const bool isPart = number && digits <= 2 && (isLast || digits == text.size()) &&
                        text.find('/') == std::string_view::npos && *number < 60;
    return isPart ? number : std::nullopt;
}

} // namespace

std::optional<Rational> parseEditTime(std::string_view text) {
    const std::size_t first = text.find(':');
    if (first == std::string_view::npos)
        return Rational::parse(text);
    if (text.substr(0, first).find_first_not_of("0123456789") != std::string_view::npos)
        return std::nullopt;
    std::optional<Rational> time = Rational::parse(text.substr(0, first));
    std::string_view rest = text.substr(first + 1);
    for (int parts = 1; time; ++parts) {
        const std::size_t end = rest.find(':');
        const bool isLast = end == std::string_view::npos;
        const auto part = sixtieths(rest.substr(0, end), isLast);
        time = part && parts <= 2 ? std::optional(*time * 60 + *part) : std::nullopt;
        if (isLast)
            break;
        rest.remove_prefix(end + 1);
    }
    return time;
}

EditRange parseEditRange(std::string_view text) {
    const std::size_t mark = text.find('-');
    const auto start = parseEditTime(text.substr(0, mark));
    const auto end = mark == std::string_view::npos ? std::nullopt : parseEditTime(text.substr(mark + 1));
    if (!start || !end)
        refuse('"' + std::string(text) + "\" is no range; write two times such as 10-12.5, 61/3-25 or 0:10-1:30");
    EditRange range{*start, *end};
    requireOrder(range);
    return range;
}

void EditList::keep(const Rational& start, const Rational& end, const Rational& speed) {
    requireOrder({start, end});
    requirePositive("speed", speed);
    if (speed.nearest() == 0)
        refuse("speed is nearer to 0 than any 64-bit floating-point number");
    add({start, end, speed, (end - start) / speed});
}

void EditList::keep(std::string_view text) {
    const std::size_t mark = std::min(text.find('@'), text.size());
    const EditRange range = parseEditRange(text.substr(0, mark));
    const auto speed = mark == text.size() ? Rational(1) : Rational::parse(text.substr(mark + 1));
    if (!speed)
        refuse('"' + std::string(text.substr(mark + 1)) + "\" is no speed; write a number such as 2, 0.5 or 3/2");
    keep(range.start, range.end, *speed);
}

void EditList::hold(const Rational& at, const Rational& duration) {
    requireTime("at", at);
    requirePositive("duration", duration);
    add({at, at, 1, duration});
}

void EditList::add(EditPiece piece) {
    const Rational duration = duration_ + piece.duration;
    if (!std::isfinite(duration.nearest()))
        refuse("the edited movie would last more seconds than the largest 64-bit floating-point number");
    const std::size_t bits = storedBits_ + (duration.bits() > s_freeBits ? 2 * duration.bits() : 0);
    if (duration.bits() > s_mostBits || bits > s_mostStoredBits)
        refuse("the pieces have too many different denominators; round their times and speeds, for example to "
               "milliseconds and hundredths");
    if (pieces_.size() >= s_mostPieces)
        refuse("the list has more than " + std::to_string(s_mostPieces) + " pieces");
    pieces_.push_back(std::move(piece));
    bases_.push_back(std::exchange(duration_, duration));
    storedBits_ = bits;
}

EditList EditList::without(std::vector<EditRange> removed, const Rational& duration) {
    for (const EditRange& range : removed)
        requireOrder(range);
    std::sort(removed.begin(), removed.end(),
              [](const EditRange& left, const EditRange& right) { return left.start < right.start; });
    EditList edits;
    Rational kept; // the end of what has been removed so far
    for (const EditRange& range : removed) {
        const Rational& end = std::min(range.start, duration);
        if (kept < end)
            edits.keep(kept, end);
        kept = std::max(kept, range.end);
    }
    if (kept < duration)
        edits.keep(kept, duration);
    return edits;
}

} // namespace ZULMetaData
