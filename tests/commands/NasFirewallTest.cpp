// storage nfs firewall / nfs41 firewall: the classification before adding, the joined
// list, and that each version's commands reach only their own rule set.

#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "nfs/NasFirewall.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;
using nlohmann::json;

namespace {

const char* const kState = R"({"firewall": {"nfsClient": ["10.0.0.0/8", "192.168.1.0/24"], "nfs41Client": []}})";

struct ChangeCase {
    const char* label;
    std::function<std::shared_ptr<Command>()> make;
    const char* ipMask;
    std::vector<std::string> errors;
    json nfsClient;   // the rule sets afterwards
    json nfs41Client;
};

TEST(NasFirewallTest, ChangesReachOnlyTheirOwnRuleset)
{
    const json v3 = {"10.0.0.0/8", "192.168.1.0/24"};
    const ChangeCase cases[] = {
        {"v3 add IPv4/mask", [] { return NFSFirewallAdd::New(); }, "172.16.0.0/12", {},
         {"10.0.0.0/8", "192.168.1.0/24", "172.16.0.0/12"}, json::array()},
        {"v4.1 add IPv6/mask", [] { return NFS41FirewallAdd::New(); }, "fd00::/8", {}, v3, {"fd00::/8"}},
        {"v3 add plain IPv4", [] { return NFSFirewallAdd::New(); }, "172.16.0.1",
         {"Only IP/Mask entries are allowed to be added"}, v3, json::array()},
        {"v4.1 add plain IPv6", [] { return NFS41FirewallAdd::New(); }, "fd00::1",
         {"Only IP/Mask entries are allowed to be added"}, v3, json::array()},
        {"v3 add junk", [] { return NFSFirewallAdd::New(); }, "everyone",
         {"Only IP/Mask entries are allowed to be added"}, v3, json::array()},
        {"v3 add duplicate", [] { return NFSFirewallAdd::New(); }, "10.0.0.0/8",
         {"IP/Mask '10.0.0.0/8' already exists in ruleset nfsClient"}, v3, json::array()},
        {"v3 remove", [] { return NFSFirewallRemove::New(); }, "10.0.0.0/8", {}, {"192.168.1.0/24"}, json::array()},
        {"v4.1 remove of a v3 entry", [] { return NFS41FirewallRemove::New(); }, "10.0.0.0/8",
         {"IP/Mask '10.0.0.0/8' not found in ruleset nfs41Client"}, v3, json::array()},
        {"v3 remove passes any text on", [] { return NFSFirewallRemove::New(); }, "everyone",
         {"IP/Mask 'everyone' not found in ruleset nfsClient"}, v3, json::array()},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.label);
        TestSupport::ScopedHost host(kState);
        auto in = Input::New();
        in->SetParameter("ip-mask", c.ipMask);
        const auto result = TestSupport::Execute(*c.make(), in);
        EXPECT_EQ(result.errors, c.errors);
        EXPECT_EQ(result.root != nullptr, c.errors.empty());
        const json firewall = host.State().is_null() ? json::parse(kState)["firewall"] : host.State()["firewall"];
        EXPECT_EQ(firewall["nfsClient"], c.nfsClient);
        EXPECT_EQ(firewall["nfs41Client"], c.nfs41Client);
    }
}

TEST(NasFirewallTest, ListJoinsTheEntriesOfItsOwnRuleset)
{
    const struct {
        json nfsClient, nfs41Client;
        const char* v3Text;
        const char* v41Text;
    } cases[] = {
        {{"a/1", "b/2"}, json::array(), "a/1,b/2", ""},
        {json::array(), {"fd00::/8"}, "", "fd00::/8"},
        {{"10.0.0.0/8"}, {"10.1.0.0/16", "10.2.0.0/16", "10.3.0.0/16"}, "10.0.0.0/8",
         "10.1.0.0/16,10.2.0.0/16,10.3.0.0/16"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.v3Text);
        TestSupport::ScopedHost host(
            json{{"firewall", {{"nfsClient", c.nfsClient}, {"nfs41Client", c.nfs41Client}}}}.dump());
        for (const auto& [command, expected] :
             {std::pair<std::shared_ptr<Command>, const char*>{NFSFirewallList::New(), c.v3Text},
              {NFS41FirewallList::New(), c.v41Text}}) {
            const auto result = TestSupport::Execute(*command, Input::New());
            EXPECT_TRUE(result.errors.empty());
            auto structure = std::dynamic_pointer_cast<MetaStruct>(result.root);
            ASSERT_NE(structure, nullptr);
            EXPECT_EQ(structure->GetName(), "NasFirewallConfigs");
            EXPECT_EQ(std::dynamic_pointer_cast<MetaString>(structure->GetField("Allowed IPMask"))->GetValue(),
                      expected);
        }
    }
}

} // namespace
