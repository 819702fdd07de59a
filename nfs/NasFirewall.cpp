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

// add and remove: one IP/Mask entry handed to the host for the rule set of `version`.
class IpMaskCommand : public StorageCommand {
protected:
    using Change = void (*)(StorageInfoImpl& storage, const std::string& ipMask, NfsVersion version);

    // `masksOnly`: refuse an entry without a mask before the host is asked.
    IpMaskCommand(const char* description, const char* ipMask, NfsVersion version, Change change, bool masksOnly)
        : StorageCommand({.description = description, .parameters = {{kIpMask, "F", ParameterType::String, ipMask, true}}}),
          version_(version), change_(change), masksOnly_(masksOnly)
    {
    }

private:
    void Run(const InputPtr& in, const OutputPtr& out) override
    {
        const std::string& ipMask = in->GetParameter(kIpMask);
        if (masksOnly_ && !IsIpMask(ipMask)) {
            out->AddErrorMessage("Only IP/Mask entries are allowed to be added");
            return;
        }
        WithStorageInfo(StorageInfoPlacement::InsideGuard, out, [&](StorageInfoImpl& storage) {
            change_(storage, ipMask, version_);
            out->SetRootObject(MetaBool::New(true));
        });
    }

    NfsVersion version_;
    Change change_;
    bool masksOnly_;
};

// storage nfs firewall add, storage nfs41 firewall add
template <typename Ruleset>
class NasFirewallAdd final : public IpMaskCommand {
public:
    NasFirewallAdd()
        : IpMaskCommand(
              Ruleset::addDescription, Ruleset::addParameter, Ruleset::version,
              [](StorageInfoImpl& storage, const std::string& ipMask, NfsVersion version) {
                  storage.AddNasFirewallConfig(ipMask, version);
              },
              true)
    {
    }
};

// storage nfs firewall remove, storage nfs41 firewall remove: any text is passed on, the
// host decides what it can remove.
template <typename Ruleset>
class NasFirewallRemove final : public IpMaskCommand {
public:
    NasFirewallRemove()
        : IpMaskCommand(
              Ruleset::removeDescription, Ruleset::removeParameter, Ruleset::version,
              [](StorageInfoImpl& storage, const std::string& ipMask, NfsVersion version) {
                  storage.RemoveNasFirewallConfig(ipMask, version);
              },
              false)
    {
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

NodePtr NewNFSFirewallAdd() { return New<NasFirewallAdd<NfsClientRuleset>>(); }
NodePtr NewNFSFirewallRemove() { return New<NasFirewallRemove<NfsClientRuleset>>(); }
NodePtr NewNFSFirewallList() { return New<NasFirewallList<NfsClientRuleset>>(); }
NodePtr NewNFS41FirewallAdd() { return New<NasFirewallAdd<Nfs41ClientRuleset>>(); }
NodePtr NewNFS41FirewallRemove() { return New<NasFirewallRemove<Nfs41ClientRuleset>>(); }
NodePtr NewNFS41FirewallList() { return New<NasFirewallList<Nfs41ClientRuleset>>(); }

} // namespace OrvaneCli::FileSystem
