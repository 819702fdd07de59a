#include "HostState.h"

#include <algorithm>
#include <cinttypes>
#include <cstdio>
#include <cstring>
#include <functional>
#include <istream>
#include <limits>
#include <ostream>
#include <sstream>
#include <unordered_map>

#include <nlohmann/json.hpp>

namespace HostSim::Model {

namespace {

using json = nlohmann::json;
using ojson = nlohmann::ordered_json;

constexpr std::size_t kQuoteLimit = 80;

// A text quoted in a message: long ones are cut, so a huge key or value never makes a huge
// message. The cut never splits a UTF-8 sequence.
std::string Cut(std::string_view text)
{
    if (text.size() <= kQuoteLimit)
        return std::string(text);
    std::size_t end = kQuoteLimit;
    while (end > 0 && (static_cast<unsigned char>(text[end]) & 0xC0) == 0x80)
        --end;
    return std::string(text.substr(0, end)) + "...";
}

// Where a value sits in the state, built into text only when a message needs it.
struct Where {
    const Where* parent = nullptr;
    std::string_view key;
    long index = -1;

    std::string Text() const
    {
        std::string text = parent ? parent->Text() : std::string();
        if (index >= 0) {
            text += "[" + std::to_string(index) + "]";
        } else {
            if (!text.empty())
                text += ".";
            text += Cut(key);
        }
        return text;
    }
    Where operator/(std::string_view child) const { return Where{this, child, -1}; }
    Where operator[](long i) const { return Where{this, {}, i}; }
};

struct PlaceError {
    std::string where;
    std::string what;
};

[[noreturn]] void Fail(const Where& where, std::string what) { throw PlaceError{where.Text(), std::move(what)}; }

[[noreturn]] void WrongType(const Where& where, const char* expected, const json& value)
{
    Fail(where, std::string("expected ") + expected + ", found " + value.type_name());
}

[[noreturn]] void UnknownKey(const Where& where) { Fail(where, "unknown key"); }

const std::string& Str(const json& v, const Where& w)
{
    if (!v.is_string())
        WrongType(w, "a string", v);
    return v.get_ref<const std::string&>();
}

bool Bool(const json& v, const Where& w)
{
    if (!v.is_boolean())
        WrongType(w, "true or false", v);
    return v.get<bool>();
}

std::uint64_t Unsigned(const json& v, const Where& w, std::uint64_t max = std::numeric_limits<std::uint64_t>::max())
{
    if (!v.is_number_integer())
        WrongType(w, "an unsigned integer", v);
    if (!v.is_number_unsigned() || v.get<std::uint64_t>() > max)
        Fail(w, v.dump() + " is out of range (0 to " + std::to_string(max) + ")");
    return v.get<std::uint64_t>();
}

std::int64_t Signed(const json& v, const Where& w, std::int64_t min, std::int64_t max)
{
    if (!v.is_number_integer())
        WrongType(w, "an integer", v);
    bool inRange = v.is_number_unsigned() ? v.get<std::uint64_t>() <= static_cast<std::uint64_t>(max)
                                          : (v.get<std::int64_t>() >= min && v.get<std::int64_t>() <= max);
    if (!inRange)
        Fail(w, v.dump() + " is out of range (" + std::to_string(min) + " to " + std::to_string(max) + ")");
    return v.get<std::int64_t>();
}

std::int32_t Int32(const json& v, const Where& w)
{
    return static_cast<std::int32_t>(
        Signed(v, w, std::numeric_limits<std::int32_t>::min(), std::numeric_limits<std::int32_t>::max()));
}

std::uint32_t Uint32(const json& v, const Where& w)
{
    return static_cast<std::uint32_t>(Unsigned(v, w, std::numeric_limits<std::uint32_t>::max()));
}

std::uint8_t Uint8(const json& v, const Where& w) { return static_cast<std::uint8_t>(Unsigned(v, w, 255)); }

const json& Object(const json& v, const Where& w)
{
    if (!v.is_object())
        WrongType(w, "an object", v);
    return v;
}

const json& Array(const json& v, const Where& w)
{
    if (!v.is_array())
        WrongType(w, "an array", v);
    return v;
}

std::vector<std::string> Strings(const json& v, const Where& w)
{
    std::vector<std::string> result;
    long i = 0;
    for (const auto& item : Array(v, w))
        result.push_back(Str(item, w[i++]));
    return result;
}

// Calls `field(key, value, where)` for every key of the object at `w`.
template <typename F>
void EachKey(const json& v, const Where& w, F&& field)
{
    for (const auto& [key, value] : Object(v, w).items())
        field(key, value, w / key);
}

std::string CanonicalMac(const json& v, const Where& w)
{
    const std::string& text = Str(v, w);
    unsigned bytes[6];
    char tail;
    if (text.size() != 17 || std::sscanf(text.c_str(), "%2x:%2x:%2x:%2x:%2x:%2x%c", &bytes[0], &bytes[1], &bytes[2],
                                         &bytes[3], &bytes[4], &bytes[5], &tail) != 6)
        Fail(w, "expected a MAC address like 00:1e:67:c4:d2:a8, found '" + Cut(text) + "'");
    char out[18];
    std::snprintf(out, sizeof out, "%02x:%02x:%02x:%02x:%02x:%02x", bytes[0], bytes[1], bytes[2], bytes[3], bytes[4],
                  bytes[5]);
    return out;
}

std::uint64_t U64(const json& v, const Where& w) { return Unsigned(v, w); }

std::int64_t I64(const json& v, const Where& w)
{
    return Signed(v, w, std::numeric_limits<std::int64_t>::min(), std::numeric_limits<std::int64_t>::max());
}

// ---- records ------------------------------------------------------------------------------

template <typename T>
ojson ToJson(const T& value)
{
    return value;
}

template <typename T>
ojson ToJson(const std::optional<T>& value)
{
    return value ? ojson(*value) : ojson(nullptr);
}

// One key of a record in the state: how it is read into the record and written out of it.
template <typename T>
struct Key {
    const char* name;
    void (*read)(T&, const json&, const Where&);
    ojson (*write)(const T&);
};

// The key that holds member `Member` of a `T`, read by `Read`, which checks the value.
template <auto Member, auto Read, typename T = typename MemberOf<decltype(Member)>::Part>
constexpr Key<T> KeyOf(const char* name)
{
    return {name, [](T& r, const json& v, const Where& w) { r.*Member = Read(v, w); },
            [](const T& r) { return ToJson(r.*Member); }};
}

// Reads the object at `w` into `r`; a key `keys` does not list is an error.
template <typename T, std::size_t N>
void ReadKeys(T& r, const json& v, const Where& w, const Key<T> (&keys)[N])
{
    EachKey(v, w, [&](const std::string& name, const json& value, const Where& at) {
        for (const auto& key : keys) {
            if (name == key.name) {
                key.read(r, value, at);
                return;
            }
        }
        UnknownKey(at);
    });
}

// Appends the records of the array at `w` to `out`.
template <typename T, std::size_t N>
void ReadRecords(std::vector<T>& out, const json& v, const Where& w, const Key<T> (&keys)[N])
{
    long i = 0;
    for (const auto& item : Array(v, w)) {
        T r;
        ReadKeys(r, item, w[i++], keys);
        out.push_back(std::move(r));
    }
}

// Every key of `r`, in the order `keys` lists them.
template <typename T, std::size_t N>
ojson WriteKeys(const T& r, const Key<T> (&keys)[N])
{
    ojson out = ojson::object();
    for (const auto& key : keys)
        out[key.name] = key.write(r);
    return out;
}

template <typename T, typename F>
ojson ListOf(const std::vector<T>& items, F&& convert)
{
    ojson list = ojson::array();
    for (const auto& item : items)
        list.push_back(convert(item));
    return list;
}

const Key<Extent> kExtentKeys[] = {KeyOf<&Extent::deviceName, Str>("deviceName"),
                                   KeyOf<&Extent::partition, Uint8>("partition")};

const Key<UnresolvedExtent> kUnresolvedExtentKeys[] = {
    KeyOf<&Extent::deviceName, Str, UnresolvedExtent>("deviceName"),
    KeyOf<&Extent::partition, Uint8, UnresolvedExtent>("partition"), KeyOf<&UnresolvedExtent::start, I64>("start"),
    KeyOf<&UnresolvedExtent::end, I64>("end"), KeyOf<&UnresolvedExtent::impl, Bool>("impl")};

const Key<User> kUserKeys[] = {KeyOf<&User::heartbeatUuid, Str>("heartbeatUuid"),
                               KeyOf<&User::macAddress, CanonicalMac>("macAddress"),
                               KeyOf<&User::driverVersionMajor, Uint32>("driverVersionMajor"),
                               KeyOf<&User::driverVersionMinor, Uint32>("driverVersionMinor"),
                               KeyOf<&User::heartbeatOffset, I64>("heartbeatOffset"),
                               KeyOf<&User::lockModeInUse, Uint8>("lockModeInUse"),
                               KeyOf<&User::live, Bool>("live")};

const Key<UnmapProperty> kUnmapKeys[] = {
    KeyOf<&UnmapProperty::granularity, Uint32>("granularity"), KeyOf<&UnmapProperty::priority, Str>("priority"),
    KeyOf<&UnmapProperty::bandwidth, Int32>("bandwidth"), KeyOf<&UnmapProperty::reserved, Int32>("reserved"),
    KeyOf<&UnmapProperty::method, Str>("method")};

const Key<NfsExport> kNfsExportKeys[] = {KeyOf<&NfsExport::host, Str>("host"), KeyOf<&NfsExport::share, Str>("share"),
                                         KeyOf<&NfsExport::capacity, U64>("capacity"),
                                         KeyOf<&NfsExport::used, U64>("used")};

const Key<Heap> kHeapKeys[] = {KeyOf<&Heap::name, Str>("name"), KeyOf<&Heap::size, U64>("size"),
                               KeyOf<&Heap::maxSize, U64>("maxSize")};

using Cache = PointerBlockCacheRecord;
const Key<Cache> kCacheKeys[] = {
    KeyOf<&Cache::cacheSize, U64>("cacheSize"),       KeyOf<&Cache::cacheSizeMax, U64>("cacheSizeMax"),
    KeyOf<&Cache::workingSet, U64>("workingSet"),     KeyOf<&Cache::workingSetMax, U64>("workingSetMax"),
    KeyOf<&Cache::heapOverhead, U64>("heapOverhead"), KeyOf<&Cache::capacityMissRatio, Int32>("capacityMissRatio")};

const Key<Fault> kFaultKeys[] = {KeyOf<&Fault::call, Str>("call"), KeyOf<&Fault::target, Str>("target"),
                                 KeyOf<&Fault::message, Str>("message"), KeyOf<&Fault::skip, U64>("skip"),
                                 KeyOf<&Fault::times, U64>("times")};

// ---- file systems -------------------------------------------------------------------------

using Record = FileSystemRecord;

struct FsField {
    const char* key;
    FsKey bit;
    void (*read)(Record&, const json&, const Where&);
    ojson (*write)(const Record&);
};

ojson WriteExtents(const std::vector<Extent>& extents)
{
    ojson list = ojson::array();
    for (const auto& e : extents) {
        if (e.null)
            list.push_back(nullptr);
        else
            list.push_back(WriteKeys(e, kExtentKeys));
    }
    return list;
}

// The key that holds field `Member` of a volume's record, read by `Read`, which checks the value.
template <auto Member, auto Read>
constexpr FsField FsKeyOf(const char* key, FsKey bit)
{
    return {key, bit, [](Record& r, const json& v, const Where& w) { Field<Member>(r) = Read(v, w); },
            [](const Record& r) { return ToJson(Field<Member>(r)); }};
}

const FsField kFsFields[] = {
    FsKeyOf<&Record::type, Str>("type", FsKey::type),
    FsKeyOf<&Record::volumeName, Str>("volumeName", FsKey::volumeName),
    FsKeyOf<&Record::name, Str>("name", FsKey::name),
    FsKeyOf<&Record::uuid, Str>("uuid", FsKey::uuid),
    FsKeyOf<&Record::mountPoint, Str>("mountPoint", FsKey::mountPoint),
    FsKeyOf<&Record::mounted, Bool>("mounted", FsKey::mounted),
    FsKeyOf<&Record::accessible, Bool>("accessible", FsKey::accessible),
    FsKeyOf<&Record::capacity, U64>("capacity", FsKey::capacity),
    FsKeyOf<&Record::used, U64>("used", FsKey::used),
    FsKeyOf<&Record::qaxiState, Int32>("qaxiState", FsKey::qaxiState),
    FsKeyOf<&Record::busy, Bool>("busy", FsKey::busy),
    FsKeyOf<&Record::explicitlyUnmounted, Bool>("explicitlyUnmounted", FsKey::explicitlyUnmounted),
    FsKeyOf<&HlfsFields::majorVersion, Int32>("majorVersion", FsKey::majorVersion),
    FsKeyOf<&HlfsFields::lvmUuid, Str>("lvmUuid", FsKey::lvmUuid),
    FsKeyOf<&HlfsFields::lockMode, Uint32>("lockMode", FsKey::lockMode),
    FsKeyOf<&HlfsFields::atsSupport, Int32>("atsSupport", FsKey::atsSupport),
    {"extents", FsKey::extents,
     [](Record& r, const json& v, const Where& w) {
         auto& extents = r.MutableHlfs().extents;
         long i = 0;
         for (const auto& item : Array(v, w)) {
             Extent e;
             if (item.is_null()) {
                 e.null = true;
                 extents.push_back(std::move(e));
                 ++i;
                 continue;
             }
             ReadKeys(e, item, w[i++], kExtentKeys);
             extents.push_back(std::move(e));
         }
     },
     [](const Record& r) -> ojson { return WriteExtents(r.Hlfs().extents); }},
    {"users", FsKey::users,
     [](Record& r, const json& v, const Where& w) { ReadRecords(r.MutableHlfs().users, v, w, kUserKeys); },
     [](const Record& r) -> ojson {
         return ListOf(r.Hlfs().users, [](const User& u) { return WriteKeys(u, kUserKeys); });
     }},
    {"unmapProperty", FsKey::unmapProperty,
     [](Record& r, const json& v, const Where& w) { ReadKeys(r.MutableHlfs().unmapProperty, v, w, kUnmapKeys); },
     [](const Record& r) -> ojson { return WriteKeys(r.Hlfs().unmapProperty, kUnmapKeys); }},
    FsKeyOf<&HlfsFields::clusteredHdskEnabled, Bool>("clusteredHdskEnabled", FsKey::clusteredHdskEnabled),
    FsKeyOf<&NfsFields::remoteHost, Str>("remoteHost", FsKey::remoteHost),
    FsKeyOf<&NfsFields::remoteHosts, Strings>("remoteHosts", FsKey::remoteHosts),
    FsKeyOf<&NfsFields::remoteShare, Str>("remoteShare", FsKey::remoteShare),
    FsKeyOf<&NfsFields::readOnly, Bool>("readOnly", FsKey::readOnly),
    FsKeyOf<&NfsFields::readOnlyState, Bool>("readOnlyState", FsKey::readOnlyState),
    FsKeyOf<&NfsFields::isPE, Bool>("isPE", FsKey::isPE),
    FsKeyOf<&NfsFields::hidden, Bool>("hidden", FsKey::hidden),
    FsKeyOf<&NfsFields::knxnic, Str>("knxnic", FsKey::knxnic),
    FsKeyOf<&NfsFields::knxnics, Str>("knxnics", FsKey::knxnics),
    FsKeyOf<&NfsFields::connections, I64>("connections", FsKey::connections),
    FsKeyOf<&NfsFields::connectionsParam, Int32>("connectionsParam", FsKey::connectionsParam),
    FsKeyOf<&NfsFields::maxQueueDepth, Uint32>("maxQueueDepth", FsKey::maxQueueDepth),
    FsKeyOf<&NfsFields::maxReadTransferSize, Uint32>("maxReadTransferSize", FsKey::maxReadTransferSize),
    FsKeyOf<&NfsFields::maxWriteTransferSize, Uint32>("maxWriteTransferSize", FsKey::maxWriteTransferSize),
    FsKeyOf<&NfsFields::securityType, Int32>("securityType", FsKey::securityType),
    FsKeyOf<&Record::preUnmount, Bool>("preUnmount", FsKey::preUnmount)};

static_assert(std::size(kFsFields) == static_cast<std::size_t>(FsKey::count));

const FsField* FindFsField(std::string_view key)
{
    static const auto index = [] {
        std::unordered_map<std::string_view, const FsField*> map;
        for (const auto& field : kFsFields)
            map.emplace(field.key, &field);
        return map;
    }();
    auto it = index.find(key);
    return it == index.end() ? nullptr : it->second;
}

Record ReadFileSystem(const json& v, const Where& w)
{
    Record r;
    EachKey(v, w, [&](const std::string& key, const json& value, const Where& at) {
        const FsField* field = FindFsField(key);
        if (!field)
            UnknownKey(at);
        field->read(r, value, at);
        r.Mark(field->bit);
    });
    for (FsKey required : {FsKey::type, FsKey::volumeName})
        if (!r.Has(required))
            Fail(w, std::string("missing required key '") + kFsFields[static_cast<int>(required)].key + "'");
    r.kind = KindOfType(r.type);
    ResolveDefaults(r);
    return r;
}

ojson WriteFileSystem(const Record& r)
{
    ojson out = ojson::object();
    for (const auto& field : kFsFields)
        if (r.Has(field.bit))
            out[field.key] = field.write(r);
    return out;
}

// ---- unresolved volumes -------------------------------------------------------------------

UnresolvedVolume ReadUnresolved(const json& v, const Where& w)
{
    UnresolvedVolume u;
    if (v.is_null()) {
        u.null = true;
        return u;
    }
    if (!v.is_object())
        WrongType(w, "an object or null", v);
    EachKey(v, w, [&](const std::string& key, const json& value, const Where& at) {
        u.Mark(key);
        if (key == "volumeName") {
            u.volumeName = Str(value, at);
        } else if (key == "uuid") {
            u.uuid = Str(value, at);
            u.uuidGiven = true;
        } else if (key == "lvmUuid") {
            u.lvmUuid = Str(value, at);
        } else if (key == "majorVersion") {
            u.majorVersion = Int32(value, at);
        } else if (key == "capacity") {
            u.capacity = Unsigned(value, at);
        } else if (key == "mountReason") {
            u.mountReason = Uint32(value, at);
        } else if (key == "resignatureReason") {
            u.resignatureReason = Uint32(value, at);
        } else if (key == "impl") {
            u.impl = Bool(value, at);
        } else if (key == "extents") {
            long i = 0;
            for (const auto& item : Array(value, at)) {
                Where itemAt = at[i++];
                UnresolvedExtent e;
                if (item.is_null()) {
                    e.null = true;
                } else {
                    if (!item.is_object())
                        WrongType(itemAt, "an object or null", item);
                    ReadKeys(e, item, itemAt, kUnresolvedExtentKeys);
                }
                u.extents.push_back(std::move(e));
            }
        } else {
            UnknownKey(at);
        }
    });
    ResolveDefaults(u);
    return u;
}

ojson WriteUnresolved(const UnresolvedVolume& u)
{
    if (u.null)
        return nullptr;
    ojson out = ojson::object();
    out["volumeName"] = u.volumeName;
    if (u.uuidGiven)
        out["uuid"] = u.uuid;
    if (u.Has("lvmUuid") || !u.lvmUuid.empty())
        out["lvmUuid"] = u.lvmUuid;
    if (u.Has("impl") || !u.impl)
        out["impl"] = u.impl;
    if (u.Has("majorVersion") || u.majorVersion != 6)
        out["majorVersion"] = u.majorVersion;
    if (u.Has("capacity") || u.capacity != 0)
        out["capacity"] = u.capacity;
    if (u.Has("mountReason") || u.mountReason != 0)
        out["mountReason"] = u.mountReason;
    if (u.Has("resignatureReason") || u.resignatureReason != 0)
        out["resignatureReason"] = u.resignatureReason;
    if (!u.Has("extents") && u.extents.empty())
        return out;
    ojson extents = ojson::array();
    for (const auto& e : u.extents) {
        if (e.null) {
            extents.push_back(nullptr);
            continue;
        }
        ojson x = WriteKeys(e, kUnresolvedExtentKeys);
        if (e.impl)
            x.erase("impl");
        extents.push_back(std::move(x));
    }
    out["extents"] = std::move(extents);
    return out;
}

// ---- the other top-level keys -------------------------------------------------------------

void ReadFeatures(State& st, const json& v, const Where& w)
{
    EachKey(v, w, [&](const std::string& key, const json& value, const Where& at) {
        for (int i = 0; i < 4; ++i) {
            if (key == kFeatureKeys[i]) {
                st.features[i] = Bool(value, at);
                return;
            }
        }
        UnknownKey(at);
    });
}

void ReadAdvancedOptions(State& st, const json& v, const Where& w)
{
    EachKey(v, w, [&](const std::string& group, const json& options, const Where& groupAt) {
        OptionGroup entries;
        EachKey(options, groupAt, [&](const std::string& name, const json& value, const Where& at) {
            if (value.is_string())
                entries.emplace_back(name, value.get<std::string>());
            else if (value.is_number_integer())
                entries.emplace_back(name, Signed(value, at, std::numeric_limits<std::int64_t>::min(),
                                                  std::numeric_limits<std::int64_t>::max()));
            else
                WrongType(at, "an integer or a string", value);
        });
        st.advancedOptions.emplace_back(group, std::move(entries));
    });
}

// Appends the elements of the array at `w`, each read by `read`, to `out`.
template <typename T>
void ReadList(std::vector<T>& out, const json& v, const Where& w, T (*read)(const json&, const Where&))
{
    long i = 0;
    for (const auto& item : Array(v, w))
        out.push_back(read(item, w[i++]));
}

// As ReadList, and gives each new element the session's next id.
template <typename T>
void ReadListWithIds(std::vector<T>& out, std::uint64_t& nextId, const json& v, const Where& w,
                     T (*read)(const json&, const Where&))
{
    const std::size_t first = out.size();
    ReadList(out, v, w, read);
    for (std::size_t i = first; i < out.size(); ++i)
        out[i].id = nextId++;
}

void ReadPendingRescan(State& st, const json& v, const Where& w)
{
    EachKey(v, w, [&](const std::string& key, const json& value, const Where& at) {
        if (key == "fileSystems") {
            st.pendingHasFileSystems = true;
            ReadList(st.pendingFileSystems, value, at, ReadFileSystem);
        } else if (key == "unresolvedVolumes") {
            st.pendingHasUnresolved = true;
            ReadList(st.pendingUnresolved, value, at, ReadUnresolved);
        } else {
            UnknownKey(at);
        }
    });
}

Fault ReadFault(const json& v, const Where& w)
{
    Fault f;
    ReadKeys(f, v, w, kFaultKeys);
    if (!v.contains("call"))
        Fail(w, "missing required key 'call'");
    if (!v.contains("message"))
        f.message = "Injected failure of " + f.call;
    return f;
}

const Key<State> kBehaviourKeys[] = {KeyOf<&State::tryMount, Bool>("tryMount")};
const Key<State> kFirewallKeys[] = {KeyOf<&State::nfsClient, Strings>("nfsClient"),
                                    KeyOf<&State::nfs41Client, Strings>("nfs41Client")};

// A top-level key of the state and how it is read.
struct TopField {
    const char* key;
    TopKey bit;
    void (*read)(State&, const json&, const Where&);
};

const TopField kTopFields[] = {
    {"features", TopKey::features, ReadFeatures},
    {"advancedOptions", TopKey::advancedOptions, ReadAdvancedOptions},
    {"behaviour", TopKey::behaviour,
     [](State& st, const json& v, const Where& w) { ReadKeys(st, v, w, kBehaviourKeys); }},
    // Elements are normally converted while the text streams in; this handles the rest.
    {"fileSystems", TopKey::fileSystems,
     [](State& st, const json& v, const Where& w) {
         ReadListWithIds(st.fileSystems, st.nextFileSystemId, v, w, ReadFileSystem);
     }},
    {"pendingRescan", TopKey::pendingRescan, ReadPendingRescan},
    {"unresolvedVolumes", TopKey::unresolvedVolumes,
     [](State& st, const json& v, const Where& w) {
         ReadListWithIds(st.unresolvedVolumes, st.nextUnresolvedId, v, w, ReadUnresolved);
     }},
    {"nfsExports", TopKey::nfsExports,
     [](State& st, const json& v, const Where& w) { ReadRecords(st.nfsExports, v, w, kNfsExportKeys); }},
    {"firewall", TopKey::firewall, [](State& st, const json& v, const Where& w) { ReadKeys(st, v, w, kFirewallKeys); }},
    {"heaps", TopKey::heaps, [](State& st, const json& v, const Where& w) { ReadRecords(st.heaps, v, w, kHeapKeys); }},
    {"pointerBlockCache", TopKey::pointerBlockCache,
     [](State& st, const json& v, const Where& w) { ReadKeys(st.pointerBlockCache, v, w, kCacheKeys); }},
    {"faults", TopKey::faults, [](State& st, const json& v, const Where& w) { ReadList(st.faults, v, w, ReadFault); }},
};

void ReadTopKey(State& st, const std::string& key, const json& value, const Where& at)
{
    for (const auto& field : kTopFields) {
        if (key == field.key) {
            field.read(st, value, at);
            st.Mark(field.bit);
            return;
        }
    }
    UnknownKey(at);
}

// The state text as the JSON reader sees it, with the one check the reader does not make
// (it takes a NUL byte for the end of the input, which would silently drop the rest of the
// file) and enough bookkeeping to give any offset a line and a column.
class CheckedInput : public std::streambuf {
public:
    explicit CheckedInput(std::streambuf* source) : source_(source), buffer_(1 << 16) {}

