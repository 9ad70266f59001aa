// Opens edit lists, whatever form they have.

#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaDataSession/EditLists/Formats.h"
#include "ZULMetaDataSession/EditLists/ListBuilder.h"
#include "ZULMetaDataSession/OrError.h"

#include <algorithm>
#include <array>
#include <cctype>

namespace ZULMetaData {

namespace {

using detail::JsonValue;

constexpr std::string_view s_byteOrderMark = "\xef\xbb\xbf";

struct NamedFormat {
    std::string_view extension;
    EditListFormat format;
};

/// Extensions that say what a file is if its contents do not.
constexpr std::array s_extensions{
    NamedFormat{".ffconcat", EditListFormat::Concat},   NamedFormat{".llc", EditListFormat::LosslessCut},
    NamedFormat{".csv", EditListFormat::CutTable},      NamedFormat{".tsv", EditListFormat::CutTable},
    NamedFormat{".otio", EditListFormat::OpenTimeline}, NamedFormat{".edl", EditListFormat::CMX3600},
};

EditListFormat formatOfName(const std::string& name) {
    std::string lower = name;
    std::transform(lower.begin(), lower.end(), lower.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    const auto found = std::find_if(s_extensions.begin(), s_extensions.end(),
                                    [&lower](const NamedFormat& row) { return lower.ends_with(row.extension); });
    return found == s_extensions.end() ? EditListFormat::Recognized : found->format;
}

/// Returns what a document is by the members that only its form has.
EditListFormat formatOfDocument(const JsonValue& document, const std::string& name) {
    const std::array forms{
        std::pair(document.find("schema") != nullptr, EditListFormat::Own),
        std::pair(document.find("cutSegments") != nullptr, EditListFormat::LosslessCut),
        std::pair(document.find("version") && (document.find("chunks") || document.find("clips") || document.find("v")),
                  EditListFormat::AutoEditor),
        std::pair(document.find("OTIO_SCHEMA") != nullptr, EditListFormat::OpenTimeline)};
    EditListFormat found = EditListFormat::Recognized;
    for (const auto& [applies, format] : forms) {
        if (applies && found != EditListFormat::Recognized)
            throw Error(name, "the document could be edit lists of several forms; name the one that it has");
        found = applies ? format : found;
    }
    return found;
}

[[noreturn]] void refuseForm(const std::string& name) {
    throw Error(name,
                "this is no edit list of a known form: JSON of zulm, a list for ffmpeg's concat demuxer, a project "
                "or table of LosslessCut, a timeline of auto-editor or OpenTimelineIO, a CMX 3600 list, or a movie "
                "with an edit list");
}

EditList readDocument(std::string_view text, const std::string& name, const EditListOptions& options) {
    if (options.format == EditListFormat::Own)
        return EditList::read(text, name);
    const JsonValue document = detail::readJson(text, name, detail::JsonDialect::JSON5);
    EditListFormat format = options.format;
    if (format == EditListFormat::Recognized)
        format = formatOfDocument(document, name);
    if (format == EditListFormat::Recognized)
        format = formatOfName(name);
    switch (format) {
    case EditListFormat::Own: return EditList::read(text, name);
    case EditListFormat::LosslessCut: return detail::readLosslessCut(document, name, options);
    case EditListFormat::AutoEditor: return detail::readAutoEditor(document, name, options);
    case EditListFormat::OpenTimeline: return detail::readOpenTimeline(document, name);
    default: refuseForm(name);
    }
}

std::string textOf(const ByteSource& bytes, const std::string& name) {
    if (bytes.size() > EditList::s_largestFile)
        throw Error(name, "the file is larger than 64 MiB; no edit list is");
    std::string text(static_cast<std::size_t>(bytes.size()), '\0');
    text.resize(bytes.read(0, text));
    return text;
}

/// Returns whether a file begins as a movie does, and no text can.
bool isMovie(const ByteSource& bytes) {
    std::string first(s_recognitionBytes, '\0');
    first.resize(bytes.read(0, first));
    return first.find('\0') < 8 && streamTypeOfContents(first) == Container::QuickTime;
}

/// Returns whether the first character begins an object or an array of JSON.
bool isDocument(std::string_view text) {
    const std::size_t first = text.find_first_not_of(" \t\r\n");
    return first != std::string_view::npos && (text[first] == '{' || text[first] == '[');
}

EditList readText(std::string_view text, const std::string& name, const EditListOptions& options) {
    if (text.starts_with(s_byteOrderMark))
        text.remove_prefix(s_byteOrderMark.size());
    EditListFormat format = options.format;
    if (format == EditListFormat::Recognized && isDocument(text))
        return readDocument(text, name, options);
    if (format == EditListFormat::Recognized)
        format = detail::recognizedText(text);
    if (format == EditListFormat::Recognized)
        format = formatOfName(name);
    switch (format) {
    case EditListFormat::Concat: return detail::readConcat(text, name, options);
    case EditListFormat::CMX3600: return detail::readCMX3600(text, name, options);
    case EditListFormat::CutTable: return detail::readCutTable(text, name, options);
    case EditListFormat::Recognized:
    case EditListFormat::MovieEditList: refuseForm(name);
    default: return readDocument(text, name, options);
    }
}

EditList openList(const ByteSource& bytes, const std::string& name, const EditListOptions& options) {
    const bool isMovieList = options.format == EditListFormat::MovieEditList ||
                             (options.format == EditListFormat::Recognized && isMovie(bytes));
    return isMovieList ? detail::readMovieEditList(bytes, name, options) : readText(textOf(bytes, name), name, options);
}

} // namespace

EditListFormat detail::recognizedText(std::string_view text) {
    while (!text.empty()) {
        const std::string_view line = takeLine(text);
        const std::string_view contents = trimmed(line);
        if (contents.empty() || contents.starts_with('#'))
            continue;
        return beginsConcat(line)     ? EditListFormat::Concat
               : beginsCMX3600(line)  ? EditListFormat::CMX3600
               : beginsCutTable(line) ? EditListFormat::CutTable
                                      : EditListFormat::Recognized;
    }
    return EditListFormat::Recognized;
}

EditList EditList::open(const FileLocation& file, const EditListOptions& options) {
    const std::string name = utf8Path(file);
    return detail::orError(name, [&] { return openList(ByteSource::file(name), name, options); });
}

EditList EditList::open(const ByteSource& bytes, const std::string& name, const EditListOptions& options) {
    return detail::orError(name, [&] { return openList(bytes, name, options); });
}

} // namespace ZULMetaData
