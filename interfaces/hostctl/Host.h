#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Storage.h"

namespace HostCtl {

struct HeapRecord {
    std::string name;
    std::uint64_t size = 0;
    std::uint64_t maxSize = 0;
};

class MemoryInfo {
public:
    virtual ~MemoryInfo();
    virtual std::vector<std::unique_ptr<HeapRecord>> GetHeapStats() = 0;
};

class HardwareInfo {
public:
    virtual ~HardwareInfo();
    virtual std::unique_ptr<MemoryInfo> GetMemoryInfo() = 0;
};

class AdvancedOption {
public:
    virtual ~AdvancedOption();
    virtual std::string GetName() = 0;
};

class AdvancedIntegerOption : public AdvancedOption {
public:
    ~AdvancedIntegerOption() override;
    virtual std::int64_t GetValue() = 0;
};

class AdvancedStringOption : public AdvancedOption {
public:
    ~AdvancedStringOption() override;
    virtual std::string GetValue() = 0;
};

class AdvancedOptionGroup {
public:
    virtual ~AdvancedOptionGroup();
    // Throws HostCtlException when the group has no such option.
    virtual std::unique_ptr<AdvancedOption> GetOption(const std::string& name) = 0;
};

class AdvancedOptions {
public:
    virtual ~AdvancedOptions();
    // Throws HostCtlException when the host has no such group.
    virtual std::unique_ptr<AdvancedOptionGroup> GetOptionGroup(const std::string& name) = 0;
};

class Host {
public:
    virtual ~Host();
    virtual std::unique_ptr<Storage::StorageInfo> GetStorageInfo() = 0;
    virtual std::unique_ptr<HardwareInfo> GetHardwareInfo() = 0;
    virtual std::unique_ptr<AdvancedOptions> GetAdvancedOptions() = 0;
};

class HostFactory {
public:
    // The host of this process; owned by the library.
    static Host* GetHost();
};

} // namespace HostCtl
