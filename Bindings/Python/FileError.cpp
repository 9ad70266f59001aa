#include "Bindings/Python/FileError.h"

#include "Bindings/Python/PythonTexts.h"

#include <cerrno>
#include <exception>
#include <utility>

namespace ZULMetaData::Python {

FileError FileError::ofErrno(const FileLocation& file) {
    return {file, std::error_code(errno != 0 ? errno : EIO, std::generic_category())};
}

void registerFileErrors() {
    py::register_exception_translator([](std::exception_ptr thrown) {
        py::tuple arguments;
        try {
            std::rethrow_exception(std::move(thrown));
        } catch (const FileError& error) {
            arguments = py::make_tuple(error.code().value(), error.code().message(), pathText(utf8Path(error.file())));
        } catch (const std::system_error& error) {
            arguments = py::make_tuple(error.code().value(), pathText(error.what()));
        }
        PyErr_SetObject(PyExc_OSError, arguments.ptr());
    });
}

} // namespace ZULMetaData::Python
