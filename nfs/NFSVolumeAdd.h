#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage nfs add
class NFSVolumeAdd : public virtual Command {
public:
    static std::shared_ptr<NFSVolumeAdd> New();
    NFSVolumeAdd();
    ~NFSVolumeAdd() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
