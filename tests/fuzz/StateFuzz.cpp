// Fuzzes the state file reader: any text is either a state or refused with the one
// documented message, never a crash, a leak or undefined behaviour; and what the host writes
// back reads again to the same state (read, write, read, write agree).

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <string>

#include "host/HostState.h"

namespace {

void Stop(const char* what, const std::string& detail)
{
    std::fprintf(stderr, "%s\n%s\n", what, detail.c_str());
    std::abort();
}

std::string WriteOut(const HostSim::Model::State& state)
{
    std::ostringstream out;
    HostSim::Model::Write(state, out);
    return out.str();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    using HostSim::Model::Parse;
    using HostSim::Model::StateError;
    static const std::string kPrefix = "Invalid host state file 'fuzz.json': ";

    std::istringstream input(std::string(reinterpret_cast<const char*>(data), size));
    HostSim::Model::State first;
    try {
        first = Parse(input, "fuzz.json");
    } catch (const StateError& e) {
        const std::string message = e.what();
        if (message.rfind(kPrefix, 0) != 0)
            Stop("a refusal without the documented start", message);
        // Quoted texts are cut, so no input makes a long message.
        if (message.size() > 1024)
            Stop("a refusal message longer than 1024 bytes", message.substr(0, 2048));
        return 0;
    }

    const std::string written = WriteOut(first);
    std::istringstream again(written);
    HostSim::Model::State second;
    try {
        second = Parse(again, "fuzz.json");
    } catch (const StateError& e) {
        Stop("what the host wrote does not read again", std::string(e.what()) + "\n" + written);
    }
    const std::string rewritten = WriteOut(second);
    if (rewritten != written)
        Stop("writing the state read back gives another text", written + "\n----\n" + rewritten);
    return 0;
}
