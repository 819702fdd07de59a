#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Network.h"

namespace HostCtl::Storage {

enum NfsVersion { NFS_VERSION_3 = 1, NFS_VERSION_41 = 2 };

enum QAXIState : int { QAXI_UNKNOWN = 0, QAXI_SUPPORTED = 1, QAXI_NOT_SUPPORTED = 2 };

class FileSystem {
public:
    enum MountOperationOption { MOUNT_PERSISTENT = 0, MOUNT_UNTIL_RESTART = 1 };

    virtual ~FileSystem();

    virtual void Mount(MountOperationOption option) = 0;
    // 1: busy, nothing was unmounted; any other value: unmounted.
    virtual int Unmount(MountOperationOption option) = 0;
    virtual bool IsMounted() = 0;
    virtual std::uint64_t GetCapacity() = 0;
    virtual std::uint64_t GetUsedSpace() = 0;
    virtual std::string GetType() = 0;
    virtual std::string GetMountPoint() = 0;
    virtual std::string GetVolumeName() = 0;
    virtual std::string GetUuid() = 0;
    virtual std::string GetName() = 0;
    virtual void PrepareUnmount() = 0;
    virtual QAXIState GetQAXIState() = 0;
};

class DiskLunPartition {
public:
    virtual ~DiskLunPartition();
    virtual std::string GetDeviceName() = 0;
    virtual std::uint8_t GetPartition() = 0;
};

// One host's heartbeat record on an HLFS volume.
struct HlfsUserInfo {
    std::string heartbeatUuid;
    HostCtl::Network::MacAddress macAddress;
    std::uint32_t driverVersionMajor = 0;
    std::uint32_t driverVersionMinor = 0;
    std::int64_t heartbeatOffset = 0;
    std::uint8_t lockModeInUse = 0;
};

// Automatic space reclamation settings of an HLFS volume.
struct HlfsVolumeUnmapProperty {
    std::uint32_t granularity = 0;
    std::string priority;
    std::int32_t bandwidth = 0;
    std::int32_t reserved = 0;
    std::string method;
};

class HlFileSystem : public virtual FileSystem {
public:
    static const std::string HLFS_TYPE;

    ~HlFileSystem() override;

    virtual int GetMajorVersion() = 0;
    virtual std::vector<std::unique_ptr<DiskLunPartition>> GetExtents() = 0;
    virtual std::string GetLvmUuid() = 0;
    virtual unsigned GetLockMode() = 0;
    virtual void SetLockMode(unsigned mode) = 0;
    virtual int GetATSSupport() = 0;
    virtual std::vector<HlfsUserInfo> GetUsers(bool quickLiveness) = 0;
    virtual HlfsVolumeUnmapProperty GetUnmapProperty() = 0;
    virtual void SetUnmapProperty(const HlfsVolumeUnmapProperty& property) = 0;
    virtual bool IsClusteredHdskEnabled() = 0;
    virtual void SetClusteredHdskEnabled(bool enabled) = 0;
};

class NetworkFileSystem : public virtual FileSystem {
public:
    enum SecurityType { SEC_NONE = 0, SEC_SYS = 1, SEC_KRB5 = 2, SEC_KRB5I = 3, SEC_KRB5P = 4 };

    static const std::string NFS_AUTH_NONE_STR;
    static const std::string NFS_AUTH_SYS_STR;
    static const std::string NFS_AUTH_KRB5_STR;
    static const std::string NFS_AUTH_KRB5I_STR;
    static const std::string NFS_AUTH_KRB5P_STR;
    static const std::string NFS_AUTH_UNKNOWN_STR;

    ~NetworkFileSystem() override;

    using FileSystem::Mount;
    // Mounts with the given flags word (4: retry).
    virtual void Mount(unsigned flags) = 0;
    virtual bool IsAccessible() = 0;
    virtual std::string GetRemoteHost() = 0;
    virtual std::vector<std::string> GetRemoteHosts() = 0;
    virtual std::string GetRemoteShare() = 0;
    virtual bool IsReadOnly() = 0;
    virtual bool GetReadOnlyState() = 0;
    virtual void SetReadOnly(bool readOnly) = 0;
    virtual bool IsPE() = 0;
    virtual void SetPE(bool isPE) = 0;
    virtual std::string GetKnxnic() = 0;
    virtual std::string GetKnxnics() = 0;
    virtual void SetKnxnics(const std::string& knxnics) = 0;
    virtual std::int64_t GetConnections() = 0;
    virtual std::int32_t GetConnectionsParam() = 0;
    virtual void SetConnectionsParam(std::int32_t connections) = 0;
    virtual std::uint32_t GetMaxReadTransferSize() = 0;
    virtual std::uint32_t GetMaxWriteTransferSize() = 0;
    virtual std::uint32_t GetMaxQueueDepth() = 0;
    virtual void SetMaxQueueDepth(std::uint32_t depth, bool apply) = 0;
    // Volumes that know no security flavour report none.
    virtual SecurityType GetSecurityType() { return SEC_NONE; }
};

class UnresolvedHlfsExtent : public virtual DiskLunPartition {
public:
    ~UnresolvedHlfsExtent() override;
};

// A copy (snapshot or replica) of an HLFS volume that still carries the original's signature.
class UnresolvedHlfsVolume {
public:
    virtual ~UnresolvedHlfsVolume();
};

struct PointerBlockCacheStats {
    std::uint64_t cacheSize = 0;
    std::uint64_t cacheSizeMax = 0;
    std::uint64_t workingSet = 0;
    std::uint64_t workingSetMax = 0;
    std::uint64_t heapOverhead = 0;
    std::int32_t capacityMissRatio = 0;
};

class PointerBlockCache {
public:
    virtual ~PointerBlockCache();
    virtual PointerBlockCacheStats GetStatistics() = 0;
    virtual void ResetStatistics() = 0;
};

// Storage information as the host object hands it out.
class StorageInfo {
public:
    virtual ~StorageInfo();
    virtual std::vector<std::unique_ptr<HlFileSystem>> GetHlfsFileSystems(const std::string& filter) = 0;
    virtual std::unique_ptr<HlFileSystem> GetHlfsFileSystemByUuid(const std::string& uuid) = 0;
    virtual std::unique_ptr<HlFileSystem> GetHlfsFileSystemByLabel(const std::string& label) = 0;
    virtual std::unique_ptr<PointerBlockCache> GetPointerBlockCache() = 0;
};

} // namespace HostCtl::Storage
