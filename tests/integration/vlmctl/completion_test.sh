#!/usr/bin/env bash
# The completions are good bash, and complete what a person begins to type.
#
#   completion_test.sh COMPLETIONS-FOLDER PROGRAMS-FOLDER
set -euo pipefail

completions=$1
export PATH=$2:$PATH
for program in vlmctl vlmbind; do bash -n "$completions/$program"; done

failures=0
# expect WORDS-TO-COME WORD... : completing the last word gives these.
expect() {
    local expected=$1 found
    shift
    found=$(
        # shellcheck source=/dev/null
        source "$completions/$1"
        COMP_WORDS=("$@") COMP_CWORD=$(($# - 1)) COMPREPLY=()
        "_$1"
        echo "${COMPREPLY[*]}"
    )
    [[ $found == "$expected" ]] && return
    echo "FAILED: $* gives \"$found\", not \"$expected\""
    failures=$((failures + 1))
}

expect 'settings set' vlmctl se
expect 'settings get set unset check tokens pairings doctor' vlmctl ''
expect 'enforceSmartCard' vlmctl set enf
expect 'allowSmartCard allowUnmappedUsers' vlmctl get all
expect 'on off' vlmctl --json set UserPairing ''
expect 'none lock logout' vlmctl set tokenRemovalAction ''
expect 'doctor' vlmctl --root /tmp doc
expect '--root' vlmctl doctor --r
expect '' vlmctl tokens ''
expect '--user' vlmctl settings --u
expect '' vlmctl tokens --u
expect 'root' vlmctl pairings --user roo
expect 'root' vlmctl pairings --user = roo
expect 'get' vlmctl --user root ge
expect 'get' vlmctl --user = root ge
expect 'status enable disable' vlmbind -s ''
expect 'root' vlmbind -p -u roo

((failures == 0)) && echo "the completions complete"
exit $((failures > 0))