    // Line and column (the count of characters read on that line, as the reader counts
    // them) of offset `position`, which must not be before the current chunk.
    std::pair<std::uint64_t, std::uint64_t> Locate(std::uint64_t position) const
    {
        std::uint64_t lines = linesBefore_;
        std::uint64_t lineStart = lineStartBefore_;
        const std::uint64_t end = std::min<std::uint64_t>(position - std::min(position, chunkStart_), length_);
        for (std::uint64_t i = 0; i < end; ++i) {
            if (buffer_[i] == '\n') {
                ++lines;
                lineStart = chunkStart_ + i + 1;
            }
        }
        return {lines + 1, position >= lineStart ? position - lineStart : 0};
    }

    std::string Place(std::uint64_t position) const
    {
        const auto [line, column] = Locate(position);
        return "line " + std::to_string(line) + ", column " + std::to_string(column);
    }

protected:
    int_type underflow() override
    {
        if (gptr() < egptr())
            return traits_type::to_int_type(*gptr());
        if (nul_ != std::string::npos)
            throw PlaceError{Place(chunkStart_ + nul_ + 1), "a NUL byte is not allowed in a state file"};
        for (std::size_t i = 0; i < length_; ++i) {
            if (buffer_[i] == '\n') {
                ++linesBefore_;
                lineStartBefore_ = chunkStart_ + i + 1;
            }
        }
        chunkStart_ += length_;
        const std::streamsize n = source_->sgetn(buffer_.data(), static_cast<std::streamsize>(buffer_.size()));
        length_ = n > 0 ? static_cast<std::size_t>(n) : 0;
        if (length_ == 0)
            return traits_type::eof();
        const void* nul = std::memchr(buffer_.data(), '\0', length_);
        nul_ = nul ? static_cast<std::size_t>(static_cast<const char*>(nul) - buffer_.data()) : std::string::npos;
        if (nul_ == 0)
            throw PlaceError{Place(chunkStart_ + 1), "a NUL byte is not allowed in a state file"};
        setg(buffer_.data(), buffer_.data(), buffer_.data() + (nul ? nul_ : length_));
        return traits_type::to_int_type(*gptr());
    }

private:
    std::streambuf* source_;
    std::vector<char> buffer_;
    std::size_t length_ = 0;
    std::size_t nul_ = std::string::npos;
    std::uint64_t chunkStart_ = 0;
    std::uint64_t linesBefore_ = 0;
    std::uint64_t lineStartBefore_ = 0;
};

// Builds the document like a DOM parser, except that each element of the top-level
// "fileSystems" array is converted to a record as soon as it is complete and then dropped,
// so a large host never exists twice in memory. A key given twice in one object is refused:
// which of the two was meant cannot be known.
class StreamingReader {
public:
    StreamingReader(State& state, const CheckedInput& input) : state_(state), input_(input) {}

