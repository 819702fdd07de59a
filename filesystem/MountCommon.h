#pragma once

// What `storage filesystem mount` and `unmount` share.

#include <string>

#include "command/Command.h"

namespace OrvaneCli::FileSystem::Mounting {

using HostFileSystem = HostCtl::Storage::FileSystem;
using FileSystemPtr = std::unique_ptr<HostFileSystem>;

inline HostFileSystem::MountOperationOption MountOption(const InputPtr& in)
{
    return in->IsFlagSet(kOptionNoPersist) ? HostFileSystem::MOUNT_UNTIL_RESTART : HostFileSystem::MOUNT_PERSISTENT;
}

inline constexpr const char* kUuidNotFound = "No volume with uuid '%s' was found";
inline constexpr const char* kLabelNotFound = "No volume with label '%s' was found";

} // namespace OrvaneCli::FileSystem::Mounting
