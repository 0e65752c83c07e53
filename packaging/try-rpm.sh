#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Builds the RPM packages of the committed tree in a fresh root, installs, uses, upgrades and removes them there. As root.
# The root is that of try-packages.sh, a Debian with the package rpm: quenx.spec is tried, not the names that another
# distribution's packages have.
#
#   packaging/try-rpm.sh         DEBIAN_MIRROR names a mirror (default: deb.debian.org)
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

mirror="${DEBIAN_MIRROR:-http://deb.debian.org/debian}"
base="$PWD/build/fresh-root.tar"
root="$PWD/build/fresh-root-rpm"
[ "$(id -u)" = 0 ] || { echo "$0: run this as root: it makes a root of its own" >&2; exit 2; }

. packaging/try/fresh-root.sh
step() { printf '\n== %s\n' "$*"; }
fail() { echo "$0: $*" >&2; exit 1; }
quietly() { "$@" >build/try-rpm.log 2>&1 || { tail -n 40 build/try-rpm.log >&2; fail "failed: $*"; }; }
all_packages() { inside sh -c "rpm --force-debian --nodeps $1 /sources/build/rpm/RPMS/*/*.rpm"; }
mkdir -p build
trap leave_root EXIT

step "A fresh root, and the packages built in it"
make_root
mkdir "$root/sources"
git archive HEAD | tar -x -C "$root/sources"
quietly inside /sources/packaging/install-packages.sh build
quietly inside apt-get install -y --no-install-recommends ipxe-qemu python3 rpm scdoc systemd
inside /sources/packaging/build-rpm.sh | sed 's|.*/||'

step "Install, and look"
quietly all_packages -i
inside getent group quenx-admin || fail "the group is missing"
inside sh -c 'rpm -V --nodeps $(rpm -qa)' || fail "that is not what was packed"
inside sh -c 'for page in quenxctl.1 quenx-cimd.8 quenx-cimd.toml.5; do ls /usr/share/man/man*/$page*; done'
cp "$root/usr/share/doc/quenx/examples/adapters.toml" "$root/etc/quenx-adapters.toml"
inside quenxctl --backend simulator install --target eth0 /usr/lib/ipxe/qemu/efi-virtio.rom
inside quenxctl --backend simulator history

step "Upgrade: what somebody has configured stays"
echo '# Mine.' >>"$root/etc/quenx/policy.toml"
quietly all_packages "-U --replacepkgs"
grep -q '^# Mine.' "$root/etc/quenx/policy.toml" || fail "the upgrade took the configuration"

step "Remove"
quietly inside sh -c 'rpm --force-debian -e $(rpm -qa)'
[ ! -e "$root/usr/bin/quenxctl" ] || fail "a program is left"
grep -q '^# Mine.' "$root/etc/quenx/policy.toml.rpmsave" || fail "the configuration was not kept aside"
[ -d "$root/var/lib/quenx" ] || fail "the history was removed"
leave_root
rm -rf --one-file-system "$root"
echo "The RPM packages can be built, installed, used, upgraded and removed."
