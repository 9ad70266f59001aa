#include "ZULMetaData/Containers/MovieDuration.h"

#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/PositionedInput.h"

#include <algorithm>
#include <bit>
#include <deque>
#include <limits>
#include <map>
#include <string_view>
#include <vector>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_mostFragments = 50000;
constexpr std::size_t s_lastFragments = 64;
constexpr std::size_t s_batch = 4096;

/// A part of the media in the track's own time.
struct Track {
    std::uint32_t timescale = 0;
    std::uint32_t defaultDuration = 0; ///< of a sample
    std::optional<double> begin;       ///< of its first fragment
    double end = 0;
    bool isPlaced = true; ///< whether every fragment says where it begins

    double seconds(double time) const { return timescale == 0 ? 0 : time / timescale; }
};

/// The fields of one atom, one after the other.
class Fields {
public:
    Fields(std::istream& stream, const ContainerItem& atom, std::uint64_t total)
        : input_(atStart(stream), 0, std::min(total, atom.end())) {
        isWhole_ = input_.moveTo(atom.payloadOffset());
    }

    template <class Integer>
    Integer next() {
        Integer value = 0;
        isWhole_ = isWhole_ && input_.readBigEndian(value);
        return isWhole_ ? value : 0;
    }

    /// A time or a duration, which has 64 bits in version 1 and 32 in every other. All ones are an open one.
    double nextTime(std::uint32_t versionAndFlags) {
        return versionAndFlags >> 24 == 1 ? timeOf(next<std::uint64_t>()) : timeOf(next<std::uint32_t>());
    }

    void skip(std::uint64_t bytes) { isWhole_ = isWhole_ && input_.moveTo(input_.position() + bytes); }
    bool isWhole() const { return isWhole_; }
    bool isOpen() const { return isOpen_; } ///< whether the last time was
    std::uint64_t left() const { return input_.total() - std::min(input_.total(), input_.position()); }

private:
    static std::istream& atStart(std::istream& stream) {
        stream.clear();
        stream.seekg(0);
        return stream;
    }

    template <class Integer>
    double timeOf(Integer value) {
        isOpen_ = value == std::numeric_limits<Integer>::max();
        return static_cast<double>(value);
    }

    detail::PositionedInput input_;
    bool isWhole_ = false;
    bool isOpen_ = false;
};

class Clock {
public:
    explicit Clock(std::istream& stream) : stream_(stream) {
        stream_.clear();
        total_ = static_cast<std::uint64_t>(ParserUtil::calcFileSize(stream_));
    }

    std::optional<double> duration() {
        const auto moov = firstAtTop("moov");
        if (!moov) {
            visitFragments();
            return indexed();
        }
        const auto header = declared(*moov);
        const auto extension = firstChild(*moov, "mvex");
        if (!extension || !isCounted_)
            return header;
        if (const auto whole = declaredOfFragments(*extension))
            return std::max(header.value_or(0), *whole);
        readTracks(*moov, *extension);
        visitFragments();
        const auto counted = ofFragments(header.value_or(0) > 0);
        return counted ? std::optional(std::max(header.value_or(0), *counted)) : header;
    }

private:
    /// Not those that reach beyond their parent: however they overlap, no byte is read more than once.
    template <class Visit>
    void visitChildren(const ContainerItem& parent, Visit visit) {
        visitAtoms(stream_, parent.payloadOffset(), parent.end(), std::min(total_, parent.end()),
                   [&](const ContainerItem& child) {
                       const bool isInside = child.end() >= child.offset && child.end() <= parent.end();
                       return isInside && visit(child);
                   });
    }

    template <class Visit>
    void forEachChild(const ContainerItem& parent, Visit visit) {
        constexpr std::size_t most = 1000;
        std::vector<ContainerItem> children;
        visitChildren(parent, [&](const ContainerItem& child) {
            children.push_back(child);
            return children.size() < most;
        });
        for (const ContainerItem& child : children)
            visit(child);
    }

    std::optional<ContainerItem> firstChild(const ContainerItem& parent, std::string_view type) {
        std::optional<ContainerItem> found;
        visitChildren(parent, [&](const ContainerItem& child) {
            if (child.type == type)
                found = child;
            return !found;
        });
        return found;
    }

    std::optional<ContainerItem> firstAtTop(std::string_view type) {
        std::optional<ContainerItem> found;
        visitTopLevel(stream_, Container::QuickTime, [&](const ContainerItem& item) {
            if (item.type == type)
                found = item;
            return !found;
        });
        return found;
    }

    std::optional<double> declared(const ContainerItem& moov);
    std::optional<double> declaredOfFragments(const ContainerItem& extension);
    void readTracks(const ContainerItem& moov, const ContainerItem& extension);
    void readTrack(const ContainerItem& trak);
    void visitFragments();
    void readFragment(const ContainerItem& moof);
    void readTrackFragment(const ContainerItem& traf);
    double durationOfRun(const ContainerItem& trun, std::uint32_t defaultDuration);
    void readIndex(const ContainerItem& sidx);
    std::optional<double> ofFragments(bool beginsAtZero) const;
    std::optional<double> indexed() const;

