// Test helpers: temporary hosts and running the built programs with captured output.
#include "support/TestHost.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <sstream>
#include <stdexcept>

#include "hostsim/core/Store.h"
#include "support/BuildTree.h"

extern char** environ;

namespace BrixTest {

namespace {

std::string Describe(const std::vector<std::string>& argv, const RunResult& result) {
    std::string line;
    for (const auto& arg : argv) line += (line.empty() ? "" : " ") + arg;
    return line + " exited " + std::to_string(result.status) + ": " + result.err;
}

void Remember(const char* name, std::string& value, bool& had) {
    const char* current = getenv(name);
    had = current != nullptr;
    if (had) value = current;
}

void Restore(const char* name, const std::string& value, bool had) {
    if (had) {
        setenv(name, value.c_str(), 1);
    } else {
        unsetenv(name);
    }
}

}  // namespace

TempHost::TempHost() {
    const char* tmp = getenv("TMPDIR");
    std::string pattern = std::string(tmp && *tmp ? tmp : "/tmp") + "/brixhost-XXXXXX";
    if (!mkdtemp(pattern.data())) {
        throw std::runtime_error("mkdtemp " + pattern + ": " + std::strerror(errno));
    }
    root_ = pattern;
    Remember("BRIX_HOST_ROOT", oldRoot_, hadRoot_);
    Remember("BRIXSIM_SLEEP_SCALE", oldScale_, hadScale_);
    setenv("BRIX_HOST_ROOT", root_.c_str(), 1);
    setenv("BRIXSIM_SLEEP_SCALE", "0", 1);
    // Made now, so a test may put files into the root before its first command.
    BrixSim::Store::Close();
    BrixSim::Store::Get();
}

TempHost::~TempHost() {
    BrixSim::Store::Close();
    std::error_code ec;
    std::filesystem::remove_all(root_, ec);
    Restore("BRIX_HOST_ROOT", oldRoot_, hadRoot_);
    Restore("BRIXSIM_SLEEP_SCALE", oldScale_, hadScale_);
}

RunResult TempHost::Cli(const std::vector<std::string>& args, const std::string& input) const {
    std::vector<std::string> argv{(BinDir() / "brixcli").string()};
    argv.insert(argv.end(), args.begin(), args.end());
    return Run(argv, input);
}

RunResult TempHost::Sim(const std::vector<std::string>& args) const {
    std::vector<std::string> argv{(BinDir() / "brixsim").string()};
    argv.insert(argv.end(), args.begin(), args.end());
    return Run(argv);
}

std::vector<nlohmann::json> TempHost::Journal() const {
    const auto result = Sim({"journal"});
    if (result.status != 0) throw std::runtime_error(Describe({"brixsim", "journal"}, result));
    std::vector<nlohmann::json> records;
    std::istringstream lines(result.out);
    for (std::string line; std::getline(lines, line);) {
        if (!line.empty()) records.push_back(nlohmann::json::parse(line));
    }
    return records;
}

void TempHost::Fault(const std::string& operation, const std::string& message) const {
    Fault(operation, message, 0);
}

void TempHost::Fault(const std::string& operation, const std::string& message, int times,
                     const std::string& detail) const {
    std::vector<std::string> args{"fault", "set", operation, message};
    if (times > 0) args.insert(args.end(), {"--times", std::to_string(times)});
    if (!detail.empty()) args.insert(args.end(), {"--detail", detail});
    const auto result = Sim(args);
    if (result.status != 0) throw std::runtime_error(Describe(args, result));
}

void TempHost::ClearFaults() const {
    const auto result = Sim({"fault", "clear"});
    if (result.status != 0) throw std::runtime_error(Describe({"fault", "clear"}, result));
}

void TempHost::Import(const nlohmann::json& state) const {
    nlohmann::json document = state;
    if (!document.contains("tables")) document = {{"tables", state}};
    if (!document.contains("version")) document["version"] = 1;

    const char* tmp = getenv("TMPDIR");
    std::string path = std::string(tmp && *tmp ? tmp : "/tmp") + "/brixstate-XXXXXX";
    const int fd = mkstemp(path.data());
    if (fd < 0) throw std::runtime_error("mkstemp: " + std::string(std::strerror(errno)));
    ::close(fd);
    {
        std::ofstream out(path, std::ios::binary | std::ios::trunc);
        out << document.dump();
    }
    const auto result = Sim({"import", path});
    ::unlink(path.c_str());
    if (result.status != 0) throw std::runtime_error(Describe({"import", path}, result));
}

nlohmann::json TempHost::Export() const {
    const auto result = Sim({"export"});
    if (result.status != 0) throw std::runtime_error(Describe({"export"}, result));
    return nlohmann::json::parse(result.out);
}

RunResult Run(const std::vector<std::string>& argv, const std::string& input) {
    // A child that exits without reading its input must not kill the test with SIGPIPE.
    signal(SIGPIPE, SIG_IGN);
    RunResult result;
    int in[2], out[2], err[2];
    if (pipe2(in, O_CLOEXEC) || pipe2(out, O_CLOEXEC) || pipe2(err, O_CLOEXEC)) {
        throw std::runtime_error("pipe: " + std::string(std::strerror(errno)));
    }
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, in[0], 0);
    posix_spawn_file_actions_adddup2(&actions, out[1], 1);
    posix_spawn_file_actions_adddup2(&actions, err[1], 2);
    std::vector<char*> args;
    for (const auto& arg : argv) args.push_back(const_cast<char*>(arg.c_str()));
    args.push_back(nullptr);
    pid_t pid = 0;
    const int error = posix_spawnp(&pid, args[0], &actions, nullptr, args.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    ::close(in[0]);
    ::close(out[1]);
    ::close(err[1]);
    if (error != 0) {
        ::close(in[1]);
        ::close(out[0]);
        ::close(err[0]);
        throw std::runtime_error("cannot run " + argv[0] + ": " + std::strerror(error));
    }

    size_t written = 0;
    int inFd = in[1];
    if (input.empty()) {
        ::close(inFd);
        inFd = -1;
    } else {
        fcntl(inFd, F_SETFL, O_NONBLOCK);
    }
    int outFd = out[0], errFd = err[0];
    char buffer[65536];
    while (outFd >= 0 || errFd >= 0 || inFd >= 0) {
        pollfd fds[3];
        int count = 0;
        if (inFd >= 0) fds[count++] = {inFd, POLLOUT, 0};
        if (outFd >= 0) fds[count++] = {outFd, POLLIN, 0};
        if (errFd >= 0) fds[count++] = {errFd, POLLIN, 0};
        if (poll(fds, static_cast<nfds_t>(count), -1) < 0) {
            if (errno == EINTR) continue;
            break;
        }
        for (int i = 0; i < count; ++i) {
            if (fds[i].revents == 0) continue;
            if (fds[i].fd == inFd) {
                const ssize_t put = ::write(inFd, input.data() + written, input.size() - written);
                if (put > 0) written += static_cast<size_t>(put);
                if ((put < 0 && errno != EAGAIN && errno != EINTR) || written == input.size()) {
                    ::close(inFd);
                    inFd = -1;
                }
                continue;
            }
            const ssize_t got = ::read(fds[i].fd, buffer, sizeof buffer);
            if (got > 0) {
                (fds[i].fd == outFd ? result.out : result.err)
                    .append(buffer, static_cast<size_t>(got));
            } else if (got == 0 || (errno != EINTR && errno != EAGAIN)) {
                ::close(fds[i].fd);
                (fds[i].fd == outFd ? outFd : errFd) = -1;
            }
        }
    }
    if (inFd >= 0) ::close(inFd);
    int status = 0;
    while (waitpid(pid, &status, 0) < 0 && errno == EINTR) {
    }
    result.status = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    return result;
}

}  // namespace BrixTest
