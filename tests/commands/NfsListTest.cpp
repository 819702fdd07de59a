// storage nfs list / nfs41 list: the translations, the row shapes the feature switches
// choose, and the per-volume skipping.

#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "nfs/NFSVolumeList.h"
#include "nfs/NFSVolumeParam.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;
using nlohmann::json;

namespace {

std::vector<std::string> Titles(const MetaStruct& structure)
{
    std::vector<std::string> titles;
    for (const auto& [title, value] : structure.GetFields()) {
        titles.push_back(title);
    }
    return titles;
}

// Every row of a list result, as title -> printed value.
std::vector<json> Rows(const TestSupport::CommandResult& result)
{
    std::vector<json> rows;
    auto list = std::dynamic_pointer_cast<MetaList>(result.root);
    if (!list) {
        return rows;
    }
    for (const auto& element : list->GetElements()) {
        json row = json::object();
        for (const auto& [title, value] : element->GetFields()) {
            if (auto s = std::dynamic_pointer_cast<MetaString>(value)) {
                row[title] = s->GetValue();
            } else if (auto i = std::dynamic_pointer_cast<MetaInt>(value)) {
                row[title] = i->GetValue();
            } else if (auto b = std::dynamic_pointer_cast<MetaBool>(value)) {
                row[title] = b->GetValue();
            }
        }
        rows.push_back(row);
    }
    return rows;
}

TEST(NfsListTest, TranslationsCoverEveryKnownValueAndFallBack)
{
    const struct {
        int value;
        const char* security;
        const char* acceleration;
    } cases[] = {
        {0, "none", "Unknown"}, {1, "sys", "Supported"}, {2, "krb5", "Not Supported"},
        {3, "krb5i", "Unknown"}, {4, "krb5p", "Unknown"}, {7, "unknown", "Unknown"}, {-1, "unknown", "Unknown"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.value);
        EXPECT_EQ(NFS41VolumeList::TranslateSecurity(static_cast<NetworkFileSystem::SecurityType>(c.value)),
                  c.security);
        EXPECT_STREQ(NFS41VolumeList::TranslateQAXI(static_cast<HostCtl::Storage::QAXIState>(c.value)),
                     c.acceleration);
    }
}

TEST(NfsListTest, SwitchesChooseFieldsAndNeverLeakAcrossVersions)
{
    const struct {
        bool f102, f103, f104;
        std::vector<std::string> v3List, v41List, v3Params, v41Params;
        const char* v3Hint;
    } cases[] = {
        {false, false, false,
         {"Volume Name", "Host", "Share", "Accessible", "Mounted", "Read-Only", "isPE", "Hardware Acceleration"},
         {"Volume Name", "Host(s)", "Share", "Accessible", "Mounted", "Read-Only", "Security", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize"},
         "Volume Name,Host,Share,Accessible,Mounted,Read-Only,isPE,Hardware Acceleration"},
        {false, true, true,
         {"Volume Name", "Host", "Share", "Knxnic", "Connections", "Accessible", "Mounted", "Read-Only", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "Host(s)", "Share", "Accessible", "Mounted", "Read-Only", "Security", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize", "Knxnic", "Connections"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize"},
         "Volume Name,Host,Share,Knxnic,Accessible,Mounted,Connections,Read-Only,isPE,Hardware Acceleration"},
        {true, true, false,
         {"Volume Name", "Host", "Share", "Connections", "Accessible", "Mounted", "Read-Only", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "Host(s)", "Share", "Knxnics", "Accessible", "Mounted", "Read-Only", "Security", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize", "Connections"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize", "Knxnics"},
         "Volume Name,Host,Share,Accessible,Mounted,Connections,Read-Only,isPE,Hardware Acceleration"},
        {false, false, true,
         {"Volume Name", "Host", "Share", "Knxnic", "Accessible", "Mounted", "Read-Only", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "Host(s)", "Share", "Accessible", "Mounted", "Read-Only", "Security", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize", "Knxnic"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize"},
         "Volume Name,Host,Share,Knxnic,Accessible,Mounted,Read-Only,isPE,Hardware Acceleration"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::Message() << "102=" << c.f102 << " 103=" << c.f103 << " 104=" << c.f104);
        TestSupport::ScopedHost host(json{{"features", {{"102", c.f102}, {"103", c.f103}, {"104", c.f104}}}}.dump());
        EXPECT_EQ(Titles(*NFSVolumeList::New()->GetOutputStructure()), c.v3List);
        EXPECT_EQ(Titles(*NFS41VolumeList::New()->GetOutputStructure()), c.v41List);
        EXPECT_EQ(Titles(*NFSVolumeParamGet::New()->GetOutputStructure()), c.v3Params);
        EXPECT_EQ(Titles(*NFS41VolumeParamGet::New()->GetOutputStructure()), c.v41Params);
        EXPECT_EQ(NFSVolumeList::New()->GetDefaultOutputParameters().at("fields:NasMount"), c.v3Hint);
    }
}

const char* const kListState = R"({"features": {"102": true, "103": true, "104": true}, "fileSystems": [
    {"type": "NFS", "volumeName": "nas1", "remoteHost": "srv1", "remoteShare": "/a", "knxnic": "knx0",
     "connections": 3, "qaxiState": 1, "readOnly": true},
    {"type": "NFS", "volumeName": "nas2", "remoteHost": "srv2", "remoteShare": "/b", "qaxiState": 2},
    {"type": "NFS", "volumeName": "nas3", "remoteHost": "srv3", "remoteShare": "/c", "isPE": true, "qaxiState": 9},
    {"type": "NFS", "volumeName": "nas4", "hidden": true},
    {"type": "NFS41", "volumeName": "v41a", "remoteHosts": ["10.0.0.1", "10.0.0.2"], "remoteShare": "/d",
     "knxnics": "knx1,knx2", "readOnly": false, "readOnlyState": true, "securityType": 2},
    {"type": "NFS41", "volumeName": "v41b", "remoteShare": "/e", "readOnly": true, "readOnlyState": false,
     "securityType": 4, "isPE": true}]})";

