#include "Tools/zulm/Command.h"
#include "Tools/zulm/Recording.h"

#include <fmt/core.h>

#include <set>

namespace Zulm {

using namespace ZULMetaData;

namespace {

struct AttachOptions {
    std::string movie;
    std::vector<std::string> streams;
};

uuid typeOfStreamFile(const std::string& path) {
    Recording stream(path);
    if (stream.parser().getStreamType() != MetaDataParser::RawStream)
        throw Failure(fmt::format("{}: not a stream file (.dat)", path));
    const auto size = stream.parser().fileDataForUUID(stream.parser().getAvailableMetaDataUUIDs().front()).length;
    if (size < s_metaDataHeaderSize)
        throw Failure(
            fmt::format("{}: too short for a stream: {} bytes of a {}-byte header", path, size, s_metaDataHeaderSize));
    return stream.parser().getAvailableMetaDataUUIDs().front();
}

/// So that nothing is found out only when the movie has been changed already.
std::set<uuid> checkStreams(const AttachOptions& options) {
    std::set<uuid> types;
    for (const std::string& path : options.streams)
        if (const uuid type = typeOfStreamFile(path); !types.insert(type).second)
            throw Failure(fmt::format("{}: a second stream {}", path, nameOf(type)));
    return types;
}

ExitCode runAttach(const AttachOptions& options) {
    Recording movie(options.movie);
    if (movie.parser().getStreamType() != MetaDataParser::QuickTime)
        throw Failure(fmt::format("{}: not a movie (.mp4, .mov, .zcap)", options.movie));
    const std::set<uuid> types = checkStreams(options);
    if (!ZULMAtomRepair::finalizeAtomsInFile(options.movie))
        throw Failure(fmt::format("{}: its atoms do not fill the file, so nothing that is appended could be found",
                                  options.movie));
    ZULMAtomWriter().writeMetaDataFiles({options.streams.begin(), options.streams.end()}, options.movie);
    Recording saved(options.movie);
    for (const uuid& type : types)
        if (saved.parser().fileDataForUUID(type).length == 0)
            throw Failure(fmt::format("{}: {} cannot be found in it again", options.movie, nameOf(type)));
    fmt::print("{}: {} stream{} attached\n", options.movie, types.size(), types.size() == 1 ? "" : "s");
    return ExitFine;
}

} // namespace

void addAttachCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<AttachOptions>();
    CLI::App* command = app.add_subcommand("attach", "Put stream files into a movie");
    command->add_option("MOVIE", options->movie, "The movie, which is changed")->required();
    command->add_option("STREAM", options->streams, "Stream files (.dat)")->required();
    command->callback([options, &chosen] { chosen = [options] { return runAttach(*options); }; });
}

} // namespace Zulm
