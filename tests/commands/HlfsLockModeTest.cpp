// storage hlfs lockmode list / set in process: the locking-mode bits, the ATS compatibility
// rules with the online upgrade option, and what set writes back. Failures and argument
// errors are covered by the hlfs-lockmode fixture cases.

#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "hlfs/HLFSVolumeLockMode.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;
using nlohmann::json;

namespace {

json Volume(const std::string& name, unsigned lockMode, int majorVersion = 5, int atsSupport = 1, int extents = 1)
{
    json v = {{"type", "HLFS"},        {"volumeName", name},         {"uuid", "uuid-" + name},
              {"lockMode", lockMode},  {"majorVersion", majorVersion}, {"atsSupport", atsSupport},
              {"extents", json::array()}};
    for (int i = 0; i < extents; ++i) {
        v["extents"].push_back({{"deviceName", name + "-disk" + std::to_string(i)}, {"partition", 1}});
    }
    return v;
}

std::string State(const json& volumes, int online = 1)
{
    return json{{"fileSystems", volumes}, {"advancedOptions", {{"HLFS3", {{"EnableOnlineATSUpgrade", online}}}}}}.dump();
}

std::string Str(const std::shared_ptr<MetaStruct>& row, const std::string& field)
{
    auto value = std::dynamic_pointer_cast<MetaString>(row->GetField(field));
    return value ? value->GetValue() : "<not a string>";
}

std::vector<std::shared_ptr<MetaStruct>> Rows(const TestSupport::CommandResult& result)
{
    auto list = std::dynamic_pointer_cast<MetaList>(result.root);
    EXPECT_TRUE(list) << "no list set";
    return list ? list->GetElements() : std::vector<std::shared_ptr<MetaStruct>>{};
}

TEST(HlfsLockModeTest, LockModeTextTakesTheFirstSetBit)
{
    const std::vector<std::pair<unsigned, std::string>> cases = {
        {0x00, "ATS+SCSI"},
        {0x0F, "ATS+SCSI"},
        {0x80, "ATS+SCSI"},
        {0x10, "ATS"},
        {0x30, "ATS"},
        {0x70, "ATS"},
        {0x20, "ATS UPGRADE PENDING"},
        {0x60, "ATS UPGRADE PENDING"},
        {0x40, "ATS DOWNGRADE PENDING"},
        {0x4F, "ATS DOWNGRADE PENDING"},
    };
    for (const auto& [mode, text] : cases) {
        EXPECT_EQ(HLFSVolumeLockModeList::TranslateLockMode(mode), text) << std::hex << mode;
    }
}

TEST(HlfsLockModeTest, AtsCompatibilityRules)
{
    struct Case {
        std::string name;
        unsigned lockMode;
        int majorVersion, atsSupport, extents, online;
        bool compatible;
        std::string modes, reason;
    };
    const std::vector<Case> cases = {
        {"ats-only", 0x10, 3, 0, 2, 1, true, "No upgrade needed", ""},
        {"upgrade pending", 0x20, 3, 0, 1, 0, true, "No upgrade needed", ""},
        {"hlfs-3 first", 0x00, 3, 0, 1, 1, false, "None", "ATS on HLFS-3 not supported"},
        {"downgrade pending judged as ats+scsi", 0x40, 3, 1, 1, 1, false, "None", "ATS on HLFS-3 not supported"},
        {"no device support", 0x00, 5, 0, 1, 1, false, "None", "Device does not support ATS"},
        {"device support 2", 0x00, 6, 2, 1, 1, false, "None", "Device does not support ATS"},
        {"one extent online", 0x00, 5, 1, 1, 1, true, "Online/Offline", ""},
        {"one extent online 7", 0x00, 5, 1, 1, 7, true, "Online/Offline", ""},
        {"no extent online", 0x00, 5, 1, 0, 1, true, "Online/Offline", ""},
        {"one extent offline", 0x00, 5, 1, 1, 0, true, "Offline", ""},
        {"two extents", 0x40, 6, 1, 2, 1, true, "Offline", ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        TestSupport::ScopedHost host(
            State(json::array({Volume("ds1", c.lockMode, c.majorVersion, c.atsSupport, c.extents)}), c.online));
        HLFSVolumeLockModeList command;
        const auto rows = Rows(TestSupport::Execute(command, Input::New()));
        ASSERT_EQ(rows.size(), 1u);
        auto compatible = std::dynamic_pointer_cast<MetaBool>(rows[0]->GetField("ATS Compatible"));
        ASSERT_TRUE(compatible);
        EXPECT_EQ(compatible->GetValue(), c.compatible);
        EXPECT_EQ(Str(rows[0], "ATS Upgrade Modes"), c.modes);
        EXPECT_EQ(Str(rows[0], "ATS Incompatibility Reason"), c.reason);
    }
}

TEST(HlfsLockModeTest, SetChangesOnlyTheAtsOnlyBit)
{
    struct Case {
        unsigned before;
        bool ats, scsi; // exactly one
        json written; // the SetLockMode argument, or null when nothing is written
    };
    const std::vector<Case> cases = {
        {0x00, true, false, 0x10},  {0x20, true, false, 0x30}, {0x60, true, false, 0x70}, {0x10, true, false, nullptr},
        {0x30, false, true, 0x20},  {0x50, false, true, 0x40}, {0x40, false, true, nullptr},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::to_string(c.before) + (c.ats ? " ats" : " scsi"));
        TestSupport::ScopedHost host(State(json::array({Volume("ds1", c.before)})));
        auto in = Input::New();
        in->SetParameter("volume-label", "ds1");
        in->SetFlag(c.ats ? "ats" : "scsi");
        HLFSVolumeLockModeSet command;
        const auto result = TestSupport::Execute(command, in);

        std::vector<json> writes;
        for (const auto& line : host.Journal()) {
            if (line["call"] == "HlFileSystem.SetLockMode") {
                writes.push_back(line["args"][0]);
            }
        }
        EXPECT_EQ(writes, c.written.is_null() ? std::vector<json>{} : std::vector<json>{c.written});
        EXPECT_TRUE(result.errors.empty());
        auto root = std::dynamic_pointer_cast<MetaBool>(result.root);
        ASSERT_TRUE(root);
        EXPECT_TRUE(root->GetValue());
    }
}

} // namespace
