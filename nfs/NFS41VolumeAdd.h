#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage nfs41 add
class NFS41VolumeAdd : public virtual Command {
public:
    static std::shared_ptr<NFS41VolumeAdd> New();
    NFS41VolumeAdd();
    ~NFS41VolumeAdd() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
