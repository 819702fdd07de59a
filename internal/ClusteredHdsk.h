#pragma once

// storage internal clusteredhdsk get / set: clustered HDSK support of one HLFS volume.

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// storage internal clusteredhdsk get
class ClusteredHdskGet : public Command {
public:
    static std::shared_ptr<ClusteredHdskGet> New();
    ClusteredHdskGet();
    ~ClusteredHdskGet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage internal clusteredhdsk set
class ClusteredHdskSet : public Command {
public:
    static std::shared_ptr<ClusteredHdskSet> New();
    ClusteredHdskSet();
    ~ClusteredHdskSet() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

} // namespace OrvaneCli::FileSystem
