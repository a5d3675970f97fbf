#!/bin/bash
# SPDX-License-Identifier: LGPL-2.1-or-later
# corvane-simctl as a person uses it; run inside the phone.
set -euo pipefail

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
failures=0

# Runs corvane-simctl; what it writes is compared with PATTERN, an extended regular expression for the whole of it.
says() { # STATUS PATTERN ARGUMENTS...
    local text status=0
    text=$(corvane-simctl "${@:3}" 2>&1) || status=$?
    if [[ $status -ne $1 || ! $text =~ ^($2)$ ]]; then
        echo "FAIL: corvane-simctl ${*:3}: status $status, \"$text\"; expected $1, \"$2\""
        failures=$((failures + 1))
    fi
}

get_all() {
    gdbus call --system -d org.ofono -o /mdm/voicecallfilter/dial -m org.corvaneos.ofono.mdm.VoiceCallFilter.GetAll 2>&1 || true
}

says 0 $'(.*\n)*org.corvaneos.mdmproxy +running\n(.*\n)*org.ofono +running(\n.*)*' services
says 0 '' stop org.ofono
says 0 $'(.*\n)*org.ofono +stopped(\n.*)*' services
says 0 '' start org.ofono
says 0 '' restart org.ofono
says 0 $'(.*\n)*org.ofono +running(\n.*)*' services
says 1 'corvane-simctl: there is no service "org.ofon"; did you mean "org.ofono"\?' stop org.ofon

says 0 'fault 1' fault error org.ofono GetAll --error a.b.C --message "No way" --times 1
says 0 $'1  error  org.ofono  \\*  \\*  GetAll  \\{\'error\': <\'a.b.C\'>, \'message\': <\'No way\'>, \'times\': <uint32 1>\\}' faults
[[ $(get_all) == *a.b.C*"No way"* ]] || { echo "FAIL: fault error"; failures=$((failures + 1)); }
says 0 '' faults
says 0 'fault 2' fault reply org.ofono GetAll --path /mdm/voicecallfilter/dial --arguments "uint32 7" "[('a', 1)]"
[[ $(get_all) == "(uint32 7, [('a', 1)])" ]] || { echo "FAIL: fault reply"; failures=$((failures + 1)); }
says 0 '' clear-fault 2
says 1 'corvane-simctl: There is no fault 2; "corvane-simctl faults" lists those that are set' clear-fault 2
says 0 'fault 3' fault late org.ofono "" --interface org.ofono.Modem --delay 5
says 0 '' clear-faults
says 1 'corvane-simctl: The fault "late" needs the option "delay", in milliseconds' fault late org.ofono GetAll
says 2 'corvane-simctl: KIND: .*error,late,never,reply.*' fault slow org.ofono GetAll
says 2 'corvane-simctl: "hello" is no GVariant text: .*; a string is "'"'hello'"'"' fault reply org.ofono GetAll --arguments hello

says 0 '' emit org.ofono /a a.b C "[('a', 1)]" "<true>" 7
says 1 'corvane-simctl: "a" is no object path; .*' emit org.ofono a a.b C

says 0 '' journal --clear
says 0 '' journal
get_all >/dev/null
says 0 '.*  org.ofono  :[0-9.]+  /mdm/voicecallfilter/dial  org.corvaneos.ofono.mdm.VoiceCallFilter.GetAll\(\)' journal
says 0 '' journal --service org.corvaneos.mdmproxy
says 0 '' journal --after 100000
says 0 '.*\{.*"member":"GetAll".*' journal --json --service org.ofono

# Secrets are shown on request alone: those of the contract, and what is called a password elsewhere.
create_account() {
    gdbus call --system -d org.corvaneos.mdmproxy -o /Corvane/Mdm/Proxy/Accounts \
        -m org.corvaneos.mdmproxy.accounts."$1" "${@:2}" >/dev/null 2>&1 || true
}
says 0 '' journal --clear
create_account createAccount corvane-cloud corvane-cloud-sync lena hush '' '{"host": <"h">, "Password": <"hush">}' false
shown="'corvane-cloud', 'corvane-cloud-sync', 'lena', '\*\*\*', '', \{'host': <'h'>, 'Password': <'\*\*\*'>\}, false\)"
says 0 ".*accounts\\.createAccount\\($shown" journal
says 0 ".*\"arguments\":\"\\($shown\".*" journal --json
says 0 ".*'lena', 'hush', '', \{'host': <'h'>, 'Password': <'hush'>\}, false\)" journal --secrets
says 0 '' journal --clear
create_account createAccount hush
create_account deleteAccount 999
gdbus call --system -d org.ofono -o /ril_0 -m org.ofono.SimManager.SetProperty Passphrase '<"hush">' >/dev/null 2>&1 || true
says 0 $'.*createAccount\\(\\*\\*\\*\\)\n.*deleteAccount\\(uint64 999,\\)\n.*SetProperty\\(\'Passphrase\', <\'\\*\\*\\*\'>\\)' journal
get_all >/dev/null

mkfifo "$work/journal"
corvane-simctl journal --follow >"$work/journal" &
follower=$!
exec 5<"$work/journal"
line=
# The call from above comes first; the next one is made once it is there.
until [[ $line == *GetAll* ]]; do read -r -t 60 line <&5 || { echo "FAIL: journal --follow"; exit 1; }; done
gdbus call --system -d org.ofono -o / -m org.ofono.Manager.GetModems >/dev/null
until [[ $line == *GetModems* ]]; do read -r -t 60 line <&5 || { echo "FAIL: journal --follow"; exit 1; }; done
kill $follower
wait $follower 2>/dev/null || [[ $? -eq 143 ]]
exec 5<&-

says 0 'sims\[0\].iccid .*' state sims
says 0 '"dual-sim"' state name --json
says 0 '\{.*"softwareUpdate": \{.*\}' state --json
says 1 'corvane-simctl: the phone has no part "softwareupdate"; did you mean "softwareUpdate"\?' state softwareupdate
says 0 '.*sim pull SLOT .*' actions
says 0 'allow \(default action\)' act call dial 0 +358501234567
says 1 'corvane-simctl: there is no action "sim pul"; did you mean "sim pull"\?' act sim pul 0
says 1 'corvane-simctl: "sim pull" takes SLOT; it was given 0 arguments' act sim pull
says 1 'corvane-simctl: "package publish" takes .*; it was given 1 argument' act package publish foo

says 2 'corvane-simctl: there is no command "jurnal"; did you mean "journal"\?' jurnal
says 2 'corvane-simctl: A subcommand is required; .*'
says 0 '.*Examples:.*' --help
says 0 'corvane-simctl [0-9]+\.[0-9]+\.[0-9]+' --version

[[ $failures -eq 0 ]]
