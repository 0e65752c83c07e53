#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# How fast quenx-cimd answers, over HTTP and HTTPS, and how much memory it takes: starts one on free loopback ports,
# with simulated adapters that write at once and with 1,000 ended jobs, and lets wrk post to it.
#
#   bench/server/run.sh [SECONDS]    for each figure, 5 if not given
#
# REQUESTS=N sets after how many requests the memory is read again (a million if not set). Needs wrk and curl. The
# clients run on the same machine, so they take their share of its processors.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/../.."
export LC_ALL=C.UTF-8

seconds="${1:-5}"
requests="${REQUESTS:-1000000}"
jobs=1000
for tool in wrk curl; do
    command -v "$tool" >/dev/null || { echo "$0: $tool is missing; install the package of that name" >&2; exit 1; }
done
[ -S /dev/log ] ||
    echo "There is no syslog here: each refusal's log lines go to the console, whose speed will be measured." >&2

cmake --preset release >/dev/null
cmake --build --preset release -j "$(nproc)" \
    --target quenx-cimd Quenx_SoftwareUpdate Quenx_SoftwareInventory >/dev/null

scratch="$(mktemp -d)"
daemon_id=
stop() {
    [ -z "$daemon_id" ] || { kill "$daemon_id" && wait "$daemon_id"; } 2>/dev/null || true
    rm -rf "$scratch"
}
trap stop EXIT

cat >"$scratch/adapters.toml" <<EOF
[[adapter]]
name = "eth0"
pci_address = "0000:03:00.0"
pci_id = "1af4:1041"
mac = "52:54:00:10:00:00"
flash_file = "/usr/lib/ipxe/qemu/efi-virtio.rom"
EOF
printf 'FWFilePath=%s\n' "$scratch" >"$scratch/provider.conf"
cat >"$scratch/quenx-cimd.toml" <<EOF
[listen]
https_port = 0
http = true
http_port = 0
socket = ""
[tls]
certificate = "$scratch/cert.pem"
key = "$scratch/key.pem"
generate = true
[auth]
method = "users"
users_file = "$scratch/users"
remember_seconds = 3600
[limits]
connections_per_address = 256
[providers]
directory = "$PWD/build/release/lib"
configuration = "$scratch/provider.conf"
[adapters]
description = "$scratch/adapters.toml"
state = "$scratch/state"
[daemon]
lock_file = "$scratch/lock"
EOF
echo bench | build/release/bin/quenx-cimd passwd --users "$scratch/users" bench >/dev/null
build/release/bin/quenx-cimd --config "$scratch/quenx-cimd.toml" >"$scratch/log" 2>&1 &
daemon_id=$!
port_of() {
    for _ in $(seq 100); do
        grep -oP "$1://127\.0\.0\.1:\K[0-9]+" "$scratch/log" && return
        sleep 0.1
    done
    cat "$scratch/log" >&2
    return 1
}
http="http://127.0.0.1:$(port_of http | head -n 1)/cimom"
https="https://127.0.0.1:$(port_of https | head -n 1)/cimom"

CREDENTIALS="$(printf bench:bench | base64)"
export CREDENTIALS

