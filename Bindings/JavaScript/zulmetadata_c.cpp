#include "Bindings/JavaScript/zulmetadata_c.h"

#include "Bindings/JavaScript/EntryColumns.h"
#include "Bindings/JavaScript/SliceBuffer.h"
#include "Tools/zulm/DumpDocument.h"
#include "Tools/zulm/InfoReport.h"
#include "Tools/zulm/JsonWriter.h"
#include "Tools/zulm/Recording.h"
#include "Tools/zulm/Text.h"
#include "Tools/zulm/VerifyReport.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaDataBridge/Source/StoredFields.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <exception>
#include <functional>
#include <istream>
#include <limits>
#include <list>
#include <memory>
#include <new>
#include <optional>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

using namespace ZULMetaData;
using namespace ZULMetaData::Bindings;

/// In the order in which they need each other.
struct ZulmRecording {
    ZulmRecording(ReadSlice read, std::uint64_t size, Container::Type type, const std::string& name)
        : buffer(std::move(read), size), input(&buffer), recording(input, type, name) {}

    SliceBuffer buffer;
    std::istream input;
    Zulm::Recording recording;
    std::string container;
    std::optional<double> duration;
    struct Names {
        std::string kind; // or its identifier where it has none
        std::string uuid;
    };
    struct Streams {
        std::vector<Zulm::StreamInfo> infos;
        std::vector<Names> names;
        std::vector<ZulmStream> summaries;
    };
    Streams found;
    Streams hidden;
};

struct ZulmEntries {
    std::vector<double> times;
    std::vector<EntryColumn> columns;
    std::vector<ZulmColumn> views;
};

struct ZulmText {
    std::string bytes;
};

namespace {

std::string& lastError() {
    static thread_local std::string message;
    return message;
}

/// Keeps exceptions in. Null where `work` threw.
template <class Work>
auto orNull(Work work) noexcept -> decltype(work()) {
    try {
        try {
            return work();
        } catch (const std::bad_alloc&) {
            lastError() = "out of memory";
        } catch (const std::length_error&) { // more than an address can count
            lastError() = "out of memory";
        } catch (const std::exception& error) {
            lastError() = error.what();
        }
    } catch (...) { // no memory for the message either
        lastError().clear();
    }
    return nullptr;
}

ReadSlice readingWith(ZulmReadAt readAt, void* context) {
    return [=](std::uint64_t position, void* bytes, std::size_t size) {
        const std::int64_t got = readAt(context, position, bytes, size);
        if (got < 0)
            throw std::system_error(EIO, std::generic_category(), "cannot be read");
        return std::min(static_cast<std::size_t>(got), size);
    };
}

Container::Type typeOf(const ReadSlice& read, std::uint64_t fileSize, const std::string& name) {
    std::array<char, s_recognitionBytes> first;
    const std::size_t size = Zulm::orUnreadable(name, [&] { return read(0, first.data(), first.size()); });
    const RecognizedContainer recognized = recognizeContainer({first.data(), size}, fileSize, name);
    if (recognized.type == Container::Unknown)
        throw Zulm::Failure(fmt::format("{}: {}", name, recognized.refusal()));
    return recognized.type;
}

constexpr double s_nothing = std::numeric_limits<double>::quiet_NaN();

void summarise(ZulmRecording::Streams& streams, std::vector<Zulm::StreamInfo> infos) {
    streams.infos = std::move(infos);
    for (const Zulm::StreamInfo& info : streams.infos)
        streams.names.push_back({ZULMetaData::metaDataKindName(info.type), ZULMetaData::uuidText(info.type)});
    for (std::size_t i = 0; i < streams.infos.size(); ++i) {
        const Zulm::StreamInfo& info = streams.infos[i];
        streams.summaries.push_back({streams.names[i].kind.c_str(), streams.names[i].uuid.c_str(), info.version,
                                     info.isDecodable ? info.entries : 0, info.range.length, info.range.offset,
                                     info.firstTime.value_or(s_nothing), info.lastTime.value_or(s_nothing),
                                     info.isDecodable ? 1 : 0});
    }
}

void fillIn(ZulmRecording& opened) {
    Zulm::Recording& recording = opened.recording;
    opened.container = recording.container();
    opened.duration = movieDuration(recording.parser());
    Zulm::requireRead(opened.input, recording.name());
    summarise(opened.found, recording.streams());
    summarise(opened.hidden, recording.hiddenStreams());
}

/// The type of the column that a field of this type fills.
template <class Value>
constexpr ZulmColumnType columnType() {
    if constexpr (std::same_as<Value, CursorImage>)
        return ZulmBytes; // its image
    else if constexpr (std::same_as<Value, std::string>)
        return ZulmTexts;
    else if constexpr (std::same_as<Value, std::uint64_t>)
        return ZulmUInt64;
    else if constexpr (std::same_as<Value, std::uint32_t>)
        return ZulmUInt32;
    else
        return std::integral<Value> ? ZulmInt32 : ZulmReal;
}

/// Collects the entries of a stream.
template <class Kind>
class EntryCollector final : public DataStreamObserver<typename Kind::Value> {
public:
    using Value = typename Kind::Value;

