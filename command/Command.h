#pragma once

// What every storage command shares: the framework and host types it uses, the
// parameter builders, the feature switches and the execution envelope.

#include <cstdint>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "FeatureList.h"
#include "hostctl/Host.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/Misc.h"
#include "hostctl/Storage.h"
#include "hostctl/StorageInfoImpl.h"
#include "quillets/AutoCli.h"
#include "quillets/CallSpec.h"
#include "quillets/MetaObj.h"
#include "quillets/QuilletException.h"

namespace OrvaneCli::FileSystem {

using Quillets::AutoCli::Command;
using Quillets::AutoCli::CommandSpec;
using Quillets::CallSpec::Input;
using Quillets::CallSpec::InputSpec;
using Quillets::CallSpec::Output;
using Quillets::CallSpec::OutputSpec;
using Quillets::CallSpec::ParameterConstraint;
using Quillets::CallSpec::ParameterConstraintType;
using Quillets::CallSpec::ParameterSpec;
using Quillets::CallSpec::ParameterType;
using Quillets::MetaObj::MetaBool;
using Quillets::MetaObj::MetaInt;
using Quillets::MetaObj::MetaList;
using Quillets::MetaObj::MetaString;
using Quillets::MetaObj::MetaStruct;
using Quillets::MetaObj::MetaType;

using HostCtl::Lib::HostCtlException;
using HostCtl::Storage::HlFileSystem;
using HostCtl::Storage::NetworkFileSystem;
using HostCtl::Storage::UnresolvedHlfsExtent;
using HostCtl::Storage::UnresolvedHlfsVolume;
using KnxCtl::Storage::StorageInfoImpl;
using KnxCtl::Storage::StorageInfoScopedCache;
using KnxCtl::Storage::UnresolvedHlfsExtentImpl;
using KnxCtl::Storage::UnresolvedHlfsVolumeImpl;

using InputPtr = std::shared_ptr<Input>;
using OutputPtr = std::shared_ptr<Output>;

// Option names that several commands share.
inline constexpr const char* kOptionVolumeLabel = "volume-label";
inline constexpr const char* kOptionVolumeUuid = "volume-uuid";
inline constexpr const char* kOptionVolumeName = "volume-name";
inline constexpr const char* kOptionNoPersist = "no-persist";
inline constexpr const char* kOptionIgnoreErrors = "ignore-errors";
inline constexpr const char* kOptionHostKnxnic = "host-knxnic";
inline constexpr const char* kOptionConnections = "connections";

// Host feature switches the plug-in reads; read afresh at every use, never cached.
enum class Feature : int {
    Nfs41KnxnicBinding = 102,
    NfsConnections = 103,
    NfsKnxnicBinding = 104,
    NasPreUnmount = 270,
};

bool IsFeatureEnabled(Feature feature);

// Parameter declaration: name, short name ("" for none), type, description ("" for none).
struct ParameterDecl {
    const char* name;
    const char* shortName;
    ParameterType type;
    std::string description;
    bool required = false;
    std::shared_ptr<ParameterConstraint> constraint = nullptr;
    std::optional<Feature> feature = std::nullopt;        // declared only while this switch is on
    std::optional<Feature> requiredUnless = std::nullopt; // required while this switch is off
};

std::shared_ptr<ParameterSpec> MakeParameter(const ParameterDecl& decl);
void AddParameter(const std::shared_ptr<InputSpec>& inputs, const ParameterDecl& decl);
std::shared_ptr<ParameterConstraint> IntRange(long min, long max);
// Allowed values, each with its description ("" adds the value without one).
std::shared_ptr<ParameterConstraint> StringEnum(std::initializer_list<std::pair<const char*, const char*>> values);

// Output description whose root is an empty boolean (action commands).
std::shared_ptr<OutputSpec> BooleanOutputSpec();
// Output description whose root is a list of `prototype`-shaped rows.
std::shared_ptr<OutputSpec> ListOutputSpec(std::shared_ptr<MetaStruct> prototype);
// Output description whose root is one structure.
std::shared_ptr<OutputSpec> StructOutputSpec(std::shared_ptr<MetaStruct> structure);

// The guarded region: runs `body`; a HostCtlException leaving it becomes exactly one
// error message with the host's text. Anything else passes on to the framework.
// Returns true when `body` completed.
template <typename Body>
bool Guarded(const OutputPtr& out, Body&& body)
{
    try {
        body();
        return true;
    } catch (const HostCtlException& e) {
        out->AddErrorMessage(e.message);
        return false;
    }
}

// Where a command creates its StorageInfoImpl relative to the guarded region.
enum class StorageInfoPlacement {
    InsideGuard,  // a failure to create it becomes an error message
    OutsideGuard, // a failure to create it reaches the framework
    Unguarded,    // neither it nor `body` is guarded: `body` guards what it must itself
};

// Creates the StorageInfoImpl where `placement` says and runs `body(storage)` in the
// guarded region. Returns true when `body` completed.
template <typename Body>
bool WithStorageInfo(StorageInfoPlacement placement, const OutputPtr& out, Body&& body)
{
    if (placement != StorageInfoPlacement::InsideGuard) {
        StorageInfoImpl storage;
        if (placement == StorageInfoPlacement::Unguarded) {
            body(storage);
            return true;
        }
        return Guarded(out, [&] { body(storage); });
    }
    return Guarded(out, [&] {
        StorageInfoImpl storage;
        body(storage);
    });
}

// A string parameter counts as given only when its value is not empty.
inline bool IsGiven(const std::string& value) { return !value.empty(); }

// The host's storage information as the host object hands it out (not the StorageInfoImpl).
std::unique_ptr<HostCtl::Storage::StorageInfo> OpenHostStorageInfo();

// The entries separated by "," (no blank); the empty text for none.
std::string JoinWithCommas(const std::vector<std::string>& entries);

// The type shown for a volume: "HLFS-<major version>", "HLFS-unknown version" or "Non-HLFS".
const char* GetHLFSVersionString(HlFileSystem* volume);

// Tells the host's datastore notification script about `event`, with `data` on its
// standard input. The outcome of the script is ignored.
void NotifyDatastore(const std::string& event, const std::string& data);
inline constexpr const char* kNotifyPreUnmount = "PreUnmount";
inline constexpr const char* kNotifyFailedUnmount = "FailedUnmount";

} // namespace OrvaneCli::FileSystem
