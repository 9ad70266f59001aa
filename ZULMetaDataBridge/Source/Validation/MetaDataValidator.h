#pragma once

// Walks every byte of the metadata of a file without trusting it, so that the file can be judged before anything else
// opens it: no size is trusted before it is checked against what is there, and no more memory is used than twice
// the file's size plus 16 MiB.
//
//     for (const Finding& finding : validateRecording("Recording.mp4").allFindings())
//         std::cerr << finding.offset << ": " << finding.sentence << '\n';

#include "../../../Platform/FileLocation.h"
#include "../../../SharedDependencies/Export.h"
#include "../../../ZULMetaData/ByteSource.h"
#include "../../../ZULMetaData/Containers/ContainerType.h"
#include "../../../ZULMetaData/ZULMMetaDataUUIDs.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData {

/// Damage: something is lost, cannot be reached, or contradicts itself. Notice: worth knowing, but all can be read.
enum class Severity { Damage, Notice };

/// What can be said of a file. `s_findingRules` tells what each of these means.
enum class FindingCode : std::size_t {
    TrailingBytes,
    OpenEndedAtom,
    SizeMarker,
    SizeBelowHeader,
    BeyondFile,
    BeyondParent,
    ZeroSizeChild,
    ZeroSizeChunk,
    MissingPad,
    ForeignChild,
    ShortDataHeader,
    SeveralMetaDataAtoms,
    ShortRecordingInfo,
    DuplicateStream,
    DroppedTail,
    UnreachableStream,
    ShortHeader,
    UnknownKind,
    BadVersion,
    NewerVersion,
    EntrySizeMismatch,
    TornEntry,
    ZeroEntrySize,
    EntryTooSmall,
    EntryBeyondEnd,
    ListCount,
    ListTotal,
    TooFewTexts,
    CursorSizes,
    CursorData,
    ImageBeyondEntry,
    LeftoverBytes,
    UndecodableImage,
    ImageNotDecoded,
    TimeNotFinite,
    TimeBackwards,
    NotUTF8,
    WideRIFF,
    BeyondDuration,
    CursorWithoutImage,
    AbsurdImage,
    ImageSurplus,
};

/// What a code is called wherever it is shown, how bad it is, and what it means.
struct FindingRule {
    FindingCode code;         ///< whose rule this is
    Severity severity;        ///< the same wherever it is found
    std::string_view name;    ///< such as "torn-entry"
    std::string_view meaning; ///< in a few words, whatever the file
};

