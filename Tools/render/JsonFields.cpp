#include "Tools/render/JsonFields.h"

#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <iterator>
#include <vector>

namespace Render {

using Zulm::Failure;

namespace {

constexpr std::size_t s_mostValues = 10'000;
constexpr std::size_t s_mostLevels = 8;

/// A line begins with its first character: the parser reads one character after a number to find its end.
struct LineCount {
    std::size_t line = 1;
    bool hasEnded = false;

    void pass(char character) {
        line += hasEnded ? 1 : 0;
        hasEnded = character == '\n';
    }
};

/// Reads the characters of a document and counts the lines.
class CountingCharacters {
public:
    using iterator_category = std::input_iterator_tag;
    using value_type = char;
    using difference_type = std::ptrdiff_t;
    using pointer = const char*;
    using reference = const char&;

    CountingCharacters(const char* place, LineCount* lines) : place_(place), lines_(lines) {}

    reference operator*() const { return *place_; }
    CountingCharacters& operator++() {
        lines_->pass(*place_);
        ++place_;
        return *this;
    }
    CountingCharacters operator++(int) {
        CountingCharacters before = *this;
        ++*this;
        return before;
    }
    bool operator==(const CountingCharacters& other) const { return place_ == other.place_; }
    bool operator!=(const CountingCharacters& other) const { return place_ != other.place_; }

private:
    const char* place_;
    LineCount* lines_;
};

/// Takes what the parser finds.
class Collector : public nlohmann::json_sax<nlohmann::json> {
public:
    Collector(std::string file, const std::size_t& line) : file_(std::move(file)), line_(line) {}

    std::map<std::string, JsonField> values;

    bool null() override { return add(nullptr) != nullptr; }
    bool boolean(bool value) override { return add(value) != nullptr; }
    bool number_integer(number_integer_t value) override { return add(value) != nullptr; }
    bool number_unsigned(number_unsigned_t value) override { return add(value) != nullptr; }
    bool number_float(number_float_t value, const string_t&) override { return add(value) != nullptr; }
    bool string(string_t& value) override { return add(value) != nullptr; }
    bool binary(binary_t&) override { return false; }
    bool start_object(std::size_t) override {
        add(nullptr)->isObject = true;
        return open();
    }
    bool end_object() override { return close(); }
    bool start_array(std::size_t) override {
        add(nullptr)->isArray = true;
        return open();
    }
    bool end_array() override { return close(); }
    bool key(string_t& name) override {
        if (name.empty() || name.find_first_of(".[]") != string_t::npos) // would pass for the path of another member
            throw Failure(fmt::format("{}: line {}: \"{}\" is not known", file_, line_, name));
        key_ = name;
        return true;
    }
    bool parse_error(std::size_t, const std::string&, const nlohmann::detail::exception& error) override {
        std::string sentence = error.what();
        sentence = sentence.substr(sentence.rfind("; ") == std::string::npos ? 0 : sentence.rfind("; ") + 2);
        throw Failure(fmt::format("{}: line {}: is not a JSON document: {}", file_, line_, sentence));
    }

private:
    JsonField* add(nlohmann::json value) {
        if (values.size() >= s_mostValues || levels_.size() > s_mostLevels)
            throw Failure(fmt::format("{}: line {}: too long or too deep", file_, line_));
        const std::string path = levels_.empty()          ? std::string()
                                 : levels_.back().empty() ? key_
                                                          : levels_.back() + "." + key_;
        JsonField* parent = levels_.empty() ? nullptr : &values[levels_.back()];
        const bool isInArray = parent && parent->isArray;
        const std::string place = isInArray ? fmt::format("{}[{}]", levels_.back(), parent->items++) : path;
        const auto [found, isNew] = values.try_emplace(place);
        if (!isNew)
            throw Failure(fmt::format("{}: line {}: \"{}\" is given twice", file_, line_, place));
        found->second.value = std::move(value);
        found->second.line = line_;
        last_ = place;
        return &found->second;
    }

    bool open() {
        levels_.push_back(last_);
        return true;
    }

    bool close() {
        levels_.pop_back();
        return true;
    }

