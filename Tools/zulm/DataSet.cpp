#include "Tools/zulm/DataSet.h"

#include "Platform/DurableFile.h"
#include "Reports/Report.h"
#include "Reports/Text.h"
#include "Tools/zulm/Failure.h"
#include "Tools/zulm/OnFile.h"
#include "Tools/zulm/OutputFile.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include <fmt/core.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <set>
#include <stdexcept>
#include <string_view>
#include <utility>

namespace Zulm {

using Json = nlohmann::ordered_json;

namespace {

constexpr auto s_manifestName = "manifest.ndjson";
constexpr auto s_recordingKey = "recording";
constexpr auto s_nameKey = "name";
constexpr auto s_journalName = ".commit.json";
constexpr std::string_view s_partBegin = "part-";
constexpr std::string_view s_folderBegin = "kind=";
constexpr std::size_t s_longestLine = std::size_t{1} << 20; // of a manifest; paths are much shorter
constexpr auto s_lockName = ".writing";
constexpr std::uint64_t s_uncommittedParts = 16; // as many as may be lost when a run ends early

std::string absolutePath(const std::string& path) {
    return onFile(path, [&] { return std::filesystem::weakly_canonical(path).string(); });
}

std::string headerLine(const DataSet::Description& description) {
    std::vector<std::string> kinds = description.kinds;
    std::sort(kinds.begin(), kinds.end());
    kinds.erase(std::unique(kinds.begin(), kinds.end()), kinds.end());
    return jsonLine(Json{
        {"schema", "zulm.data-set"}, {"schema_version", 1}, {"format", nameOf(description.format)}, {"kinds", kinds}});
}

Json manifestLine(const std::string& path, const RecordingState& state) {
    Json line;
    addText(line, s_recordingKey, path);
    addText(line, s_nameKey, state.name);
    line.update({{"bytes", state.size},
                 {"modified", state.modified},
                 {"checksum", fmt::format("{:016x}", state.checksum)},
                 {"is_whole", state.isWhole}});
    return line;
}

/// Returns the bytes of a text that `addText` has added. Throws what the document throws.
std::string storedText(const Json& line, const std::string& key) {
    const std::string bytesKey = key + "_base64";
    return line.contains(bytesKey) ? bytesOfBase64(line.at(bytesKey).get<std::string>())
                                   : line.at(key).get<std::string>();
}

/// Returns the path and what the manifest says. Throws what the document throws, and `std::logic_error`.
std::pair<std::string, RecordingState> recordingOf(const Json& line) {
    return {storedText(line, s_recordingKey),
            {storedText(line, s_nameKey), line.at("bytes").get<std::uint64_t>(),
             line.at("modified").get<std::int64_t>(), std::stoull(line.at("checksum").get<std::string>(), nullptr, 16),
             line.at("is_whole").get<bool>()}};
}

/// Reads lines up to a length, so that a damaged file takes no memory.
class Lines {
public:
    explicit Lines(const std::string& path) : path_(path), file_(openInput(path)), buffer_(s_longestLine) {}

    /// Returns nothing after the last one. Throws `Failure`.
    std::optional<std::string_view> next() {
        ++number_;
        errno = 0;
        if (file_.getline(buffer_.data(), static_cast<std::streamsize>(buffer_.size())))
            return std::string_view(buffer_.data(), static_cast<std::size_t>(file_.gcount()) - (file_.eof() ? 0 : 1));
        if (file_.bad())
            throw Failure(fmt::format("{}: cannot be read: {}", path_, std::strerror(errno != 0 ? errno : EIO)));
        if (!file_.eof())
            throwDamage();
        return std::nullopt;
    }

