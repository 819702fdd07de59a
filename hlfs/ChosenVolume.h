#pragma once

// What `storage hlfs upgrade` and `storage hlfs unmap` share: the volume chosen by their own
// volume-label / volume-uuid parameters, opened through its path under /hlfs/volumes/.

#include <string>

#include "command/Selection.h"

namespace OrvaneCli::FileSystem {

using KnxCtl::Storage::HlFileSystemImpl;

extern const VolumeSelectorTexts kChosenVolumeTexts;

// Runs `body(volume, identifier)` in the guarded region on the volume the user chose (the
// identifier is the label or UUID as typed), after checking that the host knows it; nothing
// runs when the choice is refused.
template <typename Body>
void WithChosenVolume(const InputPtr& in, const OutputPtr& out, Body&& body)
{
    Guarded(out, [&] {
        const auto choice = ChooseVolume(in, kChosenVolumeTexts, out);
        if (!choice || !FindVolume(*choice, kChosenVolumeTexts, out, [](const VolumeChoice& c) {
                return c.ByUuid() ? HlFileSystemImpl::GetHLFSFileSystemByUUID(c.value)
                                  : HlFileSystemImpl::GetHLFSFileSystemByLabel(c.value);
            })) {
            return;
        }
        HlFileSystemImpl volume(HostCtl::Misc::StrCat("/hlfs/volumes/", choice->value));
        body(volume, choice->value);
    });
}

} // namespace OrvaneCli::FileSystem
