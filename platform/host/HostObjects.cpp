#include "HostObjects.h"
#include "linux/LinuxHost.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <functional>

namespace HostSim::Objects {

using Model::FsKey;
using Model::FsKind;
using J = nlohmann::ordered_json;
using KnxCtl::Storage::HlFileSystemImpl;
using KnxCtl::Storage::UnresolvedHlfsExtentImpl;
using KnxCtl::Storage::UnresolvedHlfsVolumeImpl;

namespace {

// Changes one key of a file system; only a real change marks the state for saving.
template <typename T, typename V>
void Set(FileSystemRecord& record, T& field, const V& value, FsKey key)
{
    if (field == value)
        return;
    Runtime::MarkDirty();
    field = value;
    record.Mark(key);
}

template <typename F>
auto OnUnresolved(const Handle& handle, std::string_view call, const J* args, F&& body)
{
    Runtime::JournalEntry entry{handle.name, args ? *args : J()};
    return Runtime::Run(call, args ? &entry : nullptr, [&] {
        UnresolvedVolume& record = ResolveUnresolved(handle);
        Runtime::CheckFault(call, {record.volumeName, record.uuid});
        return body(record);
    });
}

template <typename F>
auto OnUnresolvedExtent(const Handle& handle, std::string_view call, F&& body)
{
    return Runtime::Run(call, nullptr, [&] {
        const Model::UnresolvedExtent& extent = ResolveUnresolvedExtent(handle);
        Runtime::CheckFault(call, {extent.deviceName});
        return body(extent);
    });
}

HandlePtr ExtentHandle(const Handle& volume, int index)
{
    auto handle = std::make_shared<Handle>(volume);
    handle->extent = index;
    return handle;
}

// Appends a file system made from an unresolved copy and removes the copy.
FileSystemRecord& AdoptCopy(UnresolvedVolume& copy, const std::string& uuid, const std::string& name)
{
    Model::State& st = Runtime::CheckedState();
    FileSystemRecord fs;
    fs.id = st.nextFileSystemId++;
    fs.kind = FsKind::Hlfs;
    fs.type = HlFileSystem::HLFS_TYPE;
    fs.volumeName = name;
    fs.uuid = uuid;
    for (FsKey key : {FsKey::type, FsKey::volumeName, FsKey::uuid, FsKey::capacity, FsKey::majorVersion, FsKey::extents,
                      FsKey::mounted})
        fs.Mark(key);
    auto& hlfs = fs.MutableHlfs();
    hlfs.lvmUuid = copy.lvmUuid;
    if (!copy.lvmUuid.empty())
        fs.Mark(FsKey::lvmUuid);
    hlfs.majorVersion = copy.majorVersion;
    fs.capacity = copy.capacity;
    for (const auto& e : copy.extents)
        if (!e.null)
            hlfs.extents.push_back({e.deviceName, e.partition});
    Model::ResolveDefaults(fs);

    const std::uint64_t copyId = copy.id;
    auto& copies = st.unresolvedVolumes;
    copies.erase(std::find_if(copies.begin(), copies.end(), [&](const auto& u) { return u.id == copyId; }));
    st.fileSystems.push_back(std::move(fs));
    st.Mark(Model::TopKey::fileSystems);
    st.Mark(Model::TopKey::unresolvedVolumes);
    Runtime::InvalidateIndexes();
    Runtime::MarkDirty();
    return st.fileSystems.back();
}

} // namespace

namespace {
// The record's place in `list` when it is one of its elements (a hint for later look-ups).
template <typename Record>
std::size_t PlaceIn(const std::vector<Record>& list, const Record& record)
{
    std::less<const Record*> before;
    if (list.empty() || before(&record, list.data()) || !before(&record, list.data() + list.size()))
        return static_cast<std::size_t>(-1);
    return static_cast<std::size_t>(&record - list.data());
}
} // namespace

HandlePtr MakeHandle(const FileSystemRecord& record)
{
    auto handle = std::make_shared<Handle>(Handle{Handle::Kind::FileSystem, record.id, -1, record.volumeName});
    handle->position = PlaceIn(Runtime::CheckedState().fileSystems, record);
    return handle;
}

HandlePtr MakeHandle(const UnresolvedVolume& record)
{
    auto handle = std::make_shared<Handle>(Handle{Handle::Kind::Unresolved, record.id, -1, record.volumeName});
    handle->position = PlaceIn(Runtime::CheckedState().unresolvedVolumes, record);
    return handle;
}

std::unique_ptr<FileSystem> MakeFileSystem(const FileSystemRecord& record)
{
    switch (record.kind) {
    case FsKind::Hlfs:
        return std::make_unique<HlFileSystemImpl>(MakeHandle(record));
    case FsKind::Nfs:
    case FsKind::Nfs41:
        return std::make_unique<NetworkFileSystemObject>(MakeHandle(record));
    case FsKind::Plain:
        break;
    }
    return std::make_unique<PlainFileSystem>(MakeHandle(record));
}

std::unique_ptr<HlFileSystem> MakeHlfs(const FileSystemRecord& record)
{
    return std::make_unique<HlFileSystemImpl>(MakeHandle(record));
}

std::unique_ptr<NetworkFileSystem> MakeNfs(const FileSystemRecord& record)
{
    return std::make_unique<NetworkFileSystemObject>(MakeHandle(record));
}

std::unique_ptr<HostCtl::Storage::UnresolvedHlfsVolume> MakeUnresolved(const UnresolvedVolume& record)
{
    if (record.null)
        return nullptr;
    if (!record.impl)
        return std::make_unique<ForeignUnresolvedVolume>();
    return std::make_unique<UnresolvedHlfsVolumeImpl>(MakeHandle(record));
}

FileSystemRecord& Resolve(const Handle& handle)
{
    Runtime::CheckedState();
    FileSystemRecord* record = Runtime::FindFileSystemById(handle.id, handle.position);
    if (!record)
        Runtime::Throw("Volume '" + handle.name + "' no longer exists");
    return *record;
}

UnresolvedVolume& ResolveUnresolved(const Handle& handle)
{
    Runtime::CheckedState();
    UnresolvedVolume* record = Runtime::FindUnresolvedById(handle.id, handle.position);
    if (!record)
        Runtime::Throw("Snapshot '" + handle.name + "' no longer exists");
    return *record;
}

const Model::UnresolvedExtent& ResolveUnresolvedExtent(const Handle& handle)
{
    const UnresolvedVolume& volume = ResolveUnresolved(handle);
    if (handle.extent < 0 || static_cast<std::size_t>(handle.extent) >= volume.extents.size())
        Runtime::Throw("Extent of snapshot '" + handle.name + "' no longer exists");
    return volume.extents[static_cast<std::size_t>(handle.extent)];
}

// ---- FileSystem ---------------------------------------------------------------------------

namespace FsOps {

void Mount(const Handle& h, FileSystem::MountOperationOption option)
{
    const J args = J::array({static_cast<int>(option)});
    OnFileSystem(h, "FileSystem.Mount", &args, [&](FileSystemRecord& r) {
        Set(r, r.mounted, true, FsKey::mounted);
        if (r.explicitlyUnmounted)
            Set(r, r.explicitlyUnmounted, false, FsKey::explicitlyUnmounted);
    });
}

int Unmount(const Handle& h, FileSystem::MountOperationOption option)
{
    const J args = J::array({static_cast<int>(option)});
    return OnFileSystem(h, "FileSystem.Unmount", &args, [&](FileSystemRecord& r) {
        if (r.busy)
            return 1;
        Set(r, r.mounted, false, FsKey::mounted);
        Set(r, r.explicitlyUnmounted, option == FileSystem::MOUNT_PERSISTENT, FsKey::explicitlyUnmounted);
        return 0;
    });
}

bool IsMounted(const Handle& h)
{
    return OnFileSystem(h, "FileSystem.IsMounted", nullptr, [](FileSystemRecord& r) { return r.mounted; });
}

std::uint64_t GetCapacity(const Handle& h)
{
    return OnFileSystem(h, "FileSystem.GetCapacity", nullptr, [](FileSystemRecord& r) { return r.capacity; });
}

std::uint64_t GetUsedSpace(const Handle& h)
{
    return OnFileSystem(h, "FileSystem.GetUsedSpace", nullptr, [](FileSystemRecord& r) { return r.used; });
}

std::string GetType(const Handle& h)
{
    return OnFileSystem(h, "FileSystem.GetType", nullptr, [](FileSystemRecord& r) { return r.type; });
}

std::string GetMountPoint(const Handle& h)
{
    return OnFileSystem(h, "FileSystem.GetMountPoint", nullptr, [](FileSystemRecord& r) { return r.mountPoint; });
}

std::string GetVolumeName(const Handle& h)
{
    return OnFileSystem(h, "FileSystem.GetVolumeName", nullptr, [](FileSystemRecord& r) { return r.volumeName; });
}

std::string GetUuid(const Handle& h)
{
    return OnFileSystem(h, "FileSystem.GetUuid", nullptr, [](FileSystemRecord& r) { return r.uuid; });
}

std::string GetName(const Handle& h)
{
    return OnFileSystem(h, "FileSystem.GetName", nullptr, [](FileSystemRecord& r) { return r.name; });
}

void PrepareUnmount(const Handle& h)
{
    const J args = J::array();
    OnFileSystem(h, "FileSystem.PrepareUnmount", &args, [](FileSystemRecord&) {});
}

HostCtl::Storage::QAXIState GetQAXIState(const Handle& h)
{
    return OnFileSystem(h, "FileSystem.GetQAXIState", nullptr,
                        [](FileSystemRecord& r) { return static_cast<HostCtl::Storage::QAXIState>(r.qaxiState); });
}

} // namespace FsOps

PlainFileSystem::~PlainFileSystem() = default;

// ---- NetworkFileSystem --------------------------------------------------------------------

NetworkFileSystemObject::~NetworkFileSystemObject() = default;

void NetworkFileSystemObject::Mount(unsigned flags)
{
    const J args = J::array({flags});
    OnFileSystem(handle(), "NetworkFileSystem.Mount", &args, [&](FileSystemRecord& r) {
        const auto& nfs = r.Nfs();
        std::vector<std::string> hosts =
            r.kind == FsKind::Nfs41 ? nfs.remoteHosts : std::vector<std::string>{nfs.remoteHost};
        const auto& exports = Runtime::CheckedState().nfsExports;
        auto found = std::find_if(exports.begin(), exports.end(), [&](const Model::NfsExport& e) {
            return e.share == nfs.remoteShare && std::find(hosts.begin(), hosts.end(), e.host) != hosts.end();
        });
        if (found == exports.end())
            Runtime::Throw("Unable to connect to NFS server " + (hosts.empty() ? std::string() : hosts.front()) + ":" +
                           nfs.remoteShare);
        Set(r, r.mounted, true, FsKey::mounted);
        if (r.explicitlyUnmounted)
            Set(r, r.explicitlyUnmounted, false, FsKey::explicitlyUnmounted);
        Set(r, r.capacity, found->capacity, FsKey::capacity);
        Set(r, r.used, found->used, FsKey::used);
    });
}

bool NetworkFileSystemObject::IsAccessible()
{
    return OnFileSystem(handle(), "NetworkFileSystem.IsAccessible", nullptr,
                        [](FileSystemRecord& r) { return r.accessible; });
}

std::string NetworkFileSystemObject::GetRemoteHost()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetRemoteHost", nullptr, [](FileSystemRecord& r) {
        const auto& nfs = r.Nfs();
        if (r.kind == FsKind::Nfs41)
            return nfs.remoteHosts.empty() ? std::string() : nfs.remoteHosts.front();
        return nfs.remoteHost;
    });
}

