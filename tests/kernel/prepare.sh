#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Brings the kernel of the tests and their two modules to build/kernel/RELEASE, once: Debian's kernel for clouds as it is,
# netdevsim from Debian's sources of that kernel, and the test card. Needs the packages of the group kernel.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")"

# Modules fit the kernel that the headers are of.
headers="$(dpkg-query -W -f '${Depends}\n' linux-headers-cloud-amd64 | grep -o 'linux-headers-[^ ,]*')"
release="${headers#linux-headers-}"
version="$(dpkg-query -W -f '${Version}' "$headers")"
place="$(realpath -m "../../build/kernel/$release")"
mkdir -p "$place"
ln -sfn "$release" "$place/../current"

scratch="$(mktemp -d)" # a module is not built in a folder with blanks
trap 'rm -rf "$scratch"' EXIT
here="$PWD"
cd "$scratch"

# Loads a package of the version that the headers have, and prints where it is.
load() {
    if ! apt-get -qq -o APT::Sandbox::User=root download "$1=$version" >&2; then
        { [ "$(id -u)" != 0 ] || apt-get -qq update; } >&2 # old lists name files that are gone
        apt-get -qq -o APT::Sandbox::User=root download "$1=$version" >&2 || {
            echo "$0: $1 $version is not to be had. Bring the headers up to date, then start again:" >&2
            echo "  apt-get update && apt-get install linux-headers-cloud-amd64" >&2
            return 1
        }
    fi
    echo "$scratch/$1"_*.deb
}
build_module() {
    make -s -C "/usr/src/$headers" "M=$scratch/$1" "${@:2}" modules >"$place/$1.log" 2>&1 || {
        cat "$place/$1.log" >&2
        return 1
    }
    strip --strip-debug -o "$place/$1.ko" "$scratch/$1/$1.ko"
}

if [ ! -e "$place/vmlinuz" ]; then
    echo "== kernel: loading $release"
    package="$(load "linux-image-$release")"
    dpkg -x "$package" image
    find image/lib/modules -name psample.ko -exec cp {} "$place/" \; # netdevsim needs it
    cp "image/boot/vmlinuz-$release" "$place/vmlinuz"
fi
if [ ! -e "$place/netdevsim.ko" ]; then
    echo "== kernel: building netdevsim"
    package="$(load "linux-source-$(cut -d . -f 1,2 <<<"$version")")"
    dpkg-deb --fsys-tarfile "$package" | tar -xO --wildcards '*.tar.xz' | xz -dc |
        tar -x --strip-components=3 --wildcards '*/drivers/net/netdevsim/*'
    build_module netdevsim CONFIG_NETDEVSIM=m
fi
if [ ! "$place/testcard.ko" -nt "$here/module/testcard.c" ]; then
    echo "== kernel: building the test card"
    cp -r "$here/module" testcard
    build_module testcard
fi
