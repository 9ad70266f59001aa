#include "Tools/zulm/EditOptions.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <iostream>

namespace Zulm {

using namespace ZULMetaData;

namespace {

bool isRange(const std::string& text) {
    const std::size_t mark = text.find('-');
    return mark != std::string::npos && parseEditTime(text.substr(0, mark)) && parseEditTime(text.substr(mark + 1));
}

/// What is wrong with the form of a value; whether it makes sense shows when the list is made.
std::string checkRemoved(const std::string& text) {
    return isRange(text) ? std::string()
                         : fmt::format("{} is not of the form A-B; give two times such as 10-12.5 or 0:10-1:30", text);
}

std::string checkKept(const std::string& text) {
    const std::size_t mark = std::min(text.find('@'), text.size());
    const bool hasSpeed = mark == text.size() || Rational::parse(text.substr(mark + 1));
    return isRange(text.substr(0, mark)) && hasSpeed
               ? std::string()
               : fmt::format("{} is not of the form A-B or A-B@SPEED; give two times, and a speed such as 2 or 3/2, "
                             "as in 10-12.5@2",
                             text);
}

void addRanges(CLI::App& command, const std::string& name, std::vector<std::string>& ranges, const std::string& form,
               const std::string& description, std::string (*check)(const std::string&)) {
    command.add_option(name, ranges, description)
        ->type_name(form)
        ->allow_extra_args(false)
        ->check(CLI::Validator(check, ""));
}

/// Returns what `read` returns. An impossible value becomes a failure that names its option.
template <class Read>
auto orFailure(const char* option, const std::string& text, Read read) {
    try {
        return read();
    } catch (const Error& error) {
        throw Failure(fmt::format("{} {}: {}", option, text, error.sentence()));
    }
}

/// Returns what standard input holds, or at least so much of it that no edit list is as large.
std::string listOnStandardInput() {
    std::string text;
    std::array<char, 1 << 16> piece;
    while (text.size() <= EditList::s_largestFile && (std::cin.read(piece.data(), piece.size()), std::cin.gcount() > 0))
        text.append(piece.data(), static_cast<std::size_t>(std::cin.gcount()));
    return text;
}

EditList readList(const EditOptions& options, const Recording& recording) {
    EditListOptions listOptions;
    listOptions.frameRate = options.frameRate;
    if (const auto duration = recording.duration())
        listOptions.duration = Rational::of(*duration);
    if (options.file == "-") {
        return EditList::open(ByteSource::memory(listOnStandardInput()), options.file, listOptions);
    }
    requireFile(options.file);
    return EditList::open(FileLocation(options.file), listOptions);
}

EditList listWithout(const std::vector<std::string>& removed, const Recording& recording) {
    const auto duration = recording.duration();
    if (!duration)
        throw Failure(fmt::format("{}: does not tell how long it is, so that nothing can be removed from its length; "
                                  "give what is kept with --keep",
                                  recording.name()));
    std::vector<EditRange> ranges;
    ranges.reserve(removed.size());
    for (const std::string& text : removed)
        ranges.push_back(orFailure("--remove", text, [&text] { return parseEditRange(text); }));
    return EditList::without(std::move(ranges), Rational::of(*duration));
}

} // namespace

void addEditOptions(CLI::App& command, EditOptions& options) {
    command
        .add_option("--edits", options.file,
                    "Read the pieces from this edit list: JSON of zulm, an ffmpeg concat list, LosslessCut, "
                    "auto-editor, OpenTimelineIO, CMX 3600, or a movie's own list; - is standard input")
        ->type_name("FILE");
    addRanges(
        command, "--keep", options.kept, "A-B[@SPEED]",
        "Keep the recording from A to B, which are seconds (12.5, 61/3) or time codes (1:30), SPEED times as fast "
        "(repeatable; pieces follow one another in the order given)",
        checkKept);
    addRanges(command, "--remove", options.removed, "A-B", "Keep all but what lies from A to B (repeatable)",
              checkRemoved);
    command
        .add_option_function<std::string>(
            "--frame-rate",
            [&options](const std::string& word) {
                options.frameRate = Rational::parse(word);
                if (!options.frameRate || options.frameRate->isZero())
                    throw CLI::ValidationError(
                        "--frame-rate", fmt::format("'{}' is no frame rate such as 25, 29.97 or 30000/1001", word));
            },
            "The frame rate of an edit list that counts frames, such as 25 or 30000/1001")
        ->type_name("RATE")
        ->needs("--edits");
}

void requireEdits(const EditOptions& options, const std::string& recording) {
    const int given =
        (options.file.empty() ? 0 : 1) + (options.kept.empty() ? 0 : 1) + (options.removed.empty() ? 0 : 1);
    if (given == 0)
        throw CLI::RequiredError("either --edits FILE, --keep A-B or --remove A-B");
    if (given > 1)
        throw CLI::ValidationError("--edits, --keep and --remove cannot be given together");
    if (options.file == "-" && recording == "-")
        throw CLI::ValidationError("only one of RECORDING and --edits can be standard input");
}

EditList editsOf(const EditOptions& options, const Recording& recording) {
    if (!options.file.empty())
        return readList(options, recording);
    if (!options.removed.empty())
        return listWithout(options.removed, recording);
    EditList edits;
    for (const std::string& piece : options.kept)
        orFailure("--keep", piece, [&] { edits.keep(piece); });
    return edits;
}

} // namespace Zulm
