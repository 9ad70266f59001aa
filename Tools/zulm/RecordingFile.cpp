#include "Tools/zulm/Command.h"
#include "Tools/zulm/Recording.h"

#include <fmt/core.h>

#include <stdexcept>
#include <system_error>
#include <utility>

namespace Zulm {

using namespace ZULMetaData;

Recording::Recording(std::string path, std::string name) : path_(std::move(path)), name_(std::move(name)) {
    if (name_.empty())
        name_ = path_;
    requireFile(path_);
    try {
        parser_ = openContainer(path_);
    } catch (const std::system_error& error) {
        throw Failure(fmt::format("{}: cannot be opened: {}", name_, error.code().message()));
    } catch (const std::runtime_error& refusal) {
        throw Failure(fmt::format("{}: {}", name_, refusal.what()));
    }
    if (isNamedOtherwise(path_, parser_->getStreamType()))
        warn(fmt::format("{}: is a {} by its contents, whatever its name says", name_, container()));
    requireRead(parser_->getStream(), name_);
    say(fmt::format("{}: {} with {} streams", name_, container(), parser_->getAvailableMetaDataUUIDs().size()));
}

void requireOutputName(const std::string& output, Container::Type type, const std::string& input) {
    if (isNamedOtherwise(output, type))
        throw Failure(fmt::format("{}: is named as a {} is, but would hold a {}; choose a name that ends in {}", output,
                                  containerName(MetaDataParser::streamTypeOf(output)), containerName(type),
                                  extensionFor(type)));
    const bool isUnnamed = MetaDataParser::streamTypeOf(output) == Container::Unknown;
    if (isUnnamed && MetaDataParser::streamTypeOf(input) == type)
        warn(fmt::format("{}: programs that go by the name do not take it for a {}; one that ends in {} is safe",
                         output, containerName(type), extensionFor(type)));
}

} // namespace Zulm
