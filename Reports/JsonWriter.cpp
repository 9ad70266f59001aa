#include "Reports/JsonWriter.h"

#include "Reports/Text.h"

#include <fmt/core.h>

#include <algorithm>
#include <cstdlib>

namespace Zulm {

using Json = nlohmann::ordered_json;

namespace {

constexpr int s_indent = 2;

/// Returns the end of the number that begins at `begin`.
std::size_t endOfNumber(const std::string& document, std::size_t begin) {
    return std::min(document.find_first_not_of("0123456789.eE+-", begin), document.size());
}

/// Returns the number in the fewest digits that tell it from all others, or as it is written if it has these already.
std::string shortestNumber(const std::string& written) {
    std::string shortest = fmt::format("{}", std::strtod(written.c_str(), nullptr));
    const bool isFraction = written.find('.') != std::string::npos && !written.ends_with(".0");
    return isFraction && shortest.size() < written.size() ? shortest : written;
}

/// Returns the document with its numbers in the fewest digits. The serializer writes one digit too many for about one
/// number in two thousand.
std::string withShortestNumbers(std::string document) {
    constexpr std::size_t fewest = 15; // digits that the serializer writes only if they are needed
    bool isInText = false;
    for (std::size_t i = 0; i < document.size(); ++i) {
        const char c = document[i];
        if (c == '"')
            isInText = !isInText;
        else if (isInText && c == '\\')
            ++i;
        else if (!isInText && c >= '0' && c <= '9') {
            const std::size_t size = endOfNumber(document, i) - i;
            if (size > fewest)
                document.replace(i, size, shortestNumber(document.substr(i, size)));
            i = endOfNumber(document, i) - 1;
        }
    }
    return document;
}

std::string text(const Json& document, int indent) {
    return shownJSON(withShortestNumbers(document.dump(indent, ' ', false, Json::error_handler_t::replace)));
}

} // namespace

void JsonWriter::beginObject() {
    separate();
    sink_("{");
    open_.push_back({'}'});
}

void JsonWriter::beginArray(const std::string& name) {
    this->name(name);
    sink_("[");
    open_.push_back({']'});
}

void JsonWriter::member(const std::string& name, const Json& value) {
    this->name(name);
    this->value(value);
}

void JsonWriter::members(const Json& object) {
    for (const auto& [name, value] : object.items())
        member(name, value);
}

void JsonWriter::element(const Json& value) {
    separate();
    this->value(value);
}

JsonWriter JsonWriter::forElements(TextSink sink) const {
    JsonWriter writer(std::move(sink), style_);
    for (const Open& level : open_) // whether one is empty may change meanwhile, in another thread
        writer.open_.push_back({level.closing});
    return writer;
}

void JsonWriter::joinElements() {
    if (!open_.back().isEmpty)
        sink_(",");
    open_.back().isEmpty = false;
}

void JsonWriter::endTo(std::size_t depth) {
    while (open_.size() > depth) {
        const Open ended = open_.back();
        open_.pop_back();
        if (style_ == Style::Indented && !ended.isEmpty)
            sink_(lineBreak());
        sink_({&ended.closing, 1});
    }
}

void JsonWriter::separate() {
    if (open_.empty())
        return;
    Open& open = open_.back();
    if (!open.isEmpty)
        sink_(",");
    open.isEmpty = false;
    if (style_ == Style::Indented || open.closing == ']')
        sink_(lineBreak());
}

void JsonWriter::name(const std::string& name) {
    separate();
    sink_(jsonLine(name));
    sink_(style_ == Style::Indented ? ": " : ":");
}

void JsonWriter::value(const Json& value) {
    if (style_ == Style::Lines)
        return sink_(jsonLine(value));
    const std::string lines = jsonLines(value);
    const std::string indentedBreak = lineBreak();
    std::size_t begin = 0;
    for (std::size_t end = lines.find('\n'); end != std::string::npos; end = lines.find('\n', begin)) {
        sink_(std::string_view(lines).substr(begin, end - begin)); // no line ends inside of a text
        sink_(indentedBreak);
        begin = end + 1;
    }
    sink_(std::string_view(lines).substr(begin));
}

std::string JsonWriter::lineBreak() const {
    return '\n' + std::string(style_ == Style::Indented ? s_indent * open_.size() : 0, ' ');
}

std::string jsonLine(const Json& document) {
    return text(document, -1);
}

std::string jsonLines(const Json& document) {
    return text(document, s_indent);
}

} // namespace Zulm
