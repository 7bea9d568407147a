// Dump targets as the storage service hands them out: diagnostic partitions, dump files on
// datastores and Dorna dump objects. Each is owned exclusively by whoever received it.
#pragma once

#include <cstdint>
#include <string>

namespace HostCtl {

// The host-control library's shared empty string: marks an absent path or name.
extern const std::string emptyString;

}  // namespace HostCtl

namespace HostCtl::Storage {

// A partition whose partition type is the core-dump type.
class DiagnosticPartition {
  public:
    virtual ~DiagnosticPartition() = default;
    // Device name with the partition number behind a colon, e.g. "naa.6000c2912f4e8a61:2".
    virtual std::string GetName() const = 0;
    // Device path of the partition.
    virtual std::string GetPath() const = 0;
};

// A pre-allocated dump file on a datastore.
class DiagnosticFile {
  public:
    virtual ~DiagnosticFile() = default;
    // Full host path of the file.
    virtual std::string GetPath() const = 0;
    // Size in bytes.
    virtual int64_t GetSize() const = 0;
    // Whether the file can serve as a dump target: it exists and is a non-empty regular file;
    // `checkHeader` also requires the dump-file header written at creation.
    virtual bool IsValid(bool checkHeader) const = 0;
};

// A dump object kept in the Dorna distributed storage.
class DiagnosticDorna {
  public:
    virtual ~DiagnosticDorna() = default;
    virtual std::string GetUuid() const = 0;
    // Size in bytes.
    virtual int64_t GetSize() const = 0;
    // Whether the object exists in the Dorna storage; `checkHeader` also requires that it was
    // fully allocated.
    virtual bool IsValid(bool checkHeader) const = 0;
};

}  // namespace HostCtl::Storage
