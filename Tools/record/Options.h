#pragma once

#include "Tools/record/Geometry.h"
#include "Tools/record/PrivacyFilter.h"
#include "Tools/record/VideoWriter.h"

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace CLI {
class App;
}

namespace Recorder {

enum class Task { Record, Recover, Pause, Resume, Stop, WatchAccessibility };

/// What was asked for on the command line.
struct Options {
    Task task = Task::Record;
    std::filesystem::path output;
    std::filesystem::path folder; ///< to recover
    bool deletesFolder = false;

    std::string display;
    std::optional<Area> region;
    std::string window;  ///< a title, a number, or "click"; empty for the screen
    std::string monitor; ///< a name; empty for all of them
    bool stopsOnClose = false;
    std::optional<double> duration; ///< seconds
    VideoSettings video;
    std::optional<std::string> sound; ///< the source; empty for the default one

    KeyMode keys = KeyMode::Shortcuts;
    bool withoutAccessibility = false;
    std::vector<std::string> deniedApps;
    std::vector<std::string> deniedTitles;

    std::filesystem::path socket; ///< empty for the usual place
    bool json = false;
};

/// The words of the command line as they were given.
struct GivenOptions {
    Options options;
    std::string output;
    std::string region;
    std::string socket;
    std::optional<double> duration;
    std::optional<std::string> sound;
    std::optional<std::string> recover;
    bool pause = false;
    bool resume = false;
    bool stop = false;
};

extern const char* const s_aboutRecording;
extern const char* const s_recordingExamples; ///< command lines

/// Describes the options. `zulm` uses the description for its manual, and the recorder reads its command line with it.
void addRecordingOptions(CLI::App& app, GivenOptions& given);

/// Reads the command line. Returns nothing if all that was asked for has been printed, such as the help. Throws
/// `Refusal`.
std::optional<Options> optionsOf(int argc, char** argv);

} // namespace Recorder
