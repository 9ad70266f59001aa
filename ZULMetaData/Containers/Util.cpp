#include "ZULMetaData/Containers/Util.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/PositionedInput.h"
#include "ZULMetaData/StreamBufferAccess.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <fstream>
#include <span>

namespace ZULMetaData {

namespace {

bool overwrite(std::fstream& movie, std::uint64_t position, std::span<const char> bytes) {
    seekWritePos(movie, static_cast<std::int64_t>(position));
    movie.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    movie.flush();
    if (movie.good())
        return true;
    detail::StreamBufferAccess::discardPut(*movie.rdbuf()); // half of it may be written: the rest would follow twice
    return false;
}

/// `last` reaches to the end of the movie, `remaining` bytes on, and `previous` is the atom before it.
bool closeOpenAtom(std::fstream& movie, const ContainerItem& last, const ContainerItem& previous,
                   std::uint64_t remaining) {
    if (last.isExtended()) // as after an interrupted append
        return overwrite(movie, last.offset + detail::s_extendedSizeOffset, detail::bigEndianBytes(remaining));
    if (remaining <= 0xffffffff)
        return overwrite(movie, last.offset, detail::bigEndianBytes(static_cast<std::uint32_t>(remaining)));
    if (previous.size != detail::s_atomHeaderSize || previous.type != detail::s_spareAtom)
        return false;
    // The length stays what it was without the spare bytes that the header now begins in.
    return overwrite(movie, last.offset - detail::s_atomHeaderSize, detail::extendedAtomHeader(last.type, remaining));
}

} // namespace

bool Util::finalizeAtomsInFile(const std::string& path) {
    std::fstream movie;
    fileOpen(movie, path.c_str(), std::ios_base::in | std::ios_base::out | std::ios_base::binary);
    if (!movie.is_open())
        return false;
    const auto total = static_cast<std::uint64_t>(ParserUtil::calcFileSize(movie));
    detail::PositionedInput input(movie, 0, total);
    ContainerItem previous;
    while (input.position() < total) {
        ContainerItem atom;
        if (!readAtomHeader(input, detail::ExtendedSizes::Marked, atom))
            return false;
        if (atom.size == 0)
            return closeOpenAtom(movie, atom, previous, total - atom.offset);
        if (atom.end() <= atom.offset || !input.moveTo(atom.end()))
            return false;
        previous = atom;
    }
    return input.position() == total;
}

double Util::recordingScaleForMP4AtPath(const std::string& path) {
    struct LastValue final : DataStreamObserver<double> {
        bool dataRead(double, const double& value) override {
            scale = value;
            return true;
        }
        double scale = 1.0;
    } observer;
    if (const auto parser = MetaDataParser::create(path))
        parser->loadDataType<double>(s_recordingScaleFactorUUID, observer, -1);
    return observer.scale;
}

} // namespace ZULMetaData
