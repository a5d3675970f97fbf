#!/bin/bash
# SPDX-License-Identifier: LGPL-2.1-or-later
# What the phone's sandbox promises, seen from outside.
#
# usage: sandbox_test.sh root|user BUILD_FOLDER
#
# "root" is skipped (status 77) for an ordinary user. "user" run by root becomes an ordinary user, who is given an
# installed copy because the build tree may be out of that user's sight.
set -euo pipefail

mode=$1
build=$2
readonly skipped=77 nobody=65534

if [[ $mode == root && $EUID -ne 0 ]]; then
    echo "not run by root"
    exit $skipped
fi
if [[ $mode == user && $EUID -eq 0 ]]; then
    copy=$(mktemp -d)
    trap 'rm -rf "$copy"' EXIT
    chmod 755 "$copy"
    cmake --install "$build" --prefix "$copy" >"$copy/install.log" 2>&1 || { cat "$copy/install.log"; exit 1; }
    install -m 755 "$0" "$copy/sandbox_test.sh"
    mkdir "$copy/home"
    chown $nobody:$nobody "$copy/home"
    cd "$copy/home" || exit 1
    setpriv --reuid=$nobody --regid=$nobody --clear-groups env HOME="$copy/home" \
        "$copy/sandbox_test.sh" user "$copy"
    exit
fi

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work" || exit 1
simulator=$build/bin/corvane-simulator
failures=0

fail() {
    echo "FAIL: ${FUNCNAME[2]}: $*"
    failures=$((failures + 1))
}

expect() { # WHAT ACTUAL EXPECTED
    [[ $2 == "$3" ]] || fail "$1 is \"$2\", expected \"$3\""
}

expect_match() { # WHAT ACTUAL PATTERN
    [[ $2 =~ $3 ]] || fail "$1 is \"$2\", expected a match of \"$3\""
}

phone() {
    "$simulator" -- "$@"
}

status_of() {
    local status=0
    "$@" >/dev/null 2>&1 || status=$?
    echo $status
}

# What the machine shows of itself.
machine() {
    cat /proc/self/mountinfo
    ls -A /etc /usr /usr/share /var /var/lib /run /dev
    hostname
}

processes_in() { # PID_NAMESPACE
    local process
    for process in /proc/[0-9]*; do
        if [[ $(readlink "$process/ns/pid" 2>/dev/null) == "$1" ]]; then
            echo "$process"
        fi
    done
}

# Keeps the number of a namespace from being given to another phone as soon as this one is gone.
keep_namespace() { # PID_NAMESPACE
    exec 6<"$(processes_in "$1" | head -n 1)/ns/pid"
}

# Runs a phone in the background; its command says on fd 8 when it is ready, and waits for a line on fd 9.
# fd 7 is held by every process of the phone, so that its end of file tells that none is left.
hold_phone() { # NAME COMMAND
    mkfifo "$work/$1.ready" "$work/$1.go" "$work/$1.alive"
    "$simulator" -- sh -c "$2" 7<>"$work/$1.alive" 8>"$work/$1.ready" 9<>"$work/$1.go" >"$work/$1.out" 2>&1 &
    held=$!
}

exit_status_is_passed_on() {
    expect "status" "$(status_of phone true)" 0
    expect "status" "$(status_of phone sh -c 'exit 7')" 7
    expect "status of a killed command" "$(status_of phone sh -c 'kill -KILL $$')" 137
    expect "status of an unknown command" "$(status_of phone no-such-command)" 127
    expect "status of no program" "$(status_of phone /etc/passwd)" 126
}

command_line_is_the_commands() {
    expect_match "version" "$("$simulator" --version)" '^corvane-simulator [0-9]+\.[0-9]+\.[0-9]+$'
    expect "arguments" "$("$simulator" printf '%s,' --help -- --device x)" "--help,--,--device,x,"
    expect "arguments" "$("$simulator" -- printf %s, a)" "a,"
    expect "input" "$(echo text | phone cat)" text
    expect "input without a command" "$(echo 'echo $((6 * 7))' | SHELL=/bin/sh "$simulator")" 42
}

