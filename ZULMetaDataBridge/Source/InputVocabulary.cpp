#include "ZULMetaDataBridge/Source/InputVocabulary.h"

#include <algorithm>
#include <cstddef>

namespace ZULMetaData {

namespace {

struct ButtonCodes {
    std::string_view name;
    std::int32_t press;
    std::int32_t release;
};

/// In the order of `MouseButton`. The bits of the middle button are those of Shift and Control: they mean the button
/// only if no left or right button is set.
constexpr std::array<ButtonCodes, 3> s_buttonCodes{{{"left", 1, 2}, {"right", 4, 8}, {"middle", 16, 32}}};

struct ModifierCodes {
    std::string_view name;
    std::uint32_t keyFlag;
    std::int32_t actionBit; ///< 0 if cursor actions cannot tell it
};

/// In the order of `Modifier`.
constexpr std::array<ModifierCodes, 6> s_modifierCodes{{
    {"alpha", 0x00010000, 0},
    {"shift", 0x00020000, 16},
    {"ctrl", 0x00040000, 32},
    {"alt", 0x00080000, 64},
    {"cmd", 0x00100000, 128},
    {"win", 0x80000000, 0},
}};

struct NamedKey {
    constexpr NamedKey(VirtualKey key, std::string_view keyName)
        : code(static_cast<std::uint32_t>(key)), name(keyName) {}
    constexpr NamedKey(char digit, std::string_view keyName) : code(static_cast<std::uint32_t>(digit)), name(keyName) {}