std::vector<std::string> NetworkFileSystemObject::GetRemoteHosts()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetRemoteHosts", nullptr, [](FileSystemRecord& r) {
        const auto& nfs = r.Nfs();
        return r.kind == FsKind::Nfs41 ? nfs.remoteHosts : std::vector<std::string>{nfs.remoteHost};
    });
}

std::string NetworkFileSystemObject::GetRemoteShare()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetRemoteShare", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().remoteShare; });
}

bool NetworkFileSystemObject::IsReadOnly()
{
    return OnFileSystem(handle(), "NetworkFileSystem.IsReadOnly", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().readOnly; });
}

bool NetworkFileSystemObject::GetReadOnlyState()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetReadOnlyState", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().readOnlyState; });
}

void NetworkFileSystemObject::SetReadOnly(bool readOnly)
{
    const J args = J::array({readOnly});
    OnFileSystem(handle(), "NetworkFileSystem.SetReadOnly", &args, [&](FileSystemRecord& r) {
        auto& nfs = r.MutableNfs();
        Set(r, nfs.readOnly, readOnly, FsKey::readOnly);
        Set(r, nfs.readOnlyState, readOnly, FsKey::readOnlyState);
    });
}

bool NetworkFileSystemObject::IsPE()
{
    return OnFileSystem(handle(), "NetworkFileSystem.IsPE", nullptr, [](FileSystemRecord& r) { return r.Nfs().isPE; });
}

