#include "ZULMetaData/RepairPlan.h"

#include "ZULMetaData/AtomFormat.h"
#include "ZULMetaData/PositionedInput.h"
#include "ZULMetaData/StreamExtent.h"

#include <algorithm>
#include <optional>
#include <span>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::uint64_t s_largestShortSize = 0xffffffff;

/// The smallest `DATA` atom: one stream without entries.
constexpr std::uint64_t s_smallestStreamAtom = detail::s_extendedAtomHeaderSize + s_metaDataHeaderSize;

/// How much `Util::finalizeAtomsInFile` leaves out of the length of an atom that takes the spare atom in.
constexpr std::uint64_t s_shortBy = detail::s_atomHeaderSize;

struct Atom {
    std::uint64_t start = 0;
    std::uint64_t size = 0; ///< as declared
    std::uint32_t shortSize = 0;
    std::uint32_t type = 0;

    bool isExtended() const { return shortSize == detail::s_extendedSizeMarker; }
    bool hasOpenEnd() const { return shortSize == 0; }
    std::uint64_t headerSize() const {
        return isExtended() ? detail::s_extendedAtomHeaderSize : detail::s_atomHeaderSize;
    }
    std::uint64_t end() const { return start + size; }
    std::uint64_t sizeField() const { return start + detail::s_extendedSizeOffset; }
};

std::string typeText(std::uint32_t type) {
    const auto characters = detail::bigEndianBytes(type);
    const auto isPlain = [](char c) { return c >= ' ' && c <= '~'; };
    if (!std::all_of(characters.begin(), characters.end(), isPlain))
        return "without a readable type";
    std::string text(1, '\'');
    text.append(characters.data(), characters.size());
    return text += '\'';
}

std::string nameOf(const Atom& atom) {
    return "the atom " + typeText(atom.type) + " at offset " + std::to_string(atom.start);
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
    explicit Planner(std::istream& movie) : input_(movie, 0, sizeOf(movie)), total_(input_.total()) {}

    RepairPlan plan() {
        walk();
        if (plan_.state == RepairPlan::Unrepairable)
            plan_.changes.clear();
        else if (!plan_.changes.empty())
            plan_.state = RepairPlan::Repairable;
        return std::move(plan_);
    }

private:
    /// Leaves it at its start.
    static std::uint64_t sizeOf(std::istream& movie) {
        movie.clear();
        movie.seekg(0);
        return sizeOfInput(movie);
    }

    void walk();
    void walkOver(const Atom& atom, std::uint64_t& position);
    void endInsideHeader(std::uint64_t position);
    bool beginsAppend(std::uint64_t position);

    void closeOpenEnd(const Atom& last, const Atom& previous);
    void closeInterruptedAppend(const Atom& last);
    void closeInterruptedMetaData(const Atom& metaData);
    std::uint64_t endOfWholeStreams(const Atom& metaData);
    std::uint64_t endOfTornStream(const Atom& stream);
    void setAside(std::uint64_t begin);

    bool isLeftShort(const Atom& atom);
    bool isAppended(std::uint64_t position);
    bool beginsStreamAtom(std::uint64_t position);

    std::size_t read(std::uint64_t position, std::span<char> bytes);
    std::string bytesAt(std::uint64_t position, std::uint64_t count);
    std::optional<Atom> atomAt(std::uint64_t position);
    std::optional<Atom> streamAtomAt(std::uint64_t position);

    void change(std::uint64_t offset, std::string after, std::string reason);
    void find(const Atom& atom, const std::string& what);
    void giveUp(const Atom& atom, const std::string& what);

    detail::PositionedInput input_;
    std::uint64_t total_;
    RepairPlan plan_;
};

/// As `ReadBytes`, by the input that the walk goes on with.
std::size_t Planner::read(std::uint64_t position, std::span<char> bytes) {
    const std::uint64_t left = total_ - std::min(position, total_);
    const auto size = static_cast<std::size_t>(std::min<std::uint64_t>(bytes.size(), left));
    return input_.moveTo(position) && input_.read(bytes.data(), size) ? size : 0;
}

std::string Planner::bytesAt(std::uint64_t position, std::uint64_t count) {
    std::string bytes(static_cast<std::size_t>(count), '\0');
    bytes.resize(read(position, bytes));
    return bytes;
}

/// None where the file ends inside the header.
std::optional<Atom> Planner::atomAt(std::uint64_t position) {
    Atom atom;
    atom.start = position;
    if (!input_.moveTo(position) || !input_.readBigEndian(atom.shortSize) || !input_.readBigEndian(atom.type))
        return std::nullopt;
    atom.size = atom.shortSize;
    if (atom.isExtended() && !input_.readBigEndian(atom.size))
        return std::nullopt;
    return atom;
}

