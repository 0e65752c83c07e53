#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Builds the RPM packages of the committed tree, into build/rpm; without a repository (in an archive of the sources) of
# the folder as it is. On a system that has no RPM packages of what building takes, such as Debian, that is not asked
# for: whoever runs this has it from elsewhere.
#
#   packaging/build-rpm.sh
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

command -v rpmbuild >/dev/null || { echo "$0: rpmbuild is missing; install the package rpm" >&2; exit 1; }
version="$(sed -n 's/^project(Quenx VERSION \([0-9.]*\).*/\1/p' CMakeLists.txt)"
result="$PWD/build/rpm"
rm -rf "$result"
mkdir -p "$result/SOURCES"
if [ "$(git rev-parse --show-toplevel 2>/dev/null)" = "$PWD" ]; then
    git archive --prefix="quenx-$version/" HEAD
else
    tar -c --exclude=./build --exclude=./.git --transform="s,^\\.,quenx-$version," .
fi | gzip -n >"$result/SOURCES/quenx-$version.tar.gz"
options=(--define "_topdir $result" --define "quenx_version $version")
[ ! -f /etc/debian_version ] || options+=(--nodeps)
rpmbuild -bb "${options[@]}" "$@" packaging/rpm/quenx.spec >"$result/log" 2>&1 ||
    { tail -n 40 "$result/log" >&2; echo "$0: the build failed; the whole log is $result/log" >&2; exit 1; }
find "$result/RPMS" -name '*.rpm' | sort
