#pragma once

// Which pieces of a recording make an edited movie, as the command line says it.

#include "Tools/zulm/Command.h"
#include "ZULMetaDataSession/EditList.h"
#include "ZULMetaDataSession/Recording.h"

#include <optional>
#include <string>
#include <vector>

namespace Zulm {

struct EditOptions {
    std::string file;                 ///< an edit list; "-" is standard input
    std::vector<std::string> kept;    ///< "A-B[@SPEED]"
    std::vector<std::string> removed; ///< "A-B"
    std::optional<ZULMetaData::Rational> frameRate;
};

/// Adds --edits, --keep, --remove and --frame-rate.
void addEditOptions(CLI::App& command, EditOptions& options);

/// Throws the usage error unless the options say in one way which pieces are kept, and only one of the edit list and
/// the recording is standard input.
void requireEdits(const EditOptions& options, const std::string& recording);

/// Throws `Failure` or `ZULMetaData::Error` if the edit list cannot be read or says something impossible.
ZULMetaData::EditList editsOf(const EditOptions& options, const ZULMetaData::Recording& recording);

} // namespace Zulm
