#pragma once

// How the recorder ends, and the one exception by which a part of it gives up.

#include <stdexcept>
#include <string>

namespace Recorder {

enum ExitCode : int {
    ExitFine = 0,
    ExitFailed = 1,  ///< nothing could be made
    ExitRefused = 2, ///< the options, the output or the display are refused; nothing was created
    ExitLoss = 3,    ///< something was lost
};

/// A sentence for the user that says what happened and what to do, and how the program ends.
class Failure : public std::runtime_error {
public:
    explicit Failure(const std::string& sentence, ExitCode code = ExitFailed)
        : std::runtime_error(sentence), code_(code) {}

    ExitCode code() const { return code_; }

private:
    ExitCode code_;
};

/// Something that is refused before anything is created.
class Refusal : public Failure {
public:
    explicit Refusal(const std::string& sentence) : Failure(sentence, ExitRefused) {}
};

} // namespace Recorder
