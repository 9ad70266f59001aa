#include "Tools/zulm/ChildProcess.h"

#include "Platform/Descriptor.h"
#include "Tools/zulm/Failure.h"
#include "Tools/zulm/Interruptions.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <optional>
#include <poll.h>
#include <spawn.h>
#include <sys/wait.h>
#include <system_error>
#include <unistd.h>
#include <utility>

extern char** environ; // NOLINT(readability-redundant-declaration): not every system declares it

namespace Zulm {

using ZULMetaData::Descriptor;
using ZULMetaData::uninterrupted;

namespace {

constexpr std::size_t s_mostErrors = 4096;
constexpr int s_pollMilliseconds = 100; // after which signals are looked for

/// Neither end is inherited by programs that are started.
class Pipe {
public:
    Pipe() {
        std::array<int, 2> ends{};
        if (pipe(ends.data()) != 0)
            throw Failure(fmt::format("no pipe can be opened: {}", std::strerror(errno)));
        readEnd_.emplace(ends[0]);
        writeEnd_.emplace(ends[1]);
        for (const int end : ends)
            fcntl(end, F_SETFD, FD_CLOEXEC);
    }

    int readEnd() const { return readEnd_->number(); }
    int writeEnd() const { return writeEnd_->number(); }
    void closeWriteEnd() { writeEnd_.reset(); }

private:
    std::optional<Descriptor> readEnd_;
    std::optional<Descriptor> writeEnd_;
};

/// A file without a name from which the program reads its input, as long as that may be. A pipe could send this program
/// a signal if the other one ended before it had read everything.
class ChildInput {
public:
    explicit ChildInput(std::string_view bytes) try : file_(newFile()) {
        file_.writeAt(0, bytes);
    } catch (const std::system_error& error) {
        throw Failure(
            fmt::format("no temporary file can be written: {}; set TMPDIR to another folder", error.code().message()));
    }

    int number() const { return file_.number(); }

private:
    static int newFile() {
        std::string name = (std::filesystem::temp_directory_path() / ".zulm.XXXXXX").string();
        const int file = mkostemp(name.data(), O_CLOEXEC);
        if (file < 0)
            throw std::system_error(errno, std::generic_category());
        unlink(name.c_str());
        return file;
    }

    Descriptor file_;
};

/// In a process group of its own, so that the terminal's signals reach this program alone, which then cleans up.
class Child {
public:
    Child(const std::vector<std::string>& words, const std::optional<ChildInput>& input, const Pipe& output,
          const Pipe& errors) {
        std::vector<char*> arguments;
        arguments.reserve(words.size() + 1);
        for (const std::string& word : words)
            arguments.push_back(const_cast<char*>(word.c_str())); // never written to
        arguments.push_back(nullptr);
        posix_spawn_file_actions_t files;
        posix_spawnattr_t attributes;
        posix_spawn_file_actions_init(&files);
        posix_spawnattr_init(&attributes);
        if (input)
            posix_spawn_file_actions_adddup2(&files, input->number(), STDIN_FILENO);
        else
            posix_spawn_file_actions_addopen(&files, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
        posix_spawn_file_actions_adddup2(&files, output.writeEnd(), STDOUT_FILENO);
        posix_spawn_file_actions_adddup2(&files, errors.writeEnd(), STDERR_FILENO);
        posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETPGROUP);
        posix_spawnattr_setpgroup(&attributes, 0);
        const int error = posix_spawnp(&process_, arguments.front(), &files, &attributes, arguments.data(), environ);
        posix_spawnattr_destroy(&attributes);
        posix_spawn_file_actions_destroy(&files);
        if (error != 0)
            throw Failure(error == ENOENT
                              ? fmt::format("{0}: no such program in PATH; install {0}", words.front())
                              : fmt::format("{}: cannot be started: {}", words.front(), std::strerror(error)));
    }
    ~Child() {
        if (isRunning_) {
            kill(process_, SIGKILL);
            wait();
        }
    }
    Child(const Child&) = delete;
    Child& operator=(const Child&) = delete;

    int wait() {
        int status = 0;
        uninterrupted([&] { return waitpid(process_, &status, 0); });
        isRunning_ = false;
        constexpr int signalBase = 128;
        return WIFSIGNALED(status) ? signalBase + WTERMSIG(status) : WEXITSTATUS(status);
    }

private:
    pid_t process_ = 0;
    bool isRunning_ = true;
};

/// Reads what there is. Returns nothing at the end.
std::string_view readSome(int file, std::array<char, 65536>& buffer) {
    const ssize_t size = uninterrupted([&] { return read(file, buffer.data(), buffer.size()); });
    return {buffer.data(), size < 0 ? 0 : static_cast<std::size_t>(size)};
}

} // namespace

ChildResult runChild(const std::vector<std::string>& words, const std::function<void(std::string_view bytes)>& take,
                     std::string_view input) {
    std::optional<ChildInput> childInput;
    if (!input.empty())
        childInput.emplace(input);
    Pipe output;
    Pipe errors;
    Child child(words, childInput, output, errors);
    output.closeWriteEnd();
    errors.closeWriteEnd();
    ChildResult result;
    const auto buffer = std::make_unique<std::array<char, 65536>>();
    std::array<pollfd, 2> ends{{{output.readEnd(), POLLIN, 0}, {errors.readEnd(), POLLIN, 0}}};
    while (ends[0].fd >= 0 || ends[1].fd >= 0) {
        NotedSignals::check();
        if (poll(ends.data(), ends.size(), s_pollMilliseconds) <= 0)
            continue;
        for (pollfd& end : ends) {
            if (end.fd < 0 || end.revents == 0)
                continue;
            const std::string_view bytes = readSome(end.fd, *buffer);
            if (&end == ends.data())
                take(bytes);
            else
                result.errors += bytes.substr(0, s_mostErrors - std::min(s_mostErrors, result.errors.size()));
            if (bytes.empty())
                end.fd = -1; // which `poll` leaves alone
        }
    }
    result.exitCode = child.wait();
    NotedSignals::check();
    return result;
}

std::function<void(std::string_view bytes)> inLines(std::function<void(std::string_view line)> take) {
    return [take = std::move(take), rest = std::string()](std::string_view bytes) mutable {
        rest += bytes;
        std::size_t begin = 0;
        for (std::size_t end; (end = rest.find('\n', begin)) != std::string::npos; begin = end + 1)
            take(std::string_view(rest).substr(begin, end - begin));
        rest.erase(0, begin);
    };
}

} // namespace Zulm
