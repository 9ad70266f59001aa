#include "Reports/Findings.h"
#include "Reports/InfoReport.h"
#include "Reports/Text.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/ManyFiles.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>

#include <algorithm>
#include <memory>

namespace Zulm {

using namespace ZULMetaData;

namespace {

struct InfoOptions {
    ManyFiles files;
    bool json = false;
};

ExitCode exitCodeFor(const FileInfo& file, const ValidationReport& validation) {
    if (validation.isDamaged())
        return ExitDamaged;
    return file.streams.empty() ? ExitNoMetaData : ExitFine;
}

std::string numberText(const std::optional<double>& number, int digits) {
    return number ? fmt::format("{:.{}f}", *number, digits) : "-";
}

void printRow(const StreamReport& stream) {
    const MetaDataKind* kind = findMetaDataKind(stream.type);
    writeOutput(fmt::format(
        "  {:<23}  {:>9}  {:>10}  {:>10}  {:>8}  {:>10}  {:>7}  {}\n", kind ? kind->name : "(unknown)",
        isDecodable(stream.header()) ? std::to_string(stream.wholeEntries) : "-", numberText(stream.firstTime, 3),
        numberText(stream.lastTime, 3), numberText(entriesPerSecond(stream), 2), stream.declaredBytes, stream.version,
        uuidText(stream.type)));
}

std::string creatorLine(const CreatorAttributes& creator) {
    const bool isPlatform = creator.name() == CreatorAttributes::platformNameMac();
    return fmt::format("  creator: {}{}\n", shownCreator(creator),
                       isPlatform ? " (the name is the platform's: no stamp stores the creator's)" : "");
}

void print(RecordingFile& recording, const FileInfo& file) {
    const std::string duration = file.duration ? fmt::format("{:.3f} s", *file.duration) : "duration not told";
    writeOutput(fmt::format("{}: {}, {}, {}, {} stream{}\n", shown(recording.name()),
                            containerName(recording.container()), duration, bytesText(recording.size()),
                            file.streams.size(), file.streams.size() == 1 ? "" : "s"));
    if (!file.streams.empty())
        writeOutput(heading(fmt::format("  {:<23}  {:>9}  {:>10}  {:>10}  {:>8}  {:>10}  {:>7}  {}", "kind", "entries",
                                        "first s", "last s", "per s", "bytes", "version", "uuid")) +
                    '\n');
    for (const StreamReport& stream : file.streams)
        printRow(stream);
    for (const ZCAPHeader& info : file.creators)
        writeOutput(creatorLine(info.creator));
    visitForeignAtoms(recording, [](const LayoutItem& atom) {
        writeOutput(fmt::format("  foreign atom: '{}' at offset {}, {} bytes\n", printable(atom.item.type.text()),
                                atom.item.offset, atom.size));
    });
}

/// Only so many: the rest is for the command that is made for it.
void warnOf(const std::string& name, const ValidationReport& validation) {
    constexpr std::size_t most = 5;
    std::vector<Finding> damage = validation.allFindings();
    std::erase_if(damage, [](const Finding& finding) { return finding.severity() != Severity::Damage; });
    for (std::size_t i = 0; i < std::min(most, damage.size()); ++i)
        warnAbout(name, findingText(damage[i]));
    if (validation.isDamaged())
        warn(fmt::format("{}: 'zulm verify {}' says {}", name, shellWord(name),
                         damage.size() > most ? fmt::format("{} more", damage.size() - most) : "what that means"));
}

ExitCode showInfo(const std::string& path, RunReport& report) {
    const InputFile input(path);
    RecordingFile recording = input.open();
    const FileInfo file = inspect(recording);
    warnOf(recording.name(), recording.validation());
    if (report.isWanted())
        writeInfo(report.writer(), recording, file);
    else
        print(recording, file);
    const ExitCode code = exitCodeFor(file, recording.validation());
    if (code == ExitNoMetaData)
        report.note(path, "has no recording metadata");
    return code;
}

} // namespace

void addInfoCommand(CLI::App& app, Action& chosen) {
    auto options = std::make_shared<InfoOptions>();
    CLI::App* command = app.add_subcommand("info", "Show which metadata streams a file holds");
    addManyFiles(*command, options->files, "Movies, RIFF files or stream files; - is standard input");
    command->add_flag("--json", options->json, "Print one JSON document");
    command->footer("zulm info Recording.mp4\nzulm info --json *.mp4\n"
                    "find Recordings -name '*.mp4' -print0 | zulm info --json --files-from - --null --jobs 0");
    command->callback([options, &chosen] {
        requireFiles(options->files);
        chosen = reportingOnMany("info", options->json, options->files, [options](RunReport& report) {
            return workOnFiles(options->files, report, showInfo);
        });
    });
}

} // namespace Zulm
