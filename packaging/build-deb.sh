#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Builds the Debian packages of the committed tree, into build/deb, and has lintian look at them. Without a repository
# (in an archive of the sources) it takes the folder as it is.
#
#   packaging/build-deb.sh             installs what building them takes, as root or with sudo
#   packaging/build-deb.sh --no-install    leaves it to the caller to have them
#   packaging/build-deb.sh --no-lintian    does not look at the packages
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

install=true
lintian=true
for argument in "$@"; do
    case "$argument" in
        --no-install) install=false ;;
        --no-lintian) lintian=false ;;
        *) echo "$0: unknown option $argument; there are --no-install and --no-lintian" >&2; exit 2 ;;
    esac
done
[ "$install" = false ] || packaging/install-packages.sh build deb
result="$PWD/build/deb"
rm -rf "$result"
mkdir -p "$result/source"
if [ "$(git rev-parse --show-toplevel 2>/dev/null)" = "$PWD" ]; then
    git archive HEAD | tar -x -C "$result/source"
    # The same sources are to give the same bytes, whenever they are built.
    SOURCE_DATE_EPOCH="$(git log -1 --format=%ct)"
else
    tar -c --exclude=./build --exclude=./.git . | tar -x -C "$result/source"
    SOURCE_DATE_EPOCH="$(stat -c %Y CHANGELOG.md)"
fi
export SOURCE_DATE_EPOCH

cd "$result/source"
mv packaging/debian debian
version="$(sed -n 's/^project(Quenx VERSION \([0-9.]*\).*/\1/p' CMakeLists.txt)"
cat >debian/changelog <<EOT
quenx ($version) unstable; urgency=medium

  * Of this release CHANGELOG.md tells.

 -- Quenx developers <developers@quenx.example>  $(date -u -R -d "@$SOURCE_DATE_EPOCH")
EOT

# debhelper hides the home folder, and with it what the compiler cache knows.
if command -v ccache >/dev/null; then
    CCACHE_DIR="${CCACHE_DIR:-$(ccache --get-config cache_dir)}"
    export CCACHE_DIR
fi
# No path of this build, and no name of this machine, is to be in what is delivered.
DEB_BUILD_OPTIONS="${DEB_BUILD_OPTIONS:-nocheck parallel=$(nproc)}" LC_ALL=C.UTF-8 \
    dpkg-buildpackage --build=binary --unsigned-changes --no-pre-clean >"$result/log" 2>&1 ||
    { tail -n 40 "$result/log" >&2; echo "$0: the build failed; the whole log is $result/log" >&2; exit 1; }
cd "$result"
rm -rf source
if [ "$lintian" = true ]; then lintian --fail-on error,warning ./*.changes; fi
printf '%s\n' "$result"/*.deb
