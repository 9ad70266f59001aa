#pragma once

// A JSON document whose members are taken one after the other. What is wrong is told with its line and its member.

#include <nlohmann/json.hpp>

#include <cstddef>
#include <map>
#include <optional>
#include <string>
#include <string_view>

namespace Render {

/// A value, and where it stands.
struct JsonField {        // NOLINT(bugprone-exception-escape): documents of JSON do not throw when they move
    nlohmann::json value; ///< null for an object or an array
    std::size_t line = 1;
    std::size_t items = 0; ///< of an array
    bool isObject = false;
    bool isArray = false;
    bool isUsed = false;
};

/// Members are named by their paths, such as "cursor.size" or "places[2].from". One that is left out keeps the value
/// that it has. All functions throw `Zulm::Failure` if a value is not what they take.
class JsonFields {
public:
    /// Errors call the document `file`.
    JsonFields(std::string_view document, std::string file, const std::string& schema);

    /// Returns false if there is no such member.
    bool number(const std::string& path, double least, double most, double& result);

    /// The same for a number that may be null.
    void number(const std::string& path, double least, double most, std::optional<double>& result);

    void boolean(const std::string& path, bool& result);
    void text(const std::string& path, std::string& result);
    void section(const std::string& path);      ///< an object, which may be left out
    std::size_t array(const std::string& path); ///< returns how many elements it has

    bool has(const std::string& path) const { return fields_.contains(path); }

    [[noreturn]] void failAt(const std::string& path, const std::string& what) const;

    /// Throws if there is a member that was not taken.
    void requireNothingLeft() const;

private:
    const JsonField* take(const std::string& path);
    [[noreturn]] void fail(std::size_t line, const std::string& what) const;

    std::string file_;
    std::map<std::string, JsonField> fields_;
};

/// Returns the contents of a file of at most a megabyte. Errors say that it is no `what`. Throws `Zulm::Failure`.
std::string shortFile(const std::string& path, const std::string& what);

} // namespace Render
