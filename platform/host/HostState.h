#pragma once

// The simulated host's state: what one state file holds, how it is read, checked and written.

#include <cstdint>
#include <iosfwd>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <type_traits>
#include <unordered_map>
#include <utility>
#include <variant>
#include <vector>

#include "hostctl/Storage.h"

namespace HostSim::Model {

// A state text that cannot be used; the message names the file and the place.
class StateError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

enum class FsKind : std::uint8_t { Hlfs, Nfs, Nfs41, Plain };

FsKind KindOfType(std::string_view type);

struct Extent {
    std::string deviceName;
    std::uint8_t partition = 0;
    bool null = false; // an entry the host hands out as an empty pointer
};

struct User {
    std::string heartbeatUuid;
    std::string macAddress = "00:00:00:00:00:00"; // canonical lower-case form
    std::uint32_t driverVersionMajor = 0;
    std::uint32_t driverVersionMinor = 0;
    std::int64_t heartbeatOffset = 0;
    std::uint8_t lockModeInUse = 0;
    bool live = true;
};

struct UnmapProperty {
    std::uint32_t granularity = 1048576;
    std::string priority = "low";
    std::int32_t bandwidth = 0;
    std::int32_t reserved = 0;
    std::string method = "priority";
};

struct HlfsFields {
    std::int32_t majorVersion = 6;
    std::string lvmUuid;
    std::uint32_t lockMode = 0;
    std::int32_t atsSupport = 1;
    std::vector<Extent> extents;
    std::vector<User> users;
    UnmapProperty unmapProperty;
    bool clusteredHdskEnabled = false;
};

struct NfsFields {
    std::string remoteHost;
    std::vector<std::string> remoteHosts;
    std::string remoteShare;
    bool readOnly = false;
    bool readOnlyState = false;
    bool isPE = false;
    bool hidden = false;
    std::string knxnic;
    std::string knxnics;
    std::int64_t connections = 1;
    std::int32_t connectionsParam = 1;
    std::uint32_t maxQueueDepth = 4294967295u;
    std::uint32_t maxReadTransferSize = 1048576;
    std::uint32_t maxWriteTransferSize = 1048576;
    std::int32_t securityType = 0;
};

// Keys of a file system entry; a bit is set when the key is to be written back.
enum class FsKey : std::uint8_t {
    type,
    volumeName,
    name,
    uuid,
    mountPoint,
    mounted,
    accessible,
    capacity,
    used,
    qaxiState,
    busy,
    explicitlyUnmounted,
    majorVersion,
    lvmUuid,
    lockMode,
    atsSupport,
    extents,
    users,
    unmapProperty,
    clusteredHdskEnabled,
    remoteHost,
    remoteHosts,
    remoteShare,
    readOnly,
    readOnlyState,
    isPE,
    hidden,
    knxnic,
    knxnics,
    connections,
    connectionsParam,
    maxQueueDepth,
    maxReadTransferSize,
    maxWriteTransferSize,
    securityType,
    preUnmount,
    count
};

struct FileSystemRecord {
    std::uint64_t id = 0; // stable within one session; host objects refer to it
    FsKind kind = FsKind::Plain;
    std::string type;
    std::string volumeName;
    std::string name;       // defaults resolved at load: volumeName
    std::string uuid;       // derived from volumeName
    std::string mountPoint; // "/hlfs/volumes/" + uuid
    std::uint64_t capacity = 0;
    std::uint64_t used = 0;
    std::int32_t qaxiState = 0;
    bool mounted = true;
    bool accessible = true;
    bool busy = false;
    bool explicitlyUnmounted = false;
    bool preUnmount = false;
    std::uint64_t present = 0;
    // Kind-specific parts, allocated only when used, so large hosts stay small in memory.
    std::unique_ptr<HlfsFields> hlfs;
    std::unique_ptr<NfsFields> nfs;

    bool Has(FsKey key) const { return (present >> static_cast<int>(key)) & 1u; }
    void Mark(FsKey key) { present |= std::uint64_t{1} << static_cast<int>(key); }

