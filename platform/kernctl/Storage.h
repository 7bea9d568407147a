// Kernel-control storage service: where the kernel writes its core dump. Each kind of dump
// target has an active target (in use now) and a configured one (recorded for the next boot).
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "hostctl/Storage.h"

namespace KernCtl::Storage {

class DiagnosticPartitionImpl : public HostCtl::Storage::DiagnosticPartition {
  public:
    DiagnosticPartitionImpl(std::string name, std::string path);
    std::string GetName() const override;
    std::string GetPath() const override;

  private:
    std::string name_;
    std::string path_;
};

// A dump file named by its host path; its properties are read from the file itself.
class DiagnosticFileImpl : public HostCtl::Storage::DiagnosticFile {
  public:
    explicit DiagnosticFileImpl(std::string path);
    std::string GetPath() const override;
    int64_t GetSize() const override;
    bool IsValid(bool checkHeader) const override;

  private:
    std::string path_;
};

// A Dorna dump object named by its UUID.
class DiagnosticDornaImpl : public HostCtl::Storage::DiagnosticDorna {
  public:
    explicit DiagnosticDornaImpl(std::string uuid);
    std::string GetUuid() const override;
    int64_t GetSize() const override;
    bool IsValid(bool checkHeader) const override;

    // Deletes the object from the Dorna storage.
    void DumpDornaRemove(const std::string& uuid);

  private:
    std::string uuid_;
};

class StorageInfoImpl {
  public:
    StorageInfoImpl();
    ~StorageInfoImpl();

    // --- diagnostic partitions ---
    // Null when none is active / configured.
    std::unique_ptr<HostCtl::Storage::DiagnosticPartition> GetActiveDiagnosticPartition();
    std::unique_ptr<HostCtl::Storage::DiagnosticPartition> GetConfiguredDiagnosticPartition();
    // Every partition of the core-dump partition type, in device order.
    std::vector<std::unique_ptr<HostCtl::Storage::DiagnosticPartition>>
    GetPotentialDiagnosticPartitions();
    // Configures `name` for the next boot and, with `activate`, makes it the active one now.
    void SetDiagnosticPartition(const std::string& name, bool activate);
    // Activates the configured partition.
    void ActivateDiagnosticPartition();
    void DeactivateDiagnosticPartition();
    // Activates the best partition available and answers it.
    std::unique_ptr<HostCtl::Storage::DiagnosticPartition> SmartActivateDiagnosticPartition();
    void UnconfigureDiagnosticPartition();

    // --- dump files ---
    // `sizeMb` 0 computes a default from the host's memory; an empty `datastore` picks one with
    // room; an empty `file` picks a unique name.
    void CreateDiagnosticFile(uint64_t sizeMb, const std::string& datastore,
                              const std::string& file, bool enable);
    // As CreateDiagnosticFile, but only when no dump file exists and the kernel option
    // "autoCreateDumpFile" is set.
    void AutoAddDiagnosticFile(uint64_t sizeMb, const std::string& datastore,
                               const std::string& file, bool enable);
    std::unique_ptr<HostCtl::Storage::DiagnosticFile> GetActiveDiagnosticFile();
    std::unique_ptr<HostCtl::Storage::DiagnosticFile> GetConfiguredDiagnosticFile();
    // The dump files found in the datastores' dump folders.
    std::vector<std::unique_ptr<HostCtl::Storage::DiagnosticFile>> GetPotentialDiagnosticFiles();
    void SetDiagnosticFile(const std::string& path, bool activate);
    void ActivateDiagnosticFile();
    void DeactivateDiagnosticFile();
    std::unique_ptr<HostCtl::Storage::DiagnosticFile> SmartActivateDiagnosticFile();
    void UnconfigureDiagnosticFile();
    // False when the count is unknown; otherwise `count` is how often the dump was read.
    bool GetDumpFileReadCount(const std::string& path, uint32_t& count);

    // --- Dorna dump objects ---
    void CreateDiagnosticDorna(uint64_t sizeMb, bool enable);
    // Only when no Dorna dump object exists and the kernel option "autoCreateDumpDorna" is set.
    void AutoAddDiagnosticDorna(uint64_t sizeMb, bool enable);
    std::unique_ptr<HostCtl::Storage::DiagnosticDorna> GetActiveDiagnosticDorna();
    std::unique_ptr<HostCtl::Storage::DiagnosticDorna> GetConfiguredDiagnosticDorna();
    std::vector<std::unique_ptr<HostCtl::Storage::DiagnosticDorna>> GetPotentialDiagnosticDornas();
    void SetDiagnosticDorna(const std::string& uuid, bool activate);
    void ActivateDiagnosticDorna();
    void DeactivateDiagnosticDorna();
    std::unique_ptr<HostCtl::Storage::DiagnosticDorna> SmartActivateDiagnosticDorna();
    void UnconfigureDiagnosticDorna();
    bool GetDumpDornaReadCount(const std::string& uuid, uint32_t& count);
};

}  // namespace KernCtl::Storage
