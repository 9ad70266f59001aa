#pragma once

// How the times of streams fit the movie that they are attached to.

#include "Tools/zulm/Command.h"
#include "ZULMetaDataBridge/Source/StreamRetiming.h"
#include "ZULMetaDataBridge/Source/StreamSource.h"

#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace Zulm {

class TemporaryFile;

struct TimeOptions {
    std::optional<double> shift; ///< seconds
    bool trims = false;

    bool changesTimes() const { return trims || shift; }
};

/// Adds --shift and --trim.
void addTimeOptions(CLI::App& command, TimeOptions& options);

/// Copies of streams with the times that the options ask for, kept in a temporary file as long as this lives.
class RetimedSources {
public:
    /// `folder` takes the temporary file. `duration` is that of the movie in seconds, if it is known; trimming throws
    /// `Failure` without it. So does a stream whose times nobody here can tell.
    RetimedSources(const std::vector<ZULMetaData::StreamSource>& originals, const TimeOptions& options,
                   std::optional<double> duration, const std::string& folder);
    ~RetimedSources();
    RetimedSources(const RetimedSources&) = delete;
    RetimedSources& operator=(const RetimedSources&) = delete;

    /// Without the streams that trimming left no entry of.
    const std::vector<ZULMetaData::StreamSource>& sources() const { return sources_; }

    std::uint64_t entriesRemoved() const { return entriesRemoved_; }

    /// Complains about entries that were incomplete in their original. Returns how the command ends.
    ExitCode complainAboutCuts() const;

private:
    std::unique_ptr<TemporaryFile> file_;
    std::vector<ZULMetaData::StreamSource> sources_;
    std::vector<std::string> cuts_; ///< a message each
    std::uint64_t entriesRemoved_ = 0;
};

/// Warns if entries lie before the beginning or after the end of the movie `name`. Returns how many lie after it.
std::uint64_t warnOfTimesOutside(const std::string& name, std::optional<double> duration,
                                 const std::vector<ZULMetaData::StreamSource>& sources);

} // namespace Zulm
