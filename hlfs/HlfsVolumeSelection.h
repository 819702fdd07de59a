#pragma once

// Shared by the HLFS commands (and the volume and NFS commands that notify the
// datastore script): volume selection by label or UUID, the ignore-errors flag,
// the HLFS version text and the datastore notification.

#include <memory>
#include <string>
#include <vector>

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

std::shared_ptr<ParameterSpec> IgnoreErrorInputParameter();
std::shared_ptr<InputSpec> GetSingleHLFSVolumeInputSpec();
std::shared_ptr<InputSpec> GetMultipleHLFSVolumesInputSpec();

// An empty pointer means failure; the reason is already on `out`.
std::unique_ptr<HlFileSystem> GetSingleHLFSVolume(const InputPtr& in, const OutputPtr& out);
// True: go on and produce output from `volumes`; false: stop without output.
bool GetMultipleHLFSVolumes(const InputPtr& in, const OutputPtr& out,
                            std::vector<std::unique_ptr<HlFileSystem>>& volumes);

const char* GetHLFSVersionString(HlFileSystem* volume);

// Tells the host's datastore notification script about `event`, with `data` on its
// standard input. The outcome of the script is ignored.
void NotifyDatastore(const std::string& event, const std::string& data);

} // namespace OrvaneCli::FileSystem
