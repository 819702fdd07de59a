#include "framework/Completion.h"

#include <vector>

#include "framework/GlobalOptions.h"
#include "framework/Text.h"
#include "framework/TreeWalk.h"
#include "quillets/CallSpec.h"

namespace Quillets::Cli {

using AutoCli::Command;
using AutoCli::NamespaceNode;
using CallSpec::ParameterConstraintType;
using CallSpec::ParameterType;

namespace {

// One word as a shell reads it back unchanged, in bash and in zsh alike.
std::string ShellWord(const std::string& text)
{
    std::string quoted = "'";
    for (const char c : text) {
        quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    }
    return quoted + "'";
}

std::string WordArray(const std::vector<std::string>& words)
{
    std::string out = "(";
    for (std::size_t i = 0; i < words.size(); ++i) {
        out += (i == 0 ? "" : " ") + ShellWord(words[i]);
    }
    return out + ")";
}

// How an option's value completes, as the script's __autocli_value reports it.
struct ValueRule {
    std::string kind;               // none, any, file, choice or host
    std::vector<std::string> words; // the choices, or the host value kind
};

std::string ValueBranch(const std::vector<std::string>& patterns, const ValueRule& rule)
{
    std::string out = "        ";
    for (std::size_t i = 0; i < patterns.size(); ++i) {
        out += (i == 0 ? "" : "|") + ShellWord(patterns[i]);
    }
    out += ") __autocli_kind=" + rule.kind;
    if (!rule.words.empty()) {
        out += "; __autocli_w=" + WordArray(rule.words);
    }
    return out + "; return;;\n";
}

// The parts both shells share: what the tree offers at each path, as plain case tables.
std::string TreeFunctions(const std::shared_ptr<NamespaceNode>& root, const ValueSources& sources)
{
    std::string children = "__autocli_children() {\n    case \"$1\" in\n";
    std::string options = "__autocli_options() {\n    case \"$1\" in\n";
    std::string values = "__autocli_value() {\n    __autocli_w=()\n    case \"$1|$2\" in\n";
    ForEachNode(root, [&](const CommandPath& path, const std::shared_ptr<NamespaceNode>& node) {
        const std::string where = JoinPath(path);
        if (auto command = std::dynamic_pointer_cast<Command>(node)) {
            std::vector<std::string> names;
            const auto inputs = command->GetInputSpec();
            for (const auto& parameter : inputs->GetParameters()) {
                if (!parameter || parameter->GetName().empty()) {
                    continue;
                }
                std::vector<std::string> spellings{"--" + parameter->GetName()};
                if (!parameter->GetShortName().empty()) {
                    spellings.push_back("-" + parameter->GetShortName());
                }
                ValueRule rule{parameter->GetType() == ParameterType::Flag ? "none" : "any", {}};
                const auto& constraint = parameter->GetConstraint();
                if (auto source = sources.find(parameter->GetName()); source != sources.end() && rule.kind == "any") {
                    rule = {"host", {source->second}};
                } else if (constraint && constraint->GetType() == ParameterConstraintType::StringEnum &&
                           !constraint->GetStringEnum().empty()) {
                    rule.kind = "choice";
                    for (const auto& entry : constraint->GetStringEnum()) {
                        rule.words.push_back(entry.first);
                    }
                } else if (parameter->GetType() == ParameterType::Bool) {
                    rule = {"choice", {"true", "false"}};
                }
                std::vector<std::string> patterns;
                for (const auto& spelling : spellings) {
                    names.push_back(spelling);
                    patterns.push_back(where + "|" + spelling);
                }
                values += ValueBranch(patterns, rule);
            }
            options += "        " + ShellWord(where) + ") __autocli_w=" + WordArray(names) + "; return 0;;\n";
            return;
        }
        std::vector<std::string> names;
        for (const auto& [name, child] : node->GetChildren()) {
            names.push_back(name);
        }
        children += "        " + ShellWord(where) + ") __autocli_w=" + WordArray(names) + ";;\n";
    });
    children += "        *) __autocli_w=();;\n    esac\n}\n";
    options += "    esac\n    __autocli_w=()\n    return 1\n}\n";

    // Global options last: a command's own parameter of the same name wins, as it does on
    // the command line.
    std::vector<std::string> leading;
    std::vector<std::string> anywhere;
    values += "    esac\n    case \"$2\" in\n";
    for (const auto& option : GlobalOptionTable()) {
        std::vector<std::string> spellings{option.longName};
        if (!option.shortName.empty()) {
            spellings.push_back(option.shortName);
        }
        for (const auto& spelling : spellings) {
            leading.push_back(spelling);
            if (!option.beforePathOnly) {
                anywhere.push_back(spelling);
            }
        }
        ValueRule rule{"none", {}};
        if (!option.value.empty()) {
            rule = option.fileValue         ? ValueRule{"file", {}}
                   : option.choices.empty() ? ValueRule{"any", {}}
                                            : ValueRule{"choice", option.choices};
        }
        values += ValueBranch(spellings, rule);
    }
    values += "    esac\n    __autocli_kind=none\n}\n";

    std::string globals = "__autocli_globals() {\n    if [[ -z $1 ]]; then\n        __autocli_w=" + WordArray(leading) +
                          "\n    else\n        __autocli_w=" + WordArray(anywhere) + "\n    fi\n}\n";

    return "# __autocli_children PATH: the namespaces and commands under PATH, in __autocli_w.\n" + children +
           "\n# __autocli_options PATH: the parameters of the command at PATH; fails for a namespace.\n" + options +
           "\n# __autocli_value PATH OPTION: how OPTION's value completes, in __autocli_kind: none (it\n"
           "# takes no value), any, file, choice (the words in __autocli_w) or host (the values of the\n"
           "# host that 'autocli --list-values' prints for the word in __autocli_w).\n" +
           values + "\n# __autocli_globals PATH: the global options that may stand after PATH.\n" + globals;
}

// How a shell holds the words of the command line: the expansion of word i is
// open + i + close; words before the cursor run from `first` to below `last`.
struct ShellWords {
    std::string open;
    std::string close;
    std::string first;
    std::string last;
    bool splitsAtEquals = false; // bash hands "--name=value" over as three words
};

// Walking the words before the cursor: the path so far, whether it names a command, the
// option whose value is being typed, and the options that choose the host.
std::string WalkWords(const ShellWords& words)
{
    const std::string& last = words.last;
    const bool splitsAtEquals = words.splitsAtEquals;
    auto at = [&](const std::string& index) { return words.open + index + words.close; };
    std::string out;
    out += "    for ((i = " + words.first + "; i < " + last + "; i++)); do\n";
    out += "        word=" + at("i") + "\n";
    if (!splitsAtEquals) {
        out += "        if [[ $word == --*=* ]]; then\n"
               "            __autocli_remember \"${word%%=*}\" \"${word#*=}\"\n"
               "            continue\n"
               "        fi\n";
    }
    out += "        if [[ $word == -?* ]]; then\n"
           "            __autocli_value \"$cmdpath\" \"$word\"\n"
           "            [[ $__autocli_kind == none ]] && continue\n";
    if (splitsAtEquals) {
        out += "            if ((i + 1 < " + last + ")) && [[ " + at("i + 1") +
               " == = ]]; then\n"
               "                ((i++))\n"
               "            fi\n";
    }
    out += "            if ((i + 1 >= " + last +
           ")); then\n"
           "                opt=$word\n"
           "                break\n"
           "            fi\n"
           "            ((i++))\n"
           "            __autocli_remember \"$word\" \"" +
           at("i") +
           "\"\n"
           "            continue\n"
           "        fi\n"
           "        ((command || lost)) && continue\n"
           "        __autocli_children \"$cmdpath\"\n"
           "        lost=1\n"
           "        for c in \"${__autocli_w[@]}\"; do\n"
           "            if [[ $c == \"$word\" ]]; then\n"
           "                cmdpath=${cmdpath:+$cmdpath }$word\n"
           "                lost=0\n"
           "                break\n"
           "            fi\n"
           "        done\n"
           "        ((lost)) || ! __autocli_options \"$cmdpath\" || command=1\n"
           "    done\n";
    return out;
}

// Keeps the options that choose the host, so that host values come from the same host.
const char* const kRemember = R"(# __autocli_remember OPTION VALUE: keeps --state and --host for the host value look-up.
__autocli_remember() {
    local value=$2
    [[ -n $cmdpath ]] && return
    [[ $1 == --state || $1 == --host ]] || return
    [[ $value == '~/'* ]] && value=$HOME/${value#'~/'}
    hostargs+=("$1" "$value")
}

# __autocli_program: the autocli being completed, as the shell will find it.
__autocli_program() {
    REPLY=$1
    [[ $REPLY == '~/'* ]] && REPLY=$HOME/${REPLY#'~/'}
}
)";

std::string BashScript(const std::shared_ptr<NamespaceNode>& root, const ValueSources& sources)
{
    std::string out = "# bash completion for autocli, made from its command tree by 'autocli --completion bash'.\n"
                      "# Load it with: source <(autocli --completion bash)\n\n";
    out += TreeFunctions(root, sources) + "\n" + kRemember;
    out += R"(
# __autocli_add WORD...: offers the words that start with what is typed.
__autocli_add() {
    local w
    for w in "$@"; do
        [[ $w == "$cur"* ]] && COMPREPLY+=("$w")
    done
}

# __autocli_host KIND: offers the host's values, each quoted for the shell; they come from
# autocli itself and are never evaluated.
__autocli_host() {
    local line quoted typed=${cur//\\/}
    typed=${typed#[\"\']}
    __autocli_program "${COMP_WORDS[0]}"
    while IFS= read -r line; do
        [[ $line == "$typed"* ]] || continue
        printf -v quoted '%q' "$line"
        COMPREPLY+=("$quoted")
    done < <("$REPLY" "${hostargs[@]}" --list-values "$1" 2>/dev/null)
}

_autocli() {
    local cur=${COMP_WORDS[COMP_CWORD]} cmdpath='' opt='' word c i REPLY
    local command=0 lost=0 __autocli_kind
    local -a hostargs=() __autocli_w=()
    COMPREPLY=()
)";
    out += WalkWords({"${COMP_WORDS[", "]}", "1", "COMP_CWORD", true});
    out += R"(    ((lost)) && return 0
    if [[ -n $opt ]]; then
        [[ $cur == = ]] && cur=''
        __autocli_value "$cmdpath" "$opt"
        case $__autocli_kind in
        file)
            compopt -o filenames 2>/dev/null
            mapfile -t COMPREPLY < <(compgen -f -- "$cur")
            ;;
        choice) __autocli_add "${__autocli_w[@]}" ;;
        host) __autocli_host "${__autocli_w[0]}" ;;
        esac
        return 0
    fi
    if [[ $cur == -* ]]; then
        local -a offered=()
        ((command)) && __autocli_options "$cmdpath" && offered=("${__autocli_w[@]}")
        __autocli_globals "$cmdpath"
        __autocli_add "${offered[@]}" "${__autocli_w[@]}"
    elif ((!command)); then
        __autocli_children "$cmdpath"
        __autocli_add "${__autocli_w[@]}"
    fi
    return 0
}

complete -F _autocli autocli
)";
    return out;
}

