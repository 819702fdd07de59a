// storage filesystem mount / unmount: selection rules, the host's mount short cut, the
// unmount sequence with its notifications, and the all-volumes procedure.

#include "filesystem/VolumeMount.h"
#include "VolumeTestSupport.h"

using namespace VolumeTests;

namespace {

std::string HostWith(const std::string& faults, bool tryMount = false)
{
    return std::string(R"({"behaviour": {"tryMount": )") + (tryMount ? "true" : "false") + R"(}, "fileSystems": [
        {"type": "HLFS", "volumeName": "ds1", "uuid": "u1"}, {"type": "HLFS", "volumeName": "ds2", "uuid": "u2", "mounted": false},
        {"type": "NFS", "volumeName": "nas", "uuid": "u3", "mountPoint": "/nfs/nas"},
        {"type": "HLFS", "volumeName": "ds3", "uuid": "u4", "name": "Datastore Three", "busy": true},
        {"type": "HLFS", "volumeName": "ds4", "uuid": "u5"}], "faults": [)" + faults + "]}";
}

// Every mount or unmount operation the host saw got `option`.
void ExpectOption(const TestSupport::ScopedHost& host, int option)
{
    for (const auto& line : host.Journal()) {
        if (line["call"] == "FileSystem.Unmount" || line["call"] == "FileSystem.Mount" ||
            line["call"] == "StorageInfoImpl.TryMount") {
            EXPECT_EQ(line["args"][0], option) << line.dump();
        }
    }
}

TEST(VolumeMountTest, Mount)
{
    struct Case { const char* what; Pairs args; bool tryMount; Texts errors; bool mounted; };
    const Pairs both = {{"volume-uuid", "u2"}, {"volume-label", "ds2"}};
    const std::vector<Case> cases = {
        {"by uuid", {{"volume-uuid", "u2"}}, false, {}, true},
        {"by label", {{"volume-label", "ds2"}}, false, {}, true},
        {"the host mounts it: selection not checked", both, true, {}, false},
        {"both given", both, false, {"A target volume specified by uuid cannot also be specified by label"}, false},
        {"neither given", {}, true, {"A target volume must be specified by volume uuid or volume label"}, false},
        {"unknown uuid", {{"volume-uuid", "ux"}}, false, {"No volume with uuid 'ux' was found"}, false},
        {"unknown label", {{"volume-label", "lx"}}, false, {"No volume with label 'lx' was found"}, false},
        {"mounted, named by uuid", {{"volume-uuid", "u1"}}, true, {"Volume 'u1' is already mounted"}, false},
        {"mounted, named by label", {{"volume-label", "ds1"}}, false, {"Volume 'ds1' is already mounted"}, false},
    };
    for (const bool noPersist : {false, true}) {
        for (const auto& c : cases) {
            SCOPED_TRACE(c.what);
            TestSupport::ScopedHost host(HostWith("", c.tryMount));
            const auto result = TestSupport::Execute(*VolumeMount::New(), MakeInput(c.args, noPersist ? Texts{"no-persist"} : Texts{}));
            EXPECT_EQ(result.errors, c.errors);
            EXPECT_EQ(IsTrue(result.root), c.errors.empty());
            const Texts mounted = {"StorageInfoImpl.TryMount", "FileSystem.Mount ds2"};
            EXPECT_EQ(Trace(host), c.mounted ? mounted : Texts{"StorageInfoImpl.TryMount"});
            ExpectOption(host, noPersist ? 1 : 0);
        }
    }
    // The host's own attempt stands outside the command's error handling.
    TestSupport::ScopedHost host(HostWith(Fault("StorageInfoImpl.TryMount", "", "attempt failed")));
    auto out = Output::New();
    EXPECT_THROW(VolumeMount::New()->Execute(MakeInput({{"volume-label", "ds2"}}), out), HostCtl::Lib::HostCtlException);
    EXPECT_TRUE(out->GetErrorMessages().empty());
}

struct UnmountCase { const char* what; Pairs args; std::string faults; Texts errors; bool result; Texts trace; };

Texts Sequence(const std::string& name, Texts tail)
{
    Texts trace = {"FileSystem.PrepareUnmount " + name, "StorageInfoImpl.SignalIORM", "notify PreUnmount:" + name};
    trace.insert(trace.end(), tail.begin(), tail.end());
    return trace;
}

void RunUnmount(const std::vector<UnmountCase>& cases, const Texts& flags)
{
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        TestSupport::ScopedHost host(HostWith(c.faults));
        const auto result = TestSupport::Execute(*VolumeUnmount::New(), MakeInput(c.args, flags));
        EXPECT_EQ(result.errors, c.errors);
        EXPECT_EQ(result.root != nullptr, c.result);
        EXPECT_EQ(IsTrue(result.root), c.result);
        EXPECT_EQ(Trace(host), c.trace);
        ExpectOption(host, flags.size() > 1 ? 1 : 0);
    }
}

