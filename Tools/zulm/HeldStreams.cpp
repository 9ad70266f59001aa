#include "Tools/zulm/HeldStreams.h"

#include "Tools/zulm/Choice.h"
#include "Tools/zulm/Text.h"

#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <filesystem>
#include <sstream>
#include <system_error>

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
    std::vector<std::string> names;
    names.reserve(s_metaDataKinds.size());
    for (const MetaDataKind& registered : s_metaDataKinds)
        names.emplace_back(registered.name);
    if (isIdentifier(kind) || std::find(names.begin(), names.end(), kind) != names.end())
        return {};
    return fmt::format("no kind of stream is called '{}'{} (the kinds are {})", kind, suggestionFor(kind, names),
                       fmt::join(names, ", "));
}

} // namespace

std::vector<HeldStream> heldStreams(Recording& recording, const std::vector<std::string>& kinds) {
    MetaDataParser& parser = recording.parser();
    const std::uint64_t total = recording.size();
    std::vector<HeldStream> streams;
    for (const uuid& type : parser.getAvailableMetaDataUUIDs()) {
        const auto [offset, length] = parser.fileDataForUUID(type);
        if (isChosen(type, kinds))
            streams.push_back({type, offset, length, std::min(length, total - std::min(offset, total))});
    }
    return streams;
}

StreamEntries entriesOf(Recording& recording, const HeldStream& stream) {
    const ReadBytes read = recording.bytes();
    return ZULMetaData::entriesOf(
        [read, offset = stream.offset](std::uint64_t position, std::span<char> bytes) {
            return read(offset + position, bytes);
        },
        stream.present);
}

CLI::Option* addStreamOption(CLI::App& command, std::vector<std::string>& kinds, const std::string& description,
                             const std::string& name) {
    return command.add_option(name, kinds, description)
        ->type_name("KIND")
        ->allow_extra_args(false)
        ->check(CLI::Validator(checkKind, ""));
}

void requireOneOf(const std::vector<uuid>& fitting, const std::string& option, const std::vector<std::string>& kinds,
                  const std::string& why) {
    std::vector<std::string> names;
    names.reserve(fitting.size());
    for (const uuid& type : fitting)
        names.push_back(metaDataKindName(type));
    for (const std::string& kind : kinds)
        if (std::find(fitting.begin(), fitting.end(), typeNamed(kind)) == fitting.end())
            throw CLI::ValidationError(
                fmt::format("{} {}: {} {}; choose from {}", option, kind, kind, why, fmt::join(names, ", ")));
}

uuid typeNamed(const std::string& kind) {
    const auto registered = std::find_if(s_metaDataKinds.begin(), s_metaDataKinds.end(),
                                         [&](const MetaDataKind& candidate) { return candidate.name == kind; });
    if (registered != s_metaDataKinds.end())
        return registered->type;
    uuid type{};
    std::istringstream(kind) >> type;
    return type;
}

ExitCode complainAboutNothing(const Recording& recording, const std::vector<std::string>& kinds) {
    const std::string& name = recording.name();
    if (kinds.empty())
        complain(fmt::format("{}: has no recording metadata; 'zulm salvage {} -o DIR' finds what no reader does", name,
                             shellWord(name)));
    else
        complain(fmt::format("{}: has no stream {}; 'zulm info {}' lists what it has", name, fmt::join(kinds, " or "),
                             shellWord(name)));
    return ExitNoMetaData;
}

void createFolder(const std::string& folder) {
    std::error_code error;
    std::filesystem::create_directories(folder, error);
    if (error)
        throw Failure(fmt::format("{}: cannot be created: {}", folder, error.message()));
    if (!std::filesystem::is_directory(folder, error))
        throw Failure(error ? fmt::format("{}: {}", folder, error.message()) : fmt::format("{}: is no folder", folder));
}

std::string streamFileIn(const std::string& folder, const uuid& type, std::size_t number) {
    const std::string suffix = number > 1 ? fmt::format("-{}", number) : "";
    return (std::filesystem::path(folder) / fmt::format("{}{}.dat", metaDataKindName(type), suffix)).string();
}

void requireFree(const std::vector<std::string>& outputs, bool force) {
    for (const std::string& output : outputs)
        if (!force && std::filesystem::exists(output))
            throw Failure(fmt::format("{}: exists already; --force replaces it", output));
}

} // namespace Zulm
