#!/usr/bin/env bash
# The manual page the build wrote: groff renders it without a single warning, it is what
# autocli makes on the demo host, and it covers every command, global option and variable.
# Usage: man-page.sh AUTOCLI PAGE
set -u
autocli=$1
page=$2
scratch=$(mktemp -d)
trap 'rm -rf -- "$scratch"' EXIT
failures=0
fail() {
    echo "FAIL $*"
    failures=$((failures + 1))
}

if ! command -v groff >/dev/null; then
    echo "groff is not installed (scripts/bootstrap installs it): skipped"
    exit 77
fi
[[ -s $page ]] || { echo "FAIL no manual page at $page"; exit 1; }

LC_ALL=C.UTF-8 groff -man -ww -Tutf8 "$page" >"$scratch/page.txt" 2>"$scratch/warnings"
[[ -s $scratch/warnings ]] && fail "groff warned:" && cat "$scratch/warnings"
# Plain text of the page: no overstriking for bold and underline.
sed 's/.\x08//g' "$scratch/page.txt" >"$scratch/plain.txt"

# Made on the demo host, whatever the builder's own state: a fresh home gives the same page.
(
    unset AUTOCLI_STATE AUTOCLI_HOST AUTOCLI_JOURNAL AUTOCLI_PLUGIN_PATH
    HOME=$scratch/home XDG_STATE_HOME=$scratch/home/state "$autocli" --man-page >"$scratch/again.1"
) || fail "autocli --man-page failed"
cmp -s "$page" "$scratch/again.1" || fail "the built page differs from 'autocli --man-page' on the demo host"

# Every command has its section, in the order --list-commands prints them.
(unset AUTOCLI_STATE; HOME=$scratch/home XDG_STATE_HOME=$scratch/home/state "$autocli" --list-commands) >"$scratch/commands"
[[ $(wc -l <"$scratch/commands") -ge 10 ]] || fail "too few commands listed"
grep -E '^   [a-z]' "$scratch/plain.txt" | sed 's/^ *//' | grep -Fx -f "$scratch/commands" >"$scratch/sections"
cmp -s "$scratch/commands" "$scratch/sections" || fail "command sections differ from --list-commands:" \
    "$(diff "$scratch/commands" "$scratch/sections")"

for expected in --state --host --formatter --format-param --help --version --dump-state --init-state --dry-run \
    --list-commands --completion AUTOCLI_STATE AUTOCLI_JOURNAL AUTOCLI_PLUGIN_PATH AUTOCLI_LOCK_TIMEOUT \
    XDG_STATE_HOME AUTOCLI_HOST 'SYNOPSIS' 'ENVIRONMENT' 'FILES' 'EXIT STATUS' 'EXAMPLES' \
    '--volume-label str' 'Result: a list of'; do
    grep -qF -- "$expected" "$scratch/plain.txt" || fail "the page does not show '$expected'"
done
# Option names are written with minus signs (\-), which every groff prints as ASCII, so that
# they can be copied; a bare hyphen there may print as a typographic one.
if grep -nE '(^|[ (]|\\f[BIR])-' "$page" | grep -v '^[0-9]*:\.' >"$scratch/hyphens"; then
    fail "option names with bare hyphens:" "$(head -3 "$scratch/hyphens")"
fi

((failures == 0)) || { echo "$failures failed"; exit 1; }
echo ok
