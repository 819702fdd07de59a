#include "hlfs/HlfsVolumeSelection.h"

namespace OrvaneCli::FileSystem {

namespace {

const char* const kLabelDescription = "The label of the target HLFS volume.";
const char* const kUuidDescription = "The uuid of the target HLFS volume.";

const char* const kNotifyScript = "/usr/lib/orvane/tallowd/bin/notifyDatastore.py";

std::unique_ptr<HostCtl::Storage::StorageInfo> OpenStorageInfo()
{
    return HostCtl::HostFactory::GetHost()->GetStorageInfo();
}

} // namespace

std::shared_ptr<ParameterSpec> IgnoreErrorInputParameter()
{
    return MakeParameter({kOptionIgnoreErrors, "i", ParameterType::Flag,
                          "Ignore errors encountered (if any) while retrieving information for each file system."});
}

std::shared_ptr<InputSpec> GetSingleHLFSVolumeInputSpec()
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kOptionVolumeLabel, "l", ParameterType::String, kLabelDescription});
    AddParameter(inputs, {kOptionVolumeUuid, "u", ParameterType::String, kUuidDescription});
    return inputs;
}

std::shared_ptr<InputSpec> GetMultipleHLFSVolumesInputSpec()
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kOptionVolumeLabel, "l", ParameterType::StringList, kLabelDescription});
    AddParameter(inputs, {kOptionVolumeUuid, "u", ParameterType::StringList, kUuidDescription});
    inputs->AddParameter(IgnoreErrorInputParameter());
    return inputs;
}

std::unique_ptr<HlFileSystem> GetSingleHLFSVolume(const InputPtr& in, const OutputPtr& out)
{
    const std::string label = in->GetParameter(kOptionVolumeLabel);
    const std::string uuid = in->GetParameter(kOptionVolumeUuid);

    if (IsGiven(label) && IsGiven(uuid)) {
        out->AddErrorMessage("You cannot specify both --volume-label and --volume-uuid.");
        return nullptr;
    }
    if (!IsGiven(label) && !IsGiven(uuid)) {
        out->AddErrorMessage("A target HLFS volume must be specified either by --volume-label or --volume-uuid.");
        return nullptr;
    }

    std::unique_ptr<HlFileSystem> volume;
    Guarded(out, [&] {
        auto storage = OpenStorageInfo();
        volume = IsGiven(uuid) ? storage->GetHlfsFileSystemByUuid(uuid) : storage->GetHlfsFileSystemByLabel(label);
        if (!volume) {
            out->AddErrorMessage(std::string("HLFS volume with ") + (IsGiven(uuid) ? "uuid " + uuid : "label " + label) +
                                 " could not be found.");
        }
    });
    return volume;
}

bool GetMultipleHLFSVolumes(const InputPtr& in, const OutputPtr& out,
                            std::vector<std::unique_ptr<HlFileSystem>>& volumes)
{
    std::vector<std::string> labels;
    std::vector<std::string> uuids;
    in->GetParameterList(kOptionVolumeLabel, labels);
    in->GetParameterList(kOptionVolumeUuid, uuids);
    const bool ignore = in->IsFlagSet(kOptionIgnoreErrors);

    bool ok = true;
    const bool completed = Guarded(out, [&] {
        auto storage = OpenStorageInfo();
        if (labels.empty() && uuids.empty()) {
            volumes = storage->GetHlfsFileSystems(HostCtl::emptyString);
            return;
        }
        // Labels first, then UUIDs; every name is tried and duplicates are kept.
        auto collect = [&](const std::vector<std::string>& names, const char* kind, auto lookUp) {
            for (const auto& name : names) {
                auto volume = lookUp(*storage, name);
                if (volume) {
                    volumes.push_back(std::move(volume));
                } else if (!ignore) {
                    out->AddErrorMessage(std::string("Error fetching HLFS volume with ") + kind + " '" + name + "'");
                    ok = false;
                }
            }
        };
        collect(labels, "label", [](HostCtl::Storage::StorageInfo& s, const std::string& label) {
            return s.GetHlfsFileSystemByLabel(label);
        });
        collect(uuids, "uuid", [](HostCtl::Storage::StorageInfo& s, const std::string& uuid) {
            return s.GetHlfsFileSystemByUuid(uuid);
        });
    });
    if (!completed) {
        return ignore;
    }
    return ok || ignore;
}

const char* GetHLFSVersionString(HlFileSystem* volume)
{
    if (volume->GetType() != HlFileSystem::HLFS_TYPE) {
        return "Non-HLFS";
    }
    switch (volume->GetMajorVersion()) {
    case 2:
        return "HLFS-2";
    case 3:
        return "HLFS-3";
    case 5:
        return "HLFS-5";
    case 6:
        return "HLFS-6";
    default:
        return "HLFS-unknown version";
    }
}

void NotifyDatastore(const std::string& event, const std::string& data)
{
    const std::string command = std::string(kNotifyScript) + " -t " + event + " -i " + "stdin";
    std::string output;
    const std::string input = data;
    // The script's outcome does not change what the caller does next.
    (void)Quillets::AutoCli::AutoCli_ShellCmd(command, output, input);
}

} // namespace OrvaneCli::FileSystem
