#pragma once

// What the machine has mounted, read through libmount, and what each mount holds.

#include <cstdint>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace HostLinux {

// One line of a mount table, as libmount reads it (escapes already decoded).
struct MountEntry {
    int id = 0;
    std::string target;
    std::string source;
    std::string fsType;
    std::string options; // the mount's and the file system's options together
};

// Reads a mount table in the kernel's mountinfo format (or any format libmount knows).
// Throws std::runtime_error naming the file when it cannot be read.
std::vector<MountEntry> ReadMountTable(const std::string& path = "/proc/self/mountinfo");

// The file system types the kernel knows, split the way /proc/filesystems marks them.
struct FilesystemKinds {
    std::set<std::string> block; // need a device
    std::set<std::string> nodev; // need none
    bool Has(const std::string& type) const { return block.count(type) != 0 || nodev.count(type) != 0; }
};
FilesystemKinds ReadFilesystemKinds(const std::string& path = "/proc/filesystems");

enum class MountKind { Other, Block, Nfs3, Nfs4 };

// Block file systems (a type the kernel lists without "nodev"; for a "type.subtype" the
// main type decides) and the two kinds of NFS mount. Everything else is Other.
MountKind Classify(const MountEntry& entry, const FilesystemKinds& kinds);

// The NFS settings a mount carries in its options.
struct NfsOptions {
    std::string version;          // "3", "4.0", "4.1", "4.2"; "" when not given
    std::int64_t connections = 1; // nconnect
    std::uint32_t rsize = 0;
    std::uint32_t wsize = 0;
    std::string security; // sec=, "" when not given
    bool readOnly = false;
};
NfsOptions ReadNfsOptions(const std::string& options);

// The value of one option of a comma-separated option text (libmount's reading: quotes kept
// together); nothing when the option is absent, "" when it has no value.
std::optional<std::string> OptionValue(const std::string& options, const std::string& name);

// "host:/share" (the host may be a bracketed IPv6 address) split into host and share.
struct NfsSource {
    std::string host;
    std::string share;
};
NfsSource SplitNfsSource(const std::string& source);

struct Capacity {
    std::uint64_t size = 0;      // f_blocks * f_frsize
    std::uint64_t available = 0; // f_bavail * f_frsize
    std::uint64_t fsid = 0;
};

// statvfs on `path`, answered within `seconds` (asked in a worker thread, so a server that
// no longer answers cannot hold the caller). Nothing on time-out; throws std::runtime_error
// with the system's reason when statvfs fails.
std::optional<Capacity> StatWithin(const std::string& path, int seconds);

// The file system's UUID and label where libblkid can read them from `source` (a block
// device); empty fields otherwise.
struct Identity {
    std::string uuid;
    std::string label;
};
Identity ProbeDevice(const std::string& source);

// The f_fsid as 16 lower-case hex digits.
std::string FsidText(std::uint64_t fsid);

} // namespace HostLinux
