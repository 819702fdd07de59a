// The storage-control interface's own pieces: the exception, constants, text helpers and the
// out-of-line destructors that anchor each interface class (vtable and type information) in
// this library, so that exceptions and dynamic_cast work from the plug-in.

#include <arpa/inet.h>

#include <cstdarg>
#include <cstdio>
#include <string>

#include "hostctl/Host.h"
#include "hostctl/HostCtlException.h"
#include "hostctl/Misc.h"
#include "hostctl/Network.h"
#include "hostctl/Storage.h"

namespace HostCtl {

const std::string emptyString;

namespace Lib {
HostCtlException::HostCtlException(std::string text) : message(std::move(text)) {}
HostCtlException::~HostCtlException() = default;
} // namespace Lib

namespace Misc {
std::string StrPrintf(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    va_list copy;
    va_copy(copy, args);
    int size = std::vsnprintf(nullptr, 0, format, copy);
    va_end(copy);
    std::string result;
    if (size > 0) {
        result.resize(static_cast<std::size_t>(size) + 1);
        std::vsnprintf(result.data(), result.size(), format, args);
        result.resize(static_cast<std::size_t>(size));
    }
    va_end(args);
    return result;
}
} // namespace Misc

namespace Network {
std::string MacAddress::GetStringAddress() const
{
    char text[18];
    std::snprintf(text, sizeof text, "%02x:%02x:%02x:%02x:%02x:%02x", bytes_[0], bytes_[1], bytes_[2], bytes_[3],
                  bytes_[4], bytes_[5]);
    return text;
}
} // namespace Network

namespace Storage {
const std::string HlFileSystem::HLFS_TYPE = "HLFS";
const std::string NetworkFileSystem::NFS_AUTH_NONE_STR = "none";
const std::string NetworkFileSystem::NFS_AUTH_SYS_STR = "sys";
const std::string NetworkFileSystem::NFS_AUTH_KRB5_STR = "krb5";
const std::string NetworkFileSystem::NFS_AUTH_KRB5I_STR = "krb5i";
const std::string NetworkFileSystem::NFS_AUTH_KRB5P_STR = "krb5p";
const std::string NetworkFileSystem::NFS_AUTH_UNKNOWN_STR = "unknown";

FileSystem::~FileSystem() = default;
DiskLunPartition::~DiskLunPartition() = default;
HlFileSystem::~HlFileSystem() = default;
NetworkFileSystem::~NetworkFileSystem() = default;
UnresolvedHlfsExtent::~UnresolvedHlfsExtent() = default;
UnresolvedHlfsVolume::~UnresolvedHlfsVolume() = default;
PointerBlockCache::~PointerBlockCache() = default;
StorageInfo::~StorageInfo() = default;
} // namespace Storage

MemoryInfo::~MemoryInfo() = default;
HardwareInfo::~HardwareInfo() = default;
AdvancedOption::~AdvancedOption() = default;
AdvancedIntegerOption::~AdvancedIntegerOption() = default;
AdvancedStringOption::~AdvancedStringOption() = default;
AdvancedOptionGroup::~AdvancedOptionGroup() = default;
AdvancedOptions::~AdvancedOptions() = default;
Host::~Host() = default;

} // namespace HostCtl

namespace KnxCtl::Network {

namespace {

// A prefix length: decimal digits only, no sign, no leading junk, at most `max`.
bool PrefixLength(const std::string& text, int max)
{
    if (text.empty() || text.size() > 3)
        return false;
    int value = 0;
    for (char c : text) {
        if (c < '0' || c > '9')
            return false;
        value = value * 10 + (c - '0');
    }
    return value <= max;
}

} // namespace

int FirewallRulesetImpl::GetTypeFromIpString(const std::string& text)
{
    const auto slash = text.find('/');
    const std::string address = text.substr(0, slash);
    unsigned char buffer[16];
    const bool v4 = ::inet_pton(AF_INET, address.c_str(), buffer) == 1;
    const bool v6 = !v4 && ::inet_pton(AF_INET6, address.c_str(), buffer) == 1;
    if (!v4 && !v6)
        return 0;
    if (slash == std::string::npos)
        return v4 ? 2 : 4;
    if (!PrefixLength(text.substr(slash + 1), v4 ? 32 : 128))
        return 0;
    return v4 ? 1 : 3;
}

} // namespace KnxCtl::Network
