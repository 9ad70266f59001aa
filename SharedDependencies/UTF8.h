#pragma once

namespace ZULMetaData {

/// Returns whether a byte of UTF-8 continues a character that another byte began.
constexpr bool continuesCharacter(char byte) {
    return (static_cast<unsigned char>(byte) & 0xc0) == 0x80;
}

} // namespace ZULMetaData
