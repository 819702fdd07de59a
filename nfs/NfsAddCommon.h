#pragma once

// What `storage nfs add` and `storage nfs41 add` share once the host has defined the new
// volume: its properties, the mount, and taking the definition back when the mount fails.

#include <string>

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// Parameter names both add commands use.
namespace NfsAddArg {
inline constexpr const char* kShare = "share";
inline constexpr const char* kReadOnly = "readonly";
inline constexpr const char* kIsPE = "ispe";
} // namespace NfsAddArg

// The server is named by a host parameter (`name`, -H) or, while the knxnic `binding`
// switch is on, by host-knxnic (-I); the host parameter is required only while it is off.
ParameterDecl ServerParameter(const char* name, ParameterType type, const char* description, Feature binding);
ParameterDecl ServerKnxnicParameter(ParameterType type, const char* description, Feature binding);

// share (-s) and volume-name (-v), both required. `kind` names the mount ("NAS") and
// `others` the volume kinds a new name must not clash with.
ParameterDecl ShareParameter(const char* kind);
ParameterDecl VolumeNameParameter(const char* kind, const char* others);

// Mount flags word of NetworkFileSystem::Mount.
inline constexpr unsigned kNfsMountNoFlags = 0;
inline constexpr unsigned kNfsMountRetry = 4;

// What becomes of a new definition whose mount failed.
enum class OnMountFailure {
    KeepDefinition,   // the mount's failure passes on to the caller's guarded region
    RemoveDefinition, // no unmounted definition is left behind
};

// The message for a host that defined a volume but handed back no object for it.
std::string NoNewVolumeMessage(const std::string& volumeName);

// Sets read-only and PE on the newly defined `volume` (always, also when false) and
// mounts it with `flags`. Failures of the two setters pass on to the caller's guarded
// region. A failed mount passes on as well with KeepDefinition; with RemoveDefinition
// it adds the mount's message, removes the definition named `volumeName` and, if that
// fails too, adds the removal's message after the mount's. Returns true when mounted.
bool ConfigureAndMount(StorageInfoImpl& storage, NetworkFileSystem& volume, const std::string& volumeName,
                       bool readOnly, bool isPE, unsigned flags, OnMountFailure onFailure, const OutputPtr& out);

} // namespace OrvaneCli::FileSystem
