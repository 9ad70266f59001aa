#include "ZULMetaDataSession/SessionWriter.h"

#include "Platform/CoarseClock.h"
#include "Platform/FileSystem.h"
#include "Platform/LockFile.h"
#include "Platform/NewFile.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataSession/OrError.h"
#include "ZULMetaDataSession/SessionFolder.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <filesystem>
#include <limits>
#include <map>
#include <optional>
#include <ostream>
#include <type_traits>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr auto s_lockNote = "A session is recorded into this folder as long as this file is locked.\n";

/// The largest text or picture: sizes of entries have 32 bits, and no entry has more than 64 bytes beside it.
constexpr std::uint64_t s_largestValue = std::numeric_limits<std::uint32_t>::max() - std::uint64_t{64};

/// A burst is so many readings of the clock in a row that all return the same time. In a burst the clock is not read
/// for some entries after each reading. No recorder is that fast, but a program that copies a recording is.
constexpr std::uint32_t s_readingsOfABurst = 4096;
constexpr std::uint32_t s_unwatchedOfABurst = 7;

/// How values are passed: those of a fixed size in registers, since what was just put into memory in parts is slow to
/// read as a whole.
template <class Value>
using Passed = std::conditional_t<FixedSizeValue<Value>, Value, const Value&>;

/// Lends the bytes of a picture to a cursor image, which would free them otherwise.
class LentPicture {
public:
    LentPicture(const CursorAppearance& appearance, const CursorPicture* picture) {
        image_.uniqueId = appearance.id;
        image_.flags = static_cast<CursorImage::CursorImageFlags>(appearance.flags);
        if (!picture || picture->bytes.empty())
            return;
        image_.hotspotOffsetX = picture->hotSpot.x;
        image_.hotspotOffsetY = picture->hotSpot.y;
        image_.cursorTypeId = picture->systemCursor;
        image_.imageDataSize = static_cast<std::uint32_t>(picture->bytes.size());
        image_.imageData = const_cast<unsigned char*>(picture->bytes.data());
    }
    LentPicture(const LentPicture&) = delete;
    LentPicture& operator=(const LentPicture&) = delete;
    ~LentPicture() { image_.freeImageData(false); }

    const CursorImage& image() const { return image_; }

private:
    CursorImage image_;
};

} // namespace

struct SessionWriter::State {
    /// The first entry creates a stream that is absent. An open stream takes entries, a closed or failed one takes
    /// none.
    enum class Stage : std::uint8_t { Absent, Open, Closed, Failed };

    struct StreamSlot {
        Stage stage = Stage::Absent;
        std::uint64_t entries = 0;
        std::unique_ptr<NewFile> file;
        std::ostream stream{nullptr};
    };

    State(const FileLocation& sessionFolder, SessionOptions sessionOptions);
    State(const State&) = delete;
    State& operator=(const State&) = delete;
    ~State();
    void own();

    template <class Value>
    bool append(std::size_t kind, double seconds, Passed<Value> value);
    template <class Value>
    void appendOnce(std::size_t kind, const Value& value);
    bool fits(std::size_t kind, std::uint64_t size);
    bool isReady(std::size_t kind, double seconds);
    void create(std::size_t kind);

    std::chrono::nanoseconds now() const { return options.clock ? options.clock() : CoarseClock::now(); }
    void flushIfDue();
    void flush(std::chrono::nanoseconds time);
    void close(std::size_t kind);
    void finish();

    void lose(std::size_t kind, const std::string& sentence);
    void fail(std::size_t kind, const std::string& reason);
    void reportLoss();

    FileLocation folder;
    SessionOptions options;
    std::chrono::nanoseconds flushAfter; ///< the interval, less what the clock may be late
    std::chrono::nanoseconds flushDue = std::chrono::nanoseconds::min();
    std::chrono::nanoseconds lastReading = std::chrono::nanoseconds::min();
    std::uint32_t equalReadings = 0;
    std::uint32_t unwatched = 0; ///< the number of entries for which the clock need not be read
    std::array<StreamSlot, RecordedKinds::size> streams;
    std::optional<LockFile> lock;
    std::map<std::uint64_t, std::shared_ptr<const CursorPicture>> pictures; ///< last written, by identifier
    std::string text;                                                       ///< the last one; its memory is used again
    std::optional<Error> loss;
    bool isLossReported = false;
    bool isFinished = false;
    bool isUnsaved = false; ///< a save began and did not end, so others should find the session
};

SessionWriter::State::State(const FileLocation& sessionFolder, SessionOptions sessionOptions)
    : folder(sessionFolder), options(std::move(sessionOptions)), flushAfter(options.flushInterval) {
    if (!options.clock)
        flushAfter -= CoarseClock::resolution();
    flushAfter = std::max(flushAfter, std::chrono::nanoseconds(0));
    const bool isNew = detail::orError(utf8Path(folder), [this] { return createPrivateFolder(folder); });
    try {
        own();
    } catch (const Error&) {
        std::error_code isStillThere;
        if (isNew)
            std::filesystem::remove(folder, isStillThere);
        throw;
    }
}

