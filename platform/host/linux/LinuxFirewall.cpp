#include "LinuxFirewall.h"

#include <arpa/inet.h>
#include <nftables/libnftables.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <stdexcept>

#include <nlohmann/json.hpp>

namespace HostLinux {

namespace {

struct ContextFree {
    void operator()(nft_ctx* ctx) const { nft_ctx_free(ctx); }
};

constexpr const char* kTable = "inet autocli";

std::string SetName(Ruleset ruleset, bool v6) { return std::string(RulesetName(ruleset)) + (v6 ? "_v6" : "_v4"); }

struct Result {
    bool ok = false;
    std::string output;
    std::string error;
};

// Runs commands through the packet filter's library; nothing reaches a shell.
Result Run(const std::string& commands, bool json)
{
    std::unique_ptr<nft_ctx, ContextFree> ctx(nft_ctx_new(NFT_CTX_DEFAULT));
    if (!ctx)
        throw std::runtime_error("Cannot open the packet filter: out of memory");
    nft_ctx_buffer_output(ctx.get());
    nft_ctx_buffer_error(ctx.get());
    if (json)
        nft_ctx_output_set_flags(ctx.get(), NFT_CTX_OUTPUT_JSON);
    Result result;
    result.ok = nft_run_cmd_from_buffer(ctx.get(), commands.c_str()) == 0;
    if (const char* out = nft_ctx_get_output_buffer(ctx.get()))
        result.output = out;
    if (const char* err = nft_ctx_get_error_buffer(ctx.get()))
        result.error = err;
    return result;
}

// The first line of the packet filter's message, without its "Error: " prefix.
std::string Reason(const Result& result)
{
    std::string text = result.error.substr(0, result.error.find('\n'));
    if (text.rfind("Error: ", 0) == 0)
        text.erase(0, 7);
    return text.empty() ? std::string("the packet filter refused the change") : text;
}

std::string ElementText(const nlohmann::json& element)
{
    if (element.is_string())
        return element.get<std::string>();
    if (element.is_object()) {
        if (element.contains("prefix")) {
            const auto& prefix = element["prefix"];
            return ElementText(prefix.value("addr", nlohmann::json())) + "/" + std::to_string(prefix.value("len", 0));
        }
        if (element.contains("range") && element["range"].is_array() && element["range"].size() == 2)
            return ElementText(element["range"][0]) + "-" + ElementText(element["range"][1]);
        if (element.contains("elem") && element["elem"].is_object())
            return ElementText(element["elem"].value("val", nlohmann::json()));
    }
    return element.dump();
}

void EnsureTable()
{
    // "add" leaves what exists alone; the chain and its rules are made once, with the table.
    const Result existing = Run(std::string("list chain ") + kTable + " nfs_client_out", false);
    std::string commands = std::string("add table ") + kTable + "\n";
    for (Ruleset r : {Ruleset::NfsClient, Ruleset::Nfs41Client}) {
        commands +=
            "add set " + std::string(kTable) + " " + SetName(r, false) + " { type ipv4_addr; flags interval; }\n";
        commands +=
            "add set " + std::string(kTable) + " " + SetName(r, true) + " { type ipv6_addr; flags interval; }\n";
    }
    if (!existing.ok) {
        const std::string t = kTable;
        commands += "add chain " + t + " nfs_client_out { type filter hook output priority 0; policy accept; }\n";
        commands += "add rule " + t +
                    " nfs_client_out ip daddr @nfsClient_v4 meta l4proto { tcp, udp } th dport { 111, 2049 } accept\n";
        commands += "add rule " + t +
                    " nfs_client_out ip6 daddr @nfsClient_v6 meta l4proto { tcp, udp } th dport { 111, 2049 } accept\n";
        commands += "add rule " + t + " nfs_client_out ip daddr @nfs41Client_v4 tcp dport 2049 accept\n";
        commands += "add rule " + t + " nfs_client_out ip6 daddr @nfs41Client_v6 tcp dport 2049 accept\n";
    }
    const Result made = Run(commands, false);
    if (!made.ok)
        throw std::runtime_error("Cannot set up the packet filter table autocli: " + Reason(made));
}

std::vector<std::string> ListSet(const std::string& set)
{
    const Result listed = Run("list set " + std::string(kTable) + " " + set, true);
    if (!listed.ok) {
        // A table or set that was never made holds nothing.
        if (listed.error.find("No such file or directory") != std::string::npos)
            return {};
        throw std::runtime_error("Cannot read the packet filter: " + Reason(listed));
    }
    return ElementsFromJson(listed.output);
}

} // namespace

const char* RulesetName(Ruleset ruleset) { return ruleset == Ruleset::NfsClient ? "nfsClient" : "nfs41Client"; }

bool NormaliseNetwork(const std::string& input, Network& out)
{
    const auto slash = input.find('/');
    const std::string address = input.substr(0, slash);
    unsigned char bytes[16] = {};
    const bool v4 = ::inet_pton(AF_INET, address.c_str(), bytes) == 1;
    const bool v6 = !v4 && ::inet_pton(AF_INET6, address.c_str(), bytes) == 1;
    if (!v4 && !v6)
        return false;
    const int width = v4 ? 32 : 128;
    int length = width;
    if (slash != std::string::npos) {
        const std::string digits = input.substr(slash + 1);
        if (digits.empty() || digits.size() > 3 ||
            !std::all_of(digits.begin(), digits.end(), [](char c) { return c >= '0' && c <= '9'; }))
            return false;
        length = std::stoi(digits);
        if (length > width)
            return false;
    }
    for (int bit = length; bit < width; ++bit)
        bytes[bit / 8] &= static_cast<unsigned char>(~(0x80u >> (bit % 8)));
    char text[INET6_ADDRSTRLEN] = {};
    if (!::inet_ntop(v4 ? AF_INET : AF_INET6, bytes, text, sizeof text))
        return false;
    out.v6 = v6;
    out.text = text;
    if (length != width)
        out.text += "/" + std::to_string(length);
    return true;
}

std::vector<std::string> ElementsFromJson(const std::string& json)
{
    std::vector<std::string> result;
    const auto doc = nlohmann::json::parse(json, nullptr, false);
    if (doc.is_discarded() || !doc.is_object() || !doc.contains("nftables") || !doc["nftables"].is_array())
        throw std::runtime_error("Cannot read the packet filter's listing");
    for (const auto& item : doc["nftables"]) {
        if (!item.is_object() || !item.contains("set"))
            continue;
        const auto& set = item["set"];
        if (!set.contains("elem") || !set["elem"].is_array())
            continue;
        for (const auto& element : set["elem"])
            result.push_back(ElementText(element));
    }
    return result;
}

std::vector<std::string> ListRuleset(Ruleset ruleset)
{
    std::vector<std::string> result = ListSet(SetName(ruleset, false));
    for (auto& entry : ListSet(SetName(ruleset, true)))
        result.push_back(std::move(entry));
    return result;
}

void AddToRuleset(Ruleset ruleset, const std::string& input)
{
    Network network;
    if (!NormaliseNetwork(input, network))
        throw std::runtime_error("IP/Mask '" + input + "' is not an address with a prefix length");
    const auto present = ListRuleset(ruleset);
    if (std::find(present.begin(), present.end(), network.text) != present.end())
        throw std::runtime_error("IP/Mask '" + input + "' already exists in ruleset " + RulesetName(ruleset));
    EnsureTable();
    const Result added = Run(
        "add element " + std::string(kTable) + " " + SetName(ruleset, network.v6) + " { " + network.text + " }", false);
    if (!added.ok)
        throw std::runtime_error("Cannot add IP/Mask '" + input + "' to ruleset " + RulesetName(ruleset) + ": " +
                                 Reason(added));
}

void RemoveFromRuleset(Ruleset ruleset, const std::string& input)
{
    Network network;
    const std::string notFound = "IP/Mask '" + input + "' not found in ruleset " + RulesetName(ruleset);
    if (!NormaliseNetwork(input, network))
        throw std::runtime_error(notFound);
    const auto present = ListRuleset(ruleset);
    if (std::find(present.begin(), present.end(), network.text) == present.end())
        throw std::runtime_error(notFound);
    const Result removed =
        Run("delete element " + std::string(kTable) + " " + SetName(ruleset, network.v6) + " { " + network.text + " }",
            false);
    if (!removed.ok)
        throw std::runtime_error("Cannot remove IP/Mask '" + input + "' from ruleset " + RulesetName(ruleset) + ": " +
                                 Reason(removed));
}

} // namespace HostLinux
