// storage nfs remove / nfs41 remove: the version passed to the host and the datastore
// notifications around the removal, in journal order.

#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "nfs/NFSVolumeRemove.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;
using nlohmann::json;

namespace {

const std::string kNotify = "/usr/lib/orvane/tallowd/bin/notifyDatastore.py -t ";

const char* const kState = R"({"fileSystems": [
    {"type": "NFS", "volumeName": "nas1", "remoteHost": "srv", "remoteShare": "/a"},
    {"type": "NFS41", "volumeName": "nfs41a", "remoteHosts": ["srv"], "remoteShare": "/b"},
    {"type": "NFS", "volumeName": "stuck", "busy": true}]})";

struct RemoveCase {
    bool v41;
    const char* volume;
    const char* error; // "" for success
    int remaining;     // file systems left on the host
};

TEST(NfsRemoveTest, RemovalIsNotifiedBeforeAndAfterAFailure)
{
    const RemoveCase cases[] = {
        {false, "nas1", "", 2},
        {true, "nfs41a", "", 2},
        {true, "nas1", "NFS volume 'nas1' not found", 3},
        {false, "nfs41a", "NFS volume 'nfs41a' not found", 3},
        {false, "stuck", "Volume 'stuck' is busy", 3},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.v41 ? "v4.1 " : "v3 ") + c.volume);
        TestSupport::ScopedHost host(kState);
        auto in = Input::New();
        in->SetParameter("volume-name", c.volume);
        const auto result = c.v41 ? TestSupport::Execute(*NFS41VolumeRemove::New(), in)
                                  : TestSupport::Execute(*NFSVolumeRemove::New(), in);
        const bool failed = c.error[0] != '\0';
        EXPECT_EQ(result.errors, failed ? std::vector<std::string>{c.error} : std::vector<std::string>{});
        EXPECT_EQ(result.root != nullptr, !failed);
        EXPECT_EQ(host.State()["fileSystems"].size(), static_cast<size_t>(c.remaining));

        std::vector<json> expected = {
            json{{"call", "AutoCli_ShellCmd"}, {"args", {kNotify + "PreUnmount -i stdin", c.volume}}},
            json{{"call", "StorageInfoImpl.RemoveNetworkFileSystem"}, {"args", {c.volume, c.v41 ? 2 : 1}}},
        };
        if (failed) {
            expected.push_back(
                json{{"call", "AutoCli_ShellCmd"}, {"args", {kNotify + "FailedUnmount -i stdin", c.volume}}});
        }
        std::vector<json> seen;
        for (const auto& line : host.Journal()) {
            seen.push_back(json{{"call", line["call"]}, {"args", line["args"]}});
        }
        EXPECT_EQ(seen, expected);
    }
}

} // namespace