    explicit EntryCollector(ZulmEntries& entries) : entries_(entries) {
        ZULMetaData::detail::visitStoredFields<Kind>(Value(), [&entries]<class Stored>(const char* key, const Stored&) {
            entries.columns.emplace_back(key, columnType<Stored>());
        });
    }

    bool dataRead(double time, const Value& value) override {
        entries_.times.push_back(time);
        auto column = entries_.columns.begin();
        ZULMetaData::detail::visitStoredFields<Kind>(
            value, [&column](const char*, const auto& stored) { (column++)->add(stored); });
        return true;
    }

private:
    ZulmEntries& entries_;
};

const Zulm::StreamInfo& infoNamed(const ZulmRecording& opened, const std::string& kind) {
    const auto& [infos, names, summaries] = opened.found;
    for (std::size_t i = 0; i < infos.size(); ++i)
        if (names[i].kind == kind || names[i].uuid == kind)
            return infos[i];
    throw Zulm::Failure(fmt::format("{}: holds no stream {}", opened.recording.name(), kind));
}

void requireDecodable(const ZulmRecording& opened, const Zulm::StreamInfo& info) {
    if (!info.isDecodable)
        throw Zulm::Failure(fmt::format("{}: entries of {}, version {}, cannot be decoded", opened.recording.name(),
                                        ZULMetaData::metaDataKindName(info.type), info.version));
}

void addViews(ZulmEntries& entries) {
    for (const EntryColumn& column : entries.columns)
        entries.views.push_back(column.view());
}

std::unique_ptr<ZulmEntries> readEntries(ZulmRecording& opened, const Zulm::StreamInfo& info) {
    requireDecodable(opened, info);
    auto entries = std::make_unique<ZulmEntries>();
    RecordedKinds::visit(info.type, [&]<class Kind>() {
        EntryCollector<Kind> collector(*entries);
        opened.recording.readEntries<typename Kind::Value>(info, collector);
    });
    addViews(*entries);
    return entries;
}

/// One row for each key.
std::unique_ptr<ZulmEntries> readKeyCaptions(ZulmRecording& opened, bool showsKeys) {
    const Zulm::StreamInfo& info = infoNamed(opened, metaDataKindName(KeyboardActionKind::type));
    requireDecodable(opened, info);
    MetaDataObserver<KeyStroke> read;
    opened.recording.readEntries<KeyStroke>(info, read);
    std::vector<KeyEvent> keys;
    for (std::size_t i = 0; i < read.values.size(); ++i)
        keys.push_back({read.times[i], read.values[i]});
    auto entries = std::make_unique<ZulmEntries>();
    entries->columns = {{"label", ZulmTexts}, {"isTyped", ZulmInt32}, {"first", ZulmInt32}, {"end", ZulmReal}};
    for (const KeyCaption& caption : keyCaptions(std::move(keys), showsKeys)) {
        const auto first = static_cast<std::int32_t>(entries->times.size());
        for (const CaptionKey& key : caption.keys) {
            entries->times.push_back(key.time);
            entries->columns[0].add(key.label);
            entries->columns[1].add(std::int32_t{key.isTyped});
            entries->columns[2].add(first);
            entries->columns[3].add(caption.end);
        }
    }
    addViews(*entries);
    return entries;
}

std::vector<uuid> typesNamed(const ZulmRecording& opened, const char* kinds) {
    std::vector<uuid> types;
    if (!kinds) {
        for (const Zulm::StreamInfo& info : opened.found.infos)
            types.push_back(info.type);
        return types;
    }
    std::istringstream list(kinds);
    for (std::string kind; std::getline(list, kind, ',');)
        if (const uuid type = infoNamed(opened, kind).type; std::find(types.begin(), types.end(), type) == types.end())
            types.push_back(type);
    return types;
}

} // namespace

