#include "LinuxMountOps.h"

#include <arpa/inet.h>
#include <fcntl.h>
#include <netdb.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <stdexcept>

namespace HostLinux {

const char* const kNoNfsClient = "This kernel has no NFS client (nfs is not in /proc/filesystems)";

namespace {

std::string Errno() { return std::strerror(errno); }

// Opens (making it when missing) the folder `name` inside `parent`, refusing a link.
int OpenFolderAt(int parent, const std::string& name, const std::string& shown)
{
    if (::mkdirat(parent, name.c_str(), 0755) != 0 && errno != EEXIST)
        throw std::runtime_error("Cannot create folder '" + shown + "': " + Errno());
    const int fd = ::openat(parent, name.c_str(), O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    if (fd < 0)
        throw std::runtime_error("Cannot open folder '" + shown +
                                 "': " + (errno == ELOOP || errno == ENOTDIR ? std::string("not a folder") : Errno()));
    return fd;
}

} // namespace

void RequireNfsClient(const FilesystemKinds& kinds, bool v41)
{
    if (!kinds.Has("nfs"))
        throw std::runtime_error(kNoNfsClient);
    if (v41 && !kinds.Has("nfs4"))
        throw std::runtime_error("This kernel has no NFS v4 client (nfs4 is not in /proc/filesystems)");
}

int OpenMountPoint(const std::string& folder, const std::string& name)
{
    struct stat st {};
    if (::stat(folder.c_str(), &st) != 0 && errno == ENOENT && ::mkdir(folder.c_str(), 0755) != 0 && errno != EEXIST)
        throw std::runtime_error("Cannot create folder '" + folder + "': " + Errno());
    const int top = ::open(folder.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC);
    if (top < 0)
        throw std::runtime_error("Cannot open folder '" + folder + "': " + Errno());
    int volumes = -1;
    try {
        volumes = OpenFolderAt(top, "volumes", folder + "/volumes");
        ::close(top);
    } catch (...) {
        ::close(top);
        throw;
    }
    try {
        const int fd = OpenFolderAt(volumes, name, folder + "/volumes/" + name);
        ::close(volumes);
        return fd;
    } catch (...) {
        ::close(volumes);
        throw;
    }
}

void MountOnto(int fd, const std::string& source, const std::string& type, unsigned long flags, const std::string& data)
{
    const std::string target = "/proc/self/fd/" + std::to_string(fd);
    if (::mount(source.c_str(), target.c_str(), type.c_str(), flags, data.empty() ? nullptr : data.c_str()) != 0)
        throw std::runtime_error(Errno());
}

int UnmountPath(const std::string& path)
{
    // UMOUNT_NOFOLLOW: a link put in place of the mount point is not followed elsewhere.
    if (::umount2(path.c_str(), UMOUNT_NOFOLLOW) == 0)
        return 0;
    if (errno == EBUSY)
        return 1;
    throw std::runtime_error("Cannot unmount '" + path + "': " + Errno());
}

std::string ResolveHost(const std::string& host)
{
    addrinfo hints{};
    hints.ai_family = AF_UNSPEC;
    hints.ai_socktype = SOCK_STREAM;
    addrinfo* found = nullptr;
    const int rc = ::getaddrinfo(host.c_str(), nullptr, &hints, &found);
    if (rc != 0 || !found)
        throw std::runtime_error("Cannot resolve NFS server '" + host + "': " + ::gai_strerror(rc));
    char text[INET6_ADDRSTRLEN] = {};
    const void* address = found->ai_family == AF_INET6
                              ? static_cast<const void*>(&reinterpret_cast<sockaddr_in6*>(found->ai_addr)->sin6_addr)
                              : static_cast<const void*>(&reinterpret_cast<sockaddr_in*>(found->ai_addr)->sin_addr);
    const bool ok = ::inet_ntop(found->ai_family, address, text, sizeof text) != nullptr;
    ::freeaddrinfo(found);
    if (!ok)
        throw std::runtime_error("Cannot resolve NFS server '" + host + "'");
    return text;
}

} // namespace HostLinux
