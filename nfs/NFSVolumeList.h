#pragma once

#include <initializer_list>
#include <string>
#include <vector>

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// Shared by the NFS list, parameter and firewall commands.

enum class FieldKind { String, Int, Bool };

// One field of a result structure; fields whose `present` is false are left out entirely.
struct FieldDecl {
    const char* title;
    FieldKind kind;
    bool present = true;
};

// A structure named `name` holding every present field, in the given order, at its empty value.
std::shared_ptr<MetaStruct> MakeStructure(const char* name, std::initializer_list<FieldDecl> fields);

// The entries separated by "," (no blank); the empty text for none.
std::string JoinWithCommas(const std::vector<std::string>& entries);

// Runs `body` for one volume of a listing. A host failure drops what `body` was building
// and reports "Error getting <what> for mount '<name>': <message>, skipping."; the listing
// goes on. (The name is read again for the message; if that fails too, the failure leaves.)
template <typename Body>
void ForVolumeOrSkip(NetworkFileSystem& volume, const char* what, const OutputPtr& out, Body&& body)
{
    try {
        body();
    } catch (const HostCtlException& e) {
        out->AddErrorMessage(HostCtl::Misc::StrCat("Error getting ", what, " for mount '", volume.GetVolumeName(),
                                                   "': ", e.message, ", skipping."));
    }
}

// storage nfs list
class NFSVolumeList : public virtual Command {
public:
    static std::shared_ptr<NFSVolumeList> New();
    NFSVolumeList();
    ~NFSVolumeList() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;
};

// storage nfs41 list
class NFS41VolumeList : public virtual Command {
public:
    static std::shared_ptr<NFS41VolumeList> New();
    NFS41VolumeList();
    ~NFS41VolumeList() override;

    std::shared_ptr<InputSpec> GetInputSpecInternal() override;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() override;
    virtual std::shared_ptr<MetaStruct> GetOutputStructure();
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) override;

    static const std::string& TranslateSecurity(NetworkFileSystem::SecurityType security);
    static const char* TranslateQAXI(HostCtl::Storage::QAXIState state);
};

} // namespace OrvaneCli::FileSystem
