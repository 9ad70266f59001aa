#include "Bindings/Python/EntryArrays.h"

#include "Bindings/Python/PythonTexts.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"

#include <algorithm>
#include <array>
#include <bit>
#include <memory>
#include <tuple>
#include <utility>
#include <vector>

namespace ZULMetaData::Python {

namespace {

// The arrays lie over the bytes of a stream, which are little-endian.
static_assert(std::endian::native == std::endian::little);

/// Calls `visit` with the key of every stored number of an entry, and a number of its type.
template <class Kind, class Visit>
void visitNumbers(Visit visit) {
    const auto visitNumber = [&visit]<class Projection>(const Field<Projection>& field) {
        using Result = std::decay_t<std::invoke_result_t<Projection, const typename Kind::Value&>>;
        if constexpr (std::is_arithmetic_v<Result>)
            visit(field.key, Result());
    };
    std::apply([&](const auto&... field) { (visitNumber(field), ...); }, Kind::fields);
}

template <class Kind>
py::dtype entryType() {
    py::list fields;
    const auto add = [&fields](const char* key, const py::object& type) { fields.append(py::make_tuple(key, type)); };
    add("time", py::dtype::of<double>());
    visitNumbers<Kind>([&]<class Number>(const char* key, Number) { add(key, py::dtype::of<Number>()); });
    if constexpr (std::is_same_v<Kind, CursorImageKind>) {
        add("cursorTypeId", py::dtype::of<std::int32_t>());
        add("flags", py::dtype::of<std::uint32_t>());
        add("image", py::dtype("O"));
    } else if constexpr (!FixedSizeValue<typename Kind::Value>) {
        for (const char* key : std::apply([](const auto&... field) { return std::array{field.key...}; }, Kind::fields))
            add(key, py::dtype("O"));
    }
    return py::dtype::from_args(fields);
}

/// Returns the type as a new object, because Python code may rename the fields of an array in place. Copying it takes a
/// fraction of the time of making it, which counts if many recordings are read.
template <class Kind>
py::dtype copiedEntryType() {
    static py::handle made; // never destroyed, because Python ends before
    if (!made)
        made = entryType<Kind>().release();
    return made.attr("newbyteorder")("|"); // which keeps the order; the type's own constructor makes no copy
}

void requireDecodable(const std::optional<MetaDataHeader>& header, const uuid& type, const std::string& name) {
    if (!header || header->uuid != type || !isDecodable(*header))
        throwValueError(name + ": the entries cannot be decoded: the version of the stream is not known, or its "
                               "header does not state the entry size of its kind");
}

/// The stored bytes themselves, in memory that the array owns. The header is read with them, so that one read is
/// enough.
template <class Kind>
py::array arrayOverStream(const ByteSource& stream, const std::string& name) {
    constexpr std::size_t entrySize = sizeof(double) + sizeof(typename Kind::Value);
    std::unique_ptr<char[]> bytes;
    std::optional<MetaDataHeader> header;
    std::size_t count = 0;
    {
        const py::gil_scoped_release others;
        const auto size = static_cast<std::size_t>(stream.size());
        bytes.reset(new char[size]);
        const std::size_t got = stream.read(0, {bytes.get(), size});
        if (got >= s_metaDataHeaderSize) {
            header = detail::numberIn<MetaDataHeader>({bytes.get(), got}, 0);
            count = (got - s_metaDataHeaderSize) / entrySize;
        }
    }
    requireDecodable(header, Kind::type, name);
    const char* data = bytes.get() + s_metaDataHeaderSize;
    const py::capsule owner(bytes.release(), [](void* memory) { delete[] static_cast<char*>(memory); });
    const py::dtype type = copiedEntryType<Kind>();
    if (static_cast<std::size_t>(type.itemsize()) != entrySize)
        throw std::logic_error("a record is not what an entry is");
    return {type, {count}, {entrySize}, data, owner};
}

template <class Value>
std::vector<TimedValue<Value>> decodeAll(StreamEntries& entries) {
    const py::gil_scoped_release others;
    std::vector<TimedValue<Value>> decoded;
    while (const auto entry = entries.next())
        if (auto fitting = decodeEntry<Value>(entries.bytesOf(*entry), entries.header()->version))
            decoded.push_back(std::move(*fitting));
    return decoded;
}

py::tuple rowOf(double time, const std::string& text, const py::dtype&) {
    return py::make_tuple(time, pythonText(text));
}

/// A text that an entry lacks is None.
py::tuple rowOf(double time, const std::list<std::string>& texts, const py::dtype& type) {
    py::tuple row(py::len(type));
    std::size_t column = 0;
    row[column++] = time;
    for (const std::string& text : texts)
        if (column < row.size())
            row[column++] = pythonText(text);
    while (column < row.size())
        row[column++] = py::none();
    return row;
}

py::tuple rowOf(double time, const CursorImage& cursor, const py::dtype&) {
    py::object image = py::none();
    if (cursor.imageData && cursor.imageDataSize > 0)
        image = py::bytes(reinterpret_cast<const char*>(cursor.imageData), cursor.imageDataSize);
    return py::make_tuple(time, cursor.uniqueId, cursor.hotspotOffsetX, cursor.hotspotOffsetY,
                          static_cast<std::int32_t>(cursor.cursorTypeId), static_cast<std::uint32_t>(cursor.flags),
                          image);
}

/// Reads the header.
StreamEntries entriesIn(const ByteSource& stream) {
    const py::gil_scoped_release others;
    return StreamEntries(stream);
}

template <class Kind>
py::array entriesOfKind(const ByteSource& stream, const std::string& name) {
    using Value = typename Kind::Value;
    if constexpr (FixedSizeValue<Value>) {
        return arrayOverStream<Kind>(stream, name);
    } else {
        StreamEntries entries = entriesIn(stream);
        requireDecodable(entries.header(), Kind::type, name);
        const py::dtype type = entryType<Kind>();
        py::list rows;
        for (const TimedValue<Value>& entry : decodeAll<Value>(entries))
            rows.append(rowOf(entry.time, entry.value, type));
        return py::module_::import("numpy").attr("array")(rows, type);
    }
}

} // namespace

const MetaDataKind& kindNamed(const std::string& name) {
    const MetaDataKind* kind = findMetaDataKind(name);
    if (!kind || !RecordedKinds::visit(kind->type, []<class Kind>() {}))
        throw py::key_error(name);
    return *kind;
}

py::dtype typeOfEntries(const std::string& kind) {
    py::dtype type = py::dtype::of<double>();
    RecordedKinds::visit(kindNamed(kind).type, [&type]<class Kind>() { type = entryType<Kind>(); });
    return type;
}

py::list coordinatesOf(const std::string& kind) {
    py::list names;
    RecordedKinds::visit(kindNamed(kind).type, [&names]<class Kind>() {
        using Value = typename Kind::Value;
        if constexpr (std::is_same_v<Value, Point> || std::is_same_v<Value, Rect> || std::is_same_v<Value, CursorImage>)
            visitNumbers<Kind>([&names]<class Number>(const char* key, Number) {
                if (std::is_same_v<Number, std::int32_t>)
                    names.append(key);
            });
    });
    return names;
}

py::array readEntries(const StreamSource& source) {
    return readEntries(source.open(), source.name());
}

py::array readEntries(const ByteSource& stream, const std::string& name) {
    const std::optional<MetaDataHeader> header = entriesIn(stream).header();
    requireDecodable(header, header ? header->uuid : uuid(), name);
    return readEntriesOf(header->uuid, stream, name);
}

py::array readEntriesOf(const uuid& type, const ByteSource& stream, const std::string& name) {
    py::array array;
    RecordedKinds::visit(type, [&]<class Kind>() { array = entriesOfKind<Kind>(stream, name); });
    return array;
}

} // namespace ZULMetaData::Python
