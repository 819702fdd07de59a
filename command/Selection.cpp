#include "command/Selection.h"

namespace OrvaneCli::FileSystem {

namespace {

const VolumeSelectorTexts kHlfsVolumeTexts = {
    "You cannot specify both --volume-label and --volume-uuid.",
    "A target HLFS volume must be specified either by --volume-label or --volume-uuid.",
    "HLFS volume with label %s could not be found.",
    "HLFS volume with uuid %s could not be found.",
};

} // namespace

ParameterDecl LabelParameter(const char* description, ParameterType type)
{
    return {kOptionVolumeLabel, "l", type, description};
}

ParameterDecl UuidParameter(const char* description, ParameterType type)
{
    return {kOptionVolumeUuid, "u", type, description};
}

ParameterDecl IgnoreErrorsParameter()
{
    return {kOptionIgnoreErrors, "i", ParameterType::Flag,
            "Ignore errors encountered (if any) while retrieving information for each file system."};
}

ParameterDecl HlfsLabelParameter() { return LabelParameter("The label of the target HLFS volume."); }

ParameterDecl HlfsUuidParameter() { return UuidParameter("The uuid of the target HLFS volume."); }

std::optional<std::size_t> ExactlyOneOf(std::initializer_list<Choice> choices, const char* none, const OutputPtr& out)
{
    std::optional<std::size_t> chosen;
    std::size_t index = 0;
    for (const Choice& choice : choices) {
        if (choice.given) {
            if (chosen) {
                out->AddErrorMessage(std::data(choices)[*chosen].conflict);
                return std::nullopt;
            }
            chosen = index;
        }
        ++index;
    }
    if (!chosen) {
        out->AddErrorMessage(none);
    }
    return chosen;
}

std::optional<VolumeChoice> ChooseVolume(const InputPtr& in, const VolumeSelectorTexts& texts, const OutputPtr& out)
{
    const std::string label = in->GetParameter(kOptionVolumeLabel);
    const std::string uuid = in->GetParameter(kOptionVolumeUuid);
    const auto chosen = ExactlyOneOf({{IsGiven(label), texts.both}, {IsGiven(uuid), texts.both}}, texts.neither, out);
    if (!chosen) {
        return std::nullopt;
    }
    return *chosen == 0 ? VolumeChoice{VolumeKey::Label, label} : VolumeChoice{VolumeKey::Uuid, uuid};
}

std::string VolumeNotFound(const VolumeChoice& choice, const VolumeSelectorTexts& texts)
{
    return HostCtl::Misc::StrPrintf(choice.ByUuid() ? texts.uuidNotFound : texts.labelNotFound, choice.value.c_str());
}

std::unique_ptr<HlFileSystem> GetSingleHLFSVolume(const InputPtr& in, const OutputPtr& out)
{
    const auto choice = ChooseVolume(in, kHlfsVolumeTexts, out);
    if (!choice) {
        return nullptr;
    }
    std::unique_ptr<HlFileSystem> volume;
    Guarded(out, [&] {
        volume = FindVolume(*choice, kHlfsVolumeTexts, out, [](const VolumeChoice& c) {
            auto storage = OpenHostStorageInfo();
            return c.ByUuid() ? storage->GetHlfsFileSystemByUuid(c.value) : storage->GetHlfsFileSystemByLabel(c.value);
        });
    });
    return volume;
}

} // namespace OrvaneCli::FileSystem
