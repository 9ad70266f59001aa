#include "Tools/zulm/ManyFiles.h"

#include "Platform/Descriptor.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/Interruptions.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <condition_variable>
#include <cstring>
#include <deque>
#include <fcntl.h>
#include <filesystem>
#include <iostream>
#include <mutex>
#include <optional>
#include <poll.h>
#include <streambuf>
#include <system_error>
#include <thread>
#include <unistd.h>

namespace Zulm {

using ZULMetaData::uninterrupted;

namespace {

constexpr std::string_view s_dash = "-";

bool isDash(const std::string& name) {
    return name == s_dash;
}

} // namespace

void addManyFiles(CLI::App& command, ManyFiles& files, const std::string& description) {
    command.add_option("FILE", files.named, description);
    CLI::Option* list =
        command
            .add_option("--files-from", files.list,
                        "Read the names of further files from this file, one in each line; - is standard input")
            ->type_name("FILE");
    command
        .add_flag("-0,--null", files.endsByZero, "In the list, names end with a zero byte, as 'find -print0' prints")
        ->needs(list);
    addCount(command, "--jobs", files.jobs,
             "Work on so many files at once, 0 for one on each processor. Results keep the order of the files");
}

void requireFiles(const ManyFiles& files) {
    if (files.named.empty() && files.list.empty())
        throw CLI::RequiredError("FILE");
    const auto dashes = std::count_if(files.named.begin(), files.named.end(), isDash);
    if (isDash(files.list) && dashes > 0)
        throw CLI::ValidationError("--files-from", "standard input cannot be the list and a recording");
    if (dashes > 1)
        throw CLI::ValidationError("FILE", "standard input cannot be two recordings; name - once");
    constexpr std::uint64_t mostJobs = 1024;
    if (files.jobs > mostJobs)
        throw CLI::ValidationError("--jobs",
                                   fmt::format("{} is too many; at most {} run at once", files.jobs, mostJobs));
}

/// The names in a file or on standard input. While nothing comes, signals are looked for.
class FileNames::List {
public:
    List(const std::string& path, bool endsByZero)
        : name_(path), end_(endsByZero ? '\0' : '\n'), file_(isDash(path) ? standardInput() : open(path)) {
        std::error_code isNoFile;
        const auto size = isDash(path) ? 0 : std::filesystem::file_size(path, isNoFile);
        size_ = isNoFile ? 0 : size;
    }

    bool next(std::string& path) {
        while (nextPiece(path)) {
            if (path.find('\0') != std::string::npos)
                throw Failure(fmt::format("{}: the names in it end with zero bytes; add --null", name_));
            if (path.empty())
                continue;
            if (isDash(path))
                path = "./-"; // a file of this name, as every other name in the list
            return true;
        }
        return false;
    }

    /// Returns how much of the list is read, or nothing if nobody knows how long it is.
    std::optional<double> share() const {
        return size_ == 0 ? std::nullopt : std::optional(static_cast<double>(read_) / static_cast<double>(size_));
    }

private:
    static int standardInput() { return fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, STDERR_FILENO + 1); }

    static int open(const std::string& path) {
        const bool isFolder = std::filesystem::is_directory(path);
        const int file = isFolder ? -1 : uninterrupted([&] { return ::open(path.c_str(), O_RDONLY | O_CLOEXEC); });
        if (file < 0)
            throw Failure(fmt::format("{}: the list of files cannot be opened: {}", path,
                                      isFolder ? "it is a folder" : std::strerror(errno)));
        return file;
    }

    /// Returns false after the last one.
    bool nextPiece(std::string& piece) {
        std::size_t end = bytes_.find(end_, begin_);
        while (end == std::string::npos) {
            const std::size_t searched = bytes_.size() - begin_;
            if (!readMore())
                break;
            end = bytes_.find(end_, searched);
        }
        if (end == std::string::npos && begin_ == bytes_.size())
            return false;
        piece = bytes_.substr(begin_, end == std::string::npos ? end : end - begin_);
        const std::size_t next = end == std::string::npos ? bytes_.size() : end + 1;
        read_ += next - begin_;
        begin_ = next;
        return true;
    }

