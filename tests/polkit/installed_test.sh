#!/usr/bin/env bash
# The policy file comes to where polkit looks for it, as it is.
#
#   installed_test.sh CMAKE BUILD-FOLDER POLICY-FILE
set -euo pipefail

folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

"$1" --install "$2/resources/polkit" --prefix "$folder" >/dev/null
cmp "$3" "$folder/share/polkit-1/actions/org.vlm.vlmbind.policy"
