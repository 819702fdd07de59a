#include "LinuxMounts.h"

#include <blkid/blkid.h>
#include <libmount/libmount.h>
#include <sys/stat.h>
#include <sys/statvfs.h>

#include <cerrno>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <memory>
#include <mutex>
#include <sstream>
#include <stdexcept>
#include <thread>

namespace HostLinux {

namespace {

struct TableFree {
    void operator()(libmnt_table* t) const { mnt_unref_table(t); }
};
struct IterFree {
    void operator()(libmnt_iter* i) const { mnt_free_iter(i); }
};
struct ProbeFree {
    void operator()(blkid_struct_probe* p) const { blkid_free_probe(p); }
};

const char* OrEmpty(const char* text) { return text ? text : ""; }

} // namespace

std::vector<MountEntry> ReadMountTable(const std::string& path)
{
    // libmount answers a missing file with a null table and errno set.
    errno = 0;
    std::unique_ptr<libmnt_table, TableFree> table(mnt_new_table_from_file(path.c_str()));
    if (!table) {
        const int error = errno ? errno : EINVAL;
        throw std::runtime_error("Cannot read mount table '" + path + "': " + std::strerror(error));
    }
    std::unique_ptr<libmnt_iter, IterFree> iter(mnt_new_iter(MNT_ITER_FORWARD));
    if (!iter)
        throw std::runtime_error("Cannot read mount table '" + path + "': out of memory");
    std::vector<MountEntry> result;
    libmnt_fs* fs = nullptr;
    while (mnt_table_next_fs(table.get(), iter.get(), &fs) == 0) {
        MountEntry entry;
        entry.id = mnt_fs_get_id(fs);
        entry.target = OrEmpty(mnt_fs_get_target(fs));
        entry.source = OrEmpty(mnt_fs_get_source(fs));
        entry.fsType = OrEmpty(mnt_fs_get_fstype(fs));
        char* options = mnt_fs_strdup_options(fs);
        entry.options = OrEmpty(options);
        std::free(options);
        result.push_back(std::move(entry));
    }
    return result;
}

FilesystemKinds ReadFilesystemKinds(const std::string& path)
{
    FilesystemKinds kinds;
    std::ifstream in(path);
    std::string line;
    while (std::getline(in, line)) {
        // "nodev\tname" or "\tname"
        const auto tab = line.find('\t');
        if (tab == std::string::npos)
            continue;
        const std::string name = line.substr(tab + 1);
        if (name.empty())
            continue;
        (line.compare(0, tab, "nodev") == 0 ? kinds.nodev : kinds.block).insert(name);
    }
    return kinds;
}

MountKind Classify(const MountEntry& entry, const FilesystemKinds& kinds)
{
    if (entry.fsType == "nfs")
        return MountKind::Nfs3;
    if (entry.fsType == "nfs4")
        return MountKind::Nfs4;
    std::string type = entry.fsType;
    if (!kinds.Has(type)) {
        const auto dot = type.find('.');
        if (dot != std::string::npos)
            type.resize(dot);
    }
    return kinds.block.count(type) != 0 ? MountKind::Block : MountKind::Other;
}

std::optional<std::string> OptionValue(const std::string& options, const std::string& name)
{
    char* value = nullptr;
    size_t size = 0;
    if (mnt_optstr_get_option(options.c_str(), name.c_str(), &value, &size) != 0)
        return std::nullopt;
    return value ? std::string(value, size) : std::string();
}

namespace {

std::uint64_t Number(const std::optional<std::string>& text, std::uint64_t otherwise)
{
    if (!text || text->empty())
        return otherwise;
    std::uint64_t value = 0;
    for (char c : *text) {
        if (c < '0' || c > '9')
            return otherwise;
        value = value * 10 + static_cast<std::uint64_t>(c - '0');
        if (value > 0xffffffffULL)
            return otherwise;
    }
    return value;
}

} // namespace

NfsOptions ReadNfsOptions(const std::string& options)
{
    NfsOptions nfs;
    if (auto vers = OptionValue(options, "vers"))
        nfs.version = *vers;
    else if (auto nfsvers = OptionValue(options, "nfsvers"))
        nfs.version = *nfsvers;
    // The kernel writes "vers=4" for 4.0 in some releases; one name for one version.
    if (nfs.version == "4")
        nfs.version = "4.0";
    if (auto minor = OptionValue(options, "minorversion"); minor && nfs.version == "4.0" && !minor->empty())
        nfs.version = "4." + *minor;
    nfs.connections = static_cast<std::int64_t>(Number(OptionValue(options, "nconnect"), 1));
    nfs.rsize = static_cast<std::uint32_t>(Number(OptionValue(options, "rsize"), 0));
    nfs.wsize = static_cast<std::uint32_t>(Number(OptionValue(options, "wsize"), 0));
    if (auto sec = OptionValue(options, "sec"))
        nfs.security = *sec;
    nfs.readOnly = OptionValue(options, "ro").has_value();
    return nfs;
}

NfsSource SplitNfsSource(const std::string& source)
{
    NfsSource result;
    if (!source.empty() && source.front() == '[') {
        const auto close = source.find("]:");
        if (close != std::string::npos) {
            result.host = source.substr(1, close - 1);
            result.share = source.substr(close + 2);
            return result;
        }
    }
    const auto colon = source.find(':');
    if (colon == std::string::npos) {
        result.share = source;
        return result;
    }
    result.host = source.substr(0, colon);
    result.share = source.substr(colon + 1);
    return result;
}

std::optional<Capacity> StatWithin(const std::string& path, int seconds)
{
    struct Shared {
        std::mutex mutex;
        std::condition_variable done;
        bool finished = false;
        int error = 0;
        struct statvfs st {};
    };
    auto shared = std::make_shared<Shared>();
    std::thread worker([shared, path] {
        struct statvfs st {};
        const int rc = ::statvfs(path.c_str(), &st);
        const int error = rc == 0 ? 0 : errno;
        std::lock_guard<std::mutex> lock(shared->mutex);
        shared->st = st;
        shared->error = error;
        shared->finished = true;
        shared->done.notify_all();
    });
    // A worker stuck on a dead server is left behind; it holds only its own copy of the state.
    worker.detach();
    std::unique_lock<std::mutex> lock(shared->mutex);
    if (!shared->done.wait_for(lock, std::chrono::seconds(seconds), [&] { return shared->finished; }))
        return std::nullopt;
    if (shared->error != 0)
        throw std::runtime_error(std::strerror(shared->error));
    Capacity capacity;
    const auto& st = shared->st;
    capacity.size = static_cast<std::uint64_t>(st.f_blocks) * st.f_frsize;
    capacity.available = static_cast<std::uint64_t>(st.f_bavail) * st.f_frsize;
    capacity.fsid = st.f_fsid;
    return capacity;
}

Identity ProbeDevice(const std::string& source)
{
    Identity identity;
    struct stat st {};
    if (source.rfind("/dev/", 0) != 0 || ::stat(source.c_str(), &st) != 0 || !S_ISBLK(st.st_mode))
        return identity;
    // The low-level probe reads the superblock only; it writes no cache.
    std::unique_ptr<blkid_struct_probe, ProbeFree> probe(blkid_new_probe_from_filename(source.c_str()));
    if (!probe)
        return identity;
    blkid_probe_enable_superblocks(probe.get(), 1);
    blkid_probe_set_superblocks_flags(probe.get(), BLKID_SUBLKS_UUID | BLKID_SUBLKS_LABEL);
    if (blkid_do_safeprobe(probe.get()) != 0)
        return identity;
    const char* value = nullptr;
    if (blkid_probe_lookup_value(probe.get(), "UUID", &value, nullptr) == 0 && value)
        identity.uuid = value;
    if (blkid_probe_lookup_value(probe.get(), "LABEL", &value, nullptr) == 0 && value)
        identity.label = value;
    return identity;
}

std::string FsidText(std::uint64_t fsid)
{
    char text[17];
    std::snprintf(text, sizeof text, "%016llx", static_cast<unsigned long long>(fsid));
    return text;
}

} // namespace HostLinux
