#pragma once

// A file that holds metadata streams, opened for looking into it.

#include "ZULMetaData/ZULMetaData.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace Zulm {

struct StreamInfo {
    ZULMetaData::uuid type{};
    std::string kind; ///< its name in the registry; empty where it is not registered
    ZULMetaData::MetaDataParser::CachedFileData range{};
    std::int32_t version = -1;
    bool isDecodable = false; ///< of a kind and version whose entries can be read
    std::uint64_t entries = 0;
    std::optional<double> firstTime;
    std::optional<double> lastTime;
    std::string damage; ///< what ended the entries early, or empty
};

class Recording {
public:
    /// Throws `Failure` for a file that cannot be opened or is no container by its name.
    explicit Recording(std::string path);

    const std::string& path() const { return path_; }
    ZULMetaData::MetaDataParser& parser() { return *parser_; }

    /// "movie", "RIFF" or "stream".
    std::string container() const;

    /// Every stream in the file, in the order of their identifiers. Reads them through.
    std::vector<StreamInfo> streams();

private:
    StreamInfo streamInfo(const ZULMetaData::uuid& type);

    std::string path_;
    std::unique_ptr<ZULMetaData::MetaDataParser> parser_;
};

/// The identifier as text.
std::string uuidText(const ZULMetaData::uuid& type);

/// "cursorLocation", or the identifier of a stream that is in no registry.
std::string nameOf(const ZULMetaData::uuid& type);

} // namespace Zulm
