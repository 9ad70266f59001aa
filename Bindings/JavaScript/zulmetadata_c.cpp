#include "Bindings/JavaScript/zulmetadata_c.h"

#include "Bindings/JavaScript/BlockCache.h"
#include "Bindings/JavaScript/EntryColumns.h"
#include "Bindings/Tables/SessionTables.h"
#include "Reports/DumpDocument.h"
#include "Reports/Findings.h"
#include "Reports/InfoReport.h"
#include "Reports/JsonWriter.h"
#include "Reports/Text.h"
#include "ZULMetaDataBridge/Source/RecordingFile.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"
#include "ZULMetaDataBridge/Source/StoredFields.h"

#include <fmt/core.h>

#include <algorithm>
#include <cerrno>
#include <concepts>
#include <exception>
#include <limits>
#include <locale>
#include <memory>
#include <new>
#include <optional>
#include <span>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

using namespace ZULMetaData;
using namespace ZULMetaData::Bindings;

struct ZulmRecording {
    struct Stream {
        StreamReport report;
        std::string kind; // or its identifier if it has none
        std::string uuid;
        ZulmStream summary; // points into these texts
    };

    ZulmRecording(const ByteSource& source, const std::string& name)
        : bytes(source), recording(source, name), duration(recording.duration()),
          found(summarized(recording.examinedStreams())), hidden(summarized(recording.hiddenStreams())) {}

    /// Returns what tables are made from. It is opened at the first call.
    const Recording& session() {
        if (!opened)
            opened.emplace(bytes, recording.name());
        return *opened;
    }

    static std::vector<Stream> summarized(const std::vector<StreamReport>& reports);

    ByteSource bytes;
    RecordingFile recording;
    std::optional<Recording> opened;
    std::optional<double> duration;
    std::vector<Stream> found;
    std::vector<Stream> hidden;
};

struct ZulmEntries {
    std::vector<double> times;
    std::vector<EntryColumn> columns;
    std::vector<ZulmColumn> views;
    std::vector<std::string> warnings;
};

struct ZulmText {
    std::string bytes;
};

namespace {

std::string& lastError() {
    static thread_local std::string message;
    return message;
}

/// Lets no exception out. Returns null if `work` throws.
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

ByteSource::Read readingWith(ZulmReadAt readAt, void* context) {
    return [=](std::uint64_t position, std::span<char> bytes) {
        const std::int64_t got = readAt(context, position, bytes.data(), bytes.size());
        if (got < 0)
            throw std::system_error(EIO, std::generic_category(), "cannot be read");
        return std::min(static_cast<std::size_t>(got), bytes.size());
    };
}

constexpr double s_nothing = std::numeric_limits<double>::quiet_NaN();

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
void collect(const RecordingFile& recording, const StreamReport& stream, ZulmEntries& entries) {
    using Value = typename Kind::Value;
    ZULMetaData::visitStoredFields<Kind>(Value(), [&entries]<class Stored>(const char* key, const Stored&) {
        entries.columns.emplace_back(key, columnType<Stored>());
    });
    recording.readEntries<Value>(stream, [&entries](double time, const Value& value) {
        entries.times.push_back(time);
        auto column = entries.columns.begin();
        ZULMetaData::visitStoredFields<Kind>(value,
                                             [&column](const char*, const auto& stored) { (column++)->add(stored); });
        return true;
    });
}

const StreamReport& streamNamed(const ZulmRecording& opened, const std::string& kind) {
    for (const ZulmRecording::Stream& stream : opened.found)
        if (stream.kind == kind || stream.uuid == kind)
            return stream.report;
    throw std::runtime_error(fmt::format("{}: holds no stream {}", opened.recording.name(), kind));
}

/// Returns the columns that `collect` fills from the stream.
template <class Collect>
ZulmEntries* entriesOf(const ZulmRecording& opened, const StreamReport& stream, Collect collect) {
    if (!isDecodable(stream.header()))
        throw std::runtime_error(fmt::format("{}: entries of {}, version {}, cannot be decoded",
                                             opened.recording.name(), stream.name(), stream.version));
    auto entries = std::make_unique<ZulmEntries>();
    collect(*entries);
    for (const EntryColumn& column : entries->columns)
        entries->views.push_back(column.view());
    return entries.release();
}

ZulmEntries* readEntries(const ZulmRecording& opened, const StreamReport& stream) {
    return entriesOf(opened, stream, [&](ZulmEntries& entries) {
        RecordedKinds::visit(stream.type, [&]<class Kind>() { collect<Kind>(opened.recording, stream, entries); });
    });
}

std::vector<StreamReport> streamsNamed(const ZulmRecording& opened, const char* kinds) {
    std::vector<StreamReport> streams;
    if (!kinds) {
        for (const ZulmRecording::Stream& stream : opened.found)
            streams.push_back(stream.report);
        return streams;
    }
    std::istringstream list(kinds);
    for (std::string kind; std::getline(list, kind, ',');) {
        const StreamReport& stream = streamNamed(opened, kind);
        if (std::none_of(streams.begin(), streams.end(), [&](const auto& each) { return each.type == stream.type; }))
            streams.push_back(stream);
    }
    return streams;
}

/// Turns the columns of a table into those that the caller sees.
ZulmEntries* entriesOf(Table table) {
    auto entries = std::make_unique<ZulmEntries>();
    entries->times = std::move(table.times);
    entries->warnings = std::move(table.warnings);
    for (const TableColumn& column : table.columns)
        entries->columns.push_back(EntryColumn::of(column));
    for (const EntryColumn& column : entries->columns)
        entries->views.push_back(column.view());
    return entries.release();
}

/// Reads a list such as "least=3,flicker=1".
InsightParameters parametersIn(const char* text) {
    InsightParameters parameters;
    std::istringstream list(text ? text : "");
    list.imbue(std::locale::classic());
    for (std::string name; std::getline(list, name, '=');) {
        double value = 0;
        if (!(list >> value) || (list.peek() != ',' && !list.eof()))
            throw std::invalid_argument("the parameters are not a list such as least=3,flicker=1");
        parameters[name] = value;
        list.ignore();
    }
    return parameters;
}

} // namespace

