#pragma once

// The simulated host's objects. Each one refers to its volume in the session's state by a
// stable id and reads it afresh on every call, so objects see changes made through others.

#include <cstdint>
#include <memory>
#include <string>
#include <type_traits>
#include <utility>

#include "HostRuntime.h"
#include "hostctl/Host.h"
#include "hostctl/Storage.h"
#include "hostctl/StorageInfoImpl.h"

namespace KnxCtl::Storage {

struct HostObjectHandle {
    enum class Kind { FileSystem, Unresolved };
    Kind kind = Kind::FileSystem;
    std::uint64_t id = 0;
    int extent = -1;  // for extent objects: the extent's position in its volume
    std::string name; // the volume's name when the object was made: journal target and messages
    mutable std::size_t position = static_cast<std::size_t>(-1); // where the volume was last seen
};

} // namespace KnxCtl::Storage

namespace HostSim::Objects {

using Handle = KnxCtl::Storage::HostObjectHandle;
using HandlePtr = std::shared_ptr<Handle>;
using HostCtl::Storage::DiskLunPartition;
using HostCtl::Storage::FileSystem;
using HostCtl::Storage::HlFileSystem;
using HostCtl::Storage::NetworkFileSystem;
using Model::FileSystemRecord;
using Model::UnresolvedVolume;

HandlePtr MakeHandle(const FileSystemRecord& record);
HandlePtr MakeHandle(const UnresolvedVolume& record);

// The host object of a file system, of the class its type calls for.
std::unique_ptr<FileSystem> MakeFileSystem(const FileSystemRecord& record);
std::unique_ptr<HlFileSystem> MakeHlfs(const FileSystemRecord& record);
std::unique_ptr<NetworkFileSystem> MakeNfs(const FileSystemRecord& record);
std::unique_ptr<HostCtl::Storage::UnresolvedHlfsVolume> MakeUnresolved(const UnresolvedVolume& record);

// The record behind a handle; throws HostCtlException when the session's state is bad or
// the volume has gone.
FileSystemRecord& Resolve(const Handle& handle);
UnresolvedVolume& ResolveUnresolved(const Handle& handle);

// Runs `body(record)` as call `call` on the record behind an object's handle (a file
// system's or an unresolved volume's): state check, fault check with the volume's name and
// UUID as targets, journal (when `args` is given), persistence.
template <typename Record, typename F>
auto OnRecord(const Handle& handle, std::string_view call, const nlohmann::ordered_json* args, F&& body)
{
    Runtime::JournalEntry entry{handle.name, args ? *args : nlohmann::ordered_json()};
    return Runtime::Run(call, args ? &entry : nullptr, [&] {
        Record* record;
        if constexpr (std::is_same_v<Record, UnresolvedVolume>)
            record = &ResolveUnresolved(handle);
        else
            record = &Resolve(handle);
        Runtime::CheckFault(call, {record->volumeName, record->uuid});
        return body(*record);
    });
}

template <typename F>
auto OnFileSystem(const Handle& handle, std::string_view call, const nlohmann::ordered_json* args, F&& body)
{
    return OnRecord<FileSystemRecord>(handle, call, args, std::forward<F>(body));
}

// Reads field `Member` of the record behind an object's handle as call `call`.
template <auto Member>
auto ReadField(const Handle& h, std::string_view call)
{
    if constexpr (std::is_same_v<typename Model::MemberOf<decltype(Member)>::Part, UnresolvedVolume>)
        return OnRecord<UnresolvedVolume>(h, call, nullptr, [](UnresolvedVolume& u) { return u.*Member; });
    else
        return OnFileSystem(h, call, nullptr,
                            [](FileSystemRecord& r) { return Model::Field<Member>(std::as_const(r)); });
}

// Changes one key of a file system; only a real change marks the state for saving.
template <typename T, typename V>
void Change(FileSystemRecord& record, T& field, const V& value, Model::FsKey key)
{
    if (field == value)
        return;
    Runtime::MarkDirty();
    field = value;
    record.Mark(key);
}

// Sets field `Member` (present in the record as `key`) to `value` as call `call`, with the
// value as the call's one argument.
template <auto Member, typename V>
void WriteField(const Handle& h, std::string_view call, Model::FsKey key, const V& value)
{
    const auto args = nlohmann::ordered_json::array({value});
    OnFileSystem(h, call, &args, [&](FileSystemRecord& r) { Change(r, Model::Field<Member>(r), value, key); });
}

// The FileSystem operations, shared by every kind of file system object.
namespace FsOps {
void Mount(const Handle& h, FileSystem::MountOperationOption option);
int Unmount(const Handle& h, FileSystem::MountOperationOption option);
bool IsMounted(const Handle& h);
std::uint64_t GetCapacity(const Handle& h);
std::uint64_t GetUsedSpace(const Handle& h);
std::string GetType(const Handle& h);
std::string GetMountPoint(const Handle& h);
std::string GetVolumeName(const Handle& h);
std::string GetUuid(const Handle& h);
std::string GetName(const Handle& h);
void PrepareUnmount(const Handle& h);
HostCtl::Storage::QAXIState GetQAXIState(const Handle& h);
} // namespace FsOps

class FileSystemObject : public virtual FileSystem {
public:
    explicit FileSystemObject(HandlePtr handle) : handle_(std::move(handle)) {}

