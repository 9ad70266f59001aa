// The edit list of a movie: which parts of the media its first track of pictures shows.
//
//     moov / mvhd                      [version: 1][flags: 3][created][changed][timescale: 4]...
//     moov / trak / edts / elst        [version: 1][flags: 3][count: 4], then of each edit
//                                      [length in the movie's timescale][media time, or -1][rate: 2][fraction: 2]
//     moov / trak / mdia / mdhd        [version: 1][flags: 3][created][changed][timescale: 4]...
//     moov / trak / mdia / hdlr        [version: 1][flags: 3][0: 4][handler: 4]...
//
// Times have 64 bits in version 1 and 32 in version 0.

#include "ZULMetaData/ByteReader.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaDataSession/EditLists/Formats.h"
#include "ZULMetaDataSession/EditLists/ListBuilder.h"

namespace ZULMetaData::detail {

namespace {

/// The fields of one atom after its version, one after the other.
class AtomFields {
public:
    AtomFields(const ListBuilder& list, const ItemWalk& atoms, const ContainerItem& atom)
        : list_(list), type_(atom.type), cursor_(atoms.reader(), atom.payloadOffset(), atom.end()),
          version_(next<std::uint32_t>() >> 24) {
        if (version_ > 1)
            list_.fail("the atom '" + type_.text() + "' is of version " + std::to_string(version_) +
                       "; versions 0 and 1 can be read");
    }

    template <class Integer>
    Integer next() {
        Integer value = 0;
        if (!cursor_.readBigEndian(value))
            list_.fail("the atom '" + type_.text() + "' is cut short");
        return value;
    }

    std::uint64_t nextTime() { return version_ == 1 ? next<std::uint64_t>() : next<std::uint32_t>(); }

    std::int64_t nextSignedTime() {
        return version_ == 1 ? static_cast<std::int64_t>(next<std::uint64_t>())
                             : static_cast<std::int32_t>(next<std::uint32_t>());
    }

private:
    const ListBuilder& list_;
    FourCC type_;
    ByteCursor cursor_;
    std::uint32_t version_;
};

/// Returns a number of 64 bits without a sign.
Rational rationalOf(std::uint64_t number) {
    return Rational(static_cast<std::int64_t>(number >> 1)) * 2 + static_cast<std::int64_t>(number & 1);
}

/// Reads the list of one movie.
class MovieReader {
public:
    MovieReader(const ByteSource& movie, const std::string& file, const EditListOptions& options)
        : list_(file), options_(options), atoms_(movie, Container::QuickTime) {}

    EditList read() {
        const ContainerItem moov = require(first(atoms_, "moov"), "the movie has no header");
        movieTimescale_ = timescaleIn(require(child(moov, "mvhd"), "the movie's header has no timescale"));
        isInFragments_ = child(moov, "mvex").has_value();
        ItemWalk children = atoms_.inside(moov);
        while (const auto trak = nextOf(children, "trak"))
            if (isOfPictures(*trak)) {
                readTrack(*trak);
                return list_.take();
            }
        list_.fail("the movie has no track of pictures");
    }

private:
    /// Returns the next atom of a type that lies whole in its parent.
    static std::optional<ContainerItem> nextOf(ItemWalk& atoms, FourCC type) {
        while (const auto atom = atoms.next()) {
            if (!atom->fits(atoms.end()))
                break;
            if (atom->type == type)
                return atom;
        }
        return std::nullopt;
    }

    static std::optional<ContainerItem> first(ItemWalk atoms, FourCC type) { return nextOf(atoms, type); }

    std::optional<ContainerItem> child(const ContainerItem& parent, FourCC type) const {
        return first(atoms_.inside(parent), type);
    }

    ContainerItem require(const std::optional<ContainerItem>& atom, const char* sentence) const {
        if (!atom)
            list_.fail(sentence);
        return *atom;
    }

    Rational timescaleIn(const ContainerItem& header) const {
        AtomFields fields(list_, atoms_, header);
        fields.nextTime();
        fields.nextTime();
        const auto timescale = fields.next<std::uint32_t>();
        if (timescale == 0)
            list_.fail("the atom '" + header.type.text() + "' has a timescale of 0");
        return {timescale};
    }

    bool isOfPictures(const ContainerItem& trak) const {
        const auto media = child(trak, "mdia");
        const auto handler = media ? child(*media, "hdlr") : std::nullopt;
        if (!handler)
            return false;
        AtomFields fields(list_, atoms_, *handler);
        fields.next<std::uint32_t>();
        return FourCC(fields.next<std::uint32_t>()) == "vide";
    }

    void readTrack(const ContainerItem& trak) {
        const ContainerItem media = require(child(trak, "mdia"), "the track of pictures has no media");
        const Rational timescale =
            timescaleIn(require(child(media, "mdhd"), "the media of the track of pictures has no timescale"));
        const ContainerItem edits = require(child(trak, "edts"), "the track of pictures has no edit list");
        AtomFields fields(list_, atoms_, require(child(edits, "elst"), "the track of pictures has no edit list"));
        const auto count = fields.next<std::uint32_t>();
        for (std::uint32_t number = 1; number <= count; ++number) {
            list_.moveToFile();
            const std::uint64_t length = fields.nextTime();
            const std::int64_t time = fields.nextSignedTime();
            const auto rate = static_cast<std::int32_t>(fields.next<std::uint32_t>());
            list_.moveTo("edit", number);
            if (time < 0)
                list_.fail("it is empty, which an edit list cannot say");
            addEdit(Rational(time) / timescale, length, Rational(rate, 0x10000), isInFragments_ && number == count);
        }
    }

    /// The last edit of a movie in fragments has the length 0: it lasts until the end.
    void addEdit(const Rational& start, std::uint64_t length, const Rational& speed, bool canLastUntilTheEnd) {
        if (length != 0)
            list_.play(start, rationalOf(length) / movieTimescale_, speed);
        else if (!canLastUntilTheEnd)
            list_.fail("it has no length");
        else if (options_.duration)
            list_.keep(start, *options_.duration, speed);
        else
            list_.fail("it lasts until the end, and the duration of the recording is not known");
    }

    ListBuilder list_;
    const EditListOptions& options_;
    ItemWalk atoms_;
    Rational movieTimescale_;
    bool isInFragments_ = false;
};

} // namespace

EditList readMovieEditList(const ByteSource& movie, const std::string& file, const EditListOptions& options) {
    return MovieReader(movie, file, options).read();
}

} // namespace ZULMetaData::detail
