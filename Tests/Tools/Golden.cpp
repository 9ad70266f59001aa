#include "Tests/Tools/Golden.h"

#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>

namespace ZULMetaData::Test {

void expectGolden(const std::string& text, const std::string& name) {
    const std::filesystem::path file = std::filesystem::path(ZULM_TEST_DATA) / "golden" / name;
    if (std::getenv("ZULM_UPDATE_GOLDEN")) {
        std::filesystem::create_directories(file.parent_path());
        return writeFile(file, text);
    }
    EXPECT_EQ(text, contentsOf(file)) << name;
}

} // namespace ZULMetaData::Test
