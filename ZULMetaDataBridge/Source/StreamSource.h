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

/// The source of a stream. It opens its file only when it is used. Copies refer to the same stream.
class ZULMETADATA_API StreamSource {
public:
    /// Returns a source for a whole stream file.
    static StreamSource file(const FileLocation& file);

    /// Returns a source for `length` bytes of a file, beginning at `offset`, or for fewer if the file ends before. This
    /// is the place that `fileDataForUUID` returns.
    static StreamSource part(const FileLocation& file, std::uint64_t offset, std::uint64_t length);

    /// Bytes of the caller, such as `loadAllData` gives, which must outlive the source. `name` is for messages.
    static StreamSource memory(std::string_view bytes, std::string name);

    /// The same bytes under another name.
    StreamSource named(std::string name) const { return {std::move(name), open_}; }

    const std::string& name() const { return name_; } ///< the path of its file, or what `memory` was given

    /// Returns the bytes of the stream, header included. Throws `std::system_error` if its file cannot be opened.
    ByteSource open() const { return open_(); }

private:
    StreamSource(std::string name, Callback<ByteSource()> open) : name_(std::move(name)), open_(std::move(open)) {}

    std::string name_;
    Callback<ByteSource()> open_;
};

} // namespace ZULMetaData
