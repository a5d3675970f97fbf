# SPDX-License-Identifier: LGPL-2.1-or-later
# shellcheck shell=bash
# Sourced by demo and check: work in stages of one line each, with a log that is shown when a stage fails.
# The caller sets root, the source folder, and logs, where the logs go.

stages=()
ticker=

# stage NAME COMMAND...: runs COMMAND, which may be a function. Its log is left in $stage_log.
stage() {
    local name=$1 started=$SECONDS status
    shift
    mkdir -p "$logs"
    stage_log=$logs/${name// /-}.log
    printf '%-30s' "$name"
    start_ticker "$name"
    # Not part of a condition: errexit would be off inside the function.
    set +e
    (set -e && "$@") >"$stage_log" 2>&1 </dev/null
    status=$?
    set -e
    stop_ticker
    local took=$((SECONDS - started))
    if [ $status -ne 0 ]; then
        printf 'FAILED %5d s\n\n' "$took"
        tail -n 40 "$stage_log"
        printf '\n%s: "%s" failed; whole log: %s\n' "$0" "$name" "$stage_log" >&2
        exit 1
    fi
    printf 'ok     %5d s\n' "$took"
    stages+=("$(printf '%-30s%6d s   %s' "$name" "$took" "${stage_log#"$root"/}")")
}

# On a terminal the last line of the log shows that a long stage is alive.
start_ticker() {
    [ -t 1 ] || return 0
    trap stop_ticker EXIT
    while sleep 1; do
        printf '\r\e[K%-30s%s' "$1" "$(tail -n 1 "$stage_log" | tr -cd '[:print:]' | cut -c 1-48)"
    done &
    ticker=$!
    printf '\r\e[K%-30s' "$1"
}

stop_ticker() {
    [ -n "$ticker" ] || return 0
    kill "$ticker" || true
    wait "$ticker" || true
    ticker=
    printf '\r\e[K%-30s' "${name:-}"
} 2>/dev/null

# configure FOLDER OPTION...: demo and check share a build tree, so they configure it alike.
configure() {
    cmake -S "$root" -B "$1" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo \
        -DCMAKE_COMPILE_WARNING_AS_ERROR=ON "${@:2}"
}
