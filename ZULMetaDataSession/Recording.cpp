#include "ZULMetaDataSession/Recording.h"

#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataSession/OrError.h"
#include "ZULMetaDataSession/RecordingStates.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cstddef>
#include <cstring>
#include <mutex>
#include <new>
#include <span>
#include <stdexcept>

namespace ZULMetaData {

namespace {

using detail::orError;

/// Returns the same bytes for any number of threads.
ByteSource lockedSource(const ByteSource& bytes) {
    return {bytes.size(), [bytes, mutex = std::make_shared<std::mutex>()](std::uint64_t position, std::span<char> to) {
                const std::lock_guard lock(*mutex);
                return bytes.read(position, to);
            }};
}

RecordingFile opened(const ByteSource& bytes, const std::string& name) {
    try {
        return orError(name, [&] { return RecordingFile(lockedSource(bytes), name, ScanMessages::Omitted); });
    } catch (const Error&) {
        throw;
    } catch (const std::runtime_error& refusal) {
        const std::string text = refusal.what();
        throw Error(name, text.starts_with(name + ": ") ? text.substr(name.size() + 2) : text);
    }
}

/// Returns what is wrong with the header of a stream that cannot be decoded.
std::string sentenceAbout(const MetaDataHeader& header) {
    const std::string stream = "the stream " + metaDataKindName(header.uuid);
    const MetaDataKind* kind = findMetaDataKind(header.uuid);
    const std::string version = " has version " + std::to_string(header.version);
    if (header.version < 1)
        return stream + version + ", but versions begin at 1; its header is damaged";
    if (kind && header.version > kind->currentVersion)
        return stream + version + ", and this library reads versions up to " + std::to_string(kind->currentVersion) +
               "; read it with a newer library";
    const auto textOf = [](std::uint32_t size) {
        return size == 0 ? std::string("varying size") : std::to_string(size) + " bytes";
    };
    return stream + " states entries of " + textOf(header.fixedEntrySize) + " instead of " +
           textOf(entrySizeOf(header)) + "; its header is damaged";
}

constexpr std::size_t s_bytesOfABlock = 256 * 1024;

/// Unpacks entries. They lie one after the other.
template <class Kind>
void unpack(const char* entries, std::span<double> times, std::span<TrackValueOf<Kind>> values) {
    using Stored = typename Kind::Value;
    for (std::size_t i = 0; i < times.size(); ++i, entries += sizeof(double) + sizeof(Stored)) {
        Stored stored;
        std::memcpy(&times[i], entries, sizeof(double));
        std::memcpy(&stored, entries + sizeof(double), sizeof stored);
        if constexpr (std::is_same_v<Stored, TrackValueOf<Kind>>)
            values[i] = stored;
        else
            values[i] = trackValue(stored);
    }
}

/// Reads large blocks, and looks at the order of the times while they are in the processor's cache.
template <class Kind>
Track<Kind> trackOfFixedSize(const ByteSource& stream) {
    constexpr std::size_t size = sizeof(double) + sizeof(typename Kind::Value);
    std::uint64_t position = s_metaDataHeaderSize;
    const std::uint64_t entries = stream.size() < position ? 0 : (stream.size() - position) / size;
    std::vector<double> times;
    std::vector<TrackValueOf<Kind>> values;
    if (entries > std::min(times.max_size(), values.max_size()))
        throw std::bad_alloc();
    times.reserve(static_cast<std::size_t>(entries));
    values.reserve(static_cast<std::size_t>(entries));
    std::vector<char> block(static_cast<std::size_t>(std::min<std::uint64_t>(entries, s_bytesOfABlock / size)) * size);
    bool isInOrder = true;
    while (times.size() < entries) {
        const std::size_t done = times.size();
        const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(block.size(), (entries - done) * size));
        const std::size_t count = stream.read(position, std::span(block).first(wanted)) / size;
        if (count == 0)
            break;
        times.resize(done + count);
        values.resize(done + count);
        unpack<Kind>(block.data(), std::span(times).subspan(done), std::span(values).subspan(done));
        isInOrder = isInOrder && detail::areInOrder(std::span(times).subspan(done == 0 ? 0 : done - 1));
        position += std::uint64_t{count} * size;
    }
    return isInOrder ? Track<Kind>::inOrder(std::move(times), std::move(values))
                     : Track<Kind>(std::move(times), std::move(values));
}

template <class Kind>
Track<Kind> trackOf(const ByteSource& stream) {
    if constexpr (FixedSizeValue<typename Kind::Value>) {
        return trackOfFixedSize<Kind>(stream);
    } else {
        std::vector<double> times;
        std::vector<TrackValueOf<Kind>> values;
        detail::visitEntries<Kind>(stream, [&](double time, TrackValueOf<Kind>&& value) {
            times.push_back(time);
            values.push_back(std::move(value));
            return true;
        });
        return {std::move(times), std::move(values)};
    }
}

} // namespace