    json root;

    bool null() { return Scalar(nullptr); }
    bool boolean(bool v) { return Scalar(v); }
    bool number_integer(json::number_integer_t v) { return Scalar(v); }
    bool number_unsigned(json::number_unsigned_t v) { return Scalar(v); }
    bool number_float(json::number_float_t v, const json::string_t&) { return Scalar(v); }
    bool string(json::string_t& v) { return Scalar(std::move(v)); }
    bool binary(json::binary_t&) { return true; }

    bool start_object(std::size_t)
    {
        Open(json::value_t::object);
        return true;
    }
    bool key(json::string_t& k)
    {
        if (stack_.back()->contains(k))
            throw PlaceError{PathTo(k), "this key is given twice"};
        if (stack_.size() == 1)
            topKey_ = k;
        frames_.back().key = k;
        slot_ = &(*stack_.back())[k];
        return true;
    }
    bool end_object() { return Close(); }
    bool start_array(std::size_t)
    {
        json* array = Open(json::value_t::array);
        if (stack_.size() == 2 && stack_[0]->is_object() && topKey_ == "fileSystems") {
            streamed_ = array;
            streamedCount_ = 0;
        }
        return true;
    }
    bool end_array() { return Close(); }

    // Starts an object or array at the current place.
    json* Open(json::value_t type)
    {
        json* container = Place(type);
        stack_.push_back(container);
        frames_.push_back(Frame{type == json::value_t::array, {}, 0});
        return container;
    }

