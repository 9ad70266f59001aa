#pragma once

// Records everything that a recorder observes: one object writes the streams of all kinds into one folder.
//
//     SessionWriter session("Talk.mp4.recording");
//     session.write<RecordingRegionKind>(Rect(0, 0, 1920, 1080));
//     session.write<CursorLocationKind>(0.25, {640, 360});
//     session.write<TopmostAppNameKind>(0.25, "Editor");
//     session.saveInto("Talk.mp4", "Recorder", "4.2");

#include "../Platform/FileLocation.h"
#include "../Platform/ProcessInfo.h"
#include "../SharedDependencies/Callback.h"
#include "../SharedDependencies/Export.h"
#include "../ZULMetaDataBridge/Source/ApplicationValues.h"
#include "../ZULMetaDataBridge/Source/MetaDataKinds.h"
#include "../ZULMetaDataBridge/Source/MetaDataWriters/SystemDataMetaDataWriter.h"
#include "../ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "../ZULMetaDataBridge/Source/StreamSource.h"
#include "AbandonedSession.h"
#include "Error.h"
#include "Track.h"
#include "TrackValues.h"

#include <chrono>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <list>
#include <memory>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

namespace ZULMetaData {

namespace detail {

/// Whether an application may write a `Value` where the stream stores a `Stored`.
template <class Value, class Stored>
inline constexpr bool isWrittenAs = false;
template <>
inline constexpr bool isWrittenAs<ScreenPoint, Point> = true;
template <>
inline constexpr bool isWrittenAs<ScreenRect, Rect> = true;
template <>
inline constexpr bool isWrittenAs<ProcessInfo, std::list<std::string>> = true;
template <class Value>
requires std::convertible_to<const Value&, std::string_view>
inline constexpr bool isWrittenAs<Value, std::string> = true;

} // namespace detail

/// A value that can be written as an entry of a kind: what a track of the kind holds, or what its stream stores. Points
/// and rectangles may have fractions, which are cut off; a text may be anything that is a `std::string_view`; system
/// data may be a `ProcessInfo`.
template <class Value, class Kind>
concept SessionValue = RecordedKind<Kind> &&
    (OneOf<Value, typename Kind::Value, TrackValueOf<Kind>> || detail::isWrittenAs<Value, typename Kind::Value>);

/// How a session is recorded.
struct SessionOptions {
    /// How long an entry may stay in memory while others follow it. 0 hands every entry to the system at once.
    std::chrono::nanoseconds flushInterval = std::chrono::milliseconds(500);

    /// Called once, on the caller's thread, when the first entry was lost. It may use the session, but not destroy it.
    /// What it throws passes through the function that lost the entry.
    Callback<void(const Error& loss)> onLoss = {};

    /// The clock by which the interval is measured, counted from any time. It never goes backward. If it is empty, the
    /// system's monotonic clock is read at the precision of its ticks, which are some milliseconds apart. A session
    /// reads the clock for every entry, but only for every eighth after 4,096 entries in a row at the same time.
    Callback<std::chrono::nanoseconds()> clock = {};
};

/// Writes the streams of a session. A stream file is called KIND.dat, such as "cursorLocation.dat", and is created with
/// its first entry: the folder holds what was observed and nothing else. One thread at a time may use a session.
///
/// Entries are handed to the operating system once `flushInterval` has passed, on the thread of whoever writes next, so
/// a process that is killed loses the entries of the last interval at most. Call `flushIfDue` now and then if a long
/// time may pass without an entry.
///
/// A session owns its folder. The file "session.lock" in it is locked as long as the process lives, and tells others
/// that the folder is in use. What people type and read is private: only the owner may enter a folder that a session
/// creates, and read the stream files.
class ZULMETADATA_API SessionWriter {
public:
    /// Creates the folder if it does not exist; the folder above it must. Throws `Error` if the folder cannot be used,
    /// or holds a session or a stream file already. Nothing is ever overwritten.
    explicit SessionWriter(const FileLocation& folder, SessionOptions options = {});

    SessionWriter(SessionWriter&&) noexcept;            ///< the other object can only be destroyed or assigned to
    SessionWriter& operator=(SessionWriter&&) noexcept; ///< destroys what this object was
    ~SessionWriter();                                   ///< closes the files; see `finish`

    /// Writes an entry at a time in seconds since the start of the recording. Does not throw if that fails: the entry
    /// is lost, see `isHealthy`. A time that is not finite loses the entry.
    ///
    /// The recording region, the scale factor and the system data are written once, at time 0, and reach the system at
    /// once; further entries of them are ignored. A `CursorAppearance` stores its picture, unless the picture that was
    /// written last with the same identifier is equal. A `CursorImage` stores what it holds.
    template <RecordedKind Kind, SessionValue<Kind> Value = TrackValueOf<Kind>>
    void write(double seconds, const Value& value);

