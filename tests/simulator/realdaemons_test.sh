#!/bin/bash
# SPDX-License-Identifier: LGPL-2.1-or-later
# Daemons of the distribution in the phone.
set -euo pipefail

simulator=$1/bin/corvane-simulator
failures=0

expect() { # WHAT ACTUAL EXPECTED
    [[ $2 == "$3" ]] || { echo "FAIL: $1 is \"$2\", expected \"$3\""; failures=$((failures + 1)); }
}

expect "modems of the real oFono that are online" \
    "$("$simulator" --real stock-ofono -- gdbus call --system -d org.ofono -o / -m org.ofono.Manager.GetModems |
        grep -o "'Online': <true>" | wc -l)" 2
expect "services" "$("$simulator" --real ofono -- corvane-simctl services)" \
    "org.corvaneos.mdmproxy  running"$'\n'"org.ofono               running"
expect "its log" "$("$simulator" --real ofono -- grep -c 'oFono version' /run/corvane-simulator/ofono.log)" 1

# In a phone the daemon can be taken away, by root, without anybody missing it.
if [[ $EUID -eq 0 ]]; then
    status=0
    text=$("$simulator" -- sh -c 'rm /usr/sbin/ofonod && exec "$0" --real ofono true' "$simulator" 2>&1) || status=$?
    expect "status without the daemon" $status 125
    expect "message" "$text" "corvane-simulator: /usr/sbin/ofonod is not there; install Debian's package ofono"
    status=0
    text=$("$simulator" -- sh -c 'ln -sf /bin/false /usr/sbin/ofonod && exec "$0" --real ofono true' "$simulator" 2>&1) || status=$?
    expect "status with a daemon that ends" $status 125
    expect "first line" "${text%%$'\n'*}" "corvane-simulator: /usr/sbin/ofonod ended with status 1"
fi
[[ $failures -eq 0 ]]
