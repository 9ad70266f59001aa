#include "Tools/zulm/Captions.h"

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <optional>
#include <string_view>

namespace Zulm {

using namespace ZULMetaData;

namespace {

constexpr double s_hold = 1.5;       ///< seconds that a caption stays behind its last key
constexpr double s_lastDuration = 5; ///< seconds of the last caption where nothing tells its end
constexpr double s_endOfTime = 1e9;  ///< seconds: 30 years, within what every format can hold
constexpr std::size_t s_lineLength = 42;

constexpr auto s_mask = "\xe2\x80\xa2"; // bullet

struct ModifierSign {
    std::string_view name; ///< in the library's text
    const char* sign;
};

/// In the order in which they are written in front of a key.
constexpr std::array<ModifierSign, 5> s_modifierSigns{{{"<Ctrl>", "\xe2\x8c\x83"},
                                                       {"<Alt>", "\xe2\x8c\xa5"},
                                                       {"<Win>", "\xe2\x8a\x9e"},
                                                       {"<Shift>", "\xe2\x87\xa7"},
                                                       {"<Cmd>", "\xe2\x8c\x98"}}};

/// The modifiers of a key, by the library's names for them.
class Modifiers {
public:
    explicit Modifiers(std::uint32_t flags)
        : names_(HumanReadableActions::KeyboardModifiersToString(static_cast<std::int32_t>(flags))) {}

    bool has(std::string_view name) const { return names_.find(name) != std::string::npos; }
    bool makeShortcut() const { return has("<Ctrl>") || has("<Alt>") || has("<Win>") || has("<Cmd>"); }
    bool makeUpperCase() const { return has("<Shift>") != has("<Alpha>"); }

    std::string signs() const {
        std::string text;
        for (const ModifierSign& modifier : s_modifierSigns)
            if (has(modifier.name))
                text += modifier.sign;
        return text;
    }

private:
    std::string names_;
};

/// The keys that the library names after what they type.
constexpr std::uint32_t s_space = 32;
constexpr std::string_view s_shiftedDigits = ")!@#$%^&*(";
constexpr std::uint32_t s_firstPunctuation = 187;
constexpr std::string_view s_punctuation = "+,-.";

/// What a key types that the library has a name for; empty where it types nothing.
std::string namedCharacter(std::uint32_t code, bool isShiftedKey) {
    if (code == s_space)
        return " ";
    if (code >= '0' && code <= '9')
        return std::string(1, isShiftedKey ? s_shiftedDigits[code - '0'] : static_cast<char>(code));
    if (code >= s_firstPunctuation && code - s_firstPunctuation < s_punctuation.size())
        return std::string(1, s_punctuation[code - s_firstPunctuation]);
    return {};
}

std::string utf8(std::uint32_t codePoint) {
    const auto continuation = [codePoint](int shift) { return static_cast<char>(0x80 | (codePoint >> shift & 0x3f)); };
    if (codePoint < 0x800)
        return {static_cast<char>(0xc0 | codePoint >> 6), continuation(0)};
    if (codePoint < 0x10000)
        return {static_cast<char>(0xe0 | codePoint >> 12), continuation(6), continuation(0)};
    return {static_cast<char>(0xf0 | codePoint >> 18), continuation(12), continuation(6), continuation(0)};
}

/// What a key types that has no name: its code is the character.
std::string unnamedCharacter(std::uint32_t code, const std::string& name, const Modifiers& modifiers) {
    std::string number = fmt::format("[key {}]", code);
    if (code > 0xff) {
        const std::string text = code < 0x110000 ? utf8(code) : std::string();
        return isUTF8(text) && !text.empty() ? text : number;
    }
    const std::string text = textFromLatin1(name);
    const bool isControl = text.empty() || code < ' ' || (code >= 0x7f && code < 0xa0);
    if (isControl)
        return number;
    const bool isLetter = code >= 'A' && code <= 'Z';
    return isLetter && modifiers.has("(IsVK)") && !modifiers.makeUpperCase() && !modifiers.makeShortcut()
               ? std::string(1, static_cast<char>(code - 'A' + 'a'))
               : text;
}

/// What a key types; empty for a special key.
std::string characterOf(const KeyStroke& key, const std::string& name, const Modifiers& modifiers) {
    const bool hasName = name.size() > 1;
    const bool isShiftedKey = modifiers.has("<Shift>") && modifiers.has("(IsVK)");
    return hasName ? namedCharacter(key.characterCode, isShiftedKey)
                   : unnamedCharacter(key.characterCode, name, modifiers);
}

/// A code that is not marked as a key's may be a character's: the f4 key has the number of the letter s.
bool mayBeCharacter(const KeyStroke& key, const Modifiers& modifiers) {
    return key.characterCode >= ' ' && key.characterCode != 0x7f && !modifiers.has("(IsVK)");
}

std::size_t lengthOf(const std::string& text) {
    return static_cast<std::size_t>(std::count_if(text.begin(), text.end(), [](char c) { return (c & 0xc0) != 0x80; }));
}

/// Joins the keys of a caption.
class CaptionBuilder {
public:
    CaptionBuilder(std::vector<Caption>& captions, double pause) : captions_(captions), pause_(pause) {}

