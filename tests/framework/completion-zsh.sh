#!/usr/bin/env bash
# The zsh completion script that autocli prints: it must parse, and its completion function,
# called as zsh's completion system would call it (words, CURRENT), must offer the right
# words. compadd, compset and _files are the completion system's; they are stood in for here
# so the function runs outside an interactive shell. Usage: completion-zsh.sh AUTOCLI
set -u
# shellcheck source-path=SCRIPTDIR source=completion-common.sh
source "$(dirname -- "${BASH_SOURCE[0]}")/completion-common.sh"
if ! command -v zsh >/dev/null; then
    echo "zsh is not installed (scripts/bootstrap installs it): skipped"
    exit 77
fi
export XDG_STATE_HOME="$scratch/xdg"
cat >"$scratch/host.json" <<'JSON'
{"fileSystems": [{"type": "HLFS", "volumeName": "ds one", "uuid": "11111111-aaaa"},
                 {"type": "HLFS", "volumeName": "$(touch pwned)", "uuid": "22222222-bbbb"}]}
JSON
"$autocli" --completion zsh >"$scratch/autocli.zsh" || exit 1
zsh -n "$scratch/autocli.zsh" || { echo "FAIL the script does not parse"; exit 1; }

# Each case: a name, the expected offers (sorted, joined by blanks), then the words.
check() {
    local name=$1 expected=$2
    shift 2
    verdict "$name" "$expected" "$(cd "$scratch" && zsh -f -c '
        compdef() { :; }
        compset() { PREFIX=${PREFIX#*=}; }
        _files() { print -r -- "<files>"; }
        compadd() {
            [[ $1 == -- ]] && shift
            local w
            for w in "$@"; do [[ $w == ${PREFIX}* ]] && print -r -- "$w"; done
        }
        source ./autocli.zsh
        words=("$@")
        CURRENT=$#
        PREFIX=${words[CURRENT]}
        _autocli' zsh "$@")"
}

S=$scratch/host.json
check top-level 'storage' "$autocli" ''
check deep-prefix 'set' "$autocli" storage hlfs reclaim config s
check command-options '--format-param --formatter --help --no-persist --volume-label --volume-uuid' \
    "$autocli" storage filesystem mount --
check enum-values 'fixed priority' "$autocli" storage hlfs reclaim config set -m ''
check enum-after-equals 'high' "$autocli" storage hlfs reclaim config set --reclaim-priority=h
check labels-from-state '$(touch pwned) ds one' "$autocli" --state "$S" storage filesystem mount -l ''
# Run by name, autocli is looked up in PATH, which the script must leave alone.
PATH=$(dirname -- "$autocli"):$PATH check found-by-name 'ds one' autocli --state "$S" storage filesystem mount -l d
check state-with-equals 'ds one' "$autocli" --state="$S" storage filesystem unmount --volume-label d
check state-file '<files>' "$autocli" --state ''
check unknown-word-offers-nothing '' "$autocli" storage bogus ''

finish
