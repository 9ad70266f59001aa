// A file for a command of the tool. The first byte chooses the command, the second what the file is called.

#include "Fuzz/Target.h"
#include "Tools/zulm/CommandLine.h"
#include "Tools/zulm/Settings.h"

#include <array>
#include <filesystem>
#include <string>
#include <utility>
#include <vector>

namespace {

using Words = std::vector<std::string>;

constexpr std::array s_extensions{".mp4", ".avi", ".dat", ".mov"};

/// FILE is the input, DIR a folder, MOVIE a small movie that is whole, and PAGE a page without anything.
const std::vector<Words> s_commands{
    {"info", "FILE"},
    {"info", "--json", "FILE"},
    {"atoms", "FILE"},
    {"atoms", "--json", "FILE"},
    {"dump", "FILE"},
    {"dump", "--format", "json", "FILE"},
    {"dump", "--format", "ndjson", "FILE"},
    {"dump", "--format", "csv", "FILE"},
    {"dump", "--images", "DIR/images", "--force", "FILE"},
    {"diff", "FILE", "MOVIE"},
    {"diff", "--json", "FILE", "FILE"},
    {"grep", "--json", "a", "FILE"},
    {"verify", "FILE"},
    {"verify", "--json", "FILE"},
    {"repair", "--dry-run", "--json", "FILE"},
    {"repair", "FILE", "-o", "DIR/out.mp4", "--force"},
    {"salvage", "FILE", "-o", "DIR/salvaged", "--force", "--json"},
    {"attach", "MOVIE", "FILE", "-o", "DIR/out.mp4", "--force"},
    {"attach", "MOVIE", "--from", "FILE", "-o", "DIR/out.mp4", "--force"},
    {"attach", "FILE", "--from", "FILE", "-o", "DIR/out.mp4", "--force", "--replace"},
    {"stamp", "FILE", "-o", "DIR/out.mp4", "--force", "--creator", "c", "--creator-version", "1"},
    {"redact", "FILE", "-o", "DIR/outEXTENSION", "--force", "--keys", "--titles", "a", "--range", "1:2", "--chapters",
     "--creator", "--blank-unknown"},
    {"extract", "FILE", "-o", "DIR/extracted", "--force"},
    {"convert", "--to", "srt", "FILE"},
    {"convert", "--to", "vtt", "--show-keys", "FILE"},
    {"convert", "--to", "ass", "FILE"},
    {"convert", "--to", "ffmetadata", "FILE"},
    {"convert", "--to", "chapters", "FILE"},
    {"view", "FILE", "-o", "DIR/out.html", "--force", "--page", "PAGE"},
    {"view", "FILE", "-o", "DIR/out.html", "--force", "--page", "PAGE", "--embed"},
    {"repair", "FILE", "--in-place"},
    {"attach", "FILE", "--from", "MOVIE", "--in-place", "--replace"},
    {"stamp", "FILE", "--in-place", "--creator", "c", "--creator-version", "1"},
    {"retime", "FILE", "--movie", "MOVIE", "-o", "DIR/out.mp4", "--force", "--keep", "0-2", "--keep", "1-5@3/2"},
    {"retime", "FILE", "--movie", "FILE", "-o", "DIR/out.mp4", "--force", "--remove", "1-2", "--replace", "--json"},
    {"export", "FILE", "-o", "DIR/tables", "--quiet"},
    {"export", "FILE", "-o", "DIR/tables", "--format", "ndjson", "--json"},
};

std::string replaced(std::string word, const std::string& name, const std::string& value) {
    const std::size_t found = word.find(name);
    return found == std::string::npos ? word : word.replace(found, name.size(), value);
}

int runCommand(Words words) {
    std::vector<char*> arguments;
    for (std::string& word : words)
        arguments.push_back(word.data());
    Zulm::settings() = {};
    return Zulm::runCommandLine(static_cast<int>(arguments.size()), arguments.data());
}

} // namespace

void runTarget(std::string_view bytes) {
    const Words& command = s_commands[Fuzz::takeByte(bytes) % s_commands.size()];
    const std::string extension = s_extensions[Fuzz::takeByte(bytes) % s_extensions.size()];
    const std::string file = Fuzz::fileOf("file" + extension, bytes);
    const std::string movie = Fuzz::fileOf("movie.mp4", std::string_view("\0\0\0\x08mdat", 8));
    const std::string page = Fuzz::fileOf("page.html", "<head></head>");
    const std::pair<std::string, std::string> names[] = {
        {"FILE", file}, {"DIR", Fuzz::folder()}, {"MOVIE", movie}, {"EXTENSION", extension}, {"PAGE", page}};
    Words words{"zulm"};
    for (std::string word : command) {
        for (const auto& [name, value] : names)
            word = replaced(std::move(word), name, value);
        words.push_back(std::move(word));
    }
    const int code = runCommand(words);
    if (code != Zulm::ExitFine && code != Zulm::ExitFailed && code != Zulm::ExitDamaged && code != Zulm::ExitNoMetaData)
        Fuzz::fail("an exit code that this command line cannot have");
    if (Fuzz::hasRefusedMemory())
        Fuzz::fail("much memory");
    for (const char* folder : {"/images", "/salvaged", "/extracted", "/tables"})
        std::filesystem::remove_all(Fuzz::folder() + folder);
}
