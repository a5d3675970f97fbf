# SPDX-License-Identifier: LGPL-2.1-or-later
# shellcheck shell=bash
# Sourced by demo and check: work in stages of one line each, with a log that is shown when a stage fails.

stages=()

# stage NAME COMMAND...: runs COMMAND, which may be a function, with its output in a log of its own.
stage() {
    local name=$1 started=$SECONDS status
    shift
    mkdir -p "$logs"
    stage_log=$logs/${name// /-}.log
    printf '%-34s' "$name"
    # Not part of a condition: errexit would be off inside the function.
    set +e
    (set -e && "$@") >"$stage_log" 2>&1 </dev/null
    status=$?
    set -e
    local took=$((SECONDS - started))
    if [ $status -ne 0 ]; then
        printf 'FAILED %5d s\n\n' "$took"
        tail -n "${stage_tail:-40}" "$stage_log"
        printf '\n%s: "%s" failed; whole log: %s\n' "$0" "$name" "$stage_log" >&2
        exit 1
    fi
    printf 'ok     %5d s\n' "$took"
    stages+=("$(printf '%-34s%6d s   %s' "$name" "$took" "${stage_log#"$root"/}")")
}

# configure FOLDER OPTION...: demo and check share a build tree, so they configure it alike.
configure() {
    local folder=$1
    shift
    cmake -S "$root" -B "$folder" -G Ninja -DCMAKE_COMPILE_WARNING_AS_ERROR=ON \
        -DCMAKE_BUILD_TYPE=RelWithDebInfo "$@"
}
