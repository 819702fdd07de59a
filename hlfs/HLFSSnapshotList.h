#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage hlfs snapshot list
class HLFSSnapshotList : public virtual Command {
public:
    static std::shared_ptr<HLFSSnapshotList> New();
    HLFSSnapshotList();
    ~HLFSSnapshotList() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage hlfs snapshot extent list
class HLFSSnapshotExtentList : public virtual Command {
public:
    static std::shared_ptr<HLFSSnapshotExtentList> New();
    HLFSSnapshotExtentList();
    ~HLFSSnapshotExtentList() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