    std::istream& stream_;
    std::uint64_t total_ = 0;
    bool isCounted_ = false; ///< whether the movie has a timescale
    std::uint32_t timescale_ = 0;
    std::map<std::uint32_t, Track> tracks_;
    std::size_t fragments_ = 0;
    bool areAllRead_ = true;
    std::optional<double> indexBegin_;
    double indexEnd_ = 0;
};

/// [version: 1][flags: 3][created][changed][timescale: 4][duration]
std::optional<double> Clock::declared(const ContainerItem& moov) {
    const auto header = firstChild(moov, "mvhd");
    if (!header)
        return std::nullopt;
    Fields fields(stream_, *header, total_);
    const auto version = fields.next<std::uint32_t>();
    fields.nextTime(version);
    fields.nextTime(version);
    timescale_ = fields.next<std::uint32_t>();
    const double duration = fields.nextTime(version);
    isCounted_ = fields.isWhole() && timescale_ != 0;
    return isCounted_ && !fields.isOpen() ? std::optional(duration / timescale_) : std::nullopt;
}

/// [version: 1][flags: 3][duration of the movie with all fragments]
std::optional<double> Clock::declaredOfFragments(const ContainerItem& extension) {
    const auto header = firstChild(extension, "mehd");
    if (!header)
        return std::nullopt;
    Fields fields(stream_, *header, total_);
    const double duration = fields.nextTime(fields.next<std::uint32_t>());
    const bool isTold = fields.isWhole() && !fields.isOpen() && duration > 0;
    return isTold ? std::optional(duration / timescale_) : std::nullopt;
}

void Clock::readTracks(const ContainerItem& moov, const ContainerItem& extension) {
    forEachChild(moov, [&](const ContainerItem& child) {
        if (child.type == "trak")
            readTrack(child);
    });
    forEachChild(extension, [&](const ContainerItem& child) {
        if (child.type != "trex")
            return;
        Fields fields(stream_, child, total_); // [version and flags][track][description][duration]
        fields.skip(sizeof(std::uint32_t));
        const auto id = fields.next<std::uint32_t>();
        fields.skip(sizeof(std::uint32_t));
        const auto duration = fields.next<std::uint32_t>();
        if (const auto track = tracks_.find(id); track != tracks_.end())
            track->second.defaultDuration = duration;
    });
}

void Clock::readTrack(const ContainerItem& trak) {
    const auto header = firstChild(trak, "tkhd");
    const auto media = firstChild(trak, "mdia");
    const auto mediaHeader = media ? firstChild(*media, "mdhd") : std::nullopt;
    if (!header || !mediaHeader)
        return;
    Fields fields(stream_, *header, total_); // [version and flags][created][changed][track]
    const auto version = fields.next<std::uint32_t>();
    fields.nextTime(version);
    fields.nextTime(version);
    const auto id = fields.next<std::uint32_t>();
    Fields mediaFields(stream_, *mediaHeader, total_); // [version and flags][created][changed][timescale][duration]
    const auto mediaVersion = mediaFields.next<std::uint32_t>();
    mediaFields.nextTime(mediaVersion);
    mediaFields.nextTime(mediaVersion);
    Track& track = tracks_[id];
    track.timescale = mediaFields.next<std::uint32_t>();
    const double duration = mediaFields.nextTime(mediaVersion);
    track.end = mediaFields.isOpen() ? 0 : duration;
}

/// In batches: the stream may not be moved during a visit.
void Clock::visitFragments() {
    std::deque<ContainerItem> last;
    std::vector<ContainerItem> batch;
    for (std::uint64_t position = 0; position < total_;) {
        batch.clear();
        std::uint64_t end = total_;
        visitAtoms(stream_, position, total_, total_, [&](const ContainerItem& item) {
            end = item.size == 0 || item.end() <= item.offset ? total_ : item.end();
            if (item.type == "moof" || item.type == "sidx")
                batch.push_back(item);
            return batch.size() < s_batch;
        });
        position = end;
        for (const ContainerItem& item : batch) {
            if (item.type == "sidx")
                readIndex(item);
            else if (fragments_++ < s_mostFragments)
                readFragment(item);
            else
                last.push_back(item);
            if (last.size() > s_lastFragments) {
                last.pop_front();
                areAllRead_ = false;
            }
        }
        if (batch.size() < s_batch)
            break;
    }
    for (const ContainerItem& item : last)
        readFragment(item);
}

void Clock::readFragment(const ContainerItem& moof) {
    forEachChild(moof, [this](const ContainerItem& child) {
        if (child.type == "traf")
            readTrackFragment(child);
    });
}

