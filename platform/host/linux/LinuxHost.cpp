#include "LinuxHost.h"

#include <sys/mount.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <functional>
#include <optional>
#include <stdexcept>
#include <type_traits>
#include <utility>

#include "FeatureList.h"
#include "LinuxFirewall.h"
#include "LinuxMountOps.h"
#include "LinuxMounts.h"
#include "LinuxRegistry.h"
#include "host/HostRuntime.h"
#include "host/HostSession.h"
#include "hostctl/HostCtlException.h"

namespace HostLinux {

namespace {

using HostCtl::Lib::HostCtlException;
using J = nlohmann::ordered_json;
using Journal = HostSim::Runtime::JournalEntry;

bool gActive = false;

// Statting a mount is given this long; a server that does not answer makes the volume
// inaccessible rather than the command hang.
constexpr int kStatSeconds = 5;

// Runs one host call as the simulated host runs its calls (journaled with their outcome);
// failures other than HostCtlException, such as the machine's own errors, become one.
template <typename F>
auto Call(std::string_view call, const Journal* journal, F&& body) -> decltype(body())
{
    return HostSim::Runtime::Run(call, journal, [&]() -> decltype(body()) {
        try {
            return body();
        } catch (const HostCtlException&) {
            throw;
        } catch (const std::exception& e) {
            throw HostCtlException(e.what());
        }
    });
}

Registry& TheRegistry()
{
    static std::unique_ptr<Registry> registry;
    if (!registry)
        registry = std::make_unique<Registry>(Registry::DefaultFolder());
    return *registry;
}

// The registry folder as the mount table writes it (links resolved), for comparisons.
std::string RealFolder(const std::string& folder)
{
    char buffer[PATH_MAX];
    return ::realpath(folder.c_str(), buffer) ? std::string(buffer) : folder;
}

// One volume as one look at the machine found it.
struct Volume {
    std::string mountPoint;
    std::string source;
    std::string fsType;
    std::string type; // as GetType answers
    std::string volumeName;
    std::string uuid;
    MountKind kind = MountKind::Other;
    bool mounted = false;
    bool nfs = false;
    bool v41 = false;
    std::optional<RegisteredVolume> registered;
    NfsOptions options;
    NfsSource remote;
    std::optional<Capacity> capacity;
    std::string capacityError; // why capacity is missing
    bool freshlyAdded = false; // registered by this process and not mounted since
};
using VolumePtr = std::shared_ptr<Volume>;

std::string LastComponent(const std::string& target)
{
    if (target == "/")
        return "/";
    const auto slash = target.rfind('/');
    return slash == std::string::npos ? target : target.substr(slash + 1);
}

void Measure(Volume& v)
{
    try {
        v.capacity = StatWithin(v.mountPoint, kStatSeconds);
        if (!v.capacity)
            v.capacityError =
                "'" + v.mountPoint + "' did not answer within " + std::to_string(kStatSeconds) + " seconds";
    } catch (const std::exception& e) {
        v.capacityError = "Cannot read the size of '" + v.mountPoint + "': " + e.what();
    }
}

struct Scan {
    std::vector<VolumePtr> mounted;        // block and NFS mounts, in mount table order
    std::vector<VolumePtr> registeredOnly; // registered volumes the mounted list does not show
};

VolumePtr FromRegistry(const RegisteredVolume& reg, const Registry& registry)
{
    auto v = std::make_shared<Volume>();
    v->registered = reg;
    v->nfs = true;
    v->v41 = reg.v41;
    v->kind = reg.v41 ? MountKind::Nfs4 : MountKind::Nfs3;
    v->type = reg.v41 ? "NFS41" : "NFS";
    v->volumeName = reg.name;
    v->mountPoint = registry.MountPoint(reg.name);
    v->remote.host = reg.hosts.empty() ? std::string() : reg.hosts.front();
    v->remote.share = reg.share;
    return v;
}

Scan Look()
{
    Registry& registry = TheRegistry();
    const auto registered = registry.Load();
    const std::string realVolumes = RealFolder(registry.Folder()) + "/volumes/";
    const auto kinds = ReadFilesystemKinds();
    const auto table = ReadMountTable();

    auto registeredAt = [&](const std::string& target) -> const RegisteredVolume* {
        if (target.rfind(realVolumes, 0) != 0)
            return nullptr;
        const std::string name = target.substr(realVolumes.size());
        for (const auto& reg : registered)
            if (reg.name == name)
                return &reg;
        return nullptr;
    };

    Scan scan;
    std::vector<std::string> seenRegistered;
    for (const auto& entry : table) {
        const MountKind kind = Classify(entry, kinds);
        const RegisteredVolume* reg = registeredAt(entry.target);
        if (kind == MountKind::Other) {
            if (reg) {
                // Something else is mounted where a registered volume belongs: it is that
                // volume's mount as far as unmounting goes.
                auto v = FromRegistry(*reg, registry);
                v->mountPoint = entry.target;
                v->mounted = true;
                scan.registeredOnly.push_back(v);
                seenRegistered.push_back(reg->name);
            }
            continue;
        }
        auto v = std::make_shared<Volume>();
        v->mountPoint = entry.target;
        v->source = entry.source;
        v->fsType = entry.fsType;
        v->kind = kind;
        v->mounted = true;
        v->type = entry.fsType;
        Measure(*v);
        if (kind == MountKind::Nfs3 || kind == MountKind::Nfs4) {
            v->nfs = true;
            v->options = ReadNfsOptions(entry.options);
            v->remote = SplitNfsSource(entry.source);
            if (kind == MountKind::Nfs3)
                v->type = "NFS";
            else if (v->options.version == "4.1") {
                v->type = "NFS41";
                v->v41 = true;
            }
        }
        Identity identity;
        if (kind == MountKind::Block)
            identity = ProbeDevice(entry.source);
        v->uuid = !identity.uuid.empty() ? identity.uuid : v->capacity ? FsidText(v->capacity->fsid) : std::string();
        if (reg) {
            v->registered = *reg;
            v->volumeName = reg->name;
            v->v41 = reg->v41;
            seenRegistered.push_back(reg->name);
        } else {
            v->volumeName = !identity.label.empty() ? identity.label : LastComponent(entry.target);
        }
        scan.mounted.push_back(std::move(v));
    }
    for (const auto& reg : registered)
        if (std::find(seenRegistered.begin(), seenRegistered.end(), reg.name) == seenRegistered.end())
            scan.registeredOnly.push_back(FromRegistry(reg, registry));
    return scan;
}

std::vector<VolumePtr> Everything(const Scan& scan)
{
    std::vector<VolumePtr> all = scan.mounted;
    all.insert(all.end(), scan.registeredOnly.begin(), scan.registeredOnly.end());
    return all;
}

std::string NotAddedHere(const Volume& v)
{
    return "Volume '" + v.volumeName +
           "' was not added with autocli; on a Linux host only the NFS volumes added "
           "with autocli are mounted, changed or unmounted through it";
}

// The security flavours by the names mount options give them.
constexpr std::pair<NetworkFileSystem::SecurityType, const char*> kSecurityOptions[] = {
    {NetworkFileSystem::SEC_SYS, "sys"},
    {NetworkFileSystem::SEC_KRB5, "krb5"},
    {NetworkFileSystem::SEC_KRB5I, "krb5i"},
    {NetworkFileSystem::SEC_KRB5P, "krb5p"},
};

const char* SecurityOption(int security)
{
    for (const auto& [type, option] : kSecurityOptions)
        if (type == security)
            return option;
    return nullptr;
}

NetworkFileSystem::SecurityType SecurityFromOption(const std::string& sec)
{
    // The first flavour of a list is the one in use.
    const std::string first = sec.substr(0, sec.find(':'));
    for (const auto& [type, option] : kSecurityOptions)
        if (first == option)
            return type;
    return NetworkFileSystem::SEC_NONE;
}

void UpdateRegistered(const std::string& name, const std::function<void(RegisteredVolume&)>& change)
{
    TheRegistry().Update([&](std::vector<RegisteredVolume>& volumes) {
        for (auto& v : volumes)
            if (v.name == name) {
                change(v);
                return;
            }
        throw std::runtime_error("NFS volume '" + name + "' not found");
    });
}

// Mounts a registered NFS volume on DIR/volumes/<name>.
void MountRegistered(Volume& v)
{
    const RegisteredVolume& reg = *v.registered;
    RequireNfsClient(ReadFilesystemKinds(), reg.v41);
    if (reg.hosts.empty())
        throw std::runtime_error("NFS volume '" + reg.name + "' has no server");
    const std::string host = reg.hosts.front();
    const std::string where = host + ":" + reg.share;
    std::string address;
    try {
        address = ResolveHost(host);
    } catch (const std::exception& e) {
        throw std::runtime_error("Unable to connect to NFS server " + where + ": " + e.what());
    }
    std::string data = std::string("vers=") + (reg.v41 ? "4.1" : "3") + ",addr=" + address;
    if (reg.connections > 1)
        data += ",nconnect=" + std::to_string(reg.connections);
    if (const char* sec = SecurityOption(reg.security))
        data += std::string(",sec=") + sec;
    const std::string source = (host.find(':') != std::string::npos ? "[" + host + "]" : host) + ":" + reg.share;
    const int fd = OpenMountPoint(TheRegistry().Folder(), reg.name);
    try {
        MountOnto(fd, source, reg.v41 ? "nfs4" : "nfs", reg.readOnly ? MS_RDONLY : 0, data);
    } catch (const std::exception& e) {
        ::close(fd);
        throw std::runtime_error("Unable to connect to NFS server " + where + ": " + e.what());
    }
    ::close(fd);
    v.mounted = true;
    if (reg.explicitlyUnmounted)
        UpdateRegistered(reg.name, [](RegisteredVolume& r) { r.explicitlyUnmounted = false; });
}

// ---- objects -------------------------------------------------------------------------------

class LinuxFileSystem : public virtual FileSystem {
public:
    explicit LinuxFileSystem(VolumePtr volume) : v_(std::move(volume)) {}

protected:
    template <typename F>
    auto On(std::string_view call, const J* args, F&& body)
    {
        const Journal entry{v_->volumeName, args ? *args : J()};
        return Call(call, args ? &entry : nullptr, std::forward<F>(body));
    }
    const HostLinux::Capacity& Capacity()
    {
        if (!v_->mounted)
            return kNothing;
        if (!v_->capacity && v_->capacityError.empty())
            Measure(*v_);
        if (!v_->capacity)
            throw std::runtime_error(v_->capacityError);
        return *v_->capacity;
    }
    Volume& volume() { return *v_; }

public:
    void Mount(MountOperationOption option) override
    {
        const J args = J::array({static_cast<int>(option)});
        On("FileSystem.Mount", &args, [&] {
            if (!v_->registered)
                NotAvailable("FileSystem.Mount");
            MountRegistered(*v_);
        });
    }
    int Unmount(MountOperationOption option) override
    {
        const J args = J::array({static_cast<int>(option)});
        return On("FileSystem.Unmount", &args, [&] {
            if (!v_->registered)
                throw std::runtime_error(NotAddedHere(*v_));
            if (UnmountPath(v_->mountPoint) == 1)
                return 1;
            v_->mounted = false;
            const bool persistent = option == MOUNT_PERSISTENT;
            if (v_->registered->explicitlyUnmounted != persistent)
                UpdateRegistered(v_->volumeName, [&](RegisteredVolume& r) { r.explicitlyUnmounted = persistent; });
            return 0;
        });
    }
    bool IsMounted() override { return v_->mounted; }
    std::uint64_t GetCapacity() override
    {
        return On("FileSystem.GetCapacity", nullptr, [&] { return Capacity().size; });
    }
    std::uint64_t GetUsedSpace() override
    {
        // Reserved blocks count as used: what is free is what the machine lets us write.
        return On("FileSystem.GetUsedSpace", nullptr, [&] { return Capacity().size - Capacity().available; });
    }
    std::string GetType() override { return v_->type; }
    std::string GetMountPoint() override { return v_->mountPoint; }
    std::string GetVolumeName() override { return v_->volumeName; }
    std::string GetUuid() override { return v_->uuid; }
    std::string GetName() override { return v_->volumeName; }
    void PrepareUnmount() override
    {
        const J args = J::array();
        On("FileSystem.PrepareUnmount", &args, [] {});
    }
    HostCtl::Storage::QAXIState GetQAXIState() override { return HostCtl::Storage::QAXI_UNKNOWN; }

private:
    static inline const HostLinux::Capacity kNothing{};
    VolumePtr v_;
};

class LinuxPlainFileSystem final : public LinuxFileSystem {
public:
    using LinuxFileSystem::LinuxFileSystem;
};

class LinuxNetworkFileSystem final : public NetworkFileSystem, public LinuxFileSystem {
public:
    explicit LinuxNetworkFileSystem(VolumePtr volume) : LinuxFileSystem(std::move(volume)) {}

