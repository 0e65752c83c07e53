#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Installs the packages of the named groups of debian-packages.txt that are missing. Asks nothing.
#
#   packaging/install-packages.sh GROUP...
#   packaging/install-packages.sh --check GROUP...    installs nothing; fails when a package is missing
set -euo pipefail

list="$(dirname "${BASH_SOURCE[0]}")/debian-packages.txt"
check=false
if [ "${1:-}" = --check ]; then
    check=true
    shift
fi

for group in "$@"; do
    if ! grep -q "^$group " "$list"; then
        echo "$0: unknown group $group. Name some of: $(grep -v '^#' "$list" | cut -d ' ' -f 1 | uniq | tr '\n' ' ')" >&2
        exit 2
    fi
done

wanted() {
    local group package
    while read -r group package; do
        case " $* " in *" $group "*) printf '%s\n' "$package" ;; esac
    done < <(grep -v '^#' "$list")
}

is_installed() {
    [ "$(dpkg-query -W -f '${db:Status-Status}' "$1" 2>/dev/null)" = installed ]
}

missing=()
while read -r package; do
    is_installed "$package" || missing+=("$package")
done < <(wanted "$@")

if [ "${#missing[@]}" = 0 ]; then
    exit 0
fi
if [ "$check" = true ]; then
    exit 1
fi
if ! command -v apt-get >/dev/null; then
    echo "These packages are missing, and there is no apt-get to install them: ${missing[*]}" >&2
    exit 1
fi
options=(-y --no-install-recommends)
if [ "$(id -u)" = 0 ]; then
    as_root=()
elif command -v sudo >/dev/null; then
    as_root=(sudo)
else
    {
        echo "Packages are missing, and installing them takes root. Have an administrator run this, then start again:"
        echo
        echo "  apt-get update && apt-get install ${options[*]} ${missing[*]}"
    } >&2
    exit 1
fi
echo "== Installing ${#missing[@]} packages: ${missing[*]}"
"${as_root[@]}" env DEBIAN_FRONTEND=noninteractive apt-get update -q
"${as_root[@]}" env DEBIAN_FRONTEND=noninteractive apt-get install -q "${options[@]}" "${missing[@]}"