changes_vanish() {
    local before after
    before=$(machine)
    expect "files" "$(phone sh -c 'cd /; for f in etc usr var run dev/shm; do echo x >$f/corvane-test; cat $f/corvane-test
        done; grep -q "^phone /etc overlay" proc/self/mounts && rm etc/debian_version; ls etc/debian_version 2>/dev/null')" $'x\nx\nx\nx\nx'
    after=$(machine)
    expect "the machine" "$after" "$before"
}

machine_is_the_same_meanwhile() {
    local before during
    before=$(machine)
    hold_phone meanwhile 'echo >&8; exec 8>&-; read -r _ <&9'
    read -r _ <"$work/meanwhile.ready"
    during=$(machine)
    echo >"$work/meanwhile.go"
    wait $held
    expect "the machine" "$during" "$before"
}

folder_is_kept() {
    expect "folder" "$(phone pwd)" "$work"
    phone sh -c 'echo inside >from-the-phone'
    expect "file" "$(cat from-the-phone)" inside
    expect "folder below an overlay" "$(cd /usr/share && phone sh -c 'pwd; test -d doc || echo other')" /usr/share
    mkdir gone
    expect_match "message" "$(cd gone && rmdir ../gone && "$simulator" true 2>&1)" \
        '^corvane-simulator: the current folder does not exist'
}

phone_is_its_own() {
    expect "user" "$(phone id -u)" 0
    expect "host name" "$(phone hostname)" dual-sim
    expect "host name's file" "$(phone cat /etc/hostname)" dual-sim
    expect "machine id" "$(phone cat /etc/machine-id | wc -c)" 33
    expect "networks" "$(phone ls /sys/class/net)" $'lo\nwlan0'
    expect "loopback" "$(phone sh -c 'echo $(($(cat /sys/class/net/lo/flags) & 1))')" 1
    expect "first process" "$(phone cat /proc/1/comm)" corvane-simulat
    expect "devices" "$(phone sh -c 'cd /dev; echo *')" \
        "corvane fd full gnss0 null ptmx pts random shm stderr stdin stdout tty urandom zero"
    expect "/run" "$(phone sh -c 'cd /run; echo *')" "corvane-simulator dbus lock media systemd user veld-devicelock"
    expect "folders of sessions" "$(phone sh -c 'cd /run/systemd; echo *')" "machines seats sessions users"
    expect "settings of the kernel" "$(phone sh -c 'cat /proc/sys/kernel/hostname; echo x 2>&1 >/proc/sys/kernel/hostname' \
        2>&1 | grep -c 'Read-only')" 1
}