/// A `DATA` atom as this library writes it, with its stream's header. Its end may lie anywhere behind that.
std::optional<Atom> Planner::streamAtomAt(std::uint64_t position) {
    const auto atom = atomAt(position);
    if (!atom || !atom->isExtended() || atom->type != detail::s_streamAtom || atom->size < s_smallestStreamAtom ||
        atom->end() < atom->start || total_ - position < s_smallestStreamAtom)
        return std::nullopt;
    return atom;
}

void Planner::change(std::uint64_t offset, std::string after, std::string reason) {
    std::string before = bytesAt(offset, after.empty() ? total_ - offset : after.size());
    plan_.changes.push_back({offset, std::move(before), std::move(after), std::move(reason)});
}

/// The first finding is the one that the others follow from.
void Planner::find(const Atom& atom, const std::string& what) {
    if (!plan_.finding.empty())
        return;
    plan_.finding = nameOf(atom) + " " + what;
    plan_.offset = atom.start;
}

void Planner::giveUp(const Atom& atom, const std::string& what) {
    plan_.finding.clear();
    find(atom, what);
    plan_.state = RepairPlan::Unrepairable;
}

void Planner::walk() {
    Atom previous;
    for (std::uint64_t position = 0; position < total_ && plan_.state == RepairPlan::Whole;) {
        const auto atom = atomAt(position);
        if (!atom)
            return endInsideHeader(position);
        if (atom->hasOpenEnd())
            return closeOpenEnd(*atom, previous);
        if (atom->isExtended() && atom->size == 0)
            return closeInterruptedAppend(*atom);
        walkOver(*atom, position);
        previous = *atom;
    }
}

void Planner::endInsideHeader(std::uint64_t position) {
    const bool isAppend = beginsAppend(position);
    plan_.offset = position;
    plan_.finding = "the last " + bytesText(total_ - position) + ", from offset " + std::to_string(position) + " on, " +
                    (isAppend ? "begin an atom that was never appended" : "do not hold an atom's header");
    if (isAppend)
        change(position, {}, "The beginning of an atom that was never appended is cut off.");
    else
        plan_.state = RepairPlan::Unrepairable;
}

/// Whether the file ends inside the header that this library was writing behind the movie.
bool Planner::beginsAppend(std::uint64_t position) {
    const std::string rest = bytesAt(position, std::min(total_ - position, detail::s_extendedAtomHeaderSize));
    return position > 0 && !rest.empty() &&
           (text(detail::extendedAtomHeader(detail::s_metaDataAtom, 0)).starts_with(rest) ||
            text(detail::extendedAtomHeader(detail::s_recordingInfoAtom, 0)).starts_with(rest));
}

void Planner::walkOver(const Atom& atom, std::uint64_t& position) {
    if (atom.size < atom.headerSize())
        return giveUp(atom, "declares " + bytesText(atom.size) + ", which its own header does not fit in");
    if (atom.size > total_ - atom.start)
        return giveUp(atom, "declares " + bytesText(atom.size) + ", but the file ends after " +
                                std::to_string(total_ - atom.start));
    position = atom.end();
    if (plan_.state == RepairPlan::Whole && isLeftShort(atom)) {
        find(atom, "was given a length that leaves out its last 8 bytes");
        change(atom.sizeField(), text(detail::bigEndianBytes(atom.size + s_shortBy)),
               "The length takes in the last 8 bytes of the media.");
        position += s_shortBy;
    }
}

/// Whether an atom, which the walk can go on behind, was repaired to 8 bytes less than it has. Behind it are then 8
/// bytes of media, and after them the end of the file or what was appended.
bool Planner::isLeftShort(const Atom& atom) {
    if (!atom.isExtended() || atom.size <= s_largestShortSize || total_ - atom.end() < s_shortBy)
        return false;
    const std::string spare = bytesAt(atom.end(), s_shortBy);
    if (spare.starts_with(text(detail::bigEndianBytes(static_cast<std::uint32_t>(s_shortBy)))))
        return false; // a small atom as good as any
    const std::uint64_t end = atom.end() + s_shortBy;
    return end < total_ ? isAppended(end) : !endsLikeHeader(spare);
}

/// Whether something that this library appends stands here.
bool Planner::isAppended(std::uint64_t position) {
    const auto atom = atomAt(position);
    if (!atom || !atom->isExtended() ||
        (atom->type != detail::s_metaDataAtom && atom->type != detail::s_recordingInfoAtom))
        return false;
    return atom->size == 0 || (atom->size >= atom->headerSize() && atom->size <= total_ - position);
}

