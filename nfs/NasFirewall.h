#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// The NFS client firewall rule sets differ only in their texts and the version they pass
// to the host, so each command is written once over a rule set description.
struct NfsClientRuleset;   // NFS v3: "nfsClient"
struct Nfs41ClientRuleset; // NFS v4.1: "nfs41Client"

template <typename Ruleset>
class NasFirewallAddCommand : public virtual Command {
public:
    NasFirewallAddCommand();
    ~NasFirewallAddCommand() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

template <typename Ruleset>
class NasFirewallRemoveCommand : public virtual Command {
public:
    NasFirewallRemoveCommand();
    ~NasFirewallRemoveCommand() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

template <typename Ruleset>
class NasFirewallListCommand : public virtual Command {
public:
    NasFirewallListCommand();
    ~NasFirewallListCommand() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

extern template class NasFirewallAddCommand<NfsClientRuleset>;
extern template class NasFirewallRemoveCommand<NfsClientRuleset>;
extern template class NasFirewallListCommand<NfsClientRuleset>;
extern template class NasFirewallAddCommand<Nfs41ClientRuleset>;
extern template class NasFirewallRemoveCommand<Nfs41ClientRuleset>;
extern template class NasFirewallListCommand<Nfs41ClientRuleset>;

// storage nfs firewall add
class NFSFirewallAdd : public NasFirewallAddCommand<NfsClientRuleset> {
public:
    static std::shared_ptr<NFSFirewallAdd> New();
};

// storage nfs firewall remove
class NFSFirewallRemove : public NasFirewallRemoveCommand<NfsClientRuleset> {
public:
    static std::shared_ptr<NFSFirewallRemove> New();
};

// storage nfs firewall list
class NFSFirewallList : public NasFirewallListCommand<NfsClientRuleset> {
public:
    static std::shared_ptr<NFSFirewallList> New();
};

// storage nfs41 firewall add
class NFS41FirewallAdd : public NasFirewallAddCommand<Nfs41ClientRuleset> {
public:
    static std::shared_ptr<NFS41FirewallAdd> New();
};

// storage nfs41 firewall remove
class NFS41FirewallRemove : public NasFirewallRemoveCommand<Nfs41ClientRuleset> {
public:
    static std::shared_ptr<NFS41FirewallRemove> New();
};

// storage nfs41 firewall list
class NFS41FirewallList : public NasFirewallListCommand<Nfs41ClientRuleset> {
public:
    static std::shared_ptr<NFS41FirewallList> New();
};

} // namespace OrvaneCli::FileSystem
