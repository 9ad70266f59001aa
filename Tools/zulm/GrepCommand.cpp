#include "Tools/zulm/HeldStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Report.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/Text.h"
#include "Tools/zulm/TextPattern.h"

#include <fmt/core.h>

#include <memory>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct GrepOptions {
    std::string pattern;
    std::vector<std::string> files;
    std::vector<std::string> kinds;
    bool ignoreCase = false;
    bool isFixed = false;
    bool json = false;
};

/// A search through the texts of one file.
class Search {
public:
    Search(const GrepOptions& options, const TextPattern& pattern, const std::string& file)
        : options_(options), pattern_(pattern), input_(file), recording_(input_.path(), input_.name()) {
        document_ = fileHeader(input_.name());
        document_["matches"] = Json::array();
    }

    /// 0 where something matched, 4 where nothing did, 3 where not everything could be searched.
    ExitCode run() {
        for (const HeldStream& stream : heldStreams(recording_, options_.kinds))
            RecordedKinds::visit(stream.type, [&]<class Kind>() {
                if constexpr (std::same_as<typename Kind::Value, std::string>)
                    search(stream);
            });
        if (isDamaged_)
            return ExitDamaged;
        return matches_ > 0 ? ExitFine : ExitNoMetaData;
    }

    const Json& document() const { return document_; }

private:
    void search(const HeldStream& stream) {
        StreamEntries entries = entriesOf(recording_, stream);
        std::uint64_t end = 0;
        if (entries.header() && isDecodable(*entries.header()))
            end = searchEntries(stream, entries);
        if (end == stream.declared)
            return;
        isDamaged_ = true;
        complain(fmt::format("{}: {} cannot be searched from offset {} on; 'zulm verify {}' says more", input_.name(),
                             stream.name(), stream.offset + end, shellWord(input_.name())));
    }

    /// Gives how many bytes of the stream were searched.
    std::uint64_t searchEntries(const HeldStream& stream, StreamEntries& entries) {
        while (const auto entry = entries.next()) {
            const auto decoded = decodeEntry<std::string>(entries.bytesOf(*entry), entries.header()->version);
            if (!decoded)
                return entry->offset;
            const std::string text = validText(decoded->value);
            if (pattern_.matches(text))
                report(stream, decoded->time, text);
        }
        return entries.wholeBytes();
    }

    void report(const HeldStream& stream, double time, const std::string& text) {
        ++matches_;
        if (options_.json)
            document_["matches"].push_back(
                {{"stream", stream.name()}, {"timestamp", numberDocument(time)}, {"text", text}});
        else
            writeOutput(
                fmt::format("{}:{}:{:.6f}: {}\n", withoutControls(input_.name()), stream.name(), time, shown(text)));
    }

    const GrepOptions& options_;
    const TextPattern& pattern_;
    InputFile input_;
    Recording recording_;
    Json document_;
    std::uint64_t matches_ = 0;
    bool isDamaged_ = false;
};

/// Of several files: found anywhere is found, unless something went wrong.
ExitCode combined(ExitCode left, ExitCode right) {
    if (left == ExitNoMetaData || right == ExitNoMetaData)
        return left == ExitNoMetaData ? right : left;
    return worseOf(left, right);
}

ExitCode runGrep(const GrepOptions& options) {
    const TextPattern pattern(options.pattern, options.ignoreCase, options.isFixed);
    Json files = Json::array();
    ExitCode code = ExitNoMetaData;
    for (const std::string& file : options.files)
        code = combined(code, forEachFile({file}, [&](const std::string& name) {
                            Search search(options, pattern, name);
                            const ExitCode found = search.run();
                            files.push_back(search.document());
                            return found;
                        }));
    if (options.json)
        printReport("grep", std::move(files));
    return code;
}

} // namespace

void addGrepCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<GrepOptions>();
    CLI::App* command = app.add_subcommand(
        "grep", "Search titles, slides, comments and application names of many recordings. Ends with 0 where something "
                "matches, with 4 where nothing does, and with 1 where a file could not be read");
    command->add_option("PATTERN", options->pattern, "A regular expression, as RE2 has them")->required();
    command->add_option("FILE", options->files, "Movies, RIFF files or stream files; - is standard input")->required();
    command->add_flag("-i,--ignore-case", options->ignoreCase, "Upper and lower case are the same");
    command->add_flag("-F,--fixed-strings", options->isFixed, "PATTERN is a text, not an expression");
    addStreamOption(*command, options->kinds, "Only this kind, such as topmostWindowTitle (repeatable)");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm grep -i budget *.mp4\n"
                    "zulm grep --stream topmostAppName '^Mail$' Recording.mp4");
    command->callback([options, &chosen] {
        const TextPattern checked(options->pattern, options->ignoreCase, options->isFixed);
        chosen = [options] { return runGrep(*options); };
    });
}

} // namespace Zulm
