// storage hlfs extent list: one row per extent, numbered per volume, one error scope per volume.

#include "hlfs/HLFSExtentList.h"
#include "VolumeTestSupport.h"

using namespace VolumeTests;

namespace {

std::string HostWith(const std::string& faults)
{
    return R"({"fileSystems": [
        {"type": "HLFS", "volumeName": "a", "uuid": "u-a", "lvmUuid": "l-a", "mountPoint": "/vol/a", "extents":
         [{"deviceName": "sda", "partition": 1}, {"deviceName": "sdb", "partition": 3}, {"deviceName": "sdc", "partition": 255}]},
        {"type": "vfat", "volumeName": "boot"}, {"type": "HLFS", "volumeName": "empty"},
        {"type": "HLFS", "volumeName": "b", "uuid": "u-b", "lvmUuid": "l-b", "extents": [{"deviceName": "sdd", "partition": 2}]}],
        "faults": [)" + faults + "]}";
}

TEST(HlfsExtentListTest, RowsAndErrorScopes)
{
    struct Case { const char* what; std::string faults; Texts args; Texts rows; Texts errors; };
    const auto device = Fault("DiskLunPartition.GetDeviceName", "sdb", "device gone");
    const std::vector<Case> cases = {
        {"every extent, numbered from 0 per volume", "", {},
         {"a|u-a|l-a|0|sda|1", "a|u-a|l-a|1|sdb|3", "a|u-a|l-a|2|sdc|255", "b|u-b|l-b|0|sdd|2"}, {}},
        {"a failing extent ends its volume, earlier rows stay", device, {}, {"a|u-a|l-a|0|sda|1", "b|u-b|l-b|0|sdd|2"},
         {"Error getting data for filesystem on '/vol/a': device gone, skipping."}},
        {"ignore-errors reports nothing", device, {"ignore-errors"}, {"a|u-a|l-a|0|sda|1", "b|u-b|l-b|0|sdd|2"}, {}},
        {"unreadable extents", Fault("HlFileSystem.GetExtents", "a", "unreadable"), {}, {"b|u-b|l-b|0|sdd|2"},
         {"Error getting data for filesystem on '/vol/a': unreadable, skipping."}},
        {"mount point fails again: the walk ends", device + "," + Fault("FileSystem.GetMountPoint", "a", "gone"), {},
         {"a|u-a|l-a|0|sda|1"}, {"gone"}},
        {"enumeration failure", Fault("StorageInfoImpl.GetHlfsFileSystemsList", "", "no volumes"), {"ignore-errors"},
         {"<no list>"}, {"no volumes"}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        TestSupport::ScopedHost host(HostWith(c.faults));
        const auto result = TestSupport::Execute(*HLFSExtentList::New(), MakeInput({}, c.args));
        EXPECT_EQ(Rows(result.root, {"Volume Name", "HLFS UUID", "LVM UUID", "Extent Number", "Device Name", "Partition"}),
                  c.rows);
        EXPECT_EQ(result.errors, c.errors);
    }
}

} // namespace
