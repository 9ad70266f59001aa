#include "Reports/JsonWriter.h"

#include "Reports/Text.h"

namespace Zulm {

using Json = nlohmann::ordered_json;

namespace {

constexpr int s_indent = 2;

std::string text(const Json& document, int indent) {
    return shownJSON(document.dump(indent, ' ', false, Json::error_handler_t::replace));
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
