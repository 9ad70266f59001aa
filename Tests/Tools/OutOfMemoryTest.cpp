#include "Tools/zulm/OutOfMemory.h"

#include "Tests/Support/Files.h"
#include "Tools/zulm/TemporaryFile.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <new>

namespace ZULMetaData::Test {
namespace {

/// What `new` calls in the end, after it has found no memory.
void runOutOfMemory() {
    std::get_new_handler()();
}

TEST(OutOfMemoryDeathTest, SaysSoAndEnds) {
    EXPECT_EXIT(
        {
            Zulm::endWhereMemoryRunsOut();
            runOutOfMemory();
        },
        testing::ExitedWithCode(1), "^zulm: out of memory\n$");
}

TEST(OutOfMemoryDeathTest, LeavesNoTemporaryFile) {
    const TemporaryFolder folder;
    EXPECT_EXIT(
        {
            Zulm::endWhereMemoryRunsOut();
            const Zulm::TemporaryFile file(folder.path().string(), "movie", ".mp4");
            runOutOfMemory();
        },
        testing::ExitedWithCode(1), "");
    EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
}

TEST(OutOfMemoryDeathTest, IsAnExceptionWhereSomethingHasToBeUndone) {
    EXPECT_EXIT(
        {
            Zulm::endWhereMemoryRunsOut();
            const bool isLeftOut = [] {
                const Zulm::MemoryRunsOutByException undoing;
                return std::get_new_handler() == nullptr;
            }();
            std::_Exit(isLeftOut && std::get_new_handler() ? 0 : 2);
        },
        testing::ExitedWithCode(0), "");
}

} // namespace
} // namespace ZULMetaData::Test
