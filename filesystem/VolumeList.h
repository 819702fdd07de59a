#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage filesystem list
class VolumeList : public virtual Command {
public:
    static std::shared_ptr<VolumeList> New();
    VolumeList();
    ~VolumeList() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;

    // Appends one row per file system, in the given order. A volume whose reading fails
    // is left out whole; unless `ignoreErrors` is non-zero one message names its mount point.
    void UpdateFileSystemList(const std::vector<std::unique_ptr<HostCtl::Storage::FileSystem>>& fileSystems,
                              std::shared_ptr<MetaList> list, const OutputPtr& out, char ignoreErrors);
};

} // namespace OrvaneCli::FileSystem
