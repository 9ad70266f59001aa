#include "Tools/zulm/RunReport.h"

#include "Reports/Text.h"
#include "Tools/zulm/StandardStreams.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace Zulm {

namespace {

constexpr std::size_t s_filesDepth = 2; // the document and its "files"

thread_local RunReport* t_current = nullptr;

} // namespace

RunReport::RunReport(const std::string& command, bool isWanted, std::vector<std::string> files, JsonWriter::Style style)
    : before_(t_current), isWanted_(isWanted), files_(std::move(files)),
      workedOn_(files_.empty() ? std::string() : files_.front()), writer_(writeOutput, style) {
    if (isWanted_)
        beginReport(writer_, command);
    t_current = this;
}

RunReport::RunReport(const RunReport& whole, const std::string& file)
    : before_(t_current), isWanted_(whole.isWanted_), workedOn_(file),
      writer_(whole.writer_.forElements(
          [](std::string_view text) { PrintTarget::current()->print(Printed::Document, text); })) {
    t_current = this;
}

RunReport::~RunReport() {
    t_current = before_;
}

RunReport* RunReport::current() {
    return t_current;
}

JsonWriter& RunReport::beginFile(const std::string& name) {
    writer_.beginObject();
    writer_.members(fileHeader(name));
    return writer_;
}

void RunReport::workOn(const std::string& file) {
    if (isWanted_)
        writer_.endTo(s_filesDepth);
    workedOn_ = file;
}

void RunReport::note(const std::string& file, const std::string& message) {
    if (isWanted_)
        errors_.push_back({file, validText(message)});
}

void RunReport::noteComplaint(const std::string& line) {
    const auto isAbout = [&line](const std::string& file) { return line.starts_with(file + ": "); };
    std::string file = isAbout(workedOn_) ? workedOn_ : std::string();
    for (const std::string& candidate : files_)
        if (candidate.size() > file.size() && isAbout(candidate))
            file = candidate;
    if (file.empty())
        note(workedOn_, line);
    else
        note(file, line.substr(file.size() + 2));
}

std::vector<ReportedError> RunReport::endPart() {
    if (isWanted_)
        writer_.endTo(s_filesDepth);
    return std::move(errors_);
}

void RunReport::addErrors(std::vector<ReportedError> errors) {
    std::move(errors.begin(), errors.end(), std::back_inserter(errors_));
}

void RunReport::end() {
    if (isWanted_) {
        endReport(writer_, errors_);
        writeOutput("\n");
    }
}

Action reporting(const std::string& command, bool isWanted, const std::vector<std::string>& files,
                 const std::function<ExitCode(RunReport& report)>& work, JsonWriter::Style style) {
    return [=] {
        RunReport report(command, isWanted, files, style);
        const ExitCode code = orComplaint([&] { return work(report); });
        report.end();
        return code;
    };
}

Action reportingOnEach(const std::string& command, bool isWanted, const std::vector<std::string>& files,
                       const std::function<ExitCode(const std::string& file, RunReport& report)>& work) {
    return reporting(command, isWanted, files, [=](RunReport& report) {
        return forEachFile(files, [&](const std::string& file) { return work(file, report); });
    });
}

} // namespace Zulm
