#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage nfs param get
class NFSVolumeParamGet : public virtual Command {
public:
    static std::shared_ptr<NFSVolumeParamGet> New();
    NFSVolumeParamGet();
    ~NFSVolumeParamGet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage nfs param set
class NFSVolumeParamSet : public virtual Command {
public:
    static std::shared_ptr<NFSVolumeParamSet> New();
    NFSVolumeParamSet();
    ~NFSVolumeParamSet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage nfs41 param get
class NFS41VolumeParamGet : public virtual Command {
public:
    static std::shared_ptr<NFS41VolumeParamGet> New();
    NFS41VolumeParamGet();
    ~NFS41VolumeParamGet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage nfs41 param set
class NFS41VolumeParamSet : public virtual Command {
public:
    static std::shared_ptr<NFS41VolumeParamSet> New();
    NFS41VolumeParamSet();
    ~NFS41VolumeParamSet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
