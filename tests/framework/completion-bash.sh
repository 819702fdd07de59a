#!/usr/bin/env bash
# Drives the bash completion script that autocli prints, as bash does on <Tab>: COMP_WORDS
# and COMP_CWORD in, COMPREPLY out. Usage: completion-bash.sh AUTOCLI
set -u
# shellcheck source-path=SCRIPTDIR source=completion-common.sh
source "$(dirname -- "${BASH_SOURCE[0]}")/completion-common.sh"

# A host with awkward volume names: a blank, a quote and a command substitution that must
# reach the command line as text, never run.
cat >"$scratch/host.json" <<'JSON'
{"features": {"103": true}, "fileSystems": [
 {"type": "HLFS", "volumeName": "ds one", "uuid": "11111111-aaaa"},
 {"type": "HLFS", "volumeName": "$(touch pwned)", "uuid": "22222222-bbbb"},
 {"type": "HLFS", "volumeName": "it's", "uuid": "33333333-cccc"},
 {"type": "NFS", "volumeName": "nas1", "remoteHost": "srv1", "remoteShare": "/a"},
 {"type": "NFS", "volumeName": "nas-hidden", "remoteHost": "srv3", "remoteShare": "/h", "hidden": true}]}
JSON
# The same host with every feature switch off.
echo '{"features": {}}' >"$scratch/plain.json"

# Each case: a name, the expected offers (sorted, joined by blanks), then the words of the
# command line; the last word is the one being completed. The script is made with the
# global options in `generate`, as a user loads it for one host.
generate=()
check() {
    local name=$1 expected=$2
    shift 2
    verdict "$name" "$expected" "$(
        cd "$scratch" || exit 1
        export XDG_STATE_HOME="$scratch/xdg"
        # shellcheck disable=SC1090
        source <("$autocli" "${generate[@]}" --completion bash) || exit 1
        COMP_WORDS=("$@")
        COMP_CWORD=$((${#COMP_WORDS[@]} - 1))
        COMPREPLY=()
        _autocli
        printf '%s\n' "${COMPREPLY[@]}"
    )"
}

S=$scratch/host.json
P=$scratch/plain.json
check top-level 'storage' "$autocli" ''
check namespaces 'filesystem hlfs internal nfs nfs41' "$autocli" storage ''
check deep-prefix 'set' "$autocli" storage hlfs reclaim config s
check namespace-after-globals 'extent host lockmode pbcache reclaim snapshot unmap upgrade' \
    "$autocli" --state "$S" --formatter json storage hlfs ''
check command-options '--format-param --formatter --help --no-persist --volume-label --volume-uuid' \
    "$autocli" storage filesystem mount --
check short-options '--format-param --formatter --help --no-persist --volume-label --volume-uuid -h -l -n -u' \
    "$autocli" storage filesystem mount -
check leading-globals-only-before-path '--dry-run --dump-state' "$autocli" --d
check formatter-values 'json' "$autocli" --formatter j
check completion-shells 'bash zsh' "$autocli" --completion ''
check enum-values 'fixed priority' "$autocli" storage hlfs reclaim config set --reclaim-method ''
check enum-after-equals 'high' "$autocli" storage hlfs reclaim config set --reclaim-priority = h
check bool-values 'false true' "$autocli" storage internal clusteredhdsk set -e ''
check labels-from-state "\\\$\\(touch\\ pwned\\) ds\\ one it\\'s nas-hidden nas1" \
    "$autocli" --state "$S" storage filesystem mount --volume-label ''
check labels-prefix 'ds\ one' "$autocli" --state "$S" storage filesystem unmount -l d
PATH=$(dirname -- "$autocli"):$PATH check found-by-name 'ds\ one' autocli --state "$S" storage filesystem mount -l d
check labels-state-with-equals 'ds\ one' "$autocli" --state = "$S" storage filesystem mount -l d
check uuids-from-state '22222222-bbbb' "$autocli" --state "$S" storage filesystem mount -u 22
check nfs-names-skip-hidden 'nas1' "$autocli" --state "$S" storage nfs remove --volume-name ''
generate=(--state "$S")
check switch-on-offers-connections '-c' "$autocli" storage nfs add -c
generate=(--state "$P")
check switch-off-hides-connections '' "$autocli" storage nfs add -c
generate=()
check value-is-not-a-path 'filesystem' "$autocli" --formatter storage storage f
check unknown-word-offers-nothing '' "$autocli" storage bogus ''
check after-command-no-words '' "$autocli" storage filesystem rescan ''
mkdir "$scratch/files" && touch "$scratch/files/host.json"
check state-file-names 'files/host.json' "$autocli" --state files/ho

finish
