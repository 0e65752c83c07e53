# SPDX-License-Identifier: Apache-2.0
# For run.sh: the daemons "old" and "new" side by side. Each load runs for both by turns, since a machine's speed drifts
# within minutes; the figure is the median of the turns.
connections=4
turns=(old new new old old new)

median() { # NUMBER...
    printf '%s\n' "$@" | sort -n |
        awk '{ all[NR] = $1 } END { print (all[int((NR + 1) / 2)] + all[int(NR / 2) + 1]) / 2 }'
}
print_row() { # LABEL OLD NEW FORMAT
    awk -v label="$1" -v old="$2" -v new="$3" -v format="$4" 'BEGIN {
        printf "| %-52s | %12s | %12s | %6s |\n", label, sprintf(format, old), sprintf(format, new),
            old + 0 == 0 ? "" : sprintf("%.2f", new / old) }'
}

# Requests per second, and what the daemon's processor time for one comes to.
compare_load() { # LABEL SECONDS FILE CIMMETHOD CIMOBJECT EXPECTED
    local name row before spent errors=0 object
    local -A rates=() costs=()
    for name in "${turns[@]}"; do
        object="${5:-${service_object[$name]}}"
        before="$(processor_time "$name")"
        row="$(drive "$name" "$3" "$4" "$object" "$6" "$connections" "${http[$name]}" "$2")"
        spent="$(awk -v from="$before" -v to="$(processor_time "$name")" 'BEGIN { print to - from }')"
        rates[$name]+="$(awk '{ print $1 }' <<<"$row") "
        costs[$name]+="$(awk -v us="$spent" -v seconds="$2" '{ print us / ($1 * seconds + 1e-9) * 1e6 }' <<<"$row") "
        errors=$((errors + $(awk '{ print $4 }' <<<"$row")))
    done
    # shellcheck disable=SC2086 # split on purpose
    for name in old new; do
        rates[$name]="$(median ${rates[$name]})"
        costs[$name]="$(median ${costs[$name]})"
    done
    print_row "$1, requests/s" "${rates[old]}" "${rates[new]}" %.0f
    print_row "  processor time of a request, us" "${costs[old]}" "${costs[new]}" %.0f
    [ "$errors" = 0 ] || echo "  $errors of the answers were errors"
}
compare_memory() { # LABEL
    print_row "$1, MiB" "$(pss old)" "$(pss new)" %.1f
}

# What large answers leave behind: the memory a second after the last of many clients has gone.
compare_large_answers() { # CONNECTIONS SECONDS
    local name
    local -A before=() after=()
    for name in old new; do
        before[$name]="$(pss "$name")"
        # Answers that found no room (503) say nothing against the memory: the budget is there for them.
        drive "$name" jobs.xml EnumerateInstances root/cimv2 'CLASSNAME="Quenx_ConcreteJob"' "$1" \
            "${http[$name]}" "$2" >"$scratch/$name/large"
        sleep 1
        after[$name]="$(pss "$name")"
    done
    print_row "PSS before $1 connections ask for all jobs, MiB" "${before[old]}" "${before[new]}" %.1f
    print_row "PSS a second after $2 s of that, MiB" "${after[old]}" "${after[new]}" %.1f
    print_row "  requests/s meanwhile" "$(awk '{ print $1 }' "$scratch/old/large")" \
        "$(awk '{ print $1 }' "$scratch/new/large")" %.0f
}

# Clients that connect anew for each request.
compare_handshakes() { # SECONDS
    local name label old
    for name in old new; do
        build/release/bin/HandshakeBench "$(grep -oP ':\K[0-9]+(?=/)' <<<"${https[$name]}")" \
            "$scratch/$name/service.xml" "$CREDENTIALS" "$1" >"$scratch/$name/handshakes"
    done
    while IFS=: read -r label old; do
        print_row "HTTPS anew, $label, requests/s" "${old%% req*}" \
            "$(grep -oP "^$label: *\K[0-9]+" "$scratch/new/handshakes")" %.0f
    done <"$scratch/old/handshakes"
}

# From exec: the command line to its exit, and a daemon of its own, whose certificate exists, to its "Serving ...".
compare_starts() { # RUNS OLDER NEWER
    local name commands=() times
    local -A build=([old]="$2" [new]="$3")
    for name in old new; do
        commands+=(-- "${build[$name]}/bin/quenxctl" adapters --adapters "$scratch/$name/adapters.toml"
            --state "$scratch/$name/state" --config "$scratch/$name/provider.conf")
        # An older build may know no policies, and would end with an error in no time.
        [[ "$("${build[$name]}/bin/quenxctl" --help)" != *"--policy "* ]] || commands+=(--policy "$scratch/$name/policy.toml")
    done
    read -ra times <<<"$(bench/server/start.py "$1" "" "${commands[@]:1}")"
    print_row "quenxctl adapters, to its exit, ms" "${times[0]}" "${times[1]}" %.1f
    commands=()
    for name in old new; do
        commands+=(-- "${build[$name]}/bin/quenx-cimd" --config "$scratch/$name/quenx-cimd.toml"
            --daemon-lock-file "$scratch/$name/second")
    done
    read -ra times <<<"$(bench/server/start.py "$1" Serving "${commands[@]:1}")"
    print_row "quenx-cimd, until it serves, ms" "${times[0]}" "${times[1]}" %.1f
}

compare() { # SECONDS JOBS OLDER NEWER
    local service='CLASSNAME="Quenx_SoftwareInstallationService"' job='CLASSNAME="Quenx_ConcreteJob"'
    printf '| %-52s | %12s | %12s | %6s |\n' "$connections connections, HTTP" old new "new/old"
    echo "|---|---|---|---|"
    compare_load "EnumerateInstances, one instance" "$1" service.xml EnumerateInstances root/cimv2 "$service"
    compare_load "GetInstance, alone" "$1" get-service.xml GetInstance root/cimv2 "$service"
    # 5, or 6 while another such call holds the adapter
    compare_load "InvokeMethod, refused" "$1" refused.xml InstallFromURI "" '<RETURNVALUE'
    compare_handshakes "$1"
    compare_starts 50 "$3" "$4"
    compare_memory "PSS without jobs"
    make_jobs old "$2" &
    make_jobs new "$2"
    wait $!
    compare_load "EnumerateInstances, $2 x 10 properties" "$1" jobs-10.xml EnumerateInstances root/cimv2 "$job"
    compare_load "EnumerateInstances, $2 x all properties" "$1" jobs.xml EnumerateInstances root/cimv2 "$job"
    compare_load "GetInstance, one of $2 jobs" "$1" get-job.xml GetInstance root/cimv2 "$job"
    compare_memory "PSS with $2 jobs"
    compare_large_answers 32 5
}
