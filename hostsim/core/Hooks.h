// Extension points of the simulator's core that each area fills at static initialisation.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace BrixSim {

// A kernel system-information node: `get` fills exactly `size` bytes of the record of the
// instance named by `instancePath` (empty for the node's only record), `each` names the
// instances below it one at a time, in order. Both may throw HostCtl::Lib::HostCtlException.
struct SysinfoNode {
    std::function<void(const std::vector<std::string>& instancePath, void* buffer, size_t size)>
        get;
    std::function<void(const std::vector<std::string>& instancePath,
                       const std::function<void(const std::string& name)>& name)>
        each;
};
bool RegisterSysinfoNode(uint32_t node, SysinfoNode handler);

// A file-system type that HostOs::mount/umount can mount. Handlers return 0 or an errno value;
// `target` is the host path as given. umount offers the target to every type in turn until one
// answers other than EINVAL (meaning "not mine").
struct FileSystemType {
    std::function<int(const std::string& source, const std::string& target, unsigned long flags,
                      const std::string& data)>
        mount;
    std::function<int(const std::string& target)> umount;
};
bool RegisterFileSystemType(const std::string& fstype, FileSystemType handler);

// A host file whose owner removes it only as part of its own commit, so that a removal asked for
// ahead of a commit that then fails removes nothing. HostOs::unlink of `hostPath` calls `unlink`
// (0 or an errno value) instead of removing the file; the owner removes it when it commits.
bool RegisterHeldFile(const std::string& hostPath, std::function<int()> unlink);

class Store;
// What the host does as it starts again after a reboot or power-off: run in registration order,
// inside the write transaction that records the signal to init, so a restart is all or nothing.
// State the kernel keeps only while running (levels set for this boot, active targets) goes
// back to what is configured.
bool RegisterBootStep(std::function<void(Store&)> step);

// A large host for load tests, `brixsim init --scale KEY=N,...`: each area that owns a table
// worth growing registers a key for it. `grow` runs inside the write transaction that follows
// the seeding of a new host and adds rows until the table holds `count` (a host never has fewer
// than its seeded rows). `what` says what N counts, for the usage text.
struct ScaleKey {
    std::string what;
    std::function<void(Store& store, int64_t count)> grow;
};
bool RegisterScaleKey(const std::string& key, ScaleKey handler);

}  // namespace BrixSim