void NetworkFileSystemObject::SetPE(bool isPE)
{
    const J args = J::array({isPE});
    OnFileSystem(handle(), "NetworkFileSystem.SetPE", &args,
                 [&](FileSystemRecord& r) { Set(r, r.MutableNfs().isPE, isPE, FsKey::isPE); });
}

std::string NetworkFileSystemObject::GetKnxnic()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetKnxnic", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().knxnic; });
}

std::string NetworkFileSystemObject::GetKnxnics()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetKnxnics", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().knxnics; });
}

void NetworkFileSystemObject::SetKnxnics(const std::string& knxnics)
{
    const J args = J::array({knxnics});
    OnFileSystem(handle(), "NetworkFileSystem.SetKnxnics", &args,
                 [&](FileSystemRecord& r) { Set(r, r.MutableNfs().knxnics, knxnics, FsKey::knxnics); });
}

std::int64_t NetworkFileSystemObject::GetConnections()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetConnections", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().connections; });
}

std::int32_t NetworkFileSystemObject::GetConnectionsParam()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetConnectionsParam", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().connectionsParam; });
}

void NetworkFileSystemObject::SetConnectionsParam(std::int32_t connections)
{
    const J args = J::array({connections});
    OnFileSystem(handle(), "NetworkFileSystem.SetConnectionsParam", &args, [&](FileSystemRecord& r) {
        Set(r, r.MutableNfs().connectionsParam, connections, FsKey::connectionsParam);
    });
}

