#include "framework/Frontend.h"

#include "framework/Help.h"
#include "framework/ManPage.h"
#include "framework/Render.h"
#include "framework/Suggest.h"
#include "framework/Text.h"
#include "quillets/QuilletException.h"

#include <algorithm>

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

std::string CommandList(const std::shared_ptr<AutoCli::NamespaceNode>& root)
{
    std::string out;
    ForEachCommand(root, [&](const CommandPath& path, const std::shared_ptr<AutoCli::Command>&) {
        out += Text::EscapeControl(JoinPath(path)) + "\n";
    });
    return out;
}

// One value per line, in order, each once; a value that could not stand on one line of its
// own is left out rather than split.
CliOutcome ValueList(const std::string& kind, const DispatchHooks& hooks)
{
    CliOutcome outcome;
    std::vector<std::string> kinds;
    for (const auto& [parameter, known] : hooks.valueSources) {
        if (std::find(kinds.begin(), kinds.end(), known) == kinds.end()) {
            kinds.push_back(known);
        }
    }
    std::optional<std::vector<std::string>> values;
    if (std::find(kinds.begin(), kinds.end(), kind) != kinds.end() && hooks.listValues) {
        try {
            values = hooks.listValues(kind);
        } catch (...) {
            outcome.err = DescribeException(std::current_exception(), hooks) + "\n";
            outcome.exitCode = kExitErrors;
            return outcome;
        }
    }
    if (!values) {
        outcome.err = "Unknown value list '" + Text::EscapeControl(kind) + "': use " + Text::Join(kinds, ", ") + "." +
                      DidYouMean(kind, kinds) + "\n";
        outcome.exitCode = kExitUsage;
        return outcome;
    }
    std::sort(values->begin(), values->end());
    values->erase(std::unique(values->begin(), values->end()), values->end());
    for (const auto& value : *values) {
        if (!value.empty() && value == Text::EscapeControl(value)) {
            outcome.out += value + "\n";
        }
    }
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
        case Invocation::Action::ListCommands:
            outcome.out = CommandList(inv.node);
            return outcome;
        case Invocation::Action::Completion:
            outcome.out = CompletionScript(inv.globals.completionShell.value_or(""), inv.node, hooks.valueSources);
            return outcome;
        case Invocation::Action::ListValues:
            return ValueList(inv.globals.valueList.value_or(""), hooks);
        case Invocation::Action::ManPage:
            outcome.out = ManPage(inv.node);
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
