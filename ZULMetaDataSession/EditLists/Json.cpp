#include "ZULMetaDataSession/EditLists/Json.h"

#include "ZULMetaDataBridge/Source/EntryTexts.h"
#include "ZULMetaDataSession/Error.h"

#include <algorithm>
#include <optional>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_mostLevels = 64;
constexpr std::size_t s_mostValues = 1'000'000;

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

/// Returns whether a name without quotes may contain the byte.
bool isOfName(char c) {
    return isDigit(c) || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_' || c == '$' ||
           static_cast<unsigned char>(c) >= 0x80;
}

/// Returns the value of a hexadecimal digit, or 16 for anything else.
std::uint32_t hexadecimal(char c) {
    if (isDigit(c))
        return static_cast<std::uint32_t>(c - '0');
    if (c >= 'a' && c <= 'f')
        return static_cast<std::uint32_t>(c - 'a') + 10;
    if (c >= 'A' && c <= 'F')
        return static_cast<std::uint32_t>(c - 'A') + 10;
    return 16;
}

class JsonReader {
public:
    JsonReader(std::string_view document, const std::string& file, JsonDialect dialect)
        : document_(document), file_(file), isJSON5_(dialect == JsonDialect::JSON5) {}

    JsonValue read() {
        position_ = validUTF8Length(document_);
        if (position_ < document_.size())
            fail("a byte is not UTF-8");
        position_ = 0;
        skipBlanks();
        JsonValue value;
        readValue(value);
        skipBlanks();
        if (!isAtEnd())
            fail("something follows the document");
        return value;
    }

private:
    [[noreturn]] void fail(const std::string& sentence) const { throw Error(file_, sentence, position_); }

    bool isAtEnd() const { return position_ >= document_.size(); }
    char next() const { return isAtEnd() ? '\0' : document_[position_]; }
    bool isNext(std::string_view characters) const { return document_.substr(position_).starts_with(characters); }

    bool take(std::string_view characters) {
        const bool isThere = isNext(characters);
        position_ += isThere ? characters.size() : 0;
        return isThere;
    }

    void require(std::string_view characters) {
        if (!take(characters))
            fail(isAtEnd() ? "the document is cut short" : "\"" + std::string(characters) + "\" is missing");
    }

    bool takeBlank() {
        for (const std::string_view blank : {" ", "\t", "\n", "\r"})
            if (take(blank))
                return true;
        if (!isJSON5_)
            return false;
        for (const std::string_view blank : {"\v", "\f", "\xc2\xa0", "\xe2\x80\xa8", "\xe2\x80\xa9", "\xef\xbb\xbf"})
            if (take(blank))
                return true;
        if (take("//")) {
            position_ = std::min(document_.find_first_of("\r\n", position_), document_.size());
            return true;
        }
        if (!isNext("/*"))
            return false;
        const std::size_t end = document_.find("*/", position_ + 2);
        if (end == std::string_view::npos)
            fail("a comment has no end");
        position_ = end + 2;
        return true;
    }

    void skipBlanks() {
        while (takeBlank()) {
        }
    }

    void readValue(JsonValue& value) {
        if (++values_ > s_mostValues)
            fail("the document has more than " + std::to_string(s_mostValues) + " values");
        value.offset = position_;
        const char first = next();
        if (first == '{' || first == '[')
            readItems(value);
        else if (first == '"' || (isJSON5_ && first == '\''))
            value = {JsonValue::Type::Text, position_, std::move(value.name), readText(), {}};
        else if (isDigit(first) || first == '-' || (isJSON5_ && (first == '+' || first == '.')))
            value = {JsonValue::Type::Number, position_, std::move(value.name), readNumber(), {}};
        else
            readWord(value);
    }

    void readWord(JsonValue& value) {
        for (const std::string_view word : {"true", "false", "null"}) {
            if (!take(word))
                continue;
            value.type = word == "null" ? JsonValue::Type::Null : JsonValue::Type::Boolean;
            value.text = word;
            return;
        }
        fail(isAtEnd() ? "the document is cut short" : "this is no value");
    }

    /// Reads an array or an object.
    void readItems(JsonValue& value) {
        value.type = next() == '{' ? JsonValue::Type::Object : JsonValue::Type::Array;
        const char* end = value.isObject() ? "}" : "]";
        if (++levels_ > s_mostLevels)
            fail("the document has more than " + std::to_string(s_mostLevels) + " levels");
        ++position_;
        skipBlanks();
        while (!take(end)) {
            if (!value.items.empty()) {
                require(",");
                skipBlanks();
                if (isJSON5_ && take(end))
                    break;
            }
            JsonValue& item = value.items.emplace_back();
            if (value.isObject())
                item.name = readName();
            readValue(item);
            skipBlanks();
        }
        --levels_;
        if (value.isObject())
            requireDistinctNames(value);
    }

    std::string readName() {
        std::string name;
        if (next() == '"' || (isJSON5_ && next() == '\''))
            name = readText();
        else if (isJSON5_ && isOfName(next()) && !isDigit(next()))
            while (isOfName(next()))
                name += document_[position_++];
        else
            fail(isAtEnd() ? "the document is cut short" : "the name of a member is missing");
        skipBlanks();
        require(":");
        skipBlanks();
        return name;
    }

