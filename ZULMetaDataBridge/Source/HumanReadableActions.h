#pragma once

// Texts for recorded input actions, such as "left down + shift" or "<Shift><Cmd>".

#include "../../SharedDependencies/Export.h"

#include <string>

namespace ZULMetaData {

/// The words for actions and keys that recorders number.
struct ZULMETADATA_API HumanReadableActions {
    /// Whether every bit of `flag` is set. Throws `std::invalid_argument` "Flag should not be empty." for 0.
    static bool HasFlag(int value, int flag);

    /// "left down", "right up + cmd" and so on. Bits 16 and 32 mean the middle button where no left or right
    /// bit is set, and Shift and Control otherwise. Without a button: the number.
    static std::string CursorActionToString(int action);

    /// The name of a virtual-key code. A code without one gives the character of its low 8 bits as it is, which
    /// need not be UTF-8, or nothing for white space.
    static std::string KeyboardActionCodeToString(int code);

    /// "<Shift><Cmd>" and so on; "NONE" where no known bit is set.
    static std::string KeyboardModifiersToString(int flags);
};

} // namespace ZULMetaData
