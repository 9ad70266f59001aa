#pragma once

// A stream buffer whose areas are as small as a test wants them.

#include <algorithm>
#include <cstddef>
#include <streambuf>
#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

/// Gives its bytes in pieces of one size, and takes them in such pieces.
class PiecewiseBuffer : public std::streambuf {
public:
    explicit PiecewiseBuffer(std::size_t pieceSize, std::string bytes = {})
        : bytes_(std::move(bytes)), piece_(pieceSize) {
        setp(piece_.data(), piece_.data() + piece_.size());
    }

    /// What was put in.
    std::string taken() {
        sync();
        return taken_;
    }

protected:
    int_type underflow() override {
        if (next_ == bytes_.size())
            return traits_type::eof();
        const std::size_t size = std::min(piece_.size(), bytes_.size() - next_);
        setg(bytes_.data() + next_, bytes_.data() + next_, bytes_.data() + next_ + size);
        next_ += size;
        return traits_type::to_int_type(*gptr());
    }

    int_type overflow(int_type character) override {
        sync();
        if (!traits_type::eq_int_type(character, traits_type::eof()))
            taken_ += traits_type::to_char_type(character);
        return traits_type::not_eof(character);
    }

    int sync() override {
        taken_.append(pbase(), pptr());
        setp(piece_.data(), piece_.data() + piece_.size());
        return 0;
    }

    /// Forgets the piece at hand.
    pos_type seekpos(pos_type target, std::ios_base::openmode) override {
        next_ = static_cast<std::size_t>(static_cast<off_type>(target));
        setg(nullptr, nullptr, nullptr);
        return target;
    }

    /// Only tells where it is.
    pos_type seekoff(off_type, std::ios_base::seekdir, std::ios_base::openmode) override {
        return static_cast<off_type>(next_) - (egptr() - gptr());
    }

private:
    std::string bytes_;
    std::string taken_;
    std::vector<char> piece_;
    std::size_t next_ = 0;
};

} // namespace ZULMetaData::Test
