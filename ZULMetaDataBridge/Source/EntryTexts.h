#pragma once

// Stored bytes as texts for the application.

#include "../../SharedDependencies/Export.h"

#include <cstddef>
#include <string>
#include <string_view>

namespace ZULMetaData {

ZULMETADATA_API bool isUTF8(std::string_view bytes); ///< overlong forms and surrogates are not

/// Bytes of the whole, valid characters that `bytes` begins with.
ZULMETADATA_API std::size_t validUTF8Length(std::string_view bytes);

/// The bytes up to the first zero byte. Throws `std::invalid_argument` where they are not UTF-8.
ZULMETADATA_API std::string textFromUTF8(const std::string& bytes);

/// The bytes up to the first zero byte, each the character of its number (ISO 8859-1), as UTF-8.
ZULMETADATA_API std::string textFromLatin1(const std::string& bytes);

} // namespace ZULMetaData
