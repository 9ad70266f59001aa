#include "Reports/EntryFormat.h"
#include "Reports/Text.h"
#include "Tools/zulm/Checksum.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/DataSet.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Interruptions.h"
#include "Tools/zulm/ManyFiles.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <algorithm>
#include <atomic>
#include <map>
#include <memory>
#include <optional>
#include <string_view>
#include <utility>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

constexpr auto s_recordingColumn = "recording";
constexpr auto s_furtherColumn = "further";
constexpr auto s_imageColumn = "image";
constexpr std::uint64_t s_megabyte = 1 << 20;
constexpr std::uint64_t s_mostHeld = 4 * s_megabyte; // of the lines of one recording
constexpr std::uint64_t s_fewestMegabytes = 1;
constexpr std::uint64_t s_mostMegabytes = 4096;

struct ExportOptions {
    ManyFiles files;
    std::vector<std::string> kinds;
    std::string folder;
    TableFormat format = TableFormat::CSV;
    std::uint64_t partMegabytes = 128;
    bool json = false;
};

/// The types that DuckDB has for the columns of a kind.
class ColumnTypes {
public:
    template <class Kind>
    static Json of() {
        ColumnTypes types;
        visitStoredFields<Kind>(typename Kind::Value{},
                                [&types](const char* key, const auto& value) { types.add(key, value); });
        Json columns{{s_recordingColumn, "VARCHAR"}};
        for (const std::string& key : tableKeys<Kind>()) {
            const auto type = types.types_.find(key);
            const char* const number = type == types.types_.end() ? "DOUBLE" : type->second; // or the time
            columns[key] = key == s_furtherColumn ? "VARCHAR[]" : number;
        }
        return columns;
    }

private:
    void add(const char* key, std::int32_t) { types_[key] = "INTEGER"; }
    void add(const char* key, std::uint32_t) { types_[key] = "UINTEGER"; }
    void add(const char* key, std::uint64_t) { types_[key] = "UBIGINT"; }
    void add(const char* key, float) { types_[key] = "FLOAT"; }
    void add(const char* key, double) { types_[key] = "DOUBLE"; }
    void add(const char* key, const std::string&) { types_[key] = "VARCHAR"; }
    void add(const char* key, const CursorImage&) { types_[key] = "BLOB"; }

    std::map<std::string, const char*> types_;
};

/// Reads the entries of one recording, and appends them to a data set if there is one.
class RecordingExport {
public:
    RecordingExport(const RecordingFile& recording, TableFormat format, DataSet* dataSet)
        : recording_(recording), format_(format), dataSet_(dataSet) {}

    ExitCode run(const std::vector<StreamInfo>& streams) {
        ExitCode worst = ExitFine;
        for (const StreamInfo& stream : streams)
            if (!RecordedKinds::visit(stream.type,
                                      [&]<class Kind>() { worst = worseOf(worst, readStream<Kind>(stream)); }))
                say(fmt::format("{}: entries of {} cannot be decoded", recording_.name(), stream.name()));
        appendHeld();
        return worst;
    }

    std::uint64_t checksum() const { return checksum_.value(); }
    std::uint64_t entries() const { return entries_; }
    bool hasAppended() const { return hasAppended_; } ///< returns whether the data set has some of the entries

private:
    template <class Kind>
    ExitCode readStream(const StreamInfo& stream) {
        const EntryKeys keys = tableKeys<Kind>();
        const TableHead head = headOf<Kind>(stream, keys);
        const std::string name = csvLine({{s_recordingColumn, recording_.name()}}, {s_recordingColumn});
        StreamEntries entries = recording_.entriesOf(stream);
        const bool canBeDecoded = entries.header() && isDecodable(*entries.header());
        std::optional<std::uint64_t> damage; // the offset of an entry that does not fit its kind
        std::string lines;
        checksum_.add(stream.name());
        while (const auto entry = canBeDecoded ? entries.next() : std::nullopt) {
            const auto bytes = entries.bytesOf(*entry);
            checksum_.add({bytes.data(), bytes.size()});
            const auto decoded = decodeEntry<typename Kind::Value>(bytes, entries.header()->version);
            if (!decoded) {
                damage = entry->offset;
                break;
            }
            ++entries_;
            if (dataSet_)
                lines += lineOf<Kind>(*decoded, keys, name);
            if (lines.size() >= s_megabyte)
                hold(head, lines);
        }
        hold(head, lines);
        const std::uint64_t end = canBeDecoded ? damage.value_or(entries.wholeBytes()) : 0;
        return dataSet_ ? complainAboutRest(recording_, stream, end, "exported") : ExitFine;
    }

