# SPDX-License-Identifier: Apache-2.0
# Runs the tests, or those that the kernel's command line names. Each is a function whose name begins with test_, in a
# shell of its own; the first command that fails is the end of it, and then what it printed is shown.

A=0000:00:05.0 # two functions of one card
B=0000:00:05.1
C=0000:00:06.0 # a card of its own

knob() { echo "$3" >"/sys/kernel/debug/testcard/${1%.*}/$2"; } # CARD NAME VALUE
read_knob() { cat "/sys/kernel/debug/testcard/${1%.*}/$2"; }
reset_cards() {
    for card in $A $C; do
        knob $card fail_at 4294967295
        for switch in hold quiet fail_activation lose_interface; do knob $card $switch N; done
        knob $card most_flashing 0
    done
}
# Makes an image of the given version and prints its path.
image() {
    mkdir -p /tmp/images
    { echo "TESTCARD $1"; head -c 300000 /dev/urandom; } >"/tmp/images/$1.bin"
    echo "/tmp/images/$1.bin"
}
# What the kernel tells of a function: running or stored, the version's name.
version() { devlink -j dev info "pci/$1" | sed -n "s/.*\"$2\":{[^}]*\"$3\":\"\([^\"]*\)\".*/\1/p"; }
same() { [ "$1" = "$2" ] || { echo "there is \"$1\" where \"$2\" should be"; return 1; }; }
has() { case "$1" in *"$2"*) ;; *) echo "there is no \"$2\" in: $1"; return 1 ;; esac; }
fails_with() { # STATUS COMMAND...: its output follows
    wanted=$1
    shift
    status=0
    output="$("$@" 2>&1)" || status=$?
    echo "$output"
    same $status $wanted
}

# The cards themselves, as the kernel's own tool sees them.
test_the_test_card() {
    mkdir -p /lib/firmware
    cp "$(image 1.1.0)" /lib/firmware/card.bin
    devlink dev flash pci/$B file card.bin
    same "$(version $A stored fw)" 1.1.0
    same "$(version $A running fw)" 1.0.0
    same "$(version $C stored fw)" 1.0.0
    cmp /lib/firmware/card.bin /sys/kernel/debug/testcard/0000:00:05/content
    devlink dev reload pci/$A action fw_activate
    same "$(version $B running fw)" 1.1.0
    devlink dev flash pci/$A file card.bin component fw.undi
    knob $C fail_at 25
    fails_with 1 devlink dev flash pci/$C file card.bin
    has "$output" "the flash of the test card does not answer"
    same "$(version $C stored fw)" 1.0.0
    fails_with 1 devlink dev flash pci/0000:00:07.0 file card.bin
    rm /lib/firmware/card.bin
}

if [ $# = 1 ]; then
    set -e
    test_$1
    exit
fi
chosen="$(sed -n 's/.* tests=\([^ ]*\).*/\1/p' /proc/cmdline | tr , ' ')"
[ -n "$chosen" ] || chosen="$(sed -n 's/^test_\([a-z0-9_]*\)() {$/\1/p' "$0")"
end="all passed"
for name in $chosen; do
    reset_cards
    # A test that hangs is not the end of the others.
    if timeout 600 sh "$0" "$name" >/tmp/output 2>&1; then
        echo "ok $name"
    else
        echo "not ok $name: $(tail -n 1 /tmp/output)"
        sed 's/^/    /' /tmp/output
        end="not all passed"
    fi
done
echo "end: $end"
