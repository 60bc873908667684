#!/usr/bin/env bash
# Takes the lab's machine down, or interrupts it, at all sorts of moments, and looks for what is left.
#
#   leaves_nothing_test.sh LAB BUILD-FOLDER
set -euo pipefail

lab=$1 build=$2
name=leaves-nothing-$$
command=("$lab" --name "$name" --build "$build")
scenario=desktop.the_machine_is_healthy

what_is_left() {
    local name=$1
    find /run/vlm-lab -maxdepth 1 -name "$name*"
    find /sys/fs/cgroup -maxdepth 2 -name "vlm-lab-$name*"
    # A process that nobody has waited for yet is in a "(deleted)" group.
    grep -lE "/vlm-lab-${name}[^ ]*$" /proc/[0-9]*/cgroup 2>/dev/null || true
    grep "/run/vlm-lab/$name" /proc/self/mountinfo || true
}

nothing_is_left() {  # NAME WHEN
    local left
    left=$(what_is_left "$1")
    [[ -z $left ]] || { printf 'Left %s:\n%s\n' "$2" "$left" >&2; exit 1; }
}

trap '"${command[@]}" down' EXIT

"${command[@]}" check || exit 77

"${command[@]}" up
[[ $(what_is_left "$name") ]] || { echo "This test looks in the wrong places" >&2; exit 1; }
"${command[@]}" down
nothing_is_left "$name" "after it was taken down"

for signal in INT TERM; do
    for seconds in 0.2 0.5 0.9 1.4; do
        # timeout starts it with signals as a person at a terminal would have them.
        timeout --signal="$signal" "$seconds" "${command[@]}" up || true
        [[ -d /run/vlm-lab/$name ]] && "${command[@]}" run -- true 2>/dev/null && "${command[@]}" down
        nothing_is_left "$name" "after SIG$signal at $seconds s"
    done
done

timeout --signal=KILL 0.7 "${command[@]}" up || true
"${command[@]}" down
nothing_is_left "$name" "after SIGKILL, when it was taken down"

"$lab" --build "$build" scenarios "$scenario" &
orphan=desktop-the-machine-is-healthy-$!
sleep 1
kill -KILL $!
wait $! || true
while grep -qE "/vlm-lab-${orphan}[^ ]*$" /proc/[0-9]*/cgroup 2>/dev/null; do sleep 0.1; done
"${command[@]}" up
"${command[@]}" down
nothing_is_left "$orphan" "of a scenario that was killed, when another machine was booted"
echo "nothing is left"
