// Host-wide storage operations: StorageInfoImpl, the Host object and what hangs off it.

#include <algorithm>

#include "HostObjects.h"
#include "hostctl/Host.h"
#include "hostctl/StorageInfoImpl.h"
#include "linux/LinuxHost.h"

namespace {

namespace Runtime = HostSim::Runtime;
namespace Objects = HostSim::Objects;
using HostCtl::Storage::FileSystem;
using HostCtl::Storage::HlFileSystem;
using HostCtl::Storage::NetworkFileSystem;
using HostCtl::Storage::NfsVersion;
// This file works on the host's state model throughout.
using namespace HostSim::Model;
using J = nlohmann::ordered_json;

// Runs a call that is not made on one volume object: state check, then faults matched
// against `targets` (the call's first text argument, and the volume it names).
template <typename F>
auto HostCall(std::string_view call, std::initializer_list<std::string_view> targets,
              const Runtime::JournalEntry* journal, F&& body)
{
    return Runtime::Run(call, journal, [&] {
        State& st = Runtime::CheckedState();
        Runtime::CheckFault(call, targets);
        return body(st);
    });
}

std::vector<std::unique_ptr<HlFileSystem>> HlfsMatching(const State& st, const std::string& filter)
{
    std::vector<std::unique_ptr<HlFileSystem>> result;
    for (const auto& fs : st.fileSystems)
        if (fs.kind == FsKind::Hlfs && (filter.empty() || fs.volumeName == filter || fs.uuid == filter))
            result.push_back(Objects::MakeHlfs(fs));
    return result;
}

std::unique_ptr<HlFileSystem> Hlfs(const FileSystemRecord* fs)
{
    return fs && fs->kind == FsKind::Hlfs ? Objects::MakeHlfs(*fs) : nullptr;
}

std::vector<std::string>& Ruleset(State& st, NfsVersion version)
{
    if (version != HostCtl::Storage::NFS_VERSION_3 && version != HostCtl::Storage::NFS_VERSION_41)
        Runtime::Throw("Unknown NFS version " + std::to_string(static_cast<int>(version)));
    auto& list = version == HostCtl::Storage::NFS_VERSION_3 ? st.nfsClient : st.nfs41Client;
    if (!list)
        list.emplace();
    return *list;
}

const char* RulesetName(NfsVersion version)
{
    return version == HostCtl::Storage::NFS_VERSION_3 ? "nfsClient" : "nfs41Client";
}

std::size_t FindNfs(const State& st, const std::string& name, bool v3, bool v41)
{
    const auto& list = st.fileSystems;
    for (std::size_t i = 0; i < list.size(); ++i)
        if (list[i].volumeName == name &&
            ((v3 && list[i].kind == FsKind::Nfs) || (v41 && list[i].kind == FsKind::Nfs41)))
            return i;
    return std::string::npos;
}

void RemoveNfs(const std::string& name, bool v3, bool v41, std::initializer_list<std::string_view> targets,
               const Runtime::JournalEntry& journal)
{
    HostCall("StorageInfoImpl.RemoveNetworkFileSystem", targets, &journal, [&](State& st) {
        const std::size_t pos = FindNfs(st, name, v3, v41);
        if (pos == std::string::npos)
            Runtime::Throw("NFS volume '" + name + "' not found");
        if (st.fileSystems[pos].busy)
            Runtime::Throw("Volume '" + name + "' is busy");
        st.fileSystems.erase(st.fileSystems.begin() + static_cast<std::ptrdiff_t>(pos));
        st.Mark(TopKey::fileSystems);
        Runtime::InvalidateIndexes();
        Runtime::MarkDirty();
    });
}

void SetPreUnmount(const char* call, const std::string& name, bool on)
{
    const Runtime::JournalEntry journal{name, J::array({name})};
    HostCall(call, {name}, &journal, [&](State& st) {
        const std::size_t pos = FindNfs(st, name, true, false);
        if (pos == std::string::npos)
            Runtime::Throw("NFS volume '" + name + "' not found");
        FileSystemRecord& fs = st.fileSystems[pos];
        if (fs.preUnmount != on) {
            Runtime::MarkDirty();
            fs.preUnmount = on;
            fs.Mark(FsKey::preUnmount);
        }
    });
}

FileSystemRecord& AppendNfs(State& st, FsKind kind, const std::string& volumeName, const std::string& share)
{
    if (Runtime::FirstByVolumeName(volumeName))
        Runtime::Throw("A volume named '" + volumeName + "' already exists");
    FileSystemRecord fs;
    fs.id = st.nextFileSystemId++;
    fs.kind = kind;
    fs.type = kind == FsKind::Nfs ? "NFS" : "NFS41";
    fs.volumeName = volumeName;
    fs.mounted = false;
    fs.MutableNfs().remoteShare = share;
    for (FsKey key : {FsKey::type, FsKey::volumeName, FsKey::mounted, FsKey::remoteShare})
        fs.Mark(key);
    st.fileSystems.push_back(std::move(fs));
    st.Mark(TopKey::fileSystems);
    Runtime::InvalidateIndexes();
    Runtime::MarkDirty();
    return st.fileSystems.back();
}

template <typename Filter>
std::vector<std::unique_ptr<NetworkFileSystem>> NfsList(std::string_view call, FsKind kind, Filter filter)
{
    return HostCall(call, {}, nullptr, [&](State& st) {
        std::vector<std::unique_ptr<NetworkFileSystem>> result;
        for (const auto& fs : st.fileSystems) {
            if (fs.kind != kind)
                continue;
            auto object = Objects::MakeNfs(fs);
            if (!filter || filter(*object))
                result.push_back(std::move(object));
        }
        return result;
    });
}

// ---- objects reached through the Host ----------------------------------------------------

class PointerBlockCacheObject final : public HostCtl::Storage::PointerBlockCache {
public:
    HostCtl::Storage::PointerBlockCacheStats GetStatistics() override
    {
        return HostCall("PointerBlockCache.GetStatistics", {}, nullptr,
                        [](State& st) -> HostCtl::Storage::PointerBlockCacheStats { return st.pointerBlockCache; });
    }
    void ResetStatistics() override
    {
        const Runtime::JournalEntry journal{"", J::array()};
        HostCall("PointerBlockCache.ResetStatistics", {}, &journal, [](State& st) {
            auto& c = st.pointerBlockCache;
            if (c.capacityMissRatio != 0 || c.workingSetMax != c.workingSet) {
                c.capacityMissRatio = 0;
                c.workingSetMax = c.workingSet;
                st.Mark(TopKey::pointerBlockCache);
                Runtime::MarkDirty();
            }
        });
    }
};

class StorageInfoObject final : public HostCtl::Storage::StorageInfo {
public:
    std::vector<std::unique_ptr<HlFileSystem>> GetHlfsFileSystems(const std::string& filter) override
    {
        return HostCall("StorageInfo.GetHlfsFileSystems", {filter}, nullptr,
                        [&](State& st) { return HlfsMatching(st, filter); });
    }
    std::unique_ptr<HlFileSystem> GetHlfsFileSystemByUuid(const std::string& uuid) override
    {
        return HostCall("StorageInfo.GetHlfsFileSystemByUuid", {uuid}, nullptr,
                        [&](State&) { return Hlfs(Runtime::FirstByUuid(uuid)); });
    }
    std::unique_ptr<HlFileSystem> GetHlfsFileSystemByLabel(const std::string& label) override
    {
        return HostCall("StorageInfo.GetHlfsFileSystemByLabel", {label}, nullptr,
                        [&](State&) { return Hlfs(Runtime::FirstByVolumeName(label)); });
    }
    std::unique_ptr<HostCtl::Storage::PointerBlockCache> GetPointerBlockCache() override
    {
        return HostCall("StorageInfo.GetPointerBlockCache", {}, nullptr,
                        [](State&) -> std::unique_ptr<HostCtl::Storage::PointerBlockCache> {
                            return std::make_unique<PointerBlockCacheObject>();
                        });
    }
};

class MemoryInfoObject final : public HostCtl::MemoryInfo {
public:
    std::vector<std::unique_ptr<HostCtl::HeapRecord>> GetHeapStats() override
    {
        return HostCall("MemoryInfo.GetHeapStats", {}, nullptr, [](State& st) {
            std::vector<std::unique_ptr<HostCtl::HeapRecord>> result;
            for (const auto& h : st.heaps)
                result.push_back(std::make_unique<HostCtl::HeapRecord>(HostCtl::HeapRecord{h.name, h.size, h.maxSize}));
            return result;
        });
    }
};

class HardwareInfoObject final : public HostCtl::HardwareInfo {
public:
    std::unique_ptr<HostCtl::MemoryInfo> GetMemoryInfo() override
    {
        return HostCall("HardwareInfo.GetMemoryInfo", {}, nullptr, [](State&) -> std::unique_ptr<HostCtl::MemoryInfo> {
            return std::make_unique<MemoryInfoObject>();
        });
    }
};

// One advanced option of either type; `call` names its GetValue in the journal.
template <typename Interface, typename Value>
class OptionObject final : public Interface {
public:
    OptionObject(const char* call, std::string name, Value value)
        : call_(call), name_(std::move(name)), value_(std::move(value))
    {
    }
    std::string GetName() override { return name_; }
    Value GetValue() override
    {
        return HostCall(call_, {name_}, nullptr, [&](State&) { return value_; });
    }

private:
    const char* call_;
    std::string name_;
    Value value_;
};

using IntegerOptionObject = OptionObject<HostCtl::AdvancedIntegerOption, std::int64_t>;
using StringOptionObject = OptionObject<HostCtl::AdvancedStringOption, std::string>;

class OptionGroupObject final : public HostCtl::AdvancedOptionGroup {
public:
    explicit OptionGroupObject(std::string group) : group_(std::move(group)) {}
    std::unique_ptr<HostCtl::AdvancedOption> GetOption(const std::string& name) override
    {
        return HostCall("AdvancedOptionGroup.GetOption", {name}, nullptr,
                        [&](State& st) -> std::unique_ptr<HostCtl::AdvancedOption> {
                            for (const auto& [group, options] : st.advancedOptions) {
                                if (group != group_)
                                    continue;
                                for (const auto& [optionName, value] : options) {
                                    if (optionName != name)
                                        continue;
                                    if (const auto* number = std::get_if<std::int64_t>(&value))
                                        return std::make_unique<IntegerOptionObject>("AdvancedIntegerOption.GetValue",
                                                                                     name, *number);
                                    return std::make_unique<StringOptionObject>("AdvancedStringOption.GetValue", name,
                                                                                std::get<std::string>(value));
                                }
                            }
                            Runtime::Throw("Advanced option '" + group_ + "/" + name + "' not found");
                        });
    }

private:
    std::string group_;
};

class AdvancedOptionsObject final : public HostCtl::AdvancedOptions {
public:
    std::unique_ptr<HostCtl::AdvancedOptionGroup> GetOptionGroup(const std::string& name) override
    {
        return HostCall("AdvancedOptions.GetOptionGroup", {name}, nullptr,
                        [&](State& st) -> std::unique_ptr<HostCtl::AdvancedOptionGroup> {
                            for (const auto& entry : st.advancedOptions)
                                if (entry.first == name)
                                    return std::make_unique<OptionGroupObject>(name);
                            Runtime::Throw("Advanced option group '" + name + "' not found");
                        });
    }
};

class HostObject final : public HostCtl::Host {
public:
    std::unique_ptr<HostCtl::Storage::StorageInfo> GetStorageInfo() override
    {
        return HostCall("Host.GetStorageInfo", {}, nullptr,
                        [](State&) -> std::unique_ptr<HostCtl::Storage::StorageInfo> {
                            return std::make_unique<StorageInfoObject>();
                        });
    }
    std::unique_ptr<HostCtl::HardwareInfo> GetHardwareInfo() override
    {
        return HostCall("Host.GetHardwareInfo", {}, nullptr, [](State&) -> std::unique_ptr<HostCtl::HardwareInfo> {
            return std::make_unique<HardwareInfoObject>();
        });
    }
    std::unique_ptr<HostCtl::AdvancedOptions> GetAdvancedOptions() override
    {
        return HostCall("Host.GetAdvancedOptions", {}, nullptr,
                        [](State&) -> std::unique_ptr<HostCtl::AdvancedOptions> {
                            return std::make_unique<AdvancedOptionsObject>();
                        });
    }
};

} // namespace

