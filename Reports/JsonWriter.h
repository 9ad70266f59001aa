#pragma once

#include <nlohmann/json.hpp>

#include <cstddef>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace Zulm {

using TextSink = std::function<void(std::string_view)>;

/// A JSON document that is written as its values come, so that it does not have to fit into memory.
///
///     JsonWriter writer(writeOutput);
///     writer.beginObject();
///     writer.member("path", "Recording.mp4");
///     writer.beginArray("matches");
///     writer.element({{"timestamp", 1.5}});
///     writer.endTo(0);
class JsonWriter {
public:
    enum class Style {
        Indented, ///< every member and element in a line of its own
        Lines,    ///< every element of an array in a line of its own
    };

    explicit JsonWriter(TextSink sink, Style style = Style::Indented) : sink_(std::move(sink)), style_(style) {}

    /// Begins the document, or the next element of the array that is open.
    void beginObject();

    /// Begins an array as the next member of the object that is open.
    void beginArray(const std::string& name);

    void member(const std::string& name, const nlohmann::ordered_json& value);

    /// Writes all members of `object`.
    void members(const nlohmann::ordered_json& object);

    void element(const nlohmann::ordered_json& value);

    /// Returns a writer of further elements of the array that is open. `joinElements` says where their text goes.
    JsonWriter forElements(TextSink sink) const;

    /// Makes the array that is open ready for the text of another writer's elements, which is put where this one's next
    /// element would be.
    void joinElements();

    /// Writes a whole array: what `documentOf` returns for each item.
    template <class Items, class DocumentOf>
    void array(const std::string& name, const Items& items, DocumentOf documentOf) {
        beginArray(name);
        for (const auto& item : items)
            element(documentOf(item));
        end();
    }

    /// Returns how many objects and arrays are open.
    std::size_t depth() const { return open_.size(); }

    /// Ends the innermost objects and arrays until only `depth` are open.
    void endTo(std::size_t depth);
    void end() { endTo(depth() - 1); }

private:
    struct Open {
        char closing; ///< '}' or ']'
        bool isEmpty = true;
    };

    void separate();
    void name(const std::string& name);
    void value(const nlohmann::ordered_json& value);
    std::string lineBreak() const;

    TextSink sink_;
    Style style_;
    std::vector<Open> open_;
};

/// Returns a document in one line, without its end. Bytes that are not UTF-8 show as U+FFFD, and characters that cannot
/// be seen as escapes of JSON.
std::string jsonLine(const nlohmann::ordered_json& document);

/// Returns the same in several lines, without the end of the last one.
std::string jsonLines(const nlohmann::ordered_json& document);

} // namespace Zulm
