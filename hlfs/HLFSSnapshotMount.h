#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage hlfs snapshot mount
class HLFSSnapshotMount : public virtual Command {
public:
    static std::shared_ptr<HLFSSnapshotMount> New();
    HLFSSnapshotMount();
    ~HLFSSnapshotMount() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage hlfs snapshot resignature
class HLFSSnapshotResignature : public virtual Command {
public:
    static std::shared_ptr<HLFSSnapshotResignature> New();
    HLFSSnapshotResignature();
    ~HLFSSnapshotResignature() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
