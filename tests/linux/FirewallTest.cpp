// The NFS client rule sets in the packet filter: entries normalised as nftables keeps them,
// and add, list and remove through autocli in a private network namespace, read back with
// nft's own JSON listing.

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "LinuxTestSupport.h"
#include "host/linux/LinuxFirewall.h"

namespace {

using namespace HostLinux;

TEST(Firewall, NormalisesLikeThePacketFilter)
{
    struct Case {
        const char* input;
        bool ok;
        bool v6;
        const char* text;
    };
    const Case cases[] = {
        {"10.20.40.5/24", true, false, "10.20.40.0/24"},
        {"10.20.40.0/24", true, false, "10.20.40.0/24"},
        {"10.1.1.1/32", true, false, "10.1.1.1"},
        {"10.1.1.1", true, false, "10.1.1.1"},
        {"0.0.0.0/0", true, false, "0.0.0.0/0"},
        {"192.168.77.200/29", true, false, "192.168.77.200/29"},
        {"192.168.77.201/29", true, false, "192.168.77.200/29"},
        {"fd00::5/64", true, true, "fd00::/64"},
        {"FD00:0:0:0:0:0:0:1/128", true, true, "fd00::1"},
        {"2001:db8::ffff/127", true, true, "2001:db8::fffe/127"},
        {"10.1.1.1/33", false, false, ""},
        {"fd00::/129", false, false, ""},
        {"10.1.1.1/", false, false, ""},
        {"10.1.1.1/+8", false, false, ""},
        {"10.1.1/8", false, false, ""},
        {"host.example/8", false, false, ""},
        {"10.0.0.0/8 }; flush ruleset; {", false, false, ""},
        {"", false, false, ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        Network network;
        ASSERT_EQ(NormaliseNetwork(c.input, network), c.ok);
        if (c.ok) {
            EXPECT_EQ(network.v6, c.v6);
            EXPECT_EQ(network.text, c.text);
        }
    }
}

TEST(Firewall, ReadsEveryElementFormOfTheListing)
{
    const std::string listing = R"({"nftables": [{"metainfo": {"version": "1.0.6"}},
        {"set": {"family": "inet", "name": "nfsClient_v4", "table": "autocli", "type": "ipv4_addr",
                 "flags": ["interval"], "elem": ["10.1.1.1", {"prefix": {"addr": "10.20.40.0", "len": 24}},
                 {"range": ["10.9.0.1", "10.9.0.7"]},
                 {"elem": {"val": {"prefix": {"addr": "172.16.0.0", "len": 12}}, "counter": {"packets": 0}}}]}}]})";
    EXPECT_EQ(ElementsFromJson(listing),
              (std::vector<std::string>{"10.1.1.1", "10.20.40.0/24", "10.9.0.1-10.9.0.7", "172.16.0.0/12"}));
    EXPECT_TRUE(ElementsFromJson(R"({"nftables": [{"set": {"name": "x"}}]})").empty());
    EXPECT_THROW(ElementsFromJson("not json"), std::runtime_error);
}

// The sets nft lists in this namespace, by name.
std::string Elements(const nlohmann::json& listing, const std::string& set)
{
    std::string result;
    for (const auto& item : listing["nftables"]) {
        if (!item.contains("set") || item["set"]["name"] != set || !item["set"].contains("elem"))
            continue;
        for (const auto& e : item["set"]["elem"])
            result += (result.empty() ? "" : ",") + (e.is_string() ? e.get<std::string>()
                                                                   : e["prefix"]["addr"].get<std::string>() + "/" +
                                                                         std::to_string(e["prefix"]["len"].get<int>()));
    }
    return result;
}

