#pragma once

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage hlfs extent list
class HLFSExtentList : public virtual Command {
public:
    static std::shared_ptr<HLFSExtentList> New();
    HLFSExtentList();
    ~HLFSExtentList() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;

    // Appends one row per extent, grouped by volume in the given order and numbered from 0
    // within each volume. A volume whose reading fails keeps the rows it already gave; unless
    // `ignoreErrors` is non-zero one message names its mount point.
    void UpdateExtentList(const std::vector<std::unique_ptr<HlFileSystem>>& volumes, std::shared_ptr<MetaList> list,
                          const OutputPtr& out, char ignoreErrors);
};

} // namespace OrvaneCli::FileSystem
