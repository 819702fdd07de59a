// storage nfs list / nfs41 list and param get: the translations and the row shapes the
// feature switches choose. What the commands print is covered by the nfs-list and
// nfs-param fixture cases.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "RegisteredCommand.h"
#include "nfs/Manifest.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;

namespace {

// The field titles of the rows of the command's declared result.
std::vector<std::string> Titles(const std::string& path)
{
    auto list =
        std::dynamic_pointer_cast<MetaList>(TestSupport::RegisteredCommand(path)->GetOutputSpec()->GetRootObject());
    EXPECT_TRUE(list) << path;
    std::vector<std::string> titles;
    for (const auto& [title, value] : list->GetPrototype()->GetFields()) {
        titles.push_back(title);
    }
    return titles;
}

TEST(NfsListTest, TranslationsCoverEveryKnownValueAndFallBack)
{
    const struct {
        int value;
        const char* security;
        const char* acceleration;
    } cases[] = {
        {0, "none", "Unknown"},  {1, "sys", "Supported"},   {2, "krb5", "Not Supported"}, {3, "krb5i", "Unknown"},
        {4, "krb5p", "Unknown"}, {7, "unknown", "Unknown"}, {-1, "unknown", "Unknown"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.value);
        EXPECT_EQ(TranslateSecurity(static_cast<NetworkFileSystem::SecurityType>(c.value)), c.security);
        EXPECT_STREQ(TranslateQAXI(static_cast<HostCtl::Storage::QAXIState>(c.value)), c.acceleration);
    }
}

TEST(NfsListTest, SwitchesChooseFieldsAndNeverLeakAcrossVersions)
{
    const struct {
        const char* features;
        std::vector<std::string> v3List, v41List, v3Params, v41Params;
        const char* v3Hint;
    } cases[] = {
        {R"({"102": false, "103": false, "104": false})",
         {"Volume Name", "Host", "Share", "Accessible", "Mounted", "Read-Only", "isPE", "Hardware Acceleration"},
         {"Volume Name", "Host(s)", "Share", "Accessible", "Mounted", "Read-Only", "Security", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize"},
         "Volume Name,Host,Share,Accessible,Mounted,Read-Only,isPE,Hardware Acceleration"},
        {R"({"102": false, "103": true, "104": true})",
         {"Volume Name", "Host", "Share", "Knxnic", "Connections", "Accessible", "Mounted", "Read-Only", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "Host(s)", "Share", "Accessible", "Mounted", "Read-Only", "Security", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize", "Knxnic", "Connections"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize"},
         "Volume Name,Host,Share,Knxnic,Accessible,Mounted,Connections,Read-Only,isPE,Hardware Acceleration"},
        {R"({"102": true, "103": true, "104": false})",
         {"Volume Name", "Host", "Share", "Connections", "Accessible", "Mounted", "Read-Only", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "Host(s)", "Share", "Knxnics", "Accessible", "Mounted", "Read-Only", "Security", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize", "Connections"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize", "Knxnics"},
         "Volume Name,Host,Share,Accessible,Mounted,Connections,Read-Only,isPE,Hardware Acceleration"},
        {R"({"102": false, "103": false, "104": true})",
         {"Volume Name", "Host", "Share", "Knxnic", "Accessible", "Mounted", "Read-Only", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "Host(s)", "Share", "Accessible", "Mounted", "Read-Only", "Security", "isPE",
          "Hardware Acceleration"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize", "Knxnic"},
         {"Volume Name", "MaxQueueDepth", "MaxReadTransferSize", "MaxWriteTransferSize"},
         "Volume Name,Host,Share,Knxnic,Accessible,Mounted,Read-Only,isPE,Hardware Acceleration"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.features);
        TestSupport::ScopedHost host(std::string(R"({"features": )") + c.features + "}");
        EXPECT_EQ(Titles("storage nfs list"), c.v3List);
        EXPECT_EQ(Titles("storage nfs41 list"), c.v41List);
        EXPECT_EQ(Titles("storage nfs param get"), c.v3Params);
        EXPECT_EQ(Titles("storage nfs41 param get"), c.v41Params);
        EXPECT_EQ(
            TestSupport::RegisteredCommand("storage nfs list")->GetDefaultOutputParameters().at("fields:NasMount"),
            c.v3Hint);
    }
}

} // namespace
