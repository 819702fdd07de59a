#pragma once

// The running session of the simulated host: the state in memory, fault counters, the call
// journal and persistence. Every host object goes through Run() for each of its calls.

#include <cstdint>
#include <initializer_list>
#include <optional>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

#include <nlohmann/json.hpp>

#include "HostState.h"
#include "hostctl/HostCtlException.h"

namespace HostSim::Runtime {

using HostCtl::Lib::HostCtlException;
using Model::FileSystemRecord;
using Model::State;
using Model::UnresolvedVolume;

[[noreturn]] void Throw(std::string message);

// The session's state; throws HostCtlException when no session is open or the state is bad.
State& CheckedState();

// Throws the message of the first fault that matches and fires.
void CheckFault(std::string_view call, std::initializer_list<std::string_view> targets);

// Records that the state in memory differs from the file; the session's save writes it.
void MarkDirty();

// Look-ups in the state; positions are indexes into fileSystems.
// `position` is a hint where to look first; it is updated to where the record was found.
FileSystemRecord* FindFileSystemById(std::uint64_t id, std::size_t& position);
UnresolvedVolume* FindUnresolvedById(std::uint64_t id, std::size_t& position);
const FileSystemRecord* FirstByUuid(std::string_view uuid);
const FileSystemRecord* FirstByVolumeName(std::string_view name);
const FileSystemRecord* FirstMountedByPath(std::string_view path);
// Call after anything that adds, removes or moves file systems.
void InvalidateIndexes();

struct JournalEntry {
    std::string target;
    nlohmann::ordered_json args;
};

void WriteJournal(std::string_view call, const JournalEntry& entry, const std::string* error);

// Runs one host call: `body` does the work (checks, faults, changes); journaled calls
// (`journal` given) are recorded with their outcome as they are made. Changes stay in memory
// until the session saves them once, at the end of the command. A call checks everything
// before it changes anything, so a call that throws has changed nothing.
template <typename F>
auto Run(std::string_view call, const JournalEntry* journal, F&& body) -> decltype(body())
{
    try {
        if constexpr (std::is_void_v<decltype(body())>) {
            body();
            if (journal)
                WriteJournal(call, *journal, nullptr);
        } else {
            auto result = body();
            if (journal)
                WriteJournal(call, *journal, nullptr);
            return result;
        }
    } catch (const HostCtlException& e) {
        if (journal)
            WriteJournal(call, *journal, &e.message);
        throw;
    }
}

} // namespace HostSim::Runtime
