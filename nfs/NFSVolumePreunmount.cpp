#include <string>

#include "command/StorageCommand.h"
#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

enum class Transition { Enter, Exit };

// storage nfs preunmountstate enter / exit: moves the named volume into or out of the
// preunmount state. Unlike other commands, the host's message never stands alone: it is
// prefixed with what failed and the volume's name.
template <Transition kTransition>
class NfsPreunmountState final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        constexpr bool kEnter = kTransition == Transition::Enter;
        // A failure to reach the storage information is not this command's to report.
        WithStorageInfo(StorageInfoPlacement::Unguarded, out, [&](StorageInfoImpl& storage) {
            const std::string& volumeName = in->GetParameter(kOptionVolumeName);
            try {
                if (kEnter) {
                    storage.EnterNetworkFileSystemPreUnmount(volumeName);
                } else {
                    storage.ExitNetworkFileSystemPreUnmount(volumeName);
                }
                out->SetRootObject(MetaBool::New(true));
            } catch (const HostCtlException& e) {
                out->AddErrorMessage(
                    HostCtl::Misc::StrCat(kEnter ? "Preunmount Enter failed for " : "Preunmount Exit failed for ",
                                          volumeName, ": ", e.message));
            }
        });
    }
};

CommandDecl PreunmountDecl(const char* description, const char* volumeName)
{
    return {.description = description,
            .parameters = {{kOptionVolumeName, "v", ParameterType::String, volumeName, true}}};
}

} // namespace

NodePtr NewNFSVolumePreunmountEnter()
{
    return New<NfsPreunmountState<Transition::Enter>>(
        PreunmountDecl("Enter NAS volume to preunmount state.", "Name of the NAS volume to enter preunmount state."));
}

NodePtr NewNFSVolumePreunmountExit()
{
    return New<NfsPreunmountState<Transition::Exit>>(PreunmountDecl(
        "Exit NAS volume from preunmount state.", "Name of the NAS volume to exit from preunmount state."));
}

} // namespace OrvaneCli::FileSystem
