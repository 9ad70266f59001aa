#pragma once

// What the tool printed when somebody last looked at it, in Tests/Data/golden.

#include <string>

namespace ZULMetaData::Test {

/// Compares with the file `name`. Where ZULM_UPDATE_GOLDEN is set, writes the file instead: look at the difference
/// before it is committed.
void expectGolden(const std::string& text, const std::string& name);

} // namespace ZULMetaData::Test
