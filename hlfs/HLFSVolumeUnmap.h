#pragma once

// storage hlfs upgrade and storage hlfs unmap: maintenance of one HLFS volume, chosen by
// their own volume-label / volume-uuid parameters and opened through its path under
// /hlfs/volumes/.

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage hlfs upgrade
class HLFSVolumeUpgrade : public virtual Command {
public:
    static std::shared_ptr<HLFSVolumeUpgrade> New();
    HLFSVolumeUpgrade();
    ~HLFSVolumeUpgrade() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage hlfs unmap
class HLFSVolumeUnmap : public virtual Command {
public:
    static std::shared_ptr<HLFSVolumeUnmap> New();
    HLFSVolumeUnmap();
    ~HLFSVolumeUnmap() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
