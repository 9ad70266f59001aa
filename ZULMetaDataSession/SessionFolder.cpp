#include "ZULMetaDataSession/SessionFolder.h"

#include "Platform/LockFile.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataSession/OrError.h"

#include <filesystem>
#include <system_error>
#include <utility>

namespace ZULMetaData::detail {

namespace {

template <class Kind>
std::optional<double> timeOfEntry(std::string_view entry, int version) {
    const auto decoded = decodeEntry<typename Kind::Value>(entry, version);
    return decoded ? std::optional(decoded->time) : std::nullopt;
}

bool isThere(const FileLocation& file) {
    return std::filesystem::exists(std::filesystem::symlink_status(file));
}

SessionStream measured(const FileLocation& file, const StreamFormat& format) {
    SessionStream stream{format.header.uuid, file, 0, 0, std::nullopt};
    const ByteSource bytes = ByteSource::file(utf8Path(file));
    StreamEntries entries(bytes);
    const auto& header = entries.header();
    const bool isOfKind = header && header->uuid == format.header.uuid && header->version == format.header.version &&
                          header->fixedEntrySize == format.header.fixedEntrySize;
    if (!isOfKind) { // a part of a header at best
        stream.tornBytes = bytes.size();
        return stream;
    }
    StreamEntry last;
    while (const auto entry = entries.next()) {
        last = *entry;
        ++stream.entries;
    }
    stream.tornBytes = bytes.size() - entries.wholeBytes();
    if (stream.entries > 0)
        stream.lastTime = format.timeOf(entries.bytesOf(last), header->version);
    return stream;
}

} // namespace

const std::array<StreamFormat, RecordedKinds::size>& streamFormats() {
    static const auto s_formats = [] {
        std::array<StreamFormat, RecordedKinds::size> formats;
        auto format = formats.begin();
        RecordedKinds::forEach([&format]<class Kind>() {
            *format++ = {{Kind::type, Kind::version, metaDataFixedEntrySize<typename Kind::Value>()},
                         timeOfEntry<Kind>};
        });
        return formats;
    }();
    return s_formats;
}

FileLocation lockFileIn(const FileLocation& folder) {
    return folder / "session.lock";
}

void requireFree(const FileLocation& folder) {
    if (LockFile::stateOf(lockFileIn(folder)) != LockFile::State::Absent)
        throw Error(utf8Path(folder),
                    "holds another session; record into another folder, or save that session and remove its files");
    for (const StreamFormat& format : streamFormats()) {
        const FileLocation file = format.fileIn(folder);
        if (orError(utf8Path(file), [&file] { return isThere(file); }))
            throw Error(utf8Path(file), "exists already; record into another folder");
    }
}

std::vector<SessionStream> streamsIn(const FileLocation& folder) {
    std::vector<SessionStream> streams;
    for (const StreamFormat& format : streamFormats()) {
        const FileLocation file = format.fileIn(folder);
        orError(utf8Path(file), [&] {
            if (isThere(file))
                streams.push_back(measured(file, format));
        });
    }
    return streams;
}

std::vector<StreamSource> sourcesIn(const FileLocation& folder) {
    std::vector<StreamSource> sources;
    for (const SessionStream& stream : streamsIn(folder))
        if (stream.entries > 0)
            sources.push_back(StreamSource::file(stream.file));
    return sources;
}

AttachResult saveFolder(const FileLocation& folder, const FileLocation& movie, const std::string& creatorName,
                        const std::string& creatorVersion, SafeMovieSave::FragmentIndex index) {
    const std::vector<StreamSource> sources = sourcesIn(folder);
    return orError(utf8Path(movie), [&] {
        const SafeMovieSave save(movie);
        if (!sources.empty())
            return save.attachAndStamp(AttachPlan(sources), creatorName, creatorVersion, index);
        const StampResult stamped = save.stamp(creatorName, creatorVersion, index);
        return AttachResult{stamped.repair, {}, stamped.fragmentIndex};
    });
}

void removeSession(const FileLocation& folder) {
    std::vector<FileLocation> files;
    for (const StreamFormat& format : streamFormats())
        files.push_back(format.fileIn(folder));
    files.push_back(lockFileIn(folder)); // last, so that a session that cannot be removed is still found
    for (const FileLocation& file : files)
        orError(utf8Path(file), [&file] { return std::filesystem::remove(file); });
    std::error_code notEmpty;
    std::filesystem::remove(folder, notEmpty);
}

} // namespace ZULMetaData::detail
