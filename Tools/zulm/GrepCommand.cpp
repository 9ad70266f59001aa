#include "Reports/Text.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/TextPattern.h"

#include <fmt/core.h>

#include <algorithm>
#include <filesystem>
#include <list>
#include <memory>
#include <optional>
#include <system_error>

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
    bool inverts = false;
    bool recurses = false;
    bool listsFiles = false;
    bool counts = false;
    bool printsParts = false;
    bool json = false;

    /// Whether one match in a file tells all that is asked for.
    bool needsOneMatch() const { return !json && (listsFiles || settings().quiet); }
};

template <class Kind>
constexpr bool holdsTexts = OneOf<typename Kind::Value, std::string, std::list<std::string>>;

/// A search through the texts of one file.
class Search {
public:
    Search(const GrepOptions& options, const TextPattern& pattern, const std::string& file, RunReport& report)
        : options_(options), pattern_(pattern), input_(file), recording_(input_.open()), report_(report) {}

    /// 0 where something matched, 4 where nothing did, 3 where not everything could be searched.
    ExitCode run() {
        if (report_.isWanted())
            report_.beginFile(input_.name()).beginArray("matches");
        for (const StreamInfo& stream : chosenStreams(recording_, options_.kinds))
            RecordedKinds::visit(stream.type, [&]<class Kind>() {
                if constexpr (holdsTexts<Kind>)
                    search<typename Kind::Value>(stream);
            });
        printSummary();
        if (isDamaged_)
            return ExitDamaged;
        return matches_ > 0 ? ExitFine : ExitNoMetaData;
    }

private:
    template <class Value>
    void search(const StreamInfo& stream) {
        StreamEntries entries = recording_.entriesOf(stream);
        std::uint64_t end = 0;
        if (entries.header() && isDecodable(*entries.header()))
            end = searchEntries<Value>(stream, entries);
        if (!isDone())
            isDamaged_ |= complainAboutRest(recording_, stream, end, "searched") != ExitFine;
    }

    /// Returns the number of bytes that were searched.
    template <class Value>
    std::uint64_t searchEntries(const StreamInfo& stream, StreamEntries& entries) {
        while (const auto entry = isDone() ? std::nullopt : entries.next()) {
            const auto decoded = decodeEntry<Value>(entries.bytesOf(*entry), entries.header()->version);
            if (!decoded)
                return entry->offset;
            searchTexts(stream, decoded->time, decoded->value);
        }
        return entries.wholeBytes();
    }

    void searchTexts(const StreamInfo& stream, double time, const std::string& text) {
        if (pattern_.matches(validText(text)) != options_.inverts)
            report(stream, time, text);
    }

    void searchTexts(const StreamInfo& stream, double time, const std::list<std::string>& texts) {
        for (const std::string& text : texts)
            searchTexts(stream, time, utf8FromLatin1(text));
    }

    void report(const StreamInfo& stream, double time, const std::string& text) {
        ++matches_;
        if (report_.isWanted())
            addMatch(stream, time, text);
        else if (options_.printsParts)
            for (const std::string& part : pattern_.partsOf(validText(text)))
                print(stream, time, part);
        else if (!options_.counts && !options_.needsOneMatch())
            print(stream, time, text);
    }

    void addMatch(const StreamInfo& stream, double time, const std::string& text) {
        Json match{{"stream", stream.name()}, {"timestamp", numberDocument(time)}};
        addText(match, "text", text);
        report_.writer().element(match);
    }

    void print(const StreamInfo& stream, double time, const std::string& text) const {
        if (!settings().quiet)
            writeOutput(fmt::format("{}:{}:{:.6f}: {}\n", shown(input_.name()), stream.name(), time, shown(text)));
    }

    void printSummary() const {
        if (report_.isWanted() || settings().quiet)
            return;
        if (options_.counts)
            writeOutput(fmt::format("{}:{}\n", shown(input_.name()), matches_));
        if (options_.listsFiles && matches_ > 0)
            writeOutput(shown(input_.name()) + '\n');
    }

    bool isDone() const { return matches_ > 0 && options_.needsOneMatch(); }

    const GrepOptions& options_;
    const TextPattern& pattern_;
    InputFile input_;
    RecordingFile recording_;
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

/// Looks for the pattern in the files that are named, and in those of folders that are named.
class FileSearch {
public:
    FileSearch(const GrepOptions& options, RunReport& report)
        : options_(options), pattern_(options.pattern, options.ignoreCase, options.isFixed), report_(report) {}

