#pragma once

// A metadata stream that will be attached to a movie. Its bytes are in a stream file, inside another recording, or in
// memory.

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Callback.h"
#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ByteSource.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace ZULMetaData {

/// The source of a stream. It opens its file whenever it is used. Copies refer to the same stream.
class ZULMETADATA_API StreamSource {
public:
    /// Returns a source for a whole stream file.
    static StreamSource file(const FileLocation& file);

    /// Returns a source for `length` bytes of a file, beginning at `offset`, or for fewer if the file ends before. This
    /// is the place that `fileDataForUUID` returns.
    static StreamSource part(const FileLocation& file, std::uint64_t offset, std::uint64_t length);

    /// Returns a source for bytes that are open already. `name` is for messages.
    static StreamSource bytes(ByteSource bytes, std::string name);

    /// Returns a source for bytes of the caller, such as `loadAllData` provides, which must outlive it.
    static StreamSource memory(std::string_view bytes, std::string name);

    /// Returns the same source without the check that its bytes look like a stream: a stream of a registered kind and
    /// version that holds at least one whole entry, or nothing after its header. Anything else is often a wrong path,
    /// whose first 24 bytes would pass for a header. Its entries are those that the header tells apart, perhaps none.
    StreamSource unchecked() const;

    /// Returns the same source without the check, and as one of which every byte is attached: also those after its last
    /// whole entry.
    StreamSource asStored() const;

    const std::string& name() const { return name_; } ///< returns the path of its file, or what the caller said
    bool isChecked() const { return isChecked_; }     ///< returns false after `unchecked` and `asStored`
    bool isAsStored() const { return isAsStored_; }   ///< returns true after `asStored`

    /// Returns the bytes of the stream, header included. Throws `std::system_error` if its file cannot be opened.
    ByteSource open() const { return open_(); }

private:
    StreamSource(std::string name, Callback<ByteSource()> open);

    std::string name_;
    Callback<ByteSource()> open_;
    bool isChecked_ = true;
    bool isAsStored_ = false;
};

} // namespace ZULMetaData