    std::uint32_t code;
    std::string_view name;
};

/// In ascending order. '4' has no name on purpose.
constexpr std::array<NamedKey, 61> s_namedKeys{{
    {VirtualKey::Unknown, "unknown"},
    {VirtualKey::Cancel, "cancel"},
    {VirtualKey::Function, "function"},
    {VirtualKey::Back, "back"},
    {VirtualKey::Tab, "tab"},
    {VirtualKey::Clear, "clear"},
    {VirtualKey::Return, "returnKey"},
    {VirtualKey::Pause, "pause"},
    {VirtualKey::Capital, "capital"},
    {VirtualKey::Escape, "escape"},
    {VirtualKey::Space, "space"},
    {VirtualKey::Prior, "prior"},
    {VirtualKey::Next, "next"},
    {VirtualKey::End, "end"},
    {VirtualKey::Home, "home"},
    {VirtualKey::Left, "left"},
    {VirtualKey::Up, "up"},
    {VirtualKey::Right, "right"},
    {VirtualKey::Down, "down"},
    {VirtualKey::Select, "select"},
    {VirtualKey::Print, "print"},
    {VirtualKey::Execute, "execute"},
    {VirtualKey::Snapshot, "snapshot"},
    {VirtualKey::Insert, "insert"},
    {VirtualKey::Delete, "delete"},
    {VirtualKey::Help, "help"},
    {'0', "closeParenthesis"},
    {'1', "exclamation"},
    {'2', "atSymbol"},
    {'3', "pound"},
    {'5', "percent"},
    {'6', "carat"},
    {'7', "ampersand"},
    {'8', "star"},
    {'9', "openParenthesis"},
    {VirtualKey::F1, "f1"},
    {VirtualKey::F2, "f2"},
    {VirtualKey::F3, "f3"},
    {VirtualKey::F4, "f4"},
    {VirtualKey::F5, "f5"},
    {VirtualKey::F6, "f6"},
    {VirtualKey::F7, "f7"},
    {VirtualKey::F8, "f8"},
    {VirtualKey::F9, "f9"},
    {VirtualKey::F10, "f10"},
    {VirtualKey::F11, "f11"},
    {VirtualKey::F12, "f12"},
    {VirtualKey::F13, "f13"},
    {VirtualKey::F14, "f14"},
    {VirtualKey::F15, "f15"},
    {VirtualKey::F16, "f16"},
    {VirtualKey::F17, "f17"},
    {VirtualKey::F18, "f18"},
    {VirtualKey::F19, "f19"},
    {VirtualKey::F20, "f20"},
    {VirtualKey::NumLock, "numlock"},
    {VirtualKey::Scroll, "scroll"},
    {VirtualKey::Plus, "plus"},
    {VirtualKey::Comma, "comma"},
    {VirtualKey::Minus, "minus"},
    {VirtualKey::Period, "period"},
}};

constexpr bool hasLowerCode(const NamedKey& left, const NamedKey& right) {
    return left.code < right.code;
}

static_assert(std::is_sorted(s_namedKeys.begin(), s_namedKeys.end(), hasLowerCode));

const ButtonCodes& codesOf(MouseButton button) {
    return s_buttonCodes[static_cast<std::size_t>(button)];
}

const ModifierCodes& codesOf(Modifier modifier) {
    return s_modifierCodes[static_cast<std::size_t>(modifier)];
}

Modifiers modifiersOfAction(std::int32_t stored) {
    Modifiers modifiers;
    for (const Modifier modifier : s_modifiers)
        if ((stored & codesOf(modifier).actionBit) != 0)
            modifiers.insert(modifier);
    return modifiers;
}

std::uint32_t keyFlagsOf(Modifiers modifiers) {
    std::uint32_t flags = 0;
    for (const Modifier modifier : s_modifiers)
        if (modifiers.contains(modifier))
            flags |= codesOf(modifier).keyFlag;
    return flags;
}

} // namespace

std::string_view nameOf(MouseButton button) {
    return codesOf(button).name;
}

std::string_view nameOf(Modifier modifier) {
    return codesOf(modifier).name;
}

ButtonAction buttonActionOf(std::int32_t stored) {
    ButtonAction action;
    action.stored = stored;
    if (stored == s_noButtonYet)
        return action;
    for (const MouseButton button : s_mouseButtons) {
        const ButtonCodes& codes = codesOf(button);
        if ((stored & (codes.press | codes.release)) == 0)
            continue;
        action.button = button;
        action.isPress = (stored & codes.press) != 0;
        if (action.tellsModifiers())
            action.modifiers = modifiersOfAction(stored);
        break;
    }
    return action;
}

std::int32_t storedButtonAction(MouseButton button, bool isPress, Modifiers modifiers) {
    const ButtonCodes& codes = codesOf(button);
    std::int32_t stored = isPress ? codes.press : codes.release;
    if (button == MouseButton::Middle)
        return stored;
    for (const Modifier modifier : s_modifiers)
        if (modifiers.contains(modifier))
            stored |= codesOf(modifier).actionBit;
    return stored;
}

std::string_view nameOfVirtualKey(std::uint32_t code) {
    const auto isLower = [](const NamedKey& key, std::uint32_t sought) { return key.code < sought; };
    const auto found = std::lower_bound(s_namedKeys.begin(), s_namedKeys.end(), code, isLower);
    return found != s_namedKeys.end() && found->code == code ? found->name : std::string_view();
}

KeyInput keyInputOf(const KeyStroke& stored) {
    KeyInput key;
    key.isVirtualKey = (stored.eventFlagsCode & s_virtualKeyFlag) != 0;
    key.code = stored.characterCode;
    key.stored = stored;
    for (const Modifier modifier : s_modifiers)
        if ((stored.eventFlagsCode & codesOf(modifier).keyFlag) != 0)
            key.modifiers.insert(modifier);
    return key;
}

KeyStroke storedKey(VirtualKey key, Modifiers modifiers) {
    return {static_cast<std::uint32_t>(key), keyFlagsOf(modifiers) | s_virtualKeyFlag};
}

KeyStroke storedCharacter(char32_t character, Modifiers modifiers) {
    return {static_cast<std::uint32_t>(character), keyFlagsOf(modifiers)};
}

} // namespace ZULMetaData
