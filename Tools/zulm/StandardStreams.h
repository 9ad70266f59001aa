#pragma once

// The standard streams of the process: what is printed is counted as done only when it has been taken.

#include <string>
#include <string_view>

namespace Zulm {

/// Puts something harmless in place of standard streams that are closed, so that no file that is opened later takes
/// their number and gets what is printed. Call first.
void secureStandardStreams();

/// Writes to standard output, buffered. Throws `std::system_error` where it is not taken, as `fmt::print` does.
void writeOutput(std::string_view bytes);

/// Writes `bytes` only if something was written before.
void writeSeparator(std::string_view bytes);

/// Writes a whole line to standard error. Nobody can be told if even this fails.
void writeError(std::string_view line);

/// What a piece of what is printed is.
enum class Printed {
    Output,    ///< for standard output
    Separator, ///< the same, but only after other output
    Document,  ///< the same: an element of the array that the document of the whole run has open, or a part of one
    Error,     ///< a line for standard error
};

/// Takes what a thread prints, in place of the standard streams.
class PrintTarget {
public:
    virtual ~PrintTarget() = default;
    virtual void print(Printed what, std::string_view bytes) = 0;

    /// Returns the one of this thread, or null if it prints to the standard streams.
    static PrintTarget* current();
};

/// While it lives, what this thread prints goes to `target`, or to the standard streams if it is null.
class PrintsTo {
public:
    explicit PrintsTo(PrintTarget* target);
    ~PrintsTo();
    PrintsTo(const PrintsTo&) = delete;
    PrintsTo& operator=(const PrintsTo&) = delete;

private:
    PrintTarget* before_;
};

/// Sends what is buffered for standard output. False, after a complaint, where it could not be written.
bool flushStandardOutput();

/// Says that `error` kept standard output from being written, but not if its reader has ended: `zulm dump | head` is no
/// failure that a person wants to hear of.
void complainAboutOutput(int error);

/// `text` in bold where standard output may be coloured.
std::string heading(const std::string& text);

} // namespace Zulm
