#include "ZULMetaData/Containers/RepairPlan.h"

#include "SharedDependencies/ZCAPHeader.h"
#include "ZULMetaData/ByteReader.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include <algorithm>
#include <optional>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::uint64_t s_largestShortSize = 0xffffffff;

/// The smallest `DATA` atom: one stream without entries.
constexpr std::uint64_t s_smallestStreamAtom = detail::s_extendedAtomHeaderSize + s_metaDataHeaderSize;

/// How much `Util::finalizeAtomsInFile` leaves out of the length of an atom that takes the spare atom in.
constexpr std::uint64_t s_shortBy = detail::s_atomHeaderSize;

/// Whether this library appends atoms like this one.
bool isOwn(const ContainerItem& atom) {
    return atom.isExtended() && (atom.holdsMetaData() || atom.holdsRecordingInfo());
}

/// Whether a movie that lacks a part of the atom may not play.
bool isMedia(const ContainerItem& atom) {
    return atom.type == "moov" || atom.type == "mdat" || atom.type == "moof";
}

std::string typeText(FourCC type) {
    return type.isPrintable() ? '\'' + type.text() + '\'' : "without a readable type";
}

std::string nameOf(const ContainerItem& atom) {
    return "the atom " + typeText(atom.type) + " at offset " + std::to_string(atom.offset);
}

std::string bytesText(std::uint64_t count) {
    return std::to_string(count) + (count == 1 ? " byte" : " bytes");
}

/// Whether these may be the first bytes of an atom that was cut short: whether people would name an atom by the last
/// four of them, with letters, digits, spaces or the copyright sign.
bool endsLikeHeader(const std::string& bytes) {
    const auto isUsual = [](char c) {
        return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == ' ' || c == '\xa9';
    };
    const std::string name = bytes.substr(sizeof(std::uint32_t));
    return std::all_of(name.begin(), name.end(), isUsual);
}

template <class Bytes>
std::string text(const Bytes& bytes) {
    return {bytes.data(), bytes.size()};
}

class Planner {
public:
    explicit Planner(const ByteSource& movie) : atoms_(movie, Container::QuickTime), total_(movie.size()) {
        atoms_.takeSizesLiterally();
    }

    RepairPlan plan() {
        walk();
        if (plan_.state == RepairPlan::Unrepairable)
            plan_.changes.clear();
        else if (!plan_.changes.empty())
            plan_.state = RepairPlan::Repairable;
        return std::move(plan_);
    }

private:
    std::string bytesAt(std::uint64_t position, std::uint64_t count) {
        return std::string(atoms_.reader().at(position, count));
    }

    /// A `DATA` atom as this library writes it, with its stream's header. Its end may lie anywhere after that.
    std::optional<ContainerItem> streamAtomAt(std::uint64_t position) {
        const auto atom = atoms_.itemAt(position);
        if (!atom || !atom->isExtended() || !atom->holdsStream() || atom->size < s_smallestStreamAtom ||
            atom->end() < atom->offset || total_ - position < s_smallestStreamAtom)
            return std::nullopt;
        return atom;
    }

    void change(std::uint64_t offset, std::string after, std::string reason) {
        std::string before = bytesAt(offset, after.empty() ? total_ - offset : after.size());
        plan_.changes.push_back({offset, std::move(before), std::move(after), std::move(reason)});
    }

    /// Makes an atom in extended form end at `end`.
    void changeEnd(const ContainerItem& atom, std::uint64_t end, std::string reason) {
        change(atom.offset + detail::s_extendedSizeOffset, text(detail::bigEndianBytes(end - atom.offset)),
               std::move(reason));
    }

    /// The first finding is the one that the others follow from.
    void find(const ContainerItem& atom, const std::string& what) {
        if (!plan_.finding.empty())
            return;
        plan_.finding = nameOf(atom) + " " + what;
        plan_.offset = atom.offset;
    }

    void findLastBytes(std::uint64_t begin, const std::string& what) {
        plan_.finding =
            "the last " + bytesText(total_ - begin) + ", from offset " + std::to_string(begin) + " on," + what;
        plan_.offset = begin;
    }

    void giveUp(const ContainerItem& atom, const std::string& what) {
        plan_.finding.clear();
        find(atom, what);
        plan_.state = RepairPlan::Unrepairable;
    }

    void lose(const std::string& what) {
        plan_.hasLoss = true;
        plan_.loss += (plan_.loss.empty() ? "" : "; ") + what;
    }

    void walk() {
        for (std::uint64_t position = 0; position < total_ && plan_.state == RepairPlan::Whole;) {
            const auto atom = atoms_.itemAt(position);
            if (!atom)
                return endInsideHeader(position);
            if (atom->sizeField == 0)
                return closeOpenEnd(*atom);
            if (atom->isExtended() && atom->size == 0)
                return closeInterruptedAppend(*atom);
            walkOver(*atom, position);
            previous_ = *atom;
        }
    }

