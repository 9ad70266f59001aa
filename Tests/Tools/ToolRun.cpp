#include "Tests/Tools/ToolRun.h"

#include <gtest/gtest.h>

#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <poll.h>
#include <pty.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace ZULMetaData::Test {

namespace {

using Clock = std::chrono::steady_clock;

constexpr auto s_timeLimit = std::chrono::minutes(2);

/// The ends of a channel: the program's, and the test's where it reads.
struct Ends {
    int program = -1;
    int test = -1;
};

Ends openPipe() {
    std::array<int, 2> ends{};
    EXPECT_EQ(pipe2(ends.data(), O_CLOEXEC), 0) << std::strerror(errno);
    return {ends[1], ends[0]};
}

Ends openTerminal() {
    Ends ends;
    const winsize size{24, 80, 0, 0};
    EXPECT_EQ(openpty(&ends.test, &ends.program, nullptr, nullptr, &size), 0) << std::strerror(errno);
    fcntl(ends.test, F_SETFD, FD_CLOEXEC);
    fcntl(ends.program, F_SETFD, FD_CLOEXEC);
    return ends;
}

Ends openChannel(Channel channel) {
    switch (channel) {
    case Channel::Pipe: return openPipe();
    case Channel::Terminal: return openTerminal();
    case Channel::Closed: return {};
    case Channel::FullDisk: return {open("/dev/full", O_WRONLY | O_CLOEXEC), -1};
    case Channel::BrokenPipe: break;
    }
    const Ends ends = openPipe();
    close(ends.test);
    return {ends.program, -1};
}

void closeEnd(int& descriptor) {
    if (descriptor >= 0)
        close(descriptor);
    descriptor = -1;
}

/// In the child, between fork and exec.
void redirect(int from, int to) {
    if (from < 0)
        close(to);
    else
        dup2(from, to);
}

[[noreturn]] void becomeProgram(const std::string& program, const std::vector<std::string>& arguments,
                                const ToolOptions& options, int input, int output, int errors) {
    std::signal(SIGPIPE, SIG_DFL);
    for (const auto& [name, value] : options.environment)
        setenv(name.c_str(), value.c_str(), 1);
    if (!options.folder.empty() && chdir(options.folder.c_str()) != 0)
        _exit(126);
    redirect(input, STDIN_FILENO);
    redirect(output, STDOUT_FILENO);
    redirect(errors, STDERR_FILENO);
    std::vector<char*> words{const_cast<char*>(program.c_str())};
    for (const std::string& argument : arguments)
        words.push_back(const_cast<char*>(argument.c_str()));
    words.push_back(nullptr);
    execvp(program.c_str(), words.data());
    _exit(127);
}

/// What has come; closes the end where nothing more will. A terminal ends with an error.
void readFrom(int& descriptor, std::string& text) {
    std::array<char, 65536> piece;
    const ssize_t size = read(descriptor, piece.data(), piece.size());
    if (size > 0)
        text.append(piece.data(), static_cast<std::size_t>(size));
    else if (size == 0 || errno != EINTR)
        closeEnd(descriptor);
}

class Conversation {
public:
    Conversation(pid_t child, const ToolOptions& options, int input, int output, int errors)
        : child_(child), options_(options), input_(input), output_(output), errors_(errors) {
        if (options_.input.empty())
            closeEnd(input_);
    }

    ToolResult finish() {
        while (output_ >= 0 || errors_ >= 0 || isWriting())
            if (!exchange())
                break;
        result_.exitCode = waitForEnd();
        closeEnd(input_);
        return result_;
    }

private:
    bool exchange() {
        std::array<pollfd, 3> channels{
            {{output_, POLLIN, 0}, {errors_, POLLIN, 0}, {isWriting() ? input_ : -1, POLLOUT, 0}}};
        poll(channels.data(), channels.size(), 20);
        if (channels[0].revents != 0 && options_.slownessMilliseconds > 0)
            std::this_thread::sleep_for(std::chrono::milliseconds(options_.slownessMilliseconds));
        if (channels[0].revents != 0)
            readFrom(output_, result_.output);
        if (channels[1].revents != 0)
            readFrom(errors_, result_.errors);
        if (channels[2].revents != 0 && !write())
            closeEnd(input_);
        return !mustStop();
    }

    bool isWriting() const { return input_ >= 0 && written_ < options_.input.size(); }

    /// False where nothing more will be written.
    bool write() {
        const ssize_t size = ::write(input_, options_.input.data() + written_, options_.input.size() - written_);
        if (size > 0)
            written_ += static_cast<std::size_t>(size);
        const bool isBlocked = size < 0 && errno == EAGAIN;
        return isBlocked || (size >= 0 && (isWriting() || options_.keepsInputOpen));
    }

    bool mustStop() {
        const auto elapsed = Clock::now() - start_;
        if (options_.killAfterMilliseconds > 0 && !killed_ &&
            elapsed > std::chrono::milliseconds(options_.killAfterMilliseconds) && options_.killWhen()) {
            options_.beforeKill();
            kill(child_, options_.killSignal);
            killed_ = true;
        }
        if (elapsed < s_timeLimit)
            return false;
        ADD_FAILURE() << "runs for more than two minutes";
        kill(child_, SIGKILL);
        return true;
    }

    int waitForEnd() {
        int status = 0;
        rusage usage{};
        while (wait4(child_, &status, WNOHANG, &usage) == 0) {
            mustStop();
            usleep(1000);
        }
        result_.peakMemoryKB = usage.ru_maxrss;
        return WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
    }

    pid_t child_;
    const ToolOptions& options_;
    int input_;
    int output_;
    int errors_;
    std::size_t written_ = 0;
    bool killed_ = false;
    Clock::time_point start_ = Clock::now();
    ToolResult result_;
};

} // namespace

ToolResult runProgram(const std::string& program, const std::vector<std::string>& arguments,
                      const ToolOptions& options) {
    std::signal(SIGPIPE, SIG_IGN); // a program need not read its input
    Ends output = openChannel(options.output);
    Ends errors = openChannel(options.errors);
    Ends input = openPipe(); // the other way round: the test writes
    const pid_t child = fork();
    fcntl(input.program, F_SETFL, O_NONBLOCK); // the program may read slower than it prints
    if (child == 0)
        becomeProgram(program, arguments, options, input.test, output.program, errors.program);
    EXPECT_GT(child, 0) << std::strerror(errno);
    for (int* end : {&output.program, &errors.program, &input.test})
        closeEnd(*end);
    ToolResult result = Conversation(child, options, input.program, output.test, errors.test).finish();
    EXPECT_NE(result.exitCode, 127) << program << " cannot be started";
    return result;
}

ToolResult runTool(const std::vector<std::string>& arguments, const ToolOptions& options) {
    return runProgram(ZULM_PATH, arguments, options);
}

} // namespace ZULMetaData::Test