void SessionWriter::State::own() {
    detail::requireFree(folder);
    const FileLocation lockFile = detail::lockFileIn(folder);
    detail::orError(utf8Path(lockFile), [&] { lock.emplace(lockFile, s_lockNote); });
}

SessionWriter::State::~State() {
    const bool isOver = isFinished && !isUnsaved;
    try {
        finish();
    } catch (...) { // of `onLoss`, which cannot stop anything any more
        isLossReported = true;
    }
    if (lock && isOver)
        lock->remove();
}

// ---- Entries ----------------------------------------------------------------------------------------------------

/// Returns whether the entry was accepted.
template <class Value>
bool SessionWriter::State::append(std::size_t kind, double seconds, Passed<Value> value) {
    StreamSlot& slot = streams[kind];
    if (slot.stage != Stage::Open || !std::isfinite(seconds)) [[unlikely]]
        if (!isReady(kind, seconds))
            return false;
    metaDataWrite<Value>(seconds, value, slot.stream, CursorImageKind::version); // other kinds have no versions
    if (!slot.stream.good()) [[unlikely]] {
        fail(kind, slot.file->failure());
        reportLoss();
        return false;
    }
    ++slot.entries;
    if (unwatched > 0)
        --unwatched;
    else
        flushIfDue();
    return true;
}

template <class Value>
void SessionWriter::State::appendOnce(std::size_t kind, const Value& value) {
    if (streams[kind].stage == Stage::Closed || !append<Value>(kind, 0, value))
        return;
    close(kind);
    reportLoss();
}

/// Returns false if the entry is lost because its size has no place on disk.
bool SessionWriter::State::fits(std::size_t kind, std::uint64_t size) {
    if (size <= s_largestValue)
        return true;
    lose(kind, "an entry of 4 GiB or more cannot be recorded");
    reportLoss();
    return false;
}

/// Creates a stream that does not exist. Returns false if the entry is lost.
bool SessionWriter::State::isReady(std::size_t kind, double seconds) {
    StreamSlot& slot = streams[kind];
    if (isFinished)
        lose(kind, "is finished, so that no entry can be recorded any more");
    else if (!std::isfinite(seconds))
        lose(kind, "an entry at a time that is not finite cannot be recorded");
    else if (slot.stage == Stage::Absent)
        create(kind);
    reportLoss();
    return slot.stage == Stage::Open && std::isfinite(seconds);
}

void SessionWriter::State::create(std::size_t kind) {
    StreamSlot& slot = streams[kind];
    const detail::StreamFormat& format = detail::streamFormats()[kind];
    try {
        slot.file = std::make_unique<NewFile>(format.fileIn(folder));
    } catch (const std::system_error& error) {
        fail(kind, error.what());
        return;
    }
    slot.stream.rdbuf(slot.file.get());
    slot.stream.write(reinterpret_cast<const char*>(&format.header), sizeof format.header);
    slot.stage = Stage::Open;
}

// ---- Files ------------------------------------------------------------------------------------------------------

/// Reading the clock takes half as long as writing an entry. While it keeps returning the same time, the entries come
/// so fast that it is read for some of them only.
void SessionWriter::State::flushIfDue() {
    const std::chrono::nanoseconds time = now();
    equalReadings = time == lastReading ? equalReadings + 1 : 0;
    lastReading = time;
    if (equalReadings >= s_readingsOfABurst)
        unwatched = s_unwatchedOfABurst;
    if (time >= flushDue)
        flush(time);
}

void SessionWriter::State::flush(std::chrono::nanoseconds time) {
    constexpr auto never = std::chrono::nanoseconds::max();
    flushDue = flushAfter > never - time ? never : time + flushAfter;
    for (std::size_t kind = 0; kind < streams.size(); ++kind)
        if (StreamSlot& slot = streams[kind]; slot.stage == Stage::Open && !slot.stream.flush())
            fail(kind, slot.file->failure());
    reportLoss();
}

void SessionWriter::State::close(std::size_t kind) {
    StreamSlot& slot = streams[kind];
    if (slot.stage != Stage::Open)
        return;
    if (slot.file->close())
        slot.stage = Stage::Closed;
    else
        fail(kind, slot.file->failure());
}

void SessionWriter::State::finish() {
    isFinished = true;
    for (std::size_t kind = 0; kind < streams.size(); ++kind)
        close(kind);
    reportLoss();
}

// ---- Losses -----------------------------------------------------------------------------------------------------

void SessionWriter::State::lose(std::size_t kind, const std::string& sentence) {
    if (!loss)
        loss.emplace(utf8Path(detail::streamFormats()[kind].fileIn(folder)), sentence);
}

void SessionWriter::State::fail(std::size_t kind, const std::string& reason) {
    streams[kind].stage = Stage::Failed;
    lose(kind, (reason.empty() ? "cannot be written" : reason) + "; no more entries of " +
                   detail::streamFormats()[kind].name() + " are recorded");
}

