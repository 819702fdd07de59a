#include <string>
#include <vector>

#include "command/StorageCommand.h"
#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

using HostCtl::Storage::NfsVersion;

// The NFS client firewall rule sets differ only in their names and the version they pass to
// the host, so each command is written once over the version.
std::string Ruleset(NfsVersion version)
{
    return version == HostCtl::Storage::NFS_VERSION_41 ? "nfs41Client" : "nfsClient";
}

constexpr const char* kIpMask = "ip-mask";

enum Field { kAllowedIpMask };
const ColumnTable kColumns("NasFirewallConfigs", {{kAllowedIpMask, "Allowed IPMask"}}, false);

// Only entries with a mask may be added: IPv4 with /0-32 (1) or IPv6 with /0-128 (3).
bool IsIpMask(const std::string& text)
{
    const int type = KnxCtl::Network::FirewallRulesetImpl::GetTypeFromIpString(text);
    return type == 1 || type == 3;
}

enum class Change { Add, Remove };

// storage nfs firewall add / remove, storage nfs41 firewall add / remove: one IP/Mask entry
// handed to the host. Only add checks the text first; remove passes any text on, the host
// decides what it can remove.
template <NfsVersion kVersion, Change kChange>
class NasFirewallChange final : public StorageCommand {
public:
    NasFirewallChange()
        : StorageCommand(
              {.description =
                   kAdd ? "Add a new allowed IP/Mask entry in the " + Ruleset(kVersion) + " firewall ruleset"
                        : "Remove an existing IP/Mask entry from the " + Ruleset(kVersion) + " firewall ruleset",
               .parameters = {
                   {kIpMask, "F", ParameterType::String,
                    kAdd ? "The IP/Mask to be added in the " + Ruleset(kVersion) + " firewall ruleset"
                         : "IP/Mask entry that has to be removed from " + Ruleset(kVersion) + " firewall ruleset.",
                    true}}})
    {
    }

private:
    static constexpr bool kAdd = kChange == Change::Add;

    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const std::string& ipMask = in->GetParameter(kIpMask);
        if (kAdd && !IsIpMask(ipMask)) {
            out->AddErrorMessage("Only IP/Mask entries are allowed to be added");
            return;
        }
        WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
            if (kAdd) {
                storage.AddNasFirewallConfig(ipMask, kVersion);
            } else {
                storage.RemoveNasFirewallConfig(ipMask, kVersion);
            }
            out->SetRootObject(MetaBool::New(true));
        });
    }
};

// storage nfs firewall list, storage nfs41 firewall list
template <NfsVersion kVersion>
class NasFirewallList final : public StorageCommand {
public:
    NasFirewallList()
        : StorageCommand(
              {.description = "List the allowed IP/Mask entries from the " + Ruleset(kVersion) + " firewall ruleset.",
               .result = One(kColumns),
               .formatter = "simple"})
    {
    }

private:
    void Run(const InputPtr&, const OutputPtr& out) override
    {
        WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
            const RowShape shape = Rows();
            auto result = shape.NewRow();
            result.Set(kAllowedIpMask, JoinWithCommas(storage.GetNasFirewallConfigs(kVersion)));
            out->SetRootObject(result.Structure());
        });
    }
};

} // namespace

NodePtr NewNFSFirewallAdd() { return New<NasFirewallChange<HostCtl::Storage::NFS_VERSION_3, Change::Add>>(); }
NodePtr NewNFSFirewallRemove() { return New<NasFirewallChange<HostCtl::Storage::NFS_VERSION_3, Change::Remove>>(); }
NodePtr NewNFSFirewallList() { return New<NasFirewallList<HostCtl::Storage::NFS_VERSION_3>>(); }
NodePtr NewNFS41FirewallAdd() { return New<NasFirewallChange<HostCtl::Storage::NFS_VERSION_41, Change::Add>>(); }
NodePtr NewNFS41FirewallRemove() { return New<NasFirewallChange<HostCtl::Storage::NFS_VERSION_41, Change::Remove>>(); }
NodePtr NewNFS41FirewallList() { return New<NasFirewallList<HostCtl::Storage::NFS_VERSION_41>>(); }

} // namespace OrvaneCli::FileSystem
