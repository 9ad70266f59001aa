#include "Tools/zulm/Command.h"

#include "Reports/Text.h"
#include "SharedDependencies/EndianFile.h"
#include "Tools/zulm/RunReport.h"
#include "Tools/zulm/Settings.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaDataBridge/Source/FileError.h"

#include <fmt/color.h>
#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <new>
#include <system_error>

namespace Zulm {

namespace {

constexpr auto s_warning = "zulm: warning:";

/// Prints what is shown already after `lead`, which is coloured if standard error is.
void printLine(const std::string& lead, fmt::color color, const std::string& message) {
    const std::string shownLead = useColor(stderr) ? fmt::format(fmt::emphasis::bold | fg(color), "{}", lead) : lead;
    writeError(fmt::format("{} {}\n", shownLead, message));
}

} // namespace

void complain(const std::string& message) {
    printLine("zulm:", fmt::color::red, shownMessage(message));
    if (RunReport* report = RunReport::current())
        report->noteComplaint(message);
}

void warn(const std::string& message) {
    if (!settings().quiet)
        printLine(s_warning, fmt::color::orange, shownMessage(message));
}

void warnAbout(const std::string& file, const std::string& shownSentence) {
    if (!settings().quiet)
        printLine(s_warning, fmt::color::orange, fmt::format("{}: {}", shown(file), shownSentence));
}

void say(const std::string& message) {
    if (settings().verbose)
        printLine("zulm:", fmt::color::gray, shownMessage(message));
}

ExitCode worseOf(ExitCode left, ExitCode right) {
    constexpr std::array fromBestToWorst{ExitFine, ExitNoMetaData, ExitDamaged, ExitUsage, ExitFailed};
    const auto rank = [&](ExitCode code) { return std::find(fromBestToWorst.begin(), fromBestToWorst.end(), code); };
    return rank(left) < rank(right) ? right : left;
}

ExitCode orComplaint(const Action& work) {
    try {
        return work();
    } catch (const Failure& failure) {
        complain(failure.what());
    } catch (const std::bad_alloc&) {
        complain("out of memory");
    } catch (const std::filesystem::filesystem_error& error) {
        complain(fmt::format("{}: {}", error.path1().string(), error.code().message()));
    } catch (const ZULMetaData::FileError& error) {
        complain(error.what());
    } catch (const std::system_error&) {
        throw;
    } catch (const std::exception& error) {
        complain(error.what());
    }
    return ExitFailed;
}

ExitCode forEachFile(const std::vector<std::string>& files, const std::function<ExitCode(const std::string&)>& work) {
    ExitCode worst = ExitFine;
    for (const std::string& file : files) {
        if (RunReport* report = RunReport::current())
            report->workOn(file);
        worst = worseOf(worst, orComplaint([&] { return work(file); }));
    }
    return worst;
}

void requireFile(const std::string& path, bool forWriting) {
    std::error_code error;
    const auto status = std::filesystem::status(path, error);
    if (path.empty())
        throw Failure("'' is the name of no file");
    if (status.type() == std::filesystem::file_type::not_found)
        throw Failure(fmt::format("{}: no such file", path));
    if (error)
        throw Failure(fmt::format("{}: {}", path, error.message()));
    if (std::filesystem::is_directory(status))
        throw Failure(fmt::format("{}: is a folder; name the files in it", path));
    if (!std::filesystem::is_regular_file(status))
        throw Failure(fmt::format("{}: not a regular file", path));
    const auto mode = forWriting ? std::ios::in | std::ios::out : std::ios::in;
    std::fstream file;
    ZULMetaData::fileOpen(file, path.c_str(), mode | std::ios::binary);
    if (!file.is_open())
        throw Failure(fmt::format("{}: cannot be opened: {}", path, std::strerror(errno)));
}

} // namespace Zulm
