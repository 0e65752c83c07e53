#!/usr/bin/env bash
# Installs what is missing, builds, and runs all tests.
#
#   ./test.sh                 the default build and the one with the address and undefined-behaviour sanitizers
#   ./test.sh --ci            these, 32-bit x86, the thread sanitizer, and 10 s of each fuzz target
#   ./test.sh PRESET...       just these: release asan tsan x86-32 clang, and fuzz, whose targets the build asan has
#
# CI=true in the environment means --ci. JOBS=N sets how many jobs run at once (default: one for each processor).
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")"
export LC_ALL=C.UTF-8

jobs="${JOBS:-$(nproc)}"
fuzz_seconds="${FUZZ_SECONDS:-10}"
groups=(build run test)
fuzz_build=build/asan
presets=()

for argument in "$@"; do
    case "$argument" in
        --ci) CI=true ;;
        -h | --help)
            sed -n '2,9s/^# \{0,1\}//p' "$0"
            exit 0
            ;;
        -*)
            echo "$0: unknown option $argument (see --help)" >&2
            exit 2
            ;;
        *) presets+=("$argument") ;;
    esac
done
if [ "${#presets[@]}" = 0 ]; then
    presets=(release asan)
    [ "${CI:-}" = true ] && presets+=(x86-32 tsan fuzz)
fi
case " ${presets[*]} " in *" x86-32 "*) groups+=(x86-32) ;; esac

packaging/install-packages.sh "${groups[@]}"
export ASAN_OPTIONS="${ASAN_OPTIONS:-detect_stack_use_after_return=1}"
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

run_tests() {
    local preset="$1" prefix=env
    if [ "$preset" = tsan ]; then prefix="$(tsan_prefix)"; fi
    echo "== $preset: building"
    cmake --preset "$preset" >/dev/null
    # Building runs the test programs too, to list their tests.
    $prefix cmake --build --preset "$preset" -j "$jobs"
    echo "== $preset: testing"
    $prefix ctest --preset "$preset" -j "$jobs" --output-on-failure --no-tests=error
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

for preset in "${presets[@]}"; do
    if [ "$preset" = fuzz ]; then run_fuzzers; else run_tests "$preset"; fi
done
echo "== All passed: ${presets[*]}"
