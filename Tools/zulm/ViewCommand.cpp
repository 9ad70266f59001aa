#include "Reports/Text.h"
#include "Tools/zulm/ChosenStreams.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/ViewerPage.h"

#include "SharedDependencies/EndianFile.h"

#include <fmt/core.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <memory>
#include <vector>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

struct ViewOptions {
    std::string file;
    std::string output;
    std::string page;
    bool embed = false;
    bool force = false;

    std::string folder() const { return std::filesystem::path(output).parent_path().string(); }
};

/// Browsers hold a page's text in one string, which cannot be longer than 512 MiB.
constexpr std::uint64_t s_mostEmbedded = std::uint64_t{360} << 20;

constexpr std::string_view s_elementStart = "<script type=\"application/json\" id=\"zulm-recording\">";
constexpr std::string_view s_metaDataStart = "<script type=\"text/plain\" id=\"zulm-metadata\">";
constexpr std::string_view s_recordingId = "id=\"zulm-recording\"";
constexpr std::string_view s_elementEnd = "</script>\n";
constexpr std::string_view s_place = "</head>";

std::string pageFor(const ViewOptions& options) {
    if (options.page.empty() && builtInPage().empty())
        throw Failure("this zulm was built without the viewer's page, for which emscripten and npm are needed "
                      "('scripts/install.sh viewer' installs them); build it again, or name a page with --page");
    if (options.page.empty())
        return std::string(builtInPage());
    requireFile(options.page);
    std::ifstream file = openInput(options.page);
    std::string page(std::filesystem::file_size(options.page), '\0');
    file.read(page.data(), static_cast<std::streamsize>(page.size()));
    orFileError(options.page, [&file] { requireReadable(file); });
    return page;
}

/// The page in its two parts, around which the recording belongs.
struct PageParts {
    explicit PageParts(const ViewOptions& options) : text(pageFor(options)), place(text.find(s_place)) {
        if (place == std::string::npos)
            throw Failure(
                fmt::format("{}: is not a page of the viewer, since it has no {}; name the page that zulm was "
                            "built with",
                            options.page, s_place));
        if (text.find(s_recordingId) != std::string::npos)
            throw Failure(fmt::format("{}: holds a recording already; name the page that zulm was built with, or leave "
                                      "out --page",
                                      options.page));
    }
    std::string_view front() const { return std::string_view(text).substr(0, place); }
    std::string_view back() const { return std::string_view(text).substr(place); }

    std::string text;
    std::size_t place;
};

void write(std::ofstream& stream, std::string_view bytes) {
    stream.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
}

/// In pieces that end where a group of base64 does.
void writeMovie(std::ofstream& stream, const std::string& movie, const std::string& name) {
    constexpr std::size_t pieceSize = std::size_t{3} << 18;
    std::ifstream from = openInput(movie);
    Progress progress("embedding " + name, std::filesystem::file_size(movie));
    std::vector<char> piece(pieceSize);
    while (from.read(piece.data(), static_cast<std::streamsize>(piece.size())), from.gcount() > 0) {
        write(stream, base64({piece.data(), static_cast<std::size_t>(from.gcount())}));
        progress.advance(static_cast<std::uint64_t>(from.gcount()));
    }
    orFileError(name, [&from] { requireReadable(from); });
}

void writePage(OutputFile& file, const ViewOptions& options, const InputFile& input, const PageParts& page,
               const ViewedRecording& recording) {
    std::ofstream stream = openOutput(file.temporaryPath(), options.output);
    const std::string text = scriptText(recording.document);
    const std::size_t end = options.embed ? text.size() - std::strlen("\"}") : text.size(); // of the address
    write(stream, page.front());
    write(stream, s_elementStart);
    write(stream, std::string_view(text).substr(0, end));
    if (options.embed)
        writeMovie(stream, input.path(), input.name());
    write(stream, std::string_view(text).substr(end));
    write(stream, s_elementEnd);
    write(stream, s_metaDataStart);
    write(stream, recording.metaData);
    write(stream, s_elementEnd);
    write(stream, page.back());
    stream.close();
    if (!stream)
        throw Failure(fmt::format("{}: cannot be written: {}", options.output, std::strerror(errno)));
    file.commit();
}

/// Returns what the page must know to find the movie, or null if there is none to show.
Json movieFor(const ViewOptions& options, const InputFile& input, RecordingFile& recording) {
    const bool isStream = recording.container() == Container::RawStream;
    if (isStream && options.embed)
        throw Failure(fmt::format("{}: is a stream alone, without a movie to embed", input.name()));
    if (options.embed && recording.size() > s_mostEmbedded)
        throw Failure(fmt::format("{}: {} are too much to embed, no browser would open the page; leave out --embed",
                                  input.name(), bytesText(recording.size())));
    if (options.embed) {
        warn(fmt::format("{}: the movie of {} makes the page {} larger", options.output, bytesText(recording.size()),
                         bytesText((recording.size() + 2) / 3 * 4)));
        return embeddedAddress(recording);
    }
    const bool isKept = input.path() == input.name(); // not so what came from standard input
    return isStream || !isKept ? Json(nullptr) : Json(relativeAddress(input.path(), options.folder()));
}

ExitCode runView(const ViewOptions& options) {
    const InputFile input(options.file);
    RecordingFile recording = input.open();
    if (recording.streams().empty())
        return complainAboutNothing(recording, {});
    const PageParts page(options);
    OutputFile file(options.output, {input.name(), options.page}, options.force);
    writePage(file, options, input, page, viewedRecording(recording, movieFor(options, input, recording)));
    if (!recording.validation().isDamaged())
        return ExitFine;
    complain(fmt::format("{}: is damaged, the page shows what could be read; 'zulm verify {}' says more", input.name(),
                         shellWord(input.name())));
    return ExitDamaged;
}

} // namespace

void addViewCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<ViewOptions>();
    CLI::App* command = app.add_subcommand(
        "view", "Write a page that shows a recording's metadata over its movie. It needs no network and no server, and "
                "finds the movie by its path from the page's folder");
    command->add_option("FILE", options->file, "A movie, RIFF file or stream file; - is standard input")->required();
    command->add_option("-o,--output", options->output, "The page to write")->type_name("OUT")->required();
    command->add_flag("--embed", options->embed, "Put the movie into the page, which makes it large");
    command->add_option("--page", options->page, "Use this page instead of the built-in one")->type_name("PAGE");
    command->add_flag("--force", options->force, "Replace OUT if it exists");
    command->footer("zulm view Recording.mp4 -o Recording.html\n"
                    "zulm view Recording.mp4 -o ToSend.html --embed");
    command->callback([options, &chosen] { chosen = [options] { return runView(*options); }; });
}

} // namespace Zulm
