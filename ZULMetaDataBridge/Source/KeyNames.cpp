#include "ZULMetaDataBridge/Source/KeyNames.h"

#include "ZULMetaDataBridge/Source/EntryTexts.h"
#include "ZULMetaDataBridge/Source/InputVocabulary.h"

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::uint32_t s_deleteCharacter = 0x7f;

bool isUpperControl(std::uint32_t code) {
    return code >= 0x80 && code < 0xa0;
}

KeyName numbered(std::uint32_t code) {
    return {KeyMeaning::Number, "key " + std::to_string(code)};
}

/// Every key with a name has one of several letters. The others stand for letters, and for one digit, or mean nothing.
KeyName keyNameOfVirtualKey(std::uint32_t code) {
    if (const std::string_view name = nameOfVirtualKey(code); !name.empty())
        return {KeyMeaning::Key, std::string(name)};
    const bool isLetterOrDigit = (code >= 'A' && code <= 'Z') || (code >= '0' && code <= '9');
    return isLetterOrDigit ? KeyName{KeyMeaning::Key, std::string(1, static_cast<char>(code))} : numbered(code);
}

} // namespace

bool isVirtualKey(const KeyStroke& key) {
    return (key.eventFlagsCode & s_virtualKeyFlag) != 0;
}

KeyName keyNameOf(const KeyStroke& key) {
    const std::uint32_t code = key.characterCode;
    if (isVirtualKey(key))
        return keyNameOfVirtualKey(code);
    if (code == s_deleteCharacter)
        return keyNameOfVirtualKey(static_cast<std::uint32_t>(VirtualKey::Delete));
    if (code < 0x20)
        return keyNameOfVirtualKey(code);
    std::string character = utf8Character(code);
    return character.empty() || isUpperControl(code) ? numbered(code)
                                                     : KeyName{KeyMeaning::Character, std::move(character)};
}

} // namespace ZULMetaData
