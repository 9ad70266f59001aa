#include "Tools/zulm/StandardStreams.h"

#include "Tools/zulm/Command.h"
#include "Tools/zulm/Settings.h"

#include <fmt/color.h>
#include <fmt/core.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <system_error>
#include <unistd.h>

namespace Zulm {

namespace {

std::array<char, 1 << 16> s_outputBuffer;
bool s_hasOutput = false; // only the thread whose turn it is writes to standard output
thread_local PrintTarget* t_target = nullptr;

} // namespace

void secureStandardStreams() {
    struct Stream {
        int descriptor;
        int mode; // the wrong one for the two that matter: using them must fail
    };
    for (const Stream stream : {Stream{STDIN_FILENO, O_WRONLY}, {STDOUT_FILENO, O_RDONLY}, {STDERR_FILENO, O_WRONLY}})
        if (fcntl(stream.descriptor, F_GETFD) < 0)
            if (open("/dev/null", stream.mode) != stream.descriptor)
                std::abort();      // the lowest free number is the one that is missing
    std::signal(SIGXFSZ, SIG_IGN); // a file that may not grow is a write that fails, and is told
    std::setvbuf(stdout, s_outputBuffer.data(), isTerminal(stdout) ? _IOLBF : _IOFBF, s_outputBuffer.size());
}

bool flushStandardOutput() {
    errno = 0;
    if (std::fflush(stdout) == 0)
        return true;
    complainAboutOutput(errno);
    return false;
}

void complainAboutOutput(int error) {
    if (error == EBADF)
        complain("standard output: is closed, so the result could not be printed");
    else if (error != EPIPE)
        complain(fmt::format("standard output: cannot be written: {}", std::strerror(error)));
}

void writeOutput(std::string_view bytes) {
    if (t_target)
        return t_target->print(Printed::Output, bytes);
    s_hasOutput |= !bytes.empty();
    if (std::fwrite(bytes.data(), 1, bytes.size(), stdout) != bytes.size())
        throw std::system_error(errno, std::generic_category(), "standard output");
}

void writeSeparator(std::string_view bytes) {
    if (t_target)
        t_target->print(Printed::Separator, bytes);
    else if (s_hasOutput)
        writeOutput(bytes);
}

void writeError(std::string_view line) {
    if (t_target)
        t_target->print(Printed::Error, line);
    else
        std::fwrite(line.data(), 1, line.size(), stderr);
}

PrintTarget* PrintTarget::current() {
    return t_target;
}

PrintsTo::PrintsTo(PrintTarget* target) : before_(t_target) {
    t_target = target;
}

PrintsTo::~PrintsTo() {
    t_target = before_;
}

std::string heading(const std::string& text) {
    return useColor(stdout) ? fmt::format(fmt::emphasis::bold, "{}", text) : text;
}

} // namespace Zulm