void Planner::closeOpenEnd(const Atom& last, const Atom& previous) {
    const std::uint64_t length = total_ - last.start;
    if (length <= s_largestShortSize) {
        find(last, "has an open end");
        return change(last.start, text(detail::bigEndianBytes(static_cast<std::uint32_t>(length))),
                      "The atom " + typeText(last.type) + " ends where the file does.");
    }
    if (previous.type != detail::s_spareAtom || previous.size != detail::s_atomHeaderSize)
        return giveUp(last, "has an open end, and its " + bytesText(length) +
                                " do not fit in a 32-bit size; no spare 'wide' atom stands in front of it");
    find(last, "has an open end");
    change(previous.start, text(detail::extendedAtomHeader(last.type, length + previous.size)),
           "The atom " + typeText(last.type) +
               " takes in the spare 'wide' atom for a 64-bit size, and ends where the file does.");
}

void Planner::closeInterruptedAppend(const Atom& last) {
    find(last, "was appended, but never given its size");
    if (last.type == detail::s_metaDataAtom)
        return closeInterruptedMetaData(last);
    change(last.sizeField(), text(detail::bigEndianBytes(total_ - last.start)),
           "The atom " + typeText(last.type) + " ends where the file does.");
}

void Planner::closeInterruptedMetaData(const Atom& metaData) {
    const std::uint64_t end = endOfWholeStreams(metaData);
    if (end < total_)
        setAside(end);
    change(metaData.sizeField(), text(detail::bigEndianBytes(end - metaData.start)),
           end < total_ ? "The atom 'ZULM' ends behind its last whole entry."
                        : "The atom 'ZULM' ends where the file does.");
}

/// Up to where the atom's children are whole or can be made so; the whole file where that is not certain.
std::uint64_t Planner::endOfWholeStreams(const Atom& metaData) {
    std::uint64_t position = metaData.start + metaData.headerSize();
    while (position < total_) {
        const auto stream = streamAtomAt(position);
        if (!stream) {
            plan_.hasLoss = true;
            return beginsStreamAtom(position) ? position : total_;
        }
        if (stream->size > total_ - position)
            return endOfTornStream(*stream);
        position = stream->end();
    }
    return total_;
}

/// Whether the file ends inside the first bytes of a `DATA` atom. Others may be a stream's, and are left alone.
bool Planner::beginsStreamAtom(std::uint64_t position) {
    const std::uint64_t left = total_ - position;
    const auto header = detail::extendedAtomHeader(detail::s_streamAtom, 0);
    const auto known = static_cast<std::size_t>(std::min<std::uint64_t>(left, detail::s_extendedSizeOffset));
    return left < s_smallestStreamAtom && bytesAt(position, known) == std::string(header.data(), known);
}

std::uint64_t Planner::endOfTornStream(const Atom& stream) {
    plan_.hasLoss = true;
    const std::uint64_t payload = stream.start + stream.headerSize();
    const auto readPayload = [&](std::uint64_t position, std::span<char> bytes) {
        return read(payload + position, bytes);
    };
    const auto extent = measureStream(readPayload, total_ - payload);
    const std::uint64_t end = payload + (extent ? extent->wholeBytes : 0);
    if (!extent || streamAtomAt(end))
        return total_; // its length counts a torn tail that is not there, and more streams follow
    change(stream.sizeField(), text(detail::bigEndianBytes(end - stream.start)),
           "The last stream ends behind its last whole entry.");
    return end;
}

/// A reader takes the bytes of an entry that was cut short from whatever follows it: nothing of it may stay behind
/// the last whole one.
void Planner::setAside(std::uint64_t begin) {
    const std::uint64_t count = total_ - begin;
    if (count < detail::s_atomHeaderSize)
        return change(begin, {}, "The bytes of an entry that was cut short are cut off.");
    std::string header = text(detail::extendedAtomHeader(detail::s_freeAtom, count));
    if (count <= s_largestShortSize)
        header = text(detail::bigEndianBytes(static_cast<std::uint32_t>(count))) +
                 text(detail::bigEndianBytes(detail::s_freeAtom));
    change(begin, std::move(header), "The bytes of an entry that was cut short become a 'free' atom.");
}

} // namespace

RepairPlan planRepair(std::istream& movie) {
    RepairPlan plan = Planner(movie).plan();
    requireReadable(movie);
    return plan;
}

} // namespace ZULMetaData
