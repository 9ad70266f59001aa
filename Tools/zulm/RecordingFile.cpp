#include "Tools/zulm/Command.h"
#include "Tools/zulm/Recording.h"

#include <fmt/core.h>

#include <cerrno>
#include <cstring>
#include <iostream>
#include <utility>

namespace Zulm {

using namespace ZULMetaData;

namespace {

/// Keeps what is printed on a stream from being seen.
class Muted {
public:
    explicit Muted(std::ostream& stream) : stream_(stream), buffer_(stream.rdbuf(nullptr)) {}
    ~Muted() { stream_.rdbuf(buffer_); }
    Muted(const Muted&) = delete;
    Muted& operator=(const Muted&) = delete;

private:
    std::ostream& stream_;
    std::streambuf* buffer_;
};

} // namespace

Recording::Recording(std::string path, std::string name) : path_(std::move(path)), name_(std::move(name)) {
    if (name_.empty())
        name_ = path_;
    requireFile(path_);
    if (MetaDataParser::streamTypeOf(path_) == MetaDataParser::Unknown)
        throw Failure(
            fmt::format("{}: not a movie (.mp4, .mov, .zcap), a RIFF file (.avi, .wav) or a stream (.dat)", name_));
    {
        const Muted libraryMessages(std::cerr); // they name no file; the tool says the same in its own words
        parser_ = MetaDataParser::create(path_);
    }
    if (!parser_)
        throw Failure(fmt::format("{}: cannot be opened: {}", name_, std::strerror(errno)));
    requireRead(parser_->getStream(), name_);
    say(fmt::format("{}: {} with {} streams", name_, container(), parser_->getAvailableMetaDataUUIDs().size()));
}

} // namespace Zulm
