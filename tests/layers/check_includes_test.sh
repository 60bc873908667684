#!/usr/bin/env bash
# The include check finds each kind of broken rule: a tree with one fault at a time must fail, and
# the same tree without it must pass.
set -euo pipefail

check=$(cd "$(dirname "$0")" && pwd)/check_includes.sh
tree=$(mktemp -d)
trap 'rm -rf "$tree"' EXIT
mkdir -p "$tree"/{platform/linux,hints,settings,util,bind,ui,tool,services/hints,services/vlmctl}

plant() {  # FILE INCLUDE
    printf '#include <vector>\n#include "platform/types.h"\n' >"$tree/tool/good.cpp"
    printf '  #  include %s\n' "$2" >"$tree/$1"
}

failures=0
expect() {  # pass|fail FILE INCLUDE
    plant "$2" "$3"
    local outcome=pass
    "$check" "$tree" >/dev/null || outcome=fail
    if [[ $outcome != "$1" ]]; then
        echo "$2 with $3: expected $1, got $outcome"
        failures=$((failures + 1))
    fi
    rm "$tree/$2"
}

expect pass tool/a.cpp '"bind/bind_operation.h"'
expect pass ui/a.cpp '"bind/pairing_dialog.h"'
expect pass ui/a.cpp '"platform/windowing.h"'
expect pass tool/options.cpp '<unistd.h>'
expect pass platform/linux/a.cpp '<systemd/sd-bus.h>'
expect pass services/hints/a.cpp '"platform/linux/sd_bus_message.h"'
expect pass services/hints/a.cpp '"settings/known_settings.h"'
expect pass services/vlmctl/a.cpp '"bind/token_info.h"'
expect pass services/vlmctl/a.cpp '"settings/known_settings.h"'
expect fail services/vlmctl/a.cpp '"tool/console.h"'
expect fail tool/a.cpp '<unistd.h>'
expect fail tool/a.cpp '<systemd/sd-bus.h>'
expect fail tool/a.cpp '"platform/linux/sd_bus_message.h"'
expect fail tool/a.cpp '"services/hints/status.h"'
expect fail bind/a.h '"tool/console.h"'
expect fail bind/a.cpp '"ui/bind_dialog.h"'
expect fail ui/a.cpp '<QWidget>'
expect fail ui/a.cpp '"tool/console.h"'
expect fail ui/a.cpp '"platform/linux/loaded_windowing.h"'
expect fail hints/a.cpp '"settings/smartcard_settings.h"'
expect fail platform/a.h '<openssl/evp.h>'
expect fail platform/a.h '"hints/hints_client.h"'
expect fail platform/linux/a.cpp '"hints/hints_client.h"'
expect fail services/hints/a.cpp '"bind/bind_operation.h"'
expect fail services/hints/a.cpp '"hints/hints_client.h"'
expect fail util/a.cpp '"a_file_beside_me.h"'

((failures == 0)) && echo "each broken rule is found"
exit "$failures"