TEST(VolumeMountTest, UnmountOneVolume)
{
    const std::string byUuid = "A target volume specified by uuid cannot also be specified by path or label";
    RunUnmount({
        {"all three", {{"volume-label", "ds1"}, {"volume-path", "/nfs/nas"}, {"volume-uuid", "u1"}}, "", {byUuid}, false, {}},
        {"label and uuid", {{"volume-label", "ds1"}, {"volume-uuid", "u1"}}, "", {byUuid}, false, {}},
        {"path and uuid", {{"volume-path", "/nfs/nas"}, {"volume-uuid", "u1"}}, "", {byUuid}, false, {}},
        {"label and path", {{"volume-label", "ds1"}, {"volume-path", "/nfs/nas"}}, "",
         {"A target volume specified by label cannot also be specified by path"}, false, {}},
        {"nothing", {}, "", {"A target volume must be specified by either label, by path, or by uuid."}, false, {}},
        {"by label", {{"volume-label", "ds1"}}, "", {}, true, Sequence("ds1", {"FileSystem.Unmount ds1"})},
        {"by path", {{"volume-path", "/nfs/nas"}}, "", {}, true, Sequence("nas", {"FileSystem.Unmount nas"})},
        {"by uuid", {{"volume-uuid", "u5"}}, "", {}, true, Sequence("ds4", {"FileSystem.Unmount ds4"})},
        {"unknown label", {{"volume-label", "x"}}, "", {"No volume with label 'x' was found"}, false, {}},
        {"unknown path", {{"volume-path", "/x"}}, "", {"No NAS volume was found mounted on '/x'"}, false, {}},
        {"unknown uuid", {{"volume-uuid", "x"}}, "", {"No volume with uuid 'x' was found"}, false, {}},
        {"not mounted", {{"volume-label", "ds2"}}, "", {"Volume 'ds2' is not mounted"}, false, {}},
        {"busy", {{"volume-uuid", "u4"}}, "", {"Volume 'u4' cannot be unmounted. Reason: Busy"}, false,
         Sequence("ds3", {"FileSystem.Unmount ds3", "notify FailedUnmount:ds3"})},
        {"unmount fails", {{"volume-label", "ds1"}}, Fault("FileSystem.Unmount", "ds1", "I/O error"), {"I/O error"}, false,
         Sequence("ds1", {"FileSystem.Unmount ds1", "notify FailedUnmount:ds1"})},
        {"signal fails", {{"volume-label", "ds1"}}, Fault("StorageInfoImpl.SignalIORM", "", "no IORM"), {"no IORM"}, false,
         {"FileSystem.PrepareUnmount ds1", "StorageInfoImpl.SignalIORM", "notify FailedUnmount:ds1"}},
        {"look-up fails: no notification", {{"volume-label", "ds1"}},
         Fault("StorageInfoImpl.GetFileSystemByLabel", "", "lookup failed"), {"lookup failed"}, false, {}},
    }, {});
}

TEST(VolumeMountTest, UnmountAllHlfs)
{
    const Texts prepared = {"FileSystem.PrepareUnmount ds1", "FileSystem.PrepareUnmount ds3",
                            "FileSystem.PrepareUnmount ds4", "StorageInfoImpl.SignalIORM"};
    const auto then = [&](Texts tail) { Texts t = prepared; t.insert(t.end(), tail.begin(), tail.end()); return t; };
    const std::string busy = "Volume 'Datastore Three' cannot be unmounted. Reason: Busy";
    RunUnmount({
        {"busy volume beside the true result; selectors ignored", {{"volume-label", "ds1"}}, "", {busy}, true,
         then({"notify PreUnmount:ds1,ds3,ds4", "FileSystem.Unmount ds1", "FileSystem.Unmount ds3",
               "notify FailedUnmount:ds3", "FileSystem.Unmount ds4"})},
        {"a failing unmount does not stop the rest", {}, Fault("FileSystem.Unmount", "ds1", "I/O error"), {"I/O error", busy}, true,
         then({"notify PreUnmount:ds1,ds3,ds4", "FileSystem.Unmount ds1", "notify FailedUnmount:ds1",
               "FileSystem.Unmount ds3", "notify FailedUnmount:ds3", "FileSystem.Unmount ds4"})},
        {"a failing look-up leaves the volume out", {}, Fault("StorageInfoImpl.GetFileSystemByUUID", "u1", "gone"),
         {"gone", busy}, true,
         {"FileSystem.PrepareUnmount ds3", "FileSystem.PrepareUnmount ds4", "StorageInfoImpl.SignalIORM",
          "notify PreUnmount:ds3,ds4", "FileSystem.Unmount ds3", "notify FailedUnmount:ds3", "FileSystem.Unmount ds4"}},
        {"signal failure ends it", {}, Fault("StorageInfoImpl.SignalIORM", "", "no IORM"), {"no IORM"}, false, prepared},
    }, {"unmount-all-hlfs", "no-persist"});

    // Nothing mounted: still one signal and one notification with empty data.
    TestSupport::ScopedHost host(R"({"fileSystems": [{"type": "HLFS", "volumeName": "ds2", "mounted": false}]})");
    const auto result = TestSupport::Execute(*VolumeUnmount::New(), MakeInput({}, {"unmount-all-hlfs"}));
    EXPECT_TRUE(result.errors.empty());
    EXPECT_TRUE(IsTrue(result.root));
    EXPECT_EQ(Trace(host), (Texts{"StorageInfoImpl.SignalIORM", "notify PreUnmount:"}));
}

} // namespace
