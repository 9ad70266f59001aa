#include "ZULMetaData/Containers/ContainerRecognition.h"

#include "ZULMetaData/ByteReader.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include <algorithm>
#include <array>
#include <cstring>

namespace ZULMetaData {

namespace {

constexpr std::array<FourCC, 3> s_riffSignatures{"RIFF", "RF64", "BW64"};

/// What movies begin with. Any other printable type may be the beginning of a text.
constexpr std::array<FourCC, 20> s_firstAtoms{"ftyp",
                                              "styp",
                                              "moov",
                                              "moof",
                                              "mdat",
                                              "skip",
                                              "pnot",
                                              "sidx",
                                              "ssix",
                                              "prft",
                                              "emsg",
                                              "uuid",
                                              "meta",
                                              "udta",
                                              "pdin",
                                              detail::s_freeAtom,
                                              detail::s_spareAtom,
                                              detail::s_fragmentIndexAtom,
                                              detail::s_metaDataAtom,
                                              detail::s_recordingInfoAtom};

struct ForeignSignature {
    std::string_view bytes;
    std::string_view name;
};

using namespace std::string_view_literals;

constexpr std::array s_foreignSignatures{
    ForeignSignature{"OggS"sv, "an Ogg file"},
    ForeignSignature{"FLV\x01"sv, "an FLV file"},
    ForeignSignature{"\x30\x26\xb2\x75\x8e\x66\xcf\x11"sv, "an ASF file (WMV or WMA)"},
    ForeignSignature{"\0\0\1\xba"sv, "an MPEG program stream"},
    ForeignSignature{"\0\0\1\xb3"sv, "an MPEG video stream"},
    ForeignSignature{"\x06\x0e\x2b\x34\x02\x05\x01\x01"sv, "an MXF file"},
    ForeignSignature{"RIFX"sv, "a big-endian RIFF file (RIFX)"},
    ForeignSignature{"riff\x2e\x91\xcf\x11"sv, "a Wave64 file"},
    ForeignSignature{"FORM"sv, "an IFF file (such as AIFF)"},
    ForeignSignature{"caff"sv, "a CAF file"},
    ForeignSignature{".snd"sv, "an AU file"},
    ForeignSignature{".RMF"sv, "a RealMedia file"},
    ForeignSignature{"DKIF"sv, "an IVF file"},
    ForeignSignature{"fLaC"sv, "a FLAC file"},
    ForeignSignature{"ID3"sv, "an MP3 file"},
    ForeignSignature{"GIF8"sv, "a GIF image"},
    ForeignSignature{"\x89PNG"sv, "a PNG image"},
    ForeignSignature{"\xff\xd8\xff"sv, "a JPEG image"},
};

/// All identifiers share everything but their first group.
bool beginsLikeStream(std::string_view bytes) {
    constexpr std::size_t firstGroup = 4;
    if (bytes.size() < sizeof(uuid))
        return false;
    return std::memcmp(bytes.data() + firstGroup, s_cursorImageUUID.data + firstGroup, sizeof(uuid) - firstGroup) == 0;
}

template <std::size_t size>
bool isOneOf(FourCC type, const std::array<FourCC, size>& types) {
    return std::find(types.begin(), types.end(), type) != types.end();
}

/// The header of the first atom. It may be cut short, except for its type and its 32-bit size; the latter is the type
/// if the header is that of a chunk.
struct FirstItem {
    explicit FirstItem(std::string_view bytes) : isThere(bytes.size() >= detail::s_atomHeaderSize) {
        detail::ByteReader reader(ByteSource::memory(bytes));
        detail::ByteCursor cursor(reader, 0, bytes.size());
        readAtomHeader(cursor, detail::ExtendedSizes::Marked, atom);
    }

    bool isRIFF() const { return isThere && isOneOf(FourCC(atom.sizeField), s_riffSignatures); }
    bool isAtom() const {
        return isThere && (atom.sizeField >= detail::s_atomHeaderSize || atom.sizeField == 0 ||
                           atom.sizeField == detail::s_extendedSizeMarker);
    }
    bool isKnownAtom() const { return isAtom() && isOneOf(atom.type, s_firstAtoms); }
    bool isPrintableAtom() const { return isAtom() && isPrintable(); }
    bool fits(std::uint64_t fileSize) const {
        return isThere && atom.sizeField >= detail::s_atomHeaderSize && atom.sizeField <= fileSize;
    }
    bool isPrintable() const { return isThere && atom.type.isPrintable(); }

