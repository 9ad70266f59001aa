#include "Tools/zulm/TablePart.h"

#include "Platform/DurableFile.h"
#include "Platform/NewFile.h"
#include "Reports/Text.h"
#include "Tools/zulm/Failure.h"
#include "Tools/zulm/OnFile.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/ParquetProgram.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <optional>
#include <vector>

namespace Zulm {

namespace {

namespace fs = std::filesystem;

constexpr auto s_unfinishedEnd = ".new";
constexpr std::uint64_t s_pieceBytes = std::uint64_t{64} << 20; // of lines, for which DuckDB needs little memory

/// A file that is created.
class LineFile {
public:
    explicit LineFile(std::string path)
        : path_(std::move(path)),
          file_(onFile(path_, [this] { return std::make_unique<ZULMetaData::NewFile>(path_); })) {}

    void append(const std::string& lines) {
        const auto size = static_cast<std::streamsize>(lines.size());
        if (file_->sputn(lines.data(), size) != size)
            throw Failure(fmt::format("{}: {}", path_, file_->failure()));
        bytes_ += lines.size();
    }

    void close() {
        if (!file_->close())
            throw Failure(fmt::format("{}: {}", path_, file_->failure()));
    }

    void closeDurably() {
        close();
        onFile(path_, [this] { ZULMetaData::DurableFile(path_).sync(); });
    }

    std::uint64_t bytes() const { return bytes_; }

private:
    std::string path_;
    std::unique_ptr<ZULMetaData::NewFile> file_;
    std::uint64_t bytes_ = 0;
};

class TextPart final : public TablePart {
public:
    TextPart(const std::string& folder, const std::string& name, const std::string& header)
        : TablePart(name), file_((fs::path(folder) / hiddenName(name)).string()) {
        file_.append(header);
    }
    void append(const std::string& lines) override { file_.append(lines); }
    std::uint64_t bytes() const override { return file_.bytes(); }
    void end() override { file_.closeDurably(); }

private:
    LineFile file_;
};

/// Lines become Parquet piece by piece, and the pieces become one file at the end, so that neither the lines of a whole
/// file are on the disk nor its rows in memory.
class ParquetPart final : public TablePart {
public:
    ParquetPart(const std::string& folder, const std::string& name, const TableHead& head,
                const ParquetProgram& program)
        : TablePart(name), folder_(folder), program_(program) {
        lines_.columns = head.columns;
    }

    void append(const std::string& lines) override {
        if (!file_) {
            lines_.file = fmt::format("{}.{}.lines", hiddenName(name()), pieces_.size());
            file_.emplace(pathOf(lines_.file));
        }
        for (std::size_t begin = 0, end; begin < lines.size(); begin = end + 1) {
            end = std::min(lines.find('\n', begin), lines.size());
            lines_.longest = std::max<std::uint64_t>(lines_.longest, end - begin);
        }
        file_->append(lines);
        if (file_->bytes() >= s_pieceBytes)
            endPiece();
    }

    std::uint64_t bytes() const override { return bytes_; }

    void end() override {
        if (file_)
            endPiece();
        const std::string whole = hiddenName(name());
        onFile(pathOf(whole), [&] {
            if (pieces_.size() == 1)
                fs::rename(pathOf(pieces_.front()), pathOf(whole));
            else
                program_.join(pieces_, whole);
            ZULMetaData::DurableFile(pathOf(whole)).sync();
            for (const std::string& piece : pieces_)
                fs::remove(pathOf(piece));
        });
    }

private:
    std::string pathOf(const std::string& name) const { return (fs::path(folder_) / name).string(); }

    void endPiece() {
        file_->close();
        file_.reset();
        const std::string piece = fmt::format("{}.{}", hiddenName(name()), pieces_.size());
        program_.write(lines_, piece);
        onFile(pathOf(piece), [&] {
            bytes_ += fs::file_size(pathOf(piece));
            fs::remove(pathOf(lines_.file));
        });
        pieces_.push_back(piece);
        lines_.longest = 0;
    }

    std::string folder_;
    const ParquetProgram& program_;
    ParquetProgram::Lines lines_;
    std::optional<LineFile> file_; ///< the lines of the next piece
    std::vector<std::string> pieces_;
    std::uint64_t bytes_ = 0;
};

} // namespace

std::string nameOf(TableFormat format) {
    constexpr std::array names{"csv", "ndjson", "parquet"};
    return names.at(static_cast<std::size_t>(format));
}

std::string nameInRows(const std::string& name, TableFormat format) {
    if (format == TableFormat::CSV)
        return shownLines(name);
    const std::string valid = validText(name);
    return format == TableFormat::NDJSON || valid == name ? valid : shownLines(name);
}

std::string hiddenName(const std::string& part) {
    const fs::path path(part);
    return (path.parent_path() / ("." + path.filename().string())).string();
}

bool isUnfinished(const std::string& path) {
    return fs::path(path).filename().string().starts_with(".part-");
}

std::unique_ptr<TablePart> newTablePart(const std::string& folder, const std::string& name, const TableHead& head,
                                        const ParquetProgram* parquet) {
    if (parquet)
        return std::make_unique<ParquetPart>(folder, name, head, *parquet);
    return std::make_unique<TextPart>(folder, name, head.csv);
}

void replaceDurably(const std::string& path, const std::string& bytes) {
    const bool isHidden = fs::path(path).filename().string().starts_with('.');
    const std::string unfinished = (isHidden ? path : hiddenName(path)) + s_unfinishedEnd;
    onFile(path, [&] {
        fs::remove(unfinished);
        LineFile file(unfinished);
        file.append(bytes);
        file.closeDurably();
        fs::rename(unfinished, path);
    });
    syncFolderOf(path);
}

} // namespace Zulm
