#pragma once

// Who made a recording: the 56-byte creator record of a movie's recording info.

#include "Export.h"

#include <cstddef>
#include <string>
#include <type_traits>

namespace ZULMetaData {

/// Three texts in fixed fields, written to disk as they lie in memory: name (24 bytes), version (16) and
/// platform version (16). Each is UTF-8 and always ends with a zero byte; a text too long for its field is cut
/// behind its last whole character.
class ZULMETADATA_API CreatorAttributes {
public:
    void setName(const std::string& name);       ///< in every movie the platform's, which readers look at
    void setVersion(const std::string& version); ///< of the application that recorded
    void setPlatformVersion(const std::string& platformVersion); ///< of the operating system, such as "6.1.0"

    std::string name() const;            ///< up to its zero byte, or to the field's end where a file lacks that
    std::string version() const;         ///< likewise
    std::string platformVersion() const; ///< likewise

    static std::string platformNameMac(); ///< "Mac", which is stored as the name wherever a movie is recorded

private:
    char name_[24] = {};
    char version_[16] = {};
    char platformVersion_[16] = {};
};

static_assert(sizeof(CreatorAttributes) == 56);
static_assert(std::is_trivially_copyable_v<CreatorAttributes>);

} // namespace ZULMetaData
