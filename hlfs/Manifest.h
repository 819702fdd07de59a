#pragma once

// storage hlfs: the commands of the area and the namespace they form.

#include "command/Tree.h"

namespace OrvaneCli::FileSystem {

NodePtr NewHLFSVolumeUpgrade();
NodePtr NewHLFSVolumeUnmap();
NodePtr NewHLFSExtentList();
NodePtr NewHLFSSnapshotList();
NodePtr NewHLFSSnapshotMount();
NodePtr NewHLFSSnapshotResignature();
NodePtr NewHLFSSnapshotExtentList();
NodePtr NewHLFSVolumeLockModeList();
NodePtr NewHLFSVolumeLockModeSet();
NodePtr NewHLFSVolumeHostList();
NodePtr NewHLFSPBCacheGet();
NodePtr NewHLFSPBCacheReset();
NodePtr NewHLFSReclaimConfigGet();
NodePtr NewHLFSReclaimConfigSet();

NamespacePtr HlfsNamespace();

// The HLFS locking-mode bits; none of them set means ATS+SCSI locking.
namespace LockModeBits {
constexpr unsigned AtsOnly = 0x10;
constexpr unsigned UpgradePending = 0x20;
constexpr unsigned DowngradePending = 0x40;
} // namespace LockModeBits

// The volume's locking mode: the text of the first set bit of 0x10, 0x20, 0x40, else "ATS+SCSI".
const char* TranslateLockMode(unsigned mode);
// A host's locking mode: "ATS-only" only for exactly 4, else "ATS+SCSI".
const char* TranslateLockModeInUse(unsigned char hostMode);
// Whether the host's locking mode agrees with the volume's, or which change is pending.
const char* TranslateStatus(unsigned int volumeMode, unsigned char hostMode);

} // namespace OrvaneCli::FileSystem
