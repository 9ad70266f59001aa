#include "Tools/zulm/SaveTarget.h"

#include "Reports/Text.h"
#include "Tools/zulm/EndingSignals.h"
#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/StandardStreams.h"
#include "Tools/zulm/TemporaryFile.h"
#include "ZULMetaDataBridge/Source/FileError.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>

#include <csignal>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

volatile std::sig_atomic_t s_caught = 0;

extern "C" void noteSignal(int signal) {
    s_caught = signal;
}

std::string hexText(const std::string& bytes) {
    std::string text;
    for (const char byte : bytes)
        text += fmt::format("{:02x}", static_cast<unsigned char>(byte));
    return text;
}

ByteSource openMovie(const std::string& path) {
    requireFile(path);
    return openSource(path, path);
}

void requireRepairable(const ByteSource& movie, const std::string& path) {
    try {
        const RepairPlan plan = planSave(movie, path);
        if (plan.state == RepairPlan::Unrepairable)
            throw Failure(unrepairableText(path, plan));
    } catch (const SaveError& error) {
        throw Failure(error.what());
    }
}

} // namespace

void addDestinationOptions(CLI::App& command, SaveOptions& options, const std::string& subject) {
    auto* output = command.add_option("-o,--output", options.output,
                                      fmt::format("Write a changed copy of {} to this file", subject));
    output->type_name("OUT");
    command.add_flag("--force", options.force, "Replace OUT if it exists")->needs(output);
    command.add_flag("--in-place", options.inPlace, fmt::format("Change {} itself", subject))->excludes(output);
}

void addSaveOptions(CLI::App& command, SaveOptions& options) {
    command.add_option("MOVIE", options.movie, "The movie (MP4 or QuickTime, whatever its name)")->required();
    addDestinationOptions(command, options, "MOVIE");
}

void requireDestination(const SaveOptions& options) {
    if (options.output.empty() && !options.inPlace)
        throw CLI::RequiredError("either -o OUT, which writes a changed copy, or --in-place, which changes MOVIE,");
}

SaveTarget::SaveTarget(const SaveOptions& options, const std::vector<std::string>& otherInputs)
    : name_(options.inPlace ? options.movie : options.output), subject_(options.movie), path_(options.movie),
      movie_(openMovie(options.movie)) {
    if (!options.inPlace)
        requireOutputName(name_, Container::QuickTime, options.movie);
    if (options.inPlace)
        requireFile(options.movie, true);
    requireRepairable(movie_, options.movie);
    if (options.inPlace) {
        s_caught = 0;
        catchSignals();
        return;
    }
    std::vector<std::string> inputs = otherInputs;
    inputs.push_back(options.movie);
    copy_ = std::make_unique<OutputFile>(options.output, inputs, options.force);
}

SaveTarget::~SaveTarget() {
    if (!copy_)
        handleEndingSignals(SIG_DFL);
}

SafeMovieSave::Progress SaveTarget::progress(const std::string& what) const {
    auto shown = std::make_shared<std::unique_ptr<Progress>>();
    return [what, shown](std::uint64_t done, std::uint64_t total) {
        if (s_caught != 0)
            throw Interruption{s_caught};
        if (!*shown)
            *shown = std::make_unique<Progress>(what, total);
        (*shown)->moveTo(done);
    };
}

/// A temporary file that was made meanwhile has set handlers of its own, which would end the program in the middle.
void SaveTarget::catchSignals() const {
    if (!copy_)
        handleEndingSignals(noteSignal);
}

void SaveTarget::makeCopy() {
    if (!copy_)
        return;
    copy_->copyFrom(path_);
    subject_ = fmt::format("{}, a copy of {}", name_, path_);
    path_ = copy_->temporaryPath();
}

void SaveTarget::commit() {
    if (copy_)
        copy_->commit();
}

void SaveTarget::fail(const SaveError& error) const {
    std::string text = fmt::format("{}: {}", error.file() == path_ ? subject_ : error.file(), error.sentence());
    if (error.reason() == SaveError::Reason::Doubtful)
        text += "; --unchecked attaches it as it is";
    if (error.reason() == SaveError::Reason::KindExists)
        text += "; --replace adds one that readers take instead";
    if (error.reason() != SaveError::Reason::NotUndone)
        text += copy_ ? "; nothing was written" : "; nothing was changed";
    throw Failure(text);
}

/// What was done is undone by now.
void SaveTarget::endBy(const Interruption& interruption) const {
    complain(fmt::format("{}: interrupted; it is what it was before", name_));
    removeTemporaryFiles();
    std::signal(interruption.signal, SIG_DFL);
    std::raise(interruption.signal);
    throw Failure(fmt::format("{}: interrupted", name_));
}

void addFragmentIndexOption(CLI::App& command, SafeMovieSave::FragmentIndex& index) {
    command.add_flag_callback(
        "--move-mfra", [&index] { index = SafeMovieSave::FragmentIndex::MoveToEnd; },
        "Copy the index of a fragmented movie (mfra) to the end of the file, where players look for it");
}

std::string fragmentIndexText(FragmentIndexState state) {
    switch (state) {
    case FragmentIndexState::NotAtEnd: return "not-at-end";
    case FragmentIndexState::AtEnd: return "at-end";
    default: return "none";
    }
}

void warnOfFragmentIndex(const std::string& name, FragmentIndexState state) {
    if (state == FragmentIndexState::NotAtEnd)
        warn(
            fmt::format("{}: the index of its fragments (mfra) is no longer at the end of the file, so that players do "
                        "not find it; run the command with --move-mfra to put it there",
                        name));
}

std::string unrepairableText(const std::string& path, const RepairPlan& plan) {
    return fmt::format(
        "{}: {}; nothing that is appended to it could be found. 'zulm salvage {} -o DIR' searches it for "
        "metadata streams",
        path, plan.finding, shellWord(path));
}

void printRepair(const std::string& path, const RepairPlan& plan) {
    if (plan.state == RepairPlan::Whole)
        return;
    writeOutput(fmt::format("{}: {}\n", shown(path), plan.finding));
    for (const RepairChange& change : plan.changes)
        writeOutput(fmt::format("  offset {}: {} -> {}  {}\n", change.offset, hexText(change.before),
                                change.after.empty() ? "(cut off)" : hexText(change.after), change.reason));
}

Json repairDocument(const RepairPlan& plan) {
    Json document{{"state", repairStateName(plan.state)}, {"changes", Json::array()}};
    for (const RepairChange& change : plan.changes)
        document["changes"].push_back({{"offset", change.offset},
                                       {"before", hexText(change.before)},
                                       {"after", hexText(change.after)},
                                       {"reason", change.reason}});
    if (plan.state == RepairPlan::Whole)
        return document;
    document["finding"] = plan.finding;
    document["offset"] = plan.offset;
    document["loss"] = plan.hasLoss;
    if (plan.hasLoss)
        document["lost"] = plan.loss;
    return document;
}

ExitCode complainAboutLoss(const std::string& path, const RepairPlan& plan) {
    if (!plan.hasLoss)
        return ExitFine;
    complain(
        fmt::format("{}: {}; {}. Every whole entry is kept; 'zulm salvage {} -o DIR' searches the original for more",
                    path, plan.finding, plan.loss, shellWord(path)));
    return ExitDamaged;
}

} // namespace Zulm
