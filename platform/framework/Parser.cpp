#include "framework/Parser.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <set>

#include "framework/GlobalOptions.h"
#include "framework/Suggest.h"
#include "framework/Text.h"

namespace Quillets::Cli {

using AutoCli::Command;
using AutoCli::NamespaceNode;
using CallSpec::Input;
using CallSpec::ParameterConstraintType;
using CallSpec::ParameterSpec;
using CallSpec::ParameterType;

std::optional<bool> ParseBool(const std::string& text)
{
    std::string lower;
    for (const char c : text) {
        lower += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    }
    if (lower == "true" || lower == "yes" || lower == "1" || lower == "on") {
        return true;
    }
    if (lower == "false" || lower == "no" || lower == "0" || lower == "off") {
        return false;
    }
    return std::nullopt;
}

std::optional<std::int64_t> ParseInt64(const std::string& text)
{
    const char* begin = text.data();
    const char* end = begin + text.size();
    if (begin != end && *begin == '+') {
        ++begin;
        // "+-5" is not a number.
        if (begin != end && *begin == '-') {
            return std::nullopt;
        }
    }
    if (begin == end) {
        return std::nullopt;
    }
    std::int64_t value = 0;
    const auto [stop, error] = std::from_chars(begin, end, value, 10);
    if (error != std::errc() || stop != end) {
        return std::nullopt;
    }
    return value;
}

namespace {

bool IsOption(const std::string& arg) { return arg.size() > 1 && arg[0] == '-'; }

std::string Quote(const std::string& text) { return "'" + Text::EscapeControl(text) + "'"; }

// Splits "--name=value" into name and value; "--name" has no value.
std::pair<std::string, std::optional<std::string>> SplitLong(const std::string& arg)
{
    const auto eq = arg.find('=');
    if (eq == std::string::npos) {
        return {arg, std::nullopt};
    }
    return {arg.substr(0, eq), arg.substr(eq + 1)};
}

enum class Match { NotMine, Taken, Failed };

// Reads the value of the option at args[i]: inline after '=', else the next argument,
// whatever it looks like.
bool TakeValue(const std::vector<std::string>& args, std::size_t& i, const std::optional<std::string>& inlineValue,
               std::string& value)
{
    if (inlineValue) {
        value = *inlineValue;
        return true;
    }
    if (i + 1 >= args.size()) {
        return false;
    }
    value = args[++i];
    return true;
}

std::string ApplyFormatParam(const std::string& text, GlobalOptions& globals, std::set<std::string>& seenKeys)
{
    const auto eq = text.find('=');
    if (eq == std::string::npos) {
        return "Invalid --format-param " + Quote(text) + ": expected KEY=VALUE.";
    }
    const std::string key = text.substr(0, eq);
    const std::string value = text.substr(eq + 1);
    if (key != "fields" && key != "show-header") {
        return "Unknown format parameter " + Quote(key) + ": use fields or show-header.";
    }
    if (!seenKeys.insert(key).second) {
        return "Format parameter '" + key + "' given more than once.";
    }
    if (key == "show-header") {
        const auto flag = ParseBool(value);
        if (!flag) {
            return "Invalid value " + Quote(value) + " for format parameter 'show-header': expected true or false.";
        }
        globals.output.showHeader = *flag;
        return {};
    }
    std::vector<std::string> fields;
    for (const auto& part : Text::SplitCommas(value)) {
        const auto title = Text::Trim(part);
        if (title.empty()) {
            return "Invalid value " + Quote(value) + " for format parameter 'fields': a field name is empty.";
        }
        fields.push_back(title);
    }
    globals.output.fields = std::move(fields);
    return {};
}

// The options every command line may carry. Those that choose the session or end the run
// early (--state, --host, --version, --dump-state, --init-state, --list-commands, --completion) are taken only before
// the path.
class GlobalReader {
public:
    explicit GlobalReader(GlobalOptions& globals) : globals_(globals) {}

