#include "ZULMetaData/Containers/MovieDuration.h"

#include "ZULMetaData/ByteReader.h"
#include "ZULMetaData/Containers/ContainerLayout.h"

#include <algorithm>
#include <bit>
#include <deque>
#include <limits>
#include <map>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_mostFragments = 50000;
constexpr std::size_t s_lastFragments = 64;

/// A part of the media in the track's own time.
struct Track {
    std::uint32_t timescale = 0;
    std::uint32_t defaultDuration = 0; ///< of a sample
    std::optional<double> begin;       ///< of its first fragment
    double end = 0;
    bool isPlaced = true; ///< whether every fragment has a start time

    double seconds(double time) const { return timescale == 0 ? 0 : time / timescale; }
};

/// The fields of one atom, one after the other. A number has 32 bits if nothing else is said.
class Fields {
public:
    /// Reads the first field, [version: 1][flags: 3].
    Fields(const ItemWalk& atoms, const ContainerItem& atom)
        : cursor_(atoms.reader(), atom.payloadOffset(), std::min(atoms.end(), atom.end())), versionAndFlags_(next()) {}

    std::uint32_t flags() const { return versionAndFlags_; }
    bool has(std::uint32_t flag) const { return (versionAndFlags_ & flag) != 0; }

    /// Returns 0 if the field is not there.
    template <class Integer = std::uint32_t>
    Integer next() {
        Integer value = 0;
        isWhole_ = isWhole_ && cursor_.readBigEndian(value);
        return value;
    }

    /// Reads a time or a duration, which has 64 bits in version 1 and 32 in every other. All ones are an open one.
    double nextTime() { return hasLongTimes() ? timeOf(next<std::uint64_t>()) : timeOf(next()); }

    void skip(std::uint64_t bytes) { cursor_.skip(bytes); }
    void skipIf(std::uint32_t flag, std::uint64_t bytes) { skip(has(flag) ? bytes : 0); }
    void skipTimes(std::uint64_t count) { skip(count * (hasLongTimes() ? 8 : 4)); }
    bool isWhole() const { return isWhole_; }
    bool isOpen() const { return isOpen_; } ///< whether the last time was

private:
    bool hasLongTimes() const { return versionAndFlags_ >> 24 == 1; }

    template <class Integer>
    double timeOf(Integer value) {
        isOpen_ = value == std::numeric_limits<Integer>::max();
        return static_cast<double>(value);
    }

    detail::ByteCursor cursor_;
    bool isWhole_ = true;
    bool isOpen_ = false;
    std::uint32_t versionAndFlags_;
};

class Clock {
public:
    explicit Clock(const ByteSource& movie) : atoms_(movie, Container::QuickTime) {}

    std::optional<double> duration() {
        const auto moov = first(atoms_, "moov");
        if (!moov) {
            visitFragments();
            return indexed();
        }
        const auto header = declared(*moov);
        const auto extension = firstChild(*moov, "mvex");
        if (!extension || timescale_ == 0)
            return header;
        if (const auto whole = declaredOfFragments(*extension))
            return std::max(header.value_or(0), *whole);
        readTracks(*moov, *extension);
        visitFragments();
        const auto counted = ofFragments(header.value_or(0) > 0);
        return counted ? std::optional(std::max(header.value_or(0), *counted)) : header;
    }

private:
    static std::optional<ContainerItem> first(ItemWalk atoms, FourCC type) {
        while (const auto atom = atoms.next())
            if (atom->type == type)
                return atom;
        return std::nullopt;
    }

    /// Passes over a child that reaches beyond its parent, so that no byte is read more than once, however they
    /// overlap.
    template <class Visit>
    void forEachChild(const ContainerItem& parent, Visit visit) {
        ItemWalk children = atoms_.inside(parent);
        for (auto child = children.next(); child && child->fits(parent.end()); child = children.next())
            visit(*child);
    }

    std::optional<ContainerItem> firstChild(const ContainerItem& parent, FourCC type) {
        ItemWalk children = atoms_.inside(parent);
        const auto child = first(children, type);
        return child && child->fits(parent.end()) ? child : std::nullopt;
    }

    /// [created][changed][timescale: 4][duration]
    std::optional<double> declared(const ContainerItem& moov) {
        const auto header = firstChild(moov, "mvhd");
        if (!header)
            return std::nullopt;
        Fields fields(atoms_, *header);
        fields.skipTimes(2);
        const std::uint32_t timescale = fields.next();
        const double duration = fields.nextTime();
        timescale_ = fields.isWhole() ? timescale : 0;
        return timescale_ != 0 && !fields.isOpen() ? std::optional(duration / timescale_) : std::nullopt;
    }

    /// [duration of the movie with all fragments]
    std::optional<double> declaredOfFragments(const ContainerItem& extension) {
        const auto header = firstChild(extension, "mehd");
        if (!header)
            return std::nullopt;
        Fields fields(atoms_, *header);
        const double duration = fields.nextTime();
        const bool isTold = fields.isWhole() && !fields.isOpen() && duration > 0;
        return isTold ? std::optional(duration / timescale_) : std::nullopt;
    }

    void readTracks(const ContainerItem& moov, const ContainerItem& extension) {
        forEachChild(moov, [&](const ContainerItem& child) {
            if (child.type == "trak")
                readTrack(child);
        });
        forEachChild(extension, [&](const ContainerItem& child) {
            if (child.type != "trex")
                return;
            Fields fields(atoms_, child); // [track][description: 4][duration]
            const auto track = tracks_.find(fields.next());
            fields.skip(4);
            if (track != tracks_.end())
                track->second.defaultDuration = fields.next();
        });
    }