    bool Close()
    {
        stack_.pop_back();
        frames_.pop_back();
        Completed();
        return true;
    }
    bool parse_error(std::size_t position, const std::string& token, const nlohmann::detail::exception& ex)
    {
        std::string text = ex.what();
        if (auto close = text.find("] "); text.rfind("[json.exception", 0) == 0 && close != std::string::npos)
            text.erase(0, close + 2);
        // The reader's own place, if it gave one, is replaced by the same place in this
        // file's form; a token it quotes is cut like every other quoted text.
        if (text.rfind("parse error at line ", 0) == 0) {
            if (auto colon = text.find(": "); colon != std::string::npos)
                text.erase(0, colon + 2);
        }
        if (!token.empty() && token.size() > kQuoteLimit) {
            if (auto at = text.find("'" + token + "'"); at != std::string::npos)
                text.replace(at + 1, token.size(), Cut(token));
        }
        // A number too large to hold is reported at its first character.
        const std::uint64_t start = ex.id == 406 && position >= token.size() ? position - token.size() + 1 : position;
        throw PlaceError{input_.Place(start), text};
    }

    bool StreamedFileSystems() const { return streamed_ != nullptr; }

private:
    struct Frame {
        bool array;
        std::string key; // the current key of an object
        long next;       // the index the next element of an array gets
    };

