#!/usr/bin/env bash
# Installs the packages of the named groups of debian-packages.txt that are missing. Asks nothing.
# Usage: packaging/install-packages.sh GROUP...
set -euo pipefail

list="$(dirname "${BASH_SOURCE[0]}")/debian-packages.txt"

wanted() {
    local group package
    while read -r group package; do
        case " $* " in *" $group "*) printf '%s\n' "$package" ;; esac
    done < <(grep -v '^#' "$list")
}

is_installed() {
    [ "$(dpkg-query -W -f '${db:Status-Status}' "$1" 2>/dev/null)" = installed ]
}

as_root() {
    if [ "$(id -u)" = 0 ]; then
        "$@"
    elif command -v sudo >/dev/null; then
        sudo "$@"
    else
        echo "Not root, and there is no sudo. As root, run: $*" >&2
        return 1
    fi
}

missing=()
while read -r package; do
    is_installed "$package" || missing+=("$package")
done < <(wanted "$@")

if [ "${#missing[@]}" = 0 ]; then
    exit 0
fi
if ! command -v apt-get >/dev/null; then
    echo "These are missing, and there is no apt-get to install them: ${missing[*]}" >&2
    exit 1
fi
echo "== Installing ${#missing[@]} packages: ${missing[*]}"
as_root env DEBIAN_FRONTEND=noninteractive apt-get update -q
as_root env DEBIAN_FRONTEND=noninteractive apt-get install -q -y --no-install-recommends "${missing[@]}"
