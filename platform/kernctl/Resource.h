// Kernel resource information: the user-level worlds (threads) of the host, grouped in cartels
// (processes).
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace HostCtl::Resource {

// One world as the kernel reported it when the list was taken.
class World {
  public:
    virtual ~World() = default;

    virtual uint32_t GetId() const = 0;
    virtual std::string GetName() const = 0;
    virtual std::string GetCommandLine() const = 0;
    // The cartel (process) the world belongs to, and that cartel's parent.
    virtual uint32_t GetCartelId() const = 0;
    virtual uint32_t GetParentCartelId() const = 0;
    virtual uint32_t GetWorldGroupId() const = 0;
    virtual uint32_t GetCartelGroupId() const = 0;
    virtual uint32_t GetSessionId() const = 0;
    // The world's flag word, undecoded.
    virtual uint32_t GetFlags() const = 0;
    // The kernel's names for the world's scheduling state and its kind.
    virtual std::string GetStateName() const = 0;
    virtual std::string GetTypeName() const = 0;
    // The access-control domain the world runs in (a domain number).
    virtual uint32_t GetSecurityDomain() const = 0;

  protected:
    World() = default;
};

// The worlds of one moment, read as they are walked rather than all at once.
class WorldList {
  public:
    virtual ~WorldList() = default;
    // Calls `world` for each world, ordered by world id; every walk sees the same worlds. The
    // world passed is valid only during the call.
    virtual void Each(const std::function<void(const World& world)>& world) = 0;

  protected:
    WorldList() = default;
};

}  // namespace HostCtl::Resource

namespace KernCtl::Resource {

class ResourceInfoImpl {
  public:
    ResourceInfoImpl();
    ~ResourceInfoImpl();

    // Every user-level world, read while the list lives.
    std::shared_ptr<HostCtl::Resource::WorldList> GetAllWorlds();
};

}  // namespace KernCtl::Resource