void SessionWriter::State::reportLoss() {
    if (!loss || std::exchange(isLossReported, true) || !options.onLoss)
        return;
    options.onLoss(*loss);
}

// ---- The public side --------------------------------------------------------------------------------------------

SessionWriter::SessionWriter(const FileLocation& folder, SessionOptions options)
    : state_(std::make_unique<State>(folder, std::move(options))) {}

SessionWriter::SessionWriter(SessionWriter&&) noexcept = default;
SessionWriter& SessionWriter::operator=(SessionWriter&&) noexcept = default;
SessionWriter::~SessionWriter() = default;

void SessionWriter::append(std::size_t kind, double seconds, Point value) {
    state_->append<Point>(kind, seconds, value);
}

void SessionWriter::append(std::size_t kind, double seconds, Rect value) {
    state_->append<Rect>(kind, seconds, value);
}

void SessionWriter::append(std::size_t kind, double seconds, KeyStroke value) {
    state_->append<KeyStroke>(kind, seconds, value);
}

void SessionWriter::append(std::size_t kind, double seconds, std::int32_t value) {
    state_->append<std::int32_t>(kind, seconds, value);
}

void SessionWriter::append(std::size_t kind, double seconds, float value) {
    state_->append<float>(kind, seconds, value);
}

void SessionWriter::append(std::size_t kind, double seconds, double value) {
    state_->append<double>(kind, seconds, value);
}

void SessionWriter::append(std::size_t kind, double seconds, std::string_view value) {
    if (!state_->fits(kind, value.size()))
        return;
    state_->text.assign(value);
    state_->append<std::string>(kind, seconds, state_->text);
}

void SessionWriter::append(std::size_t kind, double seconds, const CursorImage& value) {
    if (state_->fits(kind, value.imageDataSize) && state_->append<CursorImage>(kind, seconds, value))
        state_->pictures.erase(value.uniqueId);
}

void SessionWriter::append(std::size_t kind, double seconds, const CursorAppearance& value) {
    if (value.picture && !state_->fits(kind, value.picture->bytes.size()))
        return;
    auto& last = state_->pictures[value.id];
    const bool isNew = value.picture && value.picture != last && !(last && *value.picture == *last);
    const LentPicture lent(value, isNew ? value.picture.get() : nullptr);
    if (state_->append<CursorImage>(kind, seconds, lent.image()) && isNew)
        last = value.picture;
}

void SessionWriter::appendOnce(std::size_t kind, const Rect& value) {
    state_->appendOnce(kind, value);
}

void SessionWriter::appendOnce(std::size_t kind, std::int32_t value) {
    state_->appendOnce(kind, value);
}

void SessionWriter::appendOnce(std::size_t kind, const std::list<std::string>& value) {
    state_->appendOnce(kind, value);
}

void SessionWriter::flush() {
    state_->flush(state_->now());
}

void SessionWriter::flushIfDue() {
    state_->flushIfDue();
}

void SessionWriter::finish() {
    state_->finish();
}

AttachResult SessionWriter::saveInto(const FileLocation& movie, const std::string& creatorName,
                                     const std::string& creatorVersion, SafeMovieSave::FragmentIndex index) {
    state_->finish();
    state_->isUnsaved = true;
    AttachResult saved = detail::saveFolder(state_->folder, movie, creatorName, creatorVersion, index);
    state_->isUnsaved = false;
    if (state_->lock)
        state_->lock->remove();
    return saved;
}

void SessionWriter::removeFiles() {
    state_->finish();
    detail::removeSession(state_->folder);
}

const Error* SessionWriter::loss() const {
    return state_->loss ? &*state_->loss : nullptr;
}

std::uint64_t SessionWriter::entriesWritten(const uuid& kind) const {
    const auto& formats = detail::streamFormats();
    const auto found = std::find_if(formats.begin(), formats.end(),
                                    [&kind](const auto& format) { return format.header.uuid == kind; });
    return found == formats.end() ? 0 : state_->streams[static_cast<std::size_t>(found - formats.begin())].entries;
}

const FileLocation& SessionWriter::folder() const {
    return state_->folder;
}

std::vector<StreamSource> SessionWriter::sources() const {
    return detail::sourcesIn(state_->folder);
}

std::vector<AbandonedSession> SessionWriter::abandoned(const FileLocation& folder) {
    std::vector<FileLocation> folders;
    detail::orError(utf8Path(folder), [&] {
        std::error_code unknown; // such a folder cannot be examined
        for (const auto& entry : std::filesystem::directory_iterator(folder))
            if (entry.is_directory(unknown))
                folders.push_back(entry.path());
    });
    std::sort(folders.begin(), folders.end());
    folders.insert(folders.begin(), folder);
    std::vector<AbandonedSession> sessions;
    for (const FileLocation& candidate : folders)
        if (LockFile::stateOf(detail::lockFileIn(candidate)) == LockFile::State::Left)
            sessions.emplace_back(candidate);
    return sessions;
}

} // namespace ZULMetaData
