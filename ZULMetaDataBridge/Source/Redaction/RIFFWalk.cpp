#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <algorithm>
#include <array>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_formSize = 4; // the type of a list stands before its chunks

constexpr std::array<FourCC, 4> s_lists{"RIFF", "RF64", "BW64", "LIST"};
constexpr std::array<FourCC, 5> s_textLists{"INFO", "adtl", "exif", "PRMI", "ncdt"};
constexpr std::array<FourCC, 10> s_textChunks{"bext", "iXML", "axml", "aXML", "_PMX",
                                              "id3 ", "ID3 ", "DISP", "strn", "Titl"};
constexpr std::array<FourCC, 4> s_unusedChunks{"JUNK", "junk", "PAD ", "FLLR"};

class RIFFWalk {
public:
    explicit RIFFWalk(const ByteSource& file) : file_(file), chunks_(file, Container::Riff) {}

    MediaPlaces run() {
        forEach(chunks_, [this](const ContainerItem& item) {
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
        if (isOneOf(item.type, s_lists))
            visitList(item, path, depth);
        else if (isOneOf(item.type, s_textChunks))
            addTexts(item, path);
        else if (isOneOf(item.type, s_unusedChunks))
            addUnused(item, path);
    }

    void visitList(const ContainerItem& item, const std::string& path, int depth) {
        ItemWalk children = chunks_.inside(item);
        children.moveTo(item.payloadOffset() + s_formSize);
        const std::string formText = readBytes(file_, item.payloadOffset(), s_formSize);
        const FourCC form(static_cast<std::uint32_t>(bigEndianAt(formText, 0, s_formSize)));
        const std::string place = item.type == "LIST" ? path + ' ' + formText : path;
        if (form == "movi" || depth >= s_deepestLevel)
            return;
        const bool holdsTexts = item.type == "LIST" && isOneOf(form, s_textLists);
        if (holdsTexts)
            places_.places.push_back(blankedChunk(MediaPlace::Use::Text, place, item));
        forEach(children, [&](const ContainerItem& child) {
            const std::string childPath = place + '/' + shownType(child);
            if (holdsTexts)
                addTextsOf(child, childPath);
            else
                visit(child, childPath, depth + 1);
        });
    }

    void addTexts(const ContainerItem& item, const std::string& path) {
        places_.places.push_back(blankedChunk(MediaPlace::Use::Text, path, item));
        addTextsOf(item, path);
    }

    /// A chunk of a list of texts, and "strn", is one text; a label of a list "adtl" has the number of its mark before.
    void addTextsOf(const ContainerItem& item, const std::string& path) {
        const std::string payload = readBytes(file_, item.payloadOffset(), item.payloadSize());
        const bool isLabel = item.type == "labl" || item.type == "note";
        const bool isText = isLabel || item.type == "strn" || path.find("LIST INFO/") != std::string::npos;
        std::vector<std::string> texts =
            isText ? std::vector{decodedText(part(payload, isLabel ? 4 : 0))} : textRuns(payload);
        std::erase(texts, "");
        const auto role = item.type == "ISFT" ? MediaText::Role::Technical : MediaText::Role::Title;
        if (!texts.empty())
            places_.texts.push_back({role, path, item.offset, std::move(texts)});
    }

    void addUnused(const ContainerItem& item, const std::string& path) {
        if (!isBlank(file_, item))
            places_.places.push_back(blankedChunk(MediaPlace::Use::Unused, path, item));
    }

    const ByteSource& file_;
    ItemWalk chunks_;
    MediaPlaces places_;
};

} // namespace

MediaPlaces findPlacesInRIFF(const ByteSource& file) {
    return RIFFWalk(file).run();
}

} // namespace ZULMetaData::detail
