#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage filesystem mount
class VolumeMount : public virtual Command {
public:
    static std::shared_ptr<VolumeMount> New();
    VolumeMount();
    ~VolumeMount() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage filesystem unmount
class VolumeUnmount : public virtual Command {
public:
    static std::shared_ptr<VolumeUnmount> New();
    VolumeUnmount();
    ~VolumeUnmount() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
