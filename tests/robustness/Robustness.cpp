// Helpers of the whole-process robustness tests.
#include "Robustness.h"

#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <thread>

#include "support/BuildTree.h"

extern char** environ;

namespace BrixRobust {

namespace fs = std::filesystem;

namespace {

[[noreturn]] void Fail(const std::string& what) {
    throw std::runtime_error(what + ": " + std::strerror(errno));
}

// A file descriptor closed when it goes.
struct Fd {
    int fd;
    explicit Fd(int value) : fd(value) {}
    ~Fd() {
        if (fd >= 0) ::close(fd);
    }
    Fd(const Fd&) = delete;
    Fd& operator=(const Fd&) = delete;
};

void CopyRange(int from, int to, off_t begin, off_t end) {
    char buffer[1 << 16];
    while (begin < end) {
        const size_t want = static_cast<size_t>(std::min<off_t>(end - begin, sizeof buffer));
        const ssize_t got = ::pread(from, buffer, want, begin);
        if (got < 0 && errno == EINTR) continue;
        if (got <= 0) Fail("pread");
        for (ssize_t done = 0; done < got;) {
            const ssize_t put =
                ::pwrite(to, buffer + done, static_cast<size_t>(got - done), begin + done);
            if (put < 0 && errno == EINTR) continue;
            if (put <= 0) Fail("pwrite");
            done += put;
        }
        begin += got;
    }
}

// Copies the data regions only; the holes stay holes.
void CopySparseFile(const fs::path& from, const fs::path& to) {
    Fd in(::open(from.c_str(), O_RDONLY | O_CLOEXEC));
    if (in.fd < 0) Fail("open " + from.string());
    struct stat info {};
    if (::fstat(in.fd, &info) != 0) Fail("stat " + from.string());
    Fd out(::open(to.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, info.st_mode & 07777));
    if (out.fd < 0) Fail("create " + to.string());
    if (::ftruncate(out.fd, info.st_size) != 0) Fail("truncate " + to.string());
    off_t position = 0;
    while (position < info.st_size) {
        const off_t data = ::lseek(in.fd, position, SEEK_DATA);
        if (data < 0) {
            if (errno == ENXIO) break;  // only a hole is left
            Fail("seek " + from.string());
        }
        off_t hole = ::lseek(in.fd, data, SEEK_HOLE);
        if (hole < 0) hole = info.st_size;
        CopyRange(in.fd, out.fd, data, hole);
        position = hole;
    }
    ::fchmod(out.fd, info.st_mode & 07777);
}

}  // namespace

int EnvCount(const char* name, int fallback) {
    const char* text = getenv(name);
    if (!text || !*text) return fallback;
    char* end = nullptr;
    const long value = strtol(text, &end, 10);
    if (*end != '\0' || value < 1 || value > 1000000) return fallback;
    return static_cast<int>(value);
}

std::string Program(const std::string& name) {
    return (BrixTest::BinDir() / name).string();
}

pid_t Spawn(const std::vector<std::string>& argv) {
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 0, "/dev/null", O_RDONLY, 0);
    posix_spawn_file_actions_addopen(&actions, 1, "/dev/null", O_WRONLY, 0);
    posix_spawn_file_actions_addopen(&actions, 2, "/dev/null", O_WRONLY, 0);
    std::vector<char*> args;
    for (const auto& arg : argv) args.push_back(const_cast<char*>(arg.c_str()));
    args.push_back(nullptr);
    pid_t pid = 0;
    const int error = posix_spawn(&pid, args[0], &actions, nullptr, args.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    if (error != 0) {
        errno = error;
        Fail("cannot run " + argv[0]);
    }
    return pid;
}

bool Reap(pid_t pid, int& exitCode) {
    int status = 0;
    while (::waitpid(pid, &status, 0) < 0) {
        if (errno != EINTR) Fail("waitpid");
    }
    if (WIFEXITED(status)) {
        exitCode = WEXITSTATUS(status);
        return true;
    }
    exitCode = WIFSIGNALED(status) ? WTERMSIG(status) : -1;
    return false;
}

KillOutcome KillAfter(pid_t pid, std::chrono::microseconds delay) {
    std::this_thread::sleep_for(delay);
    ::kill(pid, SIGKILL);
    KillOutcome outcome;
    int code = 0;
    if (Reap(pid, code)) {
        outcome.exitCode = code;
    } else {
        outcome.killed = code == SIGKILL;
        if (!outcome.killed) outcome.exitCode = 128 + code;
    }
    return outcome;
}

void CopyTree(const fs::path& from, const fs::path& to) {
    fs::create_directories(to);
    for (const auto& entry : fs::directory_iterator(from)) {
        const fs::path target = to / entry.path().filename();
        if (entry.is_symlink()) {
            fs::copy_symlink(entry.path(), target);
        } else if (entry.is_directory()) {
            CopyTree(entry.path(), target);
            fs::permissions(target, fs::status(entry.path()).permissions());
        } else if (entry.is_regular_file()) {
            CopySparseFile(entry.path(), target);
        }
    }
}

void ResetRoot(const fs::path& root, const fs::path& templateRoot) {
    for (const auto& entry : fs::directory_iterator(root)) fs::remove_all(entry.path());
    CopyTree(templateRoot, root);
}

std::vector<std::string> Words(const std::string& line) {
    std::vector<std::string> words;
    std::string word;
    bool quoted = false, any = false;
    for (const char c : line) {
        if (c == '\'') {
            quoted = !quoted;
            any = true;
        } else if (c == ' ' && !quoted) {
            if (any) words.push_back(word);
            word.clear();
            any = false;
        } else {
            word += c;
            any = true;
        }
    }
    if (any) words.push_back(word);
    return words;
}

}  // namespace BrixRobust
