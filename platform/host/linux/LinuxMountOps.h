#pragma once

// Mounting and unmounting on a Linux host, without a shell and without following links
// that someone could have put in the way.

#include <string>

#include "LinuxMounts.h"

namespace HostLinux {

// The message for a kernel that cannot mount NFS at all.
extern const char* const kNoNfsClient;

// Throws std::runtime_error(kNoNfsClient) when the kernel lists no "nfs" file system
// (and, for v4.1, a similar message when it lists no "nfs4").
void RequireNfsClient(const FilesystemKinds& kinds, bool v41);

// An open descriptor (O_PATH) of `folder`/volumes/`name`, making both folders when missing;
// neither "volumes" nor `name` may be a symbolic link. The caller closes it.
int OpenMountPoint(const std::string& folder, const std::string& name);

// mount(2) onto the folder behind `fd` (through /proc/self/fd, so the path is not looked up
// again). Throws std::runtime_error with the system's reason.
void MountOnto(int fd, const std::string& source, const std::string& type, unsigned long flags,
               const std::string& data);

// Unmounts what is mounted on `path` (which must be a mount point); 0 when done, 1 when the
// file system is busy. Throws std::runtime_error for any other failure.
int UnmountPath(const std::string& path);

// The numeric address of `host` (a name or an address), for the kernel's addr= option.
// Throws std::runtime_error when it cannot be resolved.
std::string ResolveHost(const std::string& host);

} // namespace HostLinux
