#pragma once

// What the commands that change a movie share: whether they change it in place or a copy of it, the repair that comes
// first, and how all of it is said.

#include "Tools/zulm/Command.h"
#include "Tools/zulm/OutOfMemory.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"

#include <nlohmann/json.hpp>

#include <memory>
#include <string>
#include <vector>

namespace Zulm {

class OutputFile;

struct SaveOptions {
    std::string movie;
    std::string output;
    bool force = false;
    bool inPlace = false;
};

/// Adds MOVIE, -o, --force and --in-place.
void addSaveOptions(CLI::App& command, SaveOptions& options);

/// Adds -o, --force and --in-place for what the help calls `subject`.
void addDestinationOptions(CLI::App& command, SaveOptions& options, const std::string& subject);

/// Throws the usage error where it is left open which file is written.
void requireDestination(const SaveOptions& options);

/// The movie that a command works on: a copy that is put in its place when all is done, or the movie itself. While the
/// movie itself is changed, a signal undoes that before it ends the program.
class SaveTarget {
public:
    /// Throws `Failure` for what is no movie or cannot be repaired, and where the output is one of the inputs.
    SaveTarget(const SaveOptions& options, const std::vector<std::string>& otherInputs);
    ~SaveTarget();
    SaveTarget(const SaveTarget&) = delete;
    SaveTarget& operator=(const SaveTarget&) = delete;

    /// The file that the result is in.
    const std::string& name() const { return name_; }

    /// The movie as it is before anything is changed or copied, opened once.
    const ZULMetaData::ByteSource& movie() const { return movie_; }

    /// Returns what `plan` makes of the movie, before anything is copied. Throws `Failure` instead of `SaveError`.
    template <class Plan>
    auto planned(Plan plan) const {
        try {
            return plan(movie_, path_);
        } catch (const ZULMetaData::SaveError& error) {
            fail(error);
        }
    }

    /// Returns what `work` makes of the `SafeMovieSave` of the movie or its copy, and puts the copy in place. Throws
    /// `Failure`. Once only.
    template <class Work>
    auto save(const std::string& what, Work work) {
        try {
            makeCopy();
            catchSignals();
            const MemoryRunsOutByException undoing;
            auto result = work(ZULMetaData::SafeMovieSave(path_, progress(what)));
            commit();
            return result;
        } catch (const ZULMetaData::SaveError& error) {
            fail(error);
        } catch (const Interruption& interruption) {
            endBy(interruption);
        }
    }

private:
    struct Interruption {
        int signal;
    };

    ZULMetaData::SafeMovieSave::Progress progress(const std::string& what) const;
    void makeCopy();
    void catchSignals() const;
    void commit();
    [[noreturn]] void fail(const ZULMetaData::SaveError& error) const;
    [[noreturn]] void endBy(const Interruption& interruption) const;

    std::string name_;
    std::string subject_; ///< what messages call it
    std::string path_;    ///< of the movie, then of what is written to
    ZULMetaData::ByteSource movie_;
    std::unique_ptr<OutputFile> copy_;
};

/// Adds --move-mfra.
void addFragmentIndexOption(CLI::App& command, ZULMetaData::SafeMovieSave::FragmentIndex& index);

/// "none", "not-at-end" or "at-end".
std::string fragmentIndexText(ZULMetaData::FragmentIndexState state);

/// Warns if players no longer find the index of the fragments of the movie `name`.
void warnOfFragmentIndex(const std::string& name, ZULMetaData::FragmentIndexState state);

/// "PATH: the atom ... has an open end; ...", with what to run next.
std::string unrepairableText(const std::string& path, const ZULMetaData::RepairPlan& plan);

/// What a repair changes, or has changed: one line for the finding and one for every change.
void printRepair(const std::string& path, const ZULMetaData::RepairPlan& plan);
nlohmann::ordered_json repairDocument(const ZULMetaData::RepairPlan& plan);

/// Complains if an interrupted append lost something. Returns the exit code.
ExitCode complainAboutLoss(const std::string& path, const ZULMetaData::RepairPlan& plan);

} // namespace Zulm
