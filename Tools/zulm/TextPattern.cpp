#include "Tools/zulm/TextPattern.h"

#include <CLI/CLI.hpp>
#include <fmt/core.h>
#include <re2/re2.h>

namespace Zulm {

namespace {

RE2::Options optionsFor(bool ignoreCase, bool isFixed) {
    RE2::Options options;
    options.set_log_errors(false);
    options.set_case_sensitive(!ignoreCase);
    options.set_literal(isFixed);
    return options;
}

} // namespace

TextPattern::TextPattern(const std::string& pattern, bool ignoreCase, bool isFixed)
    : expression_(std::make_unique<RE2>(pattern, optionsFor(ignoreCase, isFixed))) {
    if (!expression_->ok())
        throw CLI::ValidationError(fmt::format("{} is no regular expression: {}", pattern, expression_->error()));
}

TextPattern::~TextPattern() = default;

bool TextPattern::matches(const std::string& text) const {
    return RE2::PartialMatch(text, *expression_);
}

} // namespace Zulm
