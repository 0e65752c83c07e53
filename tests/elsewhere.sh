#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Runs the demo and the release tests where such things go wrong: as an ordinary user, in a folder with blanks and
# umlauts, with variables and a configuration in /etc that must not matter, and with everything else read-only.
# An ordinary user runs it as himself. Where nothing can be mounted, /etc is as it is, and nothing is read-only.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

jobs="${JOBS:-$(nproc)}"
name=elsewhere
place="$(mktemp -d)"
trap 'rm -rf "$place"' EXIT
project="$place/Meine Projekte äöü/quenx"
mkdir -p "$project" "$place/home"
tar -c --exclude=./.git --exclude='./build*' . | tar -x -C "$project"

as_user=()
if [ "$(id -u)" = 0 ]; then
    chown -R nobody:nogroup "$place/home" "$place/Meine Projekte äöü"
    chmod 755 "$place"
    as_user=(setpriv --reuid=nobody --regid=nogroup --clear-groups)
    if tools/contained.sh . -- true 2>/dev/null; then
        # What the compiler cache has is used, and nothing added.
        cache="$(ccache --get-config cache_dir)"
        mkdir -p "$cache" "$place/ccache"
        export CCACHE_DIR="$place/ccache" CCACHE_READONLY=1 CCACHE_TEMPDIR=/tmp
        cp -a /etc "$place/etc"
        mkdir -p "$place/etc/quenx-cimd" "$place/etc/quenx"
        printf 'Namespace=root/elsewhere\nOEMCustomizeable=5\nFWFilePath=/usr/lib/ipxe/qemu\n' \
            >"$place/etc/quenx-cimprovider.conf"
        echo 'not = [ the adapters of a test' >"$place/etc/quenx-adapters.toml"
        echo 'not = [ the settings of a test' >"$place/etc/quenx-cimd/quenx-cimd.toml"
        echo 'not = [ the policy of a test' >"$place/etc/quenx/policy.toml"
        as_user=(unshare --mount --propagation private
            sh -c 'mount --bind "$1" "$2/ccache" && mount --bind "$2/etc" /etc && shift 2 && exec "$@"' sh
            "$cache" "$place" tools/contained.sh "$place" -- "${as_user[@]}")
    fi
fi

# Port 9 of this machine stands for a proxy that is not there.
proxy=http://127.0.0.1:9
"${as_user[@]}" env HOME="$place/home" JOBS="$jobs" \
    http_proxy="$proxy" https_proxy="$proxy" HTTPS_PROXY="$proxy" ALL_PROXY="$proxy" \
    QUENX_BACKEND=nonexistent QUENX_ADAPTERS=/nonexistent/adapters.toml QUENX_ADAPTER_STATE=/nonexistent/state \
    QUENXCTL_USER=somebody QUENXCTL_PASSWORD=something TARVEL_SMASHv2_LOG_LEVEL=2 \
    LC_ALL=POSIX TZ=Asia/Kathmandu DESTDIR=/nonexistent CDPATH=/usr NO_COLOR=1 TERM=dumb \
    bash -euo pipefail -c '
        umask 077
        cd "$1"
        echo "== elsewhere: the demo, in $PWD, as $(id -un)"
        ./demo.sh >demo.log 2>&1 || { cat demo.log; exit 1; }
        tail -n 20 demo.log
        echo "== elsewhere: building"
        cmake --preset release -DQUENX_BENCH=OFF >/dev/null
        cmake --build --preset release -j "$JOBS"
        echo "== elsewhere: testing"
        ctest --preset release -j "$JOBS"
    ' bash "$project" || status=$?
# test.sh tells from it what was skipped.
mkdir -p "build/$name/Testing/Temporary"
cp "$project/build/release/Testing/Temporary/LastTest.log" "build/$name/Testing/Temporary/" || true
exit "${status:-0}"