    Match Read(const std::vector<std::string>& args, std::size_t& i, bool leading, std::string& error)
    {
        const auto [name, inlineValue] = SplitLong(args[i]);
        if (name == "-h" || name == "--help") {
            if (inlineValue) {
                error = "Option '" + name + "' takes no value.";
                return Match::Failed;
            }
            globals_.help = true;
            return Match::Taken;
        }
        const bool early = name == "--state" || name == "--host" || name == "--version" || name == "--dump-state" ||
                           name == "--init-state" || name == "--list-commands" || name == "--completion" ||
                           name == "--list-values" || name == "--man-page";
        if (early && !leading) {
            error = "Option '" + name + "' must come before the command path.";
            return Match::Failed;
        }
        if (name == "--version" || name == "--dump-state" || name == "--init-state" || name == "--dry-run" ||
            name == "--list-commands" || name == "--man-page") {
            if (inlineValue) {
                error = "Option '" + name + "' takes no value.";
                return Match::Failed;
            }
            bool& flag = name == "--version"         ? globals_.version
                         : name == "--dump-state"    ? globals_.dumpState
                         : name == "--init-state"    ? globals_.initState
                         : name == "--dry-run"       ? globals_.dryRun
                         : name == "--list-commands" ? globals_.listCommands
                                                     : globals_.manPage;
            flag = true;
            return Match::Taken;
        }
        if (name != "--state" && name != "--host" && name != "--formatter" && name != "--format-param" &&
            name != "--completion" && name != "--list-values") {
            return Match::NotMine;
        }
        std::string value;
        if (!TakeValue(args, i, inlineValue, value)) {
            error = "Option '" + name + "' needs a value.";
            return Match::Failed;
        }
        if (name == "--completion" || name == "--list-values") {
            auto& slot = name == "--completion" ? globals_.completionShell : globals_.valueList;
            if (slot) {
                error = "Option '" + name + "' given more than once.";
                return Match::Failed;
            }
            const std::vector<std::string> shells{"bash", "zsh"};
            if (name == "--completion" && std::find(shells.begin(), shells.end(), value) == shells.end()) {
                error = "Unknown shell " + Quote(value) + " for '--completion': use bash or zsh." +
                        DidYouMean(value, shells);
                return Match::Failed;
            }
            slot = value;
            return Match::Taken;
        }
        if (name == "--state") {
            if (globals_.statePath) {
                error = "Option '--state' given more than once.";
                return Match::Failed;
            }
            if (value.empty()) {
                error = "Option '--state' needs a file name.";
                return Match::Failed;
            }
            globals_.statePath = value;
            return Match::Taken;
        }
        if (name == "--host") {
            if (globals_.hostName) {
                error = "Option '--host' given more than once.";
                return Match::Failed;
            }
            if (value != "sim" && value != "linux") {
                error = "Unknown host " + Quote(value) + ": use sim or linux.";
                return Match::Failed;
            }
            globals_.hostName = value;
            return Match::Taken;
        }
        if (name == "--formatter") {
            if (formatterSeen_) {
                error = "Option '--formatter' given more than once.";
                return Match::Failed;
            }
            if (!ParseFormatter(value)) {
                error = "Unknown formatter " + Quote(value) + ": use table, simple, json or csv." +
                        DidYouMean(value, {"table", "simple", "json", "csv"});
                return Match::Failed;
            }
            formatterSeen_ = true;
            globals_.output.formatter = value;
            return Match::Taken;
        }
        error = ApplyFormatParam(value, globals_, formatKeys_);
        return error.empty() ? Match::Taken : Match::Failed;
    }

private:
    GlobalOptions& globals_;
    bool formatterSeen_ = false;
    std::set<std::string> formatKeys_;
};

// Reads the command's own parameters into an Input, checking each value as it comes.
class ParameterReader {
public:
    ParameterReader(std::shared_ptr<CallSpec::InputSpec> inputs, std::shared_ptr<Input> input)
        : spec_(std::move(inputs)), input_(std::move(input))
    {
    }