    /// Writes the recording region, the scale factor or the system data.
    template <RecordedKind Kind, SessionValue<Kind> Value = TrackValueOf<Kind>>
    requires(Kind::role == StreamRole::Once) void write(const Value& value);

    void flush();      ///< hands all entries to the operating system
    void flushIfDue(); ///< does so if the interval has passed, and costs next to nothing otherwise

    /// Flushes and closes the files. Entries that are written afterwards are lost. A session that is destroyed without
    /// this, or after a failed `saveInto`, is abandoned.
    void finish();

    /// Finishes the session, attaches its streams to a movie and stamps it; see `SafeMovieSave`. If anything fails, it
    /// leaves the movie as it was and throws `Error`, and can be called again. A session without entries only stamps
    /// the movie. The stream files stay where they are.
    AttachResult saveInto(const FileLocation& movie, const std::string& creatorName = {},
                          const std::string& creatorVersion = {},
                          SafeMovieSave::FragmentIndex index = SafeMovieSave::FragmentIndex::Leave);

    /// Finishes the session and removes its files, and the folder if nothing else is in it. Throws `Error` if a file
    /// cannot be removed.
    void removeFiles();

    /// Returns false after an entry was lost: a file could not be written, a time was not finite, or the session was
    /// finished. If a file could not be written, what it holds stays whole, and the later entries of its kind are lost.
    bool isHealthy() const { return !loss(); }
    const Error* loss() const; ///< returns why the first entry was lost, or null

    /// Returns the number of entries that were accepted. If a file failed, some of them may be lost with it.
    std::uint64_t entriesWritten(const uuid& kind) const;

    const FileLocation& folder() const; ///< returns the folder as the constructor took it

    /// Returns the streams with at least one whole entry, for use with `SafeMovieSave`. Call `finish` before. Throws
    /// `Error` if a file cannot be read.
    std::vector<StreamSource> sources() const;

    /// Returns the sessions in `folder` itself and in the folders in it that were abandoned: their process ended, or
    /// destroyed them, before they were finished or saved. Sessions of living processes are not among them, including
    /// this one. On a file system without locks nobody can tell, and nothing is returned. Throws `Error` if `folder` or
    /// a stream file cannot be read.
    static std::vector<AbandonedSession> abandoned(const FileLocation& folder);

private:
    void append(std::size_t kind, double seconds, Point value);
    void append(std::size_t kind, double seconds, Rect value);
    void append(std::size_t kind, double seconds, KeyStroke value);
    void append(std::size_t kind, double seconds, std::int32_t value);
    void append(std::size_t kind, double seconds, float value);
    void append(std::size_t kind, double seconds, double value);
    void append(std::size_t kind, double seconds, std::string_view value);
    void append(std::size_t kind, double seconds, const CursorImage& value);
    void append(std::size_t kind, double seconds, const CursorAppearance& value);
    void appendOnce(std::size_t kind, const Rect& value);
    void appendOnce(std::size_t kind, std::int32_t value);
    void appendOnce(std::size_t kind, const std::list<std::string>& value);

    struct State;
    std::unique_ptr<State> state_;
};

// ---------------------------------------------------------------------------------------------------------------

namespace detail {

/// Return what a session stores for a value.
///@{
template <class Value>
const Value& storedValue(const Value& value) {
    return value;
}
inline Point storedValue(const ScreenPoint& point) {
    return truncated(point);
}
inline Rect storedValue(const ScreenRect& rect) {
    return truncated(rect);
}
inline std::int32_t storedValue(const ButtonAction& action) {
    return action.stored;
}
inline KeyStroke storedValue(const KeyInput& key) {
    return key.stored;
}
inline std::list<std::string> storedValue(const SystemData& machine) {
    return {machine.processorCount, machine.activeProcessorCount, machine.osVersion, machine.ram};
}
inline std::list<std::string> storedValue(const ProcessInfo& machine) {
    return SystemDataMetaDataWriter::systemTexts(machine);
}
///@}

} // namespace detail

template <RecordedKind Kind, SessionValue<Kind> Value>
void SessionWriter::write(double seconds, const Value& value) {
    constexpr std::size_t kind = detail::TracksOf<RecordedKinds>::placeOf<Kind>();
    if constexpr (Kind::role == StreamRole::Once)
        appendOnce(kind, detail::storedValue(value));
    else
        append(kind, seconds, detail::storedValue(value));
}

template <RecordedKind Kind, SessionValue<Kind> Value>
requires(Kind::role == StreamRole::Once) void SessionWriter::write(const Value& value) {
    write<Kind>(0, value);
}

} // namespace ZULMetaData
