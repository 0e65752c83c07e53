#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Line and branch coverage of the provider's own code, and the lines that no test reaches.
# Fails when less than 95 % of its lines are reached. Needs gcovr.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
tools/need.sh gcovr
. tools/environment.sh

build=build/coverage
programs=(UtilsTest SoftwareUpdateTest ReliabilityTest UnloadTest)
cmake --preset coverage >/dev/null
cmake --build "$build" -j "${JOBS:-$(nproc)}" --target "${programs[@]}"
find "$build" -name '*.gcda' -delete
for program in "${programs[@]}"; do
    "$build/bin/$program" --gtest_brief=1
done
# The branches that only an exception takes are the compiler's, not ours.
gcovr --root . --filter src/Providers/SoftwareUpdate/ --filter src/Utils/ --exclude-throw-branches \
    --exclude-unreachable-branches --print-summary --fail-under-line 95 "$build"
