#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <algorithm>
#include <array>
#include <string_view>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_formSize = 4; // the type of a list stands before its chunks

constexpr std::array<std::string_view, 4> s_lists{"RIFF", "RF64", "BW64", "LIST"};
constexpr std::array<std::string_view, 5> s_textLists{"INFO", "adtl", "exif", "PRMI", "ncdt"};
constexpr std::array<std::string_view, 10> s_textChunks{"bext", "iXML", "axml", "aXML", "_PMX",
                                                        "id3 ", "ID3 ", "DISP", "strn", "Titl"};
constexpr std::array<std::string_view, 4> s_unusedChunks{"JUNK", "junk", "PAD ", "FLLR"};

class RIFFWalk {
public:
    explicit RIFFWalk(std::istream& file) : file_(file), read_(readingFrom(file)), total_(sizeOfInput(file)) {}

    MediaPlaces run() {
        for (const ContainerItem& item : inside(listTopLevel(file_, Container::Riff), total_)) {
            if (isOneOf(item.type, s_lists))
                visit(item, shownType(item), 0);
            else if (!item.holdsMetaData())
                addUnused(item, shownType(item));
        }
        return std::move(places_);
    }

private:
    std::vector<ContainerItem> itemsIn(std::uint64_t begin, std::uint64_t end) {
        return inside(listChunks(file_, begin, end, total_), end);
    }

    /// A size that a recorder could not know reaches to the end.
    std::vector<ContainerItem> inside(std::vector<ContainerItem> items, std::uint64_t end) {
        requireReadable(file_);
        for (ContainerItem& item : items)
            item.size = std::min(item.size, end - item.offset);
        return items;
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
        const std::string form = readBytes(read_, item.payloadOffset(), s_formSize, s_formSize);
        const std::string place = item.type == "LIST" ? path + ' ' + form : path;
        if (form == "movi" || depth >= s_deepestLevel)
            return;
        const bool holdsTexts = item.type == "LIST" && isOneOf(form, s_textLists);
        if (holdsTexts)
            places_.places.push_back(blankedChunk(MediaPlace::Use::Text, place, item));
        for (const ContainerItem& child : itemsIn(item.payloadOffset() + s_formSize, item.end())) {
            const std::string childPath = place + '/' + shownType(child);
            if (holdsTexts)
                addTextsOf(child, childPath);
            else
                visit(child, childPath, depth + 1);
        }
    }

    void addTexts(const ContainerItem& item, const std::string& path) {
        places_.places.push_back(blankedChunk(MediaPlace::Use::Text, path, item));
        addTextsOf(item, path);
    }

    /// A chunk of a list of texts, and "strn", is one text; a label of a list "adtl" has the number of its mark before.
    void addTextsOf(const ContainerItem& item, const std::string& path) {
        const std::string payload = readBytes(read_, item.payloadOffset(), item.payloadSize(), s_longestRead);
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
        if (!isBlank(read_, item))
            places_.places.push_back(blankedChunk(MediaPlace::Use::Unused, path, item));
    }

    std::istream& file_;
    ReadBytes read_;
    std::uint64_t total_;
    MediaPlaces places_;
};

} // namespace

MediaPlaces findPlacesInRIFF(std::istream& file) {
    return RIFFWalk(file).run();
}

} // namespace ZULMetaData::detail
