// storage hlfs pbcache get: unit conversions and truncation of the statistics.

#include <cstdint>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "hlfs/HLFSPBCache.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;

namespace {

constexpr std::uint64_t KiB = 1ull << 10;
constexpr std::uint64_t MiB = 1ull << 20;
constexpr std::uint64_t TiB = 1ull << 40;

struct Stats {
    std::uint64_t cacheSize, cacheSizeMax, workingSet, workingSetMax, heapOverhead;
    int missRatio;
    std::uint64_t heapSize, heapSizeMax;
};

std::string StateOf(const Stats& s)
{
    nlohmann::json state;
    state["pointerBlockCache"] = {{"cacheSize", s.cacheSize},         {"cacheSizeMax", s.cacheSizeMax},
                                  {"workingSet", s.workingSet},       {"workingSetMax", s.workingSetMax},
                                  {"heapOverhead", s.heapOverhead},   {"capacityMissRatio", s.missRatio}};
    state["heaps"] = {{{"name", "hlfs3"}, {"size", s.heapSize}, {"maxSize", s.heapSizeMax}}};
    return state.dump();
}

std::vector<std::pair<std::string, std::int64_t>> Fields(const TestSupport::CommandResult& result)
{
    std::vector<std::pair<std::string, std::int64_t>> fields;
    auto root = std::dynamic_pointer_cast<MetaStruct>(result.root);
    if (!root) {
        return fields;
    }
    for (const auto& [title, value] : root->GetFields()) {
        auto number = std::dynamic_pointer_cast<MetaInt>(value);
        fields.emplace_back(title, number ? number->GetValue() : -999);
    }
    return fields;
}

TEST(HlfsPbCacheTest, StatisticsAreShownInWholeUnits)
{
    struct Case {
        const char* what;
        Stats stats;
        std::vector<std::int64_t> shown;  // in structure order
    };
    const std::vector<Case> cases = {
        {"half full", {1536 * MiB, 3072 * MiB, 3 * TiB, 5 * TiB, 64 * KiB, 7, 300 * MiB, 512 * MiB},
         {7, 1536, 3072, 50, 3, 5, 64, 300, 512}},
        {"below one unit", {MiB - 1, 3 * MiB, TiB - 1, TiB - 1, 1023, 0, 2 * MiB - 1, MiB - 1},
         {0, 0, 3, 33, 0, 0, 0, 1, 0}},
        {"two thirds", {2 * MiB, 3 * MiB, 0, 0, KiB, 100, 1, 1}, {100, 2, 3, 66, 0, 0, 1, 0, 0}},
        {"empty maximum", {5 * MiB, 0, 0, 0, 0, 0, 1, 1}, {0, 5, 0, 0, 0, 0, 0, 0, 0}},
    };
    const std::vector<std::string> titles = {"Cache Capacity Miss Ratio", "Cache Size", "Cache Size Max",
                                             "Cache Usage", "Cache Working Set", "Cache Working Set Max",
                                             "Hlfs Heap Overhead", "Hlfs Heap Size", "Hlfs Heap Size Max"};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        TestSupport::ScopedHost host(StateOf(c.stats));
        const auto result = TestSupport::Execute(*HLFSPBCacheGet::New(), Input::New());
        EXPECT_TRUE(result.errors.empty());
        std::vector<std::pair<std::string, std::int64_t>> expected;
        for (std::size_t i = 0; i < titles.size(); ++i) {
            expected.emplace_back(titles[i], c.shown[i]);
        }
        EXPECT_EQ(Fields(result), expected);
    }
}

} // namespace
