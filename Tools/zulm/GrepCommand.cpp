#include "Tools/zulm/HeldStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/Text.h"
#include "Tools/zulm/TextPattern.h"

#include <fmt/core.h>

#include <list>
#include <memory>
#include <utility>

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

template <class Kind>
constexpr bool holdsTexts = OneOf<typename Kind::Value, std::string, std::list<std::string>>;

/// A search through the texts of one file.
class Search {
public:
    Search(const GrepOptions& options, const TextPattern& pattern, const std::string& file, RunReport& report)
        : options_(options), pattern_(pattern), input_(file), recording_(input_.path(), input_.name()),
          report_(report) {}

    /// 0 where something matched, 4 where nothing did, 3 where not everything could be searched.
    ExitCode run() {
        if (report_.isWanted())
            beginFile(report_.writer());
        for (const HeldStream& stream : heldStreams(recording_, options_.kinds))
            RecordedKinds::visit(stream.type, [&]<class Kind>() {
                if constexpr (holdsTexts<Kind>)
                    search<typename Kind::Value>(stream);
            });
        if (isDamaged_)
            return ExitDamaged;
        return matches_ > 0 ? ExitFine : ExitNoMetaData;
    }

private:
    void beginFile(JsonWriter& writer) const {
        writer.beginObject();
        writer.members(fileHeader(input_.name()));
        writer.beginArray("matches");
    }

    template <class Value>
    void search(const HeldStream& stream) {
        StreamEntries entries = entriesOf(recording_, stream);
        std::uint64_t end = 0;
        if (entries.header() && isDecodable(*entries.header()))
            end = searchEntries<Value>(stream, entries);
        if (end == stream.declared)
            return;
        isDamaged_ = true;
        complain(fmt::format("{}: {} cannot be searched from offset {} on; 'zulm verify {}' says more", input_.name(),
                             stream.name(), stream.offset + end, shellWord(input_.name())));
    }

    /// Returns the number of bytes that were searched.
    template <class Value>
    std::uint64_t searchEntries(const HeldStream& stream, StreamEntries& entries) {
        while (const auto entry = entries.next()) {
            const auto decoded = decodeEntry<Value>(entries.bytesOf(*entry), entries.header()->version);
            if (!decoded)
                return entry->offset;
            searchTexts(stream, decoded->time, decoded->value);
        }
        return entries.wholeBytes();
    }

    void searchTexts(const HeldStream& stream, double time, const std::string& text) {
        if (pattern_.matches(validText(text)))
            report(stream, time, text);
    }

    void searchTexts(const HeldStream& stream, double time, const std::list<std::string>& texts) {
        for (const std::string& text : texts)
            searchTexts(stream, time, utf8FromLatin1(text));
    }

    void report(const HeldStream& stream, double time, const std::string& text) {
        ++matches_;
        if (!report_.isWanted())
            return writeOutput(
                fmt::format("{}:{}:{:.6f}: {}\n", shown(input_.name()), stream.name(), time, shown(text)));
        Json match{{"stream", stream.name()}, {"timestamp", numberDocument(time)}};
        addText(match, "text", text);
        report_.writer().element(match);
    }

    const GrepOptions& options_;
    const TextPattern& pattern_;
    InputFile input_;
    Recording recording_;
    RunReport& report_;
    std::uint64_t matches_ = 0;
    bool isDamaged_ = false;
};

/// Of several files: found anywhere is found, unless something went wrong.
ExitCode combined(ExitCode left, ExitCode right) {
    if (left == ExitNoMetaData || right == ExitNoMetaData)
        return left == ExitNoMetaData ? right : left;
    return worseOf(left, right);
}

ExitCode grep(const GrepOptions& options, RunReport& report) {
    const TextPattern pattern(options.pattern, options.ignoreCase, options.isFixed);
    ExitCode code = ExitNoMetaData;
    for (const std::string& file : options.files)
        code = combined(code, forEachFile({file}, [&](const std::string& name) {
                            return Search(options, pattern, name, report).run();
                        }));
    if (code == ExitNoMetaData)
        for (const std::string& file : options.files)
            report.note(file, "no text in it matches the pattern");
    return code;
}

ExitCode runGrep(const GrepOptions& options) {
    return withReport("grep", options.json, options.files, [&](RunReport& report) { return grep(options, report); });
}

} // namespace

void addGrepCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<GrepOptions>();
    CLI::App* command = app.add_subcommand(
        "grep", "Search titles, slides, comments, application names and system data of many recordings. Ends with 0 if "
                "something matches, with 4 if nothing does, and with 1 if a file could not be read");
    command->add_option("PATTERN", options->pattern, "A regular expression, as RE2 has them")->required();
    command->add_option("FILE", options->files, "Movies, RIFF files or stream files; - is standard input")->required();
    command->add_flag("-i,--ignore-case", options->ignoreCase, "Upper and lower case are the same");
    command->add_flag("-F,--fixed-strings", options->isFixed, "PATTERN is a text, not an expression");
    addStreamOption(*command, options->kinds, "Only this kind of texts, such as topmostWindowTitle (repeatable)");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm grep -i budget *.mp4\n"
                    "zulm grep --stream topmostAppName '^Mail$' Recording.mp4");
    command->callback([options, &chosen] {
        requireKinds("--stream", options->kinds, "has no text to search",
                     []<class Kind>() { return holdsTexts<Kind>; });
        const TextPattern checked(options->pattern, options->ignoreCase, options->isFixed);
        chosen = [options] { return runGrep(*options); };
    });
}

} // namespace Zulm
