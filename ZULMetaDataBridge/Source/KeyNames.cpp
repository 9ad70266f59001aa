#include "ZULMetaDataBridge/Source/KeyNames.h"

#include "ZULMetaDataBridge/Source/EntryTexts.h"
#include "ZULMetaDataBridge/Source/HumanReadableActions.h"

#include <cstdint>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::uint32_t s_isVirtualKey = 0x40000000;
constexpr std::uint32_t s_deleteCharacter = 0x7f;
constexpr std::uint32_t s_deleteKey = 46;

bool isUpperControl(std::uint32_t code) {
    return code >= 0x80 && code < 0xa0;
}

KeyName numbered(std::uint32_t code) {
    return {KeyMeaning::Number, "key " + std::to_string(code)};
}

/// Every key of the table has a name of several letters. The others stand for letters, and for one digit, or have a
/// text that means nothing.
KeyName nameOfVirtualKey(std::uint32_t code) {
    std::string name = HumanReadableActions::KeyboardActionCodeToString(static_cast<std::int32_t>(code));
    const bool isLetterOrDigit = (code >= 'A' && code <= 'Z') || (code >= '0' && code <= '9');
    return name.size() > 1 || isLetterOrDigit ? KeyName{KeyMeaning::Key, std::move(name)} : numbered(code);
}

} // namespace

bool isVirtualKey(const KeyStroke& key) {
    return (key.eventFlagsCode & s_isVirtualKey) != 0;
}

KeyName keyNameOf(const KeyStroke& key) {
    const std::uint32_t code = key.characterCode;
    if (isVirtualKey(key))
        return nameOfVirtualKey(code);
    if (code == s_deleteCharacter)
        return nameOfVirtualKey(s_deleteKey);
    if (code < 0x20)
        return nameOfVirtualKey(code);
    std::string character = utf8Character(code);
    return character.empty() || isUpperControl(code) ? numbered(code)
                                                     : KeyName{KeyMeaning::Character, std::move(character)};
}

} // namespace ZULMetaData
