// storage hlfs reclaim config set: the method check the front end's value list normally
// makes first. Everything a user can reach is in the hlfs-maint fixture cases.

#include <gtest/gtest.h>

#include "RegisteredCommand.h"
#include "command/Command.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;

TEST(HlfsReclaimConfigTest, UnknownMethodWritesNothing)
{
    TestSupport::ScopedHost host(R"({"fileSystems": [{"type": "HLFS", "volumeName": "ds-main"}]})");
    auto in = Input::New();
    in->SetParameter("volume-label", "ds-main");
    in->SetParameter("reclaim-method", "Fixed");
    in->SetParameterInt("reclaim-bandwidth", 1);
    const auto result = TestSupport::Execute(*TestSupport::RegisteredCommand("storage hlfs reclaim config set"), in);
    EXPECT_EQ(result.errors, std::vector<std::string>{"Unsupported unmap method"});
    EXPECT_EQ(result.root, nullptr);
    EXPECT_TRUE(host.Journal().empty());
}
