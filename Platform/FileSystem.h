#pragma once

// What file systems can do beyond the standard library: copies that keep holes, and renames that replace nothing.

#include "Platform/FileLocation.h"
#include "SharedDependencies/Export.h"

#include <cstdint>
#include <functional>
#include <stdexcept>
#include <string>

namespace ZULMetaData {

/// Why a copy ended early. `what()` does not name the file, since the caller knows both by better names.
class CopyError : public std::runtime_error {
public:
    enum class Side { Source, Target };

    CopyError(Side side, const std::string& what) : std::runtime_error(what), side_(side) {}

    Side side() const { return side_; } ///< the file that failed

private:
    Side side_;
};

/// Called now and then with the number of bytes that are copied, holes included. An exception from it ends the copy.
using CopyProgress = std::function<void(std::uint64_t done)>;

/// Makes `target`, which must exist, a copy of `size` bytes of `source` from `offset` on. Holes stay holes, and the
/// file system shares the blocks of both files if it can. Throws `CopyError`, also if `source` ends too early.
ZULMETADATA_API void copyFileRange(const FileLocation& source, std::uint64_t offset, std::uint64_t size,
                                   const FileLocation& target, const CopyProgress& progress = {});

/// Renames a file within its folder. Throws `std::system_error`, with `std::errc::file_exists` if `to` exists.
ZULMETADATA_API void renameWithoutReplacing(const FileLocation& from, const FileLocation& to);

/// The same for file systems that cannot do it in one step: takes the name with an empty file, which the rename then
/// replaces. A reader may see that empty file for a moment.
ZULMETADATA_API void renameOverPlaceholder(const FileLocation& from, const FileLocation& to);

/// Creates a folder that only its owner may enter, unless there is a folder of that name. Its parent must exist. Throws
/// `std::system_error`. Returns whether it was created.
ZULMETADATA_API bool createPrivateFolder(const FileLocation& folder);

} // namespace ZULMetaData
