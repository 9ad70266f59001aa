#include "Reports/Text.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/ManyFiles.h"
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
    ManyFiles files;
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

void noteThatNothingMatches(const ManyFiles& files, RunReport& report) {
    for (const std::string& file : files.named)
        report.note(file, "no text in it matches the pattern");
    if (!files.list.empty())
        report.note(files.list, "no text in the files that it names matches the pattern");
}

/// The files that are named, and with --recursive the recordings in folders that are named.
class SearchedFiles final : public FileNames {
public:
    explicit SearchedFiles(const GrepOptions& options) : FileNames(options.files), recurses_(options.recurses) {}

    bool next(FileToDo& file) override {
        while (!found_.empty() || FileNames::next(named_)) {
            if (found_.empty())
                found_.push_back(named_.path);
            const std::string path = std::move(found_.back());
            found_.pop_back();
            file = named_;
            file.path = path;
            std::error_code isNoFolder;
            if (!recurses_ || !std::filesystem::is_directory(path, isNoFolder))
                return true;
            file.failure = failureToOpen(path);
            if (file.failure)
                return true;
        }
        return false;
    }

private:
    /// Adds what is in a folder. Symbolic links are not followed, since they could lead in a circle.
    std::exception_ptr failureToOpen(const std::string& folder) {
        try {
            std::vector<std::filesystem::directory_entry> entries{std::filesystem::directory_iterator(folder), {}};
            std::sort(entries.rbegin(), entries.rend());
            for (const auto& entry : entries)
                if (isSearched(entry))
                    found_.push_back(entry.path().string());
        } catch (const std::filesystem::filesystem_error&) {
            return std::current_exception();
        }
        return nullptr;
    }

    static bool isSearched(const std::filesystem::directory_entry& entry) {
        if (entry.is_symlink())
            return false;
        return entry.is_directory() ||
               (entry.is_regular_file() && MetaDataParser::streamTypeOf(entry.path().string()) != Container::Unknown);
    }

    bool recurses_;
    FileToDo named_;
    std::vector<std::string> found_; ///< the next one last
};

ExitCode grep(const GrepOptions& options, RunReport& report) {
    const TextPattern pattern(options.pattern, options.ignoreCase, options.isFixed);
    const bool endsAtFirst = settings().quiet && !options.json;
    bool hasFound = false;
    SearchedFiles names(options);
    const FileWork search{
        .run = [&](const std::string& file, RunReport& part) { return Search(options, pattern, file, part).run(); },
        .combine = combined,
        .begin = ExitNoMetaData,
        .isEnough = [&](ExitCode code) { return (hasFound |= code == ExitFine) && endsAtFirst; }};
    const ExitCode code = workOnFiles(names, options.files.jobs, report, search);
    if (hasFound && endsAtFirst)
        return ExitFine;
    if (code == ExitNoMetaData)
        noteThatNothingMatches(options.files, report);
    return code;
}

} // namespace

void addGrepCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<GrepOptions>();
    CLI::App* command = app.add_subcommand(
        "grep", "Search titles, slides, comments, application names and system data of many recordings. Ends with 0 if "
                "something matches, with 4 if nothing does, and with 1 if a file could not be read");
    command->add_option("PATTERN", options->pattern, "A regular expression, as RE2 has them")->required();
    addManyFiles(*command, options->files,
                 "Movies, RIFF files or stream files, with --recursive also folders; - is standard input");
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
        requireFiles(options->files);
        requireKinds("--stream", options->kinds, "has no text to search",
                     []<class Kind>() { return holdsTexts<Kind>; });
        const TextPattern checked(options->pattern, options->ignoreCase, options->isFixed);
        chosen = reportingOnMany("grep", options->json, options->files,
                                 [options](RunReport& report) { return grep(*options, report); });
    });
}

} // namespace Zulm