    // The key path of `key` in the innermost object.
    std::string PathTo(const std::string& key) const
    {
        std::string text;
        for (std::size_t i = 0; i + 1 < frames_.size(); ++i) {
            if (frames_[i].array) {
                text += "[" + std::to_string(frames_[i].next - 1) + "]";
            } else {
                if (!text.empty())
                    text += ".";
                text += Cut(frames_[i].key);
            }
        }
        return text.empty() ? Cut(key) : text + "." + Cut(key);
    }

    template <typename V>
    bool Scalar(V&& v)
    {
        Place(json(std::forward<V>(v)));
        Completed();
        return true;
    }

    json* Place(json v)
    {
        if (stack_.empty()) {
            root = std::move(v);
            return &root;
        }
        if (stack_.back()->is_array()) {
            ++frames_.back().next;
            stack_.back()->push_back(std::move(v));
            return &stack_.back()->back();
        }
        *slot_ = std::move(v);
        return slot_;
    }

    void Completed()
    {
        if (!streamed_ || stack_.size() != 2 || stack_.back() != streamed_)
            return;
        const Where top{nullptr, "fileSystems", -1};
        state_.fileSystems.push_back(ReadFileSystem(streamed_->back(), top[streamedCount_++]));
        state_.fileSystems.back().id = state_.nextFileSystemId++;
        streamed_->erase(streamed_->end() - 1);
    }

