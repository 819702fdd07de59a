// storage filesystem list: rows in host order, one error scope per volume, the UUID filter.

#include "filesystem/VolumeList.h"
#include "VolumeTestSupport.h"

using namespace VolumeTests;

namespace {

std::string HostWith(const std::string& faults)
{
    return R"({"fileSystems": [
        {"type": "vfat", "volumeName": "boot", "uuid": "u-boot", "mountPoint": "/vol/boot", "capacity": 100, "used": 30},
        {"type": "HLFS", "volumeName": "ds1", "uuid": "u-ds1", "mountPoint": "/vol/ds1", "capacity": 1000,
         "used": 1500, "mounted": false},
        {"type": "NFS", "volumeName": "nas", "uuid": "u-nas", "mountPoint": "/vol/nas", "capacity": 5497558138880,
         "used": 1}], "faults": [)" + faults + "]}";
}

TEST(VolumeListTest, ErrorScopesAndRows)
{
    struct Case { const char* what; std::string faults; Texts args; Texts rows; Texts errors; };
    const auto capacity = Fault("FileSystem.GetCapacity", "ds1", "no capacity");
    const Texts others = {"/vol/boot", "/vol/nas"};
    const std::vector<Case> cases = {
        {"failing volume dropped whole", capacity, {}, others,
         {"Error getting data for filesystem on '/vol/ds1': no capacity, skipping."}},
        {"ignore-errors drops it silently", capacity, {"ignore-errors"}, others, {}},
        {"failure after every field was set", Fault("FileSystem.IsMounted", "ds1", "state unknown"), {}, others,
         {"Error getting data for filesystem on '/vol/ds1': state unknown, skipping."}},
        {"mount point fails again: the walk ends, earlier rows stay",
         capacity + "," + Fault("FileSystem.GetMountPoint", "ds1", "mount point gone", 1), {}, {"/vol/boot"},
         {"mount point gone"}},
        {"enumeration failure", Fault("StorageInfoImpl.GetFileSystems", "", "enumeration failed"), {"ignore-errors"},
         {"<no list>"}, {"enumeration failed"}},
        {"storage information failure", Fault("StorageInfoImpl.new", "", "no storage"), {}, {"<no list>"},
         {"no storage"}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        TestSupport::ScopedHost host(HostWith(c.faults));
        const auto result = TestSupport::Execute(*VolumeList::New(), MakeInput({}, c.args));
        EXPECT_EQ(Rows(result.root, {"Mount Point"}), c.rows);
        EXPECT_EQ(result.errors, c.errors);
    }
}

TEST(VolumeListTest, UuidFilterAndRowContents)
{
    // More in use than capacity shows no free space instead of a wrapped number.
    const std::vector<std::pair<std::string, Texts>> cases = {
        {"", {"/vol/boot|boot|u-boot|vfat|true|100|70", "/vol/ds1|ds1|u-ds1|HLFS-6|false|1000|0",
              "/vol/nas|nas|u-nas|NFS|true|5497558138880|5497558138879"}},
        {"u-ds1", {"/vol/ds1|ds1|u-ds1|HLFS-6|false|1000|0"}},
        {"u-none", {"<no list>"}},
    };
    for (const auto& [uuid, rows] : cases) {
        SCOPED_TRACE(uuid);
        TestSupport::ScopedHost host(HostWith(""));
        const auto result = TestSupport::Execute(*VolumeList::New(), MakeInput({{"uuid", uuid}}));
        EXPECT_EQ(Rows(result.root, {"Mount Point", "Volume Name", "UUID", "Type", "Mounted", "Size", "Free"}), rows);
        EXPECT_EQ(result.errors, uuid == "u-none" ? Texts{"Could not find any filesystem with specified UUID."} : Texts{});
    }
}

} // namespace