    std::string file_;
    const std::size_t& line_;
    std::vector<std::string> levels_;
    std::string key_;
    std::string last_;
};

/// Throws `Failure` that names the line for what is no JSON document, and for two members of one name.
std::map<std::string, JsonField> fieldsIn(std::string_view document, const std::string& file) {
    LineCount lines;
    Collector collector(file, lines.line);
    const CountingCharacters begin(document.data(), &lines);
    const CountingCharacters end(document.data() + document.size(), &lines);
    nlohmann::json::sax_parse(begin, end, &collector);
    return std::move(collector.values);
}

} // namespace

JsonFields::JsonFields(std::string_view document, std::string file, const std::string& schema)
    : file_(std::move(file)), fields_(fieldsIn(document, file_)) {
    JsonField& whole = fields_.at("");
    whole.isUsed = true;
    std::string name;
    if (!whole.isObject)
        fail(1, "is not an object");
    text("schema", name);
    if (name != schema)
        fail(has("schema") ? fields_.at("schema").line : 1, fmt::format("\"schema\" must be \"{}\"", schema));
    const JsonField* version = take("schema_version");
    if (!version || !version->value.is_number() || version->value.get<double>() != 1)
        fail(version ? version->line : 1, "\"schema_version\" must be 1; a newer version of zulm may read others");
}

bool JsonFields::number(const std::string& path, double least, double most, double& result) {
    const JsonField* found = take(path);
    if (!found)
        return false;
    const auto isFine = [&](const nlohmann::json& value) {
        return value.is_number() && value.get<double>() >= least && value.get<double>() <= most;
    };
    if (!isFine(found->value))
        failAt(path, fmt::format("must be a number from {} to {}", least, most));
    result = found->value.get<double>();
    return true;
}

void JsonFields::number(const std::string& path, double least, double most, std::optional<double>& result) {
    const auto found = fields_.find(path);
    if (found == fields_.end())
        return;
    const bool isNull = found->second.value.is_null() && !found->second.isObject && !found->second.isArray;
    result.reset();
    if (isNull)
        take(path);
    else
        number(path, least, most, result.emplace());
}

void JsonFields::boolean(const std::string& path, bool& result) {
    const JsonField* found = take(path);
    if (found && !found->value.is_boolean())
        failAt(path, "must be true or false");
    if (found)
        result = found->value.get<bool>();
}

void JsonFields::text(const std::string& path, std::string& result) {
    constexpr std::size_t most = 200;
    const JsonField* found = take(path);
    if (found && (!found->value.is_string() || found->value.get<std::string>().size() > most))
        failAt(path, fmt::format("must be a text of at most {} bytes", most));
    if (found)
        result = found->value.get<std::string>();
}

void JsonFields::section(const std::string& path) {
    const JsonField* found = take(path);
    if (found && !found->isObject)
        failAt(path, "must be an object");
}

std::size_t JsonFields::array(const std::string& path) {
    const JsonField* found = take(path);
    if (!found)
        fail(1, fmt::format("\"{}\" is missing", path));
    if (!found->isArray)
        failAt(path, "must be an array");
    return found->items;
}

void JsonFields::failAt(const std::string& path, const std::string& what) const {
    fail(fields_.at(path).line, fmt::format("\"{}\" {}", path, what));
}

void JsonFields::requireNothingLeft() const {
    for (const auto& [path, field] : fields_)
        if (!field.isUsed)
            failAt(path, "is not known");
}

const JsonField* JsonFields::take(const std::string& path) {
    const auto found = fields_.find(path);
    if (found == fields_.end())
        return nullptr;
    found->second.isUsed = true;
    return &found->second;
}

void JsonFields::fail(std::size_t line, const std::string& what) const {
    throw Failure(fmt::format("{}: line {}: {}", file_, line, what));
}

std::string shortFile(const std::string& path, const std::string& what) {
    constexpr std::size_t most = std::size_t{1} << 20;
    std::ifstream stream(path, std::ios::binary);
    if (!stream)
        throw Failure(fmt::format("{}: cannot be opened: {}", path, std::strerror(errno)));
    std::string text(most + 1, '\0');
    stream.read(text.data(), static_cast<std::streamsize>(text.size()));
    text.resize(static_cast<std::size_t>(stream.gcount()));
    if (stream.bad() || text.size() > most)
        throw Failure(fmt::format("{}: cannot be read, or is too large for {}", path, what));
    return text;
}

} // namespace Render
