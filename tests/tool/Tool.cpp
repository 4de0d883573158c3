#include "tool/Tool.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <stdexcept>
#include <sys/wait.h>
#include <unistd.h>

namespace {

constexpr unsigned int secondsAtMost = 60;

ToolResult run(std::vector<std::string> words, std::string_view input)
{
    // Files, not pipes, so that nothing waits for the other side.
    ScratchFolder const scratch;
    std::string const files[] = {scratch.write("in", input), scratch.path("out"),
                                 scratch.path("messages")};
    std::vector<char*> arguments;
    for (std::string& word : words)
        arguments.push_back(word.data());
    arguments.push_back(nullptr);

    pid_t const child = fork();
    if (child < 0)
        throw std::runtime_error("fork failed");
    if (child == 0) {
        for (int fd = 0; fd < 3; ++fd) {
            int const file = open(files[fd].c_str(), fd == 0 ? O_RDONLY : O_WRONLY | O_CREAT, 0600);
            if (file < 0 || dup2(file, fd) < 0)
                _exit(126);
            close(file);
        }
        setenv("KORVANE", KORVANE_TOOL, 1);
        signal(SIGALRM, SIG_DFL);
        alarm(secondsAtMost);
        execv(arguments[0], arguments.data());
        _exit(127);
    }

    int status = 0;
    while (waitpid(child, &status, 0) < 0)
        if (errno != EINTR)
            throw std::runtime_error("waitpid failed");
    ToolResult result;
    result.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    result.out = scratch.read("out");
    result.messages = scratch.read("messages");
    return result;
}

} // namespace

ToolResult runTool(std::vector<std::string> const& arguments, std::string_view input)
{
    std::vector<std::string> words = {KORVANE_TOOL};
    words.insert(words.end(), arguments.begin(), arguments.end());
    return run(words, input);
}

ToolResult runShell(std::string const& line)
{
    return run({"/bin/sh", "-c", line}, {});
}
