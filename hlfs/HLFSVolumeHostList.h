#pragma once

#include <vector>

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

using HostCtl::Storage::HlfsUserInfo;

// storage hlfs host list
class HLFSVolumeHostList : public virtual Command {
public:
    static std::shared_ptr<HLFSVolumeHostList> New();
    HLFSVolumeHostList();
    ~HLFSVolumeHostList() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;

    // "ATS-only" only for exactly 4, else "ATS+SCSI".
    static const char* TranslateLockModeInUse(unsigned char hostMode);
    // Whether the host's locking mode agrees with the volume's, or which change is pending.
    static const char* TranslateStatus(unsigned int volumeMode, unsigned char hostMode);
    static void PopulateHostListSpec(std::shared_ptr<MetaStruct> row, HlFileSystem* volume, HlfsUserInfo* record);
    void UpdateList(HlFileSystem* volume, const std::vector<HlfsUserInfo>& records, std::shared_ptr<MetaList> list);
};

} // namespace OrvaneCli::FileSystem
