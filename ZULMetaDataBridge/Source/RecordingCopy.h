#pragma once

// What redaction and compaction have in common: both write a recording anew, and the media keeps its place. `Error` is
// `RedactionError` or `CompactionError`.

#include "Platform/FileLocation.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/Containers/RepairPlan.h"

#include <cerrno>
#include <filesystem>
#include <system_error>
#include <vector>

namespace ZULMetaData {

template <class Error>
[[noreturn]] void failToWrite(const std::error_code& error = {errno != 0 ? errno : EIO, std::generic_category()}) {
    throw Error(Error::Reason::CannotWrite, "cannot be written: " + error.message());
}

/// `items` are those at the top level.
template <class Error>
void requireWholeContainer(const ByteSource& file, Container::Type type, const std::vector<ContainerItem>& items) {
    const bool isMovie = type == Container::QuickTime;
    const RepairPlan plan = isMovie ? planRepair(file) : RepairPlan();
    if (plan.state == RepairPlan::Repairable)
        throw Error(Error::Reason::Repairable, plan.finding);
    const std::uint64_t end = items.empty() ? 0 : items.back().end();
    const bool fillsFile = end == file.size() || (!isMovie && end + end % 2 == file.size());
    if (plan.state == RepairPlan::Unrepairable || !fillsFile)
        throw Error(Error::Reason::Damaged, plan.finding.empty() ? "its parts do not fill the file" : plan.finding);
}

/// Ends the file at its write position. Returns its size.
template <class Error, class Output>
std::uint64_t finishCopy(Output& out, const FileLocation& copy) {
    const auto end = out.tellp();
    out.close();
    if (!out || end < 0)
        failToWrite<Error>();
    const auto size = static_cast<std::uint64_t>(end);
    std::error_code error;
    std::filesystem::resize_file(copy, size, error);
    if (error)
        failToWrite<Error>(error);
    return size;
}

} // namespace ZULMetaData
