#pragma once

#include <cstdint>

namespace ZULMetaData {

/// What a file is, as far as finding streams in it is concerned.
struct Container {
    /// The types of files.
    enum Type : std::int32_t {
        Unknown,   ///< a file that can hold no streams
        Riff,      ///< chunks, as in AVI and WAV files
        QuickTime, ///< the atoms of a movie
        RawStream, ///< a stream file without a container
    };
};

/// Whether the search for streams prints a line on standard error about each child of metadata that is no stream.
enum class ScanMessages {
    Printed, ///< as readers of recordings do
    Omitted, ///< for programs that must not print
};

} // namespace ZULMetaData
