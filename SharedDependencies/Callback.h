#pragma once

// A function that one side hands over and the other side calls, such as a progress report or a source of bytes.

#include <cstddef>
#include <memory>
#include <type_traits>
#include <utility>

namespace ZULMetaData {

template <class Signature>
class Callback;

/// Holds a function: a lambda, a pointer to a function, a `std::function` or any other object that can be called with
/// `Arguments` and returns a `Result`. An empty callback must not be called. Copies share what they hold.
///
/// Public headers use this instead of `std::function`, because `<functional>` would make them twice as long.
template <class Result, class... Arguments>
class Callback<Result(Arguments...)> {
public:
    Callback() = default;
    Callback(std::nullptr_t) {} ///< creates an empty callback

    /// Moves `function` in. If it is a null pointer or an empty `std::function`, the callback is empty.
    template <class Function>
    requires(!std::is_same_v<Function, Callback> && std::is_invocable_r_v<Result, Function&, Arguments...>)
        Callback(Function function) {
        if constexpr (std::is_constructible_v<bool, Function> && !std::is_empty_v<Function>)
            if (!static_cast<bool>(function))
                return;
        call_ = [](void* held, Arguments... arguments) -> Result {
            return static_cast<Result>((*static_cast<Function*>(held))(std::forward<Arguments>(arguments)...));
        };
        held_ = std::make_shared<Function>(std::move(function));
    }

    /// Calls the function. Its exceptions pass through.
    Result operator()(Arguments... arguments) const {
        return call_(held_.get(), std::forward<Arguments>(arguments)...);
    }

    explicit operator bool() const { return call_ != nullptr; } ///< returns false if the callback is empty

private:
    Result (*call_)(void*, Arguments...) = nullptr;
    std::shared_ptr<void> held_;
};

} // namespace ZULMetaData
