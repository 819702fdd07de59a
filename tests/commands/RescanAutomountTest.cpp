// storage filesystem rescan / automount: one host call each, inside the command's envelope,
// with the StorageInfoImpl made before the guarded region.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "RegisteredCommand.h"
#include "command/Command.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;

namespace {

std::string FaultState(const std::string& call, const std::string& message)
{
    return R"({"faults": [{"call": ")" + call + R"(", "message": ")" + message + R"("}]})";
}

// Success is true after one host call; a host failure is exactly the host's text (even an
// empty one) with no result; a failure to reach storage goes to the framework.
TEST(RescanAutomountTest, OneHostCallAndItsFailures)
{
    const struct {
        const char* path;
        const char* hostCall;
        const char* message;
    } cases[] = {
        {"storage filesystem rescan", "StorageInfoImpl.RescanHlfs", "Unable to scan adapters"},
        {"storage filesystem automount", "StorageInfoImpl.AutoFullMountVolumes", ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.path);
        {
            TestSupport::ScopedHost host("{}");
            const auto result = TestSupport::Execute(*TestSupport::RegisteredCommand(c.path), Input::New());
            EXPECT_TRUE(result.errors.empty());
            auto root = std::dynamic_pointer_cast<MetaBool>(result.root);
            ASSERT_TRUE(root);
            EXPECT_TRUE(root->GetValue());
            EXPECT_EQ(host.JournalCalls(), std::vector<std::string>{c.hostCall});
        }
        {
            TestSupport::ScopedHost host(FaultState(c.hostCall, c.message));
            const auto result = TestSupport::Execute(*TestSupport::RegisteredCommand(c.path), Input::New());
            EXPECT_EQ(result.errors, std::vector<std::string>{c.message});
            EXPECT_EQ(result.root, nullptr);
        }
        TestSupport::ScopedHost host(FaultState("StorageInfoImpl.new", "storage service unavailable"));
        auto out = Output::New();
        EXPECT_THROW(TestSupport::RegisteredCommand(c.path)->Execute(Input::New(), out), HostCtlException);
        EXPECT_TRUE(out->GetErrorMessages().empty());
    }
}

} // namespace