    void readTrack(const ContainerItem& trak) {
        const auto header = firstChild(trak, "tkhd");
        const auto media = firstChild(trak, "mdia");
        const auto mediaHeader = media ? firstChild(*media, "mdhd") : std::nullopt;
        if (!header || !mediaHeader)
            return;
        Fields fields(atoms_, *header); // [created][changed][track]
        fields.skipTimes(2);
        Fields mediaFields(atoms_, *mediaHeader); // [created][changed][timescale][duration]
        mediaFields.skipTimes(2);
        Track& track = tracks_[fields.next()];
        track.timescale = mediaFields.next();
        const double duration = mediaFields.nextTime();
        track.end = mediaFields.isOpen() ? 0 : duration;
    }

    void visitFragments() {
        std::deque<ContainerItem> last;
        std::size_t fragments = 0;
        ItemWalk atoms = atoms_;
        while (const auto atom = atoms.next()) {
            if (atom->type == "sidx")
                readIndex(*atom);
            if (atom->type != "moof")
                continue;
            if (fragments++ < s_mostFragments) {
                readFragment(*atom);
                continue;
            }
            last.push_back(*atom);
            if (last.size() > s_lastFragments) {
                last.pop_front();
                areAllRead_ = false;
            }
        }
        for (const ContainerItem& moof : last)
            readFragment(moof);
    }

    void readFragment(const ContainerItem& moof) {
        forEachChild(moof, [this](const ContainerItem& child) {
            if (child.type == "traf")
                readTrackFragment(child);
        });
    }

    void readTrackFragment(const ContainerItem& traf) {
        constexpr std::uint32_t hasOffset = 0x1;
        constexpr std::uint32_t hasDescription = 0x2;
        constexpr std::uint32_t hasDuration = 0x8;
        Track* track = nullptr;
        std::uint32_t defaultDuration = 0;
        std::optional<double> begin;
        double length = 0;
        forEachChild(traf, [&](const ContainerItem& child) {
            if (child.type == "tfhd") {
                Fields fields(atoms_, child); // [track][offset: 8][description: 4][duration]
                const auto found = tracks_.find(fields.next());
                track = found == tracks_.end() ? nullptr : &found->second;
                fields.skipIf(hasOffset, 8);
                fields.skipIf(hasDescription, 4);
                defaultDuration = fields.has(hasDuration) ? fields.next() : track ? track->defaultDuration : 0;
            } else if (child.type == "tfdt") {
                Fields fields(atoms_, child); // [begin]
                const double time = fields.nextTime();
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

    /// [samples][offset of the data][flags of the first][duration, size, flags, offset of each], of which the flags of
    /// the atom say what is there.
    double durationOfRun(const ContainerItem& trun, std::uint32_t defaultDuration) {
        constexpr std::uint32_t hasOffset = 0x1;
        constexpr std::uint32_t hasFirstFlags = 0x4;
        constexpr std::uint32_t hasDuration = 0x100;
        constexpr std::uint32_t ofSample = 0xf00;
        Fields fields(atoms_, trun);
        const std::uint32_t samples = fields.next();
        if (!fields.has(hasDuration))
            return static_cast<double>(samples) * defaultDuration;
        fields.skipIf(hasOffset, 4);
        fields.skipIf(hasFirstFlags, 4);
        const auto others =
            static_cast<std::uint64_t>(std::popcount(fields.flags() & ofSample) - 1) * sizeof(std::uint32_t);
        double length = 0;
        for (std::uint32_t i = 0; i < samples && fields.isWhole(); ++i, fields.skip(others))
            length += fields.next();
        return length;
    }

    /// [track][timescale][begin][offset][reserved: 2][count: 2][size, duration, access point of each]
    void readIndex(const ContainerItem& sidx) {
        Fields fields(atoms_, sidx);
        fields.skip(4);
        const std::uint32_t timescale = fields.next();
        const double begin = fields.nextTime();
        fields.skipTimes(1);
        const std::uint32_t count = fields.next() & 0xffff;
        double end = begin;
        for (std::uint32_t i = 0; i < count && fields.isWhole(); ++i) {
            fields.skip(4);
            end += fields.next();
            fields.skip(4);
        }
        if (timescale == 0)
            return;
        indexBegin_ = std::min(indexBegin_.value_or(begin / timescale), begin / timescale);
        indexEnd_ = std::max(indexEnd_, end / timescale);
    }

    /// Media that begins later than at 0 has its times counted from its beginning.
    std::optional<double> ofFragments(bool beginsAtZero) const {
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

    std::optional<double> indexed() const {
        return indexBegin_ ? std::optional(indexEnd_ - *indexBegin_) : std::nullopt;
    }

    ItemWalk atoms_;
    std::uint32_t timescale_ = 0; ///< of the movie; 0 if it has none
    std::map<std::uint32_t, Track> tracks_;
    bool areAllRead_ = true;
    std::optional<double> indexBegin_;
    double indexEnd_ = 0;
};

} // namespace

std::optional<double> movieDuration(const ByteSource& file, Container::Type type) {
    return type == Container::QuickTime ? Clock(file).duration() : std::nullopt;
}

std::optional<double> movieDuration(MetaDataParser& movie) {
    return movieDuration(ByteSource::stream(movie.getStream()), movie.getStreamType());
}

} // namespace ZULMetaData
