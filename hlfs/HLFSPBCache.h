#pragma once

// storage hlfs pbcache get / reset: the host-wide HLFS pointer block cache statistics.

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage hlfs pbcache get
class HLFSPBCacheGet : public virtual Command {
public:
    static std::shared_ptr<HLFSPBCacheGet> New();
    HLFSPBCacheGet();
    ~HLFSPBCacheGet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage hlfs pbcache reset
class HLFSPBCacheReset : public virtual Command {
public:
    static std::shared_ptr<HLFSPBCacheReset> New();
    HLFSPBCacheReset();
    ~HLFSPBCacheReset() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
