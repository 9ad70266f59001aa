#pragma once

// A file that is validated: reads check against its size first, and a device that fails is no finding.

#include "ZULMetaData/PositionedInput.h"

#include <cstddef>
#include <cstdint>
#include <istream>
#include <string>
#include <system_error>

namespace ZULMetaData::detail {

class UntrustedInput {
public:
    /// `stream` stands at its start and holds `total` bytes.
    UntrustedInput(std::istream& stream, std::uint64_t total) : input_(stream, 0, total) {}

    std::uint64_t position() const { return input_.position(); }
    std::uint64_t total() const { return input_.total(); }

    /// `target` is never beyond the total.
    void moveTo(std::uint64_t target) { input_.moveTo(target); }

    /// For bytes that are there. Throws `std::runtime_error` where they do not come.
    void read(void* bytes, std::size_t size) { require(input_.read(bytes, size)); }

    template <class Number>
    Number read() {
        Number value{};
        read(&value, sizeof value);
        return value;
    }

    template <class Number>
    Number readBigEndian() {
        Number value{};
        require(input_.readBigEndian(value));
        return value;
    }

private:
    void require(bool came) const {
        if (!came)
            throw std::system_error(std::make_error_code(std::errc::io_error),
                                    "cannot be read at offset " + std::to_string(position()));
    }

    PositionedInput input_;
};

} // namespace ZULMetaData::detail
