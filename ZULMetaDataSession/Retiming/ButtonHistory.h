#pragma once

// Which buttons are down at a time.

#include "ZULMetaDataBridge/Source/InputVocabulary.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

namespace ZULMetaData::detail {

/// The buttons in the order in which several are listed.
inline constexpr std::array s_buttons{MouseButton::Left, MouseButton::Right, MouseButton::Middle};

/// The actions of each button, told apart by the numbers of their entries.
class ButtonHistory {
public:
    struct Action {
        std::size_t entry = 0;
        bool isPress = false;
        std::int32_t stored = 0; ///< the number in the stream
    };

    /// Adds what the entry of this number says. Entries are added in their order.
    void add(std::size_t entry, std::int32_t stored);

    /// Returns the last action of a button before the entry of this number, or null.
    const Action* lastBefore(MouseButton button, std::size_t entry) const;

    /// Returns the first action of a button from the entry of this number on, or null.
    const Action* firstFrom(MouseButton button, std::size_t entry) const;

private:
    const std::vector<Action>& actionsOf(MouseButton button) const {
        return actions_[static_cast<std::size_t>(button)];
    }

    std::array<std::vector<Action>, s_buttons.size()> actions_;
};

} // namespace ZULMetaData::detail
