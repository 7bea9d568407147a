// Running a host command line on behalf of the invoking user.
#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>
#include <cerrno>
#include <cstring>
#include <utility>

#include "cmdkit/AutoCli.h"

extern char** environ;

namespace CmdKit::AutoCli {

namespace {

// Runs argv[0] as given: no shell, no PATH search.
int DefaultRunner(const std::vector<std::string>& argv, const std::string& /*user*/,
                  std::string& output) {
    return RunProgram(argv[0], argv, output);
}

// Closes a pipe end once.
struct PipeEnd {
    int fd = -1;
    ~PipeEnd() {
        if (fd >= 0) close(fd);
    }
};

std::atomic<HostCommandRunner> runner{&DefaultRunner};

}  // namespace

int RunProgram(const std::string& program, const std::vector<std::string>& argv,
               std::string& output) {
    output.clear();
    int fds[2];
    if (pipe2(fds, O_CLOEXEC) != 0) {
        output = "Cannot run " + argv[0] + ": " + std::strerror(errno);
        return 126;
    }
    PipeEnd reader{fds[0]};
    PipeEnd writer{fds[1]};
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0);
    posix_spawn_file_actions_adddup2(&actions, writer.fd, STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, writer.fd, STDERR_FILENO);
    // A descriptor the caller left open without close-on-exec is none of the program's.
    posix_spawn_file_actions_addclosefrom_np(&actions, STDERR_FILENO + 1);

    std::vector<char*> args;
    args.reserve(argv.size() + 1);
    for (const auto& word : argv) args.push_back(const_cast<char*>(word.c_str()));
    args.push_back(nullptr);

    pid_t pid = 0;
    const int error = posix_spawn(&pid, program.c_str(), &actions, nullptr, args.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    close(std::exchange(writer.fd, -1));
    if (error != 0) {
        output = "Cannot run " + argv[0] + ": " + std::strerror(error);
        return error == ENOENT ? 127 : 126;
    }
    char buffer[4096];
    for (;;) {
        const ssize_t n = read(reader.fd, buffer, sizeof buffer);
        if (n > 0) {
            output.append(buffer, static_cast<size_t>(n));
        } else if (n == 0 || errno != EINTR) {
            break;
        }
    }
    int status = 0;
    while (waitpid(pid, &status, 0) < 0) {
        if (errno != EINTR) {
            output += "Cannot wait for " + argv[0] + ": " + std::strerror(errno);
            return 126;
        }
    }
    if (WIFEXITED(status)) return WEXITSTATUS(status);
    if (WIFSIGNALED(status)) return 128 + WTERMSIG(status);
    return 126;
}

void SetHostCommandRunner(HostCommandRunner newRunner) {
    runner.store(newRunner ? newRunner : &DefaultRunner);
}

int AutoCli_ShellCmdWithKvUsername(const std::string& commandLine, const std::string& user,
                                   std::string& output, const std::string& /*extra*/) {
    std::vector<std::string> argv;
    boost::algorithm::split(argv, commandLine, boost::algorithm::is_space(),
                            boost::algorithm::token_compress_on);
    std::erase_if(argv, [](const std::string& word) { return word.empty(); });
    if (argv.empty()) {
        output = "Cannot run an empty command line";
        return 127;
    }
    return runner.load()(argv, user, output);
}

}  // namespace CmdKit::AutoCli