    /// Moves what is left to the beginning. Returns false at the end of the list.
    bool readMore() {
        constexpr std::size_t most = 65536;
        bytes_.erase(0, begin_);
        begin_ = 0;
        if (isEnded_)
            return false;
        waitForBytes();
        const std::size_t before = bytes_.size();
        bytes_.resize(before + most);
        const ssize_t got = uninterrupted([&] { return read(file_.number(), bytes_.data() + before, most); });
        bytes_.resize(before + static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
        if (got < 0)
            throw Failure(fmt::format("{}: cannot be read: {}", name_, std::strerror(errno)));
        isEnded_ = got == 0;
        return !isEnded_;
    }

    void waitForBytes() const {
        constexpr int milliseconds = 100;
        pollfd end{file_.number(), POLLIN, 0};
        do
            NotedSignals::check();
        while (file_.isOpen() && poll(&end, 1, milliseconds) <= 0);
    }

    std::string name_;
    char end_;
    ZULMetaData::Descriptor file_;
    std::uint64_t size_ = 0;
    std::uint64_t read_ = 0;
    std::string bytes_;     ///< what was read
    std::size_t begin_ = 0; ///< the start of the next piece in it
    bool isEnded_ = false;  ///< a terminal could go on
};

FileNames::FileNames(const ManyFiles& files)
    : files_(files), list_(files.list.empty() ? nullptr : std::make_unique<List>(files.list, files.endsByZero)) {}

FileNames::~FileNames() = default;

bool FileNames::next(FileToDo& file) {
    file = {};
    if (taken_ < files_.named.size()) {
        file.path = files_.named[taken_++];
        file.share = list_ ? 0 : static_cast<double>(taken_) / static_cast<double>(files_.named.size());
        return true;
    }
    if (!list_ || !list_->next(file.path))
        return false;
    file.share = list_->share().value_or(0);
    return true;
}

namespace {

class OrderedWork;

/// The work on one file. What it prints is kept until all files before have ended, and goes straight on from then.
class FileJob final : public PrintTarget {
public:
    FileJob(OrderedWork& whole, FileToDo file, std::uint64_t index)
        : whole_(whole), file_(std::move(file)), index_(index) {}

    /// Throws `std::system_error` if standard output cannot be written.
    void print(Printed what, std::string_view bytes) override;

    void run(RunReport& whole, const FileWork& work);

    /// Passes on what is kept.
    void passOn();

    const FileToDo& file() const { return file_; }
    std::uint64_t index() const { return index_; }
    std::uint64_t bytes() const { return bytes_; }
    ExitCode code() const { return code_; }
    std::vector<ReportedError> takeErrors() { return std::move(errors_); }
    std::size_t kept() const { return kept_; }

    bool isEnded = false;  ///< guarded by the mutex of the whole
    bool isJoined = false; ///< an element of the document was begun

private:
    struct Piece {
        Printed what;
        std::string bytes;
    };

    OrderedWork& whole_;
    FileToDo file_;
    std::uint64_t index_;
    std::uint64_t bytes_ = 0;
    bool isItsTurn_ = false;
    std::vector<Piece> pieces_;
    std::size_t kept_ = 0;
    std::vector<ReportedError> errors_;
    ExitCode code_ = ExitFine;
};

/// Works on files with several threads, in a window that moves over their order.
class OrderedWork {
public:
    OrderedWork(FileNames& names, RunReport& report, const FileWork& work)
        : names_(names), report_(report), work_(work), code_(work.begin) {}

    ExitCode run(std::uint64_t jobs);

    /// Returns whether all files before have ended. If it must, it waits for that, because too much is kept.
    bool isTurnOf(const FileJob& job, std::size_t further);

