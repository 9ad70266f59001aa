#pragma once

#include <exception>
#include <string>

namespace Recorder {

/// What went wrong, in sentences for the user.
class Losses {
public:
    void add(const std::string& sentence) {
        if (text_.find(sentence) == std::string::npos)
            text_ += (text_.empty() ? "" : "; ") + sentence;
    }

    /// Does one step of the ending. A step that fails keeps no other from being done.
    template <class Step>
    bool attempt(Step step) {
        try {
            step();
            return true;
        } catch (const std::exception& error) {
            add(error.what());
            return false;
        }
    }

    bool isEmpty() const { return text_.empty(); }
    const std::string& text() const { return text_; }

private:
    std::string text_;
};

} // namespace Recorder
