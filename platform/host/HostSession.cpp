#include "HostSession.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <istream>
#include <optional>
#include <ostream>
#include <sstream>
#include <stdexcept>
#include <unordered_map>
#include <utility>
#include <vector>

#include <dirent.h>
#include <fcntl.h>
#include <limits.h>
#include <pwd.h>
#include <signal.h>
#include <sys/file.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <unistd.h>

#include "FeatureList.h"
#include "HostRuntime.h"

extern "C" {
unsigned char* FeatureList[kFeatureListSize] = {};
}

namespace HostSim {

namespace {

constexpr int kFeatureIndexes[4] = {102, 103, 104, 270};
unsigned char gFeatureBytes[4] = {};

// The four switches always point at their bytes, so readers never meet a null entry.
[[maybe_unused]] const bool gFeatureTableReady = [] {
    for (int i = 0; i < 4; ++i)
        FeatureList[kFeatureIndexes[i]] = &gFeatureBytes[i];
    return true;
}();

struct Indexes {
    bool valid = false;
    std::unordered_multimap<std::string_view, std::uint32_t> byUuid;
    std::unordered_multimap<std::string_view, std::uint32_t> byName;
    std::unordered_multimap<std::string_view, std::uint32_t> byMountPoint;
};

struct Session {
    bool open = false;
    std::string path;     // as named; messages use it
    std::string resolved; // the final target of any symlinks
    std::string dir;      // the resolved file's folder
    std::string base;     // the resolved file's name in it
    int dirFd = -1;       // the folder, once it is known to exist
    int lockFd = -1;
    bool fromFile = false; // the state was read from the file (else the demo host)
    bool dryRun = false;
    std::optional<std::string> error; // the state file is unusable
    Model::State state;
    bool dirty = false;
    std::vector<std::uint64_t> faultHits;
    Indexes indexes;
};

Session gSession;
std::function<void(const std::string&)> gJournalSink;
bool gJournalWarned = false;

std::string Errno(int error = errno) { return std::strerror(error); }

std::string DirectoryOf(const std::string& path)
{
    auto slash = path.rfind('/');
    if (slash == std::string::npos)
        return ".";
    if (slash == 0)
        return "/";
    return path.substr(0, slash);
}

std::string BaseOf(const std::string& path)
{
    auto slash = path.rfind('/');
    return slash == std::string::npos ? path : path.substr(slash + 1);
}

class Fd {
public:
    explicit Fd(int fd = -1) : fd_(fd) {}
    ~Fd() { Reset(); }
    Fd(const Fd&) = delete;
    Fd& operator=(const Fd&) = delete;
    int Get() const { return fd_; }
    int Release() { return std::exchange(fd_, -1); }
    void Reset(int fd = -1)
    {
        if (fd_ >= 0)
            ::close(fd_);
        fd_ = fd;
    }

private:
    int fd_;
};

mode_t CurrentUmask()
{
    const mode_t mask = ::umask(0);
    ::umask(mask);
    return mask;
}

// mkdir -p for the state's folders; new folders are private to the user, as state folders are.
void MakeDirectories(const std::string& dir)
{
    struct stat st {};
    if (::stat(dir.c_str(), &st) == 0) {
        if (!S_ISDIR(st.st_mode))
            throw std::runtime_error("'" + dir + "' is not a folder");
        return;
    }
    if (errno != ENOENT)
        throw std::runtime_error("cannot use folder '" + dir + "': " + Errno());
    const std::string parent = DirectoryOf(dir);
    if (parent != dir)
        MakeDirectories(parent);
    if (::mkdir(dir.c_str(), 0700) != 0 && errno != EEXIST)
        throw std::runtime_error("cannot create folder '" + dir + "': " + Errno());
}

// What a state path leads to, after following symlinks once.
struct Resolution {
    std::string target;
    bool exists = false;
    struct stat st {};
};

Resolution Resolve(const std::string& path)
{
    Resolution r;
    r.target = path;
    for (int hops = 0;; ++hops) {
        if (::lstat(r.target.c_str(), &r.st) != 0) {
            if (errno == ENOENT)
                return r; // nothing there (a dangling link names where the file will be)
            throw std::runtime_error("Cannot use host state file '" + path + "': " + Errno());
        }
        if (!S_ISLNK(r.st.st_mode))
            break;
        if (hops >= 40)
            throw std::runtime_error("Cannot use host state file '" + path + "': " + Errno(ELOOP));
        std::string link(PATH_MAX, '\0');
        const ssize_t n = ::readlink(r.target.c_str(), link.data(), link.size());
        if (n < 0)
            throw std::runtime_error("Cannot use host state file '" + path + "': " + Errno());
        link.resize(static_cast<std::size_t>(n));
        r.target = (!link.empty() && link[0] == '/') ? link : DirectoryOf(r.target) + "/" + link;
    }
    if (!S_ISREG(r.st.st_mode))
        throw std::runtime_error("Host state file '" + path + "' is not a regular file");
    r.exists = true;
    return r;
}

double LockTimeoutSeconds()
{
    const char* text = std::getenv("AUTOCLI_LOCK_TIMEOUT");
    if (!text || !*text)
        return 10;
    char* end = nullptr;
    errno = 0;
    const double value = std::strtod(text, &end);
    if (errno != 0 || *end != '\0' || !(value >= 0) || value > 86400 * 365)
        throw std::runtime_error(std::string("Invalid AUTOCLI_LOCK_TIMEOUT '") + text +
                                 "': expected a number of seconds");
    return value;
}

std::string SecondsText(double seconds)
{
    std::ostringstream text;
    text << seconds << (seconds == 1 ? " second" : " seconds");
    return text.str();
}

void IgnoreAlarm(int) {}

// Waits in the kernel's queue for the lock, so that waiters are served as the lock frees
// rather than whoever polls first. A short repeating alarm interrupts the wait to check the
// deadline. Returns 0 once locked, EWOULDBLOCK past the deadline, else the error.
int WaitForLock(int fd, std::chrono::steady_clock::time_point deadline)
{
    struct sigaction quiet {
    }, oldAction{};
    quiet.sa_handler = IgnoreAlarm;
    sigemptyset(&quiet.sa_mask);
    quiet.sa_flags = 0; // no SA_RESTART: the alarm must end the wait
    ::sigaction(SIGALRM, &quiet, &oldAction);
    itimerval tick{}, oldTimer{};
    tick.it_value.tv_usec = 50000;
    tick.it_interval.tv_usec = 50000;
    ::setitimer(ITIMER_REAL, &tick, &oldTimer);
    int result = 0;
    for (;;) {
        if (::flock(fd, LOCK_EX) == 0)
            break;
        if (errno != EINTR) {
            result = errno;
            break;
        }
        if (std::chrono::steady_clock::now() >= deadline) {
            // One last try: the lock may have come free with the alarm.
            result = ::flock(fd, LOCK_EX | LOCK_NB) == 0 ? 0 : EWOULDBLOCK;
            break;
        }
    }
    const itimerval off{};
    ::setitimer(ITIMER_REAL, &off, nullptr);
    ::sigaction(SIGALRM, &oldAction, nullptr);
    if (oldTimer.it_value.tv_sec || oldTimer.it_value.tv_usec)
        ::setitimer(ITIMER_REAL, &oldTimer, nullptr);
    return result;
}

// Takes the exclusive lock on `name` in `dirFd`, creating it with `mode`. The lock file is
// never followed through a link and never left readable by others, so no other user can
// hold it.
int TakeLock(int dirFd, const std::string& name, mode_t mode, const std::string& statePath, const std::string& lockPath)
{
    const double timeout = LockTimeoutSeconds();
    const auto deadline =
        std::chrono::steady_clock::now() +
        std::chrono::duration_cast<std::chrono::steady_clock::duration>(std::chrono::duration<double>(timeout));
    for (;;) {
        Fd fd(::openat(dirFd, name.c_str(), O_RDONLY | O_CREAT | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK, mode));
        if (fd.Get() < 0) {
            if (errno == ELOOP)
                throw std::runtime_error("Lock file '" + lockPath + "' is a symbolic link; remove it");
            throw std::runtime_error("Cannot open lock file '" + lockPath + "': " + Errno());
        }
        struct stat st {};
        if (::fstat(fd.Get(), &st) != 0 || !S_ISREG(st.st_mode))
            throw std::runtime_error("Lock file '" + lockPath + "' is not a regular file; remove it");
        if ((st.st_mode & S_IRWXO) && st.st_uid == ::geteuid())
            ::fchmod(fd.Get(), st.st_mode & 0770);
        if (::flock(fd.Get(), LOCK_EX | LOCK_NB) != 0) {
            if (errno != EWOULDBLOCK && errno != EINTR)
                throw std::runtime_error("Cannot lock '" + lockPath + "': " + Errno());
            const int error = WaitForLock(fd.Get(), deadline);
            if (error == EWOULDBLOCK)
                throw std::runtime_error("Host state file '" + statePath + "' is in use by another process (waited " +
                                         SecondsText(timeout) + " for lock file '" + lockPath + "')");
            if (error != 0)
                throw std::runtime_error("Cannot lock '" + lockPath + "': " + Errno(error));
        }
        // A lock file removed or replaced while this process waited locks nothing: take the new one.
        struct stat now {};
        if (::fstatat(dirFd, name.c_str(), &now, AT_SYMLINK_NOFOLLOW) == 0 && now.st_dev == st.st_dev &&
            now.st_ino == st.st_ino)
            return fd.Release();
    }
}

// Writes everything to `fd`; false with errno set when that fails.
bool WriteAll(int fd, const char* data, std::size_t size)
{
    while (size > 0) {
        const ssize_t n = ::write(fd, data, size);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0) {
            if (n == 0)
                errno = EIO;
            return false;
        }
        data += n;
        size -= static_cast<std::size_t>(n);
    }
    return true;
}

// An output buffer over a descriptor: the state is written only through the descriptor
// that created its file.
class FdWriteBuf : public std::streambuf {
public:
    explicit FdWriteBuf(int fd) : fd_(fd), buffer_(1 << 16) { setp(buffer_.data(), buffer_.data() + buffer_.size()); }
    int Error() const { return error_; }

protected:
    int_type overflow(int_type ch) override
    {
        if (!Flush())
            return traits_type::eof();
        if (!traits_type::eq_int_type(ch, traits_type::eof())) {
            *pptr() = traits_type::to_char_type(ch);
            pbump(1);
        }
        return traits_type::not_eof(ch);
    }
    int sync() override { return Flush() ? 0 : -1; }

private:
    bool Flush()
    {
        if (error_)
            return false;
        if (!WriteAll(fd_, pbase(), static_cast<std::size_t>(pptr() - pbase()))) {
            error_ = errno;
            return false;
        }
        setp(buffer_.data(), buffer_.data() + buffer_.size());
        return true;
    }

