#pragma once

// What a command with --json prints: one JSON document for the whole run, written while the files are worked on.

#include "Reports/Report.h"
#include "Tools/zulm/Command.h"

#include <functional>
#include <string>
#include <vector>

namespace Zulm {

/// The document of one run. While it exists, what is complained of is kept for the document's "errors".
class RunReport {
public:
    /// Writes the beginning of the document of `command` if `isWanted`; if not, nothing is written at all. `files` are
    /// the names that complaints may begin with. A complaint that begins with none of them is about the file that is
    /// being worked on, which is the first one until `workOn` says otherwise.
    RunReport(const std::string& command, bool isWanted, std::vector<std::string> files, JsonWriter::Style style);

    /// The part of the report `whole` that is about one file, made by a thread that prints to a `PrintTarget`. What is
    /// written goes there as `Printed::Document`.
    RunReport(const RunReport& whole, const std::string& file);

    ~RunReport();
    RunReport(const RunReport&) = delete;
    RunReport& operator=(const RunReport&) = delete;

    bool isWanted() const { return isWanted_; }

    /// Adds the object of a file. Only for a report that is wanted.
    void add(const nlohmann::ordered_json& file) { writer_.element(file); }

    /// Begins the object of the file `name`, which is written in pieces. Only for a report that is wanted.
    JsonWriter& beginFile(const std::string& name);

    /// Returns the writer, for a document that is written in pieces. Requires a report that is wanted.
    JsonWriter& writer() { return writer_; }

    /// Ends what is open of the object of the file before this one.
    void workOn(const std::string& file);

    /// Keeps an error that standard error does not tell.
    void note(const std::string& file, const std::string& message);

    /// Keeps a line of standard error.
    void noteComplaint(const std::string& line);

    /// Returns the errors of a part, whose element is ended.
    std::vector<ReportedError> endPart();

    /// Appends the errors of a part.
    void addErrors(std::vector<ReportedError> errors);

    /// Writes the errors and the end of the document.
    void end();

    /// The newest one of this thread, or null.
    static RunReport* current();

private:
    RunReport* before_;
    bool isWanted_;
    std::vector<std::string> files_;
    std::string workedOn_;
    std::vector<ReportedError> errors_;
    JsonWriter writer_;
};

/// Returns an action that runs `work` with the report of `command`. Whatever goes wrong with it is complained of, and
/// the document is whole all the same. The action throws only if standard output cannot be written.
Action reporting(const std::string& command, bool isWanted, const std::vector<std::string>& files,
                 const std::function<ExitCode(RunReport& report)>& work,
                 JsonWriter::Style style = JsonWriter::Style::Indented);

/// The same for `work` on one file after the other, as `forEachFile` runs it.
Action reportingOnEach(const std::string& command, bool isWanted, const std::vector<std::string>& files,
                       const std::function<ExitCode(const std::string& file, RunReport& report)>& work);

} // namespace Zulm
