#include "Tools/zulm/Choice.h"
#include "Tools/zulm/EntryFormat.h"
#include "Tools/zulm/HeldStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Report.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/Text.h"

#include <fmt/core.h>

#include <algorithm>
#include <limits>
#include <memory>
#include <optional>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct DiffOptions {
    std::string left;
    std::string right;
    std::vector<std::string> kinds;
    std::uint64_t limit = 100;
    bool json = false;
};

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
    Side(Recording& recording, const HeldStream& stream)
        : recording_(recording), stream_(stream), entries_(entriesOf(recording, stream)) {
        advance();
    }

    bool hasEntry() const { return current_.has_value(); }
    const std::string& bytes() const { return bytes_; }
    double time() const { return time_; }
    std::optional<MetaDataHeader> header() const { return entries_.header(); }
    Json document() const { return documentOf(*header(), bytes_); }

    /// Not beyond an entry that does not fit its kind.
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

    /// Bytes behind the last entry that could be compared.
    std::uint64_t rest() const { return stream_.declared - end_; }

    ExitCode complainAboutRest() const {
        if (rest() == 0)
            return ExitFine;
        complain(fmt::format("{}: {} cannot be read from offset {} on; 'zulm verify {}' says more", recording_.name(),
                             stream_.name(), stream_.offset + end_, shellWord(recording_.name())));
        return ExitDamaged;
    }

private:
    Recording& recording_;
    HeldStream stream_;
    StreamEntries entries_;
    std::optional<StreamEntry> current_;
    std::string bytes_;
    double time_ = 0;
    std::uint64_t end_ = 0;
};

bool haveSameBytes(Recording& left, const HeldStream& leftStream, Recording& right, const HeldStream& rightStream) {
    if (leftStream.present != rightStream.present || leftStream.declared != rightStream.declared)
        return false;
    std::vector<char> leftPiece(1 << 18);
    std::vector<char> rightPiece(leftPiece.size());
    const ReadBytes readLeft = left.bytes();
    const ReadBytes readRight = right.bytes();
    for (std::uint64_t done = 0; done < leftStream.present;) {
        const auto wanted =
            static_cast<std::size_t>(std::min<std::uint64_t>(leftPiece.size(), leftStream.present - done));
        const std::size_t size = readLeft(leftStream.offset + done, {leftPiece.data(), wanted});
        if (size == 0 || readRight(rightStream.offset + done, {rightPiece.data(), size}) != size ||
            !std::equal(leftPiece.begin(), leftPiece.begin() + static_cast<std::ptrdiff_t>(size), rightPiece.begin()))
            return false;
        done += size;
    }
    return true;
}

/// Compares two streams of one kind. Entries belong together by their times: of two that come next, the one with the
/// smaller time is only on its side; with equal times, or none, they are one entry that may have changed.
class StreamComparison {
public:
    StreamComparison(const DiffOptions& options, Side& left, Side& right, const std::string& name)
        : options_(options), left_(left), right_(right), name_(name) {}

    void run() {
        while (left_.hasEntry() || right_.hasEntry()) {
            if (left_.hasEntry() && right_.hasEntry() && left_.bytes() == right_.bytes())
                skipSame();
            else if (!right_.hasEntry() || (left_.hasEntry() && left_.time() < right_.time()))
                take("removed", removed_, true, false);
            else if (!left_.hasEntry() || right_.time() < left_.time())
                take("added", added_, false, true);
            else
                take("changed", changed_, true, true);
        }
        printSummary();
    }

    Json document() const {
        Json document{
            {"status", "changed"}, {"same", same_}, {"changed", changed_}, {"added", added_}, {"removed", removed_}};
        document["differences"] = differences_;
        document["complete"] = differences() <= listed_;
        return document;
    }

private:
    std::uint64_t differences() const { return changed_ + added_ + removed_; }

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
        if (options_.json) {
            differences_.push_back({{"change", change}, {"a", left}, {"b", right}});
            return;
        }
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

    void printSummary() const {
        if (options_.json)
            return;
        if (differences() > listed_)
            writeOutput(fmt::format("  ... and {} more; '--limit 0' lists all\n", differences() - listed_));
        writeOutput(fmt::format("  {}: {} changed, {} added, {} removed, {} the same\n", name_, changed_, added_,
                                removed_, same_));
        if (left_.rest() != right_.rest())
            writeOutput(fmt::format("  behind the last entry: {} and {} bytes\n", left_.rest(), right_.rest()));
    }

