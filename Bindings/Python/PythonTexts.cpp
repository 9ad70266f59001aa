#include "Bindings/Python/PythonTexts.h"

namespace ZULMetaData::Python {

namespace {

py::str requireText(PyObject* text) {
    if (!text)
        throw py::error_already_set();
    return py::reinterpret_steal<py::str>(text);
}

} // namespace

py::str pythonText(const std::string& bytes) {
    return requireText(PyUnicode_DecodeUTF8(bytes.data(), static_cast<py::ssize_t>(bytes.size()), "surrogateescape"));
}

py::str pathText(const std::string& bytes) {
    return requireText(PyUnicode_DecodeFSDefaultAndSize(bytes.data(), static_cast<py::ssize_t>(bytes.size())));
}

std::string storedText(const py::handle& value) {
    std::string bytes;
    if (py::isinstance<py::bytes>(value)) {
        bytes = value.cast<std::string>();
    } else {
        if (!py::isinstance<py::str>(value))
            throw py::type_error("a text is a str, or bytes");
        bytes = py::bytes(value.attr("encode")("utf-8", "surrogateescape")).cast<std::string>();
    }
    if (bytes.find('\0') != std::string::npos)
        throw py::value_error("readers would cut this text off at its zero character");
    return bytes;
}

void throwValueError(const std::string& sentence) {
    PyErr_SetObject(PyExc_ValueError, pathText(sentence).ptr());
    throw py::error_already_set();
}

} // namespace ZULMetaData::Python
