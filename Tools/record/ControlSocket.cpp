#include "Tools/record/ControlSocket.h"

#include "Tools/record/Failure.h"

#include <fmt/core.h>

#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string_view>
#include <utility>

namespace Recorder {

namespace fs = std::filesystem;

namespace {

constexpr std::string_view s_prefix = "zulm-record-";
constexpr std::string_view s_suffix = ".sock";

struct Word {
    Command command;
    std::string_view text;
};
constexpr std::array s_words{Word{Command::Pause, "pause"}, Word{Command::Resume, "resume"},
                             Word{Command::Stop, "stop"}};

/// The folder that belongs to the user as long as he is logged in, or one in its place.
fs::path runtimeFolder() {
    const char* named = std::getenv("XDG_RUNTIME_DIR");
    std::error_code error;
    for (const fs::path& folder : {fs::path(named ? named : ""), fs::path(fmt::format("/run/user/{}", getuid()))})
        if (fs::is_directory(folder, error))
            return folder;
    return fs::temp_directory_path() / fmt::format("zulm-record-{}", getuid());
}

/// Throws `Refusal` unless the folder belongs to this user alone.
void requireOwnFolder(const fs::path& folder) {
    struct stat status {};
    mkdir(folder.c_str(), 0700);
    if (lstat(folder.c_str(), &status) != 0 || !S_ISDIR(status.st_mode) || status.st_uid != getuid())
        throw Refusal(
            fmt::format("{}: is not a folder of this user; set XDG_RUNTIME_DIR, or give --socket", folder.string()));
}

sockaddr_un addressOf(const fs::path& path) {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    const std::string name = path.string();
    if (name.size() >= sizeof(address.sun_path))
        throw Refusal(fmt::format("{}: the name is too long for a socket; give a shorter one with --socket", name));
    std::memcpy(address.sun_path, name.data(), name.size());
    return address;
}

/// Returns 0, or the number of the error.
int connectTo(const FileHandle& handle, const fs::path& path) {
    const sockaddr_un address = addressOf(path);
    return connect(handle.get(), reinterpret_cast<const sockaddr*>(&address), sizeof(address)) == 0 ? 0 : errno;
}

FileHandle newSocket(int flags = 0) {
    return FileHandle(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | flags, 0));
}

/// Returns 0 if somebody listens, or the number of the error. Does not wait for one that has stopped.
int tryToReach(const fs::path& path) {
    const int error = connectTo(newSocket(SOCK_NONBLOCK), path);
    return error == EAGAIN ? 0 : error;
}

/// Returns a connection, or an empty handle if nobody listens.
FileHandle connectionTo(const fs::path& path) {
    FileHandle handle = newSocket();
    return connectTo(handle, path) == 0 ? std::move(handle) : FileHandle();
}

/// Whether a recorder that was killed has left this socket. One that cannot be reached for another reason is in use.
bool isAbandoned(const fs::path& path) {
    std::error_code error;
    if (fs::symlink_status(path, error).type() != fs::file_type::socket)
        return false;
    return tryToReach(path) == ECONNREFUSED;
}

std::vector<fs::path> socketsOf(const fs::path& folder) {
    std::vector<fs::path> sockets;
    std::error_code error;
    for (const fs::directory_entry& entry : fs::directory_iterator(folder, error)) {
        const std::string name = entry.path().filename().string();
        if (name.starts_with(s_prefix) && name.ends_with(s_suffix) && tryToReach(entry.path()) == 0)
            sockets.push_back(entry.path());
    }
    return sockets;
}

fs::path onlySocket() {
    const fs::path folder = runtimeFolder();
    const std::vector<fs::path> sockets = socketsOf(folder);
    if (sockets.empty())
        throw Failure(fmt::format("no recorder is running: none listens in {}", folder.string()));
    if (sockets.size() == 1)
        return sockets.front();
    std::string text = "several recorders are running; choose one with --socket:";
    for (const fs::path& socket : sockets)
        text += "\n  " + socket.string();
    throw Refusal(text);
}

} // namespace

