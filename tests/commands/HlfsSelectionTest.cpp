// The shared HLFS helpers: selection by label or UUID and the version text. The notification
// is checked end to end by the unmount fixture cases.

#include "hlfs/HlfsVolumeSelection.h"
#include "VolumeTestSupport.h"

using namespace VolumeTests;

namespace {

std::string HostWith(const std::string& faults)
{
    return R"({"fileSystems": [{"type": "HLFS", "volumeName": "alpha", "uuid": "u-a"},
        {"type": "HLFS", "volumeName": "beta", "uuid": "u-b", "majorVersion": 4},
        {"type": "vfat", "volumeName": "boot"}, {"type": "HLFS", "volumeName": "gamma", "uuid": "u-g", "majorVersion": 3}],
        "faults": [)" + faults + "]}";
}

// Any host contact fails with this text, so a selection that must not reach the host shows it.
const std::string kNoHost = Fault("Host.GetStorageInfo", "", "host contacted");

TEST(HlfsSelectionTest, SingleVolume)
{
    struct Case { const char *label, *uuid; std::string faults; const char* volume; Texts errors; };
    const std::vector<Case> cases = {
        {"beta", "", "", "beta", {}},
        {"", "u-g", "", "gamma", {}},
        {"alpha", "u-b", kNoHost, "", {"You cannot specify both --volume-label and --volume-uuid."}},
        {"", "", kNoHost, "", {"A target HLFS volume must be specified either by --volume-label or --volume-uuid."}},
        {"", "u-none", "", "", {"HLFS volume with uuid u-none could not be found."}},
        {"delta", "", "", "", {"HLFS volume with label delta could not be found."}},
        {"alpha", "", Fault("StorageInfo.GetHlfsFileSystemByLabel", "", "lookup failed"), "", {"lookup failed"}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.label) + "/" + c.uuid);
        TestSupport::ScopedHost host(HostWith(c.faults));
        auto out = Output::New();
        auto volume = GetSingleHLFSVolume(MakeInput({{"volume-label", c.label}, {"volume-uuid", c.uuid}}), out);
        EXPECT_EQ(out->GetErrorMessages(), c.errors);
        EXPECT_EQ(volume ? volume->GetVolumeName() : "", c.volume);
    }
}

TEST(HlfsSelectionTest, MultipleVolumes)
{
    struct Case { const char* what; Pairs lists; bool ignore; std::string faults; Texts volumes; Texts errors; bool go; };
    const Pairs missing = {{"volume-label", "nope"}, {"volume-label", "beta"}, {"volume-uuid", "u-nope"}};
    const Pairs three = {{"volume-label", "alpha"}, {"volume-label", "beta"}, {"volume-label", "gamma"}};
    const auto secondFails = Fault("StorageInfo.GetHlfsFileSystemByLabel", "", "lookup failed", 1);
    const std::vector<Case> cases = {
        {"no selection: every HLFS volume", {}, false, "", {"alpha", "beta", "gamma"}, {}, true},
        {"labels before UUIDs, duplicates kept",
         {{"volume-uuid", "u-b"}, {"volume-label", "gamma"}, {"volume-label", "gamma"}}, false, "",
         {"gamma", "gamma", "beta"}, {}, true},
        {"every missing name reported", missing, false, "", {"beta"},
         {"Error fetching HLFS volume with label 'nope'", "Error fetching HLFS volume with uuid 'u-nope'"}, false},
        {"ignore-errors silences not-found", missing, true, "", {"beta"}, {}, true},
        {"host failure keeps what was found", three, false, secondFails, {"alpha"}, {"lookup failed"}, false},
        {"ignore-errors does not silence host failures", three, true, secondFails, {"alpha"}, {"lookup failed"}, true},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        TestSupport::ScopedHost host(HostWith(c.faults));
        auto out = Output::New();
        std::vector<std::unique_ptr<HlFileSystem>> volumes;
        EXPECT_EQ(GetMultipleHLFSVolumes(MakeInput({}, c.ignore ? Texts{"ignore-errors"} : Texts{}, c.lists), out, volumes),
                  c.go);
        Texts names;
        for (const auto& volume : volumes) names.push_back(volume->GetVolumeName());
        EXPECT_EQ(names, c.volumes);
        EXPECT_EQ(out->GetErrorMessages(), c.errors);
        if (!c.lists.empty()) continue;
        // Version text by major version: 6 by default, 4 unknown, 3 known.
        Texts versions;
        for (const auto& volume : volumes) versions.push_back(GetHLFSVersionString(volume.get()));
        EXPECT_EQ(versions, (Texts{"HLFS-6", "HLFS-unknown version", "HLFS-3"}));
    }
}

} // namespace