namespace HostCtl {

Host* HostFactory::GetHost()
{
    if (HostLinux::Active())
        return HostLinux::GetHost();
    static HostObject host;
    return &host;
}

} // namespace HostCtl

namespace KnxCtl::Storage {

StorageInfoImpl::StorageInfoImpl()
{
    if (HostLinux::Active())
        return;
    HostCall("StorageInfoImpl.new", {}, nullptr, [](State&) {});
}

StorageInfoImpl::~StorageInfoImpl() = default;

bool StorageInfoImpl::IsPE(NetworkFileSystem& fs) { return fs.IsPE(); }
bool StorageInfoImpl::IsNotPE(NetworkFileSystem& fs) { return !fs.IsPE(); }
bool StorageInfoImpl::IsNotHidden(NetworkFileSystem& fs)
{
    auto* object = dynamic_cast<Objects::NetworkFileSystemObject*>(&fs);
    return !object || !object->IsHidden();
}

std::vector<std::unique_ptr<FileSystem>> StorageInfoImpl::GetFileSystems()
{
    if (HostLinux::Active())
        return HostLinux::Storage::GetFileSystems();
    return HostCall("StorageInfoImpl.GetFileSystems", {}, nullptr, [](State& st) {
        std::vector<std::unique_ptr<FileSystem>> result;
        result.reserve(st.fileSystems.size());
        for (const auto& fs : st.fileSystems)
            result.push_back(Objects::MakeFileSystem(fs));
        return result;
    });
}

namespace {

// The first volume `find` finds by `key`, as a new object, or none.
std::unique_ptr<FileSystem> FindFileSystem(std::string_view call, const std::string& key,
                                           const FileSystemRecord* (*find)(std::string_view))
{
    return HostCall(call, {key}, nullptr, [&](State&) -> std::unique_ptr<FileSystem> {
        const FileSystemRecord* fs = find(key);
        return fs ? Objects::MakeFileSystem(*fs) : nullptr;
    });
}

} // namespace

std::unique_ptr<FileSystem> StorageInfoImpl::GetFileSystemByUuidEx(const std::string& uuid)
{
    if (HostLinux::Active())
        return HostLinux::Storage::GetFileSystemByUuid("StorageInfoImpl.GetFileSystemByUuidEx", uuid);
    return FindFileSystem("StorageInfoImpl.GetFileSystemByUuidEx", uuid, Runtime::FirstByUuid);
}

std::unique_ptr<FileSystem> StorageInfoImpl::GetFileSystemByUUID(const std::string& uuid)
{
    if (HostLinux::Active())
        return HostLinux::Storage::GetFileSystemByUuid("StorageInfoImpl.GetFileSystemByUUID", uuid);
    return FindFileSystem("StorageInfoImpl.GetFileSystemByUUID", uuid, Runtime::FirstByUuid);
}

std::unique_ptr<FileSystem> StorageInfoImpl::GetFileSystemByLabel(const std::string& label)
{
    if (HostLinux::Active())
        return HostLinux::Storage::GetFileSystemByLabel(label);
    return FindFileSystem("StorageInfoImpl.GetFileSystemByLabel", label, Runtime::FirstByVolumeName);
}

std::unique_ptr<FileSystem> StorageInfoImpl::GetFileSystemByPath(const std::string& path)
{
    if (HostLinux::Active())
        return HostLinux::Storage::GetFileSystemByPath(path);
    return FindFileSystem("StorageInfoImpl.GetFileSystemByPath", path, Runtime::FirstMountedByPath);
}

std::vector<std::unique_ptr<HlFileSystem>> StorageInfoImpl::GetHlfsFileSystems(const std::string& filter)
{
    if (HostLinux::Active())
        return {};
    return HostCall("StorageInfoImpl.GetHlfsFileSystems", {filter}, nullptr,
                    [&](State& st) { return HlfsMatching(st, filter); });
}

std::vector<std::unique_ptr<HlFileSystem>> StorageInfoImpl::GetHlfsFileSystemsList(const std::string& filter)
{
    if (HostLinux::Active())
        return {};
    return HostCall("StorageInfoImpl.GetHlfsFileSystemsList", {filter}, nullptr,
                    [&](State& st) { return HlfsMatching(st, filter); });
}

std::vector<std::unique_ptr<HostCtl::Storage::UnresolvedHlfsVolume>> StorageInfoImpl::GetUnresolvedVolumes()
{
    if (HostLinux::Active())
        return {};
    return HostCall("StorageInfoImpl.GetUnresolvedVolumes", {}, nullptr, [](State& st) {
        std::vector<std::unique_ptr<HostCtl::Storage::UnresolvedHlfsVolume>> result;
        for (const auto& u : st.unresolvedVolumes)
            result.push_back(Objects::MakeUnresolved(u));
        return result;
    });
}

bool StorageInfoImpl::TryMount(FileSystem::MountOperationOption option, const std::string& uuid,
                               const std::string& label)
{
    if (HostLinux::Active())
        return HostLinux::Storage::TryMount(option, uuid, label);
    Runtime::JournalEntry journal{label, J::array({static_cast<int>(option), uuid, label})};
    return HostCall("StorageInfoImpl.TryMount", {uuid, label}, &journal, [&](State& st) {
        if (!st.tryMount.value_or(false) || (uuid.empty() && label.empty()))
            return false;
        for (auto& fs : st.fileSystems) {
            if ((!uuid.empty() && fs.uuid != uuid) || (!label.empty() && fs.volumeName != label))
                continue;
            if (journal.target.empty() || journal.target == label)
                journal.target = fs.volumeName;
            if (fs.mounted)
                continue; // another volume may match too
            journal.target = fs.volumeName;
            fs.mounted = true;
            fs.Mark(FsKey::mounted);
            if (fs.explicitlyUnmounted) {
                fs.explicitlyUnmounted = false;
                fs.Mark(FsKey::explicitlyUnmounted);
            }
            Runtime::MarkDirty();
            return true;
        }
        return false;
    });
}

void StorageInfoImpl::SignalIORM(bool signal)
{
    if (HostLinux::Active())
        return HostLinux::Storage::SignalIORM(signal);
    const Runtime::JournalEntry journal{"", J::array({signal})};
    HostCall("StorageInfoImpl.SignalIORM", {}, &journal, [](State&) {});
}

void StorageInfoImpl::RescanHlfs()
{
    if (HostLinux::Active())
        return HostLinux::Storage::RescanHlfs();
    const Runtime::JournalEntry journal{"", J::array()};
    HostCall("StorageInfoImpl.RescanHlfs", {}, &journal, [](State& st) {
        if (st.pendingFileSystems.empty() && st.pendingUnresolved.empty())
            return;
        for (auto& fs : st.pendingFileSystems) {
            fs.id = st.nextFileSystemId++;
            st.fileSystems.push_back(std::move(fs));
        }
        for (auto& u : st.pendingUnresolved) {
            u.id = st.nextUnresolvedId++;
            st.unresolvedVolumes.push_back(std::move(u));
        }
        if (!st.pendingFileSystems.empty())
            st.Mark(TopKey::fileSystems);
        if (!st.pendingUnresolved.empty())
            st.Mark(TopKey::unresolvedVolumes);
        st.pendingFileSystems.clear();
        st.pendingUnresolved.clear();
        Runtime::InvalidateIndexes();
        Runtime::MarkDirty();
    });
}

void StorageInfoImpl::AutoFullMountVolumes()
{
    if (HostLinux::Active())
        return HostLinux::Storage::AutoFullMountVolumes();
    const Runtime::JournalEntry journal{"", J::array()};
    HostCall("StorageInfoImpl.AutoFullMountVolumes", {}, &journal, [](State& st) {
        for (auto& fs : st.fileSystems) {
            if (fs.mounted || fs.explicitlyUnmounted)
                continue;
            fs.mounted = true;
            fs.Mark(FsKey::mounted);
            Runtime::MarkDirty();
        }
    });
}

void StorageInfoImpl::RestorePsaConfig()
{
    if (HostLinux::Active())
        return HostLinux::Storage::RestorePsaConfig();
    const Runtime::JournalEntry journal{"", J::array()};
    HostCall("StorageInfoImpl.RestorePsaConfig", {}, &journal, [](State&) {});
}

std::unique_ptr<NetworkFileSystem> StorageInfoImpl::AddNetworkFileSystem(
    const std::string& host, const std::string& share, const std::string& volumeName, bool knxnicBound,
    const std::string& knxnic, std::uint32_t queueDepth, std::int64_t connections)
{
    if (HostLinux::Active())
        return HostLinux::Storage::AddNetworkFileSystem(host, share, volumeName, knxnicBound, knxnic, queueDepth,
                                                        connections);
    const Runtime::JournalEntry journal{
        volumeName, J::array({host, share, volumeName, knxnicBound, knxnic, queueDepth, connections})};
    return HostCall("StorageInfoImpl.AddNetworkFileSystem", {host, volumeName}, &journal, [&](State& st) {
        FileSystemRecord& fs = AppendNfs(st, FsKind::Nfs, volumeName, share);
        auto& nfs = fs.MutableNfs();
        nfs.remoteHost = host;
        fs.Mark(FsKey::remoteHost);
        if (knxnicBound) {
            nfs.knxnic = nfs.knxnics = knxnic;
            fs.Mark(FsKey::knxnic);
            fs.Mark(FsKey::knxnics);
        }
        nfs.connections = connections;
        nfs.connectionsParam = static_cast<std::int32_t>(connections);
        fs.Mark(FsKey::connections);
        fs.Mark(FsKey::connectionsParam);
        if (queueDepth != 0) {
            nfs.maxQueueDepth = queueDepth;
            fs.Mark(FsKey::maxQueueDepth);
        }
        HostSim::Model::ResolveDefaults(fs);
        return Objects::MakeNfs(fs);
    });
}

std::unique_ptr<NetworkFileSystem> StorageInfoImpl::AddV41NetworkFileSystem(const std::vector<std::string>& hosts,
                                                                            const std::string& share,
                                                                            const std::string& volumeName,
                                                                            NetworkFileSystem::SecurityType security,
                                                                            bool knxnicBound)
{
    if (HostLinux::Active())
        return HostLinux::Storage::AddV41NetworkFileSystem(hosts, share, volumeName, security, knxnicBound);
    const Runtime::JournalEntry journal{volumeName,
                                        J::array({hosts, share, volumeName, static_cast<int>(security), knxnicBound})};
    const std::string_view firstHost = hosts.empty() ? std::string_view() : std::string_view(hosts.front());
    return HostCall(
        "StorageInfoImpl.AddV41NetworkFileSystem", {share, volumeName, firstHost}, &journal, [&](State& st) {
            FileSystemRecord& fs = AppendNfs(st, FsKind::Nfs41, volumeName, share);
            auto& nfs = fs.MutableNfs();
            if (knxnicBound) {
                std::string knxnics;
                for (const auto& text : hosts) {
                    const auto colon = text.rfind(':');
                    nfs.remoteHosts.push_back(text.substr(0, colon));
                    const std::string knxnic = colon == std::string::npos ? std::string() : text.substr(colon + 1);
                    if (nfs.remoteHosts.size() == 1)
                        nfs.knxnic = knxnic;
                    knxnics += (knxnics.empty() && nfs.remoteHosts.size() == 1 ? "" : ",") + knxnic;
                }
                nfs.knxnics = knxnics;
                fs.Mark(FsKey::knxnic);
                fs.Mark(FsKey::knxnics);
            } else {
                nfs.remoteHosts = hosts;
            }
            fs.Mark(FsKey::remoteHosts);
            nfs.securityType = static_cast<std::int32_t>(security);
            fs.Mark(FsKey::securityType);
            HostSim::Model::ResolveDefaults(fs);
            return Objects::MakeNfs(fs);
        });
}

void StorageInfoImpl::RemoveNetworkFileSystem(const std::string& volumeName)
{
    if (HostLinux::Active())
        return HostLinux::Storage::RemoveNetworkFileSystem(volumeName, 0);
    RemoveNfs(volumeName, true, true, {volumeName}, Runtime::JournalEntry{volumeName, J::array({volumeName})});
}

void StorageInfoImpl::RemoveNetworkFileSystem(const std::string& volumeName, NfsVersion version)
{
    if (HostLinux::Active())
        return HostLinux::Storage::RemoveNetworkFileSystem(volumeName, static_cast<int>(version));
    RemoveNfs(volumeName, version == HostCtl::Storage::NFS_VERSION_3, version == HostCtl::Storage::NFS_VERSION_41,
              {volumeName}, Runtime::JournalEntry{volumeName, J::array({volumeName, static_cast<int>(version)})});
}

std::vector<std::unique_ptr<NetworkFileSystem>> StorageInfoImpl::GetV3NetworkFileSystems(NetworkFileSystemFilter filter)
{
    if (HostLinux::Active())
        return HostLinux::Storage::GetNetworkFileSystems(false, filter);
    return NfsList("StorageInfoImpl.GetV3NetworkFileSystems", FsKind::Nfs, filter);
}

std::vector<std::unique_ptr<NetworkFileSystem>> StorageInfoImpl::GetV41NetworkFileSystems(
    NetworkFileSystemFilter filter)
{
    if (HostLinux::Active())
        return HostLinux::Storage::GetNetworkFileSystems(true, filter);
    return NfsList("StorageInfoImpl.GetV41NetworkFileSystems", FsKind::Nfs41, filter);
}

void StorageInfoImpl::EnterNetworkFileSystemPreUnmount(const std::string& volumeName)
{
    if (HostLinux::Active())
        return HostLinux::Storage::PreUnmount("StorageInfoImpl.EnterNetworkFileSystemPreUnmount", volumeName);
    SetPreUnmount("StorageInfoImpl.EnterNetworkFileSystemPreUnmount", volumeName, true);
}

void StorageInfoImpl::ExitNetworkFileSystemPreUnmount(const std::string& volumeName)
{
    if (HostLinux::Active())
        return HostLinux::Storage::PreUnmount("StorageInfoImpl.ExitNetworkFileSystemPreUnmount", volumeName);
    SetPreUnmount("StorageInfoImpl.ExitNetworkFileSystemPreUnmount", volumeName, false);
}

namespace {

// Changes the firewall ruleset of `version` as call `call`; `change` throws when the change
// cannot be made.
template <typename F>
void ChangeRuleset(std::string_view call, const std::string& ipMask, NfsVersion version, F&& change)
{
    const Runtime::JournalEntry journal{"", J::array({ipMask, static_cast<int>(version)})};
    HostCall(call, {ipMask}, &journal, [&](State& st) {
        auto& rules = Ruleset(st, version);
        change(rules, std::find(rules.begin(), rules.end(), ipMask));
        st.Mark(TopKey::firewall);
        Runtime::MarkDirty();
    });
}

} // namespace

void StorageInfoImpl::AddNasFirewallConfig(const std::string& ipMask, NfsVersion version)
{
    if (HostLinux::Active())
        return HostLinux::Storage::AddNasFirewallConfig(ipMask, version);
    ChangeRuleset("StorageInfoImpl.AddNasFirewallConfig", ipMask, version, [&](auto& rules, auto it) {
        if (it != rules.end())
            Runtime::Throw("IP/Mask '" + ipMask + "' already exists in ruleset " + RulesetName(version));
        rules.push_back(ipMask);
    });
}

void StorageInfoImpl::RemoveNasFirewallConfig(const std::string& ipMask, NfsVersion version)
{
    if (HostLinux::Active())
        return HostLinux::Storage::RemoveNasFirewallConfig(ipMask, version);
    ChangeRuleset("StorageInfoImpl.RemoveNasFirewallConfig", ipMask, version, [&](auto& rules, auto it) {
        if (it == rules.end())
            Runtime::Throw("IP/Mask '" + ipMask + "' not found in ruleset " + RulesetName(version));
        rules.erase(it);
    });
}

std::vector<std::string> StorageInfoImpl::GetNasFirewallConfigs(NfsVersion version)
{
    if (HostLinux::Active())
        return HostLinux::Storage::GetNasFirewallConfigs(version);
    return HostCall("StorageInfoImpl.GetNasFirewallConfigs", {}, nullptr, [&](State& st) {
        if (version != HostCtl::Storage::NFS_VERSION_3 && version != HostCtl::Storage::NFS_VERSION_41)
            Runtime::Throw("Unknown NFS version " + std::to_string(static_cast<int>(version)));
        const auto& rules = version == HostCtl::Storage::NFS_VERSION_3 ? st.nfsClient : st.nfs41Client;
        return rules ? *rules : std::vector<std::string>();
    });
}

StorageInfoScopedCache::StorageInfoScopedCache(bool refresh)
{
    if (HostLinux::Active())
        return;
    (void)refresh;
    HostCall("StorageInfoScopedCache.new", {}, nullptr, [](State&) {});
}

StorageInfoScopedCache::~StorageInfoScopedCache() = default;

} // namespace KnxCtl::Storage
