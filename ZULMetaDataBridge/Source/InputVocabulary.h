#pragma once

// What the numbers of recorded clicks and keys stand for.
//
//     const ButtonAction action = buttonActionOf(17); // left button down, with Shift
//     const KeyInput key = keyInputOf({119, 0x40020000}); // F8 with Shift

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ZULMMetaDataCommon.h"

#include <array>
#include <cstdint>
#include <initializer_list>
#include <optional>
#include <string_view>

namespace ZULMetaData {

/// A set of the values of an enumeration whose values count from 0, as one bit for each.
template <class Enum>
class EnumSet {
public:
    constexpr EnumSet() = default;                          ///< creates an empty set
    constexpr EnumSet(std::initializer_list<Enum> values) { ///< creates a set of these values
        for (const Enum value : values)
            insert(value);
    }

    constexpr bool contains(Enum value) const { return (bits_ & bitOf(value)) != 0; } ///< returns whether it is there
    constexpr bool empty() const { return bits_ == 0; }          ///< returns true if the set has no value
    constexpr std::uint32_t bits() const { return bits_; }       ///< returns bit n for the enumerator of value n
    constexpr void insert(Enum value) { bits_ |= bitOf(value); } ///< adds a value, unless it is there
    constexpr void erase(Enum value) { bits_ &= ~bitOf(value); } ///< removes a value, if it is there

    friend constexpr bool operator==(EnumSet, EnumSet) = default; ///< compares the values

private:
    static constexpr std::uint32_t bitOf(Enum value) { return std::uint32_t{1} << static_cast<unsigned>(value); }

    std::uint32_t bits_ = 0;
};

/// A button of the mouse, in the order in which several are listed.
enum class MouseButton : std::uint8_t { Left, Right, Middle };

/// A modifier key, in the order in which several are listed.
enum class Modifier : std::uint8_t {
    CapsLock, ///< "alpha"
    Shift,    ///< "shift"
    Control,  ///< "ctrl"
    Alt,      ///< "alt"; the mouse's "option"
    Command,  ///< "cmd"
    Windows,  ///< "win"
};

/// All buttons, in their order.
inline constexpr std::array s_mouseButtons{MouseButton::Left, MouseButton::Right, MouseButton::Middle};

/// All modifiers, in their order.
inline constexpr std::array s_modifiers{Modifier::CapsLock, Modifier::Shift,   Modifier::Control,
                                        Modifier::Alt,      Modifier::Command, Modifier::Windows};

using MouseButtons = EnumSet<MouseButton>; ///< buttons that are down
using Modifiers = EnumSet<Modifier>;       ///< modifiers that are down

ZULMETADATA_API std::string_view nameOf(MouseButton button); ///< returns "left", "right" or "middle"
ZULMETADATA_API std::string_view nameOf(Modifier modifier);  ///< returns the word of the enumerator's comment

/// What a cursor action says. It is about one button at most, because its number has no room for two.
struct ButtonAction {
    std::optional<MouseButton> button; ///< empty for the first entry of a recording (256) and for numbers without one
    bool isPress = false;              ///< true if the button goes down, false if it comes up
    Modifiers modifiers;               ///< held with a left or right button; those of the middle button are not stored
    std::int32_t stored = 0;           ///< the number in the stream

    /// Returns whether it tells which modifiers are held: only the actions of the left and the right button do.
    bool tellsModifiers() const { return button && *button != MouseButton::Middle; }

    friend bool operator==(const ButtonAction&, const ButtonAction&) = default; ///< compares all fields
};

inline constexpr std::int32_t s_noButtonYet = 256; ///< the number of the action with which recordings begin

/// Returns what the number says, as `HumanReadableActions::CursorActionToString` reads it.
ZULMETADATA_API ButtonAction buttonActionOf(std::int32_t stored);

/// Returns the number of an action of this button. The middle button stores no modifiers, and Caps Lock and Windows
/// have no number.
ZULMETADATA_API std::int32_t storedButtonAction(MouseButton button, bool isPress, Modifiers modifiers = {});

/// A virtual key that has a name. The values are those that are stored.
enum class VirtualKey : std::uint32_t {
    Unknown = 0,
    Cancel = 3,
    Function = 7,
    Back = 8,
    Tab = 9,
    Clear = 12,
    Return = 13,
    Pause = 19,
    Capital = 20,
    Escape = 27,
    Space = 32,
    Prior = 33,
    Next = 34,
    End = 35,
    Home = 36,
    Left = 37,
    Up = 38,
    Right = 39,
    Down = 40,
    Select = 41,
    Print = 42,
    Execute = 43,
    Snapshot = 44,
    Insert = 45,
    Delete = 46,
    Help = 47,
    F1 = 112,
    F2,
    F3,
    F4,
    F5,
    F6,
    F7,
    F8,
    F9,
    F10,
    F11,
    F12,
    F13,
    F14,
    F15,
    F16,
    F17,
    F18,
    F19,
    F20,
    NumLock = 144,
    Scroll = 145,
    Plus = 187,
    Comma = 188,
    Minus = 189,
    Period = 190,
};

/// Returns the name of a virtual key, such as "returnKey". A digit has the name of its shifted symbol, such as
/// "exclamation" for 1; but 4 has no name. Empty if the code has no name.
ZULMETADATA_API std::string_view nameOfVirtualKey(std::uint32_t code);

/// Bits in the flags of a key that are no modifiers.
///@{
inline constexpr std::uint32_t s_macFlag = 0x20000000;        ///< shown as "(MAC)"
inline constexpr std::uint32_t s_virtualKeyFlag = 0x40000000; ///< shown as "(IsVK)": the code is that of a virtual key
///@}

/// A recorded key: a virtual key, or the character that it typed.
struct KeyInput {
    bool isVirtualKey = false; ///< whether `code` is a virtual key; otherwise it is a Unicode code point
    std::uint32_t code = 0;    ///< as stored; compare it with `VirtualKey`, a letter 'A' to 'Z', or a digit
    Modifiers modifiers;       ///< held with the key
    KeyStroke stored;          ///< the numbers in the stream

    /// Returns whether this is a virtual key with this name.
    bool is(VirtualKey key) const { return isVirtualKey && code == static_cast<std::uint32_t>(key); }

    friend bool operator==(const KeyInput&, const KeyInput&) = default; ///< compares all fields
};

ZULMETADATA_API KeyInput keyInputOf(const KeyStroke& stored); ///< returns what the numbers say

/// Return the numbers of a virtual key, or of a character, with modifiers.
///@{
ZULMETADATA_API KeyStroke storedKey(VirtualKey key, Modifiers modifiers = {});
ZULMETADATA_API KeyStroke storedCharacter(char32_t character, Modifiers modifiers = {});
///@}

} // namespace ZULMetaData
