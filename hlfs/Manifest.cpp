#include "hlfs/Manifest.h"

namespace OrvaneCli::FileSystem {

NamespacePtr HlfsNamespace()
{
    auto snapshot = MakeNamespace(
        "Manage HLFS snapshots.",
        {{"list", NewHLFSSnapshotList()},
         {"mount", NewHLFSSnapshotMount()},
         {"resignature", NewHLFSSnapshotResignature()},
         {"extent", MakeNamespace("Manage HLFS snapshot extents.", {{"list", NewHLFSSnapshotExtentList()}})}});
    auto reclaimConfig = MakeNamespace("HLFS Space Reclamation Configuration Settings",
                                       {{"get", NewHLFSReclaimConfigGet()}, {"set", NewHLFSReclaimConfigSet()}});
    return MakeNamespace(
        "HLFS operations.",
        {{"upgrade", NewHLFSVolumeUpgrade()},
         {"unmap", NewHLFSVolumeUnmap()},
         {"extent", MakeNamespace("Manage HLFS extents.", {{"list", NewHLFSExtentList()}})},
         {"snapshot", snapshot},
         {"lockmode", MakeNamespace("Manage HLFS array locking mode.",
                                    {{"list", NewHLFSVolumeLockModeList()}, {"set", NewHLFSVolumeLockModeSet()}})},
         {"host", MakeNamespace("Manage hosts accessing a HLFS volume.", {{"list", NewHLFSVolumeHostList()}})},
         {"pbcache", MakeNamespace("HLFS Pointer Block Cache statistics.",
                                   {{"get", NewHLFSPBCacheGet()}, {"reset", NewHLFSPBCacheReset()}})},
         {"reclaim", MakeNamespace("Manage HLFS Space Reclamation", {{"config", reclaimConfig}})}});
}

} // namespace OrvaneCli::FileSystem
