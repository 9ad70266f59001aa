#pragma once

// Which pieces of a recording make an edited movie.
//
//     EditList edits;
//     edits.keep(10, {61, 3}, {3, 2}); // from 10 s to 61/3 s, one and a half times as fast
//     edits.hold({25, 2}, 2);          // the frame at 12.5 s for 2 s
//     std::cout << edits.json();

#include "../Platform/FileLocation.h"
#include "../SharedDependencies/Export.h"
#include "../ZULMetaData/ByteSource.h"
#include "Error.h"
#include "Rational.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData {

/// A piece of the source at a speed, or one frame of it that is held.
struct EditPiece {
    Rational start;    ///< in seconds of the source; for a held frame, the time of the frame
    Rational end;      ///< in seconds of the source; for a held frame the same as `start`
    Rational speed{1}; ///< source seconds for each edited second, above 0
    Rational duration; ///< in seconds of the edited movie, above 0

    bool isHeld() const { return start == end; } ///< returns whether this is a held frame
};

/// The times from `start` up to, but not including, `end`.
struct EditRange {
    Rational start; ///< in seconds
    Rational end;   ///< in seconds, after `start`
};

/// Reads a time as a person writes it: what `Rational::parse` reads, or a time code such as "1:30" or "0:01:02.5".
/// Returns nothing for any other text.
ZULMETADATA_API std::optional<Rational> parseEditTime(std::string_view text);

/// Reads two times with a '-' between them ("10-1:30"). Throws `Error` for any other text, and if the end is not after
/// the start.
ZULMETADATA_API EditRange parseEditRange(std::string_view text);

/// The forms in which edit lists are stored.
enum class EditListFormat : std::uint8_t {
    Recognized,    ///< what the contents are, and the name if they do not say it
    Own,           ///< the JSON that `EditList::json` returns
    Concat,        ///< a list for the concat demuxer of ffmpeg (`ffconcat version 1.0`)
    LosslessCut,   ///< a project of LosslessCut (.llc)
    CutTable,      ///< segments of LosslessCut as a table (.csv, .tsv)
    AutoEditor,    ///< a timeline of auto-editor, version 1, 2 or 3
    OpenTimeline,  ///< OpenTimelineIO JSON (.otio)
    CMX3600,       ///< an edit decision list (.edl)
    MovieEditList, ///< a movie with an edit list in its first video track
};

/// What a stored edit list may not say itself.
struct EditListOptions {
    EditListFormat format = EditListFormat::Recognized; ///< in what form it is stored
    std::optional<Rational> frameRate;                  ///< frames for each second, if the list counts frames
    std::optional<Rational> duration; ///< length of the source in seconds, for pieces that last until its end
};

/// Pieces that follow one another on the edited time line. In the source they may repeat, overlap, and come in any
/// order.
class ZULMETADATA_API EditList {
public:
    static constexpr std::uint64_t s_largestFile = 64
                                                   << 20; ///< bytes of a text that `open` reads; movies may be larger

    /// Adds [start, end) at a speed. Throws `Error` and adds nothing if a time is negative, `end` is not after `start`,
    /// or the speed is not above 0; also if a number or the length of the edited movie is too large for a double, if a
    /// number has more than 1,000 digits, or if the length cannot be written with 65,536 binary digits above and below
    /// the line.
    void keep(const Rational& start, const Rational& end, const Rational& speed = 1);

    /// Adds "A-B" or "A-B@SPEED": a range as `parseEditRange` reads it, and a speed as `Rational::parse` does. Throws
    /// `Error` for any other text.
    void keep(std::string_view text);

    /// Adds the frame at `at` for `duration`. Throws `Error` and adds nothing if `at` is negative or `duration` is not
    /// above 0, and for numbers that are too long.
    void hold(const Rational& at, const Rational& duration);

    const std::vector<EditPiece>& pieces() const { return pieces_; } ///< returns the pieces in the edited order
    const Rational& duration() const { return duration_; }           ///< returns the length of the edited movie

    /// Returns where each piece begins on the edited time line, in seconds.
    const std::vector<Rational>& bases() const { return bases_; }

    /// Returns a JSON document with the exact numbers, which `read` reads back. It ends with a line feed.
    std::string json() const;

    /// Reads a JSON document as `json` returns it. Throws `Error` that names `file` and the number of the piece,
    /// counted from 1, for anything else.
    static EditList read(std::string_view json, const std::string& file);

    /// Returns what is left of a source of this duration without these ranges, which may overlap. Throws `Error` if a
    /// range does not end after its start.
    static EditList without(std::vector<EditRange> removed, const Rational& duration);

    /// Reads an edit list of any form. Throws `Error` that names the file if it cannot be read, if it is in no known
    /// form, or if it says something that no edit list can say.
    static EditList open(const FileLocation& file, const EditListOptions& options = {});

    /// The same for bytes of the caller. Errors call them `name`.
    static EditList open(const ByteSource& bytes, const std::string& name, const EditListOptions& options = {});

private:
    void add(EditPiece piece);

    std::vector<EditPiece> pieces_;
    std::vector<Rational> bases_;
    Rational duration_;
    std::size_t storedBits_ = 0; ///< of all bases
};

} // namespace ZULMetaData
