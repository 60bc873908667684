#!/usr/bin/env bash
# Installs libvlm and what belongs to it, and uses it as a stranger would.
#
#   CXX=COMPILER CXXFLAGS=FLAGS install_test.sh CMAKE BUILD-FOLDER EXAMPLE-FOLDER
set -euo pipefail

cmake=$1 build=$2 example=$3
here=$(cd "$(dirname "$0")" && pwd)
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
# The flags are words of a command line.
read -ra flags <<<"${CXXFLAGS:-}"
export LC_ALL=C
unset VLM_LOG_TARGET VLM_LOG_LEVEL

fail() {
    printf 'FAILED: %s\n' "$*" >&2
    exit 1
}

# Nothing may remember where it was installed to.
"$cmake" --install "$build" --prefix "$folder/first" --component libvlm >/dev/null
"$cmake" --install "$build" --prefix "$folder/first" --component devel >/dev/null
mv "$folder/first" "$folder/prefix"
prefix=$folder/prefix
library=$(find "$prefix" -name 'libvlm.so.*.*')
libraries=$(dirname "$library")
headers=$(dirname "$(find "$prefix" -path '*/hints/hints_client.h' -printf '%h\n')")
grep -rIl "$folder/first" "$prefix" && fail "these files name the prefix"

exported() { nm --dynamic --defined-only "$library" | sed 's/^[^ ]* . //; s/@.*//' | c++filt | sort -u; }

exports_nothing_but_its_interface() {
    local functions expected others
    functions=$(exported | sed -n 's/^\(VL[A-Za-z]*\)(.*/\1/p')
    expected=$(sort "$here/exported_functions.txt")
    [[ $functions == "$expected" ]] ||
        fail "exported functions differ:" "$(diff <(echo "$expected") <(echo "$functions"))"
    others=$(exported | grep -vE \
        -e '^VL[A-Za-z]+\(' \
        -e '^LIBVLM_0$' \
        -e '^vlm::platform::(String|PropertyList)::' \
        -e '^vlm::platform::(readPropertyList|writeBinaryPropertyList)\(' || true)
    [[ -z $others ]] || fail "exported, and should not be: $others"
}

every_header_stands_alone() {
    local header
    while IFS= read -r header; do
        "$CXX" -std=c++20 -Wall -Wextra -Wpedantic -Werror -I "$headers" -x c++ \
            -fsyntax-only - <<<"#include <$header>" || fail "$header does not stand alone"
    done < <(find "$headers" -name '*.h' -printf '%P\n')
}

build_with_cmake() {
    {
        "$cmake" -G Ninja -S "$example" -B "$folder/cmake" -DCMAKE_PREFIX_PATH="$prefix" &&
            "$cmake" --build "$folder/cmake"
    } >"$folder/log" 2>&1 || fail "the example cannot be built with CMake: $(cat "$folder/log")"
}

build_with_pkg_config() {
    local used
    export PKG_CONFIG_PATH=$libraries/pkgconfig
    mkdir "$folder/pkg-config"
    read -ra used < <(pkg-config --cflags --libs libvlm)
    "$CXX" -std=c++20 "${flags[@]}" "$example/list_tokens.cpp" "${used[@]}" \
        -o "$folder/pkg-config/list_tokens" || fail "the example cannot be built with pkg-config"
}

# Without a bus the service cannot answer; the program must be told so.
says_that_nobody_answers() {  # PROGRAM
    local output status=0
    output=$(DBUS_SYSTEM_BUS_ADDRESS=unix:path=$folder/none \
        DBUS_SESSION_BUS_ADDRESS=unix:path=$folder/none \
        LD_LIBRARY_PATH=$libraries "$1" alice 2>&1) || status=$?
    [[ $status == 1 && $output == "The hints service gave no answer." ]] ||
        fail "$1 ended with $status and printed: $output"
}

exports_nothing_but_its_interface
every_header_stands_alone
build_with_cmake
says_that_nobody_answers "$folder/cmake/list_tokens"
build_with_pkg_config
says_that_nobody_answers "$folder/pkg-config/list_tokens"
echo "libvlm serves other programs"