    State& state_;
    const CheckedInput& input_;
    std::vector<json*> stack_;
    std::vector<Frame> frames_;
    json* slot_ = nullptr;
    std::string topKey_;
    json* streamed_ = nullptr;
    long streamedCount_ = 0;
};

void WriteReindented(std::ostream& out, const ojson& value, const char* indent)
{
    const std::string text = value.dump(2, ' ', false, ojson::error_handler_t::replace);
    std::size_t start = 0;
    for (std::size_t nl = text.find('\n'); nl != std::string::npos; nl = text.find('\n', start)) {
        out.write(text.data() + start, static_cast<std::streamsize>(nl + 1 - start));
        out << indent;
        start = nl + 1;
    }
    out.write(text.data() + start, static_cast<std::streamsize>(text.size() - start));
}

// The demo host is built in place rather than parsed from text: it is what every run
// without a state file starts from, so it must cost next to nothing.
Record DemoFileSystem(State& st, const char* type, const char* volumeName, const char* uuid, std::uint64_t capacity,
                      std::uint64_t used)
{
    Record r;
    r.type = type;
    r.volumeName = volumeName;
    r.uuid = uuid;
    r.capacity = capacity;
    r.used = used;
    for (FsKey key : {FsKey::type, FsKey::volumeName, FsKey::uuid, FsKey::capacity, FsKey::used})
        r.Mark(key);
    r.kind = KindOfType(r.type);
    r.id = st.nextFileSystemId++;
    return r;
}

HlfsFields& DemoHlfs(Record& r, const char* lvmUuid, std::int32_t qaxiState, std::int32_t majorVersion,
                     std::uint32_t lockMode)
{
    r.qaxiState = qaxiState;
    auto& h = r.MutableHlfs();
    h.lvmUuid = lvmUuid;
    h.majorVersion = majorVersion;
    h.lockMode = lockMode;
    h.atsSupport = 1;
    for (FsKey key :
         {FsKey::lvmUuid, FsKey::qaxiState, FsKey::majorVersion, FsKey::lockMode, FsKey::atsSupport, FsKey::extents})
        r.Mark(key);
    return h;
}

User DemoUser(const char* heartbeatUuid, const char* mac, std::uint32_t major, std::uint32_t minor, std::int64_t offset,
              std::uint8_t lockModeInUse)
{
    return {heartbeatUuid, mac, major, minor, offset, lockModeInUse};
}

State BuildDemo()
{
    State st;
    for (auto& feature : st.features)
        feature = true;
    // Groups and options in name order, as a state file's objects are read.
    st.advancedOptions = {
        {"HLFS3", {{"EnableOnlineATSUpgrade", std::int64_t{1}}, {"MaxHeapSizeMB", std::int64_t{256}}}},
        {"Misc", {{"HostName", std::string("host01.lab.example")}}},
        {"NFS", {{"HeartbeatFrequency", std::int64_t{12}}, {"MaxVolumes", std::int64_t{8}}}},
    };

    auto& fileSystems = st.fileSystems;
    fileSystems.reserve(6);
    {
        auto r =
            DemoFileSystem(st, "HLFS", "datastore1", "5f8d2a31-6c1e47b2-9a0f-001e67c4d2a8", 536602476544, 193273528320);
        auto& h = DemoHlfs(r, "5f8d2a30-1b7c3d44-e2c1-001e67c4d2a8", 1, 6, 16);
        h.extents.push_back({"naa.600508b1001c7e4d2f9a8b3c6d5e4f10", 3});
        h.users.push_back(DemoUser("5f8d2a35-0a4c8e21-77d3-001e67c4d2a8", "00:1e:67:c4:d2:a8", 6, 82, 3145728, 4));
        h.users.push_back(DemoUser("5f8d2b11-4e9a0c37-1b62-001e67c4d310", "00:1e:67:c4:d3:10", 6, 82, 3149824, 4));
        r.Mark(FsKey::users);
        fileSystems.push_back(std::move(r));
    }
    {
        auto r = DemoFileSystem(st, "HLFS", "shared-ds01", "5f8d2b02-91a0c3e5-4d21-001e67c4d2a8", 2198754820096,
                                1319413953331);
        auto& h = DemoHlfs(r, "5f8d2b01-7ac4e0d9-3f18-001e67c4d2a8", 1, 5, 0);
        h.extents.push_back({"naa.60060160a62031002f7c8e4b9d1a5e21", 1});
        h.extents.push_back({"naa.60060160a62031003a8d9f5c0e2b6f32", 1});
        h.users.push_back(DemoUser("5f8d2b05-2c7e9a14-58b0-001e67c4d2a8", "00:1e:67:c4:d2:a8", 5, 61, 3407872, 0));
        h.unmapProperty.priority = "none";
        r.Mark(FsKey::users);
        r.Mark(FsKey::unmapProperty);
        fileSystems.push_back(std::move(r));
    }
    {
        auto r = DemoFileSystem(st, "HLFS", "legacy-ds03", "4e1c7a90-2d3b5f68-8c17-001e67c4d2a8", 268435456000,
                                107374182400);
        auto& h = DemoHlfs(r, "4e1c7a8f-93e0b2d6-0a45-001e67c4d2a8", 2, 3, 0);
        h.extents.push_back({"naa.600508b1001c5a3b4c2d1e0f9a8b7c61", 1});
        fileSystems.push_back(std::move(r));
    }
    {
        auto r = DemoFileSystem(st, "NFS", "nfs-iso", "b7e21c4f-09d3a6e8", 1099511627776, 412316860416);
        auto& n = r.MutableNfs();
        n.remoteHost = "10.20.30.40";
        n.remoteShare = "/exports/iso";
        n.readOnly = true;
        n.connections = 1;
        n.maxQueueDepth = 64;
        for (FsKey key : {FsKey::remoteHost, FsKey::remoteShare, FsKey::readOnly, FsKey::knxnic, FsKey::knxnics,
                          FsKey::connections, FsKey::maxQueueDepth})
            r.Mark(key);
        fileSystems.push_back(std::move(r));
    }
    {
        auto r = DemoFileSystem(st, "NFS41", "nfs41-vms", "c4a9d0e2-5b8f1736", 4398046511104, 1649267441664);
        auto& n = r.MutableNfs();
        n.remoteHosts = {"10.20.30.41", "10.20.30.42"};
        n.remoteShare = "/exports/vms";
        n.securityType = 1;
        for (FsKey key : {FsKey::remoteHosts, FsKey::remoteShare, FsKey::securityType})
            r.Mark(key);
        fileSystems.push_back(std::move(r));
    }
    fileSystems.push_back(
        DemoFileSystem(st, "vfat", "BOOTBANK1", "6a3f1e2d-8b4c5a69-0d7e-001e67c4d2a8", 4293591040, 1438646272));
    for (auto& fs : fileSystems)
        ResolveDefaults(fs);

    UnresolvedVolume u;
    u.volumeName = "datastore1";
    u.uuid = "5f8d2a31-6c1e47b2-9a0f-001e67c4d2a8";
    u.uuidGiven = true;
    u.lvmUuid = "5f8d2a30-1b7c3d44-e2c1-001e67c4d2a8";
    u.majorVersion = 6;
    u.capacity = 536602476544;
    u.mountReason = 6;
    u.resignatureReason = 0;
    u.extents.push_back({{"naa.60060160a620310045b9e1d7f3c8a054", 3}, 0, 511743, true});
    for (std::string_view key :
         {"volumeName", "uuid", "lvmUuid", "majorVersion", "capacity", "mountReason", "resignatureReason", "extents"})
        u.Mark(key);
    u.id = st.nextUnresolvedId++;
    st.unresolvedVolumes.push_back(std::move(u));

    st.nfsExports = {
        {"10.20.30.40", "/exports/iso", 1099511627776, 412316860416},
        {"10.20.30.41", "/exports/vms", 4398046511104, 1649267441664},
        {"10.20.30.42", "/exports/vms", 4398046511104, 1649267441664},
        {"10.20.30.40", "/exports/backup", 2199023255552, 329853488332},
    };
    st.nfsClient = std::vector<std::string>{"10.20.30.0/24", "fd00:20:30::/64"};
    st.nfs41Client = std::vector<std::string>{"10.20.30.41", "10.20.30.42"};
    st.heaps = {{"hlfs3", 22020096, 268435456}, {"nfsclient", 4194304, 33554432}};
    st.pointerBlockCache = {134217728, 268435456, 35184372088832, 43980465111040, 4194304, 3};
    for (TopKey key : {TopKey::features, TopKey::advancedOptions, TopKey::fileSystems, TopKey::unresolvedVolumes,
                       TopKey::nfsExports, TopKey::firewall, TopKey::heaps, TopKey::pointerBlockCache})
        st.Mark(key);
    return st;
}

} // namespace

FsKind KindOfType(std::string_view type)
{
    if (type == "HLFS")
        return FsKind::Hlfs;
    if (type == "NFS")
        return FsKind::Nfs;
    if (type == "NFS41")
        return FsKind::Nfs41;
    return FsKind::Plain;
}

namespace {

// A kind-specific part of a record; its defaults while it has not been made.
template <typename Part>
const Part& PartOrDefaults(const std::unique_ptr<Part>& part)
{
    static const Part defaults;
    return part ? *part : defaults;
}

template <typename Part>
Part& MadePart(std::unique_ptr<Part>& part)
{
    if (!part)
        part = std::make_unique<Part>();
    return *part;
}

} // namespace

const HlfsFields& FileSystemRecord::Hlfs() const { return PartOrDefaults(hlfs); }
HlfsFields& FileSystemRecord::MutableHlfs() { return MadePart(hlfs); }
const NfsFields& FileSystemRecord::Nfs() const { return PartOrDefaults(nfs); }
NfsFields& FileSystemRecord::MutableNfs() { return MadePart(nfs); }

void ResolveDefaults(FileSystemRecord& fs)
{
    if (!fs.Has(FsKey::name))
        fs.name = fs.volumeName;
    if (!fs.Has(FsKey::uuid))
        fs.uuid = UuidFromText(fs.volumeName);
    if (!fs.Has(FsKey::mountPoint))
        fs.mountPoint = "/hlfs/volumes/" + fs.uuid;
    if (fs.kind == FsKind::Nfs || fs.kind == FsKind::Nfs41 || fs.nfs) {
        auto& nfs = fs.MutableNfs();
        if (!fs.Has(FsKey::readOnlyState))
            nfs.readOnlyState = nfs.readOnly;
        if (!fs.Has(FsKey::connectionsParam))
            nfs.connectionsParam = static_cast<std::int32_t>(nfs.connections);
        if (!fs.Has(FsKey::securityType))
            nfs.securityType = fs.kind == FsKind::Nfs41 ? 1 : 0;
    }
}

namespace {
constexpr std::string_view kUnresolvedKeys[] = {
    "volumeName", "uuid", "lvmUuid", "majorVersion", "capacity", "mountReason", "resignatureReason", "extents", "impl"};

int UnresolvedKeyBit(std::string_view key)
{
    for (int i = 0; i < static_cast<int>(std::size(kUnresolvedKeys)); ++i)
        if (kUnresolvedKeys[i] == key)
            return i;
    return -1;
}
} // namespace

bool UnresolvedVolume::Has(std::string_view key) const
{
    const int bit = UnresolvedKeyBit(key);
    return bit >= 0 && ((present >> bit) & 1u);
}

void UnresolvedVolume::Mark(std::string_view key)
{
    if (const int bit = UnresolvedKeyBit(key); bit >= 0)
        present = static_cast<std::uint16_t>(present | (1u << bit));
}

void ResolveDefaults(UnresolvedVolume& volume)
{
    if (!volume.uuidGiven)
        volume.uuid = UuidFromText(volume.volumeName);
}

std::string UuidFromText(std::string_view text)
{
    auto fnv = [&](std::uint64_t hash) {
        for (unsigned char c : text) {
            hash ^= c;
            hash *= 0x100000001b3ull;
        }
        // Final mix so that similar names give unrelated UUIDs.
        hash ^= hash >> 33;
        hash *= 0xff51afd7ed558ccdull;
        hash ^= hash >> 33;
        return hash;
    };
    const std::uint64_t a = fnv(0xcbf29ce484222325ull);
    const std::uint64_t b = fnv(0x84222325cbf29ce4ull);
    char out[40];
    std::snprintf(out, sizeof out, "%08" PRIx64 "-%08" PRIx64 "-%04" PRIx64 "-%012" PRIx64, a >> 32,
                  a & std::uint64_t{0xffffffff}, b >> 48, b & std::uint64_t{0xffffffffffff});
    return out;
}

namespace {

// Reads a state from a stream, which never holds a whole large file in memory.
State ParseStream(std::istream& in, const std::string& source)
{
    State st;
    try {
        CheckedInput checked(in.rdbuf());
        std::istream input(&checked);
        StreamingReader reader(st, checked);
        json::sax_parse(input, &reader, json::input_format_t::json, true, false);
        if (!reader.root.is_object())
            throw PlaceError{"",
                             std::string("expected a JSON object at the top level, found ") + reader.root.type_name()};
        for (const auto& [key, value] : reader.root.items()) {
            const Where at{nullptr, key, -1};
            if (key == "fileSystems" && reader.StreamedFileSystems() && value.is_array() && value.empty())
                st.Mark(TopKey::fileSystems);
            else
                ReadTopKey(st, key, value, at);
        }
    } catch (const PlaceError& e) {
        throw StateError("Invalid host state file '" + source + "': " + (e.where.empty() ? "" : e.where + ": ") +
                         e.what);
    }
    return st;
}

} // namespace

State Parse(std::istream& in, const std::string& source) { return ParseStream(in, source); }

State Demo() { return BuildDemo(); }

void Write(const State& st, std::ostream& out)
{
    bool first = true;
    auto key = [&](const char* name) {
        out << (first ? "{\n  \"" : ",\n  \"") << name << "\": ";
        first = false;
    };
    auto value = [&](const ojson& v) { WriteReindented(out, v, "  "); };

    if (st.Has(TopKey::features) ||
        std::any_of(std::begin(st.features), std::end(st.features), [](const auto& f) { return f.has_value(); })) {
        ojson features = ojson::object();
        for (int i = 0; i < 4; ++i)
            if (st.features[i])
                features[kFeatureKeys[i]] = *st.features[i];
        key("features");
        value(features);
    }
    if (st.Has(TopKey::advancedOptions) || !st.advancedOptions.empty()) {
        ojson groups = ojson::object();
        for (const auto& [group, options] : st.advancedOptions) {
            ojson entries = ojson::object();
            for (const auto& [name, option] : options)
                std::visit([&, &name = name](const auto& v) { entries[name] = v; }, option);
            groups[group] = std::move(entries);
        }
        key("advancedOptions");
        value(groups);
    }
    if (st.Has(TopKey::behaviour) || st.tryMount) {
        ojson behaviour = ojson::object();
        if (st.tryMount)
            behaviour["tryMount"] = *st.tryMount;
        key("behaviour");
        value(behaviour);
    }
    if (st.Has(TopKey::fileSystems) || !st.fileSystems.empty()) {
        key("fileSystems");
        if (st.fileSystems.empty()) {
            out << "[]";
        } else {
            const char* separator = "[\n    ";
            for (const auto& fs : st.fileSystems) {
                out << separator;
                WriteReindented(out, WriteFileSystem(fs), "    ");
                separator = ",\n    ";
            }
            out << "\n  ]";
        }
    }
    if (st.Has(TopKey::pendingRescan) || !st.pendingFileSystems.empty() || !st.pendingUnresolved.empty()) {
        ojson pending = ojson::object();
        if (st.pendingHasFileSystems || !st.pendingFileSystems.empty())
            pending["fileSystems"] = ListOf(st.pendingFileSystems, WriteFileSystem);
        if (st.pendingHasUnresolved || !st.pendingUnresolved.empty())
            pending["unresolvedVolumes"] = ListOf(st.pendingUnresolved, WriteUnresolved);
        key("pendingRescan");
        value(pending);
    }
    if (st.Has(TopKey::unresolvedVolumes) || !st.unresolvedVolumes.empty()) {
        key("unresolvedVolumes");
        value(ListOf(st.unresolvedVolumes, WriteUnresolved));
    }
    if (st.Has(TopKey::nfsExports) || !st.nfsExports.empty()) {
        key("nfsExports");
        value(ListOf(st.nfsExports, [](const NfsExport& e) { return WriteKeys(e, kNfsExportKeys); }));
    }
    if (st.Has(TopKey::firewall) || st.nfsClient || st.nfs41Client) {
        ojson firewall = ojson::object();
        if (st.nfsClient)
            firewall["nfsClient"] = *st.nfsClient;
        if (st.nfs41Client)
            firewall["nfs41Client"] = *st.nfs41Client;
        key("firewall");
        value(firewall);
    }
    if (st.Has(TopKey::heaps) || !st.heaps.empty()) {
        key("heaps");
        value(ListOf(st.heaps, [](const Heap& h) { return WriteKeys(h, kHeapKeys); }));
    }
    if (st.Has(TopKey::pointerBlockCache)) {
        key("pointerBlockCache");
        value(WriteKeys(st.pointerBlockCache, kCacheKeys));
    }
    if (st.Has(TopKey::faults) || !st.faults.empty()) {
        key("faults");
        value(ListOf(st.faults, [](const Fault& f) {
            // Only the keys that are set.
            ojson out = WriteKeys(f, kFaultKeys);
            if (!f.target)
                out.erase("target");
            if (!f.skip)
                out.erase("skip");
            if (!f.times)
                out.erase("times");
            return out;
        }));
    }
    out << (first ? "{}\n" : "\n}\n");
}

} // namespace HostSim::Model
