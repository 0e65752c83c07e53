#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Runs a command, in this folder, that can write to nothing but the named folders, devices, and a /tmp and a /dev/shm of
# its own that are empty at first and gone at the end: an attempt to write elsewhere fails. Needs root.
#
#   tools/contained.sh FOLDER... -- COMMAND...
set -euo pipefail

if [ "${QUENX_CONTAINED:-}" != starting ]; then
    QUENX_CONTAINED=starting exec unshare --mount --propagation private "$0" "$@"
fi
unset QUENX_CONTAINED TMPDIR

while read -r _ _ _ _ point options _; do
    point="$(printf '%b' "$point")" # a blank is written as \040
    case "$point" in /proc | /proc/* | /dev/pts) continue ;; esac
    case ",$options," in *,ro,*) continue ;; esac
    [ ! -e "$point" ] || mount -o remount,bind,ro "$point" # another mount may hide it
done </proc/self/mountinfo

here="$PWD"
folders=("$here") # the new /tmp may hide it, and the named ones: they are reached through what is opened here
exec {folder}<"$here"
opened=("$folder")
while [ "$1" != -- ]; do
    folders+=("$(realpath "$1")")
    exec {folder}<"$1"
    opened+=("$folder")
    shift
done
shift

mount -t tmpfs -o mode=1777 tmpfs /tmp
[ ! -d /dev/shm ] || mount -t tmpfs -o mode=1777 tmpfs /dev/shm
for i in "${!folders[@]}"; do
    mkdir -p "${folders[i]}"
    mount --no-canonicalize --rbind "/proc/self/fd/${opened[i]}" "${folders[i]}"
    exec {opened[i]}<&-
    [ "$i" = 0 ] || mount -o remount,bind,rw "${folders[i]}"
done

cd "$here" # as it is mounted now
exec "$@"