    void searchNamed(const std::string& path) {
        std::error_code ignored;
        if (options_.recurses && std::filesystem::is_directory(path, ignored))
            searchFolder(path);
        else
            search(path);
    }

    ExitCode code() const { return code_; }

    /// A file in which something was found is all that a quiet search looks for.
    bool isDone() const { return settings().quiet && !options_.json && hasFound_; }

private:
    void search(const std::string& path) {
        const ExitCode found = forEachFile(
            {path}, [&](const std::string& file) { return Search(options_, pattern_, file, report_).run(); });
        hasFound_ |= found == ExitFine;
        code_ = combined(code_, found);
    }

    /// Symbolic links are not followed, since they could lead in a circle.
    void searchFolder(const std::string& folder) {
        const ExitCode read = forEachFile({folder}, [&](const std::string& path) {
            std::vector<std::filesystem::directory_entry> entries{std::filesystem::directory_iterator(path), {}};
            std::sort(entries.begin(), entries.end());
            for (const auto& entry : entries)
                if (!isDone())
                    searchEntry(entry);
            return ExitNoMetaData;
        });
        code_ = combined(code_, read);
    }

    void searchEntry(const std::filesystem::directory_entry& entry) {
        const std::string path = entry.path().string();
        if (entry.is_symlink())
            return;
        if (entry.is_directory())
            searchFolder(path);
        else if (entry.is_regular_file() && MetaDataParser::streamTypeOf(path) != Container::Unknown)
            search(path);
    }

    const GrepOptions& options_;
    const TextPattern pattern_;
    RunReport& report_;
    ExitCode code_ = ExitNoMetaData;
    bool hasFound_ = false;
};

ExitCode grep(const GrepOptions& options, RunReport& report) {
    FileSearch search(options, report);
    for (const std::string& file : options.files)
        if (!search.isDone())
            search.searchNamed(file);
    if (search.isDone())
        return ExitFine;
    if (search.code() == ExitNoMetaData)
        for (const std::string& file : options.files)
            report.note(file, "no text in it matches the pattern");
    return search.code();
}

} // namespace

void addGrepCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<GrepOptions>();
    CLI::App* command = app.add_subcommand(
        "grep", "Search titles, slides, comments, application names and system data of many recordings. Ends with 0 if "
                "something matches, with 4 if nothing does, and with 1 if a file could not be read");
    command->add_option("PATTERN", options->pattern, "A regular expression, as RE2 has them")->required();
    command
        ->add_option("FILE", options->files,
                     "Movies, RIFF files or stream files, with --recursive also folders; - is standard input")
        ->required();
    command->add_flag("-i,--ignore-case", options->ignoreCase, "Make no difference between upper and lower case");
    command->add_flag("-F,--fixed-strings", options->isFixed, "Take PATTERN for a text instead of an expression");
    addStreamOption(*command, options->kinds, "Only this kind of texts, such as topmostWindowTitle (repeatable)");
    command->add_flag("-v,--invert-match", options->inverts,
                      "Look for texts that do not match, as every grep does. Here, --verbose has no short form");
    command->add_flag("-r,--recursive", options->recurses,
                      "Search the recordings in folders and in the folders inside");
    CLI::Option* lists = command->add_flag("-l,--files-with-matches", options->listsFiles,
                                           "Print only the names of the files in which something matches");
    CLI::Option* counts = command->add_flag("-c,--count", options->counts, "Print only how many texts of a file match");
    CLI::Option* parts = command->add_flag("-o,--only-matching", options->printsParts,
                                           "Print only the parts of the texts that match, each in a line of its own");
    lists->excludes(counts)->excludes(parts);
    counts->excludes(parts);
    parts->excludes("--invert-match");
    command->add_flag("--json", options->json, "Print one JSON document")
        ->excludes(lists)
        ->excludes(counts)
        ->excludes(parts);
    command->footer("zulm grep -i budget *.mp4\n"
                    "zulm grep -rl budget Recordings\n"
                    "zulm grep --stream topmostAppName '^Mail$' Recording.mp4");
    command->callback([options, &chosen] {
        requireKinds("--stream", options->kinds, "has no text to search",
                     []<class Kind>() { return holdsTexts<Kind>; });
        const TextPattern checked(options->pattern, options->ignoreCase, options->isFixed);
        chosen = reporting("grep", options->json, options->files,
                           [options](RunReport& report) { return grep(*options, report); });
    });
}

} // namespace Zulm
