#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage nfs preunmountstate enter
class NFSVolumePreunmountEnter : public Command {
public:
    static std::shared_ptr<NFSVolumePreunmountEnter> New();
    NFSVolumePreunmountEnter();
    ~NFSVolumePreunmountEnter() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage nfs preunmountstate exit
class NFSVolumePreunmountExit : public Command {
public:
    static std::shared_ptr<NFSVolumePreunmountExit> New();
    NFSVolumePreunmountExit();
    ~NFSVolumePreunmountExit() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