    Match Read(const std::vector<std::string>& args, std::size_t& i, std::string& error)
    {
        const std::string& arg = args[i];
        const ParameterSpec* parameter = nullptr;
        std::optional<std::string> inlineValue;
        if (arg.rfind("--", 0) == 0) {
            auto split = SplitLong(arg);
            const std::string& name = split.first;
            parameter =
                Find([&](const ParameterSpec& p) { return !p.GetName().empty() && "--" + p.GetName() == name; });
            inlineValue = std::move(split.second);
        } else {
            parameter = Find(
                [&](const ParameterSpec& p) { return !p.GetShortName().empty() && "-" + p.GetShortName() == arg; });
        }
        if (parameter == nullptr) {
            return Match::NotMine;
        }
        error = Apply(*parameter, args, i, inlineValue);
        return error.empty() ? Match::Taken : Match::Failed;
    }

    // What a mistyped long option most likely meant: one of the command's own parameters or
    // a global option that may follow the path.
    std::string Suggestion(const std::string& arg) const
    {
        if (arg.rfind("--", 0) != 0) {
            return {};
        }
        std::vector<std::string> names;
        for (const auto& parameter : spec_->GetParameters()) {
            if (parameter && !parameter->GetName().empty()) {
                names.push_back("--" + parameter->GetName());
            }
        }
        for (const auto& option : GlobalOptionTable()) {
            if (!option.beforePathOnly) {
                names.push_back(option.longName);
            }
        }
        return DidYouMean(SplitLong(arg).first, names);
    }

    // The first required parameter that was not given, as a message ("" when none).
    std::string CheckRequired() const
    {
        for (const auto& parameter : spec_->GetParameters()) {
            if (parameter->IsRequired() && given_.count(parameter->GetName()) == 0) {
                return "Missing required parameter " + Display(*parameter) + ".";
            }
        }
        return {};
    }

private:
    template <typename Predicate>
    const ParameterSpec* Find(Predicate predicate) const
    {
        for (const auto& parameter : spec_->GetParameters()) {
            if (parameter && predicate(*parameter)) {
                return parameter.get();
            }
        }
        return nullptr;
    }

    static std::string Display(const ParameterSpec& parameter)
    {
        std::string shown = "'--" + parameter.GetName() + "'";
        if (!parameter.GetShortName().empty()) {
            shown += " (-" + parameter.GetShortName() + ")";
        }
        return shown;
    }

    static std::string CheckEnum(const ParameterSpec& parameter, const std::string& value)
    {
        const auto& constraint = parameter.GetConstraint();
        if (!constraint || constraint->GetType() != ParameterConstraintType::StringEnum ||
            constraint->GetStringEnum().empty()) {
            return {};
        }
        std::vector<std::string> allowed;
        for (const auto& entry : constraint->GetStringEnum()) {
            if (entry.first == value) {
                return {};
            }
            allowed.push_back(entry.first);
        }
        return "Invalid value " + Quote(value) + " for '--" + parameter.GetName() + "': must be one of " +
               Text::Join(allowed, ", ") + ".";
    }

