#pragma once

// Writes a stream file from Python's values. Unlike the writers for applications it tells what goes wrong.

#include "Platform/FileLocation.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

#include <cstdint>
#include <memory>

namespace ZULMetaData::Python {

namespace py = pybind11;

/// One of the kinds that `kindNamed` gives.
class StreamWriter {
public:
    /// Creates or empties the file. Throws `OSError` where it cannot.
    static std::unique_ptr<StreamWriter> create(const FileLocation& file, const MetaDataKind& kind);

    /// A whole file. Where `entries` do not fit, as for `extend`, nothing has been created or emptied.
    static void writeFile(const FileLocation& file, const MetaDataKind& kind, const py::array& entries);

    StreamWriter() = default;
    StreamWriter(const StreamWriter&) = delete;
    StreamWriter& operator=(const StreamWriter&) = delete;
    virtual ~StreamWriter() = default;

    /// Entries as `typeOfEntries` has them. Throws `TypeError` or `ValueError` for values that do not fit; nothing of
    /// `entries` has been written then. `OSError` where the disk takes no more, or the writer is closed.
    virtual void extend(const py::array& entries) = 0;

    virtual void flush() = 0;
    virtual void close() = 0;
    virtual bool isClosed() const = 0;
    virtual std::uint64_t entriesWritten() const = 0;
};

} // namespace ZULMetaData::Python
