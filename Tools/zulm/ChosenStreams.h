#pragma once

// Which streams of a recording a command works on, and the option that names their kinds.

#include "Tools/zulm/Command.h"
#include "ZULMetaDataBridge/Source/RecordingFile.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace Zulm {

/// Returns the streams in the order of their identifiers. If `kinds` is not empty, returns only those kinds.
std::vector<ZULMetaData::StreamInfo> chosenStreams(ZULMetaData::RecordingFile& recording,
                                                   const std::vector<std::string>& kinds);

/// Adds an option that takes the names of kinds and, for kinds that have none, identifiers.
CLI::Option* addStreamOption(CLI::App& command, std::vector<std::string>& kinds, const std::string& description,
                             const std::string& name = "--stream");

/// Throws the usage error if one of these option values names none of the fitting kinds. `why` completes the sentence
/// "KIND ...".
void requireOneOf(const std::vector<std::string>& fitting, const std::string& option,
                  const std::vector<std::string>& kinds, const std::string& why);

/// The same with the kinds for which `isFitting.operator()<Kind>()` returns true.
template <class Predicate>
void requireKinds(const std::string& option, const std::vector<std::string>& kinds, const std::string& why,
                  Predicate isFitting) {
    std::vector<std::string> fitting;
    ZULMetaData::RecordedKinds::forEach([&]<class Kind>() {
        if (isFitting.template operator()<Kind>())
            fitting.push_back(ZULMetaData::metaDataKindName(Kind::type));
    });
    requireOneOf(fitting, option, kinds, why);
}

/// The identifier that an option value names.
ZULMetaData::uuid typeNamed(const std::string& kind);

/// Complain that there is nothing to work on: no metadata at all, or not of `kinds`.
///@{
ExitCode complainAboutNothing(const ZULMetaData::RecordingFile& recording, const std::vector<std::string>& kinds);
ExitCode complainAboutNothing(const std::string& recording, const std::vector<std::string>& kinds);
///@}

/// Complains if a stream goes on after its first `end` bytes, which is as far as it could be `treated`: "read" or
/// "searched". Returns how the command ends.
ExitCode complainAboutRest(const ZULMetaData::RecordingFile& recording, const ZULMetaData::StreamInfo& stream,
                           std::uint64_t end, const char* treated = "read");

/// FOLDER/NAME.dat, and FOLDER/NAME-2.dat and so on from the second on.
std::string streamFileIn(const std::string& folder, const ZULMetaData::uuid& type, std::size_t number = 1);

} // namespace Zulm
