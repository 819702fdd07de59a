// storage filesystem rescan / automount: one host call each, inside the command's envelope,
// with the StorageInfoImpl made before the guarded region.

#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "RegisteredCommand.h"
#include "command/Command.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;

namespace {

struct HostActionCommand {
    const char* hostCall;
    std::function<std::shared_ptr<Command>()> make;
};

const std::vector<HostActionCommand> kCommands = {
    {"StorageInfoImpl.RescanHlfs", [] { return TestSupport::RegisteredCommand("storage filesystem rescan"); }},
    {"StorageInfoImpl.AutoFullMountVolumes",
     [] { return TestSupport::RegisteredCommand("storage filesystem automount"); }},
};

std::string FaultState(const std::string& call, const std::string& message)
{
    return R"({"faults": [{"call": ")" + call + R"(", "message": ")" + message + R"("}]})";
}

TEST(RescanAutomountTest, SuccessIsTrueAndCallsTheHostOnce)
{
    for (const auto& c : kCommands) {
        SCOPED_TRACE(c.hostCall);
        TestSupport::ScopedHost host("{}");
        const auto result = TestSupport::Execute(*c.make(), Quillets::CallSpec::Input::New());
        EXPECT_TRUE(result.errors.empty());
        auto root = std::dynamic_pointer_cast<MetaBool>(result.root);
        ASSERT_TRUE(root);
        EXPECT_TRUE(root->GetValue());
        EXPECT_EQ(host.JournalCalls(), std::vector<std::string>{c.hostCall});
    }
}

TEST(RescanAutomountTest, HostFailureIsExactlyTheHostsTextAndNoResult)
{
    for (const auto& c : kCommands) {
        for (const std::string message : {"Unable to scan adapters", ""}) {
            SCOPED_TRACE(std::string(c.hostCall) + " / '" + message + "'");
            TestSupport::ScopedHost host(FaultState(c.hostCall, message));
            const auto result = TestSupport::Execute(*c.make(), Quillets::CallSpec::Input::New());
            EXPECT_EQ(result.errors, std::vector<std::string>{message});
            EXPECT_EQ(result.root, nullptr);
        }
    }
}

TEST(RescanAutomountTest, StorageInfoFailureReachesTheFramework)
{
    for (const auto& c : kCommands) {
        SCOPED_TRACE(c.hostCall);
        TestSupport::ScopedHost host(FaultState("StorageInfoImpl.new", "storage service unavailable"));
        auto command = c.make();
        auto out = Quillets::CallSpec::Output::New();
        EXPECT_THROW(command->Execute(Quillets::CallSpec::Input::New(), out), HostCtl::Lib::HostCtlException);
        EXPECT_TRUE(out->GetErrorMessages().empty());
    }
}

} // namespace