const char* zulm_last_error(void) {
    return lastError().empty() ? "out of memory" : lastError().c_str();
}

ZulmRecording* zulm_open(ZulmReadAt readAt, void* context, uint64_t size, const char* name) {
    return orNull([&] {
        const ReadSlice read = readingWith(readAt, context);
        auto opened = std::make_unique<ZulmRecording>(read, size, typeOf(read, size, name), name);
        fillIn(*opened);
        return opened.release();
    });
}

void zulm_close(ZulmRecording* recording) {
    delete recording;
}

const char* zulm_container(const ZulmRecording* recording) {
    return recording->container.c_str();
}

double zulm_duration(const ZulmRecording* recording) {
    return recording->duration.value_or(s_nothing);
}

size_t zulm_stream_count(const ZulmRecording* recording) {
    return recording->found.summaries.size();
}

const ZulmStream* zulm_stream(const ZulmRecording* recording, size_t index) {
    return &recording->found.summaries[index];
}

size_t zulm_hidden_count(const ZulmRecording* recording) {
    return recording->hidden.summaries.size();
}

const ZulmStream* zulm_hidden(const ZulmRecording* recording, size_t index) {
    return &recording->hidden.summaries[index];
}

ZulmEntries* zulm_read_entries(ZulmRecording* recording, const char* kind) {
    return orNull([&] { return readEntries(*recording, infoNamed(*recording, kind)).release(); });
}

ZulmEntries* zulm_read_hidden(ZulmRecording* recording, size_t index) {
    return orNull([&] { return readEntries(*recording, recording->hidden.infos[index]).release(); });
}

ZulmEntries* zulm_read_key_captions(ZulmRecording* recording, int32_t showsKeys) {
    return orNull([&] { return readKeyCaptions(*recording, showsKeys != 0).release(); });
}

void zulm_free_entries(ZulmEntries* entries) {
    delete entries;
}

size_t zulm_entry_count(const ZulmEntries* entries) {
    return entries->times.size();
}

const double* zulm_entry_times(const ZulmEntries* entries) {
    return entries->times.data();
}

size_t zulm_column_count(const ZulmEntries* entries) {
    return entries->views.size();
}

const ZulmColumn* zulm_column(const ZulmEntries* entries, size_t index) {
    return &entries->views[index];
}

ZulmText* zulm_info(ZulmRecording* recording) {
    return orNull([&] { return new ZulmText{Zulm::jsonLines(Zulm::infoDocument(recording->recording))}; });
}

ZulmText* zulm_verify(ZulmRecording* recording) {
    return orNull([&] {
        Zulm::Recording& opened = recording->recording;
        return new ZulmText{Zulm::jsonLines(Zulm::verifyDocument(opened.name(), opened.validation()))};
    });
}

ZulmText* zulm_dump(ZulmRecording* recording, const char* kinds) {
    return orNull([&] {
        auto text = std::make_unique<ZulmText>();
        Zulm::writeDump(recording->recording, typesNamed(*recording, kinds),
                        [&](std::string_view piece) { text->bytes += piece; });
        return text.release();
    });
}

const char* zulm_text_bytes(const ZulmText* text) {
    return text->bytes.data();
}

size_t zulm_text_size(const ZulmText* text) {
    return text->bytes.size();
}

void zulm_free_text(ZulmText* text) {
    delete text;
}
