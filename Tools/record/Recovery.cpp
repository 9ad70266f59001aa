#include "Tools/record/Recovery.h"

#include "Tools/record/Failure.h"
#include "Tools/record/FileHandle.h"
#include "Tools/record/FragmentedMovie.h"
#include "Tools/record/RecordingFolder.h"
#include "Tools/record/StatusLine.h"
#include "ZULMetaData/ByteSource.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"
#include "ZULMetaDataBridge/Source/RecordingFile.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "ZULMetaDataSession/Recording.h"

#include <fcntl.h>
#include <fmt/core.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>
#include <type_traits>
#include <vector>

namespace Recorder {

namespace fs = std::filesystem;
using namespace ZULMetaData;

namespace {

constexpr std::string_view s_suffix = ".recording";

constexpr double s_pictureLate = 1.2; ///< seconds by which the picture may end before the streams
constexpr double s_streamsLate = 2.5; ///< seconds by which the usage of the processor may end before the picture

void warn(const std::string& line) {
    say("zulm record: " + line);
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

bool isLocked(const FileHandle& file) {
    return file && flock(file.get(), LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK;
}

/// Throws `Refusal` if the recorder of the folder is alive.
void requireDead(const fs::path& folder) {
    const FileHandle lock(open((folder / "session.lock").c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    if (isLocked(lock))
        throw Refusal(fmt::format("{}: is being recorded; end that with 'zulm record --stop'", folder.string()));
}

/// Returns a lock that keeps other recoveries of the folder away. Throws `Refusal` if there is one.
FileHandle locked(const fs::path& folder) {
    FileHandle handle(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (isLocked(handle))
        throw Refusal(
            fmt::format("{}: is being recovered by another process; wait until it has ended", folder.string()));
    return handle;
}

FileHandle openMovie(const fs::path& path) {
    FileHandle movie(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK)); // a pipe would wait for a writer
    struct stat status {};
    if (!movie || fstat(movie.get(), &status) != 0)
        throw Failure(
            fmt::format("{}: cannot be opened: {}; change who may read it", path.string(), std::strerror(errno)));
    if (!S_ISREG(status.st_mode))
        throw Failure(fmt::format("{}: is no file, so no recorder has made it; name another folder", path.string()));
    return movie;
}

/// Copies the part of the movie that can be played.
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

/// What was found of a recording.
struct Findings {
    std::vector<StreamSource> streams;
    std::vector<fs::path> files; ///< of the streams
    double lastTime = 0;         ///< of all entries
    double lastUsage = 0;        ///< of the stream that has an entry each second
    bool hasLoss = false;

    void lose(const std::string& what) {
        warn(what);
        hasLoss = true;
    }
};

bool isInEveryRecording(const std::string& name) {
    static constexpr std::array names{"recordingRegion",    "recordingScaleFactor", "systemData",   "topmostWindow",
                                      "topmostWindowTitle", "topmostAppName",       "cursorAction", "cursorOpacity"};
    return std::find(names.begin(), names.end(), name) != names.end();
}

/// Takes every stream file that has a whole entry. A kind that every recording begins with must be there.
Findings streamsIn(const fs::path& folder) {
    Findings findings;
    RecordedKinds::forEach([&]<class Kind>() {
        const std::string name = metaDataKindName(Kind::type);
        const fs::path file = folder / (name + ".dat");
        std::error_code error;
        if (!fs::exists(file, error)) {
            if (isInEveryRecording(name))
                findings.lose(fmt::format("{}: is missing", file.string()));
            return;
        }
        try {
            const Recording stream(file);
            const Track<Kind>& track = stream.track<Kind>();
            if (!track.empty()) {
                findings.streams.push_back(StreamSource::file(file));
                findings.files.push_back(file);
                findings.lastTime = std::max(findings.lastTime, track.times().back());
                if (std::is_same_v<Kind, CPUUsageKind>)
                    findings.lastUsage = track.times().back();
            } else if (isInEveryRecording(name)) {
                findings.lose(fmt::format("{}: has no whole entry", file.string()));
            }
        } catch (const std::exception& problem) {
            findings.lose(problem.what());
        }
    });
    return findings;
}

bool haveSameBytes(const ByteSource& left, const ByteSource& right) {
    std::vector<char> here(std::size_t{1} << 20);
    std::vector<char> there(here.size());
    for (std::uint64_t done = 0; done < left.size(); done += here.size()) {
        const std::size_t count = left.read(done, here);
        if (right.read(done, there) != count ||
            !std::equal(here.begin(), here.begin() + static_cast<long>(count), there.begin()))
            return false;
    }
    return left.size() == right.size();
}

bool haveSameBytes(const fs::path& left, const fs::path& right) {
    try {
        return haveSameBytes(ByteSource::file(left.string()), ByteSource::file(right.string()));
    } catch (const std::system_error&) {
        return false;
    }
}

/// A file of its own name, which is removed unless it was renamed.
class Draft {
public:
    explicit Draft(const fs::path& beside) {
        std::string name = beside.string() + ".XXXXXX";
        file_ = FileHandle(mkostemp(name.data(), O_CLOEXEC));
        if (!file_)
            throw Failure(
                fmt::format("{}: cannot be created: {}; name another place with -o", name, std::strerror(errno)));
        path_ = name;
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

/// Returns the header and the whole entries of a stream, or nothing if it has no whole entry.
std::optional<ByteSource> wholeEntriesOf(const fs::path& file) {
    const ByteSource stream = ByteSource::file(file.string());
    const auto extent = measureStream(stream);
    return extent && extent->entries > 0 ? std::optional(stream.part(0, extent->wholeBytes)) : std::nullopt;
}

bool holds(const Recording& movie, const ByteSource& stream) {
    const std::vector<StreamInfo>& streams = movie.streams();
    return std::any_of(streams.begin(), streams.end(),
                       [&](const StreamInfo& info) { return haveSameBytes(movie.bytesOf(info), stream); });
}

/// Returns whether readers find in a movie the entries of all these stream files, and each file has one.
bool holdsAll(const fs::path& file, const std::vector<fs::path>& streamFiles) {
    try {
        const Recording movie(file);
        return std::all_of(streamFiles.begin(), streamFiles.end(), [&movie](const fs::path& stream) {
            const auto entries = wholeEntriesOf(stream);
            return entries && holds(movie, *entries);
        });
    } catch (const std::exception& problem) {
        warn(problem.what());
        return false;
    }
}

/// The recorder may have been killed after its movie was whole. Throws `Failure` if it was not.
void requireSaved(const fs::path& folder, const fs::path& output) {
    std::vector<fs::path> streams = streamFilesIn(folder);
    std::erase_if(streams, [](const fs::path& stream) { return !wholeEntriesOf(stream); });
    if (streams.empty())
        throw Failure(
            fmt::format("{}: holds no recording, and nothing was changed; name a folder that a recorder left, "
                        "such as Talk.mp4.recording",
                        folder.string()));
    if (!holdsAll(output, streams))
        throw Failure(
            fmt::format("{}: is missing, and {} does not hold the streams in the folder; nothing was changed, "
                        "and 'zulm attach' puts the streams into a movie",
                        (folder / "movie.mp4").string(), output.string()));
}

void removeRecovered(const fs::path& folder) {
    if (!removeRecording(folder))
        warn(fmt::format("{}: was kept, because it holds more than the recording did; look at what is left in it",
                         folder.string()));
}

/// Throws `Refusal` if the movie to make would be among the files that it is made from.
void requireOutside(const fs::path& folder, const fs::path& output) {
    std::error_code error;
    if (fs::equivalent(fs::weakly_canonical(fs::absolute(output, error), error).parent_path(), folder, error))
        throw Refusal(
            fmt::format("{}: is in the folder of the recording; name another place with -o", output.string()));
}

/// The picture and the streams of a recording end at about the same time.
void compareEnds(const fs::path& folder, const FragmentedMovie& fragments, Findings& findings) {
    if (findings.lastTime > fragments.duration() + s_pictureLate)
        findings.lose(fmt::format("{}: ends {:.1f} s before the streams", (folder / "movie.mp4").string(),
                                  findings.lastTime - fragments.duration()));
    if (fragments.duration() > findings.lastUsage + s_streamsLate)
        findings.lose(fmt::format("{}: its streams end {:.1f} s before the picture", folder.string(),
                                  fragments.duration() - findings.lastUsage));
}

/// Makes an ordinary movie with its streams in `draft`.
void makeMovie(const FileHandle& movie, const FragmentedMovie& fragments, const std::string& name,
               const Findings& findings, const Draft& draft) {
    copyWhole(movie.get(), draft.get(), fragments.wholeBytes(), name);
    FragmentedMovie(draft.get(), name).makeOrdinary(draft.get());
    const SafeMovieSave save(draft.path());
    if (!findings.streams.empty())
        save.attach(findings.streams);
    save.stamp("zulm record", ZULM_VERSION);
}

/// Renames the draft, unless an earlier call has made the same movie.
void publish(const Draft& draft, const fs::path& output) {
    std::error_code error;
    if (!fs::exists(fs::symlink_status(output, error)))
        renameWithoutReplacing(draft.path(), output, "name another place with -o");
    else if (!haveSameBytes(draft.path(), output))
        throw Refusal(fmt::format("{}: exists and is another movie; name another one with -o", output.string()));
    syncFolder(output.parent_path());
}

} // namespace

int recover(const fs::path& givenFolder, const fs::path& givenOutput, bool deletesFolder) {
    const fs::path folder = withoutSlash(givenFolder);
    const fs::path output = givenOutput.empty() ? usualOutput(folder) : givenOutput;
    std::error_code error;
    if (!fs::is_directory(folder, error)) {
        if (fs::exists(fs::symlink_status(output, error)))
            return ExitFine; // an earlier call has made it and removed the folder
        throw Failure(fmt::format("{}: there is no such folder; name one that a recorder left, such as "
                                  "Talk.mp4.recording",
                                  folder.string()));
    }
    requireDead(folder);
    const FileHandle lock = locked(folder);
    requireOutside(folder, output);
    const fs::path source = folder / "movie.mp4";
    if (!fs::exists(fs::symlink_status(source, error))) {
        requireSaved(folder, output);
        if (deletesFolder)
            removeRecovered(folder);
        return ExitFine;
    }
    const FileHandle movie = openMovie(source);
    const FragmentedMovie fragments(movie.get(), source.string());
    Findings findings = streamsIn(folder);
    compareEnds(folder, fragments, findings);
    const Draft draft(output.string() + ".recovering");
    makeMovie(movie, fragments, source.string(), findings, draft);
    if (!holdsAll(draft.path(), findings.files))
        findings.lose(fmt::format("{}: cannot be read back; nothing was removed", output.string()));
    publish(draft, output);
    if (deletesFolder && !findings.hasLoss)
        removeRecovered(folder);
    return findings.hasLoss ? ExitLoss : ExitFine;
}

} // namespace Recorder