    template <class Kind>
    TableHead headOf(const StreamInfo& stream, const EntryKeys& keys) const {
        TableHead head{stream.name(), {}, ColumnTypes::of<Kind>()};
        if (format_ == TableFormat::CSV)
            head.csv = fmt::format("{},{}\n", csvHeader({s_recordingColumn}), csvHeader(keys));
        return head;
    }

    template <class Kind>
    std::string lineOf(const TimedValue<typename Kind::Value>& decoded, const EntryKeys& keys,
                       const std::string& name) const {
        Json entry = entryDocument<Kind>(decoded.time, decoded.value);
        if (format_ == TableFormat::CSV)
            return fmt::format("{},{}\n", name, csvLine(entry, keys));
        if constexpr (std::same_as<typename Kind::Value, CursorImage>)
            if (format_ == TableFormat::Parquet)
                entry[s_imageColumn] = imageOf(decoded.value);
        Json line;
        if (format_ == TableFormat::Parquet)
            line[s_recordingColumn] = nameInRows(recording_.name(), format_);
        else
            addText(line, s_recordingColumn, recording_.name());
        line.update(entry);
        return jsonLine(line) + '\n';
    }

    static Json imageOf(const CursorImage& cursor) {
        if (!cursor.imageData || cursor.imageDataSize == 0)
            return nullptr;
        return base64({reinterpret_cast<const char*>(cursor.imageData), cursor.imageDataSize});
    }

    /// Takes the lines. A recording that fails early then leaves nothing in the data set, and the next run tries again.
    void hold(const TableHead& head, std::string& lines) {
        NotedSignals::check();
        if (lines.empty())
            return;
        heldBytes_ += lines.size();
        held_.emplace_back(head, std::exchange(lines, {}));
        if (heldBytes_ >= s_mostHeld)
            appendHeld();
    }

    void appendHeld() {
        hasAppended_ = hasAppended_ || !held_.empty();
        for (const auto& [head, lines] : held_)
            dataSet_->append(head, lines);
        held_.clear();
        heldBytes_ = 0;
    }

    const RecordingFile& recording_;
    TableFormat format_;
    DataSet* dataSet_;
    Checksum checksum_;
    std::uint64_t entries_ = 0;
    std::vector<std::pair<TableHead, std::string>> held_;
    std::size_t heldBytes_ = 0;
    bool hasAppended_ = false;
};

/// Exports recordings that the data set does not have.
class Exporter {
public:
    Exporter(const ExportOptions& options, DataSet& dataSet) : options_(options), dataSet_(dataSet) {}

    ExitCode run(const std::string& path, RunReport& report) {
        try {
            NotedSignals::check();
            const ExitCode code = runOne(path, report);
            dataSet_.commitIfDue();
            return code;
        } catch (const DataSet::HasFailed&) { // about which another recording complains
            return ExitFailed;
        }
    }

    std::uint64_t exported() const { return exported_; }
    std::uint64_t passedOver() const { return passedOver_; }

private:
    ExitCode runOne(const std::string& path, RunReport& report) {
        const auto begun = dataSet_.beginRecording();
        requireFile(path);
        if (!dataSet_.claim(path))
            return passOver(path, report);
        RecordingState state = RecordingState::of(path);
        const std::optional<RecordingState> known = dataSet_.stateOf(path);
        if (known && known->size == state.size && known->modified == state.modified)
            return passOver(path, report, known->isWhole);
        if (!known)
            dataSet_.takeName(path);
        RecordingFile recording = openRecording(path);
        const std::vector<StreamInfo> streams = chosenStreams(recording, options_.kinds);
        if (known)
            return requireUnchanged(recording, streams, *known, state, report);
        RecordingExport work(recording, options_.format, &dataSet_);
        try {
            const ExitCode code = work.run(streams);
            state.checksum = work.checksum();
            state.isWhole = code == ExitFine;
            dataSet_.endRecording(path, state);
            ++exported_;
            tell(report, path, "exported", work.entries());
            return recording.streams().empty() ? complainAboutNothing(recording, {}) : code;
        } catch (...) {
            state.isWhole = false;
            if (work.hasAppended())
                dataSet_.endRecording(path, state);
            throw;
        }
    }

    ExitCode passOver(const std::string& path, RunReport& report, bool isWhole = true) {
        if (isWhole)
            say(fmt::format("{}: is in the data set", path));
        else
            complain(fmt::format("{}: is in the data set in part; repair the recording and export it into a new folder",
                                 path));
        ++passedOver_;
        tell(report, path, "present", 0);
        return isWhole ? ExitFine : ExitDamaged;
    }

