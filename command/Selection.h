#pragma once

// How commands learn what to act on: the shared selection parameters, the "exactly one of"
// rule, the single volume chosen by label or UUID, and the listing loop that passes over a
// volume it cannot read.

#include <cstddef>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>

#include "command/Command.h"

namespace OrvaneCli::FileSystem {

// `volume-label` (-l) and `volume-uuid` (-u), with the command's own wording.
ParameterDecl LabelParameter(const char* description, ParameterType type = ParameterType::String);
ParameterDecl UuidParameter(const char* description, ParameterType type = ParameterType::String);
// The flag `ignore-errors` (-i) of the listings.
ParameterDecl IgnoreErrorsParameter();
// `volume-label` and `volume-uuid` as GetSingleHLFSVolume reads them.
ParameterDecl HlfsLabelParameter();
ParameterDecl HlfsUuidParameter();

// One way of naming what a command acts on. `conflict` is the message for giving it together
// with any later choice of the same list.
struct Choice {
    bool given;
    const char* conflict;
};

// The position of the only given choice. None given adds `none`; several add the conflict
// message of the first one given. Either way the result is empty.
std::optional<std::size_t> ExactlyOneOf(std::initializer_list<Choice> choices, const char* none, const OutputPtr& out);

// A command's own texts for choosing one volume by label or UUID. The not-found texts are
// formats with one %s for the value as typed.
struct VolumeSelectorTexts {
    const char* both;
    const char* neither;
    const char* labelNotFound;
    const char* uuidNotFound;
};

enum class VolumeKey { Label, Uuid };

struct VolumeChoice {
    VolumeKey key;
    std::string value;

    bool ByUuid() const { return key == VolumeKey::Uuid; }
};

// Reads volume-label and volume-uuid; exactly one must be given (no host call is made).
std::optional<VolumeChoice> ChooseVolume(const InputPtr& in, const VolumeSelectorTexts& texts, const OutputPtr& out);

// The not-found message of `choice`.
std::string VolumeNotFound(const VolumeChoice& choice, const VolumeSelectorTexts& texts);

// Looks `choice` up with `lookUp(choice)`; an empty answer adds the not-found message.
// Host failures pass on to the caller.
template <typename LookUp>
auto FindVolume(const VolumeChoice& choice, const VolumeSelectorTexts& texts, const OutputPtr& out, LookUp&& lookUp)
{
    auto volume = lookUp(choice);
    if (!volume) {
        out->AddErrorMessage(VolumeNotFound(choice, texts));
    }
    return volume;
}

// The HLFS volume named by volume-label or volume-uuid, looked up in the guarded region.
// An empty pointer means failure; the reason is already on `out`.
std::unique_ptr<HlFileSystem> GetSingleHLFSVolume(const InputPtr& in, const OutputPtr& out);

// Runs `act(volume)` in the guarded region on the volume GetSingleHLFSVolume finds; nothing
// runs when it finds none.
template <typename Act>
void WithSingleHLFSVolume(const InputPtr& in, const OutputPtr& out, Act&& act)
{
    const std::unique_ptr<HlFileSystem> volume = GetSingleHLFSVolume(in, out);
    if (volume) {
        Guarded(out, [&] { act(*volume); });
    }
}

// How a listing reports a volume it passes over: "<prefix><name>': <host message>, skipping.".
// The name is read only after the failure; if that fails too, the failure leaves the walk.
struct SkipReport {
    const char* prefix;
    std::string (HostCtl::Storage::FileSystem::*name)();
    bool quiet = false; // pass over in silence
};

// Runs `read(volume)` for one volume; a host failure in it is reported and passed over.
// Returns true when `read` completed.
template <typename Volume, typename Read>
bool ReadOrSkip(Volume& volume, const SkipReport& report, const OutputPtr& out, Read&& read)
{
    try {
        read(volume);
        return true;
    } catch (const HostCtlException& e) {
        if (!report.quiet) {
            out->AddErrorMessage(
                HostCtl::Misc::StrCat(report.prefix, (volume.*report.name)(), "': ", e.message, ", skipping."));
        }
        return false;
    }
}

// The listing loop: ReadOrSkip for every volume, in the host's order; empty entries are passed over.
template <typename Volumes, typename Read>
void ReadEachOrSkip(const Volumes& volumes, const SkipReport& report, const OutputPtr& out, Read&& read)
{
    for (const auto& volume : volumes) {
        if (volume) {
            ReadOrSkip(*volume, report, out, read);
        }
    }
}

} // namespace OrvaneCli::FileSystem
