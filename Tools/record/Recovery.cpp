#include "Tools/record/Recovery.h"

#include "Tools/record/Failure.h"
#include "Tools/record/FileHandle.h"
#include "Tools/record/FragmentedMovie.h"
#include "Tools/record/RecordingFolder.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "ZULMetaDataSession/Recording.h"

#include <fcntl.h>
#include <fmt/core.h>
#include <sys/file.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

namespace Recorder {

namespace fs = std::filesystem;
using namespace ZULMetaData;

namespace {

constexpr std::string_view s_suffix = ".recording";

constexpr double s_pictureLate = 1.2; ///< seconds by which the picture may end before the streams
constexpr double s_streamsLate = 2.5; ///< seconds by which the usage of the processor may end before the picture

void say(const std::string& line) {
    const std::string text = "zulm record: " + line + "\n";
    std::fwrite(text.data(), 1, text.size(), stderr);
}

fs::path withoutSlash(const fs::path& folder) {
    return folder.has_filename() ? folder : folder.parent_path();
}

fs::path usualOutput(const fs::path& folder) {
    const std::string name = withoutSlash(folder).string();
    if (!name.ends_with(s_suffix))
        throw Refusal(fmt::format("{}: not the folder of a recording, whose name ends in .recording; name the movie to "
                                  "make with -o",
                                  name));
    return name.substr(0, name.size() - s_suffix.size());
}

/// Throws `Refusal` if the recorder of the folder is alive.
void requireDead(const fs::path& folder) {
    const FileHandle lock(open((folder / "session.lock").c_str(), O_RDONLY | O_CLOEXEC));
    if (lock && flock(lock.get(), LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK)
        throw Refusal(fmt::format("{}: is being recorded; end that with 'zulm record --stop'", folder.string()));
}

/// Copies what of the movie can be played.
void copyWhole(int from, int to, std::uint64_t bytes, const std::string& name) {
    std::vector<char> buffer(std::size_t{1} << 20);
    for (std::uint64_t done = 0; done < bytes;) {
        const std::size_t wanted = static_cast<std::size_t>(std::min<std::uint64_t>(buffer.size(), bytes - done));
        const ssize_t count = pread(from, buffer.data(), wanted, static_cast<off_t>(done));
        if (count <= 0)
            throw Failure(fmt::format("{}: cannot be read: {}", name, std::strerror(errno)));
        for (ssize_t written = 0; written < count;) {
            const ssize_t part = write(to, buffer.data() + written, static_cast<std::size_t>(count - written));
            if (part < 0)
                throw Failure(fmt::format("{}: cannot be copied: {}; free some space, or name another place with -o",
                                          name, std::strerror(errno)));
            written += part;
        }
        done += static_cast<std::uint64_t>(count);
    }
}

/// What of a recording was found.
struct Findings {
    std::vector<StreamSource> streams;
    double lastTime = 0;  ///< of all entries
    double lastUsage = 0; ///< of the stream that has an entry each second
    bool hasLoss = false;

    void lose(const std::string& what) {
        say(what);
        hasLoss = true;
    }
};

bool isMissingKind(const std::string& name) {
    static constexpr std::array everyRecordingHas{"recordingRegion", "recordingScaleFactor", "systemData",
                                                  "topmostWindow",   "topmostWindowTitle",   "topmostAppName"};
    return std::find(everyRecordingHas.begin(), everyRecordingHas.end(), name) != everyRecordingHas.end();
}

/// Takes every stream file that has a whole entry. A kind that every recording begins with must be there.
Findings streamsIn(const fs::path& folder) {
    Findings findings;
    RecordedKinds::forEach([&]<class Kind>() {
        const std::string name = metaDataKindName(Kind::type);
        const fs::path file = folder / (name + ".dat");
        std::error_code error;
        if (!fs::exists(file, error)) {
            if (isMissingKind(name))
                findings.lose(fmt::format("{}: is missing", file.string()));
            return;
        }
        try {
            const Recording stream(file);
            const Track<Kind>& track = stream.track<Kind>();
            if (!track.empty()) {
                findings.streams.push_back(StreamSource::file(file));
                findings.lastTime = std::max(findings.lastTime, track.times().back());
                if (std::is_same_v<Kind, CPUUsageKind>)
                    findings.lastUsage = track.times().back();
            } else if (isMissingKind(name)) {
                findings.lose(fmt::format("{}: has no whole entry", file.string()));
            }
        } catch (const std::exception& problem) {
            findings.lose(problem.what());
        }
    });
    return findings;
}

bool haveSameBytes(const fs::path& left, const fs::path& right) {
    const FileHandle first(open(left.c_str(), O_RDONLY | O_CLOEXEC));
    const FileHandle second(open(right.c_str(), O_RDONLY | O_CLOEXEC));
    std::vector<char> here(std::size_t{1} << 20);
    std::vector<char> there(here.size());
    for (;;) {
        const ssize_t count = read(first.get(), here.data(), here.size());
        if (count < 0 || read(second.get(), there.data(), there.size()) != count ||
            !std::equal(here.begin(), here.begin() + count, there.begin()))
            return false;
        if (count == 0)
            return true;
    }
}

/// Removes a file that is not finished.
class Draft {
public:
    explicit Draft(fs::path path) : path_(std::move(path)) {
        std::error_code ignored;
        fs::remove(path_, ignored); // of a recovery that was killed
        file_ = FileHandle(open(path_.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
        if (!file_)
            throw Failure(fmt::format("{}: cannot be created: {}", path_.string(), std::strerror(errno)));
    }
    ~Draft() { unlink(path_.c_str()); }
    Draft(const Draft&) = delete;
    Draft& operator=(const Draft&) = delete;

    int get() const { return file_.get(); }
    const fs::path& path() const { return path_; }

private:
    fs::path path_;
    FileHandle file_;
};

/// The recorder may have been killed after its movie was whole.
bool wasSaved(const fs::path& folder, const fs::path& output) {
    std::error_code error;
    return !fs::exists(folder / "movie.mp4", error) && fs::exists(output, error);
}

/// Returns whether everything in the recovered movie can be read.
bool isReadable(const fs::path& movie, std::size_t streams) {
    try {
        return Recording(movie).streams().size() >= streams;
    } catch (const std::exception& problem) {
        say(problem.what());
        return false;
    }
}

} // namespace

int recover(const fs::path& givenFolder, const fs::path& givenOutput, bool deletesFolder) {
    const fs::path folder = withoutSlash(givenFolder);
    const fs::path output = givenOutput.empty() ? usualOutput(folder) : givenOutput;
    std::error_code error;
    const bool hasOutput = fs::exists(fs::symlink_status(output, error));
    if (!fs::is_directory(folder, error)) {
        if (hasOutput)
            return ExitFine; // an earlier call has made it and removed the folder
        throw Failure(fmt::format("{}: no such folder", folder.string()));
    }
    requireDead(folder);
    if (wasSaved(folder, output)) {
        if (deletesFolder)
            fs::remove_all(folder, error);
        return ExitFine;
    }
    const fs::path source = folder / "movie.mp4";
    const FileHandle movie(open(source.c_str(), O_RDONLY | O_CLOEXEC));
    if (!movie)
        throw Failure(fmt::format("{}: cannot be opened: {}", source.string(), std::strerror(errno)));
    const FragmentedMovie fragments(movie.get(), source.string());
    Findings findings = streamsIn(folder);

    if (findings.lastTime > fragments.duration() + s_pictureLate)
        findings.lose(fmt::format("{}: ends {:.1f} s before the streams", source.string(),
                                  findings.lastTime - fragments.duration()));
    if (fragments.duration() > findings.lastUsage + s_streamsLate)
        findings.lose(fmt::format("{}: its streams end {:.1f} s before the picture", folder.string(),
                                  fragments.duration() - findings.lastUsage));

    Draft draft(output.string() + ".recovering");
    copyWhole(movie.get(), draft.get(), fragments.wholeBytes(), source.string());
    FragmentedMovie(draft.get(), source.string()).makeOrdinary(draft.get());
    const SafeMovieSave save(draft.path());
    if (!findings.streams.empty())
        save.attach(findings.streams);
    save.stamp("zulm record", ZULM_VERSION);

    if (!isReadable(draft.path(), findings.streams.size()))
        findings.lose(fmt::format("{}: cannot be read back; nothing was removed", output.string()));
    if (hasOutput && !haveSameBytes(draft.path(), output))
        throw Refusal(fmt::format("{}: exists and is another movie; name another one with -o", output.string()));
    if (!hasOutput)
        renameWithoutReplacing(draft.path(), output);
    syncFolder(output.parent_path());
    if (deletesFolder && !findings.hasLoss)
        fs::remove_all(folder, error);
    return findings.hasLoss ? ExitLoss : ExitFine;
}

} // namespace Recorder