    void add(double time, const KeyLabel& label) {
        const bool isNew = captions_.empty() || isLineEnded_ || time - lastTime_ >= pause_ ||
                           lengthOf(captions_.back().text) + lengthOf(label.text) > s_lineLength;
        if (isNew)
            captions_.push_back({time, 0, {}});
        else if (!(label.isTyped && wasTyped_))
            captions_.back().text += ' ';
        captions_.back().text += label.text;
        captions_.back().end = time + s_hold;
        lastTime_ = time;
        wasTyped_ = label.isTyped;
        isLineEnded_ = label.endsLine;
    }

private:
    std::vector<Caption>& captions_;
    double pause_;
    double lastTime_ = 0;
    bool wasTyped_ = false;
    bool isLineEnded_ = false;
};

} // namespace

bool isShowable(double seconds) {
    return seconds >= 0 && seconds < s_endOfTime;
}

KeyLabel labelOf(const KeyStroke& key, bool showsKeys) {
    const Modifiers modifiers(key.eventFlagsCode);
    const std::string name =
        HumanReadableActions::KeyboardActionCodeToString(static_cast<std::int32_t>(key.characterCode));
    const std::string character = characterOf(key, name, modifiers);
    const bool isSpecial = character.empty() && (showsKeys || !mayBeCharacter(key, modifiers));
    if (isSpecial)
        return {fmt::format("{}[{}]", modifiers.signs(), name), false, name == "returnKey"};
    const std::string shown = showsKeys ? character : s_mask;
    if (modifiers.makeShortcut())
        return {modifiers.signs() + shown, false, false};
    return {shown, true, false};
}

std::vector<Caption> keyCaptions(std::vector<KeyEvent> keys, double pause, bool showsKeys) {
    std::stable_sort(keys.begin(), keys.end(),
                     [](const KeyEvent& left, const KeyEvent& right) { return left.time < right.time; });
    std::vector<Caption> captions;
    CaptionBuilder builder(captions, pause);
    for (const KeyEvent& event : keys)
        builder.add(event.time, labelOf(event.key, showsKeys));
    return captions;
}

std::vector<PlacedCaption> placed(std::vector<Caption> captions, double unitsPerSecond, double duration) {
    std::stable_sort(captions.begin(), captions.end(),
                     [](const Caption& left, const Caption& right) { return left.start < right.start; });
    std::vector<PlacedCaption> result;
    for (const Caption& caption : captions) {
        const double lastEnd = std::max(caption.start + s_lastDuration, std::min(duration, s_endOfTime));
        const double end = std::isfinite(caption.end) ? caption.end : lastEnd;
        const PlacedCaption next{std::llround(caption.start * unitsPerSecond), std::llround(end * unitsPerSecond),
                                 caption.text};
        if (!result.empty() && result.back().start == next.start) {
            result.back().text += " \xc2\xb7 " + next.text; // middle dot
            result.back().end = std::max(result.back().end, next.end);
            continue;
        }
        if (!result.empty())
            result.back().end = std::min(result.back().end, next.start);
        result.push_back(next);
    }
    for (PlacedCaption& caption : result)
        caption.end = std::max(caption.end, caption.start + 1);
    return result;
}

} // namespace Zulm