TEST(NfsListTest, RowsFollowTheVolumesAndAFailingVolumeIsSkipped)
{
    const struct {
        bool v41;
        bool peOnly;
        const char* fault; // fault entries, JSON
        std::vector<std::string> names;
        std::vector<std::string> errors;
    } cases[] = {
        {false, false, "[]", {"nas1", "nas2", "nas3"}, {}},
        {false, true, "[]", {"nas3"}, {}},
        {false, false, R"([{"call": "FileSystem.GetQAXIState", "target": "nas2", "message": "lost"}])",
         {"nas1", "nas3"}, {"Error getting data for mount 'nas2': lost, skipping."}},
        {true, false, "[]", {"v41a", "v41b"}, {}},
        {true, true, "[]", {"v41b"}, {}},
        {true, false, R"([{"call": "NetworkFileSystem.GetRemoteHosts", "target": "v41a", "message": "gone"}])",
         {"v41b"}, {"Error getting data for mount 'v41a': gone, skipping."}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::Message() << (c.v41 ? "v4.1 " : "v3 ") << c.fault);
        json state = json::parse(kListState);
        state["faults"] = json::parse(c.fault);
        TestSupport::ScopedHost host(state.dump());
        auto in = Input::New();
        if (c.peOnly) {
            in->SetFlag("pe-only");
        }
        const auto result = c.v41 ? TestSupport::Execute(*NFS41VolumeList::New(), in)
                                  : TestSupport::Execute(*NFSVolumeList::New(), in);
        std::vector<std::string> names;
        for (const auto& row : Rows(result)) {
            names.push_back(row["Volume Name"]);
        }
        EXPECT_EQ(names, c.names);
        EXPECT_EQ(result.errors, c.errors);
    }
}

TEST(NfsListTest, RowValuesComeFromTheRightGetters)
{
    TestSupport::ScopedHost host(kListState);
    const auto v3 = Rows(TestSupport::Execute(*NFSVolumeList::New(), Input::New()));
    ASSERT_EQ(v3.size(), 3u);
    EXPECT_EQ(v3[0], json::parse(R"({"Volume Name": "nas1", "Host": "srv1", "Share": "/a", "Knxnic": "knx0",
        "Connections": 3, "Accessible": true, "Mounted": true, "Read-Only": true, "isPE": false,
        "Hardware Acceleration": "Supported"})"));
    EXPECT_EQ(v3[1]["Hardware Acceleration"], "Not Supported");
    EXPECT_EQ(v3[2]["Hardware Acceleration"], "Unknown");

    // The v4.1 list reads the read-only state, not the read-only setting.
    const auto v41 = Rows(TestSupport::Execute(*NFS41VolumeList::New(), Input::New()));
    ASSERT_EQ(v41.size(), 2u);
    EXPECT_EQ(v41[0], json::parse(R"J({"Volume Name": "v41a", "Host(s)": "10.0.0.1,10.0.0.2", "Share": "/d",
        "Knxnics": "knx1,knx2", "Accessible": true, "Mounted": true, "Read-Only": true, "Security": "krb5",
        "isPE": false, "Hardware Acceleration": "Unknown"})J"));
    EXPECT_EQ(v41[1]["Host(s)"], "");
    EXPECT_EQ(v41[1]["Read-Only"], false);
    EXPECT_EQ(v41[1]["Security"], "krb5p");
}

TEST(NfsListTest, FailureToFetchOrToOpenTheHostIsOneMessageWithoutResult)
{
    for (const char* call : {"StorageInfoImpl.new", "StorageInfoImpl.GetV3NetworkFileSystems"}) {
        SCOPED_TRACE(call);
        TestSupport::ScopedHost host(json{{"faults", {{{"call", call}, {"message", "down"}}}}}.dump());
        const auto result = TestSupport::Execute(*NFSVolumeList::New(), Input::New());
        EXPECT_EQ(result.errors, std::vector<std::string>{"down"});
        EXPECT_EQ(result.root, nullptr);
    }
}

} // namespace
