// Projects and tables of LosslessCut: segments of one movie, in seconds.
//
//     {version: 1, mediaFileName: 'a.mp4', cutSegments: [{start: 10.5, end: 20, name: ''}]}
//
//     10.5,20,the label

#include "ZULMetaDataSession/EditLists/Formats.h"
#include "ZULMetaDataSession/EditLists/ListBuilder.h"

#include <algorithm>
#include <utility>

namespace ZULMetaData::detail {

namespace {

/// Reads the segments of a project.
class ProjectReader {
public:
    ProjectReader(const std::string& file, const EditListOptions& options) : list_(file), options_(options) {}

    EditList read(const JsonValue& document) {
        if (!document.isObject())
            list_.fail("a project is an object");
        const Rational version = numberMember(list_, document, "version");
        if (version != 1 && version != 2)
            list_.fail("the project is of version " + version.text() + "; versions 1 and 2 can be read");
        hasMarkers_ = version == 2;
        std::size_t number = 0;
        for (const JsonValue& segment : arrayMember(list_, document, "cutSegments").items) {
            list_.moveTo("segment", ++number);
            readSegment(segment);
        }
        return list_.take();
    }

private:
    void readSegment(const JsonValue& segment) {
        if (!segment.isObject())
            list_.fail("a segment is an object");
        const JsonValue* selected = segment.find("selected");
        if (selected && selected->type != JsonValue::Type::Boolean)
            list_.fail("\"selected\" is neither true nor false");
        const bool isSelected = !selected || selected->text == "true";
        const bool hasEnd = segment.find("end") != nullptr;
        if (!isSelected || (hasMarkers_ && !hasEnd))
            return;
        const Rational start = segment.find("start") ? numberMember(list_, segment, "start") : Rational(0);
        if (!hasEnd && !options_.duration)
            list_.fail("it has no end, and the duration of the recording is not known");
        list_.keep(start, hasEnd ? numberMember(list_, segment, "end") : *options_.duration);
    }

    ListBuilder list_;
    const EditListOptions& options_;
    bool hasMarkers_ = false; ///< whether a segment without an end is a marker, which is never exported
};

/// Takes one row off a table, as RFC 4180 has them, and returns its first three fields. Returns false if a quotation
/// mark has no second one.
bool takeRow(std::string_view& text, char separator, std::vector<std::string>& fields) {
    constexpr std::size_t mostFields = 3;
    fields.assign(1, {});
    bool isQuoted = false;
    bool isAtStart = true;  // whether this is the first character of its field
    bool isIgnored = false; // whether this is a further field
    while (!text.empty()) {
        const char c = text.front();
        if (!isQuoted && (c == '\n' || c == '\r')) {
            takeLine(text); // the empty rest of this one
            return true;
        }
        const bool isDoubled = isQuoted && text.starts_with("\"\"");
        text.remove_prefix(isDoubled ? 2 : 1);
        const bool isFirst = std::exchange(isAtStart, c == separator && !isQuoted);
        if (c == separator && !isQuoted) {
            isIgnored = fields.size() == mostFields;
            if (!isIgnored)
                fields.emplace_back();
        } else if (c == '"' && !isDoubled && (isQuoted || isFirst)) {
            isQuoted = !isQuoted;
        } else if (!isIgnored) {
            fields.back() += c;
        }
    }
    return !isQuoted;
}

/// Returns the character between the columns of a table: that which comes first in its first line.
char separatorOf(std::string_view text) {
    text.remove_prefix(std::min(text.find_first_not_of("\r\n"), text.size()));
    const std::size_t first = text.find_first_of(",\t\r\n");
    return first != std::string_view::npos && text[first] == '\t' ? '\t' : ',';
}

/// Returns the time in a field, or nothing if it is empty. Fails for anything else.
std::optional<Rational> timeIn(const ListBuilder& list, std::string_view field) {
    field = trimmed(field);
    if (field.empty())
        return std::nullopt;
    auto time = parseEditTime(field);
    if (!time)
        list.fail(inQuotes(field) + " is no time such as 12.5 or 00:01:30.5");
    return time;
}

bool isTimeOrEmpty(std::string_view field) {
    field = trimmed(field);
    return field.empty() || parseEditTime(field);
}

} // namespace

EditList readLosslessCut(const JsonValue& document, const std::string& file, const EditListOptions& options) {
    return ProjectReader(file, options).read(document);
}

EditList readCutTable(std::string_view text, const std::string& file, const EditListOptions& options) {
    ListBuilder list(file);
    const char separator = separatorOf(text);
    std::vector<std::string> fields;
    for (std::size_t row = 1; !text.empty(); ++row) {
        list.moveTo("row", row);
        if (!takeRow(text, separator, fields))
            list.fail("a quotation mark has no second one");
        if (fields.size() == 1 && trimmed(fields[0]).empty())
            continue;
        if (fields.size() < 2)
            list.fail("it has no columns for the start, the end and the label");
        const auto start = timeIn(list, fields[0]);
        const auto end = timeIn(list, fields[1]);
        if (!end && !options.duration)
            list.fail("it has no end, and the duration of the recording is not known");
        list.keep(start.value_or(0), end ? *end : *options.duration);
    }
    EditList edits = list.take();
    if (edits.pieces().empty())
        throw Error(file, "the table has no rows");
    return edits;
}

bool beginsCutTable(std::string_view line) {
    std::vector<std::string> fields;
    return takeRow(line, separatorOf(line), fields) && fields.size() >= 2 && isTimeOrEmpty(fields[0]) &&
           isTimeOrEmpty(fields[1]) && !(trimmed(fields[0]).empty() && trimmed(fields[1]).empty());
}

} // namespace ZULMetaData::detail
