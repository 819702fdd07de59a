#pragma once

// The two NFS client rule sets in the packet filter: table `inet autocli`, one interval set
// per rule set and address family, and an output chain that accepts NFS traffic to them.

#include <string>
#include <vector>

namespace HostLinux {

enum class Ruleset { NfsClient, Nfs41Client };

const char* RulesetName(Ruleset ruleset); // "nfsClient" / "nfs41Client"

// An address with an optional prefix, in the form the packet filter keeps it: host bits
// cleared, a full-length prefix written as the plain address. Nothing for anything else.
struct Network {
    bool v6 = false;
    std::string text;
};
bool NormaliseNetwork(const std::string& input, Network& out);

// The entries of a rule set as the packet filter lists them (IPv4 first, then IPv6); empty
// when the table or the set does not exist. Throws std::runtime_error with the packet
// filter's message on failure.
std::vector<std::string> ListRuleset(Ruleset ruleset);

// Adds `input` (already checked by the caller to be an address with a prefix). Throws with
// "IP/Mask '<x>' already exists in ruleset <name>" when the normalised entry is present,
// and with the packet filter's reason when it refuses (an overlapping interval).
void AddToRuleset(Ruleset ruleset, const std::string& input);

// Removes the entry `input` normalises to; throws "IP/Mask '<x>' not found in ruleset <name>"
// when it is not there (or is no address at all).
void RemoveFromRuleset(Ruleset ruleset, const std::string& input);

// Reads the elements of one set out of the packet filter's JSON listing.
std::vector<std::string> ElementsFromJson(const std::string& json);

} // namespace HostLinux