TEST(Firewall, AddListRemoveInAPrivateNetworkNamespace)
{
    if (auto problem = LinuxTest::NamespaceProblem({"-n"}))
        GTEST_SKIP() << *problem;
    // Each step prints a marker, its exit code and its output; nft lists the table at the
    // points where the test compares.
    const std::string script = R"(
step fresh "$AUTOCLI" --host linux --formatter json storage nfs41 firewall list
step tables nft -j list tables
step add1 "$AUTOCLI" --host linux --formatter json storage nfs firewall add -F 10.20.40.5/24
step add2 "$AUTOCLI" --host linux --formatter json storage nfs firewall add -F fd00::7/64
step add3 "$AUTOCLI" --host linux --formatter json storage nfs41 firewall add -F 192.168.9.0/24
step again "$AUTOCLI" --host linux storage nfs firewall add -F 10.20.40.0/24
step overlap "$AUTOCLI" --host linux storage nfs firewall add -F 10.20.40.128/25
step plain "$AUTOCLI" --host linux storage nfs firewall add -F 10.1.1.1
step list1 "$AUTOCLI" --host linux --formatter json storage nfs firewall list
step list41 "$AUTOCLI" --host linux --formatter json storage nfs41 firewall list
step nft1 nft -j list table inet autocli
step remove "$AUTOCLI" --host linux --formatter json storage nfs firewall remove -F 10.20.40.99/24
step removeagain "$AUTOCLI" --host linux storage nfs firewall remove -F 10.20.40.0/24
step list2 "$AUTOCLI" --host linux --formatter json storage nfs firewall list
step nft2 nft -j list table inet autocli
)";
    const auto ran = LinuxTest::RunInNamespaces({"-n"}, LinuxTest::kStepFunction + script);
    ASSERT_EQ(ran.exitCode, 0) << ran.err;
    auto steps = LinuxTest::ParseSteps(ran.out);
    // Listing in a fresh namespace shows nothing and makes no table.
    LinuxTest::ExpectSteps(steps, {{"fresh", 0, "\"Allowed IPMask\": \"\""}});
    EXPECT_EQ(steps["tables"].output.find("autocli\""), std::string::npos) << steps["tables"].output;
    if (steps["add1"].output.find("Operation not permitted") != std::string::npos)
        GTEST_SKIP() << "the packet filter refuses changes here: " << steps["add1"].output;

    const std::vector<LinuxTest::StepExpectation> expectations = {
        {"add1", 0, "true"},
        {"add2", 0, "true"},
        {"add3", 0, "true"},
        {"again", 1, "IP/Mask '10.20.40.0/24' already exists in ruleset nfsClient"},
        {"overlap", 1, "Cannot add IP/Mask '10.20.40.128/25' to ruleset nfsClient"},
        {"plain", 1, "Only IP/Mask entries are allowed to be added"},
        {"remove", 0, "true"},
        {"removeagain", 1, "IP/Mask '10.20.40.0/24' not found in ruleset nfsClient"},
    };
    LinuxTest::ExpectSteps(steps, expectations);

    // The listing is what the packet filter holds, normalised the way it keeps entries.
    ASSERT_EQ(steps["list1"].exitCode, 0) << steps["list1"].output;
    EXPECT_EQ(nlohmann::json::parse(steps["list1"].output)["Allowed IPMask"], "10.20.40.0/24,fd00::/64");
    EXPECT_EQ(nlohmann::json::parse(steps["list41"].output)["Allowed IPMask"], "192.168.9.0/24");
    ASSERT_EQ(steps["nft1"].exitCode, 0) << steps["nft1"].output;
    const auto before = nlohmann::json::parse(steps["nft1"].output);
    EXPECT_EQ(Elements(before, "nfsClient_v4"), "10.20.40.0/24");
    EXPECT_EQ(Elements(before, "nfsClient_v6"), "fd00::/64");
    EXPECT_EQ(Elements(before, "nfs41Client_v4"), "192.168.9.0/24");

    // After the remove, neither autocli nor nft shows the entry.
    EXPECT_EQ(nlohmann::json::parse(steps["list2"].output)["Allowed IPMask"], "fd00::/64");
    const auto after = nlohmann::json::parse(steps["nft2"].output);
    EXPECT_EQ(Elements(after, "nfsClient_v4"), "");
    EXPECT_EQ(Elements(after, "nfsClient_v6"), "fd00::/64");
}

} // namespace
