#include "SharedDependencies/EndianFile.h"

#include <istream>
#include <ostream>

namespace ZULMetaData {

void fileOpen(std::ifstream& stream, const char* path, std::ios_base::openmode mode) {
    stream.open(path, mode | std::ios_base::in);
}

void fileOpen(std::ofstream& stream, const char* path, std::ios_base::openmode mode) {
    stream.open(path, mode | std::ios_base::out);
}

void fileOpen(std::fstream& stream, const char* path, std::ios_base::openmode mode) {
    stream.open(path, mode);
}

void seekWritePos(std::ostream& stream, std::int64_t position) {
    stream.seekp(static_cast<std::streamoff>(position));
}

std::int64_t toInt64(std::streampos position) {
    return static_cast<std::int64_t>(static_cast<std::streamoff>(position));
}

} // namespace ZULMetaData
