#include "framework/Frontend.h"

#include "framework/Help.h"
#include "framework/Render.h"
#include "quillets/QuilletException.h"

#ifndef STORAGECLI_VERSION
#define STORAGECLI_VERSION "0.1.0"
#endif

namespace Quillets::Cli {

std::string VersionText() { return std::string("autocli ") + STORAGECLI_VERSION + "\n"; }

std::string DescribeException(const std::exception_ptr& error, const DispatchHooks& hooks)
{
    if (hooks.describeException) {
        if (auto message = hooks.describeException(error)) {
            return *message;
        }
    }
    try {
        std::rethrow_exception(error);
    } catch (const std::exception& e) {
        return e.what();
    } catch (...) {
        return "An unknown exception stopped the command.";
    }
}

namespace {

std::string WithNewline(std::string text)
{
    if (!text.empty() && text.back() != '\n') {
        text += '\n';
    }
    return text;
}

CliOutcome RunCommand(const Invocation& inv, const DispatchHooks& hooks)
{
    CliOutcome outcome;
    auto out = CallSpec::Output::New();
    try {
        inv.command->Execute(inv.input, out);
    } catch (...) {
        // Messages the command added before it failed are kept; the result is not shown.
        for (const auto& message : out->GetErrorMessages()) {
            outcome.err += message + "\n";
        }
        outcome.err += DescribeException(std::current_exception(), hooks) + "\n";
        outcome.exitCode = kExitException;
        return outcome;
    }
    const OutputHints hints{inv.command->GetDefaultOutputFormatter(), inv.command->GetDefaultOutputParameters()};
    const auto declared = inv.outputSpec ? inv.outputSpec->GetRootObject() : nullptr;
    if (hooks.writeOut) {
        RenderResultTo(hooks.writeOut, out->GetRootObject(), declared, hints, inv.globals.output);
    } else {
        outcome.out = RenderResult(out->GetRootObject(), declared, hints, inv.globals.output);
    }
    for (const auto& message : out->GetErrorMessages()) {
        outcome.err += message + "\n";
    }
    outcome.exitCode = out->GetErrorMessages().empty() ? kExitOk : kExitErrors;
    return outcome;
}

} // namespace

CliOutcome RunInvocation(const Invocation& inv, const DispatchHooks& hooks)
{
    CliOutcome outcome;
    try {
        switch (inv.action) {
        case Invocation::Action::UsageError:
            outcome.err = inv.error + "\n";
            outcome.exitCode = kExitUsage;
            return outcome;
        case Invocation::Action::Version:
            outcome.out = VersionText();
            return outcome;
        case Invocation::Action::DumpState:
            if (!hooks.dumpState) {
                outcome.err = "This front end cannot show the host state.\n";
                outcome.exitCode = kExitErrors;
                return outcome;
            }
            try {
                outcome.out = WithNewline(hooks.dumpState());
            } catch (...) {
                // A bad state file is reported, not a crash: the dump ran and failed.
                outcome.err = DescribeException(std::current_exception(), hooks) + "\n";
                outcome.exitCode = kExitErrors;
            }
            return outcome;
        case Invocation::Action::Help:
            outcome.out = HelpText(inv.path, inv.node);
            return outcome;
        case Invocation::Action::Run:
            return RunCommand(inv, hooks);
        }
    } catch (...) {
        outcome = CliOutcome{};
        outcome.err = DescribeException(std::current_exception(), hooks) + "\n";
        outcome.exitCode = kExitException;
    }
    return outcome;
}

CliOutcome Dispatch(const std::shared_ptr<AutoCli::NamespaceNode>& root, const std::vector<std::string>& args,
                    const DispatchHooks& hooks)
{
    Invocation inv;
    try {
        inv = ParseCommandLine(root, args);
    } catch (...) {
        // Describing a command's input is the command's code, and may fail.
        CliOutcome outcome;
        outcome.err = DescribeException(std::current_exception(), hooks) + "\n";
        outcome.exitCode = kExitException;
        return outcome;
    }
    return RunInvocation(inv, hooks);
}

} // namespace Quillets::Cli
