#!/usr/bin/env bash
# Listing the commands, printing completion scripts or the manual page, and the value look-up
# the completion scripts make only read: on the default state they create no file and no
# folder. Usage: creates-nothing.sh AUTOCLI
set -u
autocli=$1
scratch=$(mktemp -d)
trap 'rm -rf -- "$scratch"' EXIT
unset AUTOCLI_STATE AUTOCLI_HOST AUTOCLI_JOURNAL
export HOME=$scratch/home XDG_STATE_HOME=$scratch/state
mkdir "$HOME"
failures=0
for run in '--list-commands' '--completion bash' '--completion zsh' '--list-values volume-label' '--man-page'; do
    # shellcheck disable=SC2086 # the words of each run are split on purpose
    if ! "$autocli" $run >/dev/null 2>"$scratch/err"; then
        echo "FAIL autocli $run failed: $(cat "$scratch/err")"
        failures=$((failures + 1))
    fi
    left=$(find "$HOME" "$XDG_STATE_HOME" -mindepth 1 2>/dev/null)
    if [[ -n $left || -e $XDG_STATE_HOME ]]; then
        printf 'FAIL autocli %s created:\n%s\n' "$run" "$(find "$XDG_STATE_HOME" "$HOME" 2>/dev/null)"
        failures=$((failures + 1))
        rm -rf -- "$XDG_STATE_HOME" && mkdir -p "$HOME"
    fi
done
((failures == 0)) || { echo "$failures failed"; exit 1; }
echo ok
