// storage hlfs lockmode: the locking-mode text for bit patterns a test host rarely shows.
// Compatibility, set and failures are in the hlfs-lockmode fixture cases.

#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "hlfs/Manifest.h"

using namespace OrvaneCli::FileSystem;

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
        EXPECT_EQ(TranslateLockMode(mode), text) << std::hex << mode;
    }
}