    /// Throws `Failure` about the line that was read last.
    [[noreturn]] void throwDamage() const {
        throw Failure(fmt::format("{}: line {} is damaged; export into a new folder", path_, number_));
    }

private:
    std::string path_;
    std::ifstream file_;
    std::vector<char> buffer_;
    std::uint64_t number_ = 0;
};

/// Returns what is in a folder, which is opened again if a signal interrupts that. Throws `Failure`.
std::filesystem::directory_iterator filesIn(const std::string& folder) {
    std::error_code error;
    std::filesystem::directory_iterator files(folder, error);
    while (error == std::errc::interrupted)
        files = std::filesystem::directory_iterator(folder, error);
    if (error)
        throw Failure(fmt::format("{}: {}", folder, error.message()));
    return files;
}

/// Throws `Failure` if the folder of a kind is somewhere else.
void requireNoLink(const std::string& folder) {
    if (onFile(folder, [&] { return std::filesystem::is_symlink(folder); }))
        throw Failure(fmt::format("{}: is a symbolic link; export into a new folder", folder));
}

} // namespace

RecordingState RecordingState::of(const std::string& path) {
    RecordingState state;
    state.name = path;
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
    if (format_ == TableFormat::Parquet)
        parquet_.emplace(folder_); // first, so that nothing is created without it
    createFolder(folder_);
    lock();
    try {
        open(description);
    } catch (...) { // the folder may be another program's
        lock_->remove();
        throw;
    }
}

void DataSet::open(const Description& description) {
    openManifest(description);
    if (std::filesystem::exists(pathOf(s_journalName)))
        apply(pathOf(s_journalName));
    readManifest();
    removeLeftovers();
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
        if (std::any_of(filesIn(folder_), std::filesystem::directory_iterator(),
                        [](const auto& entry) { return !entry.path().filename().string().starts_with("."); }))
            throw Failure(fmt::format("{}: is a folder with other files in it; name a new one", folder_));
        return replaceDurably(path, header + '\n');
    }
    if (Lines(path).next() != header)
        throw Failure(fmt::format("{}: has entries of another format or of other kinds; name a new folder", folder_));
}

void DataSet::readManifest() {
    Lines lines(pathOf(s_manifestName));
    lines.next(); // what the data set is
    while (const auto line = lines.next())
        try {
            const auto [path, state] = recordingOf(Json::parse(*line));
            names_[nameInRows(state.name, format_)] = path;
            manifest_[path] = state;
        } catch (const Json::exception&) {
            lines.throwDamage();
        } catch (const std::logic_error&) {
            lines.throwDamage();
        }
}

void DataSet::removeLeftovers() const {
    using ZULMetaData::LockFile;
    for (const auto& entry : filesIn(folder_)) {
        const bool isLock = entry.path().filename().string().starts_with(std::string(s_lockName) + '.');
        if (isLock && LockFile::stateOf(entry.path()) == LockFile::State::Left) // before it had its name
            std::filesystem::remove(entry.path());
        if (entry.is_directory() && !entry.is_symlink() && entry.path().filename().string().starts_with(s_folderBegin))
            for (const auto& file : filesIn(entry.path().string()))
                if (isUnfinished(file.path().string()))
                    std::filesystem::remove(file.path());
    }
}

bool DataSet::claim(const std::string& path) {
    const std::lock_guard lock(mutex_);
    return claimed_.insert(absolutePath(path)).second;
}

void DataSet::takeName(const std::string& path) {
    const std::lock_guard lock(mutex_);
    const std::string absolute = absolutePath(path);
    const std::string& other = names_.try_emplace(nameInRows(path, format_), absolute).first->second;
    if (other == absolute)
        return;
    if (nameInRows(other, format_) == nameInRows(absolute, format_))
        throw Failure(fmt::format("{}: looks like {} in the tables, because a name is not UTF-8; rename one of them",
                                  path, other));
    throw Failure(
        fmt::format("{}: is the name of {} in {}; name the recording by its absolute path", path, other, folder_));
}

std::optional<RecordingState> DataSet::stateOf(const std::string& path) const {
    const auto found = manifest_.find(absolutePath(path));
    return found == manifest_.end() ? std::nullopt : std::optional(found->second);
}

