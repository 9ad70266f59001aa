#include "SharedDependencies/CreatorAttributes.h"

#include "SharedDependencies/UTF8.h"

#include <algorithm>
#include <cstring>
#include <iterator>
#include <string_view>

namespace ZULMetaData {

namespace {

std::size_t lengthCutAtCharacter(std::string_view text, std::size_t limit) {
    if (text.size() <= limit)
        return text.size();
    while (limit > 0 && continuesCharacter(text[limit]))
        --limit;
    return limit;
}

template <std::size_t Size>
void store(const std::string& text, char (&field)[Size]) {
    std::fill(std::begin(field), std::end(field), '\0');
    std::memcpy(field, text.data(), lengthCutAtCharacter(text, Size - 1));
}

/// Stays inside the field even if a record from disk lacks its zero byte.
template <std::size_t Size>
std::string load(const char (&field)[Size]) {
    return {std::begin(field), std::find(std::begin(field), std::end(field), '\0')};
}

template <std::size_t Size>
std::string loadWhole(const char (&field)[Size]) {
    const auto end = std::find_if(std::rbegin(field), std::rend(field), [](char c) { return c != '\0'; });
    return {std::begin(field), end.base()};
}

} // namespace

void CreatorAttributes::setName(const std::string& name) {
    store(name, name_);
}

void CreatorAttributes::setVersion(const std::string& version) {
    store(version, version_);
}

void CreatorAttributes::setPlatformVersion(const std::string& platformVersion) {
    store(platformVersion, platformVersion_);
}

std::string CreatorAttributes::name() const {
    return load(name_);
}

std::string CreatorAttributes::version() const {
    return load(version_);
}

std::string CreatorAttributes::platformVersion() const {
    return load(platformVersion_);
}

std::array<std::string, 3> CreatorAttributes::storedTexts() const {
    return {loadWhole(name_), loadWhole(version_), loadWhole(platformVersion_)};
}

std::string CreatorAttributes::platformNameMac() {
    return "Mac";
}

} // namespace ZULMetaData
