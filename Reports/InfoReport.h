#pragma once

// What `zulm info` says about a file.

#include "Reports/JsonWriter.h"
#include "Reports/Layout.h"
#include "ZULMetaDataBridge/Source/RecordingFile.h"

#include <nlohmann/json.hpp>

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace Zulm {

/// What is read before anything is printed.
struct FileInfo {
    std::optional<double> duration;
    std::vector<ZULMetaData::StreamReport> streams;
    std::vector<ZULMetaData::ZCAPHeader> creators;
};

/// Throws `FileError` if the file cannot be read.
FileInfo inspect(ZULMetaData::RecordingFile& recording);

/// Returns the rate between the first and the last entry. Empty if they are at one time or have none.
std::optional<double> entriesPerSecond(const ZULMetaData::StreamReport& stream);

/// Visits the items inside of the file's metadata that are not streams.
void visitForeignAtoms(ZULMetaData::RecordingFile& recording, const std::function<void(const LayoutItem& atom)>& visit);

/// Returns the texts of a creator with everything that is stored in their fields.
nlohmann::ordered_json creatorDocument(const ZULMetaData::CreatorAttributes& creator);
std::string shownCreator(const ZULMetaData::CreatorAttributes& creator); ///< "Mac 1.2 on version 6.1.0"

/// Writes the file's object of `zulm info --json`.
void writeInfo(JsonWriter& writer, ZULMetaData::RecordingFile& recording, const FileInfo& file);

/// Returns the same object as a whole.
nlohmann::ordered_json infoDocument(ZULMetaData::RecordingFile& recording);

} // namespace Zulm
