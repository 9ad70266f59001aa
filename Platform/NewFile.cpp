#include "Platform/NewFile.h"

#include <fcntl.h>
#include <system_error>

namespace ZULMetaData {

NewFile::NewFile(const FileLocation& file)
    : buffer_(std::make_unique<char[]>(s_bufferSize)),
      file_(uninterrupted([&] { return open(file.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600); })) {
    if (!file_.isOpen())
        throwSystemError(errno, "cannot be created");
    setp(buffer_.get(), buffer_.get() + s_bufferSize);
}

bool NewFile::close() {
    writeOut();
    setp(nullptr, nullptr);
    try {
        file_.close();
    } catch (const std::system_error& error) {
        fail(error.what());
    }
    return failure_.empty();
}

NewFile::int_type NewFile::overflow(int_type next) {
    if (!writeOut() || pptr() == epptr())
        return traits_type::eof();
    if (!traits_type::eq_int_type(next, traits_type::eof()))
        sputc(traits_type::to_char_type(next));
    return traits_type::not_eof(next);
}

int NewFile::sync() {
    return writeOut() ? 0 : -1;
}

/// After a flush in the middle of a page the next block is shorter, so that blocks end where pages do.
bool NewFile::writeOut() {
    if (!hasUnwritten())
        return failure_.empty();
    const std::span<const char> bytes(pbase(), pptr());
    try {
        file_.writeAt(written_, bytes);
    } catch (const std::system_error& error) {
        fail(error.what());
        return false;
    }
    written_ += bytes.size();
    setp(buffer_.get(), buffer_.get() + s_bufferSize - static_cast<std::size_t>(written_ % s_pageSize));
    return true;
}

/// What is in the buffer may be in the file in part: it is not written a second time.
void NewFile::fail(const char* reason) {
    setp(nullptr, nullptr);
    if (failure_.empty())
        failure_ = reason;
}

} // namespace ZULMetaData
