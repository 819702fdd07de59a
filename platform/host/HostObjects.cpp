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

template <typename F>
auto OnUnresolved(const Handle& handle, std::string_view call, const J* args, F&& body)
{
    return OnRecord<UnresolvedVolume>(handle, call, args, std::forward<F>(body));
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

namespace {

// The record behind a handle, found by `find`; `what` names the volume in the message when
// it has gone.
template <typename Record>
Record& ResolveRecord(const Handle& handle, Record* (*find)(std::uint64_t, std::size_t&), const char* what)
{
    Runtime::CheckedState();
    Record* record = find(handle.id, handle.position);
    if (!record)
        Runtime::Throw(what + (" '" + handle.name + "' no longer exists"));
    return *record;
}

} // namespace

FileSystemRecord& Resolve(const Handle& handle) { return ResolveRecord(handle, Runtime::FindFileSystemById, "Volume"); }

UnresolvedVolume& ResolveUnresolved(const Handle& handle)
{
    return ResolveRecord(handle, Runtime::FindUnresolvedById, "Snapshot");
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
        Change(r, r.mounted, true, FsKey::mounted);
        if (r.explicitlyUnmounted)
            Change(r, r.explicitlyUnmounted, false, FsKey::explicitlyUnmounted);
    });
}

int Unmount(const Handle& h, FileSystem::MountOperationOption option)
{
    const J args = J::array({static_cast<int>(option)});
    return OnFileSystem(h, "FileSystem.Unmount", &args, [&](FileSystemRecord& r) {
        if (r.busy)
            return 1;
        Change(r, r.mounted, false, FsKey::mounted);
        Change(r, r.explicitlyUnmounted, option == FileSystem::MOUNT_PERSISTENT, FsKey::explicitlyUnmounted);
        return 0;
    });
}

bool IsMounted(const Handle& h) { return ReadField<&FileSystemRecord::mounted>(h, "FileSystem.IsMounted"); }

std::uint64_t GetCapacity(const Handle& h)
{
    return ReadField<&FileSystemRecord::capacity>(h, "FileSystem.GetCapacity");
}

std::uint64_t GetUsedSpace(const Handle& h) { return ReadField<&FileSystemRecord::used>(h, "FileSystem.GetUsedSpace"); }

std::string GetType(const Handle& h) { return ReadField<&FileSystemRecord::type>(h, "FileSystem.GetType"); }

std::string GetMountPoint(const Handle& h)
{
    return ReadField<&FileSystemRecord::mountPoint>(h, "FileSystem.GetMountPoint");
}

std::string GetVolumeName(const Handle& h)
{
    return ReadField<&FileSystemRecord::volumeName>(h, "FileSystem.GetVolumeName");
}

std::string GetUuid(const Handle& h) { return ReadField<&FileSystemRecord::uuid>(h, "FileSystem.GetUuid"); }

std::string GetName(const Handle& h) { return ReadField<&FileSystemRecord::name>(h, "FileSystem.GetName"); }

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
        Change(r, r.mounted, true, FsKey::mounted);
        if (r.explicitlyUnmounted)
            Change(r, r.explicitlyUnmounted, false, FsKey::explicitlyUnmounted);
        Change(r, r.capacity, found->capacity, FsKey::capacity);
        Change(r, r.used, found->used, FsKey::used);
    });
}

bool NetworkFileSystemObject::IsAccessible()
{
    return ReadField<&FileSystemRecord::accessible>(handle(), "NetworkFileSystem.IsAccessible");
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
    return ReadField<&Model::NfsFields::remoteShare>(handle(), "NetworkFileSystem.GetRemoteShare");
}

bool NetworkFileSystemObject::IsReadOnly()
{
    return ReadField<&Model::NfsFields::readOnly>(handle(), "NetworkFileSystem.IsReadOnly");
}

bool NetworkFileSystemObject::GetReadOnlyState()
{
    return ReadField<&Model::NfsFields::readOnlyState>(handle(), "NetworkFileSystem.GetReadOnlyState");
}

void NetworkFileSystemObject::SetReadOnly(bool readOnly)
{
    const J args = J::array({readOnly});
    OnFileSystem(handle(), "NetworkFileSystem.SetReadOnly", &args, [&](FileSystemRecord& r) {
        auto& nfs = r.MutableNfs();
        Change(r, nfs.readOnly, readOnly, FsKey::readOnly);
        Change(r, nfs.readOnlyState, readOnly, FsKey::readOnlyState);
    });
}

bool NetworkFileSystemObject::IsPE() { return ReadField<&Model::NfsFields::isPE>(handle(), "NetworkFileSystem.IsPE"); }

void NetworkFileSystemObject::SetPE(bool isPE)
{
    WriteField<&Model::NfsFields::isPE>(handle(), "NetworkFileSystem.SetPE", FsKey::isPE, isPE);
}

