#pragma once

#include <functional>
#include <string>

namespace TestSupport {

// The message of the HostCtlException `call` throws, or "" when it throws none; any other
// exception goes on to the test.
std::string MessageOf(const std::function<void()>& call);

} // namespace TestSupport
