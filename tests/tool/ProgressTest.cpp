#include "tool/Tool.h"

#include "Progress.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <pty.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

using ::testing::AllOf;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

namespace {

/// What a bar of so many milliseconds, a tenth of its work each time, shows on a terminal.
std::string shownOnATerminal(int milliseconds)
{
    int terminal = -1;
    pid_t const child = forkpty(&terminal, nullptr, nullptr, nullptr);
    if (child == 0) {
        {
            Progress progress("copying", 10);
            for (unsigned int done = 1; done <= 10; ++done) {
                std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds / 10));
                progress.update(done);
            }
        }
        _exit(0);
    }
    std::string shown;
    char block[256];
    for (ssize_t got; (got = read(terminal, block, sizeof block)) > 0;)
        shown.append(block, static_cast<std::size_t>(got));
    close(terminal);
    waitpid(child, nullptr, 0);
    return shown;
}

} // namespace

TEST(Progress, ShowsAfterASecondAndIsWiped)
{
    EXPECT_THAT(shownOnATerminal(1300),
                AllOf(HasSubstr("copying [####"), HasSubstr("100 %"), EndsWith("\r\x1b[K")));
    EXPECT_THAT(shownOnATerminal(100), IsEmpty());
}
