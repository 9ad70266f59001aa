#pragma once

// The streams of a recording as bytes: as far as the file holds them, whatever it declares.

#include "Tools/zulm/Command.h"
#include "Tools/zulm/Recording.h"

#include <cstdint>
#include <string>
#include <vector>

namespace Zulm {

struct HeldStream {
    ZULMetaData::uuid type{};
    std::uint64_t offset = 0;   ///< of its header in the file
    std::uint64_t declared = 0; ///< bytes, header included
    std::uint64_t present = 0;  ///< of them, what the file holds

    std::string name() const { return ZULMetaData::metaDataKindName(type); }
    bool isCutShort() const { return present < declared; }
};

/// In the order of their identifiers. Only those of `kinds`, where these are given.
std::vector<HeldStream> heldStreams(Recording& recording, const std::vector<std::string>& kinds = {});

/// Its entries, as readers of its kind tell them apart. The recording must outlive them.
ZULMetaData::StreamEntries entriesOf(Recording& recording, const HeldStream& stream);

/// Adds an option that takes the names of kinds and, for kinds that have none, identifiers.
CLI::Option* addStreamOption(CLI::App& command, std::vector<std::string>& kinds, const std::string& description,
                             const std::string& name = "--stream");

/// Throws the usage error if one of these option values names none of the fitting kinds. `why` completes the sentence
/// "KIND ...".
void requireOneOf(const std::vector<ZULMetaData::uuid>& fitting, const std::string& option,
                  const std::vector<std::string>& kinds, const std::string& why);

/// The same with the kinds for which `isFitting.operator()<Kind>()` returns true.
template <class Predicate>
void requireKinds(const std::string& option, const std::vector<std::string>& kinds, const std::string& why,
                  Predicate isFitting) {
    std::vector<ZULMetaData::uuid> fitting;
    ZULMetaData::RecordedKinds::forEach([&]<class Kind>() {
        if (isFitting.template operator()<Kind>())
            fitting.push_back(Kind::type);
    });
    requireOneOf(fitting, option, kinds, why);
}

/// The identifier that an option value names.
ZULMetaData::uuid typeNamed(const std::string& kind);

/// Complains that there is nothing to work on: no metadata at all, or not of `kinds`.
ExitCode complainAboutNothing(const Recording& recording, const std::vector<std::string>& kinds);

/// Creates a folder where there is none. Throws `Failure`.
void createFolder(const std::string& folder);

/// FOLDER/NAME.dat, and FOLDER/NAME-2.dat and so on from the second on.
std::string streamFileIn(const std::string& folder, const ZULMetaData::uuid& type, std::size_t number = 1);

/// Throws `Failure` where one of the outputs exists, so that nothing is done by halves.
void requireFree(const std::vector<std::string>& outputs, bool force);

} // namespace Zulm