    /// Prints a piece of the job whose turn it is.
    void emit(FileJob& job, Printed what, std::string_view bytes);

    /// Says how much less is kept.
    void forget(std::size_t bytes) { kept_ -= bytes; }

private:
    static constexpr std::uint64_t s_mostAhead = 256; ///< files that are begun before an earlier one has ended
    static constexpr std::size_t s_mostKept = std::size_t{32} << 20; ///< bytes that wait for their turn

    void workOn();
    FileJob* begin();
    void end(FileJob& job);
    void finish(FileJob& job);
    void stop(std::exception_ptr reason);

    FileNames& names_;
    RunReport& report_;
    const FileWork& work_;
    FileProgress progress_;

    std::mutex reading_; ///< held while a name is read, which can take long
    std::mutex mutex_;
    std::condition_variable changed_;
    std::deque<std::unique_ptr<FileJob>> jobs_; ///< those that are begun and not printed, in their order
    std::atomic<std::uint64_t> turn_ = 0;       ///< the index of the first of them
    std::atomic<std::size_t> kept_ = 0;
    std::atomic<bool> isStopped_ = false; ///< nothing is printed any more
    bool isEnough_ = false;
    std::uint64_t begun_ = 0;
    ExitCode code_;
    std::exception_ptr failedOutput_;
    std::exception_ptr failedList_;
};

void FileJob::print(Printed what, std::string_view bytes) {
    if (!isItsTurn_ && whole_.isTurnOf(*this, bytes.size())) {
        passOn();
        isItsTurn_ = true;
    }
    if (isItsTurn_)
        return whole_.emit(*this, what, bytes);
    if (pieces_.empty() || pieces_.back().what != what || what == Printed::Separator)
        pieces_.push_back({what, {}});
    pieces_.back().bytes += bytes;
    kept_ += bytes.size();
}

void FileJob::run(RunReport& whole, const FileWork& work) {
    const PrintsTo self(this);
    RunReport report(whole, file_.path);
    code_ = orComplaint([&] {
        if (file_.failure)
            std::rethrow_exception(file_.failure);
        return work.run(file_.path, report);
    });
    errors_ = report.endPart();
    std::error_code isNoFile;
    const auto size = std::filesystem::file_size(file_.path, isNoFile);
    bytes_ = isNoFile ? 0 : size;
}

void FileJob::passOn() {
    for (const Piece& piece : pieces_)
        whole_.emit(*this, piece.what, piece.bytes);
    whole_.forget(kept_);
    pieces_.clear();
    kept_ = 0;
}

/// Sends the lines that the library prints by itself the same way as all others while it lives.
class LibraryLines final : std::streambuf {
public:
    LibraryLines() : before_(std::cerr.rdbuf(this)) {}
    ~LibraryLines() override { std::cerr.rdbuf(before_); }
    LibraryLines(const LibraryLines&) = delete;
    LibraryLines& operator=(const LibraryLines&) = delete;

protected:
    std::streamsize xsputn(const char* bytes, std::streamsize count) override {
        writeError({bytes, static_cast<std::size_t>(count)});
        return count;
    }

