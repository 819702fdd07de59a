#include <string>
#include <vector>

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "nfs/Manifest.h"
#include "nfs/NfsAddCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

constexpr const char* kHosts = "hosts";
constexpr const char* kSecurity = "sec";

// The flavours offered, in the host's numbering; anything else (or none) is AUTH_SYS.
NetworkFileSystem::SecurityType ToSecurityType(const std::string& flavour)
{
    if (flavour == NetworkFileSystem::NFS_AUTH_SYS_STR) {
        return NetworkFileSystem::SEC_SYS;
    }
    if (flavour == NetworkFileSystem::NFS_AUTH_KRB5_STR) {
        return NetworkFileSystem::SEC_KRB5;
    }
    if (flavour == NetworkFileSystem::NFS_AUTH_KRB5I_STR) {
        return NetworkFileSystem::SEC_KRB5I;
    }
    return NetworkFileSystem::SEC_SYS;
}

const CommandDecl kNFS41VolumeAddDecl = {
    .description = "Add a new NFS v4.1 volume to the Zephal Host and mount it with the given volume name.",
    .parameters = {
        ServerKnxnicParameter(
            ParameterType::StringList,
            "The hostname or IP address followed by a colon(:) and knxnic name. This parameter can be "
            "specified more than once. E.g.: --host-knxnic=host1:knxnic1 --host-knxnic=ip2:knxnic2",
            Feature::Nfs41KnxnicBinding),
        ServerParameter(kHosts, ParameterType::StringList,
                        "The hostname(s) or IP address(es) (comma-separated) of the server for the NFS v4.1 volume to "
                        "add and mount on the system.",
                        Feature::Nfs41KnxnicBinding),
        {NfsAddArg::kIsPE, "p", ParameterType::Flag, "If set, this flag will set the mount point to be PE."},
        ShareParameter("NFS v4.1"),
        VolumeNameParameter("NFS v4.1", "NAS, NFS v4.1, HLFS, or other"),
        {NfsAddArg::kReadOnly, "r", ParameterType::Flag, "If set, this flag will make the mount point be read-only."},
        {kSecurity, "a", ParameterType::String, "Security flavors. Acceptable values are: %ENUM%.", false,
         StringEnum({{NetworkFileSystem::NFS_AUTH_SYS_STR.c_str(), "Authentication based on traditional UNIX ID"},
                     {NetworkFileSystem::NFS_AUTH_KRB5_STR.c_str(),
                      "Kerberos authentication with RPC header integrity protection"},
                     {NetworkFileSystem::NFS_AUTH_KRB5I_STR.c_str(),
                      "Kerberos authentication with data integrity protection"}})}}};

// storage nfs41 add
class NFS41VolumeAdd final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace

void NFS41VolumeAdd::Run(const InputPtr& in, const OutputPtr& out)
{
    // The servers come from exactly one of hosts and host-knxnic; host-knxnic texts go to
    // the host as given ("host:knxnic"), unsplit.
    std::vector<std::string> servers;
    in->GetParameterList(kHosts, servers);
    bool knxnicBound = false;
    if (IsFeatureEnabled(Feature::Nfs41KnxnicBinding)) {
        std::vector<std::string> hostKnxnics;
        in->GetParameterList(kOptionHostKnxnic, hostKnxnics);
        const char* const exactlyOne = "Either hostName or knxnic should be provided";
        if (!ExactlyOneOf({{!servers.empty(), exactlyOne}, {!hostKnxnics.empty(), exactlyOne}}, exactlyOne, out)) {
            return;
        }
        if (!hostKnxnics.empty()) {
            servers = std::move(hostKnxnics);
            knxnicBound = true;
        }
    }

    const std::string& share = in->GetParameter(NfsAddArg::kShare);
    const std::string& volumeName = in->GetParameter(kOptionVolumeName);
    const bool readOnly = in->IsFlagSet(NfsAddArg::kReadOnly);
    const NetworkFileSystem::SecurityType security = ToSecurityType(in->GetParameter(kSecurity));
    const bool isPE = in->IsFlagSet(NfsAddArg::kIsPE);

    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        const std::unique_ptr<NetworkFileSystem> volume =
            storage.AddV41NetworkFileSystem(servers, share, volumeName, security, knxnicBound);
        if (!volume) {
            out->AddErrorMessage(NoNewVolumeMessage(volumeName));
            return;
        }
        // Version 4.1 never keeps a definition it could not mount.
        if (ConfigureAndMount(storage, *volume, volumeName, readOnly, isPE, kNfsMountNoFlags,
                              OnMountFailure::RemoveDefinition, out)) {
            out->SetRootObject(MetaBool::New(true));
        }
    });
}

NodePtr NewNFS41VolumeAdd() { return New<NFS41VolumeAdd>(kNFS41VolumeAddDecl); }

} // namespace OrvaneCli::FileSystem
