#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage filesystem rescan
class VolumeRescan : public virtual Command {
public:
    static std::shared_ptr<VolumeRescan> New();
    VolumeRescan();
    ~VolumeRescan() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage filesystem automount
class VolumeAutomount : public virtual Command {
public:
    static std::shared_ptr<VolumeAutomount> New();
    VolumeAutomount();
    ~VolumeAutomount() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
