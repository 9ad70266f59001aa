#pragma once

#include "../SharedDependencies/Export.h"

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <system_error>

namespace ZULMetaData {

/// The one way in which the session layer reports a failure.
class ZULMETADATA_API Error : public std::runtime_error {
public:
    /// `what()` joins them, as in "a.mp4: at 1200: an entry of cursorLocation is cut short". `file` may be empty.
    Error(const std::string& file, const std::string& sentence, std::optional<std::uint64_t> offset = std::nullopt)
        : std::runtime_error((file.empty() ? "" : file + ": ") +
                             (offset ? "at " + std::to_string(*offset) + ": " : "") + sentence),
          file_(file), sentence_(sentence), offset_(offset) {}

    /// The system refuses the file. The same call may succeed later.
    Error(const std::string& file, const std::string& sentence, std::error_code code) : Error(file, sentence) {
        code_ = code;
    }

    const std::string& file() const { return file_; }               ///< the file's name as the caller uses it, or empty
    const std::string& sentence() const { return sentence_; }       ///< what happened
    std::optional<std::uint64_t> offset() const { return offset_; } ///< the position in the file, if there is one
    std::error_code code() const { return code_; } ///< what the system said; no error if the contents are at fault

private:
    std::string file_;
    std::string sentence_;
    std::optional<std::uint64_t> offset_;
    std::error_code code_;
};

} // namespace ZULMetaData
