#pragma once

// What the readers of edit lists share.

#include "ZULMetaDataSession/EditList.h"
#include "ZULMetaDataSession/EditLists/Json.h"

#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::detail {

/// Builds the list of one file. Every error names the file and the place in it that is being read.
class ListBuilder {
public:
    explicit ListBuilder(std::string file) : file_(std::move(file)) {}

    const std::string& file() const { return file_; }

    /// Says what is read from now on, such as "line" and 3.
    void moveTo(const char* kind, std::size_t number) {
        kind_ = kind;
        number_ = number;
    }
    void moveToFile() { kind_ = nullptr; } ///< says that the file as a whole is read from now on

    [[noreturn]] void fail(const std::string& sentence) const;

    /// Fails unless all sources of a list are the same.
    void requireSource(const std::string& source);

    /// As `EditList` does it.
    ///@{
    void keep(const Rational& start, const Rational& end, const Rational& speed = 1);
    void hold(const Rational& at, const Rational& duration);
    ///@}

    /// Adds what a speed makes of `duration` seconds of the edited movie: a piece from `start` on, or a held frame if
    /// the speed is 0. Fails if it is negative.
    void play(const Rational& start, const Rational& duration, const Rational& speed);

    EditList take() { return std::move(edits_); }

private:
    std::string file_;
    const char* kind_ = nullptr; ///< of the place; null for the file as a whole
    std::size_t number_ = 0;
    std::optional<std::string> source_;
    EditList edits_;
};

/// Returns a member of an object. Fails if it is not there.
const JsonValue& requireMember(const ListBuilder& list, const JsonValue& object, const char* name);

/// Returns the value of a number exactly as it is written. Fails if `value` is no number; `name` is for the message.
Rational requireNumber(const ListBuilder& list, const JsonValue& value, const std::string& name);

/// Fails if the member is not there, or is of another type.
///@{
Rational numberMember(const ListBuilder& list, const JsonValue& object, const char* name);
const std::string& textMember(const ListBuilder& list, const JsonValue& object, const char* name);
const JsonValue& arrayMember(const ListBuilder& list, const JsonValue& object, const char* name);
///@}

/// Takes the first line off a text, without its end, which may be "\n", "\r\n" or "\r".
std::string_view takeLine(std::string_view& text);

/// Returns a text without blanks at both ends.
std::string_view trimmed(std::string_view text);

/// Returns the words between blanks, but no more than the first 16.
std::vector<std::string_view> wordsOf(std::string_view line);

} // namespace ZULMetaData::detail
