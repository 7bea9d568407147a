// The operating-system calls of the commands, aimed at the simulated host: its clock (the real
// clock plus a stored offset), its journal, its power state, its mounts and its files.
#include "os/HostOs.h"

#include <errno.h>
#include <signal.h>
#include <unistd.h>

#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <filesystem>
#include <string>

#include "hostsim/core/Registry.h"
#include "os/HostFiles.h"

namespace {

// Runs `call` and turns a store failure into errno `failure`, the way a system call would.
template <class Call>
int Guarded(int failure, Call call) {
    try {
        const int error = call();
        if (error == 0) return 0;
        errno = error;
    } catch (const std::exception&) {
        errno = failure;
    }
    return -1;
}

// The factor applied to every sleep; BRIXSIM_SLEEP_SCALE=0 makes sleeps instant.
double SleepScale() {
    const char* text = getenv("BRIXSIM_SLEEP_SCALE");
    if (!text || !*text) return 1.0;
    char* end = nullptr;
    const double scale = strtod(text, &end);
    if (*end != '\0' || !std::isfinite(scale) || scale < 0) return 1.0;
    return scale;
}

}  // namespace

namespace HostOs {

time_t time(time_t* out) {
    time_t now = ::time(nullptr);
    try {
        now += static_cast<time_t>(BrixSim::Store::Get().GetInt("clock.offset", 0));
    } catch (const std::exception&) {
        errno = EIO;
        return static_cast<time_t>(-1);
    }
    if (out) *out = now;
    return now;
}

struct tm* localtime(const time_t* when) {
    return ::localtime(when);
}

struct tm* localtime_r(const time_t* when, struct tm* out) {
    return ::localtime_r(when, out);
}

time_t mktime(struct tm* broken) {
    return ::mktime(broken);
}

int settimeofday(const struct timeval* tv, const struct timezone* /*tz*/) {
    if (!tv) return 0;
    if (tv->tv_usec < 0 || tv->tv_usec >= 1000000 || tv->tv_sec < 0) {
        errno = EINVAL;
        return -1;
    }
    return Guarded(EIO, [&] {
        auto& store = BrixSim::Store::Get();
        store.Write([&] {
            store.SetInt("clock.offset", static_cast<int64_t>(tv->tv_sec - ::time(nullptr)));
            store.Journal("settimeofday", {{"seconds", static_cast<int64_t>(tv->tv_sec)}});
        });
        return 0;
    });
}

int nanosleep(const struct timespec* request, struct timespec* remaining) {
    if (!request) {
        errno = EFAULT;
        return -1;
    }
    if (request->tv_sec < 0 || request->tv_nsec < 0 || request->tv_nsec >= 1000000000) {
        errno = EINVAL;
        return -1;
    }
    const int journaled = Guarded(EIO, [&] {
        auto& store = BrixSim::Store::Get();
        store.Write([&] {
            store.Journal("sleep", {{"seconds", static_cast<int64_t>(request->tv_sec)}});
        });
        return 0;
    });
    if (journaled != 0) return -1;

    const double seconds =
        (static_cast<double>(request->tv_sec) + request->tv_nsec / 1e9) * SleepScale();
    if (seconds > 0) {
        struct timespec left;
        left.tv_sec = static_cast<time_t>(seconds);
        left.tv_nsec = static_cast<long>((seconds - static_cast<double>(left.tv_sec)) * 1e9);
        while (::nanosleep(&left, &left) != 0 && errno == EINTR) {
        }
    }
    if (remaining) *remaining = {0, 0};
    return 0;
}

void syslog(int priority, const char* format, ...) {
    std::string text;
    va_list args;
    va_start(args, format);
    va_list copy;
    va_copy(copy, args);
    const int length = vsnprintf(nullptr, 0, format, copy);
    va_end(copy);
    if (length > 0) {
        text.resize(static_cast<size_t>(length) + 1);
        vsnprintf(text.data(), text.size(), format, args);
        text.resize(static_cast<size_t>(length));
    }
    va_end(args);
    // syslog reports nothing to its caller.
    const int saved = errno;
    Guarded(EIO, [&] {
        auto& store = BrixSim::Store::Get();
        store.Write([&] {
            store.Journal("syslog", {{"priority", static_cast<int64_t>(priority)}, {"text", text}});
        });
        return 0;
    });
    errno = saved;
}

int kill(pid_t pid, int signal) {
    if (signal < 0 || signal >= NSIG) {
        errno = EINVAL;
        return -1;
    }
    // The host's only process that takes signals from the tool is its init, process 1.
    if (pid != 1) {
        errno = ESRCH;
        return -1;
    }
    if (signal == 0) return 0;
    return Guarded(EIO, [&] {
        auto& store = BrixSim::Store::Get();
        store.Write([&] {
            store.Journal("signal", {{"pid", static_cast<int64_t>(pid)},
                                     {"signal", static_cast<int64_t>(signal)}});
            // init reboots on SIGTERM and powers off on SIGUSR2.
            // A powered-off host is taken as switched on again by the next use.
            if (signal == SIGTERM) {
                store.SetValue("power.last", "reboot");
                store.SetInt("power.reboots", store.GetInt("power.reboots", 0) + 1);
                BrixSim::RunBootSteps(store);
            } else if (signal == SIGUSR2) {
                store.SetValue("power.last", "poweroff");
                store.SetInt("power.poweroffs", store.GetInt("power.poweroffs", 0) + 1);
                BrixSim::RunBootSteps(store);
            }
        });
        return 0;
    });
}

int mount(const char* source, const char* target, const char* fstype, unsigned long flags,
          const void* data) {
    if (!target || !fstype) {
        errno = EFAULT;
        return -1;
    }
    const auto& types = BrixSim::RegisteredFileSystemTypes();
    auto type = types.find(fstype);
    if (type == types.end() || !type->second.mount) {
        errno = ENODEV;
        return -1;
    }
    const std::string sourceText = source ? source : "";
    const std::string dataText = data ? static_cast<const char*>(data) : "";
    return Guarded(EIO, [&] {
        auto& store = BrixSim::Store::Get();
        int error = 0;
        store.Write([&] {
            error = type->second.mount(sourceText, target, flags, dataText);
            if (error != 0) return;
            store.Journal("mount", {{"source", sourceText},
                                    {"target", std::string(target)},
                                    {"fstype", std::string(fstype)},
                                    {"flags", static_cast<int64_t>(flags)},
                                    {"data", dataText}});
        });
        return error;
    });
}

int umount(const char* target) {
    if (!target) {
        errno = EFAULT;
        return -1;
    }
    return Guarded(EIO, [&] {
        auto& store = BrixSim::Store::Get();
        int error = EINVAL;
        store.Write([&] {
            for (const auto& [name, type] : BrixSim::RegisteredFileSystemTypes()) {
                if (!type.umount) continue;
                error = type.umount(target);
                if (error != EINVAL) break;
            }
            if (error == 0) store.Journal("umount", {{"target", std::string(target)}});
        });
        return error;
    });
}

int unlink(const char* path) {
    if (!path) {
        errno = EFAULT;
        return -1;
    }
    if (!*path) {
        errno = ENOENT;
        return -1;
    }
    return Guarded(EIO, [&] {
        auto& store = BrixSim::Store::Get();
        const auto real = store.Resolve(path);
        if (!real) return EACCES;
        const auto* held =
            BrixSim::FindHeldFile(std::filesystem::path(path).lexically_normal().string());
        int error = 0;
        store.Write([&] {
            error = held ? (*held)() : ::unlink(real->c_str()) != 0 ? errno : 0;
            if (error != 0) return;
            // A held file is removed by its owner's next commit.
            if (held) {
                store.Journal("unlink", {{"path", std::string(path)}, {"held", true}});
            } else {
                store.Journal("unlink", {{"path", std::string(path)}});
            }
        });
        return error;
    });
}

// Host files the commands open themselves (secret files given by path) live under the root.
std::string HostFileName(const std::string& path) {
    try {
        const auto resolved = BrixSim::Store::Get().Resolve(path);
        if (resolved) return resolved->string();
        errno = EACCES;
    } catch (const std::exception&) {
        errno = EIO;
    }
    return std::string();
}

}  // namespace HostOs
