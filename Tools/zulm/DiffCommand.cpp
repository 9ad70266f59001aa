#include "Reports/EntryFormat.h"
#include "Reports/Text.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"

#include <fmt/core.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>
#include <limits>
#include <memory>
#include <optional>
#include <utility>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct DiffOptions {
    std::string left;
    std::string right;
    std::vector<std::string> kinds;
    std::uint64_t limit = 100;
    std::optional<double> tolerance; ///< in seconds
    bool json = false;
};

/// Whether two entries are the same but for their times. A time stands where both have their own at one place.
bool areSameButForTime(const std::string& left, double leftTime, const std::string& right, double rightTime) {
    const auto holds = [](const std::string& bytes, std::size_t position, double time) {
        std::uint64_t stored = 0;
        std::memcpy(&stored, bytes.data() + position, sizeof stored);
        return stored == std::bit_cast<std::uint64_t>(time);
    };
    if (left.size() != right.size())
        return false;
    for (std::size_t i = 0; i < left.size();) {
        if (left.size() - i >= sizeof leftTime && holds(left, i, leftTime) && holds(right, i, rightTime))
            i += sizeof leftTime;
        else if (left[i] == right[i])
            ++i;
        else
            return false;
    }
    return true;
}

/// An entry as a document; of a stream that cannot be decoded, its bytes.
Json documentOf(const MetaDataHeader& header, const std::string& bytes) {
    Json document;
    if (isDecodable(header))
        RecordedKinds::visit(header.uuid, [&]<class Kind>() {
            if (const auto decoded = decodeEntry<typename Kind::Value>(bytes, header.version))
                document = entryDocument<Kind>(decoded->time, decoded->value);
        });
    return document.is_null() ? Json{{"timestamp", nullptr}, {"base64", base64(bytes)}} : document;
}

/// One of the two streams, with the entry that comes next.
class Side {
public:
    Side(RecordingFile& recording, const StreamInfo& stream)
        : recording_(recording), stream_(stream), entries_(recording.entriesOf(stream)) {
        advance();
    }

    bool hasEntry() const { return current_.has_value(); }
    const std::string& bytes() const { return bytes_; }
    double time() const { return time_; }
    std::optional<MetaDataHeader> header() const { return entries_.header(); }
    Json document() const { return documentOf(*header(), bytes_); }

    /// Ends at an entry that does not fit its kind.
    void advance() {
        end_ = entries_.wholeBytes();
        current_ = entries_.next();
        if (!current_)
            return;
        bytes_ = entries_.bytesOf(*current_);
        const std::optional<double> time = timeOfEntry(*header(), bytes_);
        if (!time && isDecodable(*header()))
            current_.reset();
        time_ = time.value_or(std::numeric_limits<double>::quiet_NaN());
    }

    /// The number of bytes after the last entry that could be compared.
    std::uint64_t rest() const { return stream_.declaredBytes - end_; }
    void complainAboutRest() const { Zulm::complainAboutRest(recording_, stream_, end_); }

private:
    RecordingFile& recording_;
    StreamInfo stream_;
    StreamEntries entries_;
    std::optional<StreamEntry> current_;
    std::string bytes_;
    double time_ = 0;
    std::uint64_t end_ = 0;
};

bool haveSameBytes(const ByteSource& left, const ByteSource& right) {
    if (left.size() != right.size())
        return false;
    std::vector<char> leftPiece(1 << 18);
    std::vector<char> rightPiece(leftPiece.size());
    for (std::uint64_t done = 0; done < left.size();) {
        const std::size_t size = left.read(done, leftPiece);
        if (size == 0 || right.read(done, {rightPiece.data(), size}) != size ||
            !std::equal(leftPiece.begin(), leftPiece.begin() + static_cast<std::ptrdiff_t>(size), rightPiece.begin()))
            return false;
        done += size;
    }
    return true;
}

Json streamHeader(const StreamInfo& stream) {
    return {{"kind", kindDocument(stream.type)}, {"uuid", uuidText(stream.type)}};
}

/// Compares two streams of one kind. Entries belong together by their times: of two that come next, the one with the
/// smaller time is only on its side; with equal times, or none, they are one entry that may have changed.
class StreamComparison {
public:
    /// The streams become an element of the array that `writer` has open; they are printed if it is null.
    StreamComparison(const DiffOptions& options, Side& left, Side& right, const StreamInfo& stream, JsonWriter* writer)
        : options_(options), tolerance_(options.tolerance.value_or(0)), left_(left), right_(right), stream_(stream),
          writer_(writer) {}

