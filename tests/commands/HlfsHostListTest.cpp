// storage hlfs host list in process: the status of each host against the volume's locking
// mode. Rows, failures, the liveness check and the table are in the hlfs-host fixture cases.

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "hlfs/Manifest.h"

using namespace OrvaneCli::FileSystem;

namespace {

constexpr const char* kNormal = "Normal";
constexpr const char* kInvalid = "INVALID (needs unmount)";
constexpr const char* kUp = "ATS Upgrade Pending";
constexpr const char* kDown = "ATS Downgrade Pending";

TEST(HlfsHostListTest, StatusByVolumeModeAndHostMode)
{
    struct Case {
        unsigned volumeMode;
        const char* atsHost;   // host mode 4
        const char* otherHost; // host mode 0
    };
    const std::vector<Case> cases = {
        {0x60, kDown, kUp},        {0x70, kDown, kUp},        {0x20, kNormal, kUp},      {0x30, kNormal, kUp},
        {0x50, kDown, kInvalid},   {0x40, kDown, kNormal},    {0x10, kNormal, kInvalid}, {0x00, kInvalid, kNormal},
        {0x0F, kInvalid, kNormal}, {0x90, kNormal, kInvalid},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.volumeMode);
        EXPECT_STREQ(TranslateStatus(c.volumeMode, 4), c.atsHost);
        EXPECT_STREQ(TranslateStatus(c.volumeMode, 0), c.otherHost);
        // The status tests the bit of value 4, not equality.
        EXPECT_STREQ(TranslateStatus(c.volumeMode, 6), c.atsHost);
        EXPECT_STREQ(TranslateStatus(c.volumeMode, 0xFB), c.otherHost);
    }
}

} // namespace
