#include "support/HostErrors.h"

#include "hostctl/HostCtlException.h"

namespace TestSupport {

std::string MessageOf(const std::function<void()>& call)
{
    try {
        call();
    } catch (const HostCtl::Lib::HostCtlException& e) {
        return e.message;
    }
    return "";
}

} // namespace TestSupport
