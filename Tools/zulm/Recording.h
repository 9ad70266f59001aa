#pragma once

// A file that holds metadata streams, opened for looking into it.

#include "Tools/zulm/Failure.h"
#include "ZULMetaData/StreamExtent.h"
#include "ZULMetaData/ZULMetaData.h"
#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <fmt/core.h>
#include <nlohmann/json.hpp>

#include <concepts>
#include <cstdint>
#include <istream>
#include <memory>
#include <optional>
#include <string>
#include <system_error>
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
    std::uint64_t readableBytes = 0; ///< header included: what a reader can be trusted with
    std::string damage;              ///< the first thing that is wrong with it, or empty
};

/// Throws `Failure` where reading or seeking has failed. What could not be read must not pass for what is not there.
void requireRead(const std::istream& stream, const std::string& name);

/// Throws `Failure` in place of the `std::system_error` of a file that cannot be read.
template <class Work>
auto orUnreadable(const std::string& name, Work work) {
    try {
        return work();
    } catch (const std::system_error& error) {
        throw Failure(fmt::format("{}: cannot be read: {}", name, error.code().message()));
    }
}

class Recording {
public:
    /// Takes the file for what its contents say. Throws `Failure` if it cannot be opened or can hold no metadata.
    /// `name` is what messages call the file; its path if empty.
    explicit Recording(std::string path, std::string name = {});

    /// Over an input of the caller that holds a container of this type, and that must outlive this.
    Recording(std::istream& input, ZULMetaData::Container::Type type, std::string name);

    /// Empty for an input of the caller.
    const std::string& path() const { return path_; }
    const std::string& name() const { return name_; }
    ZULMetaData::MetaDataParser& parser() { return *parser_; }

    /// Of the file in bytes. Throws `Failure` where that cannot be told.
    std::uint64_t size();

    /// Its bytes at any position. Throws `Failure` where they cannot be read.
    ZULMetaData::ReadBytes bytes();

    std::string container() const;

    /// What was found by walking every byte of the metadata, once. Throws `Failure` where the file cannot be read.
    const ZULMetaData::ValidationReport& validation();

    /// Every stream that readers find, in the order of their identifiers.
    std::vector<StreamInfo> streams();
    StreamInfo streamInfo(const ZULMetaData::uuid& type);

    /// The streams that the file holds and no reader finds, in its order: a later one of the kind took their place, or
    /// they lie behind damage.
    std::vector<StreamInfo> hiddenStreams();

    /// Delivers the entries of a decodable stream as far as they are whole. Throws `std::bad_alloc` if there is no
    /// memory for an image, which `parseStream` would leave out.
    template <class Value>
    void readEntries(const StreamInfo& stream, ZULMetaData::DataStreamObserver<Value>& observer) {
        if constexpr (std::same_as<Value, ZULMetaData::CursorImage>) {
            const auto read = [file = bytes(), start = stream.range.offset](std::uint64_t position, auto into) {
                return file(start + position, into);
            };
            ZULMetaData::StreamEntries entries(read, stream.readableBytes);
            while (const auto entry = entries.next())
                if (const auto decoded = ZULMetaData::decodeEntry<Value>(entries.bytesOf(*entry), stream.version))
                    if (!observer.dataRead(decoded->time, decoded->value))
                        break;
        } else {
            ZULMetaData::MetaDataReader<Value>::parseStream(observer, parser_->getStream(), stream.range.offset,
                                                            stream.readableBytes, -1);
        }
        requireRead(parser_->getStream(), name_);
    }

private:
    ZULMetaData::ValidationReport validate();

    std::string path_;
    std::string name_;
    std::unique_ptr<ZULMetaData::MetaDataParser> parser_;
    std::optional<ZULMetaData::ValidationReport> validation_;
};

/// Whether a file's name tells another container than its contents do, so that programs that go by the name fail.
bool isNamedOtherwise(const std::string& path, ZULMetaData::Container::Type type);

/// Throws `Failure` if the name of `output`, which gets a container of this type, tells another one. Warns if programs
/// that go by the name find no metadata in `output` though they did in `input`.
void requireOutputName(const std::string& output, ZULMetaData::Container::Type type, const std::string& input);

/// "movie", "RIFF" or "stream".
std::string containerName(ZULMetaData::Container::Type type);

/// The name of a registered kind, else null.
nlohmann::ordered_json kindDocument(const ZULMetaData::uuid& type);

} // namespace Zulm
