#pragma once

// Writes a stream file from Python's values. Unlike the writers for applications it tells what goes wrong.

#include "Platform/FileLocation.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

#include <cstdint>
#include <fstream>
#include <string>
#include <string_view>

namespace ZULMetaData::Python {

namespace py = pybind11;

class StreamWriter {
public:
    /// Creates or empties the file. `kind` is one that `kindNamed` returns. Throws `OSError` if it cannot.
    StreamWriter(const FileLocation& file, const MetaDataKind& kind);
    ~StreamWriter(); ///< writes what waits, as far as that is possible
    StreamWriter(const StreamWriter&) = delete;
    StreamWriter& operator=(const StreamWriter&) = delete;

    /// Writes a whole file. If `entries` do not fit, as for `extend`, nothing is created or emptied.
    static void writeFile(const FileLocation& file, const MetaDataKind& kind, const py::array& entries);

    /// Writes entries as `typeOfEntries` has them. Throws `TypeError` or `ValueError` for values that do not fit, and
    /// writes nothing of `entries` then. Throws `OSError` if the disk is full, or if the writer is closed.
    void extend(const py::array& entries);

    void flush();
    void close();
    bool isClosed() const { return !stream_.is_open(); }
    std::uint64_t entriesWritten() const { return written_; }

private:
    void write(std::string_view bytes);
    void writeWaiting();

    /// Does `work`, and throws `FileError` if the stream fails.
    template <class Work>
    void checked(Work work);

    std::string file_;
    uuid kind_;
    std::ofstream stream_; ///< has no buffer: closing it must not write bytes a second time after a failure
    std::string waiting_;  ///< bytes that are written together with those that follow
    std::uint64_t written_ = 0;
};

} // namespace ZULMetaData::Python
