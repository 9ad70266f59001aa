#include "Tools/zulm/ParquetProgram.h"

#include "Reports/JsonWriter.h"
#include "Reports/Text.h"
#include "Tools/zulm/ChildProcess.h"
#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

#include <algorithm>
#include <filesystem>
#include <system_error>

namespace Zulm {

using Json = nlohmann::ordered_json;

namespace {

namespace fs = std::filesystem;

constexpr auto s_program = "write.cjs";

/// The places of the program: beside this one, where both were built, and where both were installed.
std::string programPath() {
    std::error_code error;
    const fs::path own = fs::read_symlink("/proc/self/exe", error).parent_path().parent_path();
    const fs::path built = own / "parquet" / s_program;
    const fs::path installed = own / "share" / "zulm" / "parquet" / s_program;
    for (const fs::path& path : {built, installed})
        if (fs::exists(path, error))
            return path.string();
    throw Failure(fmt::format("{}: no such file; Parquet needs the folder in which it is installed with zulm",
                              installed.string()));
}

} // namespace

ParquetProgram::ParquetProgram(const std::string& folder) : folder_(folder), program_(programPath()) {
    if (validText(folder) != folder)
        throw Failure(fmt::format("{}: the name of a folder with Parquet must be UTF-8", folder));
    run(Json::object(), folder);
}

void ParquetProgram::write(const Lines& lines, const std::string& output) const {
    run({{"lines", lines.file}, {"columns", lines.columns}, {"longest", lines.longest}, {"output", output}}, output);
}

void ParquetProgram::join(const std::vector<std::string>& parts, const std::string& output) const {
    run({{"parts", parts}, {"output", output}}, output);
}

void ParquetProgram::run(const Json& request, const std::string& output) const {
    Json whole{{"folder", folder_}};
    whole.update(request);
    const ChildResult result = runChild(
        {"node", program_}, [](std::string_view) {}, jsonLine(whole));
    if (result.exitCode == 0)
        return;
    std::string reason = result.errors;
    reason.erase(std::find_if(reason.rbegin(), reason.rend(), [](char c) { return c != '\n'; }).base(), reason.end());
    throw Failure(fmt::format("{}: cannot be written as Parquet: {}", output,
                              reason.empty() ? fmt::format("node ended with {}", result.exitCode) : reason));
}

} // namespace Zulm
