#pragma once

#include <vector>

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// The HLFS locking-mode bits; none of them set means ATS+SCSI locking.
namespace LockModeBits {
constexpr unsigned AtsOnly = 0x10;
constexpr unsigned UpgradePending = 0x20;
constexpr unsigned DowngradePending = 0x40;
} // namespace LockModeBits

// storage hlfs lockmode list
class HLFSVolumeLockModeList : public virtual Command {
public:
    static std::shared_ptr<HLFSVolumeLockModeList> New();
    HLFSVolumeLockModeList();
    ~HLFSVolumeLockModeList() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;

    // The text of the first set bit of 0x10, 0x20, 0x40, else "ATS+SCSI".
    static const char* TranslateLockMode(unsigned mode);
    // Fills "ATS Compatible", "ATS Upgrade Modes" and "ATS Incompatibility Reason".
    static void UpdateATSCompatibility(bool onlineUpgradeEnabled, HlFileSystem* volume,
                                       std::shared_ptr<MetaStruct> row);
    static void PopulateLockModeQuerySpec(bool onlineUpgradeEnabled, std::shared_ptr<MetaStruct> row,
                                          HlFileSystem* volume);
    void UpdateFilesystemList(const std::vector<std::unique_ptr<HlFileSystem>>& volumes, bool ignoreErrors,
                              bool onlineUpgradeEnabled, std::shared_ptr<MetaList> list, const OutputPtr& out);
};

// storage hlfs lockmode set
class HLFSVolumeLockModeSet : public virtual Command {
public:
    static std::shared_ptr<HLFSVolumeLockModeSet> New();
    HLFSVolumeLockModeSet();
    ~HLFSVolumeLockModeSet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
