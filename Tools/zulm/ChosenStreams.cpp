#include "Tools/zulm/ChosenStreams.h"

#include "Reports/Text.h"
#include "Tools/zulm/Choice.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <filesystem>
#include <sstream>

namespace Zulm {

using namespace ZULMetaData;

namespace {

bool isChosen(const uuid& type, const std::vector<std::string>& kinds) {
    return kinds.empty() ||
           std::any_of(kinds.begin(), kinds.end(), [&](const auto& kind) { return typeNamed(kind) == type; });
}

/// Whether the text is an identifier, in digits of either case.
bool isIdentifier(const std::string& text) {
    uuid type{};
    std::istringstream(text) >> type;
    return CLI::detail::to_lower(text) == uuidText(type);
}

std::string checkKind(const std::string& kind) {
    if (isIdentifier(kind) || findMetaDataKind(kind))
        return {};
    const std::vector<std::string> names = namesIn(s_metaDataKinds);
    return fmt::format("no kind of stream is called '{}'{} (the kinds are {})", kind, suggestionFor(kind, names),
                       fmt::join(names, ", "));
}

} // namespace

std::vector<StreamInfo> chosenStreams(RecordingFile& recording, const std::vector<std::string>& kinds) {
    std::vector<StreamInfo> streams = recording.streams();
    std::erase_if(streams, [&kinds](const StreamInfo& stream) { return !isChosen(stream.type, kinds); });
    return streams;
}

CLI::Option* addStreamOption(CLI::App& command, std::vector<std::string>& kinds, const std::string& description,
                             const std::string& name) {
    return command.add_option(name, kinds, description)
        ->type_name("KIND")
        ->allow_extra_args(false)
        ->check(CLI::Validator(checkKind, ""));
}

void requireOneOf(const std::vector<std::string>& fitting, const std::string& option,
                  const std::vector<std::string>& kinds, const std::string& why) {
    for (const std::string& kind : kinds)
        if (std::find(fitting.begin(), fitting.end(), metaDataKindName(typeNamed(kind))) == fitting.end())
            throw CLI::ValidationError(
                fmt::format("{} {}: {} {}; choose from {}", option, kind, kind, why, fmt::join(fitting, ", ")));
}

uuid typeNamed(const std::string& kind) {
    if (const MetaDataKind* registered = findMetaDataKind(kind))
        return registered->type;
    uuid type{};
    std::istringstream(kind) >> type;
    return type;
}

ExitCode complainAboutNothing(const RecordingFile& recording, const std::vector<std::string>& kinds) {
    return complainAboutNothing(recording.name(), kinds);
}

ExitCode complainAboutNothing(const std::string& recording, const std::vector<std::string>& kinds) {
    if (kinds.empty())
        complain(fmt::format("{}: has no recording metadata; 'zulm salvage {} -o DIR' finds what no reader does",
                             recording, shellWord(recording)));
    else
        complain(fmt::format("{}: has no stream {}; 'zulm info {}' lists what it has", recording,
                             fmt::join(kinds, " or "), shellWord(recording)));
    return ExitNoMetaData;
}

ExitCode complainAboutRest(const RecordingFile& recording, const StreamInfo& stream, std::uint64_t end,
                           const char* treated) {
    if (end >= stream.declaredBytes)
        return ExitFine;
    complain(fmt::format("{}: {} cannot be {} from offset {} on; 'zulm verify {}' says more", recording.name(),
                         stream.name(), treated, stream.offset + end, shellWord(recording.name())));
    return ExitDamaged;
}

std::string streamFileIn(const std::string& folder, const uuid& type, std::size_t number) {
    const std::string suffix = number > 1 ? fmt::format("-{}", number) : "";
    return (std::filesystem::path(folder) / fmt::format("{}{}.dat", metaDataKindName(type), suffix)).string();
}

} // namespace Zulm