std::string NetworkFileSystemObject::GetKnxnic()
{
    return ReadField<&Model::NfsFields::knxnic>(handle(), "NetworkFileSystem.GetKnxnic");
}

std::string NetworkFileSystemObject::GetKnxnics()
{
    return ReadField<&Model::NfsFields::knxnics>(handle(), "NetworkFileSystem.GetKnxnics");
}

void NetworkFileSystemObject::SetKnxnics(const std::string& knxnics)
{
    WriteField<&Model::NfsFields::knxnics>(handle(), "NetworkFileSystem.SetKnxnics", FsKey::knxnics, knxnics);
}

std::int64_t NetworkFileSystemObject::GetConnections()
{
    return ReadField<&Model::NfsFields::connections>(handle(), "NetworkFileSystem.GetConnections");
}

std::int32_t NetworkFileSystemObject::GetConnectionsParam()
{
    return ReadField<&Model::NfsFields::connectionsParam>(handle(), "NetworkFileSystem.GetConnectionsParam");
}

void NetworkFileSystemObject::SetConnectionsParam(std::int32_t connections)
{
    WriteField<&Model::NfsFields::connectionsParam>(handle(), "NetworkFileSystem.SetConnectionsParam",
                                                    FsKey::connectionsParam, connections);
}

std::uint32_t NetworkFileSystemObject::GetMaxReadTransferSize()
{
    return ReadField<&Model::NfsFields::maxReadTransferSize>(handle(), "NetworkFileSystem.GetMaxReadTransferSize");
}

std::uint32_t NetworkFileSystemObject::GetMaxWriteTransferSize()
{
    return ReadField<&Model::NfsFields::maxWriteTransferSize>(handle(), "NetworkFileSystem.GetMaxWriteTransferSize");
}

std::uint32_t NetworkFileSystemObject::GetMaxQueueDepth()
{
    return ReadField<&Model::NfsFields::maxQueueDepth>(handle(), "NetworkFileSystem.GetMaxQueueDepth");
}

void NetworkFileSystemObject::SetMaxQueueDepth(std::uint32_t depth, bool apply)
{
    const J args = J::array({depth, apply});
    OnFileSystem(handle(), "NetworkFileSystem.SetMaxQueueDepth", &args,
                 [&](FileSystemRecord& r) { Change(r, r.MutableNfs().maxQueueDepth, depth, FsKey::maxQueueDepth); });
}

NetworkFileSystem::SecurityType NetworkFileSystemObject::GetSecurityType()
{
    return OnFileSystem(handle(), "NetworkFileSystem.GetSecurityType", nullptr,
                        [](FileSystemRecord& r) { return static_cast<SecurityType>(r.Nfs().securityType); });
}

bool NetworkFileSystemObject::IsHidden()
{
    return ReadField<&Model::NfsFields::hidden>(handle(), "NetworkFileSystem.IsHidden");
}

// ---- extents ------------------------------------------------------------------------------

namespace {

// The extent record behind an extent object's handle; throws when it has gone.
const Model::Extent& ResolveExtent(const Handle& handle, ExtentSource source)
{
    if (source == ExtentSource::Unresolved)
        return ResolveUnresolvedExtent(handle);
    const FileSystemRecord& volume = Resolve(handle);
    const auto& extents = volume.Hlfs().extents;
    if (handle.extent < 0 || static_cast<std::size_t>(handle.extent) >= extents.size())
        Runtime::Throw("Extent of volume '" + handle.name + "' no longer exists");
    return extents[static_cast<std::size_t>(handle.extent)];
}

template <typename F>
auto OnExtent(const Handle& handle, ExtentSource source, std::string_view call, F&& body)
{
    return Runtime::Run(call, nullptr, [&] {
        const Model::Extent& extent = ResolveExtent(handle, source);
        Runtime::CheckFault(call, {extent.deviceName});
        return body(extent);
    });
}

} // namespace

std::string ExtentDeviceName(const Handle& handle, ExtentSource source)
{
    return OnExtent(handle, source, "DiskLunPartition.GetDeviceName",
                    [](const Model::Extent& e) { return e.deviceName; });
}

std::uint8_t ExtentPartition(const Handle& handle, ExtentSource source)
{
    return OnExtent(handle, source, "DiskLunPartition.GetPartition",
                    [](const Model::Extent& e) { return e.partition; });
}

ForeignUnresolvedVolume::~ForeignUnresolvedVolume() = default;

} // namespace HostSim::Objects

// ---- the host's implementation classes ------------------------------------------------------

