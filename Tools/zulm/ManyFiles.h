#pragma once

// What the commands share that work on very many files: which files, several of them at once, and what they print in
// the order of the files.

#include "Tools/zulm/RunReport.h"

#include <CLI/CLI.hpp>

#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace Zulm {

/// What the command line says about the files.
struct ManyFiles {
    std::vector<std::string> named;
    std::string list;        ///< a file that names more, "-" for standard input; empty if there is none
    bool endsByZero = false; ///< a name in the list ends with a zero byte, not with the line
    std::uint64_t jobs = 1;  ///< files that are worked on at once; 0 for one on each processor

    bool areSeveral() const { return named.size() > 1 || !list.empty(); }
};

/// Adds FILE, --files-from, --null and --jobs. The callback of the command calls `requireFiles`.
void addManyFiles(CLI::App& command, ManyFiles& files, const std::string& description);

/// Throws `CLI::ParseError` if no file is named, or if standard input is to be a file and the list of files.
void requireFiles(const ManyFiles& files);

/// A file that is to be worked on.
struct FileToDo {
    std::string path;
    std::exception_ptr failure{}; ///< why it cannot be worked on: a folder that cannot be read
    double share = 1;             ///< how much of all that is named ends with it, from 0 to 1
};

/// The files in their order, one by one, so that a long list takes no memory.
class FileNames {
public:
    /// Throws `Failure` if the list cannot be opened.
    explicit FileNames(const ManyFiles& files);
    virtual ~FileNames();
    FileNames(const FileNames&) = delete;
    FileNames& operator=(const FileNames&) = delete;

    /// Returns false after the last one. Throws `Failure` if the list cannot be read on.
    virtual bool next(FileToDo& file);

private:
    class List;

    const ManyFiles& files_;
    std::size_t taken_ = 0;
    std::unique_ptr<List> list_;
};

/// What is done with every file, and how it ends.
struct FileWork {
    /// Runs in a thread of its own if there are several jobs. What it prints, reports and complains of appears in the
    /// order of the files.
    std::function<ExitCode(const std::string& file, RunReport& report)> run;

    std::function<ExitCode(ExitCode, ExitCode)> combine = worseOf;
    ExitCode begin = ExitFine; ///< what the end of the first file is combined with

    /// Whether the end of a file tells all that is asked for, so that no further file is begun.
    std::function<bool(ExitCode)> isEnough = [](ExitCode) { return false; };
};

/// Works on all files, whatever happens to one of them, and returns their combined ends. Memory grows neither with the
/// number of files nor with what they print: a file that prints much waits until it is its turn.
ExitCode workOnFiles(FileNames& names, std::uint64_t jobs, RunReport& report, const FileWork& work);

/// The same for the files of the command line. A single file is worked on in this thread, with a progress of its own.
ExitCode workOnFiles(
    const ManyFiles& files, RunReport& report,
    const std::function<ExitCode(const std::string& file, RunReport& report)>& run,
    const std::function<bool(ExitCode)>& isEnough = [](ExitCode) { return false; });

/// Returns an action that runs `work` on the files as `reporting` does.
Action reportingOnMany(const std::string& command, bool isWanted, const ManyFiles& files,
                       const std::function<ExitCode(RunReport& report)>& work,
                       JsonWriter::Style style = JsonWriter::Style::Indented);

} // namespace Zulm
