#include <optional>

#include "command/Selection.h"
#include "command/StorageCommand.h"
#include "nfs/Manifest.h"
#include "nfs/NfsAddCommon.h"

namespace OrvaneCli::FileSystem {

namespace {

constexpr const char* kHost = "host";
constexpr const char* kMountRetry = "unsupported-mount-retry";
constexpr const char* kQueueDepth = "unsupported-queue-depth";

// Where the server is reached: through a named knxnic only when given as host-knxnic.
struct NfsServer {
    std::string host;
    bool knxnicBound = false;
    std::string knxnic;
};

// Empty when the server arguments do not fit; the reason is already on `out`.
std::optional<NfsServer> ReadServer(const InputPtr& in, const OutputPtr& out)
{
    if (!IsFeatureEnabled(Feature::NfsKnxnicBinding)) {
        return NfsServer{in->GetParameter(kHost), false, ""};
    }
    const std::string& hostKnxnic = in->GetParameter(kOptionHostKnxnic);
    const std::string& host = in->GetParameter(kHost);
    // Scripts match this text, misspelling included.
    const char* const exactlyOne = "Either hostName or knxnic shoud be provided";
    if (!ExactlyOneOf({{IsGiven(host), exactlyOne}, {IsGiven(hostKnxnic), exactlyOne}}, exactlyOne, out)) {
        return std::nullopt;
    }
    if (IsGiven(host)) {
        return NfsServer{host, false, ""};
    }
    // Split at the first ":knx", so IPv6 addresses keep their colons.
    const auto colon = hostKnxnic.find(":knx");
    if (colon == std::string::npos) {
        out->AddErrorMessage("Invalid host-knxnic input");
        return std::nullopt;
    }
    return NfsServer{hostKnxnic.substr(0, colon), true, hostKnxnic.substr(colon + 1)};
}

const CommandDecl kNFSVolumeAddDecl = {
    .description = "Add a new NAS volume to the Zephal Host and mount it with the given volume name.",
    .parameters = {
        ServerParameter(kHost, ParameterType::String,
                        "The hostname or IP address of the NAS volume to add and mount on the system.",
                        Feature::NfsKnxnicBinding),
        ServerKnxnicParameter(ParameterType::String,
                              "The hostname or IP address of the NAS volume to add, followed by a colon(:) and knxnic "
                              "name i.e. <host/IP>:<knxnic> ",
                              Feature::NfsKnxnicBinding),
        ShareParameter("NAS"),
        VolumeNameParameter("NAS", "NAS, HLFS or other"),
        {kOptionConnections, "c", ParameterType::Int,
         "The number of RPC connections to be established for the NFS datastore. Minimum and default values are 1 "
         "and maximum is 8. A higher number of connections yields better performance on datastores with higher IO "
         "load.",
         false, IntRange(1, 8), Feature::NfsConnections},
        {NfsAddArg::kReadOnly, "r", ParameterType::Flag, "If set this flag will set the mount point to be read-only."},
        {NfsAddArg::kIsPE, "p", ParameterType::Flag, "If set this flag will set the mount point to be PE."},
        {kMountRetry, "", ParameterType::Flag, ""},
        {kQueueDepth, "", ParameterType::Int, "", false, IntRange(1, 4294967295L)}}};

// storage nfs add
class NFSVolumeAdd final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace

void NFSVolumeAdd::Run(const InputPtr& in, const OutputPtr& out)
{
    const std::string& share = in->GetParameter(NfsAddArg::kShare);
    const std::string& volumeName = in->GetParameter(kOptionVolumeName);
    const bool readOnly = in->IsFlagSet(NfsAddArg::kReadOnly);

    std::int64_t connections = 1;
    if (IsFeatureEnabled(Feature::NfsConnections) && in->HasParameter(kOptionConnections)) {
        connections = in->GetParameterInt(kOptionConnections);
    }

    const std::optional<NfsServer> server = ReadServer(in, out);
    if (!server) {
        return;
    }

    const bool isPE = in->IsFlagSet(NfsAddArg::kIsPE);
    const bool mountRetry = in->IsFlagSet(kMountRetry);

    std::uint32_t queueDepth = 0; // none given
    if (in->HasParameter(kQueueDepth)) {
        if (!mountRetry) {
            out->AddErrorMessage("unsupported-queue-depth requires unsupported-mount-retry flag");
            return;
        }
        queueDepth = static_cast<std::uint32_t>(in->GetParameterInt(kQueueDepth));
    }

    WithStorageInfo(StorageInfoPlacement::OutsideGuard, out, [&](StorageInfoImpl& storage) {
        const std::unique_ptr<NetworkFileSystem> volume = storage.AddNetworkFileSystem(
            server->host, share, volumeName, server->knxnicBound, server->knxnic, queueDepth, connections);
        if (!volume) {
            out->AddErrorMessage(NoNewVolumeMessage(volumeName));
            return;
        }
        // With pre-unmount support the host manages the life of an unmounted definition:
        // the mount is made without the retry flag and a failed one keeps the definition.
        const bool preUnmount = IsFeatureEnabled(Feature::NasPreUnmount);
        const unsigned flags = preUnmount ? kNfsMountNoFlags : (mountRetry ? kNfsMountRetry : kNfsMountNoFlags);
        const OnMountFailure onFailure = preUnmount ? OnMountFailure::KeepDefinition : OnMountFailure::RemoveDefinition;
        if (ConfigureAndMount(storage, *volume, volumeName, readOnly, isPE, flags, onFailure, out)) {
            out->SetRootObject(MetaBool::New(true));
        }
    });
}

NodePtr NewNFSVolumeAdd() { return New<NFSVolumeAdd>(kNFSVolumeAddDecl); }

} // namespace OrvaneCli::FileSystem
