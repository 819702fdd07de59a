#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Storage.h"

namespace KnxCtl::Storage {

using HostCtl::Storage::FileSystem;
using HostCtl::Storage::HlFileSystem;
using HostCtl::Storage::NetworkFileSystem;
using HostCtl::Storage::NfsVersion;

struct HostObjectHandle; // the simulated host's reference to one object of its state

// Access to the host's storage configuration, made on the stack for one call.
class StorageInfoImpl {
public:
    using NetworkFileSystemFilter = bool (*)(NetworkFileSystem&);

    StorageInfoImpl();
    ~StorageInfoImpl();
    StorageInfoImpl(const StorageInfoImpl&) = delete;
    StorageInfoImpl& operator=(const StorageInfoImpl&) = delete;

    // Filters for the network file system queries.
    static bool IsPE(NetworkFileSystem& fs);
    static bool IsNotPE(NetworkFileSystem& fs);
    static bool IsNotHidden(NetworkFileSystem& fs);

    std::vector<std::unique_ptr<FileSystem>> GetFileSystems();
    std::unique_ptr<FileSystem> GetFileSystemByUuidEx(const std::string& uuid);
    std::unique_ptr<FileSystem> GetFileSystemByUUID(const std::string& uuid);
    std::unique_ptr<FileSystem> GetFileSystemByLabel(const std::string& label);
    std::unique_ptr<FileSystem> GetFileSystemByPath(const std::string& path);
    std::vector<std::unique_ptr<HlFileSystem>> GetHlfsFileSystems(const std::string& filter);
    std::vector<std::unique_ptr<HlFileSystem>> GetHlfsFileSystemsList(const std::string& filter);
    std::vector<std::unique_ptr<HostCtl::Storage::UnresolvedHlfsVolume>> GetUnresolvedVolumes();

    bool TryMount(FileSystem::MountOperationOption option, const std::string& uuid, const std::string& label);
    void SignalIORM(bool signal);
    void RescanHlfs();
    void AutoFullMountVolumes();
    void RestorePsaConfig();

    std::unique_ptr<NetworkFileSystem> AddNetworkFileSystem(const std::string& host, const std::string& share,
                                                            const std::string& volumeName, bool knxnicBound,
                                                            const std::string& knxnic, std::uint32_t queueDepth,
                                                            std::int64_t connections);
    std::unique_ptr<NetworkFileSystem> AddV41NetworkFileSystem(const std::vector<std::string>& hosts,
                                                               const std::string& share, const std::string& volumeName,
                                                               NetworkFileSystem::SecurityType security,
                                                               bool knxnicBound);
    void RemoveNetworkFileSystem(const std::string& volumeName);
    static void RemoveNetworkFileSystem(const std::string& volumeName, NfsVersion version);
    std::vector<std::unique_ptr<NetworkFileSystem>> GetV3NetworkFileSystems(NetworkFileSystemFilter filter);
    std::vector<std::unique_ptr<NetworkFileSystem>> GetV41NetworkFileSystems(NetworkFileSystemFilter filter);
    void EnterNetworkFileSystemPreUnmount(const std::string& volumeName);
    void ExitNetworkFileSystemPreUnmount(const std::string& volumeName);

    void AddNasFirewallConfig(const std::string& ipMask, NfsVersion version);
    void RemoveNasFirewallConfig(const std::string& ipMask, NfsVersion version);
    std::vector<std::string> GetNasFirewallConfigs(NfsVersion version);
};

// The host's HLFS implementation class, opened from a volume path under /hlfs/volumes/.
class HlFileSystemImpl : public HlFileSystem {
public:
    explicit HlFileSystemImpl(const std::string& path);
    explicit HlFileSystemImpl(std::shared_ptr<HostObjectHandle> handle);
    ~HlFileSystemImpl() override;

    static std::unique_ptr<HlFileSystem> GetHLFSFileSystemByLabel(const std::string& label);
    static std::unique_ptr<HlFileSystem> GetHLFSFileSystemByUUID(const std::string& uuid);

    void ConvertToVersion5();
    void UnmapVolume(unsigned reclaimUnit, void* context);
    bool IsAccessible();

    void Mount(MountOperationOption option) override;
    int Unmount(MountOperationOption option) override;
    bool IsMounted() override;
    std::uint64_t GetCapacity() override;
    std::uint64_t GetUsedSpace() override;
    std::string GetType() override;
    std::string GetMountPoint() override;
    std::string GetVolumeName() override;
    std::string GetUuid() override;
    std::string GetName() override;
    void PrepareUnmount() override;
    HostCtl::Storage::QAXIState GetQAXIState() override;

    int GetMajorVersion() override;
    std::vector<std::unique_ptr<HostCtl::Storage::DiskLunPartition>> GetExtents() override;
    std::string GetLvmUuid() override;
    unsigned GetLockMode() override;
    void SetLockMode(unsigned mode) override;
    int GetATSSupport() override;
    std::vector<HostCtl::Storage::HlfsUserInfo> GetUsers(bool quickLiveness) override;
    HostCtl::Storage::HlfsVolumeUnmapProperty GetUnmapProperty() override;
    void SetUnmapProperty(const HostCtl::Storage::HlfsVolumeUnmapProperty& property) override;
    bool IsClusteredHdskEnabled() override;
    void SetClusteredHdskEnabled(bool enabled) override;

private:
    std::shared_ptr<HostObjectHandle> handle_;
};

class UnresolvedHlfsExtentImpl : public HostCtl::Storage::UnresolvedHlfsExtent {
public:
    explicit UnresolvedHlfsExtentImpl(std::shared_ptr<HostObjectHandle> handle);
    ~UnresolvedHlfsExtentImpl() override;

    std::string GetDeviceName() override;
    std::uint8_t GetPartition() override;
    virtual std::int64_t GetStart();
    virtual std::int64_t GetEnd();

private:
    std::shared_ptr<HostObjectHandle> handle_;
};

class UnresolvedHlfsVolumeImpl : public HostCtl::Storage::UnresolvedHlfsVolume {
public:
    explicit UnresolvedHlfsVolumeImpl(std::shared_ptr<HostObjectHandle> handle);
    ~UnresolvedHlfsVolumeImpl() override;

    virtual std::string GetLvmUuid();
    virtual std::string GetUuid();
    virtual std::string GetVolumeName();
    virtual std::vector<std::unique_ptr<HostCtl::Storage::UnresolvedHlfsExtent>> GetExtents();
    // `second` true: may the copy be mounted; false: may it be resignatured. Sets *reason.
    virtual bool CanResolve(bool first, bool second, unsigned* reason);
    virtual std::unique_ptr<FileSystem> Mount(bool first, bool persistent);
    virtual std::unique_ptr<FileSystem> Resignature();

private:
    std::shared_ptr<HostObjectHandle> handle_;
};

// Keeps the host's storage information cached while it lives.
class StorageInfoScopedCache {
public:
    explicit StorageInfoScopedCache(bool refresh);
    ~StorageInfoScopedCache();
    StorageInfoScopedCache(const StorageInfoScopedCache&) = delete;
    StorageInfoScopedCache& operator=(const StorageInfoScopedCache&) = delete;
};

} // namespace KnxCtl::Storage
