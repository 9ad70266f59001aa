#include "Bindings/Python/SessionArrays.h"

#include "Bindings/Python/PythonTexts.h"
#include "Bindings/Tables/SessionTables.h"
#include "ZULMetaDataBridge/Source/FileError.h"

#include <pybind11/numpy.h>
#include <pybind11/stl.h>
#include <pybind11/stl/filesystem.h>

#include <cstddef>
#include <string>
#include <unordered_map>
#include <utility>
#include <variant>
#include <vector>

namespace ZULMetaData::Python {

namespace {

using namespace Bindings;

template <class Number>
py::object columnOf(const std::vector<Number>& numbers) {
    return py::array_t<Number>(static_cast<py::ssize_t>(numbers.size()), numbers.data());
}

/// Equal texts that follow one another share one object: a title holds for many rows.
py::object columnOf(const std::vector<Text>& texts) {
    py::list column;
    py::object shared = py::none();
    const Text* last = nullptr;
    for (const Text& text : texts) {
        if (!last || text != *last)
            shared = text ? py::object(pythonText(*text)) : py::none();
        last = &text;
        column.append(shared);
    }
    return column;
}

/// Rows that share bytes share one object.
py::object columnOf(const std::vector<Blob>& blobs) {
    std::unordered_map<const void*, py::bytes> known;
    py::list column;
    for (const Blob& blob : blobs) {
        if (!blob) {
            column.append(py::none());
            continue;
        }
        auto [found, isNew] = known.try_emplace(blob.get());
        if (isNew)
            found->second = py::bytes(reinterpret_cast<const char*>(blob->data()), blob->size());
        column.append(found->second);
    }
    return column;
}

/// Returns the name and the values of each column, the times first.
py::list columnsOf(const Table& table) {
    py::list columns;
    columns.append(py::make_tuple("time", columnOf(table.times)));
    for (const TableColumn& column : table.columns)
        columns.append(std::visit([&](const auto& values) { return py::make_tuple(column.name, columnOf(values)); },
                                  column.values));
    return columns;
}

/// Warns the caller of the function in Python that calls this module.
void warn(const std::string& sentence) {
    const py::str text = pathText(sentence);
    if (PyErr_WarnEx(PyExc_UserWarning, PyUnicode_AsUTF8(text.ptr()), 2) != 0)
        throw py::error_already_set(); // the program has made errors of warnings
}

/// Computes a table while other threads of Python run.
template <class Compute>
py::list computed(const Recording& recording, Compute compute) {
    Table table;
    {
        const py::gil_scoped_release others;
        table = compute();
    }
    for (const std::string& warning : table.warnings)
        warn(recording.name() + ": " + warning);
    return columnsOf(table);
}

/// Throws `FileError` for a file that cannot be opened, and `Error` for one that is no recording.
std::unique_ptr<Recording> openSession(const FileLocation& file) {
    const std::string path = utf8Path(file);
    return std::make_unique<Recording>(openSource(path, path), path);
}

py::list statesAt(const Recording& recording,
                  const py::array_t<double, py::array::c_style | py::array::forcecast>& times, bool interpolates) {
    const std::span<const double> asked(times.data(), static_cast<std::size_t>(times.size()));
    const Interpolation interpolation = interpolates ? Interpolation::Linear : Interpolation::Held;
    return computed(recording, [&] { return statesTable(recording, asked, interpolation); });
}

} // namespace

void addSession(py::module_& module) {
    py::class_<Recording>(module, "Session")
        .def(py::init(&openSession), py::arg("path"), py::call_guard<py::gil_scoped_release>())
        .def("states", statesAt, py::arg("times"), py::arg("interpolates"))
        .def(
            "insight",
            [](const Recording& recording, const std::string& name, const InsightParameters& parameters) {
                return computed(recording, [&] { return insightTable(recording, name, parameters); });
            },
            py::arg("name"), py::arg("parameters"))
        .def(
            "retimed",
            [](const Recording& recording, const py::bytes& edits, const FileLocation& name,
               const std::string& frameRate) {
                const EditText list{edits, utf8Path(name), frameRate};
                return computed(recording, [&] { return retimedTable(recording, list); });
            },
            py::arg("edits"), py::arg("name"), py::arg("frame_rate"));
    module.attr("insight_names") = py::tuple(py::cast(insightNames()));
}

} // namespace ZULMetaData::Python