    void tell(RunReport& report, const std::string& path, const char* state, std::uint64_t entries) const {
        if (!report.isWanted())
            return;
        Json file = fileHeader(path);
        addText(file, "output", options_.folder);
        file.update({{"state", state}, {"entries", entries}});
        report.add(file);
    }

    /// A recording that was copied or touched has another time and the same entries.
    ExitCode requireUnchanged(const RecordingFile& recording, const std::vector<StreamInfo>& streams,
                              const RecordingState& known, RecordingState state, RunReport& report) {
        RecordingExport look(recording, options_.format, nullptr);
        look.run(streams);
        state.checksum = look.checksum();
        if (state.checksum != known.checksum)
            throw Failure(fmt::format("{}: has changed since it was exported to {}; export into a new folder",
                                      recording.name(), options_.folder));
        state.name = known.name;
        state.isWhole = known.isWhole;
        dataSet_.endRecording(recording.name(), state);
        return passOver(recording.name(), report, state.isWhole);
    }

    const ExportOptions& options_;
    DataSet& dataSet_;
    std::atomic<std::uint64_t> exported_ = 0;
    std::atomic<std::uint64_t> passedOver_ = 0;
};

ExitCode exportAll(const ExportOptions& options, RunReport& report) {
    std::vector<std::string> kinds;
    for (const std::string& kind : options.kinds)
        kinds.push_back(metaDataKindName(typeNamed(kind)));
    const NotedSignals noted;
    DataSet dataSet(options.folder, {options.format, kinds, options.partMegabytes * s_megabyte});
    Exporter exporter(options, dataSet);
    const ExitCode code = workOnFiles(
        options.files, report, [&](const std::string& path, RunReport& part) { return exporter.run(path, part); },
        [&dataSet](ExitCode) { return dataSet.hasFailed(); });
    NotedSignals::check();
    if (dataSet.hasFailed())
        return code;
    dataSet.commit();
    if (!settings().quiet && !report.isWanted())
        writeOutput(fmt::format("{}: recordings exported: {}, already there: {}; new files: {}\n",
                                shown(options.folder), exporter.exported(), exporter.passedOver(), dataSet.parts()));
    return code;
}

ExitCode exportOrEnd(const ExportOptions& options, RunReport& report) {
    try {
        return exportAll(options, report);
    } catch (const Interruption& interruption) {
        complain(fmt::format("{}: interrupted; the same command goes on with what is not in it", options.folder));
        endBy(interruption);
    }
}

void requireRecordings(const ManyFiles& files) {
    requireFiles(files);
    if (std::find(files.named.begin(), files.named.end(), "-") != files.named.end())
        throw CLI::ValidationError("FILE", "standard input cannot be exported, since it has no name to be known by");
}

} // namespace

void addExportCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<ExportOptions>();
    CLI::App* command = app.add_subcommand(
        "export",
        "Write the entries of many recordings as tables that databases and data frames read: a folder for "
        "each kind with files of CSV, NDJSON or Parquet, and a manifest. A recording that is in the manifest is passed "
        "over, so the same command adds what is new");
    addManyFiles(*command, options->files, "Movies, RIFF files or stream files");
    command->add_option("-o,--output", options->folder, "The folder of the tables")->required()->type_name("DIR");
    addChoice(*command, "--format", options->format, "What the files are. Parquet needs Node and DuckDB",
              {{"csv", TableFormat::CSV}, {"ndjson", TableFormat::NDJSON}, {"parquet", TableFormat::Parquet}});
    addStreamOption(*command, options->kinds, "Export only this kind, such as cursorLocation (repeatable)");
    addCount(*command, "--part-size", options->partMegabytes,
             "Begin a new file when one has so many MiB; 128 unless told otherwise");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm export --format parquet *.mp4 -o Tables\n"
                    "find Recordings -name '*.mp4' -print0 | zulm export --files-from - --null --jobs 0 -o Tables");
    command->callback([options, &chosen] {
        requireRecordings(options->files);
        requireKinds("--stream", options->kinds, "has no entries", []<class Kind>() { return true; });
        if (options->partMegabytes < s_fewestMegabytes || options->partMegabytes > s_mostMegabytes)
            throw CLI::ValidationError("--part-size", fmt::format("{} is not from {} to {}", options->partMegabytes,
                                                                  s_fewestMegabytes, s_mostMegabytes));
        chosen = reportingOnMany("export", options->json, options->files,
                                 [options](RunReport& report) { return exportOrEnd(*options, report); });
    });
}

} // namespace Zulm
