#include "Bindings/Python/EntryArrays.h"

#include "Bindings/Python/PythonTexts.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"

#include <algorithm>
#include <iterator>
#include <memory>
#include <tuple>
#include <utility>
#include <vector>

namespace ZULMetaData::Python {

namespace {

template <class Value>
constexpr const char* numberFormat() {
    if constexpr (std::is_same_v<Value, std::int32_t>)
        return "<i4";
    else if constexpr (std::is_same_v<Value, std::uint32_t>)
        return "<u4";
    else if constexpr (std::is_same_v<Value, float>)
        return "<f4";
    else if constexpr (std::is_same_v<Value, double>)
        return "<f8";
    else
        return nullptr; // a text, which only the kind's own entries are made of
}

template <class Kind>
void addFields(py::list& fields) {
    const auto add = [&fields]<class Projection>(const Field<Projection>& field) {
        using Result = std::decay_t<std::invoke_result_t<Projection, const typename Kind::Value&>>;
        if constexpr (!FixedSizeValue<typename Kind::Value>)
            fields.append(py::make_tuple(field.key, "O"));
        else if constexpr (numberFormat<Result>() != nullptr)
            fields.append(py::make_tuple(field.key, numberFormat<Result>()));
    };
    std::apply([&add](const auto&... field) { (add(field), ...); }, Kind::fields);
}

template <>
void addFields<CursorImageKind>(py::list& fields) {
    fields.append(py::make_tuple("id", "<u8"));
    fields.append(py::make_tuple("hotspotOffsetX", "<i4"));
    fields.append(py::make_tuple("hotspotOffsetY", "<i4"));
    fields.append(py::make_tuple("cursorTypeId", "<i4"));
    fields.append(py::make_tuple("flags", "<u4"));
    fields.append(py::make_tuple("image", "O"));
}

template <class Kind>
py::dtype entryType() {
    py::list fields;
    fields.append(py::make_tuple("time", "<f8"));
    addFields<Kind>(fields);
    return py::dtype::from_args(fields);
}

/// The stored bytes themselves, in memory that the array owns.
template <class Kind>
py::array arrayOverStream(const ByteSource& stream) {
    constexpr std::size_t entrySize = sizeof(double) + sizeof(typename Kind::Value);
    std::unique_ptr<char[]> bytes;
    std::size_t count = 0;
    {
        const py::gil_scoped_release others;
        const std::uint64_t body = stream.size() - std::min<std::uint64_t>(stream.size(), s_metaDataHeaderSize);
        const std::size_t whole = static_cast<std::size_t>(body / entrySize) * entrySize;
        bytes.reset(new char[whole]);
        count = stream.read(s_metaDataHeaderSize, {bytes.get(), whole}) / entrySize;
    }
    const char* data = bytes.get();
    const py::capsule owner(bytes.release(), [](void* memory) { delete[] static_cast<char*>(memory); });
    const py::dtype type = entryType<Kind>();
    if (static_cast<std::size_t>(type.itemsize()) != entrySize)
        throw std::logic_error("a record is not what an entry is");
    return {type, {count}, {entrySize}, data, owner};
}

template <class Value>
std::vector<TimedValue<Value>> decodeAll(const ByteSource& stream) {
    const py::gil_scoped_release others;
    std::vector<TimedValue<Value>> decoded;
    StreamEntries entries(stream);
    while (const auto entry = entries.next())
        if (auto fitting = decodeEntry<Value>(entries.bytesOf(*entry), entries.header()->version))
            decoded.push_back(std::move(*fitting));
    return decoded;
}

/// Moves one field of all entries into its column.
template <class Value, class ValueOf>
void fillColumn(py::array& array, const char* name, const std::vector<TimedValue<Value>>& entries, ValueOf valueOf) {
    py::list column(entries.size());
    for (std::size_t i = 0; i < entries.size(); ++i)
        column[i] = valueOf(entries[i].value);
    array[py::str(name)] = column;
}

void fillColumns(py::array& array, const std::vector<TimedValue<std::string>>& entries) {
    const py::object name = array.dtype().attr("names")[py::int_(1)];
    fillColumn(array, name.cast<std::string>().c_str(), entries, pythonText);
}

/// A text that an entry lacks is None.
void fillColumns(py::array& array, const std::vector<TimedValue<std::list<std::string>>>& entries) {
    const py::tuple names = array.dtype().attr("names");
    for (std::size_t column = 1; column < names.size(); ++column)
        fillColumn(array, names[column].cast<std::string>().c_str(), entries,
                   [column](const std::list<std::string>& texts) -> py::object {
                       if (texts.size() < column)
                           return py::none();
                       return pythonText(*std::next(texts.begin(), static_cast<std::ptrdiff_t>(column) - 1));
                   });
}

void fillColumns(py::array& array, const std::vector<TimedValue<CursorImage>>& entries) {
    const auto field = [&](const char* name, auto valueOf) { fillColumn(array, name, entries, valueOf); };
    field("id", [](const CursorImage& cursor) { return py::int_(cursor.uniqueId); });
    field("hotspotOffsetX", [](const CursorImage& cursor) { return py::int_(cursor.hotspotOffsetX); });
    field("hotspotOffsetY", [](const CursorImage& cursor) { return py::int_(cursor.hotspotOffsetY); });
    field("cursorTypeId", [](const CursorImage& cursor) { return py::int_(static_cast<int>(cursor.cursorTypeId)); });
    field("flags", [](const CursorImage& cursor) { return py::int_(static_cast<std::uint32_t>(cursor.flags)); });
    field("image", [](const CursorImage& cursor) -> py::object {
        if (!cursor.imageData || cursor.imageDataSize == 0)
            return py::none();
        return py::bytes(reinterpret_cast<const char*>(cursor.imageData), cursor.imageDataSize);
    });
}

template <class Kind>
py::array entriesOfKind(const ByteSource& stream) {
    using Value = typename Kind::Value;
    if constexpr (FixedSizeValue<Value>) {
        return arrayOverStream<Kind>(stream);
    } else {
        const std::vector<TimedValue<Value>> entries = decodeAll<Value>(stream);
        py::array array(entryType<Kind>(), static_cast<py::ssize_t>(entries.size()));
        py::array_t<double> times(static_cast<py::ssize_t>(entries.size()));
        std::transform(entries.begin(), entries.end(), times.mutable_data(),
                       [](const TimedValue<Value>& entry) { return entry.time; });
        array[py::str("time")] = times;
        fillColumns(array, entries);
        return array;
    }
}

} // namespace

const MetaDataKind& kindNamed(const std::string& name) {
    const MetaDataKind* kind = findMetaDataKind(name);
    if (!kind || !RecordedKinds::visit(kind->type, []<class Kind>() {}))
        throw py::key_error(name);
    return *kind;
}

py::dtype typeOfEntries(const uuid& kind) {
    py::dtype type = py::dtype::of<double>();
    RecordedKinds::visit(kind, [&type]<class Kind>() { type = entryType<Kind>(); });
    return type;
}

py::list coordinatesOf(const uuid& kind) {
    py::list names;
    RecordedKinds::visit(kind, [&names]<class Kind>() {
        using Value = typename Kind::Value;
        const auto add = [&names]<class Projection>(const Field<Projection>& field) {
            using Result = std::decay_t<std::invoke_result_t<Projection, const Value&>>;
            if constexpr (std::is_same_v<Result, std::int32_t>)
                names.append(field.key);
        };
        if constexpr (std::is_same_v<Value, Point> || std::is_same_v<Value, Rect> || std::is_same_v<Value, CursorImage>)
            std::apply([&add](const auto&... field) { (add(field), ...); }, Kind::fields);
    });
    return names;
}

py::array readEntries(const StreamSource& source) {
    const ByteSource stream = source.open();
    const std::optional<MetaDataHeader> header = StreamEntries(stream).header();
    if (!header || !isDecodable(*header))
        throwValueError(source.name() +
                        ": the entries cannot be decoded: the version of the stream is not known, or its "
                        "header does not state the entry size of its kind");
    py::array array;
    RecordedKinds::visit(header->uuid, [&]<class Kind>() { array = entriesOfKind<Kind>(stream); });
    return array;
}

} // namespace ZULMetaData::Python
