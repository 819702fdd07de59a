#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage nfs remove
class NFSVolumeRemove : public virtual Command {
public:
    static std::shared_ptr<NFSVolumeRemove> New();
    NFSVolumeRemove();
    ~NFSVolumeRemove() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage nfs41 remove: the same removal, for NFS v4.1 volumes.
class NFS41VolumeRemove : public virtual Command {
public:
    static std::shared_ptr<NFS41VolumeRemove> New();
    NFS41VolumeRemove();
    ~NFS41VolumeRemove() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
