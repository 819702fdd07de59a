#include "nfs/NasFirewall.h"

#include <string>
#include <vector>

#include "nfs/NFSVolumeList.h"

namespace OrvaneCli::FileSystem {

using HostCtl::Storage::NfsVersion;

struct NfsClientRuleset {
    static constexpr NfsVersion version = HostCtl::Storage::NFS_VERSION_3;
    static constexpr const char* addDescription = "Add a new allowed IP/Mask entry in the nfsClient firewall ruleset";
    static constexpr const char* addParameter = "The IP/Mask to be added in the nfsClient firewall ruleset";
    static constexpr const char* removeDescription =
        "Remove an existing IP/Mask entry from the nfsClient firewall ruleset";
    static constexpr const char* removeParameter =
        "IP/Mask entry that has to be removed from nfsClient firewall ruleset.";
    static constexpr const char* listDescription =
        "List the allowed IP/Mask entries from the nfsClient firewall ruleset.";
};

struct Nfs41ClientRuleset {
    static constexpr NfsVersion version = HostCtl::Storage::NFS_VERSION_41;
    static constexpr const char* addDescription = "Add a new allowed IP/Mask entry in the nfs41Client firewall ruleset";
    static constexpr const char* addParameter = "The IP/Mask to be added in the nfs41Client firewall ruleset";
    static constexpr const char* removeDescription =
        "Remove an existing IP/Mask entry from the nfs41Client firewall ruleset";
    static constexpr const char* removeParameter =
        "IP/Mask entry that has to be removed from nfs41Client firewall ruleset.";
    static constexpr const char* listDescription =
        "List the allowed IP/Mask entries from the nfs41Client firewall ruleset.";
};

namespace {

constexpr const char* kIpMask = "ip-mask";

std::shared_ptr<InputSpec> IpMaskInputSpec(const char* description)
{
    auto inputs = InputSpec::New();
    AddParameter(inputs, {kIpMask, "F", ParameterType::String, description, true});
    return inputs;
}

// Only entries with a mask may be added: IPv4 with /0-32 (1) or IPv6 with /0-128 (3).
bool IsIpMask(const std::string& text)
{
    const int type = KnxCtl::Network::FirewallRulesetImpl::GetTypeFromIpString(text);
    return type == 1 || type == 3;
}

} // namespace

// ---- add ----

template <typename Ruleset>
NasFirewallAddCommand<Ruleset>::NasFirewallAddCommand()
{
    SetDescription(Ruleset::addDescription);
}

template <typename Ruleset>
NasFirewallAddCommand<Ruleset>::~NasFirewallAddCommand() = default;

template <typename Ruleset>
std::shared_ptr<InputSpec> NasFirewallAddCommand<Ruleset>::GetInputSpecInternal()
{
    return IpMaskInputSpec(Ruleset::addParameter);
}

template <typename Ruleset>
std::shared_ptr<OutputSpec> NasFirewallAddCommand<Ruleset>::GetOutputSpecInternal()
{
    return BooleanOutputSpec();
}

template <typename Ruleset>
void NasFirewallAddCommand<Ruleset>::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const std::string& ipMask = in->GetParameter(kIpMask);
    if (!IsIpMask(ipMask)) {
        out->AddErrorMessage("Only IP/Mask entries are allowed to be added");
        return;
    }
    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        storage.AddNasFirewallConfig(ipMask, Ruleset::version);
        out->SetRootObject(MetaBool::New(true));
    });
}

// ---- remove ----

template <typename Ruleset>
NasFirewallRemoveCommand<Ruleset>::NasFirewallRemoveCommand()
{
    SetDescription(Ruleset::removeDescription);
}

template <typename Ruleset>
NasFirewallRemoveCommand<Ruleset>::~NasFirewallRemoveCommand() = default;

template <typename Ruleset>
std::shared_ptr<InputSpec> NasFirewallRemoveCommand<Ruleset>::GetInputSpecInternal()
{
    return IpMaskInputSpec(Ruleset::removeParameter);
}

template <typename Ruleset>
std::shared_ptr<OutputSpec> NasFirewallRemoveCommand<Ruleset>::GetOutputSpecInternal()
{
    return BooleanOutputSpec();
}

// Any text is passed on: the host decides what it can remove.
template <typename Ruleset>
void NasFirewallRemoveCommand<Ruleset>::ExecuteInternal(const InputPtr& in, const OutputPtr& out)
{
    const std::string& ipMask = in->GetParameter(kIpMask);
    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        storage.RemoveNasFirewallConfig(ipMask, Ruleset::version);
        out->SetRootObject(MetaBool::New(true));
    });
}

// ---- list ----

template <typename Ruleset>
NasFirewallListCommand<Ruleset>::NasFirewallListCommand()
{
    SetDescription(Ruleset::listDescription);
    SetDefaultOutputFormatter("simple");
}

template <typename Ruleset>
NasFirewallListCommand<Ruleset>::~NasFirewallListCommand() = default;

template <typename Ruleset>
std::shared_ptr<InputSpec> NasFirewallListCommand<Ruleset>::GetInputSpecInternal()
{
    return InputSpec::New();
}

template <typename Ruleset>
std::shared_ptr<OutputSpec> NasFirewallListCommand<Ruleset>::GetOutputSpecInternal()
{
    return StructOutputSpec(GetOutputStructure());
}

template <typename Ruleset>
std::shared_ptr<MetaStruct> NasFirewallListCommand<Ruleset>::GetOutputStructure()
{
    return MakeStructure("NasFirewallConfigs", {{"Allowed IPMask", FieldKind::String}});
}

template <typename Ruleset>
void NasFirewallListCommand<Ruleset>::ExecuteInternal(const InputPtr&, const OutputPtr& out)
{
    WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
        auto result = GetOutputStructure();
        result->SetField("Allowed IPMask", JoinWithCommas(storage.GetNasFirewallConfigs(Ruleset::version)));
        out->SetRootObject(result);
    });
}

template class NasFirewallAddCommand<NfsClientRuleset>;
template class NasFirewallRemoveCommand<NfsClientRuleset>;
template class NasFirewallListCommand<NfsClientRuleset>;
template class NasFirewallAddCommand<Nfs41ClientRuleset>;
template class NasFirewallRemoveCommand<Nfs41ClientRuleset>;
template class NasFirewallListCommand<Nfs41ClientRuleset>;

std::shared_ptr<NFSFirewallAdd> NFSFirewallAdd::New() { return std::shared_ptr<NFSFirewallAdd>(new NFSFirewallAdd()); }

std::shared_ptr<NFSFirewallRemove> NFSFirewallRemove::New()
{
    return std::shared_ptr<NFSFirewallRemove>(new NFSFirewallRemove());
}

std::shared_ptr<NFSFirewallList> NFSFirewallList::New()
{
    return std::shared_ptr<NFSFirewallList>(new NFSFirewallList());
}

std::shared_ptr<NFS41FirewallAdd> NFS41FirewallAdd::New()
{
    return std::shared_ptr<NFS41FirewallAdd>(new NFS41FirewallAdd());
}

std::shared_ptr<NFS41FirewallRemove> NFS41FirewallRemove::New()
{
    return std::shared_ptr<NFS41FirewallRemove>(new NFS41FirewallRemove());
}

std::shared_ptr<NFS41FirewallList> NFS41FirewallList::New()
{
    return std::shared_ptr<NFS41FirewallList>(new NFS41FirewallList());
}

} // namespace OrvaneCli::FileSystem
