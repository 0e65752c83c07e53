#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# The long run: the soak program, a minute of each fuzz target, and daemons, clients, floods, kills and unloads together.
#
#   bench/soak.sh [SECONDS]    of stress, 60 if not given
#
# FUZZ_SECONDS and TOGETHER_SECONDS set the length of the others: 60 each target, and an hour.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
tools/need.sh python3
cmake --preset release >/dev/null
cmake --build --preset release -j "${JOBS:-$(nproc)}" \
    --target soak quenx-cimd quenxctl Quenx_SoftwareUpdate Quenx_SoftwareInventory FlashStarter
build/release/bin/soak --gtest_brief=1 --seconds="${1:-60}"
FUZZ_SECONDS="${FUZZ_SECONDS:-60}" ./test.sh fuzz
bench/soak/together.py --seconds "${TOGETHER_SECONDS:-3600}"