ControlSocket::ControlSocket(const fs::path& path) : path_(path) {
    if (path_.empty()) {
        const fs::path folder = runtimeFolder();
        requireOwnFolder(folder);
        path_ = folder / fmt::format("{}{}{}", s_prefix, getpid(), s_suffix);
        unlink(path_.c_str()); // of an earlier process of this number
    } else if (isAbandoned(path_)) {
        unlink(path_.c_str());
    }
    listener_ = newSocket(SOCK_NONBLOCK);
    const sockaddr_un address = addressOf(path_);
    const mode_t mask = umask(0177);
    const bool isBound = bind(listener_.get(), reinterpret_cast<const sockaddr*>(&address), sizeof(address)) == 0;
    const int error = errno;
    umask(mask);
    constexpr int waiting = 8;
    if (!isBound || listen(listener_.get(), waiting) != 0)
        throw Refusal(fmt::format("{}: the socket cannot be made: {}; choose another one with --socket", path_.string(),
                                  std::strerror(isBound ? errno : error)));
}

ControlSocket::~ControlSocket() {
    unlink(path_.c_str());
}

std::vector<int> ControlSocket::descriptors() const {
    std::vector<int> all{listener_.get()};
    for (const Client& client : clients_)
        all.push_back(client.socket.get());
    return all;
}

void ControlSocket::serve(const std::function<std::string(Command)>& obey) {
    for (;;) {
        FileHandle socket(accept4(listener_.get(), nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK));
        if (!socket)
            break;
        clients_.push_back({std::move(socket)});
    }
    for (std::size_t i = 0; i < clients_.size();) {
        if (serve(clients_[i], obey))
            ++i;
        else
            clients_.erase(clients_.begin() + static_cast<std::ptrdiff_t>(i));
    }
}

/// Returns false if the client has gone or was answered.
bool ControlSocket::serve(Client& client, const std::function<std::string(Command)>& obey) {
    std::array<char, 64> bytes{};
    const ssize_t count = recv(client.socket.get(), bytes.data(), bytes.size(), 0);
    if (count < 0)
        return errno == EAGAIN || errno == EINTR;
    if (count == 0)
        return false;
    std::string_view text(bytes.data(), static_cast<std::size_t>(count));
    text = text.substr(0, text.find('\n'));
    for (const Word& word : s_words) {
        if (word.text != text)
            continue;
        const std::string answer = obey(word.command) + "\n";
        send(client.socket.get(), answer.data(), answer.size(), MSG_NOSIGNAL);
        client.waitsForEnd = word.command == Command::Stop;
        return client.waitsForEnd;
    }
    return false;
}

void ControlSocket::tellEnd(const std::string& answer) {
    const std::string line = answer + "\n";
    for (const Client& client : clients_)
        if (client.waitsForEnd)
            send(client.socket.get(), line.data(), line.size(), MSG_NOSIGNAL);
    clients_.clear();
}

int sendCommand(Command command, const fs::path& path) {
    const fs::path target = path.empty() ? onlySocket() : path;
    const FileHandle connection = connectionTo(target);
    if (!connection)
        throw Failure(fmt::format("{}: no recorder listens there", target.string()));
    for (const Word& word : s_words)
        if (word.command == command) {
            const std::string line = std::string(word.text) + "\n";
            send(connection.get(), line.data(), line.size(), MSG_NOSIGNAL);
        }
    std::string answers;
    std::array<char, 256> bytes{};
    for (ssize_t count = 0; (count = recv(connection.get(), bytes.data(), bytes.size(), 0)) > 0;)
        answers.append(bytes.data(), static_cast<std::size_t>(count));
    if (answers.ends_with("kept\n"))
        return ExitLoss;
    if (command == Command::Stop && !answers.empty() && !answers.ends_with("saved\n"))
        throw Failure(
            fmt::format("{}: the recorder ended before its movie was whole; 'zulm record --recover' makes one "
                        "of its folder",
                        target.string()),
            ExitLoss);
    if (answers == s_tooLate + std::string("\n"))
        throw Failure(fmt::format("{}: the recorder is ending; wait for its movie", target.string()));
    if (answers == s_tooEarly + std::string("\n"))
        throw Failure(fmt::format("{}: the recorder has no frame yet; say it again when it has", target.string()));
    if (answers.empty())
        throw Failure(fmt::format("{}: the recorder ended without an answer", target.string()));
    return ExitFine;
}

} // namespace Recorder