struct Recording::State {
    State(const ByteSource& bytes, const std::string& name) : file(opened(bytes, name)), streams(file.streams()) {}

    /// Whether something was read, such as the track of a kind. It is read once.
    class Reading {
    public:
        template <class Work>
        void once(Work work) {
            if (isDone_.load(std::memory_order_acquire))
                return;
            const std::lock_guard lock(mutex_);
            if (isDone_.load(std::memory_order_relaxed))
                return;
            work();
            isDone_.store(true, std::memory_order_release);
        }

    private:
        std::mutex mutex_;
        std::atomic<bool> isDone_ = false;
    };

    RecordingFile file;
    std::vector<StreamInfo> streams;
    std::mutex validation; ///< of the file, which walks at the first question
    std::array<Reading, RecordedKinds::size> readings;
    detail::Tracks tracks;
    Reading statesReading;
    std::shared_ptr<const detail::RecordingStates> states;
};

Recording::Recording(const FileLocation& file) {
    const std::string path = utf8Path(file);
    state_ = std::make_unique<State>(orError(path, [&path] { return ByteSource::file(path); }), path);
}

Recording::Recording(ByteSource bytes, const std::string& name) : state_(std::make_unique<State>(bytes, name)) {}

Recording::Recording(Recording&&) noexcept = default;
Recording& Recording::operator=(Recording&&) noexcept = default;
Recording::~Recording() = default;

const std::string& Recording::name() const {
    return state_->file.name();
}

Container::Type Recording::container() const {
    return state_->file.container();
}

std::optional<double> Recording::duration() const {
    const std::lock_guard lock(state_->validation); // whose result has the duration too
    return orError(name(), [this] { return state_->file.duration(); });
}

const std::vector<StreamInfo>& Recording::streams() const {
    return state_->streams;
}

std::vector<StreamReport> Recording::hiddenStreams() const {
    const std::lock_guard lock(state_->validation);
    return orError(name(), [this] { return state_->file.hiddenStreams(); });
}

bool Recording::hidesStreams() const {
    const std::lock_guard lock(state_->validation);
    return orError(name(), [this] { return state_->file.validation().hidesStreams(); });
}

std::vector<ZCAPHeader> Recording::creators() const {
    return orError(name(), [this] { return state_->file.creators(); });
}

bool Recording::has(const uuid& kind) const {
    return find(kind) != nullptr;
}

const StreamInfo* Recording::find(const uuid& kind) const {
    const auto found = std::find_if(state_->streams.begin(), state_->streams.end(),
                                    [&kind](const StreamInfo& stream) { return stream.type == kind; });
    return found == state_->streams.end() ? nullptr : &*found;
}

ByteSource Recording::bytesOf(const StreamInfo& stream) const {
    const ByteSource bytes = state_->file.bytesOf(stream);
    return {bytes.size(), [bytes, name = name()](std::uint64_t position, std::span<char> to) {
                return orError(name, [&] { return bytes.read(position, to); });
            }};
}

ByteSource Recording::decodableBytesOf(const uuid& kind) const {
    const StreamInfo* stream = find(kind);
    if (!stream)
        return ByteSource::memory({});
    ByteSource bytes = bytesOf(*stream);
    if (!stream->hasRoom()) { // only a walk over everything tells where it ends
        const std::lock_guard lock(state_->validation);
        bytes = bytes.part(0, orError(name(), [&] { return state_->file.examine(*stream).readableBytes; }));
    }
    const std::optional<MetaDataHeader> header = StreamEntries(bytes).header();
    if (!header)
        return ByteSource::memory({});
    if (!isDecodable(*header))
        throw Error(name(), sentenceAbout(*header), stream->offset);
    return bytes;
}

const detail::Tracks& Recording::tracksWith(std::size_t place) const {
    State& state = *state_;
    state.readings[place].once([&] {
        RecordedKinds::forEach([&]<class Kind>() {
            if (detail::TracksOf<RecordedKinds>::placeOf<Kind>() == place)
                std::get<Track<Kind>>(state.tracks) = trackOf<Kind>(decodableBytesOf(Kind::type));
        });
    });
    return state.tracks;
}

const std::shared_ptr<const detail::RecordingStates>& Recording::states() const {
    state_->statesReading.once([this] {
        state_->states =
            std::make_shared<const detail::RecordingStates>([this]<class Kind>() { return track<Kind>(); });
    });
    return state_->states;
}

Snapshot Recording::at(double time, Interpolation interpolation) const {
    const detail::RecordingStates& states = *this->states();
    const detail::EntryCounts counts = states.countsUntil(time);
    Snapshot snapshot;
    snapshot.time = time;
    states.show(counts, snapshot);
    states.showCursor(counts, interpolation, snapshot);
    return snapshot;
}

RecordedArea Recording::area() const {
    return detail::areaOf(track<RecordingRegionKind>(), track<ScaleFactorKind>());
}

} // namespace ZULMetaData
