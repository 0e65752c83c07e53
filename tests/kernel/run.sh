#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Boots a virtual machine whose kernel has network cards that can be flashed, and runs guest/tests.sh in it with the
# programs of build/release. Fails when a test did, when the kernel complained, or at the time limit.
#
#   tests/kernel/run.sh             after tests/kernel/prepare.sh and a build of the programs
#   tests/kernel/run.sh NAME...     just these tests
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/../.."

# Emulation takes half a minute for all of it, and many times that on a busy machine.
limit="${KERNEL_TEST_SECONDS:-2400}"
place="$(realpath build/kernel)"
kernel="$place/current"
root="$place/root"
if [ ! -e "$kernel/testcard.ko" ]; then
    echo "$0: There is no kernel in build/kernel. Make it: tests/kernel/prepare.sh" >&2
    exit 2
fi

# Copies files to the guest, to where they are here; then libraries that programs need.
bring() { cp -L --parents "$@" "$root/"; }
bring_libraries_of() {
    local libraries
    mapfile -t libraries < <(ldd "$@" | grep -oE '(=> |^\s+)/[^ ]+' | sed 's/^[^/]*//' | grep -vF "$root" | sort -u)
    bring "${libraries[@]}"
}

rm -rf "$root"
mkdir -p "$root"/{dev,proc,sys,run,tmp,etc/quenx-cimd,root,var,var/lib,usr/{bin,sbin,lib,lib64}}
ln -s usr/bin usr/sbin usr/lib usr/lib64 "$root/"
ln -s ../run "$root/var/"
DESTDIR="$root" cmake --install build/release --prefix /usr/local --strip >"$place/install.log"
tools=(/lib/systemd/systemd)
for tool in busybox devlink setpriv systemctl systemd-tmpfiles wbemcli; do tools+=("$(command -v "$tool")"); done
tools+=("$(ldconfig -p | awk '$1 == "libcurl.so.4" && /x86-64/ && !found++ { print $NF }')") # quenxctl loads it for a server
bring "${tools[@]}" /lib/systemd/system/{basic,network-online,shutdown,sysinit}.target
bring_libraries_of "${tools[@]}" "$root"/usr/local/{bin/quenxctl,sbin/quenx-cimd,lib/quenx/*.so}
cp "$kernel"/*.ko tests/kernel/guest/{init,tests.sh} "$root/"
cp tests/kernel/guest/*.service "$root/lib/systemd/system/"
printf 'root:x:0:0::/root:/bin/sh\nnobody:x:65534:65534::/:/bin/sh\n' >"$root/etc/passwd"
printf 'root:x:0:\nnogroup:x:65534:\n' >"$root/etc/group"
(cd "$root" && find . | busybox cpio -o -H newc -R 0:0) >"$place/initrd" 2>"$place/initrd.log"

# Slot 5 has a card with two functions, 6 one with one, 7 one whose driver does not flash; 8 is nobody's.
card() { printf -- '-device\n%s,addr=%s,romfile=,multifunction=%s\n' "$1" "$2" "${3:-off}"; }
mapfile -t cards < <(card e1000 5.0 on; card e1000 5.1; card e1000 6.0; card e1000-82544gc 7.0; card rtl8139 8.0)
# What an emulated machine on a busy one trips over: a timer that comes late, and whatever watches for standstill.
patience="no_timer_check nowatchdog rcupdate.rcu_cpu_stall_suppress=1 sysctl.kernel.hung_task_timeout_secs=0"
patience+=" systemd.default_timeout_start_sec=600"
echo "== kernel: $(readlink "$kernel")"
nice timeout "$limit" qemu-system-x86_64 -nodefaults -no-user-config -machine pc,accel=tcg -cpu qemu64,+rdrand -m 1G \
    -display none -no-reboot -kernel "$kernel/vmlinuz" -initrd "$place/initrd" "${cards[@]}" \
    -append "console=ttyS0 panic=-1 mitigations=off $patience tests=$(IFS=,; echo "$*")" \
    -serial "file:$place/console.log" -serial stdio </dev/null 2>"$place/qemu.log" | tee "$place/results.log" || {
    tail -n 60 "$place/qemu.log" "$place/console.log" >&2
    echo "The virtual machine did not end by itself within $limit s. Its console is above, and in $place/console.log." >&2
    exit 1
}
if grep -E 'BUG:|WARNING:|Oops|Kernel panic' "$place/console.log" >&2; then
    echo "The kernel complained: see $place/console.log." >&2
    exit 1
fi
# The last line says how many there were: without it the machine stopped too early.
grep -q '^end: all passed$' "$place/results.log"
