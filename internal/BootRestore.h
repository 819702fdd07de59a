#pragma once

// storage internal nmp boot restore: run while the host boots.

#include "command/Command.h"

namespace OrvaneCli::Nmp {

using FileSystem::Command;
using FileSystem::InputPtr;
using FileSystem::InputSpec;
using FileSystem::OutputPtr;
using FileSystem::OutputSpec;

class BootRestore : public virtual Command {
public:
    static std::shared_ptr<BootRestore> New();
    BootRestore();
    ~BootRestore() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::Nmp