    const HlfsFields& Hlfs() const;
    HlfsFields& MutableHlfs();
    const NfsFields& Nfs() const;
    NfsFields& MutableNfs();
};

template <typename>
struct MemberOf;
template <typename P, typename T>
struct MemberOf<T P::*> {
    using Part = P;
};

// The field `Member` of a volume's record, in whichever part holds it (the record itself, or
// its HLFS or NFS part). Through a record that is not const, a missing part is made.
template <auto Member, typename Record>
auto& Field(Record& r)
{
    using Part = typename MemberOf<decltype(Member)>::Part;
    constexpr bool reading = std::is_const_v<Record>;
    if constexpr (std::is_same_v<Part, HlfsFields>) {
        if constexpr (reading)
            return r.Hlfs().*Member;
        else
            return r.MutableHlfs().*Member;
    } else if constexpr (std::is_same_v<Part, NfsFields>) {
        if constexpr (reading)
            return r.Nfs().*Member;
        else
            return r.MutableNfs().*Member;
    } else {
        return r.*Member;
    }
}

// An extent of a volume the host has not resolved: also where it lies on its device.
struct UnresolvedExtent : Extent {
    std::int64_t start = 0;
    std::int64_t end = 0;
    bool impl = true;
};

struct UnresolvedVolume {
    std::uint64_t id = 0;
    bool null = false;
    std::string volumeName;
    std::string uuid; // derived from volumeName when not given
    bool uuidGiven = false;
    std::string lvmUuid;
    std::int32_t majorVersion = 6;
    std::uint64_t capacity = 0;
    std::uint32_t mountReason = 0;
    std::uint32_t resignatureReason = 0;
    std::vector<UnresolvedExtent> extents;
    bool impl = true;
    std::uint16_t present = 0; // keys given in the state, written back even when default

    bool Has(std::string_view key) const;
    void Mark(std::string_view key);
};

struct NfsExport {
    std::string host;
    std::string share;
    std::uint64_t capacity = 0;
    std::uint64_t used = 0;
};

struct Heap {
    std::string name;
    std::uint64_t size = 0;
    std::uint64_t maxSize = 0;
};

// Kept in the state exactly as the cache hands it out.
using PointerBlockCacheRecord = HostCtl::Storage::PointerBlockCacheStats;

struct Fault {
    std::string call;
    std::optional<std::string> target;
    std::string message;
    std::uint64_t skip = 0;
    std::optional<std::uint64_t> times;
};

using OptionValue = std::variant<std::int64_t, std::string>;
using OptionGroup = std::vector<std::pair<std::string, OptionValue>>;

// Top-level keys; a bit is set when the key is to be written back.
enum class TopKey : std::uint8_t {
    features,
    advancedOptions,
    behaviour,
    fileSystems,
    pendingRescan,
    unresolvedVolumes,
    nfsExports,
    firewall,
    heaps,
    pointerBlockCache,
    faults,
    count
};

constexpr const char* kFeatureKeys[] = {"102", "103", "104", "270"};

struct State {
    std::uint32_t present = 0;
    std::optional<bool> features[4];
    std::vector<std::pair<std::string, OptionGroup>> advancedOptions;
    std::optional<bool> tryMount;
    std::vector<FileSystemRecord> fileSystems;
    bool pendingHasFileSystems = false;
    bool pendingHasUnresolved = false;
    std::vector<FileSystemRecord> pendingFileSystems;
    std::vector<UnresolvedVolume> pendingUnresolved;
    std::vector<UnresolvedVolume> unresolvedVolumes;
    std::vector<NfsExport> nfsExports;
    std::optional<std::vector<std::string>> nfsClient;
    std::optional<std::vector<std::string>> nfs41Client;
    std::vector<Heap> heaps;
    PointerBlockCacheRecord pointerBlockCache;
    std::vector<Fault> faults;

    std::uint64_t nextFileSystemId = 1;
    std::uint64_t nextUnresolvedId = 1;

    bool Has(TopKey key) const { return (present >> static_cast<int>(key)) & 1u; }
    void Mark(TopKey key) { present |= 1u << static_cast<int>(key); }
    bool Feature(int index) const { return features[index].value_or(false); }
};

// Reads and checks a state text; `source` names it in messages. Throws StateError.
State Parse(std::istream& in, const std::string& source);
// The built-in demo host.
State Demo();
// Writes the state in the file format (indented JSON, file systems streamed one by one).
void Write(const State& state, std::ostream& out);

// Fills in the defaults of a file system that are derived from its other keys.
void ResolveDefaults(FileSystemRecord& fs);
void ResolveDefaults(UnresolvedVolume& volume);

// A UUID in the host's format, derived deterministically from a text.
std::string UuidFromText(std::string_view text);

} // namespace HostSim::Model