packages_are_the_phones() {
    expect "desktop entries that are the machine's" \
        "$(phone sh -c 'ls /usr/share/applications | grep -vE "^(corvane|tarn|desk)-"')" ""
    expect "icon themes" "$(phone sh -c 'cd /usr/share/icons; echo *')" "default hicolor"
    expect "package" "$(phone rpm -q corvane-browser)" corvane-browser-5.0.3-1.noarch
    expect "owner of a file" "$(phone rpm -qf /usr/share/applications/tarn-chess.desktop)" tarn-chess-1.0.7-1.noarch
    expect "needed package" "$(phone rpm -q --whatprovides corvane-webengine)" corvane-webengine-91.4.0-1.noarch
    expect "installation" "$(phone sh -c 'mdmctl install corvane-notes && rpm -q corvane-notes; ls /usr/share/applications' |
        grep notes)" $'corvane-notes is installed.\ncorvane-notes-1.4.0-1.noarch\ncorvane-notes.desktop'
    expect "removal" "$(phone sh -c 'mdmctl remove tarn-chess; rpm -q tarn-chess; ls /usr/share/applications | grep tarn')" \
        $'tarn-chess is removed.\npackage tarn-chess is not installed'
    # Packages other than the built-in phone's take a database made at the start.
    cat >packages.json <<'END'
{ "packages": { "installed": [ { "name": "a", "version": "1", "files": ["/etc/a.conf"] } ], "available": [] } }
END
    expect "packages of a profile" "$("$simulator" --device packages.json -- rpm -qa)" a-1-1.noarch
    expect "its file" "$("$simulator" --device packages.json -- sh -c 'rpm -qf /etc/a.conf; cat /etc/a.conf')" \
        $'a-1-1.noarch\nof a'
    echo '{ "packages": { "installed": [ { "name": "a", "version": "1", "requires": ["b"] } ] } }' >wrong.json
    expect "a package that is missing" "$("$simulator" --device wrong.json true 2>&1)" \
        "corvane-simulator: wrong.json: /packages/installed/0/requires: b is not installed"
    echo '{ "packages": { "available": [ { "name": "a", "version": "1" }, { "name": "a", "version": "1" } ] } }' >wrong.json
    expect "a version twice" "$("$simulator" --device wrong.json true 2>&1)" \
        "corvane-simulator: wrong.json: /packages/available/1: a 1-1 is there already; each is allowed once"
}

environment_is_the_phones() {
    local seen
    seen=$(DBUS_SYSTEM_BUS_ADDRESS=unix:path=/elsewhere DBUS_SESSION_BUS_ADDRESS=unix:path=/elsewhere phone env)
    expect "bus variables" "$(grep -c ^DBUS_ <<<"$seen")" 0
    expect_match "PATH" "$(grep ^PATH= <<<"$seen")" "^PATH=$build/bin:"
    expect "XDG_RUNTIME_DIR" "$(grep ^XDG_RUNTIME_DIR= <<<"$seen")" XDG_RUNTIME_DIR=/run/user/0
    expect "mode of XDG_RUNTIME_DIR" "$(phone stat -c %a /run/user/0)" 700
}