void Clock::readTrackFragment(const ContainerItem& traf) {
    constexpr std::uint32_t hasOffset = 0x1;
    constexpr std::uint32_t hasDescription = 0x2;
    constexpr std::uint32_t hasDuration = 0x8;
    Track* track = nullptr;
    std::uint32_t defaultDuration = 0;
    std::optional<double> begin;
    double length = 0;
    forEachChild(traf, [&](const ContainerItem& child) {
        if (child.type == "tfhd") {
            Fields fields(stream_, child, total_); // [version and flags][track][offset: 8][description][duration]
            const auto flags = fields.next<std::uint32_t>();
            const auto found = tracks_.find(fields.next<std::uint32_t>());
            track = found == tracks_.end() ? nullptr : &found->second;
            fields.skip((flags & hasOffset ? 8 : 0) + (flags & hasDescription ? 4 : 0));
            defaultDuration = flags & hasDuration ? fields.next<std::uint32_t>() : track ? track->defaultDuration : 0;
        } else if (child.type == "tfdt") {
            Fields fields(stream_, child, total_); // [version and flags][begin]
            const double time = fields.nextTime(fields.next<std::uint32_t>());
            if (fields.isWhole())
                begin = time;
        } else if (child.type == "trun") {
            length += durationOfRun(child, defaultDuration);
        }
    });
    if (!track)
        return;
    track->isPlaced &= begin.has_value();
    const double from = begin.value_or(track->end);
    if (!track->begin)
        track->begin = from;
    track->end = std::max(track->end, from + length);
}

/// [version and flags][samples][offset of the data][flags of the first][duration, size, flags, offset of each], of
/// which the flags say what is there.
double Clock::durationOfRun(const ContainerItem& trun, std::uint32_t defaultDuration) {
    constexpr std::uint32_t hasOffset = 0x1;
    constexpr std::uint32_t hasFirstFlags = 0x4;
    constexpr std::uint32_t hasDuration = 0x100;
    constexpr std::uint32_t ofSample = 0xf00;
    Fields fields(stream_, trun, total_);
    const auto flags = fields.next<std::uint32_t>();
    const auto samples = fields.next<std::uint32_t>();
    if (!(flags & hasDuration))
        return static_cast<double>(samples) * defaultDuration;
    fields.skip((flags & hasOffset ? 4 : 0) + (flags & hasFirstFlags ? 4 : 0));
    const auto others = static_cast<std::uint64_t>(std::popcount(flags & ofSample) - 1) * sizeof(std::uint32_t);
    double length = 0;
    for (std::uint32_t i = 0; i < samples && fields.isWhole(); ++i, fields.skip(others))
        length += fields.next<std::uint32_t>();
    return length;
}

/// [version and flags][track][timescale][begin][offset][reserved: 2][count: 2][size, duration, access point of each]
void Clock::readIndex(const ContainerItem& sidx) {
    Fields fields(stream_, sidx, total_);
    const auto version = fields.next<std::uint32_t>();
    fields.skip(sizeof(std::uint32_t));
    const auto timescale = fields.next<std::uint32_t>();
    const double begin = fields.nextTime(version);
    fields.nextTime(version);
    const std::uint32_t count = fields.next<std::uint32_t>() & 0xffff;
    double end = begin;
    for (std::uint32_t i = 0; i < count && fields.isWhole(); ++i) {
        fields.skip(sizeof(std::uint32_t));
        end += fields.next<std::uint32_t>();
        fields.skip(sizeof(std::uint32_t));
    }
    if (timescale == 0)
        return;
    indexBegin_ = std::min(indexBegin_.value_or(begin / timescale), begin / timescale);
    indexEnd_ = std::max(indexEnd_, end / timescale);
}

/// Media that begins later than at 0 has its times counted from its beginning.
std::optional<double> Clock::ofFragments(bool beginsAtZero) const {
    double end = 0;
    std::optional<double> begin;
    for (const auto& [id, track] : tracks_) {
        if (!track.begin || track.timescale == 0)
            continue;
        if (!areAllRead_ && !track.isPlaced)
            return indexed();
        end = std::max(end, track.seconds(track.end));
        begin = std::min(begin.value_or(track.seconds(*track.begin)), track.seconds(*track.begin));
    }
    return begin ? std::optional(beginsAtZero ? end : end - *begin) : std::nullopt;
}

std::optional<double> Clock::indexed() const {
    return indexBegin_ ? std::optional(indexEnd_ - *indexBegin_) : std::nullopt;
}

} // namespace

std::optional<double> movieDuration(MetaDataParser& movie) {
    return movieDuration(movie.getStream(), movie.getStreamType());
}

std::optional<double> movieDuration(std::istream& stream, Container::Type type) {
    if (type != Container::QuickTime)
        return std::nullopt;
    return Clock(stream).duration();
}

} // namespace ZULMetaData
