#pragma once

#include <string>

namespace HostCtl::Lib {

// The storage-control library's one failure type. Deliberately not a std::exception:
// commands catch it by name and pass `message` on unchanged.
class HostCtlException {
public:
    explicit HostCtlException(std::string text);
    virtual ~HostCtlException();

    const std::string& GetMessage() const { return message; }

    std::string message;
};

} // namespace HostCtl::Lib
