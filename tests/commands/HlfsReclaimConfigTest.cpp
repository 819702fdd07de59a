// storage hlfs reclaim config set: every branch of the checks, and the whole record written
// each time.

#include <cstdint>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "hlfs/HLFSReclaimConfig.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;

namespace {

const char* const kState = R"({"fileSystems": [
    {"type": "HLFS", "volumeName": "ds-main", "uuid": "5f1c-aa01",
     "unmapProperty": {"granularity": 4294967295, "priority": "medium", "bandwidth": -20, "reserved": 9,
                       "method": "fixed"}}]})";

struct Arg {
    std::string name;
    std::string text;
    std::int64_t number;  // used when text is empty
};

InputPtr MakeInput(const std::vector<Arg>& args)
{
    auto in = Input::New();
    for (const auto& arg : args) {
        if (!arg.text.empty()) {
            in->SetParameter(arg.name, arg.text);
        } else {
            in->SetParameterInt(arg.name, arg.number);
        }
    }
    return in;
}

TEST(HlfsReclaimConfigTest, SetChecksAndTheRecordWritten)
{
    const Arg volume{"volume-label", "ds-main", 0};
    struct Case {
        std::vector<Arg> args;
        std::string message;  // empty: written
        nlohmann::json written;
    };
    const std::vector<Case> cases = {
        {{volume},
         "You have to specify at least one of - reclaim-granularity, reclaim-priority, reclaim-method", {}},
        {{volume, {"reclaim-granularity", "", 0}}, "", {0, "", 0, 0, "priority"}},
        {{volume, {"reclaim-granularity", "", -1}}, "reclaim-granularity must be greater than or equal to zero", {}},
        {{volume, {"reclaim-granularity", "", 4294967295}}, "", {4294967295u, "", 0, 0, "priority"}},
        {{volume, {"reclaim-granularity", "", 4294967296}}, "reclaim-granularity must not be greater than 4294967295",
         {}},
        {{volume, {"reclaim-priority", "high", 0}}, "", {0, "high", 0, 0, "priority"}},
        // The bandwidth is dropped unless the method is "fixed".
        {{volume, {"reclaim-priority", "low", 0}, {"reclaim-bandwidth", "", 50}}, "", {0, "low", 0, 0, "priority"}},
        {{volume, {"reclaim-method", "priority", 0}}, "reclaim-priority should be specified", {}},
        {{volume, {"reclaim-method", "priority", 0}, {"reclaim-priority", "none", 0}, {"reclaim-bandwidth", "", 9}},
         "", {0, "none", 0, 0, "priority"}},
        {{volume, {"reclaim-method", "fixed", 0}}, "reclaim-bandwidth should be specified", {}},
        {{volume, {"reclaim-method", "fixed", 0}, {"reclaim-bandwidth", "", -5}, {"reclaim-granularity", "", 65536},
          {"reclaim-priority", "medium", 0}},
         "", {65536, "medium", -5, 0, "fixed"}},
        {{volume, {"reclaim-method", "fixed", 0}, {"reclaim-bandwidth", "", 2147483647}}, "",
         {0, "", 2147483647, 0, "fixed"}},
        {{volume, {"reclaim-method", "fixed", 0}, {"reclaim-bandwidth", "", 2147483648}},
         "reclaim-bandwidth must be between -2147483648 and 2147483647", {}},
        {{volume, {"reclaim-method", "fixed", 0}, {"reclaim-bandwidth", "", -2147483649}},
         "reclaim-bandwidth must be between -2147483648 and 2147483647", {}},
        {{volume, {"reclaim-method", "Fixed", 0}, {"reclaim-bandwidth", "", 1}}, "Unsupported unmap method", {}},
        // The volume is resolved before any parameter is looked at.
        {{{"volume-uuid", "0000-dead", 0}},
         "HLFS volume with uuid 0000-dead could not be found.", {}},
        {{volume, {"volume-uuid", "5f1c-aa01", 0}, {"reclaim-granularity", "", -1}},
         "You cannot specify both --volume-label and --volume-uuid.", {}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.message.empty() ? c.written.dump() : c.message);
        TestSupport::ScopedHost host(kState);
        const auto result = TestSupport::Execute(*HLFSReclaimConfigSet::New(), MakeInput(c.args));
        std::vector<nlohmann::json> writes;
        for (const auto& line : host.Journal()) {
            if (line.value("call", "") == "HlFileSystem.SetUnmapProperty") {
                writes.push_back(line["args"]);
            }
        }
        if (c.message.empty()) {
            EXPECT_TRUE(result.errors.empty());
            auto root = std::dynamic_pointer_cast<MetaBool>(result.root);
            ASSERT_TRUE(root);
            EXPECT_TRUE(root->GetValue());
            EXPECT_EQ(writes, std::vector<nlohmann::json>{c.written});
        } else {
            EXPECT_EQ(result.errors, std::vector<std::string>{c.message});
            EXPECT_EQ(result.root, nullptr);
            EXPECT_TRUE(writes.empty());
        }
    }
}

} // namespace
