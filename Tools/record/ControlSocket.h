#pragma once

// The socket by which `zulm record --pause`, `--resume` and `--stop` reach the recorder that runs.

#include "Tools/record/FileHandle.h"

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace Recorder {

enum class Command { Pause, Resume, Stop };

/// The answer to a command that comes before the first frame.
inline constexpr const char* s_tooEarly = "too early";

/// The answer to --pause and --resume after the end.
inline constexpr const char* s_tooLate = "too late";

/// The answer to --stop.
inline constexpr const char* s_stopping = "stopping";

/// The recorder's end. One thread uses it.
class ControlSocket {
public:
    /// Listens at `path`, or at the usual place in the user's runtime folder if it is empty. Throws `Refusal`.
    explicit ControlSocket(const std::filesystem::path& path);
    ~ControlSocket();
    ControlSocket(const ControlSocket&) = delete;
    ControlSocket& operator=(const ControlSocket&) = delete;

    /// Returns the descriptors to wait for.
    std::vector<int> descriptors() const;

    /// Takes what has arrived. `obey` returns the answer.
    void serve(const std::function<std::string(Command)>& obey);

    /// Tells those who asked for the end how it went.
    void tellEnd(const std::string& answer);

private:
    struct Client {
        FileHandle socket;
        bool waitsForEnd = false;
    };

    bool serve(Client& client, const std::function<std::string(Command)>& obey);

    std::filesystem::path path_;
    FileHandle listener_;
    std::vector<Client> clients_;
};

/// Sends a command to the recorder that listens at `path`, or to the only one that runs. Returns how the program ends.
int sendCommand(Command command, const std::filesystem::path& path);

} // namespace Recorder