    using LinuxFileSystem::Mount;
    void Mount(unsigned flags) override
    {
        const J args = J::array({flags});
        On("NetworkFileSystem.Mount", &args, [&] {
            if (!volume().registered)
                throw std::runtime_error(NotAddedHere(volume()));
            MountRegistered(volume());
        });
    }
    bool IsAccessible() override
    {
        return On("NetworkFileSystem.IsAccessible", nullptr, [&] {
            if (!volume().mounted)
                return false;
            try {
                return StatWithin(volume().mountPoint, kStatSeconds).has_value();
            } catch (const std::exception&) {
                return false;
            }
        });
    }
    std::string GetRemoteHost() override { return volume().remote.host; }
    std::vector<std::string> GetRemoteHosts() override
    {
        if (volume().registered && !volume().registered->hosts.empty())
            return volume().registered->hosts;
        return {volume().remote.host};
    }
    std::string GetRemoteShare() override { return volume().remote.share; }
    bool IsReadOnly() override { return ReadOnly(); }
    bool GetReadOnlyState() override { return ReadOnly(); }
    void SetReadOnly(bool readOnly) override
    {
        const J args = J::array({readOnly});
        On("NetworkFileSystem.SetReadOnly", &args, [&] {
            if (ReadOnly() == readOnly)
                return;
            if (!volume().registered || volume().mounted)
                throw std::runtime_error(volume().registered ? "Volume '" + volume().volumeName +
                                                                   "' is mounted: unmount it to change read-only"
                                                             : NotAddedHere(volume()));
            UpdateRegistered(volume().volumeName, [&](RegisteredVolume& r) { r.readOnly = readOnly; });
            volume().registered->readOnly = readOnly;
        });
    }
    bool IsPE() override { return false; }
    void SetPE(bool isPE) override
    {
        const J args = J::array({isPE});
        On("NetworkFileSystem.SetPE", &args, [&] {
            if (!isPE)
                return;
            // The add that made this volume fails here, before any mount: its definition must
            // not stay behind as if the add had worked.
            if (volume().freshlyAdded && !volume().mounted)
                TheRegistry().Update([&](std::vector<RegisteredVolume>& volumes) {
                    volumes.erase(
                        std::remove_if(volumes.begin(), volumes.end(),
                                       [&](const RegisteredVolume& r) { return r.name == volume().volumeName; }),
                        volumes.end());
                });
            NotAvailable("NetworkFileSystem.SetPE");
        });
    }
    std::string GetKnxnic() override { return {}; }
    std::string GetKnxnics() override { return {}; }
    void SetKnxnics(const std::string& knxnics) override
    {
        const J args = J::array({knxnics});
        On("NetworkFileSystem.SetKnxnics", &args, [] { NotAvailable("NetworkFileSystem.SetKnxnics"); });
    }
    std::int64_t GetConnections() override
    {
        if (MountedNfs())
            return volume().options.connections;
        return volume().registered ? volume().registered->connections : 1;
    }
    std::int32_t GetConnectionsParam() override
    {
        return static_cast<std::int32_t>(volume().registered ? volume().registered->connections : GetConnections());
    }
    void SetConnectionsParam(std::int32_t connections) override
    {
        const J args = J::array({connections});
        On("NetworkFileSystem.SetConnectionsParam", &args, [&] {
            if (!volume().registered)
                throw std::runtime_error(NotAddedHere(volume()));
            // Takes effect at the next mount, as nconnect is fixed for a mount's life.
            UpdateRegistered(volume().volumeName, [&](RegisteredVolume& r) { r.connections = connections; });
            volume().registered->connections = connections;
        });
    }
    std::uint32_t GetMaxReadTransferSize() override { return volume().options.rsize; }
    std::uint32_t GetMaxWriteTransferSize() override { return volume().options.wsize; }
    std::uint32_t GetMaxQueueDepth() override { return 4294967295u; }
    void SetMaxQueueDepth(std::uint32_t depth, bool apply) override
    {
        const J args = J::array({depth, apply});
        On("NetworkFileSystem.SetMaxQueueDepth", &args, [] { NotAvailable("NetworkFileSystem.SetMaxQueueDepth"); });
    }
    SecurityType GetSecurityType() override
    {
        if (MountedNfs())
            return SecurityFromOption(volume().options.security);
        return volume().registered ? static_cast<SecurityType>(volume().registered->security) : SEC_NONE;
    }

private:
    // Mounted as NFS, so the mount's own options tell the truth.
    bool MountedNfs() { return volume().mounted && !volume().source.empty(); }
    bool ReadOnly()
    {
        if (MountedNfs())
            return volume().options.readOnly;
        return volume().registered && volume().registered->readOnly;
    }
};

std::unique_ptr<FileSystem> MakeObject(const VolumePtr& v)
{
    if (v->nfs)
        return std::make_unique<LinuxNetworkFileSystem>(v);
    return std::make_unique<LinuxPlainFileSystem>(v);
}

// ---- host-wide objects ---------------------------------------------------------------------

class LinuxStorageInfo final : public HostCtl::Storage::StorageInfo {
public:
    std::vector<std::unique_ptr<HlFileSystem>> GetHlfsFileSystems(const std::string&) override { return {}; }
    std::unique_ptr<HlFileSystem> GetHlfsFileSystemByUuid(const std::string&) override { return nullptr; }
    std::unique_ptr<HlFileSystem> GetHlfsFileSystemByLabel(const std::string&) override { return nullptr; }
    std::unique_ptr<HostCtl::Storage::PointerBlockCache> GetPointerBlockCache() override
    {
        NotAvailable("StorageInfo.GetPointerBlockCache");
    }
};

// The HLFS heaps and their pointer block cache have no counterpart on Linux.
class LinuxMemoryInfo final : public HostCtl::MemoryInfo {
public:
    std::vector<std::unique_ptr<HostCtl::HeapRecord>> GetHeapStats() override
    {
        NotAvailable("MemoryInfo.GetHeapStats");
    }
};

class LinuxHardwareInfo final : public HostCtl::HardwareInfo {
public:
    std::unique_ptr<HostCtl::MemoryInfo> GetMemoryInfo() override { return std::make_unique<LinuxMemoryInfo>(); }
};

class OnlineUpgradeOption final : public HostCtl::AdvancedIntegerOption {
public:
    std::string GetName() override { return "EnableOnlineATSUpgrade"; }
    std::int64_t GetValue() override { return 0; }
};

// Of the host's advanced options only HLFS3/EnableOnlineATSUpgrade has an answer here: off,
// as there is no HLFS volume to upgrade.
class LinuxOptionGroup final : public HostCtl::AdvancedOptionGroup {
public:
    std::unique_ptr<HostCtl::AdvancedOption> GetOption(const std::string& name) override
    {
        if (name == "EnableOnlineATSUpgrade")
            return std::make_unique<OnlineUpgradeOption>();
        throw HostCtlException("Advanced option 'HLFS3/" + name + "' not found");
    }
};

class LinuxAdvancedOptions final : public HostCtl::AdvancedOptions {
public:
    std::unique_ptr<HostCtl::AdvancedOptionGroup> GetOptionGroup(const std::string& name) override
    {
        if (name == "HLFS3")
            return std::make_unique<LinuxOptionGroup>();
        throw HostCtlException("Advanced option group '" + name + "' not found");
    }
};

class LinuxHostObject final : public HostCtl::Host {
public:
    std::unique_ptr<HostCtl::Storage::StorageInfo> GetStorageInfo() override
    {
        return std::make_unique<LinuxStorageInfo>();
    }
    std::unique_ptr<HostCtl::HardwareInfo> GetHardwareInfo() override { return std::make_unique<LinuxHardwareInfo>(); }
    std::unique_ptr<HostCtl::AdvancedOptions> GetAdvancedOptions() override
    {
        return std::make_unique<LinuxAdvancedOptions>();
    }
};

HostLinux::Ruleset RulesetOf(NfsVersion version)
{
    if (version == HostCtl::Storage::NFS_VERSION_3)
        return HostLinux::Ruleset::NfsClient;
    if (version == HostCtl::Storage::NFS_VERSION_41)
        return HostLinux::Ruleset::Nfs41Client;
    throw HostCtlException("Unknown NFS version " + std::to_string(static_cast<int>(version)));
}

void SetFeatures(bool on)
{
    const int indexes[4] = {102, 103, 104, 270};
    for (int index : indexes)
        if (FeatureList[index])
            *FeatureList[index] = on && index == 103 ? 1 : 0;
}

} // namespace

void OpenSession()
{
    HostSim::CloseSession();
    gActive = true;
    SetFeatures(true);
}

void CloseSession()
{
    gActive = false;
    SetFeatures(false);
}

bool Active() { return gActive; }

void NotAvailable(const std::string& call) { throw HostCtlException(call + " is not available on a Linux host"); }

namespace Storage {

std::vector<std::unique_ptr<FileSystem>> GetFileSystems()
{
    return Call("StorageInfoImpl.GetFileSystems", nullptr, [] {
        std::vector<std::unique_ptr<FileSystem>> result;
        for (const auto& v : Look().mounted)
            result.push_back(MakeObject(v));
        return result;
    });
}

std::unique_ptr<FileSystem> GetFileSystemByUuid(const std::string& call, const std::string& uuid)
{
    return Call(call, nullptr, [&]() -> std::unique_ptr<FileSystem> {
        for (const auto& v : Everything(Look()))
            if (!v->uuid.empty() && v->uuid == uuid)
                return MakeObject(v);
        return nullptr;
    });
}

std::unique_ptr<FileSystem> GetFileSystemByLabel(const std::string& label)
{
    return Call("StorageInfoImpl.GetFileSystemByLabel", nullptr, [&]() -> std::unique_ptr<FileSystem> {
        // A name this tool registered comes first: it is the one the user gave.
        const Scan scan = Look();
        const auto all = Everything(scan);
        for (const auto& v : all)
            if (v->registered && v->volumeName == label)
                return MakeObject(v);
        for (const auto& v : all)
            if (v->volumeName == label)
                return MakeObject(v);
        return nullptr;
    });
}

std::unique_ptr<FileSystem> GetFileSystemByPath(const std::string& path)
{
    return Call("StorageInfoImpl.GetFileSystemByPath", nullptr, [&]() -> std::unique_ptr<FileSystem> {
        for (const auto& v : Everything(Look()))
            if (v->mounted && v->mountPoint == path)
                return MakeObject(v);
        return nullptr;
    });
}

bool TryMount(FileSystem::MountOperationOption option, const std::string& uuid, const std::string& label)
{
    const Journal journal{label, J::array({static_cast<int>(option), uuid, label})};
    return Call("StorageInfoImpl.TryMount", &journal, [] { return false; });
}

void SignalIORM(bool signal)
{
    const Journal journal{"", J::array({signal})};
    Call("StorageInfoImpl.SignalIORM", &journal, [] {});
}

void RescanHlfs()
{
    const Journal journal{"", J::array()};
    Call("StorageInfoImpl.RescanHlfs", &journal, [] {});
}

void AutoFullMountVolumes()
{
    const Journal journal{"", J::array()};
    Call("StorageInfoImpl.AutoFullMountVolumes", &journal, [] {
        std::string firstFailure;
        for (const auto& v : Look().registeredOnly) {
            if (v->mounted || v->registered->explicitlyUnmounted)
                continue;
            try {
                MountRegistered(*v);
            } catch (const std::exception& e) {
                if (firstFailure.empty())
                    firstFailure = e.what();
            }
        }
        if (!firstFailure.empty())
            throw std::runtime_error(firstFailure);
    });
}

void RestorePsaConfig()
{
    const Journal journal{"", J::array()};
    Call("StorageInfoImpl.RestorePsaConfig", &journal, [] { NotAvailable("StorageInfoImpl.RestorePsaConfig"); });
}

namespace {

std::unique_ptr<NetworkFileSystem> Register(RegisteredVolume reg)
{
    if (!IsUsableVolumeName(reg.name))
        throw std::runtime_error(
            "Volume name '" + reg.name +
            "' cannot be used on a Linux host: it must be a folder name (no '/', not '.' or '..')");
    if (reg.hosts.empty() || reg.hosts.front().empty())
        throw std::runtime_error("NFS volume '" + reg.name + "' needs a server");
    // A volume that could never be mounted here is not recorded at all.
    RequireNfsClient(ReadFilesystemKinds(), reg.v41);
    for (const auto& v : Look().mounted)
        if (v->volumeName == reg.name)
            throw std::runtime_error("A volume named '" + reg.name + "' already exists");
    TheRegistry().Update([&](std::vector<RegisteredVolume>& volumes) {
        for (const auto& v : volumes)
            if (v.name == reg.name)
                throw std::runtime_error("A volume named '" + reg.name + "' already exists");
        volumes.push_back(reg);
    });
    auto v = FromRegistry(reg, TheRegistry());
    v->freshlyAdded = true;
    return std::make_unique<LinuxNetworkFileSystem>(v);
}

} // namespace

std::unique_ptr<NetworkFileSystem> AddNetworkFileSystem(const std::string& host, const std::string& share,
                                                        const std::string& volumeName, bool knxnicBound,
                                                        const std::string& knxnic, std::uint32_t queueDepth,
                                                        std::int64_t connections)
{
    const Journal journal{volumeName,
                          J::array({host, share, volumeName, knxnicBound, knxnic, queueDepth, connections})};
    return Call("StorageInfoImpl.AddNetworkFileSystem", &journal, [&] {
        if (knxnicBound)
            NotAvailable("Binding an NFS volume to a knxnic");
        if (queueDepth != 0)
            NotAvailable("NetworkFileSystem.SetMaxQueueDepth");
        RegisteredVolume reg;
        reg.name = volumeName;
        reg.hosts = {host};
        reg.share = share;
        reg.connections = connections < 1 ? 1 : connections;
        return Register(std::move(reg));
    });
}

std::unique_ptr<NetworkFileSystem> AddV41NetworkFileSystem(const std::vector<std::string>& hosts,
                                                           const std::string& share, const std::string& volumeName,
                                                           NetworkFileSystem::SecurityType security, bool knxnicBound)
{
    const Journal journal{volumeName, J::array({hosts, share, volumeName, static_cast<int>(security), knxnicBound})};
    return Call("StorageInfoImpl.AddV41NetworkFileSystem", &journal, [&] {
        if (knxnicBound)
            NotAvailable("Binding an NFS volume to a knxnic");
        RegisteredVolume reg;
        reg.name = volumeName;
        reg.v41 = true;
        reg.hosts = hosts;
        reg.share = share;
        reg.security = static_cast<int>(security);
        return Register(std::move(reg));
    });
}

void RemoveNetworkFileSystem(const std::string& volumeName, int version)
{
    const Journal journal{volumeName, version == 0 ? J::array({volumeName}) : J::array({volumeName, version})};
    Call("StorageInfoImpl.RemoveNetworkFileSystem", &journal, [&] {
        VolumePtr found;
        for (const auto& v : Everything(Look()))
            if (v->registered && v->volumeName == volumeName &&
                (version == 0 || (version == HostCtl::Storage::NFS_VERSION_41) == v->registered->v41))
                found = v;
        if (!found)
            throw std::runtime_error("NFS volume '" + volumeName + "' not found");
        if (found->mounted && UnmountPath(found->mountPoint) == 1)
            throw std::runtime_error("Volume '" + volumeName + "' is busy");
        TheRegistry().Update([&](std::vector<RegisteredVolume>& volumes) {
            volumes.erase(std::remove_if(volumes.begin(), volumes.end(),
                                         [&](const RegisteredVolume& r) { return r.name == volumeName; }),
                          volumes.end());
        });
        // The empty mount point goes with the volume; anything else there stays.
        ::rmdir(TheRegistry().MountPoint(volumeName).c_str());
    });
}

std::vector<std::unique_ptr<NetworkFileSystem>> GetNetworkFileSystems(bool v41, NfsFilter filter)
{
    return Call(v41 ? "StorageInfoImpl.GetV41NetworkFileSystems" : "StorageInfoImpl.GetV3NetworkFileSystems", nullptr,
                [&] {
                    std::vector<std::unique_ptr<NetworkFileSystem>> result;
                    for (const auto& v : Everything(Look())) {
                        const bool wanted = v->registered ? v->registered->v41 == v41
                                                          : (v41 ? v->type == "NFS41" : v->kind == MountKind::Nfs3);
                        if (!wanted)
                            continue;
                        auto object = std::make_unique<LinuxNetworkFileSystem>(v);
                        if (!filter || filter(*object))
                            result.push_back(std::move(object));
                    }
                    return result;
                });
}

void PreUnmount(const std::string& call, const std::string& volumeName)
{
    const Journal journal{volumeName, J::array({volumeName})};
    Call(call, &journal, [&] { NotAvailable(call); });
}

void AddNasFirewallConfig(const std::string& ipMask, NfsVersion version)
{
    const Journal journal{"", J::array({ipMask, static_cast<int>(version)})};
    Call("StorageInfoImpl.AddNasFirewallConfig", &journal, [&] { AddToRuleset(RulesetOf(version), ipMask); });
}

void RemoveNasFirewallConfig(const std::string& ipMask, NfsVersion version)
{
    const Journal journal{"", J::array({ipMask, static_cast<int>(version)})};
    Call("StorageInfoImpl.RemoveNasFirewallConfig", &journal, [&] { RemoveFromRuleset(RulesetOf(version), ipMask); });
}

std::vector<std::string> GetNasFirewallConfigs(NfsVersion version)
{
    return Call("StorageInfoImpl.GetNasFirewallConfigs", nullptr, [&] { return ListRuleset(RulesetOf(version)); });
}

} // namespace Storage

void OpenHlfs(const std::string& path)
{
    const Journal journal{"", J::array({path})};
    Call("HlFileSystemImpl.new", &journal,
         [&] { throw HostCtlException("Cannot open HLFS volume at '" + path + "'"); });
}

HostCtl::Host* GetHost()
{
    static LinuxHostObject host;
    return &host;
}

} // namespace HostLinux
