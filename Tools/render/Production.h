#pragma once

// Everything that the frames of a film are drawn from, opened once.

#include "Tools/render/Composer.h"
#include "Tools/render/Options.h"
#include "Tools/render/Redactions.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/InputFile.h"

#include <memory>
#include <string>
#include <vector>

namespace Zulm {
class TemporaryFile;
}

namespace Render {

class Production {
public:
    /// Opens a recording, and its pictures if it has streams; without them nothing else may be called. Throws
    /// `Zulm::Failure` and `ZULMetaData::Error`.
    explicit Production(const SourceOptions& options);
    ~Production();
    Production(const Production&) = delete;
    Production& operator=(const Production&) = delete;

    /// The recording as it is, whatever is covered in the film.
    const ZULMetaData::Recording& recording() const { return recording_; }
    /// The recording without what is covered.
    const ZULMetaData::Recording& shown() const { return redacted_ ? *redacted_ : recording_; }

    const std::string& path() const { return input_.path(); } ///< of the movie
    double duration() const;                                  ///< of the recording, in seconds

    /// Returns an edit list of the whole recording, or of what is not idle.
    ///@{
    ZULMetaData::EditList whole() const;
    ZULMetaData::EditList withoutIdle(double least, double rest) const;
    ///@}

    /// Prepares the film of an edit list. `zoom` is what the option says. `largestWidth` limits the size that the movie
    /// has by itself.
    void prepare(const ZULMetaData::EditList& edits, const std::string& zoom, int largestWidth);

    const FilmSize& size() const { return stage_->film(); }
    const Stage& stage() const { return *stage_; }
    const Style& style() const { return style_; }
    FilmSession& session() { return *session_; }
    Composer& composer() { return *composer_; }
    PictureReader& pictures() { return *pictures_; }

    /// Returns the streams of the film, to be attached to it. The recorded region is that which all of the film shows
    /// while the camera is at rest.
    Zulm::RetimedStreams& streams();

    /// Warns of streams that nobody knows, and complains about what of the recording is not in the film. Call it when
    /// the film is done. Returns how the command ends.
    Zulm::ExitCode complain() const;

private:
    FilmSize sizeFor(int largestWidth) const;
    void redact();
    ZULMetaData::Rect shownRegion() const;

    SourceOptions options_;
    Style style_;
    Zulm::InputFile input_;
    ZULMetaData::Recording recording_;
    std::unique_ptr<Zulm::TemporaryFile> redactedFile_;
    std::unique_ptr<ZULMetaData::Recording> redacted_; ///< null if nothing is covered
    Redactions redactions_;
    std::vector<std::string> losses_;         ///< by covering
    std::unique_ptr<PictureReader> pictures_; ///< null if there is no stream
    std::unique_ptr<Stage> stage_;
    std::unique_ptr<FilmSession> session_;
    std::unique_ptr<Composer> composer_;
};

} // namespace Render