namespace='<LOCALNAMESPACEPATH><NAMESPACE NAME="root"/><NAMESPACE NAME="cimv2"/></LOCALNAMESPACEPATH>'
message() {
    printf '<?xml version="1.0" encoding="utf-8"?>\n<CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE ID="1"'
    printf ' PROTOCOLVERSION="1.0"><SIMPLEREQ>%s</SIMPLEREQ></MESSAGE></CIM>' "$1"
}
enumerate() { # OPERATION CLASS
    message "<IMETHODCALL NAME=\"$1\">$namespace<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"$2\"/></IPARAMVALUE>\
</IMETHODCALL>"
}
install() { # URI
    message "<METHODCALL NAME=\"InstallFromURI\"><LOCALINSTANCEPATH>$namespace$service</LOCALINSTANCEPATH><PARAMVALUE \
NAME=\"URI\"><VALUE>$1</VALUE></PARAMVALUE><PARAMVALUE NAME=\"InstallOptions\"><VALUE.ARRAY><VALUE>5</VALUE><VALUE>3\
</VALUE></VALUE.ARRAY></PARAMVALUE><PARAMVALUE NAME=\"Target\"><VALUE.REFERENCE><LOCALINSTANCEPATH>$namespace$target\
</LOCALINSTANCEPATH></VALUE.REFERENCE></PARAMVALUE></METHODCALL>"
}
resident() { awk '/^VmRSS/ { printf "%.1f MiB", $2 / 1024 }' "/proc/$daemon_id/status"; }
post() { # FILE CIMMETHOD CIMOBJECT
    curl -sS "$http" -H 'Content-Type: application/xml; charset="utf-8"' -H 'CIMOperation: MethodCall' \
        -H "CIMMethod: $2" -H "CIMObject: $3" -H "Authorization: Basic $CREDENTIALS" --data-binary "@$1"
}
# The first path of a class, as an element.
path_of() {
    enumerate EnumerateInstanceNames "$1" >"$scratch/names.xml"
    post "$scratch/names.xml" EnumerateInstanceNames root/cimv2 | grep -o '<INSTANCENAME .*' |
        sed 's|</INSTANCENAME>.*|</INSTANCENAME>|'
}
service="$(path_of Quenx_SoftwareInstallationService)"
target="$(path_of Quenx_EthernetPort)"
# The same path as the text of a CIMObject header.
service_object="root/cimv2:Quenx_SoftwareInstallationService.$(grep -oP 'KEYBINDING NAME="\K[^"]+|<KEYVALUE[^>]*>\K[^<]+' \
    <<<"$service" | paste -d= - - | sed 's/=\(.*\)/="\1"/' | paste -sd,)"
enumerate EnumerateInstances Quenx_SoftwareInstallationService >"$scratch/service.xml"
enumerate EnumerateInstances Quenx_ConcreteJob >"$scratch/jobs.xml"
install "https://elsewhere/image" >"$scratch/refused.xml"
install "file:///usr/lib/ipxe/qemu/efi-virtio.rom" >"$scratch/install.xml"

# Prints the row of figures: LABEL FILE CIMMETHOD CIMOBJECT EXPECTED CONNECTIONS URL SECONDS
measure() {
    printf '%-34s %-5s %4s ' "$1" "${7%%:*}" "$6"
    REQUEST="$scratch/$2" METHOD="$3" OBJECT="$4" EXPECTED="$5" \
        wrk -t "$(($6 < 2 ? 1 : 2))" -c "$6" -d "$8s" --timeout 30s -s bench/server/post.lua "$7" | tail -n 1
}

echo "resident after start: $(resident)"
measure "EnumerateInstances, for memory" service.xml EnumerateInstances root/cimv2 \
    'CLASSNAME="Quenx_SoftwareInstallationService"' 8 "$http" "$seconds" >"$scratch/row"
rate="$(awk '{ print int($(NF - 3)) }' "$scratch/row")"
measure "EnumerateInstances, for memory" service.xml EnumerateInstances root/cimv2 \
    'CLASSNAME="Quenx_SoftwareInstallationService"' 8 "$http" "$((requests / rate + 1))" >>"$scratch/row"
echo "resident after about $requests requests: $(resident)"

for ((done = 0; done < jobs;)); do
    # The adapter of a job that has not ended refuses the next (return value 6).
    answer="$(post "$scratch/install.xml" InstallFromURI "$service_object")"
    case "$answer" in
        *"<VALUE>4096<"*) done=$((done + 1)) ;;
        *"<VALUE>6<"*) ;;
        *) echo "$0: InstallFromURI was answered with: $answer" >&2; exit 1 ;;
    esac
done
echo "resident with $jobs jobs: $(resident)"
job="$(path_of Quenx_ConcreteJob)"
message "<IMETHODCALL NAME=\"GetInstance\">$namespace<IPARAMVALUE NAME=\"InstanceName\">$job</IPARAMVALUE></IMETHODCALL>" \
    >"$scratch/get.xml"

printf '\n%-34s %-5s %4s %12s %10s %10s %8s\n' "" "" conn requests/s "p50 ms" "p99 ms" errors
for url in "$http" "$https"; do
    for connections in 1 8 64; do
        measure "EnumerateInstances, one service" service.xml EnumerateInstances root/cimv2 \
            'CLASSNAME="Quenx_SoftwareInstallationService"' "$connections" "$url" "$seconds"
        measure "EnumerateInstances, $jobs jobs" jobs.xml EnumerateInstances root/cimv2 \
            'Job#1<' "$connections" "$url" "$seconds"
        measure "GetInstance, a job" get.xml GetInstance root/cimv2 'Job#1<' "$connections" "$url" "$seconds"
        # 5, or 6 while another such call holds the adapter
        measure "InstallFromURI, refused" refused.xml InstallFromURI "$service_object" '<RETURNVALUE' "$connections" \
            "$url" "$seconds"
    done
done
echo
echo "resident at the end: $(resident)"
