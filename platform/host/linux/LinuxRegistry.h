#pragma once

// The NFS volumes this tool added on a Linux host, kept in DIR/linux-host.json.

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace HostLinux {

struct RegisteredVolume {
    std::string name;
    bool v41 = false;
    std::vector<std::string> hosts;
    std::string share;
    bool readOnly = false;
    std::int64_t connections = 1;
    int security = 0; // NetworkFileSystem::SecurityType
    bool explicitlyUnmounted = false;

    bool operator==(const RegisteredVolume&) const = default;
};

class Registry {
public:
    // DIR: $AUTOCLI_LINUX_DIR, else /var/lib/autocli. Throws std::runtime_error when the
    // variable names a relative folder.
    static std::string DefaultFolder();

    explicit Registry(std::string folder);
    ~Registry();
    Registry(const Registry&) = delete;
    Registry& operator=(const Registry&) = delete;

    const std::string& Folder() const { return folder_; }
    std::string FilePath() const { return folder_ + "/linux-host.json"; }
    std::string MountPoint(const std::string& name) const { return folder_ + "/volumes/" + name; }

    // The registered volumes. Reading takes no lock and creates nothing: saves replace the
    // file in one step, so a reader sees one whole version. Throws std::runtime_error for a
    // file that cannot be read or is not a registry.
    std::vector<RegisteredVolume> Load() const;

    // Changes the registry under its lock: the folder and the lock file are made when
    // missing, the lock (DIR/linux-host.json.lock) is held until this object is destroyed,
    // the file is read afresh, `change` edits the list, and the result is saved atomically.
    void Update(const std::function<void(std::vector<RegisteredVolume>&)>& change);

private:
    void Lock();
    void Save(const std::vector<RegisteredVolume>& volumes);

    std::string folder_;
    int folderFd_ = -1;
    int lockFd_ = -1;
};

// A volume name that can be a folder name under DIR/volumes: not empty, no "/", not "."
// or "..", at most 255 bytes.
bool IsUsableVolumeName(const std::string& name);

} // namespace HostLinux
