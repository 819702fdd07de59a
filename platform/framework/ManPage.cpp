#include "framework/ManPage.h"

#include <cstdio>
#include <vector>

#include "framework/Frontend.h"
#include "framework/GlobalOptions.h"
#include "framework/Help.h"
#include "framework/Render.h"
#include "framework/Text.h"
#include "framework/TreeWalk.h"
#include "framework/Words.h"
#include "quillets/CallSpec.h"
#include "quillets/MetaObj.h"

namespace Quillets::Cli {

using AutoCli::Command;
using CallSpec::ParameterConstraintType;

namespace {

void AppendCodePoint(std::string& out, char32_t value)
{
    char buffer[16];
    std::snprintf(buffer, sizeof buffer, "\\[u%04lX]", static_cast<unsigned long>(value));
    out += buffer;
}

std::string Bold(const std::string& text) { return "\\fB" + RoffText(text, true) + "\\fR"; }
std::string Italic(const std::string& text) { return "\\fI" + RoffText(text, true) + "\\fR"; }

std::string Section(const std::string& title) { return ".SH " + title + "\n"; }

// A tagged paragraph: the tag on its own line, then the body.
std::string Tagged(const std::string& tag, const std::string& body)
{
    return ".TP\n" + tag + "\n" + RoffText(body) + "\n";
}

std::string OptionsSection()
{
    std::string out = Section("OPTIONS") +
                      RoffText("Global options stand before the command path; --formatter, --format-param and "
                               "--help may also follow it.") +
                      "\n";
    for (const auto& option : GlobalOptionTable()) {
        std::string tag = option.shortName.empty() ? "" : Bold(option.shortName) + ", ";
        tag += Bold(option.longName);
        if (!option.value.empty()) {
            tag += " " + Italic(option.value);
        }
        out += Tagged(tag, option.description);
    }
    return out;
}

std::string ResultSentence(Command& command)
{
    const auto outputs = command.GetOutputSpec();
    const auto root = outputs->GetRootObject();
    if (root && root->GetType() == MetaObj::MetaType::Bool) {
        return "Result: a boolean (true on success).";
    }
    const auto shape = RowShape(nullptr, root);
    if (!shape) {
        return {};
    }
    std::vector<std::string> titles;
    for (std::size_t i = 0; i < shape->GetFieldCount(); ++i) {
        titles.push_back(shape->GetFieldTitle(i));
    }
    return std::string("Result: ") + (root->GetType() == MetaObj::MetaType::List ? "a list of " : "one ") +
           shape->GetName() + ", with the fields " + Text::Join(titles, ", ") + ".";
}

std::string CommandSection(const CommandPath& path, Command& command)
{
    const auto input = command.GetInputSpec();
    std::string out = ".SS \"" + RoffText(JoinPath(path), true) + "\"\n";
    if (!command.GetDescription().empty()) {
        out += RoffText(command.GetDescription()) + "\n";
    }
    for (const auto& parameter : input->GetParameters()) {
        if (!parameter) {
            continue;
        }
        std::string tag = parameter->GetShortName().empty() ? "" : Bold("-" + parameter->GetShortName()) + ", ";
        tag += Bold("--" + parameter->GetName());
        if (const std::string value = WordsFor(parameter->GetType()).manValue; !value.empty()) {
            tag += " " + Italic(value);
        }
        out += Tagged(tag, ParameterDetails(*parameter));
        const auto& constraint = parameter->GetConstraint();
        if (constraint && constraint->GetType() == ParameterConstraintType::StringEnum &&
            !constraint->GetStringEnum().empty()) {
            // One line per value, under the parameter's description.
            out += ".RS\n.PP\n";
            bool first = true;
            for (const auto& [value, description] : constraint->GetStringEnum()) {
                out += (first ? "" : ".br\n") + Bold(value) +
                       (description.empty() ? std::string() : ": " + RoffText(description)) + "\n";
                first = false;
            }
            out += ".RE\n";
        }
    }
    if (!command.GetExamples().empty()) {
        out += ".PP\nExamples:\n";
        for (const auto& [arguments, description] : command.GetExamples()) {
            out += ".RS\n.PP\n" + Bold("autocli " + JoinPath(path) + (arguments.empty() ? "" : " " + arguments)) + "\n";
            if (!description.empty()) {
                out += ".br\n" + RoffText(description) + "\n";
            }
            out += ".RE\n";
        }
    }
    if (const auto result = ResultSentence(command); !result.empty()) {
        out += ".PP\n" + RoffText(result) + "\n";
    }
    return out;
}

const char* const kDescription =
    "autocli reaches the storage commands of the host. Commands sit in namespaces (storage, then "
    "filesystem, nfs and the others); autocli --list-commands prints every command path, and --help after "
    "any part of a path explains it.";

const char* const kParameterSyntax =
    "A parameter is given as --name value, --name=value or -x value (its one-letter short name; short "
    "names are case-sensitive). A flag takes no value. A boolean takes true or false (also yes/no, 1/0, "
    "on/off, in any case). An integer is a signed 64-bit decimal number. A list parameter may be repeated, "
    "and each value is also split at commas. Any other parameter given twice is a usage error. A value that "
    "starts with - is taken as a value where an option needs one.";

const char* const kOutput =
    "Results go to standard output, messages to standard error. The table formatter prints a header, a "
    "line of dashes and one line per row, in columns as wide as their widest cell on a terminal; simple "
    "prints one Title: value line per field; json prints one JSON value; csv prints RFC 4180 lines. Output "
    "is the same on a terminal and on a pipe.";

struct Entry {
    const char* tag;
    const char* text;
};

const Entry kEnvironment[] = {
    {"AUTOCLI_STATE", "The host state file when --state is not given. A file named here must exist."},
    {"AUTOCLI_HOST", "Which host answers (sim or linux) when --host is not given; default sim."},
    {"AUTOCLI_JOURNAL", "A file to which every host call a command makes is appended, one JSON line each."},
    {"AUTOCLI_PLUGIN_PATH", "One absolute folder to load the command plug-ins from, instead of the one beside "
                            "the program."},
    {"AUTOCLI_LOCK_TIMEOUT", "Seconds to wait for the lock on the state file; default 10."},
    {"XDG_STATE_HOME", "The folder of the default state file; default $HOME/.local/state."},
};

const Entry kExitStatus[] = {
    {"0", "The command ran and reported no error."},
    {"1", "The command ran and reported at least one error."},
    {"2", "Usage error: nothing was run."},
    {"3", "The command was stopped by a failure it could not handle; the message is on standard error."},
};

const Entry kExamples[] = {
    {"autocli --list-commands", "Every command path."},
    {"autocli storage filesystem list", "The file systems of the host, on the default state."},
    {"autocli --formatter json storage nfs list", "The NFS volumes as JSON."},
    {"autocli --format-param 'fields=Volume Name,Mount Point' storage filesystem list",
     "Only two columns, in that order."},
    {"autocli --state ./host.json --init-state", "Create a state file from the demo host."},
    {"autocli --state ./host.json --dry-run storage filesystem rescan",
     "Show the host calls a command would make, and save nothing."},
    {"source <(autocli --completion bash)", "Complete commands, parameters and volume names in bash."},
};

std::string EntryList(const char* title, const Entry* begin, const Entry* end, bool codeTags)
{
    std::string out = Section(title);
    for (const Entry* entry = begin; entry != end; ++entry) {
        out += Tagged(codeTags ? Bold(entry->tag) : RoffText(entry->tag), entry->text);
    }
    return out;
}

} // namespace

std::string RoffText(const std::string& text, bool code)
{
    std::string out;
    std::size_t pos = 0;
    // Inside a word that starts with a dash: an option name, which a reader copies.
    bool option = false;
    char previous = ' ';
    while (pos < text.size()) {
        const char c = text[pos];
        const auto byte = static_cast<unsigned char>(c);
        if (byte >= 0x80) {
            AppendCodePoint(out, Text::NextCodePoint(text, pos).value_or(U'\ufffd'));
            previous = 'x';
            continue;
        }
        ++pos;
        if (c == '-' && (previous == ' ' || previous == '(' || previous == '\n')) {
            option = true;
        } else if (c == ' ' || c == '\n') {
            option = false;
        }
        if (c == '\\') {
            out += "\\e";
        } else if (c == '-' && (code || option)) {
            // A plain ASCII minus that never breaks the line.
            out += "\\-";
        } else if (c == '"') {
            out += "\\(dq";
        } else if (c == '\n') {
            out += '\n';
        } else if (byte < 0x20 || byte == 0x7f) {
            out += ' ';
        } else {
            // A line that starts with a control character would be read as a request.
            if ((c == '.' || c == '\'') && (out.empty() || out.back() == '\n')) {
                out += "\\&";
            }
            out += c;
        }
        previous = c;
    }
    return out;
}

std::string ManPage(const std::shared_ptr<AutoCli::NamespaceNode>& root)
{
    std::string version = VersionText();
    if (!version.empty() && version.back() == '\n') {
        version.pop_back();
    }
    std::string out = ".\\\" The manual page of autocli, made from its command tree by 'autocli --man-page'.\n";
    out += ".TH AUTOCLI 1 \"\" \"" + RoffText(version, true) + "\" \"User Commands\"\n";
    // Option names and paths are copied from the page: no hyphenation, no stretched blanks.
    out += ".nh\n.ad l\n";
    out += Section("NAME") + "autocli \\- run the storage commands of the host\n";
    out += Section("SYNOPSIS") + ".B autocli\n[\\fIGLOBAL OPTIONS\\fR] \\fINAMESPACE\\fR... \\fICOMMAND\\fR "
                                 "[\\fIPARAMETERS\\fR]\n.br\n.B autocli\n[\\fIGLOBAL OPTIONS\\fR] "
                                 "[\\fINAMESPACE\\fR...] [\\fICOMMAND\\fR] \\fB\\-\\-help\\fR\n";
    out += Section("DESCRIPTION") + RoffText(kDescription) + "\n.PP\n" + RoffText(kParameterSyntax) + "\n.PP\n" +
           RoffText(kOutput) + "\n";
    out += OptionsSection();
    out += Section("COMMANDS");
    ForEachCommand(root, [&](const CommandPath& path, const std::shared_ptr<Command>& command) {
        out += CommandSection(path, *command);
    });
    out += EntryList("ENVIRONMENT", std::begin(kEnvironment), std::end(kEnvironment), true);
    out += Section("FILES") +
           Tagged(Bold("${XDG_STATE_HOME:-$HOME/.local/state}/autocli/host.json"),
                  "The default host state file, a JSON object. While it does not exist, "
                  "commands run on the demo host built into autocli, and the first change "
                  "writes it. A file named with --state or AUTOCLI_STATE must exist; "
                  "--init-state creates one from the demo host. --dump-state prints the "
                  "state in effect.") +
           Tagged(Bold("FILE.lock"), "Beside the state file: held while a command runs, so that commands on one "
                                     "state run one after the other.");
    out += EntryList("EXIT STATUS", std::begin(kExitStatus), std::end(kExitStatus), false);
    out += Section("EXAMPLES");
    for (const auto& example : kExamples) {
        out += ".PP\n" + RoffText(example.text) + "\n.RS\n.B " + RoffText(example.tag, true) + "\n.RE\n";
    }
    return out;
}

} // namespace Quillets::Cli
