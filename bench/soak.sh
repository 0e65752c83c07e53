#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# The long run: the soak program, a minute of each fuzz target, daemons, clients, floods, kills and unloads together, and
# small changes of the code, nine in ten of which the tests have to notice.
#
#   bench/soak.sh [SECONDS]    of stress, 60 if not given
#
# FUZZ_SECONDS, TOGETHER_SECONDS and CHANGES set the length of the others: 60 each target, an hour, and 80 changes.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
tools/need.sh python3
cmake --preset release >/dev/null
cmake --build --preset release -j "${JOBS:-$(nproc)}" \
    --target soak quenx-cimd quenxctl Quenx_SoftwareUpdate Quenx_SoftwareInventory FlashStarter
build/release/bin/soak --gtest_brief=1 --seconds="${1:-60}"
FUZZ_SECONDS="${FUZZ_SECONDS:-60}" ./test.sh fuzz
bench/soak/together.py --seconds "${TOGETHER_SECONDS:-3600}"
tests/mutate.py --count "${CHANGES:-80}"