std::unique_ptr<TablePart> DataSet::newPart(Table& table, const TableHead& head) {
    const std::string folder = std::string(s_folderBegin) + head.kind;
    if (!table.next) {
        requireNoLink(pathOf(folder));
        createFolder(pathOf(folder));
        table.next = 0;
        for (const auto& file : filesIn(pathOf(folder)))
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
    if (hasFailed_)
        throw HasFailed();
}

bool DataSet::hasFailed() const {
    const std::lock_guard lock(mutex_);
    return hasFailed_;
}

void DataSet::append(const TableHead& head, const std::string& lines) {
    const std::lock_guard lock(mutex_);
    requireUsable();
    try {
        appendTo(tables_[head.kind], head, lines);
    } catch (...) {
        hasFailed_ = true;
        throw;
    }
}

void DataSet::appendTo(Table& table, const TableHead& head, const std::string& lines) {
    if (!table.open)
        table.open = newPart(table, head);
    const std::uint64_t before = table.open->bytes();
    table.open->append(lines);
    uncommittedBytes_ += table.open->bytes() - before;
    if (table.open->bytes() >= partBytes_)
        endPart(table);
}

void DataSet::endPart(Table& table) {
    const std::uint64_t before = table.open->bytes();
    table.open->end();
    uncommittedBytes_ += table.open->bytes() - before;
    ended_.push_back(table.open->name());
    table.open.reset();
}

void DataSet::endRecording(const std::string& path, const RecordingState& state) {
    const std::lock_guard lock(mutex_);
    try {
        access_.addInput(path);
        done_.push_back(manifestLine(absolutePath(path), state));
    } catch (...) { // its rows must not be committed without it
        hasFailed_ = true;
        throw;
    }
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
    try {
        commitUncommitted();
    } catch (...) { // what is half committed must stay as it is for the next run
        hasFailed_ = true;
        throw;
    }
}

void DataSet::commitUncommitted() {
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

/// Returns whether it is the name of a part that this program writes, and leads nowhere else.
bool DataSet::isPartName(const std::string& part) const {
    std::string_view rest = part;
    const auto skip = [&rest](std::string_view begin) {
        const bool isThere = rest.starts_with(begin);
        rest.remove_prefix(isThere ? begin.size() : 0);
        return isThere;
    };
    const std::size_t slash = rest.find('/');
    if (slash == std::string_view::npos || !skip(s_folderBegin) ||
        !ZULMetaData::findMetaDataKind(std::string(rest.substr(0, slash - s_folderBegin.size()))))
        return false;
    rest = std::string_view(part).substr(slash + 1);
    if (!skip(s_partBegin))
        return false;
    const std::size_t digits = std::min(rest.find_first_not_of("0123456789"), rest.size());
    return digits > 0 && rest.substr(digits) == "." + nameOf(format_);
}

/// A folder can come from anybody: nothing outside of it may change, whatever its files say.
DataSet::Commit DataSet::readCommit(const std::string& journal) const {
    Commit commit;
    try {
        const Json found = onFile(journal, [&] {
            std::ifstream file = openInput(journal);
            return Json::parse(file);
        });
        commit.parts = found.at("parts").get<std::vector<std::string>>();
        const Json& recordings = found.at("recordings");
        for (const Json& line : recordings) {
            const auto [path, state] = recordingOf(line);
            commit.lines += jsonLine(manifestLine(path, state)) + '\n';
        }
        const Json& bytes = found.at("manifest_bytes");
        commit.manifestBytes = bytes.get<std::uint64_t>();
        if (recordings.is_array() && bytes.is_number_unsigned() &&
            commit.manifestBytes <= std::filesystem::file_size(pathOf(s_manifestName)) &&
            std::all_of(commit.parts.begin(), commit.parts.end(),
                        [this](const auto& part) { return isPartName(part); }))
            return commit;
    } catch (const Json::exception&) { // reported below
    } catch (const std::logic_error&) {
    }
    throw Failure(fmt::format("{}: is damaged; export into a new folder", journal));
}

/// Can be repeated, so that the next run ends a commit that this one could not end.
void DataSet::apply(const std::string& journal) {
    const Commit commit = readCommit(journal);
    std::set<std::string> folders;
    for (const std::string& part : commit.parts)
        folders.insert(std::filesystem::path(pathOf(part)).parent_path().string());
    for (const std::string& folder : folders)
        requireNoLink(folder);
    for (const std::string& part : commit.parts)
        moveIn(part);
    for (const std::string& folder : folders)
        syncByName(folder);
    syncByName(folder_); // which may have new folders
    const std::string path = pathOf(s_manifestName);
    onFile(path, [&] {
        ZULMetaData::DurableFile manifest(path);
        manifest.truncate(commit.manifestBytes);
        manifest.writeAt(commit.manifestBytes, commit.lines);
        manifest.sync();
        std::filesystem::remove(journal);
    });
}

} // namespace Zulm
