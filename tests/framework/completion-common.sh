# shellcheck shell=bash
# Sourced by completion-bash.sh and completion-zsh.sh: the scratch folder, the tally of the
# cases and the closing verdict. The caller sets -u and passes AUTOCLI as its first argument.
# shellcheck disable=SC2034 # read by the script that sources this one
autocli=$(realpath -- "$1")
scratch=$(mktemp -d)
trap 'rm -rf -- "$scratch"' EXIT
failures=0

# One case: its name, the expected offers (sorted, joined by blanks) and the offers it got,
# one a line in any order.
verdict() {
    local name=$1 expected=$2 got
    got=$(LC_ALL=C sort <<<"$3" | tr '\n' ' ' | sed 's/ $//')
    if [[ $got != "$expected" ]]; then
        printf 'FAIL %s\n  expected: [%s]\n  got:      [%s]\n' "$name" "$expected" "$got"
        failures=$((failures + 1))
    else
        printf 'ok   %s\n' "$name"
    fi
}

# The host's volume names include "$(touch pwned)": completing must never have run it.
finish() {
    if [[ -e $scratch/pwned ]]; then
        echo "FAIL a volume name was run as a command"
        failures=$((failures + 1))
    fi
    ((failures == 0)) || { echo "$failures failed"; exit 1; }
}
