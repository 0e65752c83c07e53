#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Installs what is missing, builds, and runs all tests.
#
#   ./test.sh                 the default build and the one with the address and undefined-behaviour sanitizers
#   ./test.sh --ci            these, 32-bit x86, the thread sanitizer, 10 s of each fuzz target, elsewhere and kernel
#   ./test.sh --nightly       kernel, packages and 32-bit x86, with sanitizers too: what CI may leave to the night
#   ./test.sh PRESET...       just these: release asan tsan x86-32 x86-32-asan clang; fuzz, whose targets asan has;
#                             elsewhere, the demo and the release tests as another user in an odd folder; kernel,
#                             updates by the release build in a virtual machine with cards that the kernel flashes; and
#                             packages, those for Debian and RPM of the committed tree in a fresh root, as root
#
# CI=true in the environment means --ci. JOBS=N sets how many jobs run at once (default: one for each processor).
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")"

jobs="${JOBS:-$(nproc)}"
fuzz_seconds="${FUZZ_SECONDS:-10}"
groups=(build run test)
fuzz_build=build/asan
all_presets=(release asan x86-32 x86-32-asan tsan fuzz elsewhere kernel packages clang)
presets=()

for argument in "$@"; do
    case "$argument" in
        --ci) CI=true ;;
        --nightly) presets+=(kernel packages x86-32 x86-32-asan) ;;
        -h | --help)
            sed -n '3,14s/^# \{0,1\}//p' "$0"
            exit 0
            ;;
        -*)
            echo "$0: unknown option $argument (see --help)" >&2
            exit 2
            ;;
        *)
            case " ${all_presets[*]} " in
                *" $argument "*) presets+=("$argument") ;;
                *)
                    echo "$0: unknown preset $argument. Name some of: ${all_presets[*]}" >&2
                    exit 2
                    ;;
            esac
            ;;
    esac
done
if [ "${#presets[@]}" = 0 ]; then
    presets=(release asan)
    [ "${CI:-}" = true ] && presets+=(x86-32 tsan fuzz elsewhere kernel)
fi
case " ${presets[*]} " in *" x86-32"*) groups+=(x86-32) ;; esac
case " ${presets[*]} " in *" packages "*) groups+=(deb) ;; esac

packaging/install-packages.sh "${groups[@]}"
# A virtual machine is not to be had everywhere.
have_kernel=true
case " ${presets[*]} " in
    *" kernel "*) if packaging/install-packages.sh kernel; then tests/kernel/prepare.sh; else have_kernel=false; fi ;;
esac
. tools/environment.sh # a proxy was for the packages
# The second as in cmake/SanitizerDefaults.cpp.
export ASAN_OPTIONS="${ASAN_OPTIONS:-detect_stack_use_after_return=1:intercept_tls_get_addr=0}"
export UBSAN_OPTIONS="${UBSAN_OPTIONS:-print_stacktrace=1}"
export TSAN_OPTIONS="${TSAN_OPTIONS:-halt_on_error=1 second_deadlock_stack=1}"

# Prints the command that has to stand before a program with the thread sanitizer: none where such a program runs as it
# is, one that turns address randomisation off where the kernel places memory too freely for it.
tsan_prefix() {
    local probe
    probe="$(mktemp -d)"
    echo 'int main() { return 0; }' >"$probe/probe.cpp"
    clang++ -fsanitize=thread "$probe/probe.cpp" -o "$probe/probe"
    if "$probe/probe" 2>/dev/null; then
        echo env
    elif setarch -R "$probe/probe" 2>/dev/null; then
        echo setarch -R
    else
        echo "Programs with the thread sanitizer do not run here. As root: sysctl vm.mmap_rnd_bits=28" >&2
        rm -rf "$probe"
        return 1
    fi
    rm -rf "$probe"
}

# For root, whom the system stops from nothing: tests can write to the build and to a /tmp of their own.
contained=()
mkdir -p build
if tools/contained.sh . -- true 2>/dev/null; then contained=(tools/contained.sh build --); fi

