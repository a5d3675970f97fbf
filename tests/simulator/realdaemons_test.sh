#!/bin/bash
# SPDX-License-Identifier: LGPL-2.1-or-later
# Daemons of the distribution in the phone.
set -euo pipefail

simulator=$1/bin/corvane-simulator
devices=$(realpath "${0%/*}/../../examples/devices")
failures=0

expect() { # WHAT ACTUAL EXPECTED
    [[ $2 == "$3" ]] || { echo "FAIL: $1 is \"$2\", expected \"$3\""; failures=$((failures + 1)); }
}

contains() { # WHAT ACTUAL PART
    [[ $2 == *"$3"* ]] || { echo "FAIL: $1 is \"$2\", expected something with \"$3\""; failures=$((failures + 1)); }
}

modems=$("$simulator" --real ofono -- gdbus call --system -d org.ofono -o / -m org.ofono.Manager.GetModems)
contains "modems of the real oFono" "$modems" "([(objectpath '/ril_0', {'Online': <true>"
contains "modems of the real oFono" "$modems" "('/ril_1', {'Online': <true>"
expect "SIMs of a phone without any" \
    "$("$simulator" --device "$devices/no-sim.json" --real ofono -- gdbus call --system -d org.ofono -o / \
        -m org.veldmobile.ofono.ModemManager.GetPresentSims)" "([false, false],)"
contains "a locked SIM" \
    "$("$simulator" --device "$devices/locked-sim.json" --real stock-ofono -- corvane-simctl state sims)" "pin"
services=$("$simulator" --real ofono -- corvane-simctl services | tr -s ' ')
contains "services" "$services" "org.corvaneos.mdmproxy running"
contains "services" "$services" "org.ofono running"
expect "its log" "$("$simulator" --real ofono -- grep -c 'oFono version' /run/corvane-simulator/ofono.log)" 1

# A daemon that dies by itself is told of, can be started again, and is not forgotten.
status=0
# shellcheck disable=SC2016
text=$("$simulator" --real stock-ofono -- sh -c '
    for process in /proc/[0-9]*; do
        [ "$(readlink "$process/exe")" != /usr/sbin/ofonod ] || kill -9 "${process#/proc/}"
    done
    until corvane-simctl services | grep -q "org.ofono *stopped"; do :; done
    corvane-simctl start org.ofono
    corvane-simctl services' 2>&1) || status=$?
expect "status with a daemon that dies" $status 125
contains "message" "$text" "corvane-simulator: /usr/sbin/ofonod was ended by signal 9; stock-ofono said:"
contains "services after that" "$(tr -s ' ' <<< "$text")" "org.ofono running"

# In a phone the daemon can be taken away, by root, without anybody missing it.
if [[ $EUID -eq 0 ]]; then
    status=0
    text=$("$simulator" -- sh -c 'rm /usr/sbin/ofonod && exec "$0" --real ofono true' "$simulator" 2>&1) || status=$?
    expect "status without the daemon" $status 125
    expect "message" "$text" "corvane-simulator: /usr/sbin/ofonod is not there; install Debian's package ofono"
    status=0
    text=$("$simulator" -- sh -c 'ln -sf /bin/false /usr/sbin/ofonod && exec "$0" --real ofono true' "$simulator" 2>&1) || status=$?
    expect "status with a daemon that ends" $status 125
    contains "message" "$text" "corvane-simulator: /usr/sbin/ofonod ended with status 1"
fi
[[ $failures -eq 0 ]]
