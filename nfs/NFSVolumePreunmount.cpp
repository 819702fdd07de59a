#include <string>

#include "command/StorageCommand.h"
#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

using PreunmountOperation = void (*)(StorageInfoImpl& storage, const std::string& volumeName);

// Runs one preunmount operation on the named volume. Unlike other commands, the host's
// message never stands alone: it is prefixed with the command's failure text and the name.
class PreunmountCommand : public StorageCommand {
protected:
    PreunmountCommand(const char* description, const char* volumeName, PreunmountOperation operation,
                      const char* failurePrefix)
        : StorageCommand({.description = description,
                          .parameters = {{kOptionVolumeName, "v", ParameterType::String, volumeName, true}}}),
          operation_(operation),
          failurePrefix_(failurePrefix)
    {
    }

private:
    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        // A failure to reach the storage information is not this command's to report.
        WithStorageInfo(StorageInfoPlacement::Unguarded, out, [&](StorageInfoImpl& storage) {
            const std::string& volumeName = in->GetParameter(kOptionVolumeName);
            try {
                operation_(storage, volumeName);
                out->SetRootObject(MetaBool::New(true));
            } catch (const HostCtlException& e) {
                out->AddErrorMessage(HostCtl::Misc::StrCat(failurePrefix_, volumeName, ": ", e.message));
            }
        });
    }

    PreunmountOperation operation_;
    const char* failurePrefix_;
};

// storage nfs preunmountstate enter
class NFSVolumePreunmountEnter final : public PreunmountCommand {
public:
    NFSVolumePreunmountEnter()
        : PreunmountCommand("Enter NAS volume to preunmount state.", "Name of the NAS volume to enter preunmount state.",
                            [](StorageInfoImpl& storage, const std::string& name) {
                                storage.EnterNetworkFileSystemPreUnmount(name);
                            },
                             "Preunmount Enter failed for ")
    {
    }
};

// storage nfs preunmountstate exit
class NFSVolumePreunmountExit final : public PreunmountCommand {
public:
    NFSVolumePreunmountExit()
        : PreunmountCommand("Exit NAS volume from preunmount state.",
                            "Name of the NAS volume to exit from preunmount state.",
                            [](StorageInfoImpl& storage, const std::string& name) {
                                storage.ExitNetworkFileSystemPreUnmount(name);
                            },
                             "Preunmount Exit failed for ")
    {
    }
};

} // namespace

NodePtr NewNFSVolumePreunmountEnter() { return New<NFSVolumePreunmountEnter>(); }
NodePtr NewNFSVolumePreunmountExit() { return New<NFSVolumePreunmountExit>(); }

} // namespace OrvaneCli::FileSystem
