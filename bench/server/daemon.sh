# SPDX-License-Identifier: Apache-2.0
# For run.sh: daemons to measure, each by a name, and what is asked of them. In the folder $scratch.
declare -A daemon_id=() http=() https=() service_object=()
pids=()

stop_daemons() {
    for pid in "${pids[@]}"; do
        { kill "$pid" && wait "$pid"; } 2>/dev/null || true
    done
    rm -rf "$scratch"
}

# A syslog that reads and drops, in a /dev that this script and its children have alone.
serve_syslog() {
    local devices name
    devices="$scratch/devices"
    mkdir "$devices"
    mount -t tmpfs -o mode=755 tmpfs "$devices"
    for name in null zero full random urandom tty; do
        [ -e "/dev/$name" ] || continue
        : >"$devices/$name"
        mount --bind "/dev/$name" "$devices/$name"
    done
    ln -s /proc/self/fd "$devices/fd"
    mkdir "$devices/shm"
    mount --move "$devices" /dev
    python3 -c 'import socket
log = socket.socket(socket.AF_UNIX, socket.SOCK_DGRAM)
log.bind("/dev/log")
while True: log.recv(65536)' &
    pids+=($!)
    until [ -S /dev/log ]; do sleep 0.1; done
}

# Starts the daemon of a build's folder, on free loopback ports, with a simulated adapter that writes at once.
start_daemon() { # NAME BUILD
    local own="$scratch/$1" binary="$2/bin/quenx-cimd" options
    mkdir "$own"
    options="$("$binary" --help)"
    known() { [[ "$options" != *"--$1 "* ]] || printf '%s = %s\n' "${1##*-}" "$2"; } # an older build lacks some
    cat >"$own/adapters.toml" <<EOF
[[adapter]]
name = "eth0"
pci_address = "0000:03:00.0"
pci_id = "1af4:1041"
mac = "52:54:00:10:00:00"
flash_file = "/usr/lib/ipxe/qemu/efi-virtio.rom"
EOF
    printf 'FWFilePath=%s\n' "$own" >"$own/provider.conf"
    echo "# As if there were none." >"$own/policy.toml"
    cat >"$own/quenx-cimd.toml" <<EOF
[listen]
https_port = 0
http = true
http_port = 0
$(known listen-socket '""')
[tls]
certificate = "$own/cert.pem"
key = "$own/key.pem"
$(known tls-generate true)
[auth]
method = "users"
users_file = "$own/users"
remember_seconds = 3600
[limits]
connections_per_address = 256
[providers]
directory = "$2/lib"
configuration = "$own/provider.conf"
$(known providers-policy "\"$own/policy.toml\"")
[adapters]
description = "$own/adapters.toml"
state = "$own/state"
[daemon]
lock_file = "$own/lock"
EOF
    echo bench | "$binary" passwd --users "$own/users" bench >/dev/null
    "$binary" --config "$own/quenx-cimd.toml" >"$own/log" 2>&1 &
    daemon_id[$1]=$!
    pids+=("${daemon_id[$1]}")
    http[$1]="http://127.0.0.1:$(port_of "$own/log" http)/cimom"
    https[$1]="https://127.0.0.1:$(port_of "$own/log" https)/cimom"
    write_requests "$1"
}
port_of() { # LOG SCHEME
    for _ in $(seq 100); do
        grep -oP "$2://127\.0\.0\.1:\K[0-9]+" "$1" | head -n 1 | grep . && return
        sleep 0.1
    done
    cat "$1" >&2
    return 1
}

CREDENTIALS="$(printf bench:bench | base64)"
export CREDENTIALS

namespace='<LOCALNAMESPACEPATH><NAMESPACE NAME="root"/><NAMESPACE NAME="cimv2"/></LOCALNAMESPACEPATH>'
message() {
    printf '<?xml version="1.0" encoding="utf-8"?>\n<CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE ID="1"'
    printf ' PROTOCOLVERSION="1.0"><SIMPLEREQ>%s</SIMPLEREQ></MESSAGE></CIM>' "$1"
}
enumerate() { # OPERATION CLASS [PROPERTY...]
    local list="" name
    for name in "${@:3}"; do list+="<VALUE>$name</VALUE>"; done
    [ -z "$list" ] || list="<IPARAMVALUE NAME=\"PropertyList\"><VALUE.ARRAY>$list</VALUE.ARRAY></IPARAMVALUE>"
    message "<IMETHODCALL NAME=\"$1\">$namespace<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"$2\"/></IPARAMVALUE>\
$list</IMETHODCALL>"
}
get() { # INSTANCENAME
    message "<IMETHODCALL NAME=\"GetInstance\">$namespace<IPARAMVALUE NAME=\"InstanceName\">$1</IPARAMVALUE>\
</IMETHODCALL>"
}
install() { # SERVICE TARGET URI
    message "<METHODCALL NAME=\"InstallFromURI\"><LOCALINSTANCEPATH>$namespace$1</LOCALINSTANCEPATH><PARAMVALUE \
NAME=\"URI\"><VALUE>$3</VALUE></PARAMVALUE><PARAMVALUE NAME=\"InstallOptions\"><VALUE.ARRAY><VALUE>5</VALUE><VALUE>3\
</VALUE></VALUE.ARRAY></PARAMVALUE><PARAMVALUE NAME=\"Target\"><VALUE.REFERENCE><LOCALINSTANCEPATH>$namespace$2\
</LOCALINSTANCEPATH></VALUE.REFERENCE></PARAMVALUE></METHODCALL>"
}

