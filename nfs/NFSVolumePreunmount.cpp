#include "nfs/NFSVolumePreunmount.h"

#include <string>

namespace OrvaneCli::FileSystem {

namespace {

using PreunmountOperation = void (StorageInfoImpl::*)(const std::string&);

std::shared_ptr<InputSpec> PreunmountInputSpec(const char* volumeNameDescription)
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kOptionVolumeName, "v", ParameterType::String, volumeNameDescription, true});
    return inputs;
}

// Runs `operation` on the named volume. Unlike other commands, the host's message never
// stands alone: it is prefixed with `failurePrefix` and the volume name.
void ChangePreunmountState(const InputPtr& in, const OutputPtr& out, PreunmountOperation operation,
                           const char* failurePrefix)
{
    StorageInfoImpl storage;
    const std::string& volumeName = in->GetParameter(kOptionVolumeName);
    try {
        (storage.*operation)(volumeName);
        out->SetRootObject(MetaBool::New(true));
    } catch (const HostCtlException& e) {
        out->AddErrorMessage(HostCtl::Misc::StrCat(failurePrefix, volumeName, ": ", e.message));
    }
}

} // namespace

std::shared_ptr<NFSVolumePreunmountEnter> NFSVolumePreunmountEnter::New()
{
    return std::make_shared<NFSVolumePreunmountEnter>();
}

NFSVolumePreunmountEnter::NFSVolumePreunmountEnter() { SetDescription("Enter NAS volume to preunmount state."); }

NFSVolumePreunmountEnter::~NFSVolumePreunmountEnter() = default;

std::shared_ptr<InputSpec> NFSVolumePreunmountEnter::GetInputSpecInternal()
{
    return PreunmountInputSpec("Name of the NAS volume to enter preunmount state.");
}

std::shared_ptr<OutputSpec> NFSVolumePreunmountEnter::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void NFSVolumePreunmountEnter::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    ChangePreunmountState(in, out, &StorageInfoImpl::EnterNetworkFileSystemPreUnmount, "Preunmount Enter failed for ");
}

std::shared_ptr<NFSVolumePreunmountExit> NFSVolumePreunmountExit::New()
{
    return std::make_shared<NFSVolumePreunmountExit>();
}

NFSVolumePreunmountExit::NFSVolumePreunmountExit() { SetDescription("Exit NAS volume from preunmount state."); }

NFSVolumePreunmountExit::~NFSVolumePreunmountExit() = default;

std::shared_ptr<InputSpec> NFSVolumePreunmountExit::GetInputSpecInternal()
{
    return PreunmountInputSpec("Name of the NAS volume to exit from preunmount state.");
}

std::shared_ptr<OutputSpec> NFSVolumePreunmountExit::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void NFSVolumePreunmountExit::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    ChangePreunmountState(in, out, &StorageInfoImpl::ExitNetworkFileSystemPreUnmount, "Preunmount Exit failed for ");
}

} // namespace OrvaneCli::FileSystem