    void endInsideHeader(std::uint64_t position) {
        const bool isAppend = beginsAppend(position) && (!isOwn(previous_) || isFollowedByStrayBytes());
        if (!isAppend && isFollowedByStrayBytes())
            return setStrayBytesAside(position);
        findLastBytes(position, isAppend ? " begin an atom that was never appended" : " do not hold an atom's header");
        if (!isAppend) {
            plan_.state = RepairPlan::Unrepairable;
            return;
        }
        const std::uint64_t sizeField = std::min(position + detail::s_extendedSizeOffset, total_);
        const std::string size = bytesAt(sizeField, total_ - sizeField);
        if (size.find_first_not_of('\0') != std::string::npos)
            lose("all of the atom but the beginning of its header is missing");
        change(position, {}, "The beginning of an atom that was never appended is cut off.");
    }

    /// Whether the bytes before the extended size, as many as there are, are those of this type.
    bool beginsHeader(std::uint64_t position, FourCC type) {
        const std::string bytes = bytesAt(position, std::min(total_ - position, detail::s_extendedSizeOffset));
        return !bytes.empty() && text(detail::extendedAtomHeader(type, 0)).starts_with(bytes);
    }

    /// Whether the file ends inside the header of an atom of this library.
    bool beginsAppend(std::uint64_t position) {
        return position > 0 &&
               (beginsHeader(position, detail::s_metaDataAtom) || beginsHeader(position, detail::s_recordingInfoAtom));
    }

    /// Whether what follows the atom before belongs to nothing: the atom is one of this library, and its contents end
    /// where it does. If its size were wrong, its own streams would follow it.
    bool isFollowedByStrayBytes() {
        if (!isOwn(previous_) || previous_.holdsRecordingInfo())
            return isOwn(previous_) && previous_.size == detail::s_extendedAtomHeaderSize + sizeof(ZCAPHeader);
        std::uint64_t end = previous_.offset + detail::s_extendedAtomHeaderSize;
        while (end < previous_.end()) {
            const auto stream = streamAtomAt(end);
            if (!stream)
                return false;
            end = stream->end();
        }
        return end == previous_.end();
    }

    /// Mends a last atom that does not fit into the file, if the atom or the one before it belongs to this library: a
    /// movie plays whatever stands there. Returns false for any other atom.
    bool mendTail(const ContainerItem& last) {
        if (isOwn(last) && last.size >= last.headerSize && last.offset > 0)
            closeCutTail(last);
        else if (isFollowedByStrayBytes() && !isMedia(last) && !isOwn(last))
            setStrayBytesAside(last.offset);
        else
            return false;
        return true;
    }

    std::string cutShort(const ContainerItem& atom) const {
        return "declares " + bytesText(atom.size) + ", but the file ends after " + std::to_string(total_ - atom.offset);
    }

    void closeCutTail(const ContainerItem& last) {
        find(last, cutShort(last));
        if (last.holdsMetaData()) {
            closeMetaData(last);
            if (!plan_.hasLoss)
                lose("the streams that followed its last one are missing");
            return;
        }
        lose("the name and the versions in it are incomplete and are dropped");
        setAside(last.offset, "an atom that was cut short");
    }

    void setStrayBytesAside(std::uint64_t begin) {
        findLastBytes(begin, " belong to no atom");
        setAside(begin, "no atom");
    }

    void walkOver(const ContainerItem& atom, std::uint64_t& position) {
        const bool fits = atom.size >= atom.headerSize && atom.fits(total_);
        if (!fits && mendTail(atom)) {
            position = total_;
            return;
        }
        if (atom.size < atom.headerSize)
            return giveUp(atom, "declares " + bytesText(atom.size) + ", which its own header does not fit in");
        if (!fits)
            return giveUp(atom, cutShort(atom));
        position = atom.end();
        if (plan_.state == RepairPlan::Whole && isLeftShort(atom)) {
            find(atom, "was given a length that leaves out its last 8 bytes");
            position += s_shortBy;
            changeEnd(atom, position, "The length takes in the last 8 bytes of the media.");
        }
    }

    /// Whether an atom, after which the walk can go on, was repaired to 8 bytes less than it has. It is then followed
    /// by 8 bytes of media, and these by the end of the file or by what was appended.
    bool isLeftShort(const ContainerItem& atom) {
        if (!atom.isExtended() || atom.size <= s_largestShortSize || total_ - atom.end() < s_shortBy)
            return false;
        const std::string spare = bytesAt(atom.end(), s_shortBy);
        if (spare.starts_with(text(detail::bigEndianBytes(static_cast<std::uint32_t>(s_shortBy)))))
            return false; // a small atom as good as any
        const std::uint64_t end = atom.end() + s_shortBy;
        return end < total_ ? isAppended(end) : !endsLikeHeader(spare);
    }

