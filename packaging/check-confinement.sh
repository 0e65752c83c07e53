#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Whether the AppArmor profile is one, and whether the SELinux module compiles. Neither needs a kernel that has them.
#
#   packaging/check-confinement.sh     takes apparmor and selinux-policy-dev
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")"

apparmor_parser --skip-kernel-load --skip-cache --quiet apparmor/usr.sbin.quenx-cimd
echo "The AppArmor profile is one."
scratch="$(mktemp -d)"
trap 'rm -rf "$scratch"' EXIT
cp selinux/quenx.te selinux/quenx.fc "$scratch"
make -C "$scratch" -f /usr/share/selinux/devel/Makefile quenx.pp >"$scratch/log" 2>&1 ||
    { cat "$scratch/log" >&2; exit 1; }
if grep -i -E 'warning|error' "$scratch/log"; then exit 1; fi
echo "The SELinux module compiles."
