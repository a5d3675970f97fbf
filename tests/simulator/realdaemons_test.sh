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

# ConnMan alone, and on the modems of the real oFono.
networks=$("$simulator" --real connman -- timeout 60 bash -c '
    networks() { gdbus call --system -d net.connman -o / -m net.connman.Manager.GetServices; }
    networks
    corvane-simctl act cable unplug eth0
    while [[ $(networks) == *_cable* ]]; do :; done
    corvane-simctl act cable plug eth0
    until [[ $(networks) == *_cable*ready* ]]; do :; done
    corvane-simctl act cable plug eth7' 2>&1) || true
contains "networks of the real ConnMan" "$networks" "_cable', {'Type': <'ethernet'>"
contains "a cable that is not there" "$networks" 'There is no cable at "eth7"; there are eth0, dummy0'
services=$("$simulator" --real ofono,connman -- corvane-simctl services | tr -s ' ')
contains "services" "$services" "org.ofono running"
contains "services" "$services" "net.connman running"
expect "cables" "$("$simulator" --real connman -- corvane-simctl state cables | tr -s ' ')" \
    "cables[0].interface eth0
cables[0].plugged true
cables[1].interface dummy0
cables[1].plugged true"
status=0
text=$("$simulator" --real ofono,stock-ofono true 2>&1) || status=$?
expect "status with one service twice" $status 2
contains "message" "$text" "ofono and stock-ofono are one and the same service"

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

# What a daemon has started goes with it, and keeps no name.
status=0
text=$("$simulator" --real upower -- timeout 60 sh -c '
    kill -9 "$(pidof umockdev-run)"
    until corvane-simctl services | grep -q "org.freedesktop.UPower *stopped"; do :; done
    corvane-simctl start org.freedesktop.UPower
    corvane-simctl services' 2>&1) || status=$?
expect "status with a daemon whose wrapper dies" $status 125
contains "services after that" "$(tr -s ' ' <<< "$text")" "org.freedesktop.UPower running"

# Wiped again while the daemon comes up, which it does at last.
expect "restarts" "$("$simulator" --real connman -- timeout 60 bash -c '
    corvane-simctl act cable unplug eth0
    corvane-simctl act cable unplug dummy0
    for count in 1 2; do
        mdmctl lock wipe --yes --reboot >/dev/null
        until [[ $(corvane-simctl state restarts) == *" $count" ]]; do :; done
    done
    corvane-simctl act cable plug eth0
    corvane-simctl act cable plug dummy0
    until [[ $(gdbus call --system -d net.connman -o / -m net.connman.Manager.GetServices) == *_cable*ready* ]]; do
        :
    done
    corvane-simctl state restarts' 2>&1 | tr -s ' ')" "restarts 2"

# Switched on while it goes down.
# shellcheck disable=SC2016
text=$("$simulator" --real connman -- timeout 60 bash -c '
    first=$(pidof connmand)
    kill -STOP "$first"
    mdmctl lock wipe --yes >/dev/null
    until [[ $(corvane-simctl state power) == *off ]]; do :; done
    corvane-simctl act power on
    kill -CONT "$first"
    while second=$(pidof connmand) || true; [[ -z $second || $second == "$first" ]]; do :; done
    corvane-simctl act power on' 2>&1) || true
contains "a phone that is on with a new daemon" "$text" "The phone is on already"

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
    status=0
    text=$("$simulator" -- sh -c 'rm /usr/sbin/dnsmasq && exec "$0" --real connman true' "$simulator" 2>&1) || status=$?
    expect "status without the address server" $status 125
    contains "message" "$text" "/usr/sbin/dnsmasq is not there; install Debian's package dnsmasq-base"
fi
[[ $failures -eq 0 ]]