    /// Whether something that this library appends stands here.
    bool isAppended(std::uint64_t position) {
        const auto atom = atoms_.itemAt(position);
        if (!atom || !isOwn(*atom))
            return false;
        return atom->size == 0 || (atom->size >= atom->headerSize && atom->fits(total_));
    }

    void closeOpenEnd(const ContainerItem& last) {
        const std::uint64_t length = total_ - last.offset;
        if (!last.type.isPrintable() && last.offset == 0)
            return giveUp(last, "has an open end: the file does not begin like a movie");
        if (isOwn(previous_) && !isFollowedByStrayBytes())
            return giveUp(last, "has an open end, and the metadata before it ends in the middle of a stream");
        if (!last.type.isPrintable())
            return setStrayBytesAside(last.offset);
        if (length <= s_largestShortSize) {
            find(last, "has an open end");
            return change(last.offset, text(detail::bigEndianBytes(static_cast<std::uint32_t>(length))),
                          "The atom " + typeText(last.type) + " ends where the file does.");
        }
        if (previous_.type != detail::s_spareAtom || previous_.size != detail::s_atomHeaderSize)
            return giveUp(last, "has an open end, and its " + bytesText(length) +
                                    " do not fit in a 32-bit size; there is no spare 'wide' atom before it");
        find(last, "has an open end");
        change(previous_.offset, text(detail::extendedAtomHeader(last.type, length + previous_.size)),
               "The atom " + typeText(last.type) +
                   " takes in the spare 'wide' atom for a 64-bit size, and ends where the file does.");
    }

    void closeInterruptedAppend(const ContainerItem& last) {
        find(last, "was appended, but never given its size");
        if (last.holdsMetaData())
            return closeMetaData(last);
        changeEnd(last, total_, "The atom " + typeText(last.type) + " ends where the file does.");
    }

    void closeMetaData(const ContainerItem& metaData) {
        const std::uint64_t end = endOfWholeStreams(metaData);
        if (end < total_)
            setAside(end, "an entry that was cut short");
        changeEnd(metaData, end,
                  end < total_ ? "The atom 'ZULM' ends after its last whole entry."
                               : "The atom 'ZULM' ends where the file does.");
    }

    /// Returns the end of the children that are whole or can be made so, or the end of the file if that is not certain.
    std::uint64_t endOfWholeStreams(const ContainerItem& metaData) {
        std::uint64_t position = metaData.offset + metaData.headerSize;
        while (position < total_) {
            const auto stream = streamAtomAt(position);
            if (!stream) {
                lose("the " + bytesText(total_ - position) + " from offset " + std::to_string(position) +
                     " on do not hold a whole stream");
                return beginsStreamAtom(position) ? position : total_;
            }
            if (!stream->fits(total_))
                return endOfTornStream(*stream);
            position = stream->end();
        }
        return total_;
    }

    /// Whether the file ends inside the first bytes of a `DATA` atom. Others may be a stream's, and are left alone.
    bool beginsStreamAtom(std::uint64_t position) {
        return total_ - position < s_smallestStreamAtom && beginsHeader(position, detail::s_streamAtom);
    }

    std::uint64_t endOfTornStream(const ContainerItem& stream) {
        const std::uint64_t payload = stream.offset + stream.headerSize;
        const auto extent = measureStream(atoms_.source().part(payload));
        const std::uint64_t end = payload + (extent ? extent->wholeBytes : 0);
        const bool isFollowed = !extent || streamAtomAt(end);
        lose(!extent      ? "the last stream has no whole header"
             : isFollowed ? "a stream at offset " + std::to_string(payload) + " counts bytes that are not there"
                          : "the stream of the kind " + metaDataKindName(extent->header.uuid) + " ends after " +
                                std::to_string(extent->entries) + (extent->entries == 1 ? " entry" : " entries"));
        if (isFollowed)
            return total_; // its length counts a torn tail that is not there, and more streams follow
        changeEnd(stream, end, "The last stream ends after its last whole entry.");
        return end;
    }

    /// A reader takes the bytes of an entry that was cut short from whatever follows it: nothing of it may stay after
    /// the last whole one.
    void setAside(std::uint64_t begin, const std::string& what) {
        const std::uint64_t count = total_ - begin;
        const std::string subject = "The bytes of " + what;
        if (count < detail::s_atomHeaderSize)
            return change(begin, {}, subject + " are cut off.");
        std::string header = count > s_largestShortSize
                                 ? text(detail::extendedAtomHeader(detail::s_freeAtom, count))
                                 : text(detail::atomHeader(detail::s_freeAtom, static_cast<std::uint32_t>(count)));
        change(begin, std::move(header), subject + " become a 'free' atom.");
    }

    ItemWalk atoms_;
    std::uint64_t total_;
    ContainerItem previous_; ///< the atom before the one that is looked at; of size 0 at the beginning
    RepairPlan plan_;
};

} // namespace

RepairPlan planRepair(const ByteSource& movie) {
    return Planner(movie).plan();
}

} // namespace ZULMetaData
