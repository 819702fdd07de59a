#include "HostValues.h"

#include <memory>

#include "hostctl/StorageInfoImpl.h"

namespace Autocli {

namespace {

constexpr const char* kLabel = "volume-label";
constexpr const char* kUuid = "volume-uuid";
constexpr const char* kNfsName = "nfs-volume-name";
constexpr const char* kMountPoint = "volume-path";

} // namespace

Quillets::Cli::ValueSources VolumeParameters()
{
    return {
        {"volume-label", kLabel},  {"volume-uuid", kUuid},       {"uuid", kUuid},
        {"volume-name", kNfsName}, {"volume-path", kMountPoint},
    };
}

std::optional<std::vector<std::string>> HostValues(const std::string& kind)
{
    using KnxCtl::Storage::StorageInfoImpl;
    std::vector<std::string> values;
    StorageInfoImpl storage;
    if (kind == kNfsName) {
        for (const auto& volume : storage.GetV3NetworkFileSystems(&StorageInfoImpl::IsNotHidden)) {
            values.push_back(volume->GetVolumeName());
        }
        for (const auto& volume : storage.GetV41NetworkFileSystems(&StorageInfoImpl::IsNotHidden)) {
            values.push_back(volume->GetVolumeName());
        }
        return values;
    }
    if (kind != kLabel && kind != kUuid && kind != kMountPoint) {
        return std::nullopt;
    }
    for (const auto& volume : storage.GetFileSystems()) {
        values.push_back(kind == kLabel  ? volume->GetVolumeName()
                         : kind == kUuid ? volume->GetUuid()
                                         : volume->GetMountPoint());
    }
    if (kind != kMountPoint) {
        // Volumes the host found but has not mounted are named by label or UUID to mount them.
        for (const auto& entry : storage.GetUnresolvedVolumes()) {
            if (auto* volume = dynamic_cast<KnxCtl::Storage::UnresolvedHlfsVolumeImpl*>(entry.get())) {
                values.push_back(kind == kLabel ? volume->GetVolumeName() : volume->GetUuid());
            }
        }
    }
    return values;
}

} // namespace Autocli