/// By the numbers of their codes.
inline constexpr std::array<FindingRule, 42> s_findingRules{{
    {FindingCode::TrailingBytes, Severity::Damage, "trailing-bytes", "too few bytes for another atom or chunk"},
    {FindingCode::OpenEndedAtom, Severity::Damage, "open-ended-atom", "an atom without a size: nothing follows it"},
    {FindingCode::SizeMarker, Severity::Damage, "size-marker", "a 32-bit size that is neither a size nor the mark 1"},
    {FindingCode::SizeBelowHeader, Severity::Damage, "size-below-header", "an atom smaller than its own header"},
    {FindingCode::BeyondFile, Severity::Damage, "beyond-file", "an atom or chunk reaches beyond the file"},
    {FindingCode::BeyondParent, Severity::Damage, "beyond-parent", "a child reaches beyond its ZULM"},
    {FindingCode::ZeroSizeChild, Severity::Damage, "zero-size-child", "a child of size 0 hides all that follows it"},
    {FindingCode::ZeroSizeChunk, Severity::Damage, "zero-size-chunk", "a chunk of size 0 hides all that follows it"},
    {FindingCode::MissingPad, Severity::Notice, "missing-pad", "an odd chunk without its pad byte"},
    {FindingCode::ForeignChild, Severity::Damage, "foreign-child", "a child of ZULM that is not DATA"},
    {FindingCode::ShortDataHeader, Severity::Damage, "short-data-header", "readers lose a DATA atom's last 8 bytes"},
    {FindingCode::SeveralMetaDataAtoms, Severity::Notice, "several-metadata-atoms", "more than one ZULM"},
    {FindingCode::ShortRecordingInfo, Severity::Damage, "short-recording-info", "a ZULR atom without a whole record"},
    {FindingCode::DuplicateStream, Severity::Notice, "duplicate-stream",
     "a stream supersedes an earlier one of its kind"},
    {FindingCode::DroppedTail, Severity::Damage, "dropped-tail", "a DATA size counts bytes that were left out"},
    {FindingCode::UnreachableStream, Severity::Damage, "unreachable-stream", "a stream that no reader finds"},
    {FindingCode::ShortHeader, Severity::Damage, "short-header", "a stream shorter than its header"},
    {FindingCode::UnknownKind, Severity::Notice, "unknown-kind", "a stream of no registered kind"},
    {FindingCode::BadVersion, Severity::Damage, "bad-version", "a stream version below 1"},
    {FindingCode::NewerVersion, Severity::Notice, "newer-version", "a stream newer than this library"},
    {FindingCode::EntrySizeMismatch, Severity::Damage, "entry-size-mismatch", "a header whose entry size is wrong"},
    {FindingCode::TornEntry, Severity::Damage, "torn-entry", "a stream ends inside an entry"},
    {FindingCode::ZeroEntrySize, Severity::Damage, "zero-entry-size", "an entry of size 0"},
    {FindingCode::EntryTooSmall, Severity::Damage, "entry-too-small", "an entry smaller than its fixed part"},
    {FindingCode::EntryBeyondEnd, Severity::Damage, "entry-beyond-end", "an entry reaches beyond its stream"},
    {FindingCode::ListCount, Severity::Damage, "list-count", "a list counts more texts than it can hold"},
    {FindingCode::ListTotal, Severity::Damage, "list-total", "a list's total and its texts disagree"},
    {FindingCode::TooFewTexts, Severity::Damage, "too-few-texts", "a list lacks texts that its kind must have"},
    {FindingCode::CursorSizes, Severity::Damage, "cursor-sizes", "the two sizes of a cursor record disagree"},
    {FindingCode::CursorData, Severity::Damage, "cursor-data", "a cursor record too short for its fields"},
    {FindingCode::ImageBeyondEntry, Severity::Damage, "image-beyond-entry", "an image larger than its record"},
    {FindingCode::LeftoverBytes, Severity::Notice, "leftover-bytes", "a cursor record longer than its fields"},
    {FindingCode::UndecodableImage, Severity::Damage, "undecodable-image", "an image that does not decode"},
    {FindingCode::ImageNotDecoded, Severity::Notice, "image-not-decoded", "an image too large to decode"},
    {FindingCode::TimeNotFinite, Severity::Damage, "time-not-finite", "a time that is infinite or not a number"},
    {FindingCode::TimeBackwards, Severity::Notice, "time-backwards", "a time before that of an earlier entry"},
    {FindingCode::NotUTF8, Severity::Damage, "not-utf8", "a text that is not UTF-8"},
    {FindingCode::WideRIFF, Severity::Notice, "wide-riff", "readers of 32-bit RIFF files do not find the metadata"},
    {FindingCode::BeyondDuration, Severity::Notice, "beyond-duration", "entries after the end of the movie"},
    {FindingCode::CursorWithoutImage, Severity::Notice, "cursor-without-image",
     "a cursor that has had no image so far"},
    {FindingCode::AbsurdImage, Severity::Notice, "absurd-image", "an image far larger than any cursor"},
    {FindingCode::ImageSurplus, Severity::Notice, "image-surplus", "bytes after the end of an image"},
}};

static_assert(
    [] {
        for (std::size_t i = 0; i < s_findingRules.size(); ++i)
            if (s_findingRules[i].code != static_cast<FindingCode>(i))
                return false;
        return static_cast<std::size_t>(FindingCode::ImageSurplus) + 1 == s_findingRules.size();
    }(),
    "one rule for every code, in their order");

