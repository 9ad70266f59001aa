#pragma once

// Writes streams to the end of a movie or RIFF file as one `ZULM` item. Used to write a whole file anew; a
// movie that must not be lost is changed by `SafeMovieSave`.

#include "ZULMetaData/ByteSource.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/Containers/ContainerType.h"

#include <cstdint>
#include <functional>
#include <ostream>

namespace ZULMetaData {

/// Throws `std::length_error` if a stream or all of them do not fit into a chunk. Other failures show in the state of
/// the output; a position that cannot be determined makes it bad.
class MetaDataSection {
public:
    /// Begins at the position of `out`.
    MetaDataSection(std::ostream& out, Container::Type type);

    /// Calls `write(out)`, which appends the stream and returns whether it stays. A stream that does not is taken back.
    template <class Write>
    void add(Write write) {
        const std::uint64_t begin = open();
        if (write(out_))
            close(begin, detail::s_streamAtom);
        else
            moveTo(begin);
    }

    /// Ends the item, or takes it back if it has no stream.
    void finish();

private:
    std::uint64_t position();
    void moveTo(std::uint64_t position);
    std::uint64_t open();
    void close(std::uint64_t begin, FourCC type);

    std::ostream& out_;
    bool isMovie_;
    std::uint64_t begin_;
    std::uint64_t firstStream_;
};

/// Appends a part of a source to an output. Pieces that are zero are skipped, so that holes of a file stay holes. Calls
/// `advance` with the number of bytes that were copied. Throws `std::system_error` if the source ends early.
void appendBytes(const ByteSource& source, std::uint64_t offset, std::uint64_t size, std::ostream& out,
                 const std::function<void(std::uint64_t)>& advance = {});

/// Returns whether two sources hold the same bytes.
bool haveSameBytes(const ByteSource& left, const ByteSource& right);

} // namespace ZULMetaData
