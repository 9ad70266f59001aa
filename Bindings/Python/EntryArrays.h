#pragma once

// The entries of a stream as one NumPy array: a record for each, its fields named as the keys of an `EntryDictionary`.

#include "ZULMetaData/ByteSource.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"
#include "ZULMetaDataBridge/Source/StreamSource.h"

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

#include <string>

namespace ZULMetaData::Python {

namespace py = pybind11;

/// Throws `KeyError` for a name that no recorded kind has.
const MetaDataKind& kindNamed(const std::string& name);

/// "time" and the stored fields, in the order in which they are stored; texts and images are objects. A record of
/// numbers lies in memory as its entry does in the stream.
py::dtype typeOfEntries(const std::string& kind);

/// Returns the names of its fields that are coordinates: the library's writers for applications cut off their
/// fractions.
py::list coordinatesOf(const std::string& kind);

/// Returns every whole entry that fits the kind. Numbers are not copied after they are read: the array keeps that
/// memory. Texts are whole; bytes in them that are not UTF-8 become lone surrogates. Throws `ValueError` for a stream
/// whose version is not known.
///@{
py::array readEntries(const StreamSource& stream);
py::array readEntries(const ByteSource& stream, const std::string& name);
///@}

/// The same for a stream whose kind is known, which must be a recorded one. Numbers are read at once with the header.
py::array readEntriesOf(const uuid& type, const ByteSource& stream, const std::string& name);

} // namespace ZULMetaData::Python
