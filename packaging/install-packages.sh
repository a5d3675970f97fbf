# SPDX-License-Identifier: LGPL-2.1-or-later
# shellcheck shell=bash
# Sourced by demo and check: installs what packaging/debian-packages.txt names and this machine lacks.

# packages_for COMMAND: the packages that every command needs, and those that the list reserves for COMMAND.
packages_for() {
    sed 's/#.*//' "$root/packaging/debian-packages.txt" |
        awk -v command="$1" 'NF == 1 || (NF == 2 && $2 == command) { print $1 }'
}

# missing_packages PACKAGE...: those that are not installed.
missing_packages() {
    # dpkg-query fails when it does not know one of the names, which is just what is asked.
    local installed
    installed=$(dpkg-query --show --showformat='${db:Status-Status} ${Package}\n' "$@" 2>/dev/null |
        sed -n 's/^installed //p') || true
    printf '%s\n' "$@" | grep -vxF "${installed:-none}" || true
}

# install_packages COMMAND: says nothing when everything is there.
install_packages() {
    if ! command -v dpkg-query >/dev/null; then
        echo "$0: this is no Debian: install the equivalents of packaging/debian-packages.txt yourself" >&2
        return 0
    fi

    local wanted missing
    mapfile -t wanted < <(packages_for "$1")
    mapfile -t missing < <(missing_packages "${wanted[@]}")
    [ ${#missing[@]} -gt 0 ] || return 0

    local install=(apt-get install --yes --no-install-recommends "${missing[@]}")
    local become=()
    if [ "$(id -u)" -ne 0 ]; then
        if ! command -v sudo >/dev/null; then
            printf '%s: packages are missing, and there is no sudo. As root, run:\n    apt-get update && %s\n' \
                "$0" "${install[*]}" >&2
            return 1
        fi
        become=(sudo)
    fi

    echo "installing: ${missing[*]}"
    local log
    log=$(mktemp)
    # The package lists may be absent or too old; they are fetched only when the first attempt says so.
    if ! run_apt "$log" "${install[@]}" && ! { run_apt "$log" apt-get update && run_apt "$log" "${install[@]}"; }
    then
        tail -n 20 "$log" >&2
        printf '%s: the packages could not be installed (whole log: %s). To see why, run:\n    %s\n' \
            "$0" "$log" "${become[*]:+${become[*]} }${install[*]}" >&2
        return 1
    fi
    rm -f "$log"
}

# run_apt LOG COMMAND...: another package manager at work is waited for.
run_apt() {
    local log=$1
    shift
    "${become[@]}" env DEBIAN_FRONTEND=noninteractive "$1" -o DPkg::Lock::Timeout=300 "${@:2}" \
        >>"$log" 2>&1 </dev/null
}
