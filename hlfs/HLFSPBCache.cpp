#include <algorithm>
#include <array>

#include "command/StorageCommand.h"
#include "hlfs/Manifest.h"

namespace OrvaneCli::FileSystem {

using HostCtl::HeapRecord;
using HostCtl::HostFactory;
using HostCtl::Storage::PointerBlockCacheStats;

namespace {

constexpr const char* kHlfsHeapName = "hlfs3";

// The result's fields, in structure order, with the unit each value is shown in.
enum Field {
    kMissRatio,
    kCacheSize,
    kCacheSizeMax,
    kCacheUsage,
    kWorkingSet,
    kWorkingSetMax,
    kHeapOverhead,
    kHeapSize,
    kHeapSizeMax,
    kFieldCount
};

const ColumnTable kColumns("HLFSPBCacheGet",
                           {
                               {kMissRatio, "Cache Capacity Miss Ratio", ColumnType::Int, {.unit = "%"}},
                               {kCacheSize, "Cache Size", ColumnType::Int, {.unit = "MiB"}},
                               {kCacheSizeMax, "Cache Size Max", ColumnType::Int, {.unit = "MiB"}},
                               {kCacheUsage, "Cache Usage", ColumnType::Int, {.unit = "%"}},
                               {kWorkingSet, "Cache Working Set", ColumnType::Int, {.unit = "TiB"}},
                               {kWorkingSetMax, "Cache Working Set Max", ColumnType::Int, {.unit = "TiB"}},
                               {kHeapOverhead, "Hlfs Heap Overhead", ColumnType::Int, {.unit = "KiB"}},
                               {kHeapSize, "Hlfs Heap Size", ColumnType::Int, {.unit = "MiB"}},
                               {kHeapSizeMax, "Hlfs Heap Size Max", ColumnType::Int, {.unit = "MiB"}},
                           },
                           false);

constexpr unsigned kMiB = 20;
constexpr unsigned kTiB = 40;
constexpr unsigned kKiB = 10;

// The values of the columns, in the same order: whole units, truncated. The host's
// figures are unsigned 64-bit; the fields hold 32-bit integers.
std::array<int, kFieldCount> CacheFieldValues(const PointerBlockCacheStats& stats, const HeapRecord& heap)
{
    // An empty maximum has no usage to speak of (and must not be divided by).
    const std::uint64_t usage = stats.cacheSizeMax == 0 ? 0 : stats.cacheSize * 100 / stats.cacheSizeMax;
    return {
        static_cast<int>(stats.capacityMissRatio),    static_cast<int>(stats.cacheSize >> kMiB),
        static_cast<int>(stats.cacheSizeMax >> kMiB), static_cast<int>(usage),
        static_cast<int>(stats.workingSet >> kTiB),   static_cast<int>(stats.workingSetMax >> kTiB),
        static_cast<int>(stats.heapOverhead >> kKiB), static_cast<int>(heap.size >> kMiB),
        static_cast<int>(heap.maxSize >> kMiB),
    };
}

const CommandDecl kHLFSPBCacheGetDecl = {
    .description = "Get HLFS Pointer Block cache statistics.", .result = One(kColumns), .formatter = "simple"};

// storage hlfs pbcache get
class HLFSPBCacheGet final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr&, const OutputPtr& out) override
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
            const PointerBlockCacheStats stats = OpenHostStorageInfo()->GetPointerBlockCache()->GetStatistics();

            const RowShape shape = Rows();
            auto structure = shape.NewRow();
            const std::array<int, kFieldCount> values = CacheFieldValues(stats, **heap);
            for (int field = 0; field < kFieldCount; ++field) {
                structure.Set(field, values[static_cast<std::size_t>(field)]);
            }
            out->SetRootObject(structure.Structure());
        });
    }
};

const CommandDecl kHLFSPBCacheResetDecl = {"Reset the HLFS Pointer Block cache statistics."};

// storage hlfs pbcache reset
class HLFSPBCacheReset final : public StorageCommand {
    using StorageCommand::StorageCommand;

    void Run(const InputPtr&, const OutputPtr& out) override
    {
        Guarded(out, [&] {
            OpenHostStorageInfo()->GetPointerBlockCache()->ResetStatistics();
            out->SetRootObject(MetaBool::New(true));
        });
    }
};

} // namespace

NodePtr NewHLFSPBCacheGet() { return New<HLFSPBCacheGet>(kHLFSPBCacheGetDecl); }
NodePtr NewHLFSPBCacheReset() { return New<HLFSPBCacheReset>(kHLFSPBCacheResetDecl); }

} // namespace OrvaneCli::FileSystem