std::string ZshScript(const std::shared_ptr<NamespaceNode>& root, const ValueSources& sources)
{
    std::string out = "#compdef autocli\n"
                      "# zsh completion for autocli, made from its command tree by 'autocli --completion zsh'.\n"
                      "# Load it with: source <(autocli --completion zsh)  (after compinit)\n\n";
    out += TreeFunctions(root, sources) + "\n" + kRemember;
    out += R"(
_autocli() {
    local cur=${words[CURRENT]} cmdpath='' opt='' word c i REPLY
    local command=0 lost=0 __autocli_kind
    local -a hostargs __autocli_w offered values
)";
    out += WalkWords({"${(Q)words[", "]}", "2", "CURRENT", false});
    out += R"(    ((lost)) && return 1
    if [[ -z $opt && $cur == --*=* ]]; then
        opt=${cur%%=*}
        compset -P '*='
    fi
    if [[ -n $opt ]]; then
        __autocli_value "$cmdpath" "$opt"
        case $__autocli_kind in
        file) _files ;;
        choice) compadd -- "${__autocli_w[@]}" ;;
        host)
            __autocli_program "${(Q)words[1]}"
            values=("${(@f)$("$REPLY" "${hostargs[@]}" --list-values "${__autocli_w[1]}" 2>/dev/null)}")
            compadd -- "${values[@]}"
            ;;
        esac
        return 0
    fi
    if [[ $cur == -* ]]; then
        ((command)) && __autocli_options "$cmdpath" && offered=("${__autocli_w[@]}")
        __autocli_globals "$cmdpath"
        compadd -- "${offered[@]}" "${__autocli_w[@]}"
    elif ((!command)); then
        __autocli_children "$cmdpath"
        compadd -- "${__autocli_w[@]}"
    fi
    return 0
}

if [[ ${funcstack[1]} == _autocli ]]; then
    _autocli "$@"
else
    compdef _autocli autocli
fi
)";
    return out;
}

} // namespace

std::string CompletionScript(const std::string& shell, const std::shared_ptr<NamespaceNode>& root,
                             const ValueSources& sources)
{
    if (shell == "bash") {
        return BashScript(root, sources);
    }
    if (shell == "zsh") {
        return ZshScript(root, sources);
    }
    return {};
}

} // namespace Quillets::Cli
