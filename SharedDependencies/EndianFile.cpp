#include "SharedDependencies/EndianFile.h"

#include <cerrno>
#include <filesystem>
#include <ostream>
#include <system_error>

namespace ZULMetaData {

namespace {

/// Opening a pipe would wait for its other end, which may never come.
bool isPipe(const char* path) {
    std::error_code ignored;
    return std::filesystem::is_fifo(path, ignored);
}

/// Opens the file again if a signal interrupts it.
template <class Stream>
void openFile(Stream& stream, const char* path, std::ios_base::openmode mode) {
    if (isPipe(path)) {
        errno = EINVAL;
        stream.setstate(std::ios_base::failbit);
        return;
    }
    do {
        errno = 0;
        stream.open(path, mode);
    } while (stream.fail() && errno == EINTR);
}

} // namespace

void fileOpen(std::ifstream& stream, const char* path, std::ios_base::openmode mode) {
    openFile(stream, path, mode | std::ios_base::in);
}

void fileOpen(std::ofstream& stream, const char* path, std::ios_base::openmode mode) {
    openFile(stream, path, mode | std::ios_base::out);
}

void fileOpen(std::fstream& stream, const char* path, std::ios_base::openmode mode) {
    openFile(stream, path, mode);
}

void seekWritePos(std::ostream& stream, std::int64_t position) {
    stream.seekp(static_cast<std::streamoff>(position));
}

std::int64_t toInt64(std::streampos position) {
    return static_cast<std::int64_t>(static_cast<std::streamoff>(position));
}

} // namespace ZULMetaData
