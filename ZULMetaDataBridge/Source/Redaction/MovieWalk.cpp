#include "ZULMetaDataBridge/Source/Redaction/MediaPlaces.h"
#include "ZULMetaDataBridge/Source/Redaction/TextSearch.h"
#include "ZULMetaDataBridge/Source/Redaction/TextTrack.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaDataBridge/Source/EntryTexts.h"

#include <algorithm>
#include <array>
#include <iterator>
#include <set>
#include <string_view>

namespace ZULMetaData::detail {

namespace {

constexpr std::array<FourCC, 16> s_topTypes{
    "ftyp", "styp", "moov", "moof", "mdat", "imda", "sidx", "ssix",
    "prft", "pdin", "meta", "meco", "emsg", "pnot", "PICT", s_fragmentIndexAtom};
constexpr std::array<FourCC, 12> s_containerAtoms{"moov", "trak", "mdia", "minf", "stbl", "edts",
                                                  "dinf", "mvex", "moof", "traf", "gmhd", s_fragmentIndexAtom};
constexpr std::array<FourCC, 4> s_unusedAtoms{s_freeAtom, s_spareAtom, "skip", "junk"};
constexpr std::array<FourCC, 5> s_tableAtoms{"stsz", "stz2", "stsc", "stco", "co64"};
/// Tags that name programs, as paths show them.
constexpr std::array<std::string_view, 3> s_programs{"/\xc2\xa9too",
                                                     "/\xc2\xa9"
                                                     "enc",
                                                     "/\xc2\xa9swr"};
constexpr std::array<FourCC, 9> s_phoneTags{"titl", "auth", "dscp", "perf", "gnre", "albm", "cprt", "yrrc", "coll"};

/// The type of a `uuid` atom that holds XMP.
constexpr std::string_view s_xmp = "\xbe\x7a\xcf\xcb\x97\xa9\x42\xe8\x9c\x71\x99\x94\x91\xe3\xaf\xac";

std::vector<std::string> chapterTitles(std::string_view payload) {
    constexpr std::size_t timeSize = 8;
    std::vector<std::string> titles;
    std::size_t at = payload.starts_with('\0') ? 4 : 8; // version and flags; in later versions four bytes more
    const auto count = static_cast<unsigned char>(part(payload, at, 1).empty() ? 0 : payload[at]);
    for (++at; titles.size() < count && at + timeSize < payload.size();) {
        const auto size = static_cast<unsigned char>(payload[at + timeSize]);
        titles.push_back(decodedText(part(payload, at + timeSize + 1, size)));
        at += timeSize + 1 + size;
    }
    return titles.size() == count ? titles : textRuns(payload);
}

/// [size: 2][language: 2][text], again and again.
std::vector<std::string> countedTexts(std::string_view payload) {
    std::vector<std::string> texts;
    std::size_t at = 0;
    while (at + 4 <= payload.size()) {
        const auto size = static_cast<std::size_t>(bigEndianAt(payload, at, 2));
        if (size > payload.size() - at - 4)
            return textRuns(payload);
        texts.push_back(decodedText(payload.substr(at + 4, size)));
        at += 4 + size;
    }
    return texts;
}

/// [type: 4][locale: 4][value]
std::vector<std::string> dataTexts(std::string_view payload) {
    enum Type : std::uint64_t { Text = 1, UTF16Text = 2, FirstPicture = 12, LastNumber = 79 };
    const std::uint64_t type = bigEndianAt(payload, 0, 4);
    if (type == Text)
        return {decodedText(part(payload, 8))};
    if (type == UTF16Text)
        return {textFromUTF16(part(payload, 8))};
    return type >= FirstPicture && type <= LastNumber ? std::vector<std::string>() : textRuns(part(payload, 8));
}

std::vector<std::string> textsOfTag(const ContainerItem& item, const std::string& payload) {
    if (item.type == "chpl")
        return chapterTitles(payload);
    if (item.type == "data")
        return dataTexts(payload);
    if (item.type == "name")
        return {decodedText(payload)};
    if (item.type.value >> 24 == 0xa9)
        return countedTexts(payload);
    if (isOneOf(item.type, s_phoneTags)) // [version and flags: 4][language: 2][text]
        return {decodedText(part(payload, 6))};
    return textRuns(payload);
}

/// Returns the position of the first child of an item that holds tags; its end if it holds a text itself.
std::uint64_t childrenOf(const ContainerItem& item, std::string_view payload) {
    if (item.type == "udta" || item.type == "ilst" || payload.substr(4).starts_with("data"))
        return item.payloadOffset();
    if (item.type == "----" || payload.substr(4).starts_with("mean"))
        return item.payloadOffset();
    if (item.type == "meta") // with or without version and flags
        return item.payloadOffset() + (part(payload, 4).starts_with("hdlr") ? 0 : 4);
    return item.end();
}

class MovieWalk : PlaceWalk {
public:
    explicit MovieWalk(const ByteSource& movie) : PlaceWalk(movie, Container::QuickTime) {}