namespace KnxCtl::Storage {

namespace Ops = HostSim::Objects::FsOps;
namespace Runtime = HostSim::Runtime;
using namespace HostSim::Model;
using HostSim::Objects::Change;
using HostSim::Objects::OnFileSystem;
using HostSim::Objects::ReadField;
using HostSim::Objects::WriteField;
namespace Model = HostSim::Model;
using J = nlohmann::ordered_json;

namespace {

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

namespace {

// The first volume `find` finds by `key` when it is an HLFS volume, as a new object, or none.
std::unique_ptr<HlFileSystem> FindHlfs(std::string_view call, const std::string& key,
                                       const FileSystemRecord* (*find)(std::string_view))
{
    return Runtime::Run(call, nullptr, [&]() -> std::unique_ptr<HlFileSystem> {
        Runtime::CheckedState();
        Runtime::CheckFault(call, {key});
        const FileSystemRecord* r = find(key);
        return r && r->kind == FsKind::Hlfs ? HostSim::Objects::MakeHlfs(*r) : nullptr;
    });
}

} // namespace

HlFileSystemImpl::HlFileSystemImpl(std::shared_ptr<HostObjectHandle> handle) : handle_(std::move(handle)) {}
HlFileSystemImpl::~HlFileSystemImpl() = default;

std::unique_ptr<HlFileSystem> HlFileSystemImpl::GetHLFSFileSystemByLabel(const std::string& label)
{
    if (HostLinux::Active())
        return nullptr;
    return FindHlfs("HlFileSystemImpl.GetHLFSFileSystemByLabel", label, Runtime::FirstByVolumeName);
}

std::unique_ptr<HlFileSystem> HlFileSystemImpl::GetHLFSFileSystemByUUID(const std::string& uuid)
{
    if (HostLinux::Active())
        return nullptr;
    return FindHlfs("HlFileSystemImpl.GetHLFSFileSystemByUUID", uuid, Runtime::FirstByUuid);
}

void HlFileSystemImpl::ConvertToVersion5()
{
    const J args = J::array();
    OnFileSystem(*handle_, "HlFileSystemImpl.ConvertToVersion5", &args, [](FileSystemRecord& r) {
        if (r.Hlfs().majorVersion != 3)
            Runtime::Throw("Volume '" + r.volumeName + "' is not an HLFS-3 volume");
        Change(r, r.MutableHlfs().majorVersion, 5, FsKey::majorVersion);
    });
}

void HlFileSystemImpl::UnmapVolume(unsigned reclaimUnit, void* context)
{
    const J args = J::array({reclaimUnit, context ? J("context") : J(nullptr)});
    OnFileSystem(*handle_, "HlFileSystemImpl.UnmapVolume", &args, [](FileSystemRecord&) {});
}

bool HlFileSystemImpl::IsAccessible()
{
    return ReadField<&FileSystemRecord::accessible>(*handle_, "HlFileSystemImpl.IsAccessible");
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
    return ReadField<&Model::HlfsFields::lvmUuid>(*handle_, "HlFileSystem.GetLvmUuid");
}

unsigned HlFileSystemImpl::GetLockMode()
{
    return OnFileSystem(*handle_, "HlFileSystem.GetLockMode", nullptr,
                        [](FileSystemRecord& r) { return static_cast<unsigned>(r.Hlfs().lockMode); });
}

void HlFileSystemImpl::SetLockMode(unsigned mode)
{
    WriteField<&Model::HlfsFields::lockMode>(*handle_, "HlFileSystem.SetLockMode", FsKey::lockMode, mode);
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
    return ReadField<&Model::HlfsFields::clusteredHdskEnabled>(*handle_, "HlFileSystem.IsClusteredHdskEnabled");
}

void HlFileSystemImpl::SetClusteredHdskEnabled(bool enabled)
{
    WriteField<&Model::HlfsFields::clusteredHdskEnabled>(*handle_, "HlFileSystem.SetClusteredHdskEnabled",
                                                         FsKey::clusteredHdskEnabled, enabled);
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
    return HostSim::Objects::ExtentDeviceName(*handle_, HostSim::Objects::ExtentSource::Unresolved);
}

std::uint8_t UnresolvedHlfsExtentImpl::GetPartition()
{
    return HostSim::Objects::ExtentPartition(*handle_, HostSim::Objects::ExtentSource::Unresolved);
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
    return HostSim::Objects::ReadField<&UnresolvedVolume::lvmUuid>(*handle_, "UnresolvedHlfsVolumeImpl.GetLvmUuid");
}

std::string UnresolvedHlfsVolumeImpl::GetUuid()
{
    return HostSim::Objects::ReadField<&UnresolvedVolume::uuid>(*handle_, "UnresolvedHlfsVolumeImpl.GetUuid");
}

std::string UnresolvedHlfsVolumeImpl::GetVolumeName()
{
    return HostSim::Objects::ReadField<&UnresolvedVolume::volumeName>(*handle_,
                                                                      "UnresolvedHlfsVolumeImpl.GetVolumeName");
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
