#pragma once

// The streams of a recording for an edited movie, kept in a temporary file until they are attached.

#include "Tools/zulm/Command.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "ZULMetaDataSession/Retiming.h"

#include <nlohmann/json.hpp>

#include <list>
#include <memory>
#include <string>
#include <vector>

namespace Zulm {

class TemporaryFile;

/// Complains that a recording has no stream. Returns how the command ends.
ExitCode complainAboutNoStreams(const ZULMetaData::Recording& recording);

class RetimedStreams {
public:
    /// `folder` takes the temporary file. Throws `Failure` if that cannot be written, and `ZULMetaData::Error` if the
    /// recording cannot be read.
    RetimedStreams(const ZULMetaData::Recording& recording, const ZULMetaData::EditList& edits,
                   const std::string& folder);
    ~RetimedStreams();
    RetimedStreams(const RetimedStreams&) = delete;
    RetimedStreams& operator=(const RetimedStreams&) = delete;

    const ZULMetaData::EditedRecording& edited() const { return edited_; }

    /// Takes these bytes, header included, as the stream of a kind, whether or not the recording has one.
    void replace(const ZULMetaData::uuid& kind, std::string bytes);

    /// What is attached.
    std::vector<ZULMetaData::StreamSource> sources() const;

    /// Attaches the streams to a movie that is called `name` in messages. Does nothing to it if there are none. Throws
    /// `Failure`.
    ZULMetaData::AttachResult
    attachTo(const std::string& movie, const std::string& name,
             ZULMetaData::SafeMovieSave::FragmentIndex index = ZULMetaData::SafeMovieSave::FragmentIndex::Leave) const;

    /// Warns of streams that nobody knows, and complains about what was lost. Returns how the command ends.
    ExitCode complain() const;

    /// One line for each stream.
    void print(const ZULMetaData::AttachResult& attached) const;

    /// One object for each stream.
    nlohmann::ordered_json documents(const ZULMetaData::AttachResult& attached) const;

private:
    std::string name_; ///< of the recording
    std::unique_ptr<TemporaryFile> file_;
    ZULMetaData::EditedRecording edited_;
    std::list<std::string> replacements_; ///< which stay where they are
};

/// Warns if a movie's length is not that of the edits.
void warnOfOtherLength(const std::string& movie, std::optional<double> duration, const ZULMetaData::EditList& edits);

} // namespace Zulm
