# SPDX-License-Identifier: Apache-2.0
# Sourced by scripts that use a fresh Debian 12: needs the variables mirror, base (an archive of the root, which is made
# where it is missing) and root (a folder, which is emptied).
inside() {
    chroot "$root" env -i PATH=/usr/local/sbin:/usr/local/bin:/usr/sbin:/usr/bin:/sbin:/bin LC_ALL=C.UTF-8 \
        DEBIAN_FRONTEND=noninteractive HOME=/root TERM=dumb "$@"
}

leave_root() {
    local point
    for point in proc dev; do
        ! mountpoint -q "$root/$point" || umount "$root/$point"
    done
}

make_root() {
    leave_root
    rm -rf --one-file-system "$root"
    mkdir -p "$root"
    if [ ! -f "$base" ]; then
        command -v debootstrap >/dev/null || { echo "$0: install the package debootstrap" >&2; exit 1; }
        debootstrap --variant=minbase bookworm "$root" "$mirror" >"$base.log"
        tar -c -C "$root" . >"$base.new"
        mv "$base.new" "$base"
    else
        tar -x -C "$root" -f "$base"
    fi
    mount -t proc proc "$root/proc"
    # How this machine reaches its packages, apart from where.
    cp /etc/resolv.conf "$root/etc/resolv.conf"
    local file
    for file in /etc/apt/apt.conf /etc/apt/apt.conf.d/*; do
        [ ! -f "$file" ] || ! grep -q '^ *Acquire::https\?::' "$file" || cp "$file" "$root/etc/apt/apt.conf.d/"
    done
    echo "deb $mirror bookworm main" >"$root/etc/apt/sources.list"
    # Nothing is started: there is no init.
    printf '#!/bin/sh\nexit 101\n' >"$root/usr/sbin/policy-rc.d"
    chmod +x "$root/usr/sbin/policy-rc.d"
    cp packaging/try/systemctl packaging/try/serve "$root/usr/local/sbin/"
    inside apt-get update >/dev/null
}