    MediaPlaces run() {
        ItemWalk atoms = items_;
        while (const auto atom = atoms.next())
            if (!atom->holdsMetaData() && !atom->holdsRecordingInfo())
                visitTop(*atom);
        for (const MovieTrack& track : tracks_)
            if (track.holdsTexts())
                addTextTrack(track);
        return std::move(places_);
    }

private:
    /// Passes over a child that does not lie inside its parent.
    template <class Visit>
    void forEachChild(const ContainerItem& parent, std::uint64_t begin, Visit visit) {
        ItemWalk children = items_.inside(parent);
        children.moveTo(begin);
        while (const auto child = children.next())
            if (child->size >= child->headerSize && child->fits(parent.end()))
                visit(*child);
    }

    void visitTop(const ContainerItem& item) {
        const std::string path = shownType(item);
        if (item.type == "mdat")
            mediaData_.push_back(item);
        isFragmented_ = isFragmented_ || item.type == "moof";
        const bool isXMP = item.type == "uuid" && readBytes(file_, item.payloadOffset(), s_xmp.size()) == s_xmp;
        if (isXMP)
            addTags(item, path);
        else if (isOneOf(item.type, s_topTypes))
            visit(item, path, nullptr, 0);
        else
            addUnused(item, path);
    }

    void visit(const ContainerItem& item, const std::string& path, MovieTrack* track, int depth) {
        if (item.type == "trak") {
            MovieTrack found{item, path, 0, {}, {}};
            visitChildren(item, path, &found, depth);
            tracks_.push_back(std::move(found));
        } else if (isOneOf(item.type, s_containerAtoms)) {
            visitChildren(item, path, track, depth);
        } else if (item.type == "udta" || item.type == "meta") {
            addTags(item, path);
        } else if (item.type == "tref") {
            addReferences(item, path);
        } else if (item.type == "hdlr") {
            addHandler(item, path, track);
        } else if (item.type == "tkhd" && track) {
            const std::string header = payloadOf(item);
            track->id = bigEndianAt(header, header.starts_with('\1') ? 20 : 12, 4); // after two times of 64 or 32 bits
        } else if (isOneOf(item.type, s_tableAtoms) && track) {
            track->tables.emplace(item.type.value, item);
        } else if (item.type == "cmov") {
            places_.obstacles.push_back({path, item.offset, "is compressed"});
        } else if (isOneOf(item.type, s_unusedAtoms)) {
            addUnused(item, path);
        }
    }

    void visitChildren(const ContainerItem& item, const std::string& path, MovieTrack* track, int depth) {
        if (depth >= s_deepestLevel)
            return places_.obstacles.push_back({path, item.offset, "is nested too deeply"});
        forEachChild(item, item.payloadOffset(), [&](const ContainerItem& child) {
            visit(child, path + '/' + shownType(child), track, depth + 1);
        });
    }

    /// References to chapters are removed together with the chapters.
    void addReferences(const ContainerItem& item, const std::string& path) {
        forEachChild(item, item.payloadOffset(), [&](const ContainerItem& child) {
            if (child.type != "chap")
                return;
            const std::string ids = payloadOf(child);
            for (std::size_t at = 0; at + 4 <= ids.size(); at += 4)
                chapterTracks_.insert(bigEndianAt(ids, at, 4));
            const bool isOnlyChild = child.size == item.payloadSize();
            addPlace(MediaPlace::Use::Text, isOnlyChild ? item : child, isOnlyChild ? path : path + "/chap");
        });
    }

    /// [version and flags: 4][component type: 4][handler: 4][reserved: 12][name]
    void addHandler(const ContainerItem& item, const std::string& path, MovieTrack* track) {
        constexpr std::size_t handlerOffset = 8;
        constexpr std::size_t nameOffset = 24;
        const std::string payload = payloadOf(item);
        if (track && track->handler.empty() && path.ends_with("mdia/hdlr"))
            track->handler = part(payload, handlerOffset, 4);
        const std::string_view name = part(payload, nameOffset);
        if (name.find_first_not_of('\0') == std::string_view::npos)
            return;
        const bool isCounted = static_cast<unsigned char>(name.front()) == name.size() - 1;
        addTexts(MediaText::Role::Technical, item, path, {decodedText(isCounted ? name.substr(1) : name)});
        places_.places.push_back({MediaPlace::Use::Text,
                                  path,
                                  item.offset,
                                  item.size,
                                  {{item.payloadOffset() + nameOffset, item.payloadSize() - nameOffset, {}}}});
    }

    void addTags(const ContainerItem& item, const std::string& path) {
        addPlace(MediaPlace::Use::Text, item, path);
        addTextsOf(item, path, 0);
    }

