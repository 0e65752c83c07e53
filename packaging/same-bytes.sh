#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Builds the packages twice, in folders of different names, with another time zone, language and umask, and at different
# times: both have to be the same, byte by byte. The committed tree, like build-deb.sh. What differs stays in build. The
# second build takes nothing from a compiler cache, which would compare the first with itself.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

place="$PWD/build/same-bytes"
rm -rf "$place"
build() {
    local folder="$place/$1"
    mkdir -p "$folder"
    git archive HEAD | tar -x -C "$folder"
    (cd "$folder" && "${@:2}" packaging/build-deb.sh --no-install --no-lintian)
    (cd "$folder/build/deb" && sha256sum ./*.deb) >"$place/$1.sums"
}
build one env
build another-folder env CCACHE_DISABLE=1 TZ=Pacific/Kiritimati LANG=C bash -c 'umask 077 && exec "$0" "$@"'
cat "$place/one.sums"
if ! diff "$place/one.sums" "$place/another-folder.sums"; then
    echo "$0: the packages differ; compare those in $place, by diffoscope for instance" >&2
    exit 1
fi
echo "Both builds have the same bytes."
rm -rf "$place"
