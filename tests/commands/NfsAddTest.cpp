// storage nfs add / nfs41 add: which arguments reach the host and how the mount is made,
// as the host's journal shows them. Mount failures and their clean-up are end-to-end cases.

#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "RegisteredCommand.h"
#include "command/Command.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;
using nlohmann::json;

namespace {

// "name=value" a string, "name#=N" an integer, "name+=value" a list entry, "name" a flag.
InputPtr MakeInput(const std::string& words)
{
    auto in = Input::New();
    std::istringstream stream(words);
    for (std::string word; stream >> word;) {
        const auto eq = word.find('=');
        if (eq == std::string::npos) {
            in->SetFlag(word);
        } else if (word[eq - 1] == '#') {
            in->SetParameterInt(word.substr(0, eq - 1), std::stoll(word.substr(eq + 1)));
        } else if (word[eq - 1] == '+') {
            in->AddParameterListValue(word.substr(0, eq - 1), word.substr(eq + 1));
        } else {
            in->SetParameter(word.substr(0, eq), word.substr(eq + 1));
        }
    }
    return in;
}

std::string State(const std::string& features, const std::string& exportHosts = R"(["srv"])")
{
    json exports = json::array();
    for (const auto& host : json::parse(exportHosts)) {
        exports.push_back({{"host", host}, {"share", "/exp"}, {"capacity", 100}, {"used", 1}});
    }
    return json{{"features", json::parse(features)}, {"nfsExports", exports}}.dump();
}

// The args of every journal line of `call`, in order.
std::vector<json> ArgsOf(const TestSupport::ScopedHost& host, const std::string& call)
{
    std::vector<json> args;
    for (const auto& line : host.Journal()) {
        if (line["call"] == call) {
            args.push_back(line["args"]);
        }
    }
    return args;
}

struct AddCase {
    const char* features;
    const char* words;   // besides share=/exp volume-name=nas9
    const char* error;   // "" for success
    const char* addArgs; // "" when the host must not be asked
    int mountFlags;
};

TEST(NfsAddTest, V3ArgumentsReachTheHostAsDecided)
{
    const AddCase cases[] = {
        {R"({"104": true})", "", "Either hostName or knxnic shoud be provided", "", 0},
        {R"({"104": true})", "host-knxnic=srv:eth0", "Invalid host-knxnic input", "", 0},
        {R"({"104": true})", "host-knxnic=srv:eth0 unsupported-queue-depth#=5", "Invalid host-knxnic input", "", 0},
        {"{}", "host=srv unsupported-queue-depth#=5", "unsupported-queue-depth requires unsupported-mount-retry flag",
         "", 0},
        {R"({"104": true})", "host-knxnic=srv:knx1", "", R"(["srv","/exp","nas9",true,"knx1",0,1])", 0},
        {R"({"104": true})", "host-knxnic=:knx2", "", R"(["","/exp","nas9",true,"knx2",0,1])", 0},
        {"{}", "host=srv host-knxnic=x:knx1 connections#=4", "", R"(["srv","/exp","nas9",false,"",0,1])", 0},
        {R"({"103": true})", "host=srv connections#=8", "", R"(["srv","/exp","nas9",false,"",0,8])", 0},
        {"{}", "host=srv unsupported-mount-retry unsupported-queue-depth#=4294967295", "",
         R"(["srv","/exp","nas9",false,"",4294967295,1])", 4},
        {R"({"270": true})", "host=srv unsupported-mount-retry", "", R"(["srv","/exp","nas9",false,"",0,1])", 0},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.features) + " " + c.words);
        TestSupport::ScopedHost host(State(c.features, R"(["srv", "fe80::1", ""])"));
        const auto result = TestSupport::Execute(*TestSupport::RegisteredCommand("storage nfs add"),
                                                 MakeInput(std::string("share=/exp volume-name=nas9 ") + c.words));
        if (c.error[0] != '\0') {
            EXPECT_EQ(result.errors, std::vector<std::string>{c.error});
            EXPECT_EQ(result.root, nullptr);
            EXPECT_TRUE(host.Journal().empty());
            continue;
        }
        EXPECT_TRUE(result.errors.empty());
        EXPECT_NE(result.root, nullptr);
        EXPECT_EQ(ArgsOf(host, "StorageInfoImpl.AddNetworkFileSystem"), std::vector<json>{json::parse(c.addArgs)});
        EXPECT_EQ(ArgsOf(host, "NetworkFileSystem.Mount"), std::vector<json>{json::array({c.mountFlags})});
    }
}

TEST(NfsAddTest, V41ServerListAndSecurityReachTheHostAsDecided)
{
    const AddCase cases[] = {
        {R"({"102": true})", "", "Either hostName or knxnic should be provided", "", 0},
        {R"({"102": true})", "host-knxnic+=srv:knx1 host-knxnic+=ip2:knx2 sec=krb5i", "",
         R"([["srv:knx1","ip2:knx2"],"/exp","nas9",3,true])", 0},
        {"{}", "hosts+=srv host-knxnic+=srv:knx1 sec=krb5", "", R"([["srv"],"/exp","nas9",2,false])", 0},
        {"{}", "hosts+=srv sec=krb5p", "", R"([["srv"],"/exp","nas9",1,false])", 0},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.features) + " " + c.words);
        TestSupport::ScopedHost host(State(c.features));
        const auto result = TestSupport::Execute(*TestSupport::RegisteredCommand("storage nfs41 add"),
                                                 MakeInput(std::string("share=/exp volume-name=nas9 ") + c.words));
        if (c.error[0] != '\0') {
            EXPECT_EQ(result.errors, std::vector<std::string>{c.error});
            EXPECT_TRUE(host.Journal().empty());
            continue;
        }
        EXPECT_TRUE(result.errors.empty());
        EXPECT_EQ(ArgsOf(host, "StorageInfoImpl.AddV41NetworkFileSystem"), std::vector<json>{json::parse(c.addArgs)});
        EXPECT_EQ(ArgsOf(host, "NetworkFileSystem.Mount"), std::vector<json>{json::array({0})});
    }
}

TEST(NfsAddTest, StorageInfoFailureIsAMessageOnlyForV41)
{
    TestSupport::ScopedHost host(R"({"faults": [{"call": "StorageInfoImpl.new", "message": "no storage"}]})");
    const auto v41 = TestSupport::Execute(*TestSupport::RegisteredCommand("storage nfs41 add"),
                                          MakeInput("hosts+=srv share=/exp volume-name=nas9"));
    EXPECT_EQ(v41.errors, std::vector<std::string>{"no storage"});
    auto out = Output::New();
    EXPECT_THROW(TestSupport::RegisteredCommand("storage nfs add")
                     ->Execute(MakeInput("host=srv share=/exp volume-name=nas9"), out),
                 HostCtlException);
}

} // namespace
