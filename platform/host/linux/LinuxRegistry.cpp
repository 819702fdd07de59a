#include "LinuxRegistry.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <thread>

#include <nlohmann/json.hpp>

namespace HostLinux {

namespace {

constexpr const char* kFileName = "linux-host.json";
constexpr const char* kLockName = "linux-host.json.lock";

std::string Errno() { return std::strerror(errno); }

std::string ParentOf(const std::string& path)
{
    const auto slash = path.rfind('/');
    return slash == 0 || slash == std::string::npos ? std::string("/") : path.substr(0, slash);
}

// mkdir -p for the registry folder; only root-owned-style permissions (0755).
void MakeFolders(const std::string& dir)
{
    struct stat st {};
    if (::stat(dir.c_str(), &st) == 0) {
        if (!S_ISDIR(st.st_mode))
            throw std::runtime_error("'" + dir + "' is not a folder");
        return;
    }
    if (dir != "/")
        MakeFolders(ParentOf(dir));
    if (::mkdir(dir.c_str(), 0755) != 0 && errno != EEXIST)
        throw std::runtime_error("Cannot create folder '" + dir + "': " + Errno());
}

int LockTimeoutSeconds()
{
    if (const char* text = std::getenv("AUTOCLI_LOCK_TIMEOUT"); text && *text) {
        char* end = nullptr;
        const long value = std::strtol(text, &end, 10);
        if (end && *end == '\0' && value >= 0 && value <= 3600)
            return static_cast<int>(value);
    }
    return 10;
}

const char* Expect(const nlohmann::json& value, const char* what, bool ok)
{
    if (!ok)
        throw std::runtime_error(std::string("'") + what + "' has the wrong type");
    (void)value;
    return what;
}

RegisteredVolume FromJson(const nlohmann::json& item)
{
    if (!item.is_object())
        throw std::runtime_error("a volume is not an object");
    RegisteredVolume v;
    for (const auto& [key, value] : item.items()) {
        if (key == "name")
            Expect(value, "name", value.is_string()), v.name = value.get<std::string>();
        else if (key == "version") {
            Expect(value, "version", value.is_string() && (value == "3" || value == "4.1"));
            v.v41 = value == "4.1";
        } else if (key == "hosts") {
            Expect(value, "hosts", value.is_array());
            for (const auto& host : value)
                Expect(host, "hosts", host.is_string()), v.hosts.push_back(host.get<std::string>());
        } else if (key == "share")
            Expect(value, "share", value.is_string()), v.share = value.get<std::string>();
        else if (key == "readOnly")
            Expect(value, "readOnly", value.is_boolean()), v.readOnly = value.get<bool>();
        else if (key == "connections")
            Expect(value, "connections", value.is_number_integer()), v.connections = value.get<std::int64_t>();
        else if (key == "security")
            Expect(value, "security", value.is_number_integer()), v.security = value.get<int>();
        else if (key == "explicitlyUnmounted")
            Expect(value, "explicitlyUnmounted", value.is_boolean()), v.explicitlyUnmounted = value.get<bool>();
        else
            throw std::runtime_error("unknown key '" + key + "'");
    }
    if (!IsUsableVolumeName(v.name))
        throw std::runtime_error("a volume has no usable name");
    return v;
}

nlohmann::ordered_json ToJson(const RegisteredVolume& v)
{
    return {{"name", v.name},         {"version", v.v41 ? "4.1" : "3"},
            {"hosts", v.hosts},       {"share", v.share},
            {"readOnly", v.readOnly}, {"connections", v.connections},
            {"security", v.security}, {"explicitlyUnmounted", v.explicitlyUnmounted}};
}

// Reads the whole of an open file.
std::string ReadAll(int fd)
{
    std::string text;
    char buffer[8192];
    for (;;) {
        const ssize_t n = ::read(fd, buffer, sizeof buffer);
        if (n < 0 && errno == EINTR)
            continue;
        if (n < 0)
            throw std::runtime_error(Errno());
        if (n == 0)
            return text;
        text.append(buffer, static_cast<std::size_t>(n));
    }
}

std::vector<RegisteredVolume> Parse(const std::string& text, const std::string& file)
{
    std::vector<RegisteredVolume> result;
    try {
        const auto doc = nlohmann::json::parse(text);
        if (!doc.is_object())
            throw std::runtime_error("the document is not an object");
        for (const auto& [key, value] : doc.items()) {
            if (key != "volumes")
                throw std::runtime_error("unknown key '" + key + "'");
            if (!value.is_array())
                throw std::runtime_error("'volumes' is not an array");
            for (const auto& item : value)
                result.push_back(FromJson(item));
        }
    } catch (const nlohmann::json::exception& e) {
        throw std::runtime_error("Invalid registry file '" + file + "': " + e.what());
    } catch (const std::runtime_error& e) {
        throw std::runtime_error("Invalid registry file '" + file + "': " + e.what());
    }
    return result;
}

} // namespace

bool IsUsableVolumeName(const std::string& name)
{
    return !name.empty() && name.size() <= 255 && name != "." && name != ".." && name.find('/') == std::string::npos &&
           name.find('\0') == std::string::npos;
}

std::string Registry::DefaultFolder()
{
    if (const char* dir = std::getenv("AUTOCLI_LINUX_DIR"); dir && *dir) {
        std::string folder = dir;
        if (folder.front() != '/')
            throw std::runtime_error("AUTOCLI_LINUX_DIR must name an absolute folder, not '" + folder + "'");
        while (folder.size() > 1 && folder.back() == '/')
            folder.pop_back();
        return folder;
    }
    return "/var/lib/autocli";
}

Registry::Registry(std::string folder) : folder_(std::move(folder)) {}

Registry::~Registry()
{
    if (lockFd_ >= 0)
        ::close(lockFd_);
    if (folderFd_ >= 0)
        ::close(folderFd_);
}

std::vector<RegisteredVolume> Registry::Load() const
{
    const int dirFd = folderFd_ >= 0 ? folderFd_ : ::open(folder_.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (dirFd < 0) {
        if (errno == ENOENT)
            return {};
        throw std::runtime_error("Cannot open folder '" + folder_ + "': " + Errno());
    }
    const int fd = ::openat(dirFd, kFileName, O_RDONLY | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK);
    const int openError = errno;
    if (dirFd != folderFd_)
        ::close(dirFd);
    if (fd < 0) {
        if (openError == ENOENT)
            return {};
        throw std::runtime_error("Cannot read registry file '" + FilePath() + "': " + std::strerror(openError));
    }
    struct stat st {};
    if (::fstat(fd, &st) != 0 || !S_ISREG(st.st_mode)) {
        ::close(fd);
        throw std::runtime_error("Registry file '" + FilePath() + "' is not a regular file");
    }
    std::string text;
    try {
        text = ReadAll(fd);
    } catch (const std::runtime_error& e) {
        ::close(fd);
        throw std::runtime_error("Cannot read registry file '" + FilePath() + "': " + e.what());
    }
    ::close(fd);
    return Parse(text, FilePath());
}

void Registry::Lock()
{
    if (lockFd_ >= 0)
        return;
    MakeFolders(folder_);
    folderFd_ = ::open(folder_.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (folderFd_ < 0)
        throw std::runtime_error("Cannot open folder '" + folder_ + "': " + Errno());
    // Only the owner may hold the lock: a lock file others can open would let them block us.
    const int fd = ::openat(folderFd_, kLockName, O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC, 0600);
    if (fd < 0)
        throw std::runtime_error("Cannot open lock file '" + folder_ + "/" + kLockName + "': " + Errno());
    const int seconds = LockTimeoutSeconds();
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(seconds);
    while (::flock(fd, LOCK_EX | LOCK_NB) != 0) {
        if ((errno != EWOULDBLOCK && errno != EINTR) || std::chrono::steady_clock::now() >= deadline) {
            const bool busy = errno == EWOULDBLOCK;
            const std::string why = Errno();
            ::close(fd);
            if (busy)
                throw std::runtime_error("Registry file '" + FilePath() + "' is in use by another process (waited " +
                                         std::to_string(seconds) + " seconds for its lock)");
            throw std::runtime_error("Cannot lock '" + folder_ + "/" + kLockName + "': " + why);
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    lockFd_ = fd;
}

void Registry::Save(const std::vector<RegisteredVolume>& volumes)
{
    nlohmann::ordered_json doc = {{"volumes", nlohmann::ordered_json::array()}};
    for (const auto& v : volumes)
        doc["volumes"].push_back(ToJson(v));
    const std::string text = doc.dump(2) + "\n";
    const std::string file = FilePath();

    std::string temp = file + ".tmp.XXXXXX";
    const int fd = ::mkostemp(temp.data(), O_CLOEXEC);
    if (fd < 0)
        throw std::runtime_error("Cannot save registry file '" + file + "': " + Errno());
    const std::string tempName = temp.substr(folder_.size() + 1);
    auto fail = [&](const std::string& why) {
        ::close(fd);
        ::unlinkat(folderFd_, tempName.c_str(), 0);
        throw std::runtime_error("Cannot save registry file '" + file + "': " + why);
    };
    struct stat old {};
    const mode_t mode = ::fstatat(folderFd_, kFileName, &old, AT_SYMLINK_NOFOLLOW) == 0 && S_ISREG(old.st_mode)
                            ? (old.st_mode & 07777)
                            : 0644;
    const char* data = text.data();
    std::size_t left = text.size();
    while (left > 0) {
        const ssize_t n = ::write(fd, data, left);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            fail(n < 0 ? Errno() : "write failed");
        data += n;
        left -= static_cast<std::size_t>(n);
    }
    if (::fchmod(fd, mode) != 0)
        fail(Errno());
    if (::fsync(fd) != 0)
        fail(Errno());
    ::close(fd);
    if (::renameat(folderFd_, tempName.c_str(), folderFd_, kFileName) != 0) {
        const std::string why = Errno();
        ::unlinkat(folderFd_, tempName.c_str(), 0);
        throw std::runtime_error("Cannot save registry file '" + file + "': " + why);
    }
    ::fsync(folderFd_);
}

void Registry::Update(const std::function<void(std::vector<RegisteredVolume>&)>& change)
{
    Lock();
    std::vector<RegisteredVolume> volumes = Load();
    change(volumes);
    Save(volumes);
}

} // namespace HostLinux
