#include "ZULMetaDataSession/Retiming/ButtonHistory.h"

#include <algorithm>

namespace ZULMetaData::detail {

namespace {

/// Returns the first action from an entry on.
auto from(const std::vector<ButtonHistory::Action>& actions, std::size_t entry) {
    return std::lower_bound(
        actions.begin(), actions.end(), entry,
        [](const ButtonHistory::Action& action, std::size_t number) { return action.entry < number; });
}

} // namespace

void ButtonHistory::add(std::size_t entry, std::int32_t stored) {
    const ButtonAction action = buttonActionOf(stored);
    if (action.button)
        actions_[static_cast<std::size_t>(*action.button)].push_back({entry, action.isPress, stored});
}

const ButtonHistory::Action* ButtonHistory::lastBefore(MouseButton button, std::size_t entry) const {
    const std::vector<Action>& actions = actionsOf(button);
    const auto next = from(actions, entry);
    return next == actions.begin() ? nullptr : &*(next - 1);
}

const ButtonHistory::Action* ButtonHistory::firstFrom(MouseButton button, std::size_t entry) const {
    const std::vector<Action>& actions = actionsOf(button);
    const auto next = from(actions, entry);
    return next == actions.end() ? nullptr : &*next;
}

} // namespace ZULMetaData::detail
