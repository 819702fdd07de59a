#include "hlfs/HLFSPBCache.h"

#include <algorithm>
#include <array>

namespace OrvaneCli::FileSystem {

using HostCtl::HeapRecord;
using HostCtl::HostFactory;
using HostCtl::Misc::StrCat;
using HostCtl::Storage::PointerBlockCacheStats;

namespace {

constexpr const char* kStructureName = "HLFSPBCacheGet";
constexpr const char* kHlfsHeapName = "hlfs3";

// The result's fields, in structure order, with the unit each value is shown in.
struct CacheField {
    const char* title;
    const char* unit;
};

constexpr std::array<CacheField, 9> kCacheFields = {{
    {"Cache Capacity Miss Ratio", "%"},
    {"Cache Size", "MiB"},
    {"Cache Size Max", "MiB"},
    {"Cache Usage", "%"},
    {"Cache Working Set", "TiB"},
    {"Cache Working Set Max", "TiB"},
    {"Hlfs Heap Overhead", "KiB"},
    {"Hlfs Heap Size", "MiB"},
    {"Hlfs Heap Size Max", "MiB"},
}};

constexpr unsigned kMiB = 20;
constexpr unsigned kTiB = 40;
constexpr unsigned kKiB = 10;

// The values of kCacheFields, in the same order: whole units, truncated. The host's
// figures are unsigned 64-bit; the fields hold 32-bit integers.
std::array<int, 9> CacheFieldValues(const PointerBlockCacheStats& stats, const HeapRecord& heap)
{
    // An empty maximum has no usage to speak of (and must not be divided by).
    const std::uint64_t usage = stats.cacheSizeMax == 0 ? 0 : stats.cacheSize * 100 / stats.cacheSizeMax;
    return {
        static_cast<int>(stats.capacityMissRatio),
        static_cast<int>(stats.cacheSize >> kMiB),
        static_cast<int>(stats.cacheSizeMax >> kMiB),
        static_cast<int>(usage),
        static_cast<int>(stats.workingSet >> kTiB),
        static_cast<int>(stats.workingSetMax >> kTiB),
        static_cast<int>(stats.heapOverhead >> kKiB),
        static_cast<int>(heap.size >> kMiB),
        static_cast<int>(heap.maxSize >> kMiB),
    };
}

} // namespace

std::shared_ptr<HLFSPBCacheGet> HLFSPBCacheGet::New() { return std::shared_ptr<HLFSPBCacheGet>(new HLFSPBCacheGet()); }

HLFSPBCacheGet::HLFSPBCacheGet()
{
    SetDescription("Get HLFS Pointer Block cache statistics.");
    SetDefaultOutputFormatter("simple");
    for (const CacheField& field : kCacheFields) {
        SetDefaultOutputParameter(StrCat("units:", kStructureName, ".", field.title), field.unit);
    }
}

HLFSPBCacheGet::~HLFSPBCacheGet() = default;

std::shared_ptr<InputSpec> HLFSPBCacheGet::GetInputSpecInternal() { return InputSpec::New(); }

std::shared_ptr<OutputSpec> HLFSPBCacheGet::GetOutputSpecInternal() { return StructOutputSpec(GetOutputStructure()); }

std::shared_ptr<MetaStruct> HLFSPBCacheGet::GetOutputStructure()
{
    auto structure = MetaStruct::New(kStructureName);
    for (const CacheField& field : kCacheFields) {
        structure->SetField(field.title, MetaInt::New());
    }
    return structure;
}

void HLFSPBCacheGet::ExecuteInternal(const InputPtr&, const OutputPtr& out)
{
    Guarded(out, [&] {
        HostCtl::Host* host = HostFactory::GetHost();
        std::unique_ptr<HostCtl::MemoryInfo> memory = host->GetHardwareInfo()->GetMemoryInfo();
        const std::vector<std::unique_ptr<HeapRecord>> heaps = memory->GetHeapStats();
        const auto heap = std::find_if(heaps.begin(), heaps.end(), [](const std::unique_ptr<HeapRecord>& record) {
            return record && record->name == kHlfsHeapName;
        });
        if (heap == heaps.end() || (*heap)->size == 0) {
            out->AddErrorMessage("Did not find HLFS3 heap stats!");
            return;
        }
        const PointerBlockCacheStats stats = host->GetStorageInfo()->GetPointerBlockCache()->GetStatistics();

        auto structure = GetOutputStructure();
        const std::array<int, 9> values = CacheFieldValues(stats, **heap);
        for (std::size_t i = 0; i < kCacheFields.size(); ++i) {
            structure->SetField(kCacheFields[i].title, values[i]);
        }
        out->SetRootObject(structure);
    });
}

std::shared_ptr<HLFSPBCacheReset> HLFSPBCacheReset::New()
{
    return std::shared_ptr<HLFSPBCacheReset>(new HLFSPBCacheReset());
}

HLFSPBCacheReset::HLFSPBCacheReset() { SetDescription("Reset the HLFS Pointer Block cache statistics."); }

HLFSPBCacheReset::~HLFSPBCacheReset() = default;

std::shared_ptr<InputSpec> HLFSPBCacheReset::GetInputSpecInternal() { return InputSpec::New(); }

std::shared_ptr<OutputSpec> HLFSPBCacheReset::GetOutputSpecInternal() { return BooleanOutputSpec(); }

void HLFSPBCacheReset::ExecuteInternal(const InputPtr&, const OutputPtr& out)
{
    Guarded(out, [&] {
        HostFactory::GetHost()->GetStorageInfo()->GetPointerBlockCache()->ResetStatistics();
        out->SetRootObject(MetaBool::New(true));
    });
}

} // namespace OrvaneCli::FileSystem
