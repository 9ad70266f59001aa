#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/ContainerScan.h"
#include "ZULMetaData/Containers/FileParser.h"

#include <cerrno>
#include <stdexcept>
#include <system_error>

namespace ZULMetaData {

namespace {

/// Finds what the plain scan does, and what follows a RIFF chunk whose size is not in its header.
template <class Parser>
class ThoroughParser final : public Parser {
public:
    using Parser::Parser;

    void recognize(const std::string& path) requires std::is_base_of_v<detail::FileParser, Parser> {
        const auto recognized = recognizeContainer(ByteSource::stream(this->getStream()), path);
        if (recognized.type == Container::Unknown)
            throw std::runtime_error(recognized.refusal());
        this->setStreamType(recognized.type);
    }

    void scan() {
        std::istream& stream = this->getStream();
        const ByteSource file = ByteSource::stream(stream);
        rewind(stream);
        this->cacheFileStreamInfo();
        requireReadable(stream);
        if (this->getStreamType() != Container::Riff)
            return;
        ItemWalk chunks(file, Container::Riff);
        const auto first = chunks.next();
        if (!first || first->sizeSource == ContainerItem::Header || chunks.position() >= file.size())
            return;
        rewind(stream);
        detail::StreamCache found;
        detail::scanChunks(stream, file.size(), found, chunks.position());
        requireReadable(stream);
        for (const auto& [type, place] : found)
            this->cacheStream(type, place);
    }

private:
    static void rewind(std::istream& stream) {
        stream.clear();
        stream.seekg(0);
    }
};

} // namespace

std::unique_ptr<MetaDataParser> openContainer(const std::string& path) {
    errno = 0;
    auto parser = std::make_unique<ThoroughParser<detail::FileParser>>(path, Container::Unknown);
    if (!parser->isOpen())
        throw std::system_error(errno, std::generic_category(), "cannot be opened");
    parser->recognize(path);
    parser->scan();
    return parser;
}

std::unique_ptr<MetaDataParser> openContainer(std::istream& stream, Container::Type type) {
    auto parser = std::make_unique<ThoroughParser<detail::StreamParser>>(stream, type);
    parser->scan();
    return parser;
}

} // namespace ZULMetaData
