#pragma once

// The Linux back end of the storage-control library: the same operations as the simulated
// host, answered from the machine this process runs on. The storage-control classes hand
// their calls here while a Linux session is open.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "hostctl/Host.h"
#include "hostctl/Storage.h"

namespace HostLinux {

using HostCtl::Storage::FileSystem;
using HostCtl::Storage::HlFileSystem;
using HostCtl::Storage::NetworkFileSystem;
using HostCtl::Storage::NfsVersion;

// Opens the Linux session: closes any simulated one and sets the feature switches
// (103 on; 102, 104 and 270 off). Nothing on the machine is touched.
void OpenSession();
void CloseSession();
bool Active();

// Throws HostCtlException("<call> is not available on a Linux host").
[[noreturn]] void NotAvailable(const std::string& call);

// StorageInfoImpl's operations.
namespace Storage {
using NfsFilter = bool (*)(NetworkFileSystem&);

std::vector<std::unique_ptr<FileSystem>> GetFileSystems();
std::unique_ptr<FileSystem> GetFileSystemByUuid(const std::string& call, const std::string& uuid);
std::unique_ptr<FileSystem> GetFileSystemByLabel(const std::string& label);
std::unique_ptr<FileSystem> GetFileSystemByPath(const std::string& path);

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
                                                           NetworkFileSystem::SecurityType security, bool knxnicBound);
// `version` 0: either version.
void RemoveNetworkFileSystem(const std::string& volumeName, int version);
std::vector<std::unique_ptr<NetworkFileSystem>> GetNetworkFileSystems(bool v41, NfsFilter filter);
void PreUnmount(const std::string& call, const std::string& volumeName);

void AddNasFirewallConfig(const std::string& ipMask, NfsVersion version);
void RemoveNasFirewallConfig(const std::string& ipMask, NfsVersion version);
std::vector<std::string> GetNasFirewallConfigs(NfsVersion version);
} // namespace Storage

// HlFileSystemImpl's: there is no HLFS on Linux.
void OpenHlfs(const std::string& path); // always throws "Cannot open HLFS volume at '<path>'"

// The host object (storage information, hardware, advanced options).
HostCtl::Host* GetHost();

} // namespace HostLinux
