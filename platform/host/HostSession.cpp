#include "HostSession.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <thread>
#include <unordered_map>
#include <vector>

#include <fcntl.h>
#include <pwd.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "FeatureList.h"
#include "HostRuntime.h"

extern "C" {
unsigned char* FeatureList[kFeatureListSize] = {};
}

namespace HostSim {

namespace {

using Runtime::Throw;

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
    std::string path;
    int lockFd = -1;
    std::optional<std::string> error; // the state file is unusable
    Model::State state;
    bool dirty = false;
    std::vector<std::uint64_t> faultHits;
    Indexes indexes;
};

Session gSession;

std::string Errno()
{
    return std::strerror(errno);
}

std::string DirectoryOf(const std::string& path)
{
    auto slash = path.rfind('/');
    if (slash == std::string::npos)
        return ".";
    if (slash == 0)
        return "/";
    return path.substr(0, slash);
}

// mkdir -p; true when the folder exists afterwards.
bool MakeDirectories(const std::string& dir)
{
    struct stat st{};
    if (::stat(dir.c_str(), &st) == 0)
        return S_ISDIR(st.st_mode);
    if (dir != "/" && dir != "." && !MakeDirectories(DirectoryOf(dir)))
        return false;
    return ::mkdir(dir.c_str(), 0755) == 0 || errno == EEXIST;
}

// Reads the state file; a missing file is the demo host. Fills `session.state` or `error`.
void Load(Session& session)
{
    session.error.reset();
    session.state = Model::State();
    session.indexes = Indexes();
    session.dirty = false;
    struct stat st{};
    if (::stat(session.path.c_str(), &st) != 0) {
        if (errno == ENOENT) {
            session.state = Model::Demo();
            return;
        }
        session.error = "Cannot read host state file '" + session.path + "': " + Errno();
        return;
    }
    if (S_ISDIR(st.st_mode)) {
        session.error = "Cannot read host state file '" + session.path + "': it is a folder";
        return;
    }
    std::ifstream in(session.path, std::ios::binary);
    if (!in) {
        session.error = "Cannot read host state file '" + session.path + "': " + Errno();
        return;
    }
    try {
        session.state = Model::Parse(in, session.path);
    } catch (const Model::StateError& e) {
        session.state = Model::State();
        session.error = e.what();
    }
}

void ApplyFeatures(const Session& session)
{
    for (int i = 0; i < 4; ++i)
        gFeatureBytes[i] = (!session.error && session.state.Feature(i)) ? 1 : 0;
}

void Save(Session& session)
{
    const std::string dir = DirectoryOf(session.path);
    if (!MakeDirectories(dir))
        Throw("Cannot save host state file '" + session.path + "': cannot create folder '" + dir + "': " + Errno());
    std::string temp = session.path + ".tmp.XXXXXX";
    int fd = ::mkostemp(temp.data(), O_CLOEXEC);
    if (fd < 0)
        Throw("Cannot save host state file '" + session.path + "': " + Errno());
    auto fail = [&](const std::string& why) {
        ::close(fd);
        ::unlink(temp.c_str());
        Throw("Cannot save host state file '" + session.path + "': " + why);
    };
    struct stat old{};
    ::fchmod(fd, ::stat(session.path.c_str(), &old) == 0 ? (old.st_mode & 07777) : 0644);
    {
        std::ofstream out(temp, std::ios::binary | std::ios::trunc);
        std::vector<char> buffer(1 << 16);
        out.rdbuf()->pubsetbuf(buffer.data(), static_cast<std::streamsize>(buffer.size()));
        Model::Write(session.state, out);
        out.flush();
        if (!out)
            fail("write failed");
    }
    if (::fsync(fd) != 0)
        fail(Errno());
    ::close(fd);
    if (::rename(temp.c_str(), session.path.c_str()) != 0) {
        std::string why = Errno();
        ::unlink(temp.c_str());
        Throw("Cannot save host state file '" + session.path + "': " + why);
    }
    int dirFd = ::open(dir.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (dirFd >= 0) {
        ::fsync(dirFd);
        ::close(dirFd);
    }
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

void Throw(std::string message)
{
    throw HostCtlException(std::move(message));
}

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

void MarkDirty()
{
    gSession.dirty = true;
}

namespace {
// Records are kept in id order, so a binary search finds any of them; objects remember
// where their record was, which makes the usual look-up a single comparison.
template <typename Record>
Record* FindById(std::vector<Record>& list, std::uint64_t id, std::size_t& position)
{
    if (position < list.size() && list[position].id == id)
        return &list[position];
    auto it = std::lower_bound(list.begin(), list.end(), id,
                               [](const Record& r, std::uint64_t key) { return r.id < key; });
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
    if (!path || !*path)
        return;
    nlohmann::ordered_json line = {{"call", call}, {"target", entry.target}, {"args", entry.args}};
    if (error)
        line["error"] = *error;
    std::string text = line.dump(-1, ' ', false, nlohmann::ordered_json::error_handler_t::replace) + "\n";
    int fd = ::open(path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644);
    if (fd < 0)
        return; // the journal is a record for tests and diagnosis; it never fails a host call
    const char* data = text.data();
    std::size_t left = text.size();
    while (left > 0) {
        ssize_t n = ::write(fd, data, left);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            break;
        data += n;
        left -= static_cast<std::size_t>(n);
    }
    ::close(fd);
}

namespace Detail {

void Commit()
{
    if (!gSession.dirty)
        return;
    try {
        Save(gSession);
        gSession.dirty = false;
    } catch (const HostCtlException&) {
        Load(gSession); // what is on disk is the truth; a failed call changes nothing
        throw;
    }
}

void Abandon()
{
    if (gSession.dirty && gSession.open)
        Load(gSession);
}

} // namespace Detail
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

void OpenSession(const std::string& stateFile)
{
    CloseSession();
    if (stateFile.empty())
        throw std::runtime_error("No host state file was given");
    const std::string lockPath = stateFile + ".lock";
    const std::string dir = DirectoryOf(stateFile);
    if (!MakeDirectories(dir))
        throw std::runtime_error("Cannot create folder '" + dir + "' for host state file '" + stateFile +
                                 "': " + Errno());
    int fd = ::open(lockPath.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644);
    if (fd < 0)
        throw std::runtime_error("Cannot open lock file '" + lockPath + "': " + Errno());
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (::flock(fd, LOCK_EX | LOCK_NB) != 0) {
        if ((errno != EWOULDBLOCK && errno != EINTR) || std::chrono::steady_clock::now() >= deadline) {
            const bool busy = errno == EWOULDBLOCK;
            std::string why = Errno();
            ::close(fd);
            if (busy)
                throw std::runtime_error("Host state file '" + stateFile +
                                         "' is in use by another process (waited 10 seconds for lock file '" +
                                         lockPath + "')");
            throw std::runtime_error("Cannot lock '" + lockPath + "': " + why);
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    gSession.path = stateFile;
    gSession.lockFd = fd;
    gSession.open = true;
    gSession.faultHits.clear();
    Load(gSession);
    ApplyFeatures(gSession);
}

void CloseSession()
{
    if (gSession.lockFd >= 0)
        ::close(gSession.lockFd); // releases the lock
    gSession = Session();
    for (auto& byte : gFeatureBytes)
        byte = 0;
}

std::string DumpState()
{
    const Model::State& state = Runtime::CheckedState();
    std::ostringstream out;
    Model::Write(state, out);
    return std::move(out).str(); // hands over the buffer: a large state is not copied again
}

} // namespace HostSim
