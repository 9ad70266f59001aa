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
constexpr double s_lastDuration = 5; ///< seconds of the last title if the length of the movie is not known
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

constexpr std::uint32_t s_space = 32;
constexpr std::string_view s_shiftedDigits = ")!@#$%^&*(";
constexpr std::uint32_t s_firstPunctuation = 187;
constexpr std::string_view s_punctuation = "+,-.";

/// Returns what a virtual key with a name types; empty if it types nothing.
std::string typedByVirtualKey(std::uint32_t code, const Modifiers& modifiers) {
    if (code == s_space)
        return " ";
    if (code >= '0' && code <= '9')
        return std::string(1, modifiers.has("<Shift>") ? s_shiftedDigits[code - '0'] : static_cast<char>(code));
    if (code >= s_firstPunctuation && code - s_firstPunctuation < s_punctuation.size())
        return std::string(1, s_punctuation[code - s_firstPunctuation]);
    if (code < 'A' || code > 'Z')
        return {};
    const bool isUpperCase = modifiers.makeUpperCase() || modifiers.makeShortcut();
    return std::string(1, static_cast<char>(isUpperCase ? code : code - 'A' + 'a'));
}

/// Returns what a key types; empty for a special key. A number may stand for any character.
std::string typedBy(const KeyStroke& key, const KeyName& name, const Modifiers& modifiers) {
    switch (name.meaning) {
    case KeyMeaning::Character: return name.text;
    case KeyMeaning::Number: return fmt::format("[{}]", name.text);
    case KeyMeaning::Key: break;
    }
    return isVirtualKey(key) ? typedByVirtualKey(key.characterCode, modifiers) : std::string();
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

double endOfCaptions(std::optional<double> duration) {
    return std::min(duration.value_or(s_endOfTime), s_endOfTime);
}

KeyLabel labelOf(const KeyStroke& key, bool showsKeys) {
    const Modifiers modifiers(key.eventFlagsCode);
    const KeyName name = keyNameOf(key);
    const std::string typed = typedBy(key, name, modifiers);
    if (typed.empty())
        return {fmt::format("{}[{}]", modifiers.signs(), name.text), false, name.text == "returnKey"};
    const std::string shown = showsKeys ? typed : s_mask;
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

std::vector<PlacedCaption> placed(std::vector<Caption> captions, double unitsPerSecond,
                                  std::optional<double> duration) {
    std::stable_sort(captions.begin(), captions.end(),
                     [](const Caption& left, const Caption& right) { return left.start < right.start; });
    const double lastEnd = std::floor(endOfCaptions(duration) * unitsPerSecond);
    const auto unitsAt = [&](double seconds) {
        return std::llround(std::min(std::round(seconds * unitsPerSecond), lastEnd));
    };
    std::vector<PlacedCaption> result;
    for (const Caption& caption : captions) {
        const double end = std::isfinite(caption.end) ? caption.end : duration.value_or(caption.start + s_lastDuration);
        const std::int64_t start = std::min(unitsAt(caption.start), std::max(std::llround(lastEnd) - 1, 0LL));
        const PlacedCaption next{start, unitsAt(end), caption.text};
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
