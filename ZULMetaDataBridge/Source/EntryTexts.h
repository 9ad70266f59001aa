#pragma once

// Stored bytes as texts for the application.

#include "../../SharedDependencies/Export.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace ZULMetaData {

ZULMETADATA_API bool isUTF8(std::string_view bytes); ///< overlong forms and surrogates are not

/// Bytes of the whole, valid characters that `bytes` begins with.
ZULMETADATA_API std::size_t validUTF8Length(std::string_view bytes);

/// Returns the length of the valid character that `bytes` begins with, or 0 if it begins with none or is empty.
ZULMETADATA_API std::size_t validCharacterLength(std::string_view bytes);

/// Returns the character with this number as UTF-8. Empty for surrogates and for numbers beyond U+10FFFF.
ZULMETADATA_API std::string utf8Character(std::uint32_t codePoint);

namespace detail {

/// Returns a number below 0x200000 in the form of a character of UTF-8, even if it is none.
std::string encodedUTF8(std::uint32_t number);

} // namespace detail

/// Returns all bytes as UTF-8, each the character of its number (ISO 8859-1).
ZULMETADATA_API std::string utf8FromLatin1(std::string_view bytes);

/// Returns the bytes up to the first zero byte. Throws `std::invalid_argument` if they are not UTF-8.
ZULMETADATA_API std::string textFromUTF8(const std::string& bytes);

/// Returns the bytes up to the first zero byte, each the character of its number (ISO 8859-1), as UTF-8.
ZULMETADATA_API std::string textFromLatin1(const std::string& bytes);

} // namespace ZULMetaData
