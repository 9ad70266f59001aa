#pragma once

// What `zulm info` tells of a file.

#include "Tools/zulm/Layout.h"
#include "Tools/zulm/Recording.h"

#include <nlohmann/json.hpp>

#include <optional>
#include <string>
#include <vector>

namespace Zulm {

struct FileInfo {
    std::string name;
    std::string container;
    std::optional<double> duration;
    std::vector<StreamInfo> streams;
    std::vector<ZULMetaData::ZCAPHeader> creators;
    Layout layout;
    std::vector<ZULMetaData::Finding> warnings;
    bool isDamaged = false;
};

/// Throws `Failure` where the file cannot be read.
FileInfo inspect(Recording& recording);

/// Between the first and the last entry; none where they are at one time or at none.
std::optional<double> entriesPerSecond(const StreamInfo& stream);

/// What is inside of the file's metadata.
std::vector<LayoutItem> metaDataChildren(const Layout& layout);

/// The texts of a creator with everything that is stored in their fields.
nlohmann::ordered_json creatorDocument(const ZULMetaData::CreatorAttributes& creator);
std::string shownCreator(const ZULMetaData::CreatorAttributes& creator); ///< "Mac 1.2 on version 6.1.0"

/// The file's object of `zulm info --json`.
nlohmann::ordered_json infoDocument(const FileInfo& file);

} // namespace Zulm
