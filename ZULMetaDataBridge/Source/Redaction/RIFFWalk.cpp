#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include "ZULMetaData/Containers/AtomFormat.h"

#include <algorithm>
#include <array>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_formSize = 4; // the type of a list stands before its chunks

constexpr std::array<FourCC, 4> s_lists{"RIFF", "RF64", "BW64", "LIST"};
constexpr std::array<FourCC, 5> s_textLists{"INFO", "adtl", "exif", "PRMI", "ncdt"};
constexpr std::array<FourCC, 10> s_textChunks{"bext", "iXML", "axml", "aXML", "_PMX",
                                              "id3 ", "ID3 ", "DISP", "strn", "Titl"};
constexpr std::array<FourCC, 4> s_unusedChunks{s_junkChunk, "junk", "PAD ", "FLLR"};

class RIFFWalk : PlaceWalk {
public:
    explicit RIFFWalk(const ByteSource& file) : PlaceWalk(file, Container::Riff) {}

    MediaPlaces run() {
        forEach(items_, [this](const ContainerItem& item) {
            if (isOneOf(item.type, s_lists))
                visit(item, shownType(item), 0);
            else if (!item.holdsMetaData())
                addUnused(item, shownType(item));
        });
        return std::move(places_);
    }

private:
    /// A size that a recorder could not know reaches to the end.
    template <class Visit>
    static void forEach(ItemWalk chunks, Visit visit) {
        while (auto chunk = chunks.next()) {
            chunk->size = std::min(chunk->size, chunks.end() - chunk->offset);
            visit(*chunk);
        }
    }

    void visit(const ContainerItem& item, const std::string& path, int depth) {
        if (isOneOf(item.type, s_lists)) {
            visitList(item, path, depth);
        } else if (isOneOf(item.type, s_textChunks)) {
            addPlace(MediaPlace::Use::Text, item, path);
            addTextsOf(item, path);
        } else if (isOneOf(item.type, s_unusedChunks)) {
            addUnused(item, path);
        }
    }

    void visitList(const ContainerItem& item, const std::string& path, int depth) {
        ItemWalk children = items_.inside(item);
        children.moveTo(item.payloadOffset() + s_formSize);
        const std::string formText = readBytes(file_, item.payloadOffset(), s_formSize);
        const FourCC form(static_cast<std::uint32_t>(bigEndianAt(formText, 0, s_formSize)));
        const std::string place = item.type == "LIST" ? path + ' ' + formText : path;
        if (form == "movi" || depth >= s_deepestLevel)
            return;
        const bool holdsTexts = item.type == "LIST" && isOneOf(form, s_textLists);
        if (holdsTexts)
            addPlace(MediaPlace::Use::Text, item, place);
        forEach(children, [&](const ContainerItem& child) {
            const std::string childPath = place + '/' + shownType(child);
            if (holdsTexts)
                addTextsOf(child, childPath);
            else
                visit(child, childPath, depth + 1);
        });
    }

    /// A chunk of a list of texts, and "strn", is one text; a label of a list "adtl" has the number of its mark before.
    void addTextsOf(const ContainerItem& item, const std::string& path) {
        const std::string payload = payloadOf(item);
        const bool isLabel = item.type == "labl" || item.type == "note";
        const bool isText = isLabel || item.type == "strn" || path.find("LIST INFO/") != std::string::npos;
        const auto role = item.type == "ISFT" ? MediaText::Role::Technical : MediaText::Role::Title;
        addTexts(role, item, path,
                 isText ? std::vector{decodedText(part(payload, isLabel ? 4 : 0))} : textRuns(payload));
    }
};

} // namespace

MediaPlaces findPlacesInRIFF(const ByteSource& file) {
    return RIFFWalk(file).run();
}

} // namespace ZULMetaData::detail
