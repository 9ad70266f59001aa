#include "ZULMetaDataBridge/Source/HumanReadableActions.h"

#include "ZULMetaDataBridge/Source/InputVocabulary.h"

#include <array>
#include <cstdint>
#include <stdexcept>
#include <string_view>

namespace ZULMetaData {

namespace {

/// The modifiers of cursor actions, in the order of their texts.
constexpr std::array s_actionModifiers{Modifier::Shift, Modifier::Control, Modifier::Command, Modifier::Alt};

std::string actionModifierName(Modifier modifier) {
    return modifier == Modifier::Alt ? "option" : std::string(nameOf(modifier));
}

/// Returns "<Shift>" for "shift".
std::string keyModifierText(Modifier modifier) {
    std::string name(nameOf(modifier));
    name.front() = static_cast<char>(name.front() - 'a' + 'A');
    return '<' + name + '>';
}

bool isWhiteSpace(char c) {
    return c == ' ' || (c >= '\t' && c <= '\r');
}

} // namespace

bool HumanReadableActions::HasFlag(int value, int flag) {
    if (flag == 0)
        throw std::invalid_argument("Flag should not be empty.");
    return (value & flag) == flag;
}

std::string HumanReadableActions::CursorActionToString(int action) {
    if (action == s_noButtonYet)
        return "mouse init";
    const ButtonAction says = buttonActionOf(action);
    if (!says.button)
        return std::to_string(action);
    std::string text = std::string(nameOf(*says.button)) + (says.isPress ? " down" : " up");
    for (const Modifier modifier : s_actionModifiers)
        if (says.modifiers.contains(modifier))
            text += " + " + actionModifierName(modifier);
    return text;
}

std::string HumanReadableActions::KeyboardActionCodeToString(int code) {
    if (const std::string_view name = nameOfVirtualKey(static_cast<std::uint32_t>(code)); !name.empty())
        return std::string(name);
    const char character = static_cast<char>(code & 0xff);
    return isWhiteSpace(character) ? std::string() : std::string(1, character);
}

std::string HumanReadableActions::KeyboardModifiersToString(int flags) {
    const KeyInput key = keyInputOf({0, static_cast<std::uint32_t>(flags)});
    std::string text = (key.stored.eventFlagsCode & s_macFlag) != 0 ? "(MAC)" : "";
    for (const Modifier modifier : s_modifiers)
        if (key.modifiers.contains(modifier))
            text += keyModifierText(modifier);
    if (key.isVirtualKey)
        text += "(IsVK)";
    return text.empty() ? "NONE" : text;
}

} // namespace ZULMetaData
