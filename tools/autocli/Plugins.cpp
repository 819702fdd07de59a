#include "Plugins.h"

#include <dlfcn.h>
#include <limits.h>
#include <sys/auxv.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <system_error>

namespace AutoCliFrontEnd {

namespace {

namespace fs = std::filesystem;
using Quillets::AutoCli::NamespaceNode;
using RegisterFunction = void (*)(std::shared_ptr<NamespaceNode>);

std::optional<std::string> RealPath(const std::string& path)
{
    char buffer[PATH_MAX];
    if (::realpath(path.c_str(), buffer) == nullptr)
        return std::nullopt;
    return std::string(buffer);
}

std::string ParentOf(const std::string& path)
{
    const auto slash = path.rfind('/');
    return slash == 0 || slash == std::string::npos ? std::string("/") : path.substr(0, slash);
}

// Why a resolved file or folder could be changed by someone
// other than root or the caller; nothing when it could not.
std::optional<std::string> Untrusted(const struct stat& st)
{
    if (st.st_uid != 0 && st.st_uid != ::geteuid())
        return "it is owned by user " + std::to_string(st.st_uid) + ", neither root nor the caller";
    if ((st.st_mode & (S_IWGRP | S_IWOTH)) != 0) {
        // A sticky folder of root's (like /tmp) lets nobody rename or remove what others own in it.
        if (S_ISDIR(st.st_mode) && (st.st_mode & S_ISVTX) != 0 && st.st_uid == 0)
            return std::nullopt;
        return std::string("it can be written by users other than its owner");
    }
    return std::nullopt;
}

// Checks `folder` (resolved) and every folder above it; the message names the first that fails.
std::optional<std::string> UntrustedFolder(const std::string& folder)
{
    for (std::string at = folder;; at = ParentOf(at)) {
        struct stat st {};
        if (::stat(at.c_str(), &st) != 0)
            return "'" + at + "' cannot be examined: " + std::strerror(errno);
        if (auto why = Untrusted(st))
            return "'" + at + "': " + *why;
        if (at == "/")
            return std::nullopt;
    }
}

} // namespace

PluginFolder FindPluginFolder()
{
    PluginFolder result;
    if (const char* configured = std::getenv("AUTOCLI_PLUGIN_PATH"); configured && *configured) {
        if (configured[0] != '/') {
            result.error = std::string("AUTOCLI_PLUGIN_PATH must name an absolute folder, not '") + configured + "'.";
            result.usageError = true;
            return result;
        }
        result.path = configured;
        return result;
    }
    // The executable's real path: from the kernel, else from what it was started as, when
    // that is absolute. Never from the current folder.
    std::optional<std::string> self = RealPath("/proc/self/exe");
    if (!self) {
        // NOLINTNEXTLINE(performance-no-int-to-ptr): the loader hands the address over as an integer
        const char* started = reinterpret_cast<const char*>(::getauxval(AT_EXECFN));
        if (started && started[0] == '/')
            self = RealPath(started);
    }
    if (!self || (*self)[0] != '/') {
        result.error = "Cannot find the plug-in folder: the path of the running program is not known "
                       "(set AUTOCLI_PLUGIN_PATH to an absolute folder).";
        return result;
    }
    result.path = (fs::path(*self).parent_path() / ".." / "lib" / "autocli" / "plugins").lexically_normal().string();
    if (result.path.size() > 1 && result.path.back() == '/')
        result.path.pop_back();
    return result;
}

PluginLoad LoadPlugins(const std::string& folder, const std::shared_ptr<NamespaceNode>& root,
                       const std::shared_ptr<NamespaceNode>& storage,
                       std::string (*describe)(const std::exception_ptr&))
{
    PluginLoad load;
    const auto realFolder = RealPath(folder);
    if (!realFolder) {
        load.error = "Cannot read the plug-in folder '" + folder + "': " + std::strerror(errno);
        return load;
    }
    if (auto why = UntrustedFolder(*realFolder)) {
        load.warnings.push_back("Skipping the plug-in folder '" + folder + "': " + *why + ".");
        load.error = "No plug-in could be loaded from '" + folder + "'.";
        return load;
    }

    std::vector<std::string> names;
    std::error_code error;
    for (fs::directory_iterator it(*realFolder, error), end; !error && it != end; it.increment(error)) {
        if (it->path().extension() == ".so")
            names.push_back(it->path().filename().string());
    }
    if (error) {
        load.error = "Cannot read the plug-in folder '" + folder + "': " + error.message();
        return load;
    }
    std::sort(names.begin(), names.end());

    int loaded = 0;
    for (const auto& name : names) {
        const std::string shown = folder + "/" + name;
        auto skip = [&](const std::string& why) {
            load.warnings.push_back("Skipping plug-in '" + shown + "': " + why + ".");
        };
        const auto file = RealPath(*realFolder + "/" + name);
        struct stat st {};
        if (!file || ::stat(file->c_str(), &st) != 0) {
            skip(std::string("it cannot be examined: ") + std::strerror(errno));
            continue;
        }
        if (!S_ISREG(st.st_mode)) {
            skip("it is not a regular file");
            continue;
        }
        if (auto why = Untrusted(st)) {
            skip(*why);
            continue;
        }
        // A link may lead out of the checked folder: its target's folders must be as safe.
        if (ParentOf(*file) != *realFolder) {
            if (auto why = UntrustedFolder(ParentOf(*file))) {
                skip(*why);
                continue;
            }
        }
        // Plug-ins stay loaded for the life of the process: the tree holds their objects.
        void* handle = ::dlopen(file->c_str(), RTLD_NOW | RTLD_LOCAL);
        if (handle == nullptr) {
            const char* why = ::dlerror();
            load.warnings.push_back("Cannot load plug-in '" + shown + "': " + (why ? why : "unknown error"));
            continue;
        }
        auto registerStorage = reinterpret_cast<RegisterFunction>(::dlsym(handle, "FilesystemNfs_RegisterNamespaces"));
        auto registerRoot = reinterpret_cast<RegisterFunction>(::dlsym(handle, "AutoCli_RegisterNamespaces"));
        if (registerStorage == nullptr && registerRoot == nullptr) {
            load.warnings.push_back("Skipping '" + shown +
                                    "': it is not a storage plug-in (it exports no registration function).");
            ::dlclose(handle);
            continue;
        }
        try {
            if (registerStorage != nullptr)
                registerStorage(storage);
            if (registerRoot != nullptr)
                registerRoot(root);
        } catch (...) {
            load.error = "Plug-in '" + shown + "' failed to register: " + describe(std::current_exception());
            return load;
        }
        ++loaded;
    }
    if (loaded == 0)
        load.error = "No plug-in could be loaded from '" + folder + "'.";
    return load;
}

} // namespace AutoCliFrontEnd