    int fd_;
    std::vector<char> buffer_;
    int error_ = 0;
};

// An input buffer over a descriptor.
class FdReadBuf : public std::streambuf {
public:
    explicit FdReadBuf(int fd) : fd_(fd), buffer_(1 << 16) {}
    int Error() const { return error_; }

protected:
    int_type underflow() override
    {
        if (gptr() < egptr())
            return traits_type::to_int_type(*gptr());
        for (;;) {
            const ssize_t n = ::read(fd_, buffer_.data(), buffer_.size());
            if (n < 0 && errno == EINTR)
                continue;
            if (n < 0)
                error_ = errno;
            if (n <= 0)
                return traits_type::eof();
            setg(buffer_.data(), buffer_.data(), buffer_.data() + n);
            return traits_type::to_int_type(*gptr());
        }
    }

private:
    int fd_;
    std::vector<char> buffer_;
    int error_ = 0;
};

// Removes what killed writers left of their temporary files: FILE.tmp.* entries and the
// contents of such folders. Only names are removed; nothing is followed.
void RemoveStaleTemporaries(int dirFd, const std::string& base)
{
    const std::string prefix = base + ".tmp.";
    const int listFd = ::dup(dirFd);
    if (listFd < 0)
        return;
    DIR* dir = ::fdopendir(listFd);
    if (!dir) {
        ::close(listFd);
        return;
    }
    ::rewinddir(dir);
    std::vector<std::string> stale;
    while (const dirent* entry = ::readdir(dir))
        if (std::string_view(entry->d_name).substr(0, prefix.size()) == prefix)
            stale.emplace_back(entry->d_name);
    ::closedir(dir);
    for (const auto& name : stale) {
        struct stat st {};
        if (::fstatat(dirFd, name.c_str(), &st, AT_SYMLINK_NOFOLLOW) != 0)
            continue;
        if (!S_ISDIR(st.st_mode)) {
            ::unlinkat(dirFd, name.c_str(), 0);
            continue;
        }
        const int inner = ::openat(dirFd, name.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
        if (inner < 0)
            continue;
        if (DIR* sub = ::fdopendir(inner)) {
            std::vector<std::string> names;
            while (const dirent* entry = ::readdir(sub))
                if (std::strcmp(entry->d_name, ".") != 0 && std::strcmp(entry->d_name, "..") != 0)
                    names.emplace_back(entry->d_name);
            for (const auto& file : names)
                ::unlinkat(::dirfd(sub), file.c_str(), 0);
            ::closedir(sub);
        } else {
            ::close(inner);
        }
        ::unlinkat(dirFd, name.c_str(), AT_REMOVEDIR);
    }
}

// A fresh FILE.tmp.XXXXXX folder in `dirFd` that only this user can enter. The file inside it
// cannot be swapped by anyone who can write the state's folder, so the rename below moves
// exactly what this process wrote.
std::pair<std::string, int> MakePrivateFolder(int dirFd, const std::string& base)
{
    static const char kLetters[] = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789";
    for (int attempt = 0; attempt < 100; ++attempt) {
        unsigned char random[6];
        if (::getrandom(random, sizeof random, 0) != static_cast<ssize_t>(sizeof random))
            throw std::runtime_error(Errno());
        std::string name = base + ".tmp.";
        for (unsigned char byte : random)
            name += kLetters[byte % (sizeof kLetters - 1)];
        if (::mkdirat(dirFd, name.c_str(), 0700) != 0) {
            if (errno == EEXIST)
                continue;
            throw std::runtime_error(Errno());
        }
        const int fd = ::openat(dirFd, name.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
        struct stat st {};
        if (fd < 0 || ::fstat(fd, &st) != 0 || st.st_uid != ::geteuid() || (st.st_mode & 077)) {
            // Someone put another folder in its place: leave it to its owner.
            if (fd >= 0)
                ::close(fd);
            continue;
        }
        return {name, fd};
    }
    throw std::runtime_error("cannot create a temporary folder");
}

// The owner, group and mode the saved file gets.
struct FileIdentity {
    mode_t mode = 0;
    std::optional<std::pair<uid_t, gid_t>> owner;
};

// Writes `state` to `dirFd`/`base` in one step: temporary file written only through its
// descriptor, given its final mode, flushed, renamed over the old file, folder flushed.
// With `noReplace`, an existing file is not replaced (StateFileExists). Throws runtime_error
// with the reason.
void WriteAtomically(int dirFd, const std::string& base, const Model::State& state, const FileIdentity& identity,
                     bool noReplace)
{
    auto made = MakePrivateFolder(dirFd, base);
    const std::string folderName = std::move(made.first);
    Fd folder(made.second);
    const char* const kFile = "state";
    bool fileMade = false;
    auto cleanUp = [&] {
        if (fileMade)
            ::unlinkat(folder.Get(), kFile, 0);
        struct stat mine {
        }, there{};
        if (::fstat(folder.Get(), &mine) == 0 &&
            ::fstatat(dirFd, folderName.c_str(), &there, AT_SYMLINK_NOFOLLOW) == 0 && mine.st_ino == there.st_ino &&
            mine.st_dev == there.st_dev)
            ::unlinkat(dirFd, folderName.c_str(), AT_REMOVEDIR);
    };
    try {
        Fd fd(::openat(folder.Get(), kFile, O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
        if (fd.Get() < 0)
            throw std::runtime_error(Errno());
        fileMade = true;
        {
            FdWriteBuf buffer(fd.Get());
            std::ostream out(&buffer);
            Model::Write(state, out);
            out.flush();
            if (buffer.Error() || !out)
                throw std::runtime_error(Errno(buffer.Error() ? buffer.Error() : EIO));
        }
        if (identity.owner && ::fchown(fd.Get(), identity.owner->first, identity.owner->second) != 0) {
            // Another user's file keeps at least its group where this user may set it.
            (void)::fchown(fd.Get(), static_cast<uid_t>(-1), identity.owner->second);
        }
        if (::fchmod(fd.Get(), identity.mode) != 0 || ::fsync(fd.Get()) != 0)
            throw std::runtime_error(Errno());
        const int renamed = noReplace ? ::renameat2(folder.Get(), kFile, dirFd, base.c_str(), RENAME_NOREPLACE)
                                      : ::renameat(folder.Get(), kFile, dirFd, base.c_str());
        if (renamed != 0) {
            if (noReplace && errno == EEXIST)
                throw StateFileExists("exists");
            throw std::runtime_error(Errno());
        }
        fileMade = false;
        ::fsync(dirFd);
    } catch (...) {
        cleanUp();
        throw;
    }
    cleanUp();
}

// Reads the state file (already locked) into `session`; a bad one is remembered.
void Load(Session& session)
{
    session.error.reset();
    session.state = Model::State();
    session.indexes = Indexes();
    session.dirty = false;
    const std::string what = "Cannot read host state file '" + session.path + "': ";
    Fd fd(::openat(session.dirFd, session.base.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
    struct stat st {};
    if (fd.Get() < 0) {
        session.error = what + Errno();
        return;
    }
    if (::fstat(fd.Get(), &st) != 0 || !S_ISREG(st.st_mode)) {
        session.error = "Host state file '" + session.path + "' is not a regular file";
        return;
    }
    FdReadBuf buffer(fd.Get());
    std::istream in(&buffer);
    try {
        session.state = Model::Parse(in, session.path);
    } catch (const Model::StateError& e) {
        session.state = Model::State();
        session.error = buffer.Error() ? what + Errno(buffer.Error()) : std::string(e.what());
    }
}

void ApplyFeatures(const Session& session)
{
    for (int i = 0; i < 4; ++i)
        gFeatureBytes[i] = (!session.error && session.state.Feature(i)) ? 1 : 0;
}

void Save(Session& session)
{
    FileIdentity identity;
    if (session.dirFd < 0) {
        // The demo host's first change: the folder and the lock come into being now.
        MakeDirectories(session.dir);
        session.dirFd = ::open(session.dir.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
        if (session.dirFd < 0)
            throw std::runtime_error(Errno());
        session.lockFd = TakeLock(session.dirFd, session.base + ".lock", (0666 & ~CurrentUmask()) & 0770, session.path,
                                  session.resolved + ".lock");
    }
    struct stat st {};
    if (::fstatat(session.dirFd, session.base.c_str(), &st, AT_SYMLINK_NOFOLLOW) == 0) {
        if (!session.fromFile)
            throw std::runtime_error("another process created it while this command ran; run the command again");
        if (!S_ISREG(st.st_mode))
            throw std::runtime_error("it is no longer a regular file");
        identity.mode = st.st_mode & 07777;
        if (st.st_uid != ::geteuid() || st.st_gid != ::getegid())
            identity.owner = std::make_pair(st.st_uid, st.st_gid);
    } else {
        identity.mode = 0666 & ~CurrentUmask();
    }
    RemoveStaleTemporaries(session.dirFd, session.base);
    WriteAtomically(session.dirFd, session.base, session.state, identity, false);
    session.fromFile = true;
}

void BuildIndexes(Session& session)
{
    auto& ix = session.indexes;
    if (ix.valid)
        return;
    ix = Indexes();
    const auto& list = session.state.fileSystems;
    ix.byUuid.reserve(list.size());
    ix.byName.reserve(list.size());
    ix.byMountPoint.reserve(list.size());
    for (std::uint32_t i = 0; i < list.size(); ++i) {
        ix.byUuid.emplace(list[i].uuid, i);
        ix.byName.emplace(list[i].volumeName, i);
        ix.byMountPoint.emplace(list[i].mountPoint, i);
    }
    ix.valid = true;
}

// The first position among `map`'s entries for `key` that `accept` takes, or npos.
template <typename Accept>
std::size_t First(const std::unordered_multimap<std::string_view, std::uint32_t>& map, std::string_view key,
                  Accept&& accept)
{
    std::size_t best = std::string::npos;
    auto [begin, end] = map.equal_range(key);
    for (auto it = begin; it != end; ++it)
        if (it->second < best && accept(it->second))
            best = it->second;
    return best;
}

std::string HomeFolder()
{
    if (const char* home = std::getenv("HOME"); home && *home)
        return home;
    if (const passwd* pw = ::getpwuid(::getuid()); pw && pw->pw_dir)
        return pw->pw_dir;
    return "/tmp";
}

} // namespace

namespace Runtime {

void Throw(std::string message) { throw HostCtlException(std::move(message)); }

State& CheckedState()
{
    if (!gSession.open)
        Throw("No host session is open");
    if (gSession.error)
        Throw(*gSession.error);
    return gSession.state;
}

void CheckFault(std::string_view call, std::initializer_list<std::string_view> targets)
{
    auto& faults = gSession.state.faults;
    if (faults.empty())
        return;
    gSession.faultHits.resize(faults.size(), 0);
    for (std::size_t i = 0; i < faults.size(); ++i) {
        const auto& fault = faults[i];
        if (fault.call != call)
            continue;
        if (fault.target && std::find(targets.begin(), targets.end(), *fault.target) == targets.end())
            continue;
        const std::uint64_t hit = ++gSession.faultHits[i];
        if (hit > fault.skip && (!fault.times || hit - fault.skip <= *fault.times))
            Throw(fault.message);
    }
}

void MarkDirty() { gSession.dirty = true; }

namespace {
// Records are kept in id order, so a binary search finds any of them; objects remember
// where their record was, which makes the usual look-up a single comparison.
template <typename Record>
Record* FindById(std::vector<Record>& list, std::uint64_t id, std::size_t& position)
{
    if (position < list.size() && list[position].id == id)
        return &list[position];
    auto it =
        std::lower_bound(list.begin(), list.end(), id, [](const Record& r, std::uint64_t key) { return r.id < key; });
    if (it == list.end() || it->id != id)
        return nullptr;
    position = static_cast<std::size_t>(it - list.begin());
    return &*it;
}
} // namespace

FileSystemRecord* FindFileSystemById(std::uint64_t id, std::size_t& position)
{
    return FindById(gSession.state.fileSystems, id, position);
}

UnresolvedVolume* FindUnresolvedById(std::uint64_t id, std::size_t& position)
{
    return FindById(gSession.state.unresolvedVolumes, id, position);
}

const FileSystemRecord* FirstByUuid(std::string_view uuid)
{
    BuildIndexes(gSession);
    std::size_t pos = First(gSession.indexes.byUuid, uuid, [](std::uint32_t) { return true; });
    return pos == std::string::npos ? nullptr : &gSession.state.fileSystems[pos];
}

const FileSystemRecord* FirstByVolumeName(std::string_view name)
{
    BuildIndexes(gSession);
    std::size_t pos = First(gSession.indexes.byName, name, [](std::uint32_t) { return true; });
    return pos == std::string::npos ? nullptr : &gSession.state.fileSystems[pos];
}

const FileSystemRecord* FirstMountedByPath(std::string_view path)
{
    BuildIndexes(gSession);
    const auto& list = gSession.state.fileSystems;
    auto mounted = [&](std::uint32_t i) { return list[i].mounted; };
    std::size_t best = First(gSession.indexes.byMountPoint, path, mounted);
    constexpr std::string_view prefix = "/hlfs/volumes/";
    if (path.substr(0, prefix.size()) == prefix)
        best = std::min(best, First(gSession.indexes.byName, path.substr(prefix.size()), mounted));
    return best == std::string::npos ? nullptr : &list[best];
}

void InvalidateIndexes()
{
    gSession.indexes.valid = false;
    gSession.indexes.byUuid.clear();
    gSession.indexes.byName.clear();
    gSession.indexes.byMountPoint.clear();
}

void WriteJournal(std::string_view call, const JournalEntry& entry, const std::string* error)
{
    const char* path = std::getenv("AUTOCLI_JOURNAL");
    if (!gJournalSink && (!path || !*path))
        return;
    nlohmann::ordered_json line = {{"call", call}, {"target", entry.target}, {"args", entry.args}};
    if (error)
        line["error"] = *error;
    std::string text = line.dump(-1, ' ', false, nlohmann::ordered_json::error_handler_t::replace);
    if (gJournalSink) {
        gJournalSink(text);
        return;
    }
    text += "\n";
    // Never through a link, and never waiting on a pipe nobody reads.
    Fd fd(::open(path, O_WRONLY | O_APPEND | O_CREAT | O_NOFOLLOW | O_CLOEXEC | O_NONBLOCK, 0644));
    if (fd.Get() < 0 || !WriteAll(fd.Get(), text.data(), text.size())) {
        // The journal is a record for tests and diagnosis; it never fails a host call, but
        // a journal that cannot be written is said once.
        if (!gJournalWarned) {
            gJournalWarned = true;
            const std::string warning = std::string("Cannot write the call journal '") + path +
                                        "': " + (errno == ELOOP ? std::string("it is a symbolic link") : Errno()) +
                                        "\n";
            (void)!::write(STDERR_FILENO, warning.data(), warning.size());
        }
    }
}

} // namespace Runtime

std::string DefaultStatePath()
{
    if (const char* state = std::getenv("AUTOCLI_STATE"); state && *state)
        return state;
    std::string base;
    if (const char* xdg = std::getenv("XDG_STATE_HOME"); xdg && *xdg)
        base = xdg;
    else
        base = HomeFolder() + "/.local/state";
    return base + "/autocli/host.json";
}

StateChoice ChooseStatePath(const std::string* option)
{
    if (option)
        return {*option, true};
    const char* state = std::getenv("AUTOCLI_STATE");
    return {DefaultStatePath(), state && *state};
}

void OpenSession(const std::string& stateFile, const SessionOptions& options)
{
    CloseSession();
    if (stateFile.empty())
        throw std::runtime_error("No host state file was given");
    Resolution where = Resolve(stateFile);
    Session& session = gSession;
    session.path = stateFile;
    session.resolved = where.target;
    session.dir = DirectoryOf(where.target);
    session.base = BaseOf(where.target);
    session.dryRun = options.dryRun;
    if (where.exists) {
        session.dirFd = ::open(session.dir.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
        if (session.dirFd < 0) {
            const std::string why = Errno();
            CloseSession();
            throw std::runtime_error("Cannot use host state file '" + stateFile + "': " + why);
        }
        try {
            session.lockFd = TakeLock(session.dirFd, session.base + ".lock", where.st.st_mode & 0770, stateFile,
                                      where.target + ".lock");
        } catch (...) {
            CloseSession();
            throw;
        }
        // What is there now, under the lock, is what counts.
        struct stat st {};
        if (::fstatat(session.dirFd, session.base.c_str(), &st, AT_SYMLINK_NOFOLLOW) != 0) {
            if (errno != ENOENT) {
                const std::string why = Errno();
                CloseSession();
                throw std::runtime_error("Cannot use host state file '" + stateFile + "': " + why);
            }
            where.exists = false;
        } else if (!S_ISREG(st.st_mode)) {
            CloseSession();
            throw std::runtime_error("Host state file '" + stateFile + "' is not a regular file");
        }
    }
    if (!where.exists && options.mustExist) {
        CloseSession();
        throw StateFileMissing("State file '" + stateFile + "' does not exist.");
    }
    session.open = true;
    session.faultHits.clear();
    if (where.exists) {
        session.fromFile = true;
        Load(session);
    } else {
        session.state = Model::Demo();
    }
    ApplyFeatures(session);
}

void SaveChanges()
{
    Session& session = gSession;
    if (!session.open || !session.dirty || session.dryRun || session.error)
        return;
    try {
        Save(session);
        session.dirty = false;
    } catch (const std::exception& e) {
        throw std::runtime_error("Cannot save host state file '" + session.path + "': " + e.what());
    }
}

void CloseSession()
{
    if (gSession.lockFd >= 0)
        ::close(gSession.lockFd); // releases the lock
    if (gSession.dirFd >= 0)
        ::close(gSession.dirFd);
    gSession = Session();
    for (auto& byte : gFeatureBytes)
        byte = 0;
}

void InitState(const std::string& stateFile)
{
    CloseSession();
    const std::string exists = "Host state file '" + stateFile + "' already exists; --init-state leaves it as it is.";
    if (stateFile.empty())
        throw std::runtime_error("No host state file was given");
    struct stat st {};
    if (::lstat(stateFile.c_str(), &st) == 0)
        throw StateFileExists(exists);
    if (errno != ENOENT)
        throw std::runtime_error("Cannot use host state file '" + stateFile + "': " + Errno());
    const std::string dir = DirectoryOf(stateFile);
    const std::string base = BaseOf(stateFile);
    try {
        MakeDirectories(dir);
        Fd dirFd(::open(dir.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
        if (dirFd.Get() < 0)
            throw std::runtime_error(Errno());
        const mode_t mode = 0666 & ~CurrentUmask();
        Fd lock(TakeLock(dirFd.Get(), base + ".lock", mode & 0770, stateFile, stateFile + ".lock"));
        RemoveStaleTemporaries(dirFd.Get(), base);
        WriteAtomically(dirFd.Get(), base, Model::Demo(), FileIdentity{mode, std::nullopt}, true);
    } catch (const StateFileExists&) {
        throw StateFileExists(exists);
    } catch (const std::exception& e) {
        throw std::runtime_error("Cannot create host state file '" + stateFile + "': " + e.what());
    }
}

std::string DumpState()
{
    const Model::State& state = Runtime::CheckedState();
    std::ostringstream out;
    Model::Write(state, out);
    return std::move(out).str(); // hands over the buffer: a large state is not copied again
}

void SetJournalSink(std::function<void(const std::string&)> sink) { gJournalSink = std::move(sink); }

} // namespace HostSim