    /// Returns whether they are the same, as far as that was asked for.
    bool run() {
        if (!options_.tolerance && !writer_)
            printHeading();
        if (writer_) {
            writer_->beginObject();
            writer_->members(streamHeader(stream_));
        }
        const bool haveSameHeader = compareHeaders();
        if (writer_)
            writer_->beginArray("differences");
        compareEntries();
        const bool areSame = options_.tolerance && haveSameHeader && foundNothing();
        if (writer_) {
            writer_->end();
            writer_->member("status", areSame ? "same" : "changed");
            writer_->members(counts());
            writer_->end();
        } else if (!foundNothing() || isHeadingPrinted_) {
            printSummary();
        }
        return areSame;
    }

private:
    bool compareHeaders() {
        const auto left = left_.header();
        const auto right = right_.header();
        if (!left || !right)
            return left.has_value() == right.has_value();
        const bool hasSameVersion = compareNumbers("version", left->version, right->version);
        return compareNumbers("entry_size", left->fixedEntrySize, right->fixedEntrySize) && hasSameVersion;
    }

    template <class Number>
    bool compareNumbers(const char* name, Number left, Number right) {
        if (left == right)
            return true;
        if (writer_) {
            writer_->member(name, {{"a", left}, {"b", right}});
        } else {
            printHeading();
            if (!settings().quiet)
                writeOutput(fmt::format("  its header's {}: {} and {}\n", name, left, right));
        }
        return false;
    }

    void compareEntries() {
        while (left_.hasEntry() || right_.hasEntry()) {
            if (areSame())
                skipSame();
            else if (!right_.hasEntry() || (left_.hasEntry() && left_.time() < right_.time() - tolerance_))
                take("removed", removed_, true, false);
            else if (!left_.hasEntry() || right_.time() < left_.time() - tolerance_)
                take("added", added_, false, true);
            else
                take("changed", changed_, true, true);
        }
    }

    bool foundNothing() const { return differences() == 0 && left_.rest() == 0 && right_.rest() == 0; }

    Json counts() const {
        return {{"same", same_},
                {"changed", changed_},
                {"added", added_},
                {"removed", removed_},
                {"complete", differences() <= listed_}};
    }

    std::uint64_t differences() const { return changed_ + added_ + removed_; }

    bool areSame() const {
        if (!left_.hasEntry() || !right_.hasEntry())
            return false;
        return left_.bytes() == right_.bytes() ||
               (options_.tolerance && std::abs(left_.time() - right_.time()) <= tolerance_ &&
                areSameButForTime(left_.bytes(), left_.time(), right_.bytes(), right_.time()));
    }

    void skipSame() {
        ++same_;
        left_.advance();
        right_.advance();
    }

    void take(const char* change, std::uint64_t& count, bool fromLeft, bool fromRight) {
        ++count;
        if (options_.limit == 0 || listed_ < options_.limit)
            list(change, fromLeft ? left_.document() : Json(), fromRight ? right_.document() : Json());
        if (fromLeft)
            left_.advance();
        if (fromRight)
            right_.advance();
    }

    void list(const char* change, const Json& left, const Json& right) {
        ++listed_;
        if (writer_)
            return writer_->element({{"change", change}, {"a", left}, {"b", right}});
        printHeading();
        if (settings().quiet)
            return;
        const bool isChange = !left.is_null() && !right.is_null();
        if (!left.is_null())
            printEntry(isChange ? '<' : '-', left);
        if (!right.is_null())
            printEntry(isChange ? '>' : '+', right);
        if (left == right)
            writeOutput("    (the bytes differ in what is not shown)\n");
    }

    static void printEntry(char mark, const Json& entry) {
        const bool isDecoded = !entry.contains("base64");
        writeOutput(fmt::format("  {} {}\n", mark, isDecoded ? textLine(entry) : entry["base64"].get<std::string>()));
    }

    void printHeading() {
        if (!std::exchange(isHeadingPrinted_, true))
            writeOutput(fmt::format("{}: differs\n", stream_.name()));
    }

    void printSummary() {
        printHeading();
        if (settings().quiet)
            return;
        if (differences() > listed_)
            writeOutput(fmt::format("  ... and {} more; '--limit 0' lists all\n", differences() - listed_));
        writeOutput(fmt::format("  {}: {} changed, {} added, {} removed, {} the same\n", stream_.name(), changed_,
                                added_, removed_, same_));
        if (left_.rest() != right_.rest())
            writeOutput(fmt::format("  after the last entry: {} and {} bytes\n", left_.rest(), right_.rest()));
    }

    const DiffOptions& options_;
    double tolerance_;
    Side& left_;
    Side& right_;
    const StreamInfo& stream_;
    JsonWriter* writer_;
    bool isHeadingPrinted_ = false;
    std::uint64_t same_ = 0;
    std::uint64_t changed_ = 0;
    std::uint64_t added_ = 0;
    std::uint64_t removed_ = 0;
    std::uint64_t listed_ = 0;
};

