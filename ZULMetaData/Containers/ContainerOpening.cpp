#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/ContainerScan.h"
#include "ZULMetaData/Containers/FileParser.h"
#include "ZULMetaData/Containers/WideRIFF.h"
#include "ZULMetaData/StreamExtent.h"

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
        const RecognizedContainer recognized = recognizeContainer(this->getStream(), path);
        if (recognized.type == Container::Unknown)
            throw std::runtime_error(recognized.refusal());
        this->setStreamType(recognized.type);
    }

    void scan() {
        std::istream& stream = this->getStream();
        const std::uint64_t size = sizeOfInput(stream);
        this->cacheFileStreamInfo();
        if (this->getStreamType() != Container::Riff)
            return requireReadable(stream);
        requireReadable(stream);
        const auto wide = detail::wideRIFF(stream);
        if (!wide || wide->end >= size)
            return;
        stream.clear();
        stream.seekg(0);
        detail::StreamCache found;
        detail::scanChunks(stream, size, found, wide->end + wide->end % 2);
        requireReadable(stream);
        for (const auto& [type, place] : found)
            this->cacheStream(type, place);
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
    stream.clear();
    parser->scan();
    return parser;
}

} // namespace ZULMetaData
