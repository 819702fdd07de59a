// make-state [--hlfs] N: writes a host state with N file systems of mixed kinds (with --hlfs,
// HLFS volumes only) to standard output.
// The output depends only on N, and is laid out as the host itself writes its state file.

#include <cinttypes>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <iostream>
#include <string>

#include <nlohmann/json.hpp>

namespace {

using ojson = nlohmann::ordered_json;

// A small deterministic generator (splitmix64), so every run gives the same host.
struct Random {
    std::uint64_t state;
    std::uint64_t Next()
    {
        std::uint64_t z = (state += 0x9e3779b97f4a7c15ull);
        z = (z ^ (z >> 30)) * 0xbf58476d1ce4e5b9ull;
        z = (z ^ (z >> 27)) * 0x94d049bb133111ebull;
        return z ^ (z >> 31);
    }
    std::uint64_t Below(std::uint64_t n) { return Next() % n; }
};

std::string Hex(std::uint64_t value, int digits)
{
    char text[17];
    const std::uint64_t mask = digits >= 16 ? ~std::uint64_t{0} : ((std::uint64_t{1} << (4 * digits)) - 1);
    std::snprintf(text, sizeof text, "%0*" PRIx64, digits, value & mask);
    return text;
}

std::string Uuid(Random& r)
{
    return Hex(r.Next(), 8) + "-" + Hex(r.Next(), 8) + "-" + Hex(r.Next(), 4) + "-" + Hex(r.Next(), 12);
}

std::string Mac(Random& r)
{
    std::string mac = "00:1e:67";
    for (int i = 0; i < 3; ++i)
        mac += ":" + Hex(r.Below(256), 2);
    return mac;
}

ojson FileSystem(Random& r, std::size_t index, bool hlfsOnly)
{
    char name[32];
    const std::uint64_t kind = hlfsOnly ? r.Below(6) : r.Below(10);
    const std::uint64_t capacity = (r.Below(4096) + 16) << 30;
    const std::uint64_t used = capacity / 100 * r.Below(100);
    ojson fs;
    if (kind < 6) {
        std::snprintf(name, sizeof name, "datastore-%06zu", index);
        const int version = kind < 4 ? 6 : (kind == 4 ? 5 : 3);
        fs = {{"type", "HLFS"}, {"volumeName", name},      {"uuid", Uuid(r)},    {"capacity", capacity},
              {"used", used},   {"majorVersion", version}, {"lvmUuid", Uuid(r)}, {"lockMode", version == 6 ? 16 : 0}};
        ojson extents = ojson::array();
        for (std::uint64_t e = 0, n = 1 + r.Below(2); e < n; ++e)
            extents.push_back({{"deviceName", "naa.6" + Hex(r.Next(), 16) + Hex(r.Next(), 15)}, {"partition", 1}});
        fs["extents"] = std::move(extents);
        ojson users = ojson::array();
        for (std::uint64_t u = 0, n = r.Below(3); u < n; ++u)
            users.push_back({{"heartbeatUuid", Uuid(r)},
                             {"macAddress", Mac(r)},
                             {"driverVersionMajor", version},
                             {"driverVersionMinor", 82},
                             {"heartbeatOffset", 3145728 + 4096 * u},
                             {"lockModeInUse", 1}});
        if (!users.empty())
            fs["users"] = std::move(users);
    } else if (kind < 8) {
        std::snprintf(name, sizeof name, "nfs-%06zu", index);
        fs = {{"type", "NFS"},
              {"volumeName", name},
              {"uuid", Hex(r.Next(), 8) + "-" + Hex(r.Next(), 8)},
              {"remoteHost", "10." + std::to_string(r.Below(256)) + "." + std::to_string(r.Below(256)) + ".10"},
              {"remoteShare", std::string("/exports/") + name},
              {"capacity", capacity},
              {"used", used}};
    } else if (kind < 9) {
        std::snprintf(name, sizeof name, "nfs41-%06zu", index);
        fs = {{"type", "NFS41"},
              {"volumeName", name},
              {"uuid", Hex(r.Next(), 8) + "-" + Hex(r.Next(), 8)},
              {"remoteHosts", {"10.30.0." + std::to_string(r.Below(250)), "10.30.1." + std::to_string(r.Below(250))}},
              {"remoteShare", std::string("/exports/") + name},
              {"capacity", capacity},
              {"used", used},
              {"securityType", 1}};
    } else {
        std::snprintf(name, sizeof name, "BOOTBANK-%06zu", index);
        fs = {{"type", "vfat"}, {"volumeName", name}, {"capacity", 4293591040ull}, {"used", 1438646272ull}};
    }
    if (r.Below(20) == 0)
        fs["mounted"] = false; // a few for automount to find
    return fs;
}

void WriteIndented(const ojson& value, const char* indent)
{
    const std::string text = value.dump(2);
    for (char c : text) {
        std::cout.put(c);
        if (c == '\n')
            std::cout << indent;
    }
}

} // namespace

static int Generate(int argc, char** argv)
{
    const bool hlfsOnly = argc == 3 && std::string(argv[1]) == "--hlfs";
    const char* number = argc == 2 ? argv[1] : (hlfsOnly ? argv[2] : nullptr);
    char* end = nullptr;
    const unsigned long long count = number ? std::strtoull(number, &end, 10) : 0;
    if (!number || !end || *end != '\0' || number[0] == '-') {
        std::cerr << "usage: make-state [--hlfs] N > state.json   (N file systems; --hlfs: HLFS only)\n";
        return 2;
    }
    std::ios::sync_with_stdio(false);
    Random r{42};
    std::cout << "{\n  \"features\": ";
    WriteIndented({{"102", true}, {"103", true}, {"104", true}, {"270", true}}, "  ");
    std::cout << ",\n  \"advancedOptions\": ";
    WriteIndented({{"HLFS3", {{"EnableOnlineATSUpgrade", 1}}}}, "  ");
    std::cout << ",\n  \"fileSystems\": [";
    for (std::size_t i = 0; i < count; ++i) {
        std::cout << (i == 0 ? "\n    " : ",\n    ");
        WriteIndented(FileSystem(r, i, hlfsOnly), "    ");
    }
    std::cout << (count ? "\n  ]" : "]") << ",\n  \"firewall\": ";
    WriteIndented({{"nfsClient", {"10.0.0.0/8"}}, {"nfs41Client", {"10.30.0.0/16"}}}, "  ");
    std::cout << "\n}\n";
    return std::cout ? 0 : 1;
}

int main(int argc, char** argv)
{
    try {
        return Generate(argc, argv);
    } catch (const std::exception& e) {
        std::cerr << "make-state: " << e.what() << "\n";
        return 1;
    }
}