run_tests() {
    local preset="$1" prefix=env
    if [ "$preset" = tsan ]; then prefix="$(tsan_prefix)"; fi
    echo "== $preset: building"
    cmake --preset "$preset" >/dev/null
    # Building runs the test programs too, to list their tests.
    $prefix cmake --build --preset "$preset" -j "$jobs"
    echo "== $preset: testing"
    $prefix "${contained[@]}" ctest --preset "$preset" -j "$jobs"
}

# Each target starts from its seeds; what it finds on its way stays in the build folder.
run_fuzzers() {
    local target name found=0
    echo "== fuzz: building"
    cmake --preset asan >/dev/null
    cmake --build --preset asan -j "$jobs" --target fuzzers
    for target in $fuzz_build/bin/fuzz_*; do
        [ -x "$target" ] || continue
        found=1
        name="$(basename "$target")"
        echo "== fuzz: $name for $fuzz_seconds s"
        mkdir -p "$fuzz_build/corpus/$name"
        "$target" -max_total_time="$fuzz_seconds" -timeout=10 -rss_limit_mb=2048 -print_final_stats=1 \
            -artifact_prefix="$fuzz_build/$name-" "$fuzz_build/corpus/$name" "tests/Fuzz/seeds/$name" \
            >"$fuzz_build/$name.log" 2>&1 || {
            tail -n 60 "$fuzz_build/$name.log"
            return 1
        }
        grep -E 'stat::number_of_executed_units|DONE' "$fuzz_build/$name.log"
    done
    if [ "$found" = 0 ]; then
        echo "There are no fuzz targets in $fuzz_build/bin." >&2
        return 1
    fi
}

run_kernel_tests() {
    [ "$have_kernel" = true ] || return 0
    cmake --preset release >/dev/null
    cmake --build --preset release -j "$jobs" --target quenx_installed
    tests/kernel/run.sh
}

run_package_tests() {
    echo "== packages: building"
    nice packaging/build-deb.sh --no-install
    echo "== packages: trying them in a fresh root"
    packaging/try-packages.sh
    echo "== packages: RPM packages"
    packaging/try-rpm.sh
    echo "== packages: the profiles that confine the daemon"
    packaging/check-confinement.sh
}

# The tests of a run that were skipped, each with the reason that it gave.
skipped_tests() {
    local log="build/$1/Testing/Temporary/LastTest.log"
    [ ! -f "$log" ] || awk -v preset="$1" '
        /: Skipped$/ { getline reason }
        /^\[  SKIPPED \] .* \([0-9]+ ms\)$/ { printf "  %s: %s: %s\n", preset, $4, reason }' "$log"
}

what_was_skipped() {
    local preset skipped= unasked=()
    for preset in "${presets[@]}"; do
        [ "$preset" = fuzz ] || skipped+="$(skipped_tests "$preset")"$'\n'
    done
    [ "$have_kernel" = true ] || skipped+="  kernel: all of it: the packages for a virtual machine cannot be installed here"
    skipped="$(grep . <<<"$skipped" || true)"
    echo "== Skipped:${skipped:+$'\n'}${skipped:- no test}"
    if [ "${#contained[@]}" = 0 ]; then
        echo "== Not shown: that no test writes outside its own folders, which takes root and mount namespaces"
    fi
    for preset in "${all_presets[@]}"; do
        case " ${presets[*]} " in *" $preset "*) ;; *) unasked+=("$preset") ;; esac
    done
    [ "${#unasked[@]}" = 0 ] || echo "== Not run, since not asked for (see --help): ${unasked[*]}"
}

for preset in "${presets[@]}"; do
    case "$preset" in
        fuzz) run_fuzzers ;;
        elsewhere) tests/elsewhere.sh ;;
        kernel) run_kernel_tests ;;
        packages) run_package_tests ;;
        *) run_tests "$preset" ;;
    esac
done
what_was_skipped
[ "$have_kernel" = true ] || presets=("${presets[@]/#kernel/kernel (skipped)}")
echo "== All passed: ${presets[*]}"