    std::string Apply(const ParameterSpec& parameter, const std::vector<std::string>& args, std::size_t& i,
                      const std::optional<std::string>& inlineValue)
    {
        const std::string& name = parameter.GetName();
        const std::string shown = "'--" + name + "'";
        const bool repeated = given_.count(name) != 0;
        if (repeated && parameter.GetType() != ParameterType::StringList) {
            return "Parameter " + shown + " given more than once.";
        }
        given_.insert(name);

        if (parameter.GetType() == ParameterType::Flag) {
            if (inlineValue) {
                return "Parameter " + shown + " is a flag and takes no value.";
            }
            input_->SetFlag(name);
            return {};
        }
        std::string value;
        if (!TakeValue(args, i, inlineValue, value)) {
            return "Missing value for parameter " + shown + ".";
        }
        switch (parameter.GetType()) {
        case ParameterType::Int: {
            const auto number = ParseInt64(value);
            if (!number) {
                return "Invalid value " + Quote(value) + " for " + shown + ": expected a 64-bit decimal integer.";
            }
            const auto& constraint = parameter.GetConstraint();
            if (constraint && constraint->GetType() == ParameterConstraintType::IntRange &&
                (*number < constraint->GetMin() || *number > constraint->GetMax())) {
                return "Invalid value " + Quote(value) + " for " + shown + ": must be between " +
                       std::to_string(constraint->GetMin()) + " and " + std::to_string(constraint->GetMax()) + ".";
            }
            input_->SetParameterInt(name, *number);
            return {};
        }
        case ParameterType::Bool: {
            const auto flag = ParseBool(value);
            if (!flag) {
                return "Invalid value " + Quote(value) + " for " + shown +
                       ": expected true or false (also yes/no, 1/0, on/off).";
            }
            input_->SetParameterBool(name, *flag);
            return {};
        }
        case ParameterType::StringList: {
            const auto entries = Text::SplitCommas(value);
            for (const auto& entry : entries) {
                if (auto problem = CheckEnum(parameter, entry); !problem.empty()) {
                    return problem;
                }
            }
            for (const auto& entry : entries) {
                input_->AddParameterListValue(name, entry);
            }
            return {};
        }
        default: {
            if (auto problem = CheckEnum(parameter, value); !problem.empty()) {
                return problem;
            }
            input_->SetParameter(name, value);
            return {};
        }
        }
    }

