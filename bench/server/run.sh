#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# How fast quenx-cimd answers, and how much memory it takes: starts it on free loopback ports, with simulated adapters
# that write at once and with 1,000 ended jobs, and lets wrk post to it.
#
#   bench/server/run.sh [SECONDS]                   a table of one to 64 connections, over HTTP and HTTPS
#   bench/server/run.sh --against BUILD [SECONDS]   this build and an older one (a folder with bin/ and lib/) by turns
#
# SECONDS is the length of each load, 5 if not given, and 3 with --against. REQUESTS=N sets after how many requests the
# table reads the memory again (a million if not set). Needs wrk, curl and python3. The clients run on the same machine,
# so they take their share of its processors.
set -euo pipefail
here="$(realpath "${BASH_SOURCE[0]}")"
# Without a syslog each line of the log goes to the console, and the console's speed would be measured.
if [ ! -S /dev/log ] && [ -z "${QUENX_OWN_DEVICES:-}" ] && unshare --mount true 2>/dev/null; then
    QUENX_OWN_DEVICES=yes exec unshare --mount --propagation private "$here" "$@"
fi
older=
if [ "${1:-}" = --against ]; then
    older="$(realpath "${2:?the folder of the older build}")"
    [ -x "$older/bin/quenx-cimd" ] ||
        { echo "$0: $older has no bin/quenx-cimd; name the folder of a build" >&2; exit 2; }
    set -- "${@:3}"
fi
cd "$(dirname "$here")/../.."
export LC_ALL=C.UTF-8

seconds="${1:-$([ -z "$older" ] && echo 5 || echo 3)}"
requests="${REQUESTS:-1000000}"
jobs=1000
for tool in wrk curl python3; do
    command -v "$tool" >/dev/null || { echo "$0: $tool is missing; install the package of that name" >&2; exit 1; }
done

scratch="$(mktemp -d)"
# shellcheck source=daemon.sh
. bench/server/daemon.sh
# shellcheck source=compare.sh
. bench/server/compare.sh
trap stop_daemons EXIT

cmake --preset release >/dev/null
cmake --build --preset release -j "$(nproc)" \
    --target quenx-cimd quenxctl HandshakeBench Quenx_SoftwareUpdate Quenx_SoftwareInventory >/dev/null
if [ -n "${QUENX_OWN_DEVICES:-}" ]; then
    serve_syslog
elif [ ! -S /dev/log ]; then
    echo "There is no syslog here, so the console's speed is measured, too. Run this as root, or start one." >&2
fi
start_daemon new "$PWD/build/release"
if [ -n "$older" ]; then
    start_daemon old "$older"
    compare "$seconds" "$jobs" "$older" "$PWD/build/release"
    exit
fi

# Prints the row of figures: LABEL FILE CIMMETHOD CIMOBJECT EXPECTED CONNECTIONS URL SECONDS
measure() {
    printf '%-34s %-5s %4s ' "$1" "${7%%:*}" "$6"
    drive new "${@:2}"
}

echo "resident after start: $(resident new)"
measure "EnumerateInstances, for memory" service.xml EnumerateInstances root/cimv2 \
    'CLASSNAME="Quenx_SoftwareInstallationService"' 8 "${http[new]}" "$seconds" >"$scratch/row"
rate="$(awk '{ print int($(NF - 3)) }' "$scratch/row")"
measure "EnumerateInstances, for memory" service.xml EnumerateInstances root/cimv2 \
    'CLASSNAME="Quenx_SoftwareInstallationService"' 8 "${http[new]}" "$((requests / rate + 1))" >>"$scratch/row"
echo "resident after about $requests requests: $(resident new)"
make_jobs new "$jobs"
echo "resident with $jobs jobs: $(resident new)"

printf '\n%-34s %-5s %4s %12s %10s %10s %8s\n' "" "" conn requests/s "p50 ms" "p99 ms" errors
for url in "${http[new]}" "${https[new]}"; do
    for connections in 1 8 64; do
        measure "EnumerateInstances, one service" service.xml EnumerateInstances root/cimv2 \
            'CLASSNAME="Quenx_SoftwareInstallationService"' "$connections" "$url" "$seconds"
        measure "EnumerateInstances, $jobs jobs" jobs.xml EnumerateInstances root/cimv2 \
            'CLASSNAME="Quenx_ConcreteJob"' "$connections" "$url" "$seconds"
        measure "GetInstance, a job" get-job.xml GetInstance root/cimv2 'CLASSNAME="Quenx_ConcreteJob"' \
            "$connections" "$url" "$seconds"
        # 5, or 6 while another such call holds the adapter
        measure "InstallFromURI, refused" refused.xml InstallFromURI "${service_object[new]}" '<RETURNVALUE' \
            "$connections" "$url" "$seconds"
    done
done
echo
echo "HTTPS, 4 clients that connect for each request (EnumerateInstances, one service):"
build/release/bin/HandshakeBench "$(grep -oP ':\K[0-9]+(?=/)' <<<"${https[new]}")" "$scratch/new/service.xml" \
    "$CREDENTIALS" "$seconds"
echo
echo "resident at the end: $(resident new)"
