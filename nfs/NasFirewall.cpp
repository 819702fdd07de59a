#include <string>
#include <vector>

#include "command/StorageCommand.h"
#include "nfs/Manifest.h"

namespace OrvaneCli::FileSystem {

namespace {

using HostCtl::Storage::NfsVersion;

// The NFS client firewall rule sets differ only in their texts and the version they pass
// to the host, so each command is written once over a rule set description.
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

constexpr const char* kIpMask = "ip-mask";

enum Field { kAllowedIpMask };
const ColumnTable kColumns("NasFirewallConfigs", {{kAllowedIpMask, "Allowed IPMask", ColumnType::String}}, false);

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
template <typename Ruleset, Change kChange>
class NasFirewallChange final : public StorageCommand {
public:
    NasFirewallChange()
        : StorageCommand({.description = kAdd ? Ruleset::addDescription : Ruleset::removeDescription,
                          .parameters = {{kIpMask, "F", ParameterType::String,
                                          kAdd ? Ruleset::addParameter : Ruleset::removeParameter, true}}})
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
                storage.AddNasFirewallConfig(ipMask, Ruleset::version);
            } else {
                storage.RemoveNasFirewallConfig(ipMask, Ruleset::version);
            }
            out->SetRootObject(MetaBool::New(true));
        });
    }
};

// storage nfs firewall list, storage nfs41 firewall list
template <typename Ruleset>
class NasFirewallList final : public StorageCommand {
public:
    NasFirewallList()
        : StorageCommand({.description = Ruleset::listDescription, .result = One(kColumns), .formatter = "simple"})
    {
    }

private:
    void Run(const InputPtr&, const OutputPtr& out) override
    {
        WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
            const RowShape shape = Rows();
            auto result = shape.NewRow();
            result.Set(kAllowedIpMask, JoinWithCommas(storage.GetNasFirewallConfigs(Ruleset::version)));
            out->SetRootObject(result.Structure());
        });
    }
};

} // namespace

NodePtr NewNFSFirewallAdd() { return New<NasFirewallChange<NfsClientRuleset, Change::Add>>(); }
NodePtr NewNFSFirewallRemove() { return New<NasFirewallChange<NfsClientRuleset, Change::Remove>>(); }
NodePtr NewNFSFirewallList() { return New<NasFirewallList<NfsClientRuleset>>(); }
NodePtr NewNFS41FirewallAdd() { return New<NasFirewallChange<Nfs41ClientRuleset, Change::Add>>(); }
NodePtr NewNFS41FirewallRemove() { return New<NasFirewallChange<Nfs41ClientRuleset, Change::Remove>>(); }
NodePtr NewNFS41FirewallList() { return New<NasFirewallList<Nfs41ClientRuleset>>(); }

} // namespace OrvaneCli::FileSystem
