#include "ZULMetaDataSession/EditLists/ListBuilder.h"

#include "ZULMetaDataSession/EditLists/Decimal.h"

#include <algorithm>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_mostWords = 16;
constexpr std::string_view s_textBlanks = " \t\r\n\v\f";

/// Calls `add`. What it refuses becomes an error of the builder.
template <class Add>
void orFail(const ListBuilder& list, Add add) {
    std::optional<std::string> refusal;
    try {
        add();
    } catch (const Error& error) {
        refusal = error.sentence();
    }
    if (refusal)
        list.fail(*refusal);
}

} // namespace

void ListBuilder::fail(const std::string& sentence) const {
    throw Error(file_, kind_ ? kind_ + (' ' + std::to_string(number_)) + ": " + sentence : sentence);
}

void ListBuilder::requireSource(const std::string& source) {
    if (source_ && *source_ != source)
        fail("the source is " + inQuotes(source) + ", but that of an earlier piece is " + inQuotes(*source_) +
             "; an edit list has one recording as its source");
    source_ = source;
}

void ListBuilder::keep(const Rational& start, const Rational& end, const Rational& speed) {
    orFail(*this, [&] { edits_.keep(start, end, speed); });
}

void ListBuilder::hold(const Rational& at, const Rational& duration) {
    orFail(*this, [&] { edits_.hold(at, duration); });
}

void ListBuilder::play(const Rational& start, const Rational& duration, const Rational& speed) {
    if (speed.isNegative())
        fail("it runs backwards, which an edit list cannot say");
    if (speed.isZero())
        hold(start, duration);
    else
        keep(start, start + duration * speed, speed);
}

const JsonValue& requireMember(const ListBuilder& list, const JsonValue& object, const char* name) {
    const JsonValue* member = object.find(name);
    if (!member)
        list.fail('"' + std::string(name) + "\" is missing");
    return *member;
}

Rational requireNumber(const ListBuilder& list, const JsonValue& value, const std::string& name) {
    const auto number = value.isNumber() ? exactDecimal(value.text) : std::nullopt;
    if (!number)
        list.fail(name + " is no number, or one of more than 400 places");
    return *number;
}

Rational numberMember(const ListBuilder& list, const JsonValue& object, const char* name) {
    return requireNumber(list, requireMember(list, object, name), '"' + std::string(name) + '"');
}

const std::string& textMember(const ListBuilder& list, const JsonValue& object, const char* name) {
    const JsonValue& member = requireMember(list, object, name);
    if (!member.isText())
        list.fail('"' + std::string(name) + "\" is no text");
    return member.text;
}

const JsonValue& arrayMember(const ListBuilder& list, const JsonValue& object, const char* name) {
    const JsonValue& member = requireMember(list, object, name);
    if (!member.isArray())
        list.fail('"' + std::string(name) + "\" is no array");
    return member;
}

std::string_view takeLine(std::string_view& text) {
    const std::size_t end = std::min(text.find_first_of("\r\n"), text.size());
    const std::string_view line = text.substr(0, end);
    text.remove_prefix(end);
    text.remove_prefix(text.starts_with("\r\n") ? 2 : text.empty() ? 0 : 1);
    return line;
}

std::string_view trimmed(std::string_view text) {
    text.remove_prefix(std::min(text.find_first_not_of(s_textBlanks), text.size()));
    return text.empty() ? text : text.substr(0, text.find_last_not_of(s_textBlanks) + 1);
}

std::vector<std::string_view> wordsOf(std::string_view line) {
    std::vector<std::string_view> words;
    for (line = trimmed(line); !line.empty() && words.size() < s_mostWords; line = trimmed(line)) {
        const std::size_t end = std::min(line.find_first_of(s_textBlanks), line.size());
        words.push_back(line.substr(0, end));
        line.remove_prefix(end);
    }
    return words;
}

} // namespace ZULMetaData::detail
