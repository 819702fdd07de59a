#pragma once

// storage hlfs reclaim config get / set: the automatic space reclamation settings of one
// HLFS volume.

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage hlfs reclaim config get
class HLFSReclaimConfigGet : public virtual Command {
public:
    static std::shared_ptr<HLFSReclaimConfigGet> New();
    HLFSReclaimConfigGet();
    ~HLFSReclaimConfigGet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage hlfs reclaim config set
class HLFSReclaimConfigSet : public virtual Command {
public:
    static std::shared_ptr<HLFSReclaimConfigSet> New();
    HLFSReclaimConfigSet();
    ~HLFSReclaimConfigSet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