std::uint32_t NetworkFileSystemObject::GetMaxReadTransferSize()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetMaxReadTransferSize", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().maxReadTransferSize; });
}

std::uint32_t NetworkFileSystemObject::GetMaxWriteTransferSize()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetMaxWriteTransferSize", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().maxWriteTransferSize; });
}

std::uint32_t NetworkFileSystemObject::GetMaxQueueDepth()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetMaxQueueDepth", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().maxQueueDepth; });
}

void NetworkFileSystemObject::SetMaxQueueDepth(std::uint32_t depth, bool apply)
{
    const J args = J::array({depth, apply});
    OnFileSystem(handle(), "NetworkFileSystem.SetMaxQueueDepth", &args,
                 [&](FileSystemRecord& r) { Set(r, r.MutableNfs().maxQueueDepth, depth, FsKey::maxQueueDepth); });
}

NetworkFileSystem::SecurityType NetworkFileSystemObject::GetSecurityType()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetSecurityType", nullptr,
                        [](FileSystemRecord& r) { return static_cast<SecurityType>(r.Nfs().securityType); });
}

bool NetworkFileSystemObject::IsHidden()
{
    return OnFileSystem(handle(), "NetworkFileSystem.IsHidden", nullptr,
                        [](FileSystemRecord& r) { return r.Nfs().hidden; });
}

// ---- extents ------------------------------------------------------------------------------

namespace {

template <typename F>
auto OnLunPartition(const Handle& handle, std::string_view call, F&& body)
{
    return Runtime::Run(call, nullptr, [&] {
        const FileSystemRecord& volume = Resolve(handle);
        const auto& extents = volume.Hlfs().extents;
        if (handle.extent < 0 || static_cast<std::size_t>(handle.extent) >= extents.size())
            Runtime::Throw("Extent of volume '" + handle.name + "' no longer exists");
        const Model::Extent& extent = extents[static_cast<std::size_t>(handle.extent)];
        Runtime::CheckFault(call, {extent.deviceName});
        return body(extent);
    });
}

} // namespace

LunPartitionObject::~LunPartitionObject() = default;

std::string LunPartitionObject::GetDeviceName()
{
    return OnLunPartition(*handle_, "DiskLunPartition.GetDeviceName",
                          [](const Model::Extent& e) { return e.deviceName; });
}

std::uint8_t LunPartitionObject::GetPartition()
{
    return OnLunPartition(*handle_, "DiskLunPartition.GetPartition",
                          [](const Model::Extent& e) { return e.partition; });
}

ForeignUnresolvedVolume::~ForeignUnresolvedVolume() = default;
ForeignUnresolvedExtent::~ForeignUnresolvedExtent() = default;

std::string ForeignUnresolvedExtent::GetDeviceName()
{
    return OnUnresolvedExtent(*handle_, "DiskLunPartition.GetDeviceName",
                              [](const Model::UnresolvedExtent& e) { return e.deviceName; });
}

std::uint8_t ForeignUnresolvedExtent::GetPartition()
{
    return OnUnresolvedExtent(*handle_, "DiskLunPartition.GetPartition",
                              [](const Model::UnresolvedExtent& e) { return e.partition; });
}

} // namespace HostSim::Objects

// ---- the host's implementation classes ------------------------------------------------------