capabilities_are_dropped() {
    # CAP_LINUX_IMMUTABLE 9, SYS_MODULE 16, SYS_RAWIO 17, SYS_PACCT 20, SYS_BOOT 22, SYS_TIME 25, MKNOD 27,
    # AUDIT_CONTROL 30, MAC_OVERRIDE 32, MAC_ADMIN 33, SYSLOG 34, WAKE_ALARM 35, BLOCK_SUSPEND 36, AUDIT_READ 37,
    # PERFMON 38, BPF 39
    local bit mask=0 sets line count=0
    for bit in 9 16 17 20 22 25 27 30 32 33 34 35 36 37 38 39; do
        mask=$((mask | 1 << bit))
    done
    sets=$(phone sh -c 'cat /proc/[0-9]*/status' | grep ^Cap)
    while read -r line; do
        count=$((count + 1))
        expect "what is left of $line" $((16#${line##*$'\t'} & mask)) 0
    done <<<"$sets"
    # Process 1, bus, services, command, its child: five sets each.
    [[ $count -ge 20 ]] || fail "only $count sets seen"
    # What later daemons need is kept: CAP_NET_ADMIN 12, CAP_SYS_ADMIN 21.
    expect "what is kept" $((16#$(phone grep ^CapEff /proc/self/status | cut -f2) >> 12 & 0x201)) $((0x201))
}

signals_reach_the_command() {
    local name status
    # SIGINT is left to the terminal's test: the shell makes its background jobs ignore it.
    for name in TERM HUP USR1; do
        # A signal that comes just before "read" would wait for a line; "wait" sees it.
        hold_phone "$name" "trap 'echo got $name; exit 9' $name; sleep infinity & echo >&8; exec 8>&-; wait"
        read -r _ <"$work/$name.ready"
        kill -"$name" $held
        status=0
        wait $held || status=$?
        expect "status after SIG$name" $status 9
        expect "output" "$(cat "$work/$name.out")" "got $name"
    done
    hold_phone dies 'echo >&8; exec 8>&-; read -r _ <&9'
    read -r _ <"$work/dies.ready"
    kill -TERM $held
    status=0
    wait $held || status=$?
    expect "status of a terminated command" $status 143
}

nothing_survives() {
    local namespace
    hold_phone busy 'sleep 1000 & setsid sleep 1000 & readlink /proc/self/ns/pid >&8; exec 8>&-; read -r _ <&9'
    read -r namespace <"$work/busy.ready"
    expect_match "namespace" "$namespace" '^pid:'
    keep_namespace "$namespace"
    echo >"$work/busy.go"
    wait $held
    expect "processes" "$(processes_in "$namespace")" ""
    exec 6<&-
}

kill_takes_everything_down() {
    local namespace
    hold_phone killed 'readlink /proc/self/ns/pid >&8; exec 8>&-; exec sleep 1000'
    exec 5<"$work/killed.alive"
    read -r namespace <"$work/killed.ready"
    [[ $(processes_in "$namespace" | wc -l) -ge 4 ]] || fail "not enough processes seen in the phone"
    keep_namespace "$namespace"
    kill -KILL $held
    timeout 60 cat <&5 || fail "the phone lives on"
    exec 5<&-
    wait $held 2>/dev/null || true
    # The files are closed a moment before the process table is cleared.
    while [[ -n $(processes_in "$namespace") && $SECONDS -lt 120 ]]; do :; done
    expect "processes" "$(processes_in "$namespace")" ""
    exec 6<&-
}

two_phones_are_apart() {
    hold_phone first 'corvane-simctl act sim pull 0 >/dev/null; echo first >/etc/which; echo >&8; exec 8>&-; read -r _ <&9
        cat /etc/which; corvane-simctl state sims | grep "0.*present"'
    local first=$held
    hold_phone second 'echo second >/etc/which; echo >&8; exec 8>&-; read -r _ <&9
        cat /etc/which; corvane-simctl state sims | grep "0.*present"'
    local second=$held
    read -r _ <"$work/first.ready"
    read -r _ <"$work/second.ready"
    echo >"$work/first.go"
    echo >"$work/second.go"
    wait $first $second
    expect "the first phone" "$(tr -s ' ' <"$work/first.out")" $'first\nsims[0].present false'
    expect "the second phone" "$(tr -s ' ' <"$work/second.out")" $'second\nsims[0].present true'
}

phones_nest() {
    expect "services in a phone in a phone" "$(phone "$simulator" --device "$work/nested.json" -- hostname)" nested
}

# Types on a terminal of its own: what is said must be there before the next thing is typed.
on_terminal() { # COMMAND; reads "WAIT_FOR<tab>TYPE" lines
    local wanted typed seen='' character
    terminal_text=''
    # The shell that runs it must not stay between the terminal and the command: Control-C would end it as well.
    coproc terminal { exec script -qec "exec $1" /dev/null 2>&1; }
    local terminal_in=${terminal[1]} terminal_out=${terminal[0]} terminal_pid=$terminal_PID
    while IFS=$'\t' read -r wanted typed; do
        while [[ $seen != *"$wanted"* ]]; do
            IFS= read -r -d '' -n 1 -t 60 character <&"$terminal_out" || break 2
            seen+=$character
        done
        terminal_text+=$seen
        seen=''
        printf '%b' "$typed" >&"$terminal_in"
    done
    while IFS= read -r -d '' -n 1 -t 60 character <&"$terminal_out"; do
        seen+=$character
    done
    # Does nothing when it has ended, as it should.
    kill "$terminal_pid" 2>/dev/null || true
    terminal_status=0
    wait "$terminal_pid" || terminal_status=$?
    terminal_text+=$seen
}

control_c_reaches_the_command_alone() {
    cat >"$work/interrupted.sh" <<'SCRIPT'
trap 'echo interrupted; corvane-simctl services; exit 5' INT
sleep infinity &
echo ready
wait
SCRIPT
    on_terminal "$simulator -- bash $work/interrupted.sh" <<<$'ready\t\\003'
    expect "status" "$terminal_status" 5
    expect_match "output" "$terminal_text" 'interrupted'
    expect_match "output" "$terminal_text" 'org.ofono +running'
    # Once: the terminal's signal is not passed on a second time.
    expect "interruptions" "$(grep -c interrupted <<<"$terminal_text")" 1
}

shell_has_job_control() {
    on_terminal "env SHELL=/bin/bash HOME=$work PS1='phone> ' $simulator" <<'TYPED'
exit takes you out	PS1="at "; echo "in:$debian_chroot"\n
in:phone	sh -c 'kill -STOP $$; echo "resu""med"'\n
Stopped	fg\n
resumed	exit 3\n
TYPED
    expect "status" "$terminal_status" 3
    expect_match "banner" "$terminal_text" 'inside the simulated phone "dual-sim"'
    [[ ! $terminal_text =~ 'no job control' ]] || fail "there is no job control"
    # The terminal is the caller's again.
    on_terminal "env SHELL=/bin/bash HOME=$work bash -c '$simulator; echo outside; read -r line; echo got:\$line'" <<'TYPED'
exit takes you out	exit\n
outside	back\n
TYPED
    expect_match "input after the phone" "$terminal_text" 'got:back'
}

refusals_help() {
    local one_line='^corvane-simulator: [^'$'\n'']+$'
    refusal() { # EXPECTED_STATUS PATTERN ARGUMENTS...
        local text status=0
        text=$("$simulator" "${@:3}" 2>&1 </dev/null) || status=$?
        expect "status of ${*:3}" $status "$1"
        expect_match "message" "$text" "$one_line"
        expect_match "message" "$text" "$2"
    }
    profile() { printf '%s' "$1" >"$work/wrong.json"; }

    refusal 2 'there are --device, --real' --devise x
    refusal 2 'PROFILE' --device
    refusal 2 'no-such.json' --device no-such.json true
    refusal 2 'no real daemon "phone"; there are: .*ofono' --real phone true
    profile '{"sims": [{"imsi": "244x"}]}'
    refusal 2 'wrong.json: /sims/0/imsi: ' --device wrong.json true
    profile '{"sim": []}'
    refusal 2 'wrong.json: .*sim.*"sims"' --device wrong.json true
    profile '{"callFilters": {"dial": {"rules": [{"imsi": "1", "action": "hangup"}]}}}'
    refusal 2 'wrong.json: /callFilters/dial/rules/0/action: .*"block"' --device wrong.json true
    profile '{"callFilters": {"incoming": {"rules": [{"imsi": "1", "action": "block"}, {"imsi": "1", "action": "allow"}]}}}'
    refusal 2 'wrong.json: /callFilters/incoming/rules/1/imsi: ' --device wrong.json true
    profile '{"smsFilter": {"default": "hangup"}}'
    refusal 2 'wrong.json: /smsFilter/default: .*"block"' --device wrong.json true
    profile '{"dataFilter": {"rules": [{"imsi": "1", "action": "block"}, {"imsi": "1", "action": "allow"}]}}'
    refusal 2 'wrong.json: /dataFilter/rules/1/imsi: ' --device wrong.json true
    profile '{"callLog": [{"time": "2026-02-30T00:00:00Z", "direction": "missed"}]}'
    refusal 2 'wrong.json: /callLog/0/time: ' --device wrong.json true
    profile '{"callLog": [{"time": "2026-02-03T00:00:00Z", "direction": "missed", "seconds": 1}]}'
    refusal 2 'wrong.json: /callLog/0/seconds: ' --device wrong.json true
    profile '{"notifications": [{"owner": "x", "summary": "x", "time": "2026-02-30T00:00:00Z"}]}'
    refusal 2 'wrong.json: /notifications/0/time: ' --device wrong.json true
    profile '{"notifications": [{"owner": "x", "summary": "x", "remoteActions": [{"deep": [{"none": null}]}]}]}'
    refusal 2 'wrong.json: /notifications/0/remoteActions/0/deep/0/none' --device wrong.json true
    profile '{"accounts": {"providers": [{"name": "a", "services": ["s"]}, {"name": "a", "services": ["s"]}]}}'
    refusal 2 'wrong.json: /accounts/providers/1/name: ' --device wrong.json true
    profile '{"accounts": {"present": [{"provider": "none", "user": "u"}]}}'
    refusal 2 'wrong.json: /accounts/present/0/provider: .*email, corvane-cloud' --device wrong.json true
    profile '{"autostart": ["mail"]}'
    refusal 2 'wrong.json: /autostart/0: ' --device wrong.json true
    profile '{"certificates": {"system": ["nobody"]}}'
    refusal 2 'wrong.json: /certificates/system/0: must be one of corvane-root, ' --device wrong.json true
    profile '{"certificates": {"installed": [{"file": "a.crt", "content": ""}, {"file": "b.crt"}]}}'
    refusal 2 'wrong.json: /certificates/installed/1: must have either authority or content' --device wrong.json true
    profile '{"certificates": {"blacklisted": [{"file": "a", "content": ""}, {"file": "a", "content": ""}]}}'
    refusal 2 'wrong.json: /certificates/blacklisted/1/file: ' --device wrong.json true
    profile '{"certificates": {"installed": [{"file": "a.crt", "authority": "nobody"}]}}'
    refusal 2 'wrong.json: /certificates/installed/0/authority: ' --device wrong.json true
    profile '{"sims": [{"imsi": "244051"}, {"imsi": "244051"}]}'
    refusal 2 'wrong.json: /sims/1/imsi: ' --device wrong.json true
    profile '{"sims": [{"provider": "None"}]}'
    refusal 2 'wrong.json: /sims/0: ' --device wrong.json true
    profile '{"sims": [{"imsi": "244051", "technologies": ["gsm"], "technologyPreference": "lte"}]}'
    refusal 2 'wrong.json: /sims/0/technologyPreference: the slot'"'"'s technologies are without lte' --device wrong.json true
    profile '{"sims": [{"imsi": "244051", "accessPoints": [{"type": "internet"}, {"type": "other"}]}]}'
    refusal 2 'wrong.json: /sims/0/accessPoints/1/type: .*"mms"' --device wrong.json true
    profile '{"softwareUpdate": {"catalogue": [{"version": "1.0"}, {"version": "1.0"}]}}'
    refusal 2 'wrong.json: /softwareUpdate/catalogue/1/version: ' --device wrong.json true
    profile '{"name": 1'
    refusal 2 'wrong.json' --device wrong.json true
}

failed_set_up_is_told() {
    # Without the right to create a user namespace there is no phone.
    local text status=0
    text=$(unshare --user --map-root-user bash -c 'echo 0 >/proc/sys/user/max_user_namespaces 2>/dev/null
        echo 0 >/proc/sys/user/max_pid_namespaces && exec "$0" true' "$simulator"  2>&1) || status=$?
    expect "status" $status 125
    expect_match "message" "$text" '^corvane-simulator: cannot create [^'$'\n'']+: [^'$'\n'']+$'
}

printf '%s' '{"name": "nested"}' >"$work/nested.json"
for test in exit_status_is_passed_on command_line_is_the_commands changes_vanish machine_is_the_same_meanwhile \
    folder_is_kept phone_is_its_own packages_are_the_phones environment_is_the_phones capabilities_are_dropped signals_reach_the_command \
    nothing_survives kill_takes_everything_down two_phones_are_apart phones_nest \
    control_c_reaches_the_command_alone shell_has_job_control refusals_help failed_set_up_is_told; do
    failures_before=$failures
    $test
    if [[ $failures -eq $failures_before ]]; then
        echo "ok: $test"
    fi
done
[[ $failures -eq 0 ]]