    bool isThere;
    ContainerItem atom;
};

std::string_view matroskaName(std::string_view bytes) {
    if (!bytes.starts_with("\x1a\x45\xdf\xa3"))
        return {};
    return bytes.find("webm") < s_recognitionBytes ? "a WebM file" : "a Matroska file";
}

/// Packets of 188 bytes begin with the same byte; some files have four more before each.
bool isTransportStream(std::string_view bytes) {
    constexpr std::size_t packet = 188;
    for (const std::size_t extra : {std::size_t{0}, std::size_t{4}}) {
        const auto isSync = [&](std::size_t i) { return bytes[extra + i * (packet + extra)] == 'G'; };
        if (bytes.size() > extra + 2 * (packet + extra) && isSync(0) && isSync(1) && isSync(2))
            return true;
    }
    return false;
}

std::string_view foreignNameOf(std::string_view bytes) {
    if (const std::string_view matroska = matroskaName(bytes); !matroska.empty())
        return matroska;
    const auto found = std::find_if(s_foreignSignatures.begin(), s_foreignSignatures.end(),
                                    [&](const ForeignSignature& foreign) { return bytes.starts_with(foreign.bytes); });
    if (found != s_foreignSignatures.end())
        return found->name;
    return isTransportStream(bytes) ? "an MPEG transport stream" : std::string_view();
}

/// What the bytes are, if an atom like `isMovie` begins a movie.
Container::Type typeOf(std::string_view bytes, bool (FirstItem::*isMovie)() const) {
    if (beginsLikeStream(bytes))
        return Container::RawStream;
    const FirstItem item(bytes);
    if (item.isRIFF())
        return Container::Riff;
    return (item.*isMovie)() ? Container::QuickTime : Container::Unknown;
}

/// The type of a file whose first bytes say little.
Container::Type typeByName(std::string_view bytes, std::uint64_t fileSize, Container::Type named) {
    const FirstItem item(bytes);
    switch (named) {
    case Container::RawStream: return named;
    case Container::Riff: return item.isThere ? Container::Unknown : named;
    case Container::QuickTime:
        return !item.isThere || item.isPrintable() || item.fits(fileSize) ? named : Container::Unknown;
    default: break;
    }
    const bool fits = item.isPrintableAtom() && item.atom.sizeField <= fileSize;
    return fits ? Container::QuickTime : Container::Unknown;
}

} // namespace

Container::Type streamTypeOfContents(std::string_view firstBytes) {
    return typeOf(firstBytes, &FirstItem::isPrintableAtom);
}

std::string_view extensionFor(Container::Type type) {
    switch (type) {
    case Container::Riff: return ".avi";
    case Container::QuickTime: return ".mp4";
    case Container::RawStream: return ".dat";
    default: return "";
    }
}

std::string RecognizedContainer::refusal() const {
    if (!foreignName.empty())
        return "is " + std::string(foreignName) +
               "; recording metadata is in movies (MP4, QuickTime), RIFF files (AVI, WAV) and stream files alone";
    std::string text = "begins neither like a movie, nor a RIFF file, nor a stream";
    return contradictsName ? text += ", although its name says so" : text;
}

RecognizedContainer recognizeContainer(std::string_view firstBytes, std::uint64_t fileSize, const std::string& name) {
    const Container::Type named = MetaDataParser::streamTypeOf(name);
    RecognizedContainer recognized;
    recognized.type = typeOf(firstBytes, &FirstItem::isKnownAtom);
    if (recognized.type == Container::Unknown)
        recognized.foreignName = foreignNameOf(firstBytes);
    if (recognized.type == Container::Unknown && recognized.foreignName.empty())
        recognized.type = typeByName(firstBytes, fileSize, named);
    recognized.contradictsName = named != Container::Unknown && named != recognized.type;
    return recognized;
}

RecognizedContainer recognizeContainer(const ByteSource& file, const std::string& name) {
    std::array<char, s_recognitionBytes> first;
    const std::size_t count = file.read(0, first);
    return recognizeContainer({first.data(), count}, file.size(), name);
}

} // namespace ZULMetaData