    std::shared_ptr<CallSpec::InputSpec> spec_;
    std::shared_ptr<Input> input_;
    std::set<std::string> given_;
};

// What a mistyped global option most likely meant; only options valid where it stands.
std::string GlobalSuggestion(const std::string& arg, bool leading)
{
    if (arg.rfind("--", 0) != 0) {
        return {};
    }
    std::vector<std::string> names;
    for (const auto& option : GlobalOptionTable()) {
        if (leading || !option.beforePathOnly) {
            names.push_back(option.longName);
        }
    }
    return DidYouMean(SplitLong(arg).first, names);
}

std::vector<std::string> ChildNames(const NamespaceNode& node)
{
    std::vector<std::string> names;
    for (const auto& [name, child] : node.GetChildren()) {
        names.push_back(name);
    }
    return names;
}

std::string HelpHint(const CommandPath& path)
{
    return path.empty() ? std::string(" See 'autocli --help'.") : " See 'autocli " + JoinPath(path) + " --help'.";
}

// Reads the global options before the path into the reader's options; returns the index of
// the first argument after them and sets `error` on a usage error.
std::size_t ReadLeadingGlobals(GlobalReader& reader, const GlobalOptions& globals, const std::vector<std::string>& args,
                               std::string& error)
{
    std::size_t i = 0;
    for (; i < args.size() && IsOption(args[i]); ++i) {
        const auto match = reader.Read(args, i, true, error);
        if (match == Match::Failed) {
            error += HelpHint({});
            break;
        }
        if (match == Match::NotMine) {
            error = "Unknown option " + Quote(args[i]) + "." + GlobalSuggestion(args[i], true) + HelpHint({});
            break;
        }
        if (globals.help) {
            ++i;
            break;
        }
    }
    return i;
}

} // namespace

LeadingGlobals ParseLeadingGlobals(const std::vector<std::string>& args)
{
    LeadingGlobals result;
    GlobalReader reader(result.globals);
    result.next = ReadLeadingGlobals(reader, result.globals, args, result.error);
    return result;
}

Invocation ParseCommandLine(const std::shared_ptr<NamespaceNode>& root, const std::vector<std::string>& args)
{
    Invocation inv;
    inv.node = root;
    auto usage = [&](const std::string& message) {
        inv.action = Invocation::Action::UsageError;
        inv.error = message + HelpHint(inv.path);
        return inv;
    };

    // One reader for the whole line, so that an option given both before and after the path
    // counts as given twice.
    GlobalReader globals(inv.globals);
    std::string leadingError;
    const std::size_t next = ReadLeadingGlobals(globals, inv.globals, args, leadingError);
    if (!leadingError.empty()) {
        inv.error = leadingError;
        return inv;
    }
    if (inv.globals.version) {
        inv.action = Invocation::Action::Version;
        return inv;
    }
    if (inv.globals.dumpState) {
        inv.action = Invocation::Action::DumpState;
        return inv;
    }
    if (inv.globals.listCommands || inv.globals.completionShell || inv.globals.valueList || inv.globals.manPage) {
        inv.action = inv.globals.listCommands      ? Invocation::Action::ListCommands
                     : inv.globals.completionShell ? Invocation::Action::Completion
                     : inv.globals.valueList       ? Invocation::Action::ListValues
                                                   : Invocation::Action::ManPage;
        return inv;
    }
    if (inv.globals.help) {
        inv.action = Invocation::Action::Help;
        return inv;
    }

    std::optional<ParameterReader> parameters;
    for (std::size_t i = next; i < args.size(); ++i) {
        const std::string& arg = args[i];
        std::string error;
        // A command's own parameter wins over a global option of the same name.
        if (parameters && IsOption(arg)) {
            const auto match = parameters->Read(args, i, error);
            if (match == Match::Failed) {
                return usage(error);
            }
            if (match == Match::Taken) {
                continue;
            }
        }
        if (IsOption(arg)) {
            const auto match = globals.Read(args, i, false, error);
            if (match == Match::Failed) {
                return usage(error);
            }
            if (match == Match::NotMine) {
                if (inv.command) {
                    return usage("Unknown parameter " + Quote(arg) + " for '" + JoinPath(inv.path) + "'." +
                                 parameters->Suggestion(arg));
                }
                return usage("Unknown option " + Quote(arg) + "." + GlobalSuggestion(arg, false));
            }
            if (inv.globals.help) {
                inv.action = Invocation::Action::Help;
                return inv;
            }
            continue;
        }
        if (inv.command) {
            return usage("Unexpected argument " + Quote(arg) + " after command '" + JoinPath(inv.path) + "'.");
        }
        auto child = inv.node->GetNamespaceNode(arg);
        if (!child) {
            const std::string where =
                inv.path.empty() ? std::string("at the top level") : "in '" + JoinPath(inv.path) + "'";
            return usage("Unknown namespace or command " + Quote(arg) + " " + where + "." +
                         DidYouMean(arg, ChildNames(*inv.node)));
        }
        inv.path.push_back(arg);
        inv.node = child;
        if (auto command = std::dynamic_pointer_cast<Command>(child)) {
            inv.command = command;
            auto declared = command->GetInputSpec();
            inv.input = Input::New();
            inv.input->Declare(declared, JoinPath(inv.path));
            parameters.emplace(std::move(declared), inv.input);
        }
    }

    if (!inv.command) {
        if (inv.path.empty()) {
            return usage("No command given.");
        }
        return usage("'" + JoinPath(inv.path) + "' is a namespace: name one of its commands.");
    }
    if (auto missing = parameters->CheckRequired(); !missing.empty()) {
        return usage(missing);
    }
    inv.outputSpec = inv.command->GetOutputSpec();
    if (inv.globals.output.fields) {
        if (auto problem = CheckFieldSelection(inv.outputSpec->GetRootObject(), *inv.globals.output.fields);
            !problem.empty()) {
            return usage("Invalid --format-param fields: " + problem);
        }
    }
    inv.action = Invocation::Action::Run;
    return inv;
}

} // namespace Quillets::Cli
