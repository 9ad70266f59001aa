#include "ZULMetaDataBridge/Source/HumanReadableActions.h"

#include <algorithm>
#include <array>
#include <span>
#include <stdexcept>
#include <string_view>

namespace ZULMetaData {

namespace {

struct Named {
    int value;
    std::string_view text;
};

constexpr int s_mouseInit = 256;

constexpr std::array<Named, 4> s_buttons{{{1, "left down"}, {2, "left up"}, {4, "right down"}, {8, "right up"}}};

constexpr std::array<Named, 4> s_buttonModifiers{
    {{16, " + shift"}, {32, " + ctrl"}, {128, " + cmd"}, {64, " + option"}}};

/// The bits of Shift and Control, where no left or right button is named.
constexpr std::array<Named, 2> s_middleButtons{{{16, "middle down"}, {32, "middle up"}}};

constexpr std::array<Named, 8> s_keyModifiers{{
    {0x20000000, "(MAC)"},
    {0x00010000, "<Alpha>"},
    {0x00020000, "<Shift>"},
    {0x00040000, "<Ctrl>"},
    {0x00080000, "<Alt>"},
    {0x00100000, "<Cmd>"},
    {static_cast<int>(0x80000000), "<Win>"},
    {0x40000000, "(IsVK)"},
}};

/// In ascending order. 52 has no name on purpose: it shows as "4".
constexpr std::array<Named, 61> s_keys{{
    {0, "unknown"},
    {3, "cancel"},
    {7, "function"},
    {8, "back"},
    {9, "tab"},
    {12, "clear"},
    {13, "returnKey"},
    {19, "pause"},
    {20, "capital"},
    {27, "escape"},
    {32, "space"},
    {33, "prior"},
    {34, "next"},
    {35, "end"},
    {36, "home"},
    {37, "left"},
    {38, "up"},
    {39, "right"},
    {40, "down"},
    {41, "select"},
    {42, "print"},
    {43, "execute"},
    {44, "snapshot"},
    {45, "insert"},
    {46, "delete"},
    {47, "help"},
    {48, "closeParenthesis"},
    {49, "exclamation"},
    {50, "atSymbol"},
    {51, "pound"},
    {53, "percent"},
    {54, "carat"},
    {55, "ampersand"},
    {56, "star"},
    {57, "openParenthesis"},
    {112, "f1"},
    {113, "f2"},
    {114, "f3"},
    {115, "f4"},
    {116, "f5"},
    {117, "f6"},
    {118, "f7"},
    {119, "f8"},
    {120, "f9"},
    {121, "f10"},
    {122, "f11"},
    {123, "f12"},
    {124, "f13"},
    {125, "f14"},
    {126, "f15"},
    {127, "f16"},
    {128, "f17"},
    {129, "f18"},
    {130, "f19"},
    {131, "f20"},
    {144, "numlock"},
    {145, "scroll"},
    {187, "plus"},
    {188, "comma"},
    {189, "minus"},
    {190, "period"},
}};

constexpr bool comesFirst(const Named& left, const Named& right) {
    return left.value < right.value;
}

static_assert(std::is_sorted(s_keys.begin(), s_keys.end(), comesFirst));

const Named* firstSet(std::span<const Named> names, int bits) {
    const auto isSet = [bits](const Named& name) { return HumanReadableActions::HasFlag(bits, name.value); };
    const auto found = std::find_if(names.begin(), names.end(), isSet);
    return found == names.end() ? nullptr : &*found;
}

std::string textOfAllSet(std::span<const Named> names, int bits) {
    std::string text;
    for (const Named& name : names)
        if (HumanReadableActions::HasFlag(bits, name.value))
            text += name.text;
    return text;
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
    if (action == s_mouseInit)
        return "mouse init";
    if (const Named* button = firstSet(s_buttons, action))
        return std::string(button->text) + textOfAllSet(s_buttonModifiers, action);
    if (const Named* button = firstSet(s_middleButtons, action))
        return std::string(button->text);
    return std::to_string(action);
}

std::string HumanReadableActions::KeyboardActionCodeToString(int code) {
    const auto key = std::lower_bound(s_keys.begin(), s_keys.end(), Named{code, {}}, comesFirst);
    if (key != s_keys.end() && key->value == code)
        return std::string(key->text);
    const char character = static_cast<char>(code & 0xff);
    return isWhiteSpace(character) ? std::string() : std::string(1, character);
}

std::string HumanReadableActions::KeyboardModifiersToString(int flags) {
    const std::string text = textOfAllSet(s_keyModifiers, flags);
    return text.empty() ? "NONE" : text;
}

} // namespace ZULMetaData