/// Every code has one.
constexpr const FindingRule& ruleOf(FindingCode code) {
    return s_findingRules[static_cast<std::size_t>(code)];
}

/// Something worth telling about a file, and where it stands.
struct Finding {
    FindingCode code;     ///< what was found
    std::string place;    ///< the stream's kind (its identifier if that has no name), or the type of the atom, in
                          ///< which bytes that cannot be printed are `\xNN`
    std::uint64_t offset; ///< in the file: of the atom, the entry, the header's field, the image or the bad character
    std::string sentence; ///< for people, with the numbers in question

    Severity severity() const { return ruleOf(code).severity; } ///< by the rule of its code
};

/// One stream, walked from its header to its end or to the first entry after which no other can be found.
struct ZULMETADATA_API StreamReport {
    uuid type{};                      ///< as its header says; all zero if that is cut short
    std::string kind;                 ///< its name in the registry; empty if it is not registered
    std::int32_t version = -1;        ///< of its entries, as its header says; -1 if that is cut short
    std::uint32_t fixedEntrySize = 0; ///< as its header says, right or wrong; 0 if each entry carries its size
    std::uint64_t offset = 0;         ///< of the header in the file
    std::uint64_t declaredBytes = 0;  ///< header included, as the container says
    std::uint64_t presentBytes = 0;   ///< of them, what lies inside the container
    std::uint64_t wholeEntries = 0;   ///< that are there from end to end and fit their own sizes
    std::uint64_t readableBytes = 0;  ///< header included, up to the first entry that does not: safe for every reader
    std::optional<double> firstTime;  ///< seconds, of the first entry with a finite time
    std::optional<double> lastTime;   ///< seconds, of the last entry with a finite time
    bool isReachable = true;          ///< whether readers find it
    std::vector<Finding> findings;    ///< inside this stream

    /// Its kind, or its identifier if that has no name.
    std::string name() const;

    /// As it is stored, unless it is cut short.
    MetaDataHeader header() const { return {type, version, fixedEntrySize}; }
};

/// What a file holds, and what is wrong with it.
struct ZULMETADATA_API ValidationReport {
    /// More of either severity are only counted, so that the report stays small whatever the file.
    static constexpr std::size_t s_maximumFindings = 1000;
    static constexpr std::size_t s_maximumStreams = 1000; ///< streams in the report; more are walked, but only counted

    Container::Type container = Container::Unknown; ///< as recognized, or as the caller said
    std::uint64_t bytes = 0;                        ///< in the file
    std::optional<double> duration;                 ///< of the movie in seconds, as `movieDuration` returns it
    std::uint64_t streamCount = 0;                  ///< `streams.size()`, or more if not all are listed
    std::uint64_t wholeEntries = 0;                 ///< of all streams
    std::uint64_t damageCount = 0;                  ///< findings, listed or not
    std::uint64_t noticeCount = 0;                  ///< findings, listed or not
    std::vector<StreamReport> streams;              ///< in the order of the file
    std::vector<Finding> findings;                  ///< of the container

    bool isDamaged() const { return damageCount > 0; }   ///< notices are no damage
    bool hasMetaData() const { return streamCount > 0; } ///< streams, whole or not
    bool hidesStreams() const;                           ///< readers may miss streams, because a ZULM is damaged
    std::vector<Finding> allFindings() const;            ///< in the order of their offsets
};

/// Takes the file for what `recognizeContainer` says. Findings of the ignored codes are neither listed nor counted.
/// Throws `std::system_error` if the file cannot be opened or read, and `std::runtime_error` if it can hold no
/// metadata.
///@{
ZULMETADATA_API ValidationReport validateRecording(const FileLocation& file, const std::set<FindingCode>& ignored = {});
ZULMETADATA_API ValidationReport validateRecording(const ByteSource& file, Container::Type type,
                                                   const std::set<FindingCode>& ignored = {});
///@}

} // namespace ZULMetaData
