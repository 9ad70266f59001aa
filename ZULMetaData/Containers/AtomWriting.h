#pragma once

// Appending one atom to a movie: its header with a size of 0, the payload, and last the real size. The header is
// always in extended form.

#include "SharedDependencies/Export.h"
#include "ZULMetaData/Containers/FourCC.h"

#include <cstdint>
#include <fstream>

namespace ZULMetaData::detail {

/// Positions in the movie; -1 if the stream had failed.
struct OpenAtom {
    std::int64_t start;
    std::int64_t sizeField;
};

/// Writes the header at the end of `movie`.
ZULMETADATA_API OpenAtom beginAtom(std::ofstream& movie, FourCC type);

/// Closes `movie` and returns the length of the atom, which is counted from an end of -1 if a write has failed.
ZULMETADATA_API std::uint64_t endAtom(std::ofstream& movie, const OpenAtom& atom);

/// Writes the extended size of an atom. Reports no failure.
ZULMETADATA_API void writeAtomSize(std::fstream& movie, std::int64_t sizeField, std::uint64_t size);

} // namespace ZULMetaData::detail