    const DiffOptions& options_;
    Side& left_;
    Side& right_;
    std::string name_;
    Json differences_ = Json::array();
    std::uint64_t same_ = 0;
    std::uint64_t changed_ = 0;
    std::uint64_t added_ = 0;
    std::uint64_t removed_ = 0;
    std::uint64_t listed_ = 0;
};

class Comparison {
public:
    Comparison(const DiffOptions& options, Recording& left, Recording& right)
        : options_(options), left_(left), right_(right) {}

    /// The streams of both sides, merged in the order of their identifiers.
    void run(const std::vector<HeldStream>& left, const std::vector<HeldStream>& right) {
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

    const Json& streams() const { return streams_; }
    ExitCode code() const { return code_; }

private:
    void addStream(const HeldStream& stream, const Json& findings) {
        Json document{{"kind", kindDocument(stream.type)}, {"uuid", uuidText(stream.type)}};
        document.update(findings);
        streams_.push_back(document);
    }

    void addOneSided(const HeldStream& stream, const std::string& file, const char* status) {
        code_ = ExitDamaged;
        addStream(stream, {{"status", status}});
        if (!options_.json)
            writeOutput(fmt::format("{}: only in {}\n", stream.name(), shown(file)));
    }

    void compare(const HeldStream& leftStream, const HeldStream& rightStream) {
        if (haveSameBytes(left_, leftStream, right_, rightStream))
            return addStream(leftStream, {{"status", "same"}});
        code_ = ExitDamaged;
        if (!options_.json)
            writeOutput(fmt::format("{}: differs\n", leftStream.name()));
        Side left(left_, leftStream);
        Side right(right_, rightStream);
        const Json headers = compareHeaders(left.header(), right.header());
        StreamComparison entries(options_, left, right, leftStream.name());
        entries.run();
        Json findings = entries.document();
        findings.update(headers);
        addStream(leftStream, findings);
        left.complainAboutRest();
        right.complainAboutRest();
    }

    Json compareHeaders(const std::optional<MetaDataHeader>& left, const std::optional<MetaDataHeader>& right) const {
        Json findings = Json::object();
        if (!left || !right)
            return findings;
        compareNumbers(findings, "version", left->version, right->version);
        compareNumbers(findings, "entry_size", left->fixedEntrySize, right->fixedEntrySize);
        return findings;
    }

    template <class Number>
    void compareNumbers(Json& findings, const char* name, Number left, Number right) const {
        if (left == right)
            return;
        findings[name] = {{"a", left}, {"b", right}};
        if (!options_.json)
            writeOutput(fmt::format("  its header's {}: {} and {}\n", name, left, right));
    }

    const DiffOptions& options_;
    Recording& left_;
    Recording& right_;
    Json streams_ = Json::array();
    ExitCode code_ = ExitFine;
};

ExitCode runDiff(const DiffOptions& options) {
    const InputFile leftFile(options.left);
    const InputFile rightFile(options.right);
    Recording left(leftFile.path(), leftFile.name());
    Recording right(rightFile.path(), rightFile.name());
    const auto leftStreams = heldStreams(left, options.kinds);
    const auto rightStreams = heldStreams(right, options.kinds);
    if (leftStreams.empty() && rightStreams.empty())
        return worseOf(complainAboutNothing(left, options.kinds), complainAboutNothing(right, options.kinds));
    Comparison comparison(options, left, right);
    comparison.run(leftStreams, rightStreams);
    if (options.json) {
        Json document = fileHeader(left.name());
        document["other"] = fileHeader(right.name());
        document["same"] = comparison.code() == ExitFine;
        document["streams"] = comparison.streams();
        printReport("diff", Json::array({document}));
    }
    return comparison.code();
}

} // namespace

void addDiffCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<DiffOptions>();
    CLI::App* command = app.add_subcommand(
        "diff", "Show which streams and entries differ: - only in A, + only in B, < and > what A and B have at one "
                "time. Ends with 0 where nothing does, with 3 where something does");
    command->add_option("A", options->left, "A movie, RIFF file or stream file; - is standard input")->required();
    command->add_option("B", options->right, "What to compare it with, likewise")->required();
    addStreamOption(*command, options->kinds, "Only this kind, such as cursorLocation, or UUID (repeatable)");
    addCount(*command, "--limit", options->limit,
             "List at most this many differences of each stream (100 unless it is given, 0 for all)");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm diff Original.mp4 Edited.mp4\n"
                    "zulm diff --stream keyboardAction --limit 0 Original.mp4 Edited.mp4");
    command->callback([options, &chosen] {
        if (options->left == "-" && options->right == "-")
            throw CLI::ValidationError("only one of A and B can be standard input");
        chosen = [options] { return runDiff(*options); };
    });
}

} // namespace Zulm