namespace KnxCtl::Storage {

namespace Ops = HostSim::Objects::FsOps;
namespace Runtime = HostSim::Runtime;
using HostSim::Model::FileSystemRecord;
using HostSim::Model::FsKey;
using HostSim::Model::FsKind;
using HostSim::Objects::OnFileSystem;
using J = nlohmann::ordered_json;

namespace {

template <typename T, typename V>
void SetKey(FileSystemRecord& record, T& field, const V& value, FsKey key)
{
    if (field == value)
        return;
    Runtime::MarkDirty();
    field = value;
    record.Mark(key);
}

constexpr std::string_view kVolumesFolder = "/hlfs/volumes/";

const FileSystemRecord* HlfsAt(std::string_view path)
{
    if (path.substr(0, kVolumesFolder.size()) != kVolumesFolder)
        return nullptr;
    const std::string_view rest = path.substr(kVolumesFolder.size());
    for (const FileSystemRecord* r : {Runtime::FirstByUuid(rest), Runtime::FirstByVolumeName(rest)})
        if (r && r->kind == FsKind::Hlfs)
            return r;
    return nullptr;
}

} // namespace

HlFileSystemImpl::HlFileSystemImpl(const std::string& path)
{
    if (HostLinux::Active())
        HostLinux::OpenHlfs(path);
    Runtime::JournalEntry entry{"", J::array({path})};
    handle_ = Runtime::Run("HlFileSystemImpl.new", &entry, [&] {
        Runtime::CheckedState();
        const FileSystemRecord* record = HlfsAt(path);
        if (record)
            entry.target = record->volumeName;
        Runtime::CheckFault("HlFileSystemImpl.new",
                            {path, record ? std::string_view(record->volumeName) : std::string_view(),
                             record ? std::string_view(record->uuid) : std::string_view()});
        if (!record)
            Runtime::Throw("Cannot open HLFS volume at '" + path + "'");
        return HostSim::Objects::MakeHandle(*record);
    });
}

HlFileSystemImpl::HlFileSystemImpl(std::shared_ptr<HostObjectHandle> handle) : handle_(std::move(handle)) {}
HlFileSystemImpl::~HlFileSystemImpl() = default;

std::unique_ptr<HlFileSystem> HlFileSystemImpl::GetHLFSFileSystemByLabel(const std::string& label)
{
    if (HostLinux::Active())
        return nullptr;
    return Runtime::Run("HlFileSystemImpl.GetHLFSFileSystemByLabel", nullptr, [&]() -> std::unique_ptr<HlFileSystem> {
        Runtime::CheckedState();
        Runtime::CheckFault("HlFileSystemImpl.GetHLFSFileSystemByLabel", {label});
        const FileSystemRecord* r = Runtime::FirstByVolumeName(label);
        return r && r->kind == FsKind::Hlfs ? HostSim::Objects::MakeHlfs(*r) : nullptr;
    });
}

std::unique_ptr<HlFileSystem> HlFileSystemImpl::GetHLFSFileSystemByUUID(const std::string& uuid)
{
    if (HostLinux::Active())
        return nullptr;
    return Runtime::Run("HlFileSystemImpl.GetHLFSFileSystemByUUID", nullptr, [&]() -> std::unique_ptr<HlFileSystem> {
        Runtime::CheckedState();
        Runtime::CheckFault("HlFileSystemImpl.GetHLFSFileSystemByUUID", {uuid});
        const FileSystemRecord* r = Runtime::FirstByUuid(uuid);
        return r && r->kind == FsKind::Hlfs ? HostSim::Objects::MakeHlfs(*r) : nullptr;
    });
}

void HlFileSystemImpl::ConvertToVersion5()
{
    const J args = J::array();
    OnFileSystem(*handle_, "HlFileSystemImpl.ConvertToVersion5", &args, [](FileSystemRecord& r) {
        if (r.Hlfs().majorVersion != 3)
            Runtime::Throw("Volume '" + r.volumeName + "' is not an HLFS-3 volume");
        SetKey(r, r.MutableHlfs().majorVersion, 5, FsKey::majorVersion);
    });
}

void HlFileSystemImpl::UnmapVolume(unsigned reclaimUnit, void* context)
{
    const J args = J::array({reclaimUnit, context ? J("context") : J(nullptr)});
    OnFileSystem(*handle_, "HlFileSystemImpl.UnmapVolume", &args, [](FileSystemRecord&) {});
}

bool HlFileSystemImpl::IsAccessible()
{
    return OnFileSystem(*handle_, "HlFileSystemImpl.IsAccessible", nullptr,
                        [](FileSystemRecord& r) { return r.accessible; });
}

void HlFileSystemImpl::Mount(MountOperationOption option) { Ops::Mount(*handle_, option); }
int HlFileSystemImpl::Unmount(MountOperationOption option) { return Ops::Unmount(*handle_, option); }
bool HlFileSystemImpl::IsMounted() { return Ops::IsMounted(*handle_); }
std::uint64_t HlFileSystemImpl::GetCapacity() { return Ops::GetCapacity(*handle_); }
std::uint64_t HlFileSystemImpl::GetUsedSpace() { return Ops::GetUsedSpace(*handle_); }
std::string HlFileSystemImpl::GetType() { return Ops::GetType(*handle_); }
std::string HlFileSystemImpl::GetMountPoint() { return Ops::GetMountPoint(*handle_); }
std::string HlFileSystemImpl::GetVolumeName() { return Ops::GetVolumeName(*handle_); }
std::string HlFileSystemImpl::GetUuid() { return Ops::GetUuid(*handle_); }
std::string HlFileSystemImpl::GetName() { return Ops::GetName(*handle_); }
void HlFileSystemImpl::PrepareUnmount() { Ops::PrepareUnmount(*handle_); }
HostCtl::Storage::QAXIState HlFileSystemImpl::GetQAXIState() { return Ops::GetQAXIState(*handle_); }

int HlFileSystemImpl::GetMajorVersion()
{
    return OnFileSystem(*handle_, "HlFileSystem.GetMajorVersion", nullptr,
                        [](FileSystemRecord& r) { return static_cast<int>(r.Hlfs().majorVersion); });
}

std::vector<std::unique_ptr<HostCtl::Storage::DiskLunPartition>> HlFileSystemImpl::GetExtents()
{
    return OnFileSystem(*handle_, "HlFileSystem.GetExtents", nullptr, [&](FileSystemRecord& r) {
        std::vector<std::unique_ptr<HostCtl::Storage::DiskLunPartition>> result;
        const int count = static_cast<int>(r.Hlfs().extents.size());
        for (int i = 0; i < count; ++i) {
            if (r.Hlfs().extents[static_cast<std::size_t>(i)].null) {
                result.push_back(nullptr);
                continue;
            }
            auto extentHandle = std::make_shared<HostObjectHandle>(*handle_);
            extentHandle->extent = i;
            result.push_back(std::make_unique<HostSim::Objects::LunPartitionObject>(std::move(extentHandle)));
        }
        return result;
    });
}

std::string HlFileSystemImpl::GetLvmUuid()
{
    return OnFileSystem(*handle_, "HlFileSystem.GetLvmUuid", nullptr,
                        [](FileSystemRecord& r) { return r.Hlfs().lvmUuid; });
}

unsigned HlFileSystemImpl::GetLockMode()
{
    return OnFileSystem(*handle_, "HlFileSystem.GetLockMode", nullptr,
                        [](FileSystemRecord& r) { return static_cast<unsigned>(r.Hlfs().lockMode); });
}

void HlFileSystemImpl::SetLockMode(unsigned mode)
{
    const J args = J::array({mode});
    OnFileSystem(*handle_, "HlFileSystem.SetLockMode", &args,
                 [&](FileSystemRecord& r) { SetKey(r, r.MutableHlfs().lockMode, mode, FsKey::lockMode); });
}

int HlFileSystemImpl::GetATSSupport()
{
    return OnFileSystem(*handle_, "HlFileSystem.GetATSSupport", nullptr,
                        [](FileSystemRecord& r) { return static_cast<int>(r.Hlfs().atsSupport); });
}

std::vector<HostCtl::Storage::HlfsUserInfo> HlFileSystemImpl::GetUsers(bool quickLiveness)
{
    const J args = J::array({quickLiveness});
    return OnFileSystem(*handle_, "HlFileSystem.GetUsers", &args, [&](FileSystemRecord& r) {
        std::vector<HostCtl::Storage::HlfsUserInfo> result;
        for (const auto& u : r.Hlfs().users) {
            if (quickLiveness && !u.live)
                continue;
            std::array<std::uint8_t, 6> bytes{};
            unsigned parts[6] = {};
            std::sscanf(u.macAddress.c_str(), "%2x:%2x:%2x:%2x:%2x:%2x", &parts[0], &parts[1], &parts[2], &parts[3],
                        &parts[4], &parts[5]);
            for (int i = 0; i < 6; ++i)
                bytes[static_cast<std::size_t>(i)] = static_cast<std::uint8_t>(parts[i]);
            HostCtl::Storage::HlfsUserInfo info;
            info.heartbeatUuid = u.heartbeatUuid;
            info.macAddress = HostCtl::Network::MacAddress(bytes);
            info.driverVersionMajor = u.driverVersionMajor;
            info.driverVersionMinor = u.driverVersionMinor;
            info.heartbeatOffset = u.heartbeatOffset;
            info.lockModeInUse = u.lockModeInUse;
            result.push_back(std::move(info));
        }
        return result;
    });
}

HostCtl::Storage::HlfsVolumeUnmapProperty HlFileSystemImpl::GetUnmapProperty()
{
    return OnFileSystem(*handle_, "HlFileSystem.GetUnmapProperty", nullptr, [](FileSystemRecord& r) {
        const auto& p = r.Hlfs().unmapProperty;
        HostCtl::Storage::HlfsVolumeUnmapProperty out;
        out.granularity = p.granularity;
        out.priority = p.priority;
        out.bandwidth = p.bandwidth;
        out.reserved = p.reserved;
        out.method = p.method;
        return out;
    });
}

void HlFileSystemImpl::SetUnmapProperty(const HostCtl::Storage::HlfsVolumeUnmapProperty& property)
{
    const J args =
        J::array({property.granularity, property.priority, property.bandwidth, property.reserved, property.method});
    OnFileSystem(*handle_, "HlFileSystem.SetUnmapProperty", &args, [&](FileSystemRecord& r) {
        HostSim::Model::UnmapProperty next{property.granularity, property.priority, property.bandwidth,
                                           property.reserved, property.method};
        auto& current = r.MutableHlfs().unmapProperty;
        const bool same = current.granularity == next.granularity && current.priority == next.priority &&
                          current.bandwidth == next.bandwidth && current.reserved == next.reserved &&
                          current.method == next.method;
        if (!same)
            Runtime::MarkDirty();
        current = std::move(next);
        r.Mark(FsKey::unmapProperty);
    });
}

bool HlFileSystemImpl::IsClusteredHdskEnabled()
{
    return OnFileSystem(*handle_, "HlFileSystem.IsClusteredHdskEnabled", nullptr,
                        [](FileSystemRecord& r) { return r.Hlfs().clusteredHdskEnabled; });
}

void HlFileSystemImpl::SetClusteredHdskEnabled(bool enabled)
{
    const J args = J::array({enabled});
    OnFileSystem(*handle_, "HlFileSystem.SetClusteredHdskEnabled", &args, [&](FileSystemRecord& r) {
        SetKey(r, r.MutableHlfs().clusteredHdskEnabled, enabled, FsKey::clusteredHdskEnabled);
    });
}

// ---- unresolved copies --------------------------------------------------------------------

using HostSim::Model::UnresolvedVolume;

UnresolvedHlfsExtentImpl::UnresolvedHlfsExtentImpl(std::shared_ptr<HostObjectHandle> handle)
    : handle_(std::move(handle))
{
}
UnresolvedHlfsExtentImpl::~UnresolvedHlfsExtentImpl() = default;

std::string UnresolvedHlfsExtentImpl::GetDeviceName()
{
    return HostSim::Objects::OnUnresolvedExtent(*handle_, "DiskLunPartition.GetDeviceName",
                                                [](const HostSim::Model::UnresolvedExtent& e) { return e.deviceName; });
}

std::uint8_t UnresolvedHlfsExtentImpl::GetPartition()
{
    return HostSim::Objects::OnUnresolvedExtent(*handle_, "DiskLunPartition.GetPartition",
                                                [](const HostSim::Model::UnresolvedExtent& e) { return e.partition; });
}

std::int64_t UnresolvedHlfsExtentImpl::GetStart()
{
    return HostSim::Objects::OnUnresolvedExtent(*handle_, "UnresolvedHlfsExtentImpl.GetStart",
                                                [](const HostSim::Model::UnresolvedExtent& e) { return e.start; });
}

std::int64_t UnresolvedHlfsExtentImpl::GetEnd()
{
    return HostSim::Objects::OnUnresolvedExtent(*handle_, "UnresolvedHlfsExtentImpl.GetEnd",
                                                [](const HostSim::Model::UnresolvedExtent& e) { return e.end; });
}

UnresolvedHlfsVolumeImpl::UnresolvedHlfsVolumeImpl(std::shared_ptr<HostObjectHandle> handle)
    : handle_(std::move(handle))
{
}
UnresolvedHlfsVolumeImpl::~UnresolvedHlfsVolumeImpl() = default;

std::string UnresolvedHlfsVolumeImpl::GetLvmUuid()
{
    return HostSim::Objects::OnUnresolved(*handle_, "UnresolvedHlfsVolumeImpl.GetLvmUuid", nullptr,
                                          [](UnresolvedVolume& u) { return u.lvmUuid; });
}

std::string UnresolvedHlfsVolumeImpl::GetUuid()
{
    return HostSim::Objects::OnUnresolved(*handle_, "UnresolvedHlfsVolumeImpl.GetUuid", nullptr,
                                          [](UnresolvedVolume& u) { return u.uuid; });
}

std::string UnresolvedHlfsVolumeImpl::GetVolumeName()
{
    return HostSim::Objects::OnUnresolved(*handle_, "UnresolvedHlfsVolumeImpl.GetVolumeName", nullptr,
                                          [](UnresolvedVolume& u) { return u.volumeName; });
}

std::vector<std::unique_ptr<HostCtl::Storage::UnresolvedHlfsExtent>> UnresolvedHlfsVolumeImpl::GetExtents()
{
    return HostSim::Objects::OnUnresolved(
        *handle_, "UnresolvedHlfsVolumeImpl.GetExtents", nullptr, [&](UnresolvedVolume& u) {
            std::vector<std::unique_ptr<HostCtl::Storage::UnresolvedHlfsExtent>> result;
            for (std::size_t i = 0; i < u.extents.size(); ++i) {
                const auto& e = u.extents[i];
                if (e.null) {
                    result.push_back(nullptr);
                    continue;
                }
                auto extentHandle = HostSim::Objects::ExtentHandle(*handle_, static_cast<int>(i));
                if (e.impl)
                    result.push_back(std::make_unique<UnresolvedHlfsExtentImpl>(std::move(extentHandle)));
                else
                    result.push_back(
                        std::make_unique<HostSim::Objects::ForeignUnresolvedExtent>(std::move(extentHandle)));
            }
            return result;
        });
}

bool UnresolvedHlfsVolumeImpl::CanResolve(bool first, bool second, unsigned* reason)
{
    const J args = J::array({first, second});
    return HostSim::Objects::OnUnresolved(*handle_, "UnresolvedHlfsVolumeImpl.CanResolve", &args,
                                          [&](UnresolvedVolume& u) {
                                              const unsigned code = second ? u.mountReason : u.resignatureReason;
                                              if (reason)
                                                  *reason = code;
                                              return code == 0;
                                          });
}

std::unique_ptr<FileSystem> UnresolvedHlfsVolumeImpl::Mount(bool first, bool persistent)
{
    const J args = J::array({first, persistent});
    return HostSim::Objects::OnUnresolved(
        *handle_, "UnresolvedHlfsVolumeImpl.Mount", &args, [&](UnresolvedVolume& u) -> std::unique_ptr<FileSystem> {
            if (u.mountReason != 0)
                Runtime::Throw("Cannot mount snapshot '" + u.volumeName + "': reason code " +
                               std::to_string(u.mountReason));
            const std::string uuid = u.uuid;
            const std::string name = u.volumeName;
            return HostSim::Objects::MakeFileSystem(HostSim::Objects::AdoptCopy(u, uuid, name));
        });
}

std::unique_ptr<FileSystem> UnresolvedHlfsVolumeImpl::Resignature()
{
    const J args = J::array();
    return HostSim::Objects::OnUnresolved(
        *handle_, "UnresolvedHlfsVolumeImpl.Resignature", &args,
        [&](UnresolvedVolume& u) -> std::unique_ptr<FileSystem> {
            if (u.resignatureReason != 0)
                Runtime::Throw("Cannot resignature snapshot '" + u.volumeName + "': reason code " +
                               std::to_string(u.resignatureReason));
            // A new signature that no file system uses yet, the same for the same state every time.
            std::string uuid;
            for (int salt = 0; uuid.empty() || Runtime::FirstByUuid(uuid); ++salt)
                uuid = HostSim::Model::UuidFromText("resignature/" + u.uuid + "/" + u.volumeName + "/" +
                                                    std::to_string(salt));
            const std::string name = "snap-" + uuid.substr(0, 8) + "-" + u.volumeName;
            return HostSim::Objects::MakeFileSystem(HostSim::Objects::AdoptCopy(u, uuid, name));
        });
}

} // namespace KnxCtl::Storage