    void requireDistinctNames(const JsonValue& object) {
        std::vector<const JsonValue*> members;
        members.reserve(object.items.size());
        for (const JsonValue& member : object.items)
            members.push_back(&member);
        const auto byName = [](const JsonValue* left, const JsonValue* right) { return left->name < right->name; };
        std::stable_sort(members.begin(), members.end(), byName);
        const auto first =
            std::adjacent_find(members.begin(), members.end(),
                               [](const JsonValue* left, const JsonValue* right) { return left->name == right->name; });
        if (first == members.end())
            return;
        position_ = static_cast<std::size_t>((*std::next(first))->offset);
        fail("an object has two members \"" + (*first)->name + '"');
    }

    std::string readDigits() {
        std::string digits;
        while (isDigit(next()))
            digits += document_[position_++];
        return digits;
    }

    /// Returns a number of JSON5 as JSON writes it.
    std::string readNumber() {
        std::string number = take("-") ? "-" : "";
        if (number.empty() && isJSON5_)
            take("+");
        std::string integer = readDigits();
        std::string fraction;
        const bool hasPoint = take(".");
        if (hasPoint)
            fraction = readDigits();
        const bool lacksDigits =
            isJSON5_ ? integer.empty() && fraction.empty() : integer.empty() || (hasPoint && fraction.empty());
        if (lacksDigits || (integer.size() > 1 && integer.front() == '0'))
            fail("this is no decimal number");
        number += integer.empty() ? "0" : integer;
        if (!fraction.empty())
            number += '.' + fraction;
        if (take("e") || take("E")) {
            number += 'e';
            if (next() == '-' || next() == '+')
                number += document_[position_++];
            const std::string exponent = readDigits();
            if (exponent.empty())
                fail("this is no decimal number");
            number += exponent;
        }
        if (isOfName(next()))
            fail("this is no decimal number");
        return number;
    }

    std::string readText() {
        const char quote = document_[position_++];
        std::string text;
        while (next() != quote) {
            if (isAtEnd())
                fail("a text has no end");
            const char c = document_[position_];
            if (c == '\\') {
                ++position_;
                readEscape(text);
            } else if (c == '\n' || c == '\r' || (!isJSON5_ && static_cast<unsigned char>(c) < 0x20)) {
                fail("a text contains a control character");
            } else {
                text += c;
                ++position_;
            }
        }
        ++position_;
        return text;
    }

    void readEscape(std::string& text) {
        constexpr std::string_view escapes = "\"\\/bfnrt";
        constexpr std::string_view meanings = "\"\\/\b\f\n\r\t";
        if (take("u")) {
            text += utf8Character(readUnicode());
            return;
        }
        if (const std::size_t escape = escapes.find(next()); !isAtEnd() && escape != std::string_view::npos) {
            text += meanings[escape];
            ++position_;
        } else if (!isJSON5_ || isAtEnd() || (isDigit(next()) && next() != '0')) {
            fail("this is no escape of a text");
        } else {
            readFurtherEscape(text);
        }
    }

    void readFurtherEscape(std::string& text) {
        for (const std::string_view end : {"\r\n", "\n", "\r", "\xe2\x80\xa8", "\xe2\x80\xa9"})
            if (take(end))
                return; // the text goes on in the next line
        if (take("x"))
            text += utf8Character(readHexadecimal(2));
        else if (take("v"))
            text += '\v';
        else if (take("0"))
            text += '\0';
        else
            text += document_[position_++];
    }

    std::uint32_t readHexadecimal(int digits) {
        std::uint32_t number = 0;
        for (; digits > 0; --digits) {
            const std::uint32_t digit = hexadecimal(next());
            if (digit > 15)
                fail("this is no escape of a text");
            number = number * 16 + digit;
            ++position_;
        }
        return number;
    }

    std::uint32_t readUnicode() {
        constexpr std::uint32_t firstHigh = 0xd800;
        constexpr std::uint32_t firstLow = 0xdc00;
        constexpr std::uint32_t afterLow = 0xe000;
        const std::uint32_t unit = readHexadecimal(4);
        if (unit < firstHigh || unit >= afterLow)
            return unit;
        const std::uint32_t low = unit < firstLow && take("\\u") ? readHexadecimal(4) : 0;
        if (low < firstLow || low >= afterLow)
            fail("a text contains half of a pair of surrogates");
        return 0x10000 + ((unit - firstHigh) << 10) + (low - firstLow);
    }

    std::string_view document_;
    const std::string& file_;
    bool isJSON5_;
    std::size_t position_ = 0;
    std::size_t levels_ = 0;
    std::size_t values_ = 0;
};

} // namespace

const JsonValue* JsonValue::find(std::string_view member) const {
    const auto found = std::find_if(items.begin(), items.end(), [this, member](const JsonValue& item) {
        return isObject() && item.name == member;
    });
    return found == items.end() ? nullptr : &*found;
}

JsonValue readJson(std::string_view document, const std::string& file, JsonDialect dialect) {
    return JsonReader(document, file, dialect).read();
}

} // namespace ZULMetaData::detail