    /// One text atom or the texts of all that are inside of it.
    void addTextsOf(const ContainerItem& item, const std::string& path, int depth) {
        const std::string payload = payloadOf(item);
        const std::uint64_t children = payload.size() < 8 ? item.end() : childrenOf(item, payload);
        if (children < item.end() && depth < s_deepestLevel) {
            forEachChild(item, children, [&](const ContainerItem& child) {
                addTextsOf(child, path + '/' + shownType(child), depth + 1);
            });
        } else if (isOneOf(item.type, s_unusedAtoms)) {
            addUnused(item, path);
        } else if (item.type != "hdlr") {
            const bool isTechnical = item.type == "keys" || item.type == "mean" ||
                                     std::any_of(s_programs.begin(), s_programs.end(), [&path](std::string_view tag) {
                                         return path.find(tag) != std::string::npos;
                                     });
            addTexts(isTechnical ? MediaText::Role::Technical : MediaText::Role::Title, item, path,
                     textsOfTag(item, payload));
        }
    }

    void addTextTrack(const MovieTrack& track) {
        const bool hasChapters = chapterTracks_.contains(track.id);
        std::string obstacle = whyUnreadable(track);
        if (obstacle.empty() && hasChapters)
            obstacle = whyNotRemovable(track);
        if (!obstacle.empty())
            return places_.obstacles.push_back({track.path, track.atom.offset, obstacle});
        MediaPlace place = blanked(MediaPlace::Use::Text, track.atom, track.path);
        std::vector<std::string> texts;
        visitSamples(track, file_, [&](const SampleRange& sample) {
            const auto found = textsOfSample(readBytes(file_, sample.offset, sample.size));
            texts.insert(texts.end(), found.begin(), found.end());
            place.blanks.push_back({sample.offset, sample.size, {}});
            return true;
        });
        addTexts(hasChapters ? MediaText::Role::Title : MediaText::Role::Caption, track.atom, track.path,
                 std::move(texts));
        if (hasChapters)
            places_.places.push_back(std::move(place));
    }

    std::string whyUnreadable(const MovieTrack& track) {
        if (isFragmented_)
            return "has its texts in fragments";
        constexpr std::uint64_t most = 1 << 20; // nobody reads more texts
        const auto isBounded = [this] { return textSamples_ <= most && textBytes_ <= file_.size(); };
        const bool isKnown = visitSamples(track, file_, [&](const SampleRange& sample) {
            textBytes_ += sample.size;
            ++textSamples_;
            return isBounded();
        });
        return isKnown && isBounded() ? "" : "does not say where its texts are";
    }

    std::string whyNotRemovable(const MovieTrack& track) {
        std::vector<SampleRange> samples;
        visitSamples(track, file_, [&samples](const SampleRange& sample) {
            samples.push_back(sample);
            return true;
        });
        const auto isInside = [this](const SampleRange& sample) { return isInMediaData(sample); };
        if (!std::all_of(samples.begin(), samples.end(), isInside))
            return "has texts outside of the media data";
        return isSharedWithOtherTracks(track, samples) ? "shares its texts with another track" : "";
    }

    bool isInMediaData(const SampleRange& sample) const {
        return std::any_of(mediaData_.begin(), mediaData_.end(), [&](const ContainerItem& item) {
            return sample.offset >= item.payloadOffset() && sample.offset <= item.end() &&
                   sample.size <= item.end() - sample.offset;
        });
    }

    bool isSharedWithOtherTracks(const MovieTrack& track, const std::vector<SampleRange>& samples) {
        std::map<std::uint64_t, std::uint64_t> ends; // by offset
        for (const SampleRange& sample : samples)
            ends[sample.offset] = std::max(ends[sample.offset], sample.offset + sample.size);
        bool isShared = false;
        for (const MovieTrack& other : tracks_) {
            if (other.atom.offset == track.atom.offset)
                continue;
            visitSamples(other, file_, [&](const SampleRange& sample) {
                const auto after = ends.lower_bound(sample.offset + sample.size);
                isShared = sample.size > 0 && after != ends.begin() && std::prev(after)->second > sample.offset;
                return !isShared;
            });
            if (isShared)
                break;
        }
        return isShared;
    }

    std::uint64_t textSamples_ = 0; ///< of all tracks of texts so far, which may share their samples
    std::uint64_t textBytes_ = 0;
    std::vector<MovieTrack> tracks_;
    std::set<std::uint64_t> chapterTracks_; ///< that other tracks refer to
    std::vector<ContainerItem> mediaData_;
    bool isFragmented_ = false;
};

} // namespace

MediaPlaces findPlacesInMovie(const ByteSource& movie) {
    return MovieWalk(movie).run();
}

} // namespace ZULMetaData::detail
