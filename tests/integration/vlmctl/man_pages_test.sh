#!/usr/bin/env bash
# The manual pages are clean, and tell of every option and key that there is.
#
#   man_pages_test.sh SOURCE-FOLDER VLMCTL
set -euo pipefail

source=$1 vlmctl=$2
cd "$source/docs/man"
command -v mandoc >/dev/null || { echo "SKIPPED: there is no mandoc here"; exit 77; }

failures=0
fail() {
    printf 'FAILED: %s\n' "$*"
    failures=$((failures + 1))
}

is_clean() {  # PAGE
    local complaints
    # Which pages of others are installed, and known to mandoc, says nothing about this one.
    complaints=$(mandoc -T lint "$1" 2>&1 |
        grep -vE 'referenced manual not found|outdated mandoc.db lacks' || true)
    [[ -z $complaints ]] || fail "$complaints"
}

refers_to_pages_of_ours_that_exist() {  # PAGE
    local name section
    while read -r name section; do
        [[ $name != vlm* && $name != Smartcard* || -f $name.$section ]] ||
            fail "$1 refers to $name($section)"
    done < <(sed -nE 's/^\.Xr ([^ ]+) ([0-9]).*/\1 \2/p' "$1")
}

tells() {  # PAGE LINE-PATTERN
    grep -qE -- "$2" "$1" || fail "$1 does not tell of $2"
}

for page in *.[0-9]; do
    is_clean "$page"
    refers_to_pages_of_ours_that_exist "$page"
done

# Two settings may stand in one line of the table.
settings=$(grep -oE 'KnownSetting\{"[A-Za-z]+", [01]' "$source/settings/known_settings.h")
[[ $(wc -l <<<"$settings") -ge 7 ]] || fail "the known settings were not found"
while IFS='"' read -r _ key default; do
    state=off
    [[ $default == ', 1' ]] && state=on
    tells SmartcardLogin.plist.5 "^\.It Cm $key Pq default: $state\$"
done <<<"$settings"

for option in $("$vlmctl" --help | grep -oE -- '--[a-z-]+' | sort -u); do
    tells vlmctl.1 "^\.It .*Fl -${option#--}( |\$)"
done
for word in settings get set unset check tokens pairings doctor; do tells vlmctl.1 "^\.It Cm $word"; done
letters=$(sed -nE 's/.*kOptions = "\+([a-z:]+)".*/\1/p' "$source/tool/options.cpp")
[[ $letters ]] || fail "the options of vlmbind were not found"
while read -rn 1 letter; do
    [[ $letter == [a-z] ]] && tells vlmbind.1 "^\.It Fl $letter( |\$)"
done <<<"$letters"

((failures == 0)) && echo "the manual pages are clean and tell of everything"
exit $((failures > 0))
