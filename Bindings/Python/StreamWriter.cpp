#include "Bindings/Python/StreamWriter.h"

#include "Bindings/Python/PythonTexts.h"
#include "SharedDependencies/EndianFile.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/FileError.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <sstream>
#include <system_error>
#include <utility>

namespace ZULMetaData::Python {

namespace {

constexpr std::size_t s_blockSize = 65536;

std::string storedValue(const py::tuple& entry, const std::string*) {
    return storedText(entry[1]);
}

std::list<std::string> storedValue(const py::tuple& entry, const std::list<std::string>*) {
    std::list<std::string> texts;
    for (std::size_t i = 1; i < entry.size(); ++i)
        texts.push_back(storedText(entry[i]));
    return texts;
}

/// The fields are in the order of `typeOfEntries`.
CursorImage storedValue(const py::tuple& entry, const CursorImage*) {
    unsigned char* data = nullptr;
    std::string_view bytes;
    if (!entry[6].is_none()) {
        if (!py::isinstance<py::bytes>(entry[6]))
            throw py::type_error("an image is the bytes of a PNG or TIFF file, or None for one that came before");
        bytes = entry[6].cast<std::string_view>();
        if (bytes.size() > std::numeric_limits<std::int32_t>::max())
            throw py::value_error("an image of more than 2 GiB");
    }
    if (!bytes.empty()) {
        data = static_cast<unsigned char*>(std::malloc(bytes.size()));
        if (!data)
            throw std::bad_alloc();
        std::memcpy(data, bytes.data(), bytes.size());
    }
    return {entry[1].cast<std::uint64_t>(),
            entry[2].cast<std::int32_t>(),
            entry[3].cast<std::int32_t>(),
            data,
            static_cast<std::uint32_t>(bytes.size()),
            static_cast<CursorTypeID>(entry[4].cast<std::int32_t>()),
            static_cast<CursorImage::CursorImageFlags>(entry[5].cast<std::uint32_t>())};
}

/// Returns what the entries are in a stream of their kind. A record of numbers is an entry; others are put together in
/// `encoded`.
std::string_view storedBytes(const uuid& kind, const py::array& entries, std::string& encoded) {
    std::string_view bytes(static_cast<const char*>(entries.data()), static_cast<std::size_t>(entries.nbytes()));
    RecordedKinds::visit(kind, [&]<class Kind>() {
        using Value = typename Kind::Value;
        if constexpr (!FixedSizeValue<Value>) {
            std::ostringstream stream;
            stream.exceptions(std::ios_base::badbit); // there is no memory
            for (const py::handle entry : entries.attr("tolist")()) {
                const auto fields = py::reinterpret_borrow<py::tuple>(entry);
                metaDataWrite<Value>(fields[0].template cast<double>(),
                                     storedValue(fields, static_cast<const Value*>(nullptr)), stream, Kind::version);
            }
            bytes = encoded = std::move(stream).str();
        }
    });
    return bytes;
}

} // namespace

template <class Work>
void StreamWriter::checked(Work work) {
    errno = 0;
    work();
    if (stream_.good())
        return;
    const int error = errno != 0 ? errno : EIO;
    throw FileError(file_, std::system_error(error, std::generic_category()));
}

StreamWriter::StreamWriter(const FileLocation& file, const MetaDataKind& kind)
    : file_(utf8Path(file)), kind_(kind.type) {
    MetaDataHeader header{kind.type, kind.currentVersion, 0};
    header.fixedEntrySize = entrySizeOf(header);
    stream_.rdbuf()->pubsetbuf(nullptr, 0);
    checked([&] {
        fileOpen(stream_, file_.c_str(), std::ios_base::binary | std::ios_base::trunc);
        stream_.write(reinterpret_cast<const char*>(&header), sizeof header);
    });
}

StreamWriter::~StreamWriter() {
    writeWaiting();
}

void StreamWriter::writeFile(const FileLocation& file, const MetaDataKind& kind, const py::array& entries) {
    std::string encoded;
    const std::string_view bytes = storedBytes(kind.type, entries, encoded);
    StreamWriter writer(file, kind);
    writer.write(bytes);
    writer.close();
}

void StreamWriter::extend(const py::array& entries) {
    if (isClosed())
        throw py::value_error("the writer is closed");
    std::string encoded;
    write(storedBytes(kind_, entries, encoded));
    written_ += static_cast<std::uint64_t>(entries.size());
}

void StreamWriter::write(std::string_view bytes) {
    checked([&] {
        if (waiting_.size() + bytes.size() > s_blockSize)
            writeWaiting();
        if (bytes.size() > s_blockSize)
            stream_.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        else
            waiting_ += bytes;
    });
}

void StreamWriter::writeWaiting() {
    const std::string bytes = std::exchange(waiting_, {});
    stream_.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
}

void StreamWriter::flush() {
    checked([this] { writeWaiting(); });
}

void StreamWriter::close() {
    checked([this] {
        if (isClosed())
            return;
        writeWaiting();
        stream_.close();
    });
}

} // namespace ZULMetaData::Python
