#pragma once

#include <ostream>
#include <streambuf>

namespace ZULMetaData::detail {

/// Takes everything and keeps nothing.
class NullBuffer : public std::streambuf {
    int_type overflow(int_type byte) override { return traits_type::not_eof(byte); }
    std::streamsize xsputn(const char*, std::streamsize count) override { return count; }
};

class NullOutput : private NullBuffer, public std::ostream {
public:
    NullOutput() : std::ostream(static_cast<NullBuffer*>(this)) {}
};

} // namespace ZULMetaData::detail