std::vector<ZulmRecording::Stream> ZulmRecording::summarized(const std::vector<StreamReport>& reports) {
    std::vector<Stream> streams;
    streams.reserve(reports.size());
    for (const StreamReport& report : reports)
        streams.push_back({report, report.name(), uuidText(report.type), {}});
    for (auto& [report, kind, identifier, summary] : streams) {
        const bool isKnown = isDecodable(report.header());
        summary = {kind.c_str(),
                   identifier.c_str(),
                   report.version,
                   isKnown ? report.wholeEntries : 0,
                   report.declaredBytes,
                   report.offset,
                   report.firstTime.value_or(s_nothing),
                   report.lastTime.value_or(s_nothing),
                   isKnown ? 1 : 0};
    }
    return streams;
}

const char* zulm_last_error(void) {
    return lastError().empty() ? "out of memory" : lastError().c_str();
}

ZulmRecording* zulm_open(ZulmReadAt readAt, void* context, uint64_t size, const char* name) {
    return orNull([&] { return new ZulmRecording(cachedInBlocks({size, readingWith(readAt, context)}), name); });
}

void zulm_close(ZulmRecording* recording) {
    delete recording;
}

const char* zulm_container(const ZulmRecording* recording) {
    return containerName(recording->recording.container());
}

double zulm_duration(const ZulmRecording* recording) {
    return recording->duration.value_or(s_nothing);
}

size_t zulm_stream_count(const ZulmRecording* recording) {
    return recording->found.size();
}

const ZulmStream* zulm_stream(const ZulmRecording* recording, size_t index) {
    return &recording->found[index].summary;
}

size_t zulm_hidden_count(const ZulmRecording* recording) {
    return recording->hidden.size();
}

const ZulmStream* zulm_hidden(const ZulmRecording* recording, size_t index) {
    return &recording->hidden[index].summary;
}

ZulmEntries* zulm_read_entries(ZulmRecording* recording, const char* kind) {
    return orNull([&] { return readEntries(*recording, streamNamed(*recording, kind)); });
}

ZulmEntries* zulm_read_hidden(ZulmRecording* recording, size_t index) {
    return orNull([&] { return readEntries(*recording, recording->hidden[index].report); });
}

ZulmEntries* zulm_states(ZulmRecording* recording, const double* times, size_t count, int32_t interpolates) {
    return orNull([&] {
        const Interpolation interpolation = interpolates != 0 ? Interpolation::Linear : Interpolation::Held;
        return entriesOf(statesTable(recording->session(), {times, count}, interpolation));
    });
}

ZulmEntries* zulm_insight(ZulmRecording* recording, const char* name, const char* parameters) {
    return orNull([&] { return entriesOf(insightTable(recording->session(), name, parametersIn(parameters))); });
}

ZulmEntries* zulm_retime(ZulmRecording* recording, const char* edits, const char* name, const char* frameRate) {
    return orNull([&] {
        return entriesOf(
            retimedTable(recording->session(), {edits, name ? name : "edits", frameRate ? frameRate : ""}));
    });
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

size_t zulm_warning_count(const ZulmEntries* entries) {
    return entries->warnings.size();
}

const char* zulm_warning(const ZulmEntries* entries, size_t index) {
    return entries->warnings[index].c_str();
}

ZulmText* zulm_info(ZulmRecording* recording) {
    return orNull([&] { return new ZulmText{Zulm::jsonLines(Zulm::infoDocument(recording->recording))}; });
}

ZulmText* zulm_verify(ZulmRecording* recording) {
    return orNull([&] {
        RecordingFile& opened = recording->recording;
        return new ZulmText{Zulm::jsonLines(Zulm::verifyDocument(opened.name(), opened.validation()))};
    });
}

ZulmText* zulm_dump(ZulmRecording* recording, const char* kinds) {
    return orNull([&] {
        auto text = std::make_unique<ZulmText>();
        Zulm::writeDump(recording->recording, streamsNamed(*recording, kinds),
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