    int_type overflow(int_type next) override {
        const char byte = traits_type::to_char_type(next);
        writeError({&byte, 1});
        return traits_type::not_eof(next);
    }

private:
    std::streambuf* before_;
};

ExitCode OrderedWork::run(std::uint64_t jobs) {
    const LibraryLines lines;
    std::vector<std::thread> threads;
    try {
        for (std::uint64_t i = 1; i < jobs; ++i)
            threads.emplace_back([this] { workOn(); });
    } catch (const std::system_error&) { // the threads that could be made do all of it
    }
    workOn();
    for (std::thread& thread : threads)
        thread.join();
    progress_.hide();
    if (failedOutput_)
        std::rethrow_exception(failedOutput_);
    if (!failedList_)
        return code_;
    return worseOf(code_, orComplaint([&]() -> ExitCode { std::rethrow_exception(failedList_); }));
}

bool OrderedWork::isTurnOf(const FileJob& job, std::size_t further) {
    if (turn_ == job.index() || isStopped_)
        return true;
    if (kept_.fetch_add(further) + further <= s_mostKept)
        return false;
    kept_ -= further;
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [&] { return turn_ == job.index() || isStopped_; });
    return true;
}

void OrderedWork::emit(FileJob& job, Printed what, std::string_view bytes) {
    if (isStopped_)
        return;
    const PrintsTo standardStreams(nullptr);
    progress_.hide();
    switch (what) {
    case Printed::Output: return writeOutput(bytes);
    case Printed::Separator: return writeSeparator(bytes);
    case Printed::Error: return writeError(bytes);
    case Printed::Document:
        if (!job.isJoined)
            report_.writer().joinElements();
        job.isJoined = true;
        return writeOutput(bytes);
    }
}

void OrderedWork::workOn() {
    try {
        while (FileJob* job = begin()) {
            job->run(report_, work_);
            end(*job);
        }
    } catch (...) { // standard output cannot be written
        stop(std::current_exception());
    }
}

/// Returns null if nothing is left to begin.
FileJob* OrderedWork::begin() {
    const std::lock_guard reading(reading_);
    {
        std::unique_lock lock(mutex_);
        changed_.wait(lock, [&] { return begun_ - turn_ < s_mostAhead || isStopped_; });
        if (isStopped_ || isEnough_ || failedList_)
            return nullptr;
    }
    FileToDo file;
    try {
        if (!names_.next(file))
            return nullptr;
    } catch (const Failure&) {
        const std::lock_guard lock(mutex_);
        failedList_ = std::current_exception();
        return nullptr;
    }
    const std::lock_guard lock(mutex_);
    return jobs_.emplace_back(std::make_unique<FileJob>(*this, std::move(file), begun_++)).get();
}

void OrderedWork::end(FileJob& job) {
    const std::lock_guard lock(mutex_);
    job.isEnded = true;
    isEnough_ |= work_.isEnough(job.code());
    while (!isStopped_ && !jobs_.empty() && jobs_.front()->isEnded) {
        finish(*jobs_.front());
        jobs_.pop_front();
        ++turn_; // from here on the next job prints by itself
    }
    changed_.notify_all();
}

void OrderedWork::finish(FileJob& job) {
    job.passOn();
    report_.addErrors(job.takeErrors());
    code_ = work_.combine(code_, job.code());
    progress_.advance(job.bytes(), job.file().share);
}

void OrderedWork::stop(std::exception_ptr reason) {
    const std::lock_guard lock(mutex_);
    if (!failedOutput_)
        failedOutput_ = std::move(reason);
    isStopped_ = true;
    changed_.notify_all();
}

} // namespace

ExitCode workOnFiles(FileNames& names, std::uint64_t jobs, RunReport& report, const FileWork& work) {
    const std::uint64_t processors = std::max(1U, std::thread::hardware_concurrency());
    return OrderedWork(names, report, work).run(jobs == 0 ? processors : jobs);
}

ExitCode workOnFiles(const ManyFiles& files, RunReport& report,
                     const std::function<ExitCode(const std::string& file, RunReport& report)>& run,
                     const std::function<bool(ExitCode)>& isEnough) {
    if (!files.areSeveral())
        return forEachFile(files.named, [&](const std::string& file) { return run(file, report); });
    FileNames names(files);
    return workOnFiles(names, files.jobs, report, {.run = run, .isEnough = isEnough});
}

Action reportingOnMany(const std::string& command, bool isWanted, const ManyFiles& files,
                       const std::function<ExitCode(RunReport& report)>& work, JsonWriter::Style style) {
    const std::string& first = files.named.empty() ? files.list : files.named.front();
    return reporting(command, isWanted, {first}, work, style);
}

} // namespace Zulm