class Comparison {
public:
    /// The streams become elements of the array that `writer` has open; they are printed if it is null.
    Comparison(const DiffOptions& options, RecordingFile& left, RecordingFile& right, JsonWriter* writer)
        : options_(options), left_(left), right_(right), writer_(writer) {}

    /// The streams of both sides, merged in the order of their identifiers.
    void run(const std::vector<StreamInfo>& left, const std::vector<StreamInfo>& right) {
        auto l = left.begin();
        auto r = right.begin();
        while (l != left.end() || r != right.end()) {
            if (r == right.end() || (l != left.end() && l->type < r->type))
                addOneSided(*l++, left_.name(), "removed");
            else if (l == left.end() || r->type < l->type)
                addOneSided(*r++, right_.name(), "added");
            else
                compare(*l++, *r++);
        }
    }

    ExitCode code() const { return code_; }

private:
    static Json streamDocument(const StreamInfo& stream, const char* status) {
        Json document = streamHeader(stream);
        document["status"] = status;
        return document;
    }

    void addOneSided(const StreamInfo& stream, const std::string& file, const char* status) {
        code_ = ExitDamaged;
        if (writer_)
            writer_->element(streamDocument(stream, status));
        else
            writeOutput(fmt::format("{}: only in {}\n", stream.name(), shown(file)));
    }

    void compare(const StreamInfo& leftStream, const StreamInfo& rightStream) {
        if (leftStream.declaredBytes != rightStream.declaredBytes ||
            !haveSameBytes(left_.bytesOf(leftStream), right_.bytesOf(rightStream)))
            compareEntries(leftStream, rightStream);
        else if (writer_)
            writer_->element(streamDocument(leftStream, "same"));
    }

    void compareEntries(const StreamInfo& leftStream, const StreamInfo& rightStream) {
        Side left(left_, leftStream);
        Side right(right_, rightStream);
        if (!StreamComparison(options_, left, right, leftStream, writer_).run())
            code_ = ExitDamaged;
        left.complainAboutRest();
        right.complainAboutRest();
    }

    const DiffOptions& options_;
    RecordingFile& left_;
    RecordingFile& right_;
    JsonWriter* writer_;
    ExitCode code_ = ExitFine;
};

ExitCode diff(const DiffOptions& options, RunReport& report) {
    const InputFile leftFile(options.left);
    const InputFile rightFile(options.right);
    RecordingFile left = leftFile.open();
    RecordingFile right = rightFile.open();
    const auto leftStreams = chosenStreams(left, options.kinds);
    const auto rightStreams = chosenStreams(right, options.kinds);
    if (leftStreams.empty() && rightStreams.empty())
        return worseOf(complainAboutNothing(left, options.kinds), complainAboutNothing(right, options.kinds));
    JsonWriter* const writer = report.isWanted() ? &report.writer() : nullptr;
    if (writer) {
        report.beginFile(left.name());
        writer->member("other", fileHeader(right.name()));
        writer->beginArray("streams");
    }
    Comparison comparison(options, left, right, writer);
    comparison.run(leftStreams, rightStreams);
    if (writer) {
        writer->end();
        writer->member("same", comparison.code() == ExitFine);
    }
    return comparison.code();
}

} // namespace

void addDiffCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<DiffOptions>();
    CLI::App* command = app.add_subcommand(
        "diff", "Show which streams and entries differ. A line with - is only in A, one with + only in B, and < and > "
                "stand before what A and B have at one time. Ends with 0 if nothing differs and with 3 if something "
                "does");
    command->add_option("A", options->left, "A movie, RIFF file or stream file; - is standard input")->required();
    command->add_option("B", options->right, "The file to compare it with")->required();
    addStreamOption(*command, options->kinds,
                    "Compare only this kind, such as cursorLocation, or this UUID (repeatable)");
    addCount(*command, "--limit", options->limit,
             "List at most this many differences of each stream; the default is 100, and 0 lists all");
    addSeconds(*command, "--tolerance", options->tolerance,
               "Take entries with equal values for the same if their times differ by no more than this");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm diff Original.mp4 Edited.mp4\n"
                    "zulm diff --stream keyboardAction --limit 0 Original.mp4 Edited.mp4");
    command->callback([options, &chosen] {
        if (options->left == "-" && options->right == "-")
            throw CLI::ValidationError("only one of A and B can be standard input");
        chosen = reporting("diff", options->json, {options->left, options->right},
                           [options](RunReport& report) { return diff(*options, report); });
    });
}

} // namespace Zulm
