#include "plot/plot.h"

#include "text/files.h"

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <fcntl.h>
#include <memory>
#include <spawn.h>
#include <stdexcept>
#include <sys/wait.h>
#include <system_error>
#include <unistd.h>

namespace dravikHost {

namespace {

// The status of a child that became no other program, where its start told nothing else.
constexpr int kNotStarted = 127;

[[noreturn]] void failToStart(int failure)
{
    throw std::runtime_error("cannot start gnuplot: " + std::generic_category().message(failure) +
                             "; --script writes what it would be given");
}

class tChild
{
public:
    // Its standard input is the end of a pipe.
    explicit tChild(int input)
    {
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_adddup2(&actions, input, STDIN_FILENO);
        char name[] = "gnuplot";
        char* const arguments[] = {name, nullptr};
        const int failure = posix_spawnp(&pid, name, &actions, nullptr, arguments, environ);
        posix_spawn_file_actions_destroy(&actions);
        if (failure != 0) failToStart(failure);
    }

    void requireSuccess() const
    {
        int status = 0;
        while (waitpid(pid, &status, 0) < 0 && errno == EINTR) {
        }
        if (WIFEXITED(status) && WEXITSTATUS(status) == kNotStarted) failToStart(ENOENT);
        if (!WIFEXITED(status) || WEXITSTATUS(status) != 0)
            throw std::runtime_error("gnuplot did not draw it; what is wrong stands above");
    }

private:
    pid_t pid = 0;
};

} // namespace

// Should gnuplot end early, the pipe breaks and its status tells.
void runGnuplot(const std::string& script)
{
    int ends[2];
    if (pipe2(ends, O_CLOEXEC) != 0)
        throw std::system_error(errno, std::generic_category(), "cannot make a pipe");
    tFile output(fdopen(ends[0], "r"));
    tFile input(fdopen(ends[1], "w"));
    const tChild gnuplot(ends[0]);
    output.reset(); // now it is gnuplot's alone, or the pipe would never break
    (void)std::signal(SIGPIPE, SIG_IGN);
    (void)std::fwrite(script.data(), 1, script.size(), input.get());
    input.reset();
    gnuplot.requireSuccess();
}

} // namespace dravikHost
