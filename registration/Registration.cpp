#include "registration/Registration.h"

#include "command/Tree.h"
#include "filesystem/Manifest.h"
#include "hlfs/Manifest.h"
#include "internal/Manifest.h"
#include "nfs/Manifest.h"

using Quillets::QuilletException;
using Quillets::AutoCli::Namespace;
using Quillets::AutoCli::NamespaceNode;
using namespace OrvaneCli::FileSystem;

namespace {

// The namespace `name` under `parent`; anything else there is a broken tree.
NamespacePtr FindNamespace(const NodePtr& parent, const char* name)
{
    auto missing = [&] {
        return QuilletException(HostCtl::Misc::StrPrintf("Unable to find '%s' namespace in namespace '%s'", name,
                                                         parent->GetName().c_str()));
    };
    if (!parent->HasNamespaceNode(name)) {
        throw missing();
    }
    auto ns = std::dynamic_pointer_cast<Namespace>(parent->GetNamespaceNode(name));
    if (!ns) {
        throw missing();
    }
    return ns;
}

} // namespace

extern "C" {

// NOLINTNEXTLINE(performance-unnecessary-value-param): the exported signature is fixed
void AutoCli_RegisterNamespaces(std::shared_ptr<NamespaceNode> root) { Core_RegisterInternalNamespaces(root); }

// NOLINTNEXTLINE(performance-unnecessary-value-param): the exported signature is fixed
void Core_RegisterInternalNamespaces(std::shared_ptr<NamespaceNode> root)
{
    const NamespacePtr storage = FindNamespace(root, "storage");
    NamespacePtr internal;
    if (storage->HasNamespaceNode("internal")) {
        internal = FindNamespace(storage, "internal");
    } else {
        internal = MakeNamespace("Orvane internal storage commands.");
        Attach(storage, "internal", internal);
    }
    Attach(internal, "core", MakeNamespace("Orvane core storage commands. No operations are currently internal only."));
    Nmp_RegisterInternalNamespaces(internal);
    ClusteredHdsk_RegisterInternalNamespace(internal);
}

// NOLINTNEXTLINE(performance-unnecessary-value-param): the exported signature is fixed
void Nmp_RegisterInternalNamespaces(std::shared_ptr<NamespaceNode> parent) { Attach(parent, "nmp", NmpNamespace()); }

// NOLINTNEXTLINE(performance-unnecessary-value-param): the exported signature is fixed
void ClusteredHdsk_RegisterInternalNamespace(std::shared_ptr<NamespaceNode> parent)
{
    Attach(parent, "clusteredhdsk", ClusteredHdskNamespace());
}

// NOLINTNEXTLINE(performance-unnecessary-value-param): the exported signature is fixed
void FilesystemNfs_RegisterNamespaces(std::shared_ptr<NamespaceNode> parent)
{
    Attach(parent, "filesystem", FilesystemNamespace());
    Attach(parent, "nfs", NfsNamespace());
    Attach(parent, "nfs41", Nfs41Namespace());
    Attach(parent, "hlfs", HlfsNamespace());
}

} // extern "C"
