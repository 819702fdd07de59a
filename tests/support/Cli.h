#pragma once

#include <memory>
#include <string>
#include <vector>

#include "quillets/AutoCli.h"
#include "quillets/CallSpec.h"
#include "quillets/MetaObj.h"

namespace TestSupport {

struct CliResult {
    int exitCode = -1;
    std::string out;
    std::string err;
};

// Runs the built autocli (with `--state statePath` first when it is not empty, then `args`),
// with no standard input; `env` holds extra "NAME=VALUE" entries.
CliResult RunAutocli(const std::vector<std::string>& args, const std::string& statePath = "",
                     const std::vector<std::string>& env = {});

// Runs `argv` (argv[0] looked up in PATH when it holds no '/') with no standard input; `env`
// adds or replaces "NAME=VALUE" entries. A program that cannot be started ends with 127.
CliResult RunProgram(const std::vector<std::string>& argv, const std::vector<std::string>& env = {});

struct CommandResult {
    std::vector<std::string> errors;
    std::shared_ptr<Quillets::MetaObj::MetaObject> root;
};

// Runs `command` in process with `in` on a fresh Output; `in` is declared with the
// command's input description first, so reading an undeclared parameter throws.
CommandResult Execute(Quillets::AutoCli::Command& command, const std::shared_ptr<Quillets::CallSpec::Input>& in);

// Renders `root` with the named formatter ("table", "simple", "json", "csv") and the
// command's declared hints, exactly as autocli prints it to standard output.
std::string Render(Quillets::AutoCli::Command& command, const std::shared_ptr<Quillets::MetaObj::MetaObject>& root,
                   const std::string& formatter);

} // namespace TestSupport
