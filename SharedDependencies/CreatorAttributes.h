#pragma once

// The 56-byte record of who made a recording, which is part of the recording info of a movie.

#include "Export.h"

#include <array>
#include <string>
#include <type_traits>

namespace ZULMetaData {

/// Holds three texts in fixed fields: name (24 bytes), version (16) and platform version (16). It is written to disk as
/// it lies in memory. Each text is UTF-8 and ends with a zero byte. A text that is too long for its field is cut after
/// the last whole character that fits.
class ZULMETADATA_API CreatorAttributes {
public:
    /// Sets the name. In every movie it is the name of the platform, by which readers tell platforms apart.
    void setName(const std::string& name);
    /// Sets the version of the application that made the recording.
    void setVersion(const std::string& version);
    /// Sets the version of the operating system, such as "6.1.0".
    void setPlatformVersion(const std::string& platformVersion);

    /// Each returns its text up to the zero byte, or the whole field if a file has no zero byte there.
    ///@{
    std::string name() const;
    std::string version() const;
    std::string platformVersion() const;
    ///@}

    /// Returns the three fields with everything that is stored in them, without the zero bytes at their ends.
    std::array<std::string, 3> storedTexts() const;

    /// Returns "Mac". It is stored as the name on every platform.
    static std::string platformNameMac();

private:
    char name_[24] = {};
    char version_[16] = {};
    char platformVersion_[16] = {};
};

static_assert(sizeof(CreatorAttributes) == 56);
static_assert(std::is_trivially_copyable_v<CreatorAttributes>);

} // namespace ZULMetaData
