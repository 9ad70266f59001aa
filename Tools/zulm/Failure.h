#pragma once

#include <stdexcept>

namespace Zulm {

/// Why a command could not do its work, in words for a person: "FILE: what is wrong; what to do about it".
class Failure : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

} // namespace Zulm
