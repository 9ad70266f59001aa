#include "Tools/zulm/DataSet.h"

#include "Platform/DurableFile.h"
#include "Reports/Report.h"
#include "Reports/Text.h"
#include "Tools/zulm/Failure.h"
#include "Tools/zulm/OnFile.h"

#include <fmt/core.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string_view>

namespace Zulm {

using Json = nlohmann::ordered_json;

namespace {

constexpr auto s_manifestName = "manifest.ndjson";
constexpr auto s_recordingKey = "recording";
constexpr auto s_bytesKey = "recording_base64";
constexpr auto s_journalName = ".commit.json";
constexpr std::string_view s_partBegin = "part-";
constexpr auto s_lockName = ".writing";
constexpr std::uint64_t s_uncommittedParts = 16; // as many as may be lost when a run ends early

std::string absolutePath(const std::string& path) {
    return std::filesystem::absolute(path).lexically_normal().string();
}

std::string headerLine(const DataSet::Description& description) {
    std::vector<std::string> kinds = description.kinds;
    std::sort(kinds.begin(), kinds.end());
    return jsonLine(Json{
        {"schema", "zulm.data-set"}, {"schema_version", 1}, {"format", nameOf(description.format)}, {"kinds", kinds}});
}

Json manifestLine(const std::string& path, const RecordingState& state) {
    Json line;
    addText(line, s_recordingKey, path);
    line.update({{"bytes", state.size},
                 {"modified", state.modified},
                 {"checksum", fmt::format("{:016x}", state.checksum)},
                 {"is_whole", state.isWhole}});
    return line;
}

} // namespace

RecordingState RecordingState::of(const std::string& path) {
    RecordingState state;
    try {
        state.size = std::filesystem::file_size(path);
        state.modified = std::filesystem::last_write_time(path).time_since_epoch().count();
    } catch (const std::filesystem::filesystem_error& error) {
        throw Failure(fmt::format("{}: {}", path, error.code().message()));
    }
    return state;
}

DataSet::DataSet(const std::string& folder, const Description& description)
    : folder_(folder), format_(description.format), partBytes_(description.partBytes) {
    createFolder(folder_);
    lock();
    openManifest(description);
    if (std::filesystem::exists(pathOf(s_journalName)))
        apply(pathOf(s_journalName));
    readManifest();
    removeLeftovers();
    if (format_ == TableFormat::Parquet)
        parquet_.emplace(folder_);
}

DataSet::~DataSet() {
    try {
        tables_.clear();
        if (!std::filesystem::exists(pathOf(s_journalName))) // the next run needs the parts that it names
            removeLeftovers();
        lock_->remove();
    } catch (const std::exception&) { // the next run removes what is left
    }
}

std::string DataSet::pathOf(const std::string& name) const {
    return (std::filesystem::path(folder_) / name).string();
}

void DataSet::lock() {
    using ZULMetaData::LockFile;
    const std::string path = pathOf(s_lockName);
    onFile(path, [&] {
        const LockFile::State state = LockFile::stateOf(path);
        if (state == LockFile::State::Held)
            throw Failure(fmt::format("{}: another program writes to this data set; wait until it has ended", folder_));
        if (state == LockFile::State::Left)
            std::filesystem::remove(path);
        lock_ = std::make_unique<LockFile>(path, "zulm export writes to this folder\n");
    });
}

void DataSet::openManifest(const Description& description) {
    const std::string path = pathOf(s_manifestName);
    const std::string header = headerLine(description);
    if (!std::filesystem::exists(path)) {
        if (std::any_of(std::filesystem::directory_iterator(folder_), std::filesystem::directory_iterator(),
                        [](const auto& entry) { return !entry.path().filename().string().starts_with("."); }))
            throw Failure(fmt::format("{}: is a folder with other files in it; name a new one", folder_));
        return replaceDurably(path, header + '\n');
    }
    std::string found;
    std::ifstream file(path, std::ios::binary);
    if (!std::getline(file, found))
        throw Failure(fmt::format("{}: cannot be read", path));
    if (found != header)
        throw Failure(fmt::format("{}: has entries of another format or of other kinds; name a new folder", folder_));
}

void DataSet::readManifest() {
    const std::string path = pathOf(s_manifestName);
    std::ifstream file(path, std::ios::binary);
    std::string text;
    std::getline(file, text);
    for (std::uint64_t number = 2; std::getline(file, text); ++number)
        try {
            const Json line = Json::parse(text);
            const std::string& recording = line.at(line.contains(s_bytesKey) ? s_bytesKey : s_recordingKey);
            manifest_[recording] = {line.at("bytes"), line.at("modified"),
                                    std::stoull(line.at("checksum").get<std::string>(), nullptr, 16),
                                    line.at("is_whole")};
        } catch (const std::exception&) {
            throw Failure(fmt::format("{}: line {} is damaged; export into a new folder", path, number));
        }
    if (file.bad())
        throw Failure(fmt::format("{}: cannot be read", path));
}

void DataSet::removeLeftovers() const {
    for (const auto& entry : std::filesystem::directory_iterator(folder_))
        if (entry.is_directory() && entry.path().filename().string().starts_with("kind="))
            for (const auto& file : std::filesystem::directory_iterator(entry.path()))
                if (isUnfinished(file.path().string()))
                    std::filesystem::remove(file.path());
}

bool DataSet::claim(const std::string& path) {
    const std::lock_guard lock(mutex_);
    return claimed_.insert(absolutePath(path)).second;
}

std::optional<RecordingState> DataSet::stateOf(const std::string& path) const {
    const Json name = manifestLine(absolutePath(path), {});
    const auto found = manifest_.find(name.at(name.contains(s_bytesKey) ? s_bytesKey : s_recordingKey));
    return found == manifest_.end() ? std::nullopt : std::optional(found->second);
}

std::unique_ptr<TablePart> DataSet::newPart(Table& table, const TableHead& head) {
    const std::string folder = "kind=" + head.kind;
    if (!table.next) {
        createFolder(pathOf(folder));
        table.next = 0;
        for (const auto& file : std::filesystem::directory_iterator(pathOf(folder)))
            if (const std::string name = file.path().filename().string(); name.starts_with(s_partBegin))
                table.next = std::max<std::uint64_t>(*table.next,
                                                     std::strtoull(name.c_str() + s_partBegin.size(), nullptr, 10) + 1);
    }
    return newTablePart(folder_, fmt::format("{}/{}{:05}.{}", folder, s_partBegin, (*table.next)++, nameOf(format_)),
                        head, parquet_ ? &*parquet_ : nullptr);
}

std::shared_lock<std::shared_mutex> DataSet::beginRecording() {
    std::shared_lock begun(recordings_);
    const std::lock_guard lock(mutex_);
    requireUsable();
    return begun;
}

void DataSet::requireUsable() const {
    if (failure_)
        std::rethrow_exception(failure_);
}

void DataSet::append(const TableHead& head, const std::string& lines) {
    const std::lock_guard lock(mutex_);
    requireUsable();
    try {
        appendTo(tables_[head.kind], head, lines);
    } catch (...) {
        failure_ = std::current_exception();
        throw;
    }
}

void DataSet::appendTo(Table& table, const TableHead& head, const std::string& lines) {
    if (!table.open)
        table.open = newPart(table, head);
    table.open->append(lines);
    uncommittedBytes_ += lines.size();
    if (table.open->bytes() >= partBytes_)
        endPart(table);
}

void DataSet::endPart(Table& table) {
    table.open->end();
    ended_.push_back(table.open->name());
    table.open.reset();
}

void DataSet::endRecording(const std::string& path, const RecordingState& state) {
    const std::lock_guard lock(mutex_);
    done_.push_back(manifestLine(absolutePath(path), state));
    access_.addInput(path);
}

void DataSet::commitIfDue() {
    const auto isDue = [this] {
        const std::lock_guard lock(mutex_);
        return uncommittedBytes_ >= s_uncommittedParts * partBytes_;
    };
    if (!isDue())
        return;
    const std::unique_lock nobodyElse(recordings_);
    if (isDue()) // another thread may have committed meanwhile
        commitAll();
}

void DataSet::commit() {
    const std::unique_lock nobodyElse(recordings_);
    commitAll();
}

void DataSet::commitAll() {
    const std::lock_guard lock(mutex_);
    requireUsable();
    for (auto& [kind, table] : tables_)
        if (table.open)
            endPart(table);
    if (done_.empty() && ended_.empty())
        return;
    for (const std::string& part : ended_)
        access_.applyTo(pathOf(hiddenName(part)));
    const std::string journal = pathOf(s_journalName);
    const Json commit{{"manifest_bytes", std::filesystem::file_size(pathOf(s_manifestName))},
                      {"parts", ended_},
                      {"recordings", done_}};
    replaceDurably(journal, jsonLine(commit));
    apply(journal);
    parts_ += ended_.size();
    ended_.clear();
    done_.clear();
    access_ = FileAccess();
    uncommittedBytes_ = 0;
}

/// Lets readers see a part.
void DataSet::moveIn(const std::string& part) const {
    const std::string whole = pathOf(part);
    const std::string hidden = pathOf(hiddenName(part));
    onFile(whole, [&] {
        if (std::filesystem::exists(hidden))
            std::filesystem::rename(hidden, whole);
        else if (!std::filesystem::exists(whole))
            throw Failure(fmt::format("{}: is missing; export into a new folder", whole));
    });
}

/// Can be repeated, so that the next run ends a commit that this one could not end.
void DataSet::apply(const std::string& journal) {
    std::ifstream file(journal, std::ios::binary);
    const Json commit = Json::parse(file, nullptr, false);
    if (!commit.is_object() || !commit.contains("manifest_bytes") || !commit.contains("parts") ||
        !commit.contains("recordings"))
        throw Failure(fmt::format("{}: is damaged; export into a new folder", journal));
    for (const std::string part : commit.at("parts"))
        moveIn(part);
    std::string lines;
    for (const Json& recording : commit.at("recordings"))
        lines += jsonLine(recording) + '\n';
    const std::string path = pathOf(s_manifestName);
    onFile(path, [&] {
        ZULMetaData::DurableFile manifest(path);
        manifest.truncate(commit.at("manifest_bytes"));
        manifest.writeAt(commit.at("manifest_bytes"), lines);
        manifest.sync();
        std::filesystem::remove(journal);
    });
}

} // namespace Zulm
