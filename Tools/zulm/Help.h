#pragma once

#include <CLI/CLI.hpp>

#include <string>

namespace Zulm {

/// The pages of --help: the tool's, and each command's.
class HelpPage final : public CLI::Formatter {
public:
    std::string make_help(const CLI::App* app, std::string name, CLI::AppFormatMode mode) const override;
};

} // namespace Zulm