    void Mount(MountOperationOption option) override { FsOps::Mount(*handle_, option); }
    int Unmount(MountOperationOption option) override { return FsOps::Unmount(*handle_, option); }
    bool IsMounted() override { return FsOps::IsMounted(*handle_); }
    std::uint64_t GetCapacity() override { return FsOps::GetCapacity(*handle_); }
    std::uint64_t GetUsedSpace() override { return FsOps::GetUsedSpace(*handle_); }
    std::string GetType() override { return FsOps::GetType(*handle_); }
    std::string GetMountPoint() override { return FsOps::GetMountPoint(*handle_); }
    std::string GetVolumeName() override { return FsOps::GetVolumeName(*handle_); }
    std::string GetUuid() override { return FsOps::GetUuid(*handle_); }
    std::string GetName() override { return FsOps::GetName(*handle_); }
    void PrepareUnmount() override { FsOps::PrepareUnmount(*handle_); }
    HostCtl::Storage::QAXIState GetQAXIState() override { return FsOps::GetQAXIState(*handle_); }

protected:
    const Handle& handle() const { return *handle_; }

private:
    HandlePtr handle_;
};

// A file system of a kind the plug-in knows only as FileSystem (vfat, ufs, ...).
class PlainFileSystem final : public FileSystemObject {
public:
    using FileSystemObject::FileSystemObject;
    ~PlainFileSystem() override;
};

// An NFS v3 or v4.1 volume.
class NetworkFileSystemObject final : public NetworkFileSystem, public FileSystemObject {
public:
    explicit NetworkFileSystemObject(HandlePtr handle) : FileSystemObject(std::move(handle)) {}
    ~NetworkFileSystemObject() override;

    using FileSystemObject::Mount;
    void Mount(unsigned flags) override;
    bool IsAccessible() override;
    std::string GetRemoteHost() override;
    std::vector<std::string> GetRemoteHosts() override;
    std::string GetRemoteShare() override;
    bool IsReadOnly() override;
    bool GetReadOnlyState() override;
    void SetReadOnly(bool readOnly) override;
    bool IsPE() override;
    void SetPE(bool isPE) override;
    std::string GetKnxnic() override;
    std::string GetKnxnics() override;
    void SetKnxnics(const std::string& knxnics) override;
    std::int64_t GetConnections() override;
    std::int32_t GetConnectionsParam() override;
    void SetConnectionsParam(std::int32_t connections) override;
    std::uint32_t GetMaxReadTransferSize() override;
    std::uint32_t GetMaxWriteTransferSize() override;
    std::uint32_t GetMaxQueueDepth() override;
    void SetMaxQueueDepth(std::uint32_t depth, bool apply) override;
    SecurityType GetSecurityType() override;

    bool IsHidden();
};

// Where an extent object's record lives: in an HLFS volume's extents or an unresolved volume's.
enum class ExtentSource { Volume, Unresolved };

// The DiskLunPartition calls on the extent record behind a handle.
std::string ExtentDeviceName(const Handle& handle, ExtentSource source);
std::uint8_t ExtentPartition(const Handle& handle, ExtentSource source);

// One extent seen through its handle: a partition of a disk LUN of an HLFS volume, or an
// extent of an unresolved volume marked `impl: false` (not the host's implementation class).
template <typename Interface, ExtentSource Source>
class ExtentObject final : public Interface {
public:
    explicit ExtentObject(HandlePtr handle) : handle_(std::move(handle)) {}
    ~ExtentObject() override = default;
    std::string GetDeviceName() override { return ExtentDeviceName(*handle_, Source); }
    std::uint8_t GetPartition() override { return ExtentPartition(*handle_, Source); }

private:
    HandlePtr handle_;
};

using LunPartitionObject = ExtentObject<DiskLunPartition, ExtentSource::Volume>;
using ForeignUnresolvedExtent = ExtentObject<HostCtl::Storage::UnresolvedHlfsExtent, ExtentSource::Unresolved>;

// Unresolved volumes marked `impl: false`: not the host's implementation class.
class ForeignUnresolvedVolume final : public HostCtl::Storage::UnresolvedHlfsVolume {
public:
    ~ForeignUnresolvedVolume() override;
};

// The extent record behind an unresolved-extent handle; throws when it has gone.
const Model::UnresolvedExtent& ResolveUnresolvedExtent(const Handle& handle);

// Host-wide objects.
std::unique_ptr<HostCtl::Storage::StorageInfo> MakeStorageInfo();

} // namespace HostSim::Objects
