#pragma once

#include <array>
#include <cstdint>
#include <string>

namespace HostCtl::Network {

class MacAddress {
public:
    MacAddress() = default;
    explicit MacAddress(const std::array<std::uint8_t, 6>& bytes) : bytes_(bytes) {}

    // Six lower-case hex pairs joined by ':'.
    std::string GetStringAddress() const;
    const std::array<std::uint8_t, 6>& GetBytes() const { return bytes_; }

private:
    std::array<std::uint8_t, 6> bytes_{};
};

} // namespace HostCtl::Network

namespace KnxCtl::Network {

class FirewallRulesetImpl {
public:
    // 1 IPv4 with /0-32, 2 plain IPv4, 3 IPv6 with /0-128, 4 plain IPv6, 0 anything else.
    static int GetTypeFromIpString(const std::string& text);
};

} // namespace KnxCtl::Network
