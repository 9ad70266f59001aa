#include "Bindings/Python/StreamWriter.h"

#include "Bindings/Python/PythonTexts.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/FileError.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

namespace ZULMetaData::Python {

namespace {

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

/// What is ready to be written, for values that are not of a fixed size.
template <class Value>
std::vector<TimedValue<Value>> storedEntries(const py::array& entries) {
    std::vector<TimedValue<Value>> stored;
    stored.reserve(static_cast<std::size_t>(entries.size()));
    for (const py::handle entry : entries.attr("tolist")()) {
        const auto fields = py::reinterpret_borrow<py::tuple>(entry);
        stored.push_back({fields[0].template cast<double>(), storedValue(fields, static_cast<const Value*>(nullptr))});
    }
    return stored;
}

/// A record is what an entry is.
template <FixedSizeValue Value>
const py::array& storedEntries(const py::array& entries) {
    return entries;
}

template <class Kind>
class KindStreamWriter final : public StreamWriter {
public:
    explicit KindStreamWriter(const FileLocation& file) : file_(file) {
        errno = 0;
        writer_.init(utf8Path(file), Kind::type, Kind::version);
        throwUnlessHealthy();
    }

    void extend(const py::array& entries) override {
        if (isClosed())
            throw py::value_error("the writer is closed");
        write(storedEntries<Value>(entries));
        written_ += static_cast<std::uint64_t>(entries.size());
    }

    /// What `storedEntries` gave.
    template <class Entries>
    void write(const Entries& entries) {
        errno = 0;
        put(entries);
        throwUnlessHealthy();
    }

    void flush() override {
        errno = 0;
        writer_.getStream().flush();
        throwUnlessHealthy();
    }

    void close() override {
        errno = 0;
        writer_.close();
        throwUnlessHealthy();
    }

    bool isClosed() const override { return !stream().is_open(); }

    std::uint64_t entriesWritten() const override { return written_; }

private:
    using Value = typename Kind::Value;

    const std::ofstream& stream() const { return const_cast<KindStreamWriter*>(this)->writer_.getStream(); }

    void throwUnlessHealthy() const {
        if (!stream().good())
            throw FileError(utf8Path(file_), std::system_error(errno != 0 ? errno : EIO, std::generic_category()));
    }

    void put(const py::array& records) {
        writer_.getStream().write(static_cast<const char*>(records.data()), records.nbytes());
    }

    void put(const std::vector<TimedValue<Value>>& entries) {
        for (const TimedValue<Value>& entry : entries)
            writer_.write(entry.time, entry.value, false);
    }

    FileLocation file_;
    MetaDataWriter<Value, int, int> writer_;
    std::uint64_t written_ = 0;
};

} // namespace

std::unique_ptr<StreamWriter> StreamWriter::create(const FileLocation& file, const MetaDataKind& kind) {
    std::unique_ptr<StreamWriter> writer;
    RecordedKinds::visit(kind.type, [&]<class Kind>() { writer = std::make_unique<KindStreamWriter<Kind>>(file); });
    return writer;
}

void StreamWriter::writeFile(const FileLocation& file, const MetaDataKind& kind, const py::array& entries) {
    RecordedKinds::visit(kind.type, [&]<class Kind>() {
        const auto& stored = storedEntries<typename Kind::Value>(entries);
        KindStreamWriter<Kind> writer(file);
        writer.write(stored);
        writer.close();
    });
}

} // namespace ZULMetaData::Python
