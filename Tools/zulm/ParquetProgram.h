#pragma once

// Runs DuckDB in Node, which writes files of Parquet (Tools/parquet).

#include <cstdint>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

namespace Zulm {

/// Works in one folder, from which the names of files begin. Nobody but their owner may read the new files.
class ParquetProgram {
public:
    /// Throws `Failure` if Node, DuckDB or the program is missing; it says how to install it.
    explicit ParquetProgram(const std::string& folder);

    /// Lines of JSON, and what is in them.
    struct Lines { // NOLINT(bugprone-exception-escape): documents of JSON do not throw when they move
        std::string file;
        nlohmann::ordered_json columns; ///< names and DuckDB's types. Images are in base64
        std::uint64_t longest = 0;      ///< bytes of the longest line
    };

    /// Makes a file of them. Throws `Failure`.
    void write(const Lines& lines, const std::string& output) const;

    /// Makes one file of several. Throws `Failure`.
    void join(const std::vector<std::string>& parts, const std::string& output) const;

private:
    void run(const nlohmann::ordered_json& request, const std::string& output) const;

    std::string folder_;
    std::string program_;
};

} // namespace Zulm
