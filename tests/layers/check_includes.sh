#!/usr/bin/env bash
# Checks who includes whom: check_includes.sh [ROOT]
#
# An arrow only ever points down. The upper floors know the C++ standard library, the headers of
# platform/ and the floors below them; libraries live in platform/linux/ and services/. Prints each
# include that breaks this, and ends with 1 when there was one.
set -euo pipefail

root=${1:-.}
cd "$root"

# Lowest first.
floors=(platform hints settings util bind ui tool)

standard_headers=" algorithm any array atomic barrier bit bitset cassert cctype cerrno cfenv cfloat
 charconv chrono cinttypes climits clocale cmath codecvt compare complex concepts condition_variable
 coroutine csetjmp csignal cstdarg cstddef cstdint cstdio cstdlib cstring ctime cuchar cwchar cwctype
 deque exception execution filesystem format forward_list fstream functional future initializer_list
 iomanip ios iosfwd iostream istream iterator latch limits list locale map memory memory_resource
 mutex new numbers numeric optional ostream queue random ranges ratio regex scoped_allocator
 semaphore set shared_mutex source_location span sstream stack stdexcept stop_token streambuf string
 string_view syncstream system_error thread tuple type_traits typeindex typeinfo unordered_map
 unordered_set utility valarray variant vector version "

broken=0
complain() {
    printf '%s includes %s: %s\n' "$1" "$2" "$3"
    broken=1
}

is_standard() { [[ "${standard_headers//$'\n'/ }" == *" $1 "* ]]; }

floor_number() {
    local i
    for i in "${!floors[@]}"; do
        [[ ${floors[$i]} == "$1" ]] && { echo "$i"; return; }
    done
    echo -1
}

check_upper() {  # FILE FLOOR-NUMBER INCLUDE
    local file=$1 own=$2 include=$3 target number
    if [[ $include == \<* ]]; then
        target=${include:1:-1}
        is_standard "$target" && return
        # The one exception: the POSIX option parser in the command line.
        [[ $target == unistd.h && $file == tool/options.cpp ]] && return
        complain "$file" "$include" "an upper floor knows the standard library only"
        return
    fi
    target=${include:1:-1}
    if [[ $target == platform/linux/* || $target == services/* || $target == tests/* ]]; then
        complain "$file" "$include" "an upper floor knows the platform by its interfaces only"
        return
    fi
    number=$(floor_number "${target%%/*}")
    if ((number < 0)); then
        complain "$file" "$include" "no floor of this house"
    elif ((number > own)); then
        complain "$file" "$include" "a lower floor never knows a higher one"
    fi
}

check_lower() {  # FILE INCLUDE ALLOWED-FOLDER...
    local file=$1 include=$2 target folder
    shift 2
    [[ $include == \<* ]] && return
    target=${include:1:-1}
    for folder in "$@"; do [[ $target == "$folder"/* ]] && return; done
    complain "$file" "$include" "this folder knows only: $*"
}

seen=0
while IFS= read -r file; do
    seen=$((seen + 1))
    while IFS= read -r include; do
        case $file in
            platform/linux/*) check_lower "$file" "$include" platform ;;
            # The administrator's tool is a client that stands on the floors, not below them.
            services/vlmctl/*)
                check_lower "$file" "$include" platform hints settings bind services ;;
            # Who lets people in goes by the settings.
            services/*) check_lower "$file" "$include" platform settings services ;;
            *) check_upper "$file" "$(floor_number "${file%%/*}")" "$include" ;;
        esac
    done < <(sed -nE 's/^[[:space:]]*#[[:space:]]*include[[:space:]]*([<"][^>"]+[>"]).*/\1/p' "$file")
done < <(find "${floors[@]}" services -name '*.h' -o -name '*.cpp' 2>/dev/null | sort)

((seen > 0)) || { echo "no sources below $root"; exit 2; }
((broken == 0)) && echo "$seen files: every include points down"
exit "$broken"
