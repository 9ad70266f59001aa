#include "Tools/record/HeldInput.h"

#include "Tests/Support/Files.h"
#include "ZULMetaDataSession/Recording.h"

#include <gtest/gtest.h>

#include <vector>

using namespace Recorder;
using namespace ZULMetaData;

namespace {

constexpr std::uint32_t s_control = 0x40000;

class HeldInputTest : public testing::Test {
protected:
    HeldInputTest() { journal_.start(begin_); }

    void press(std::uint32_t code, Instant time, std::uint32_t flags = 0) {
        input_.addKey(begin_ + time, KeyStroke(code, flags));
    }

    /// Ends the recording, and returns the codes of the keys in it.
    std::vector<std::uint32_t> keys(Instant end) {
        input_.releaseAll(begin_ + end);
        journal_.session().finish();
        const Recording stream(folder_ / "a/keyboardAction.dat");
        std::vector<std::uint32_t> codes;
        for (const KeyInput& key : stream.track<KeyboardActionKind>().values())
            codes.push_back(key.code);
        return codes;
    }

    Instant begin_ = now();
    ZULMetaData::Test::TemporaryFolder folder_;
    PrivacyFilter privacy_{KeyMode::Everything, {}, {}};
    Journal journal_{folder_ / "a", [](const Error&) {}};
    HeldInput input_{journal_, privacy_};
};

} // namespace

TEST_F(HeldInputTest, LeavesOutTheKeyThatEndedTheRecording) {
    press('a', s_second);
    press('b', 2 * s_second);
    input_.dropTrigger(begin_ + 2 * s_second + 100 * s_millisecond);
    EXPECT_EQ(keys(3 * s_second), std::vector<std::uint32_t>{'a'});
}

TEST_F(HeldInputTest, KeepsAKeyThatIsTooOldToHaveEndedIt) {
    press('a', s_second);
    input_.dropTrigger(begin_ + 2 * s_second);
    EXPECT_EQ(keys(3 * s_second), std::vector<std::uint32_t>{'a'});
}

TEST_F(HeldInputTest, LeavesOutTheInterruptOfTheTerminalAndNoEarlierShortcut) {
    press('S', s_second, s_control);
    press('C', 2 * s_second, s_control);
    input_.dropInterruptKey(begin_ + 2 * s_second + 100 * s_millisecond);
    input_.dropInterruptKey(begin_ + 2 * s_second + 100 * s_millisecond); // the terminal's own key was left out already
    EXPECT_EQ(keys(3 * s_second), std::vector<std::uint32_t>{'S'});
}
