#!/usr/bin/env bash
# No program or library looks for its libraries in the folder that it happens to be started in, or in
# any other that is not its own.
#
#   search_paths_test.sh BUILD-FOLDER
set -euo pipefail

status=0
for file in "$1"/bin/* "$1"/lib/libvlm.so "$1"/lib/vlm/*.so; do
    path=$(readelf -d "$file" | sed -n 's/.*R[UN]*PATH.*\[\(.*\)\]/\1:/p')
    while [[ $path ]]; do
        element=${path%%:*}
        path=${path#*:}
        if [[ $element != "\$ORIGIN/../lib"* ]]; then
            echo "$file looks for libraries in \"$element\"" >&2
            status=1
        fi
    done
done
exit "$status"