post() { # NAME FILE CIMMETHOD CIMOBJECT [TIMES]: over one connection
    curl -sS "${http[$1]}#[1-${5:-1}]" -H 'Content-Type: application/xml; charset="utf-8"' \
        -H 'CIMOperation: MethodCall' -H "CIMMethod: $3" -H "CIMObject: $4" -H "Authorization: Basic $CREDENTIALS" \
        --data-binary "@$scratch/$1/$2"
}
# The first path of a class, as an element.
path_of() { # NAME CLASS
    enumerate EnumerateInstanceNames "$2" >"$scratch/$1/names.xml"
    post "$1" names.xml EnumerateInstanceNames root/cimv2 | grep -o '<INSTANCENAME .*' |
        sed 's|</INSTANCENAME>.*|</INSTANCENAME>|'
}
write_requests() { # NAME
    local own="$scratch/$1" service target
    service="$(path_of "$1" Quenx_SoftwareInstallationService)"
    target="$(path_of "$1" Quenx_EthernetPort)"
    # The same path as the text of a CIMObject header.
    service_object[$1]="root/cimv2:Quenx_SoftwareInstallationService.$(
        grep -oP 'KEYBINDING NAME="\K[^"]+|<KEYVALUE[^>]*>\K[^<]+' <<<"$service" |
            paste -d= - - | sed 's/=\(.*\)/="\1"/' | paste -sd,)"
    enumerate EnumerateInstances Quenx_SoftwareInstallationService >"$own/service.xml"
    get "$service" >"$own/get-service.xml"
    enumerate EnumerateInstances Quenx_ConcreteJob >"$own/jobs.xml"
    enumerate EnumerateInstances Quenx_ConcreteJob InstanceID Name JobState JobStatus PercentComplete ElapsedTime \
        StartTime TimeOfLastStateChange OperationalStatus ErrorCode >"$own/jobs-10.xml"
    install "$service" "$target" "https://elsewhere/image" >"$own/refused.xml"
    install "$service" "$target" "file:///usr/lib/ipxe/qemu/efi-virtio.rom" >"$own/install.xml"
}

# Has the daemon carry out so many jobs, and writes the request for the first of them.
make_jobs() { # NAME COUNT
    local done=0 answers
    while [ "$done" -lt "$2" ]; do
        answers="$(post "$1" install.xml InstallFromURI "${service_object[$1]}" "$(($2 - done < 50 ? $2 - done : 50))")"
        # The adapter of a job that has not ended refuses the next (return value 6).
        if ! grep -qE '<VALUE>(4096|6)<' <<<"$answers"; then
            echo "$0: InstallFromURI was answered with: $(head -n 2 <<<"$answers")" >&2
            return 1
        fi
        done=$((done + $(grep -c '<VALUE>4096<' <<<"$answers" || true)))
    done
    get "$(path_of "$1" Quenx_ConcreteJob)" >"$scratch/$1/get-job.xml"
}

# What one load does: requests/s, p50 and p99 in ms, errors.
drive() { # NAME FILE CIMMETHOD CIMOBJECT EXPECTED CONNECTIONS URL SECONDS
    REQUEST="$scratch/$1/$2" METHOD="$3" OBJECT="$4" EXPECTED="$5" \
        wrk -t "$(($6 < 2 ? 1 : 2))" -c "$6" -d "$8s" --timeout 30s -s bench/server/post.lua "$7" | tail -n 1
}

resident() { awk '/^VmRSS/ { printf "%.1f MiB", $2 / 1024 }' "/proc/${daemon_id[$1]}/status"; }
pss() { awk '/^Pss:/ { printf "%.1f", $2 / 1024 }' "/proc/${daemon_id[$1]}/smaps_rollup"; }
# Of both user and system, in seconds.
processor_time() { awk -v hz="$(getconf CLK_TCK)" '{ print ($14 + $15) / hz }' "/proc/${daemon_id[$1]}/stat"; }
