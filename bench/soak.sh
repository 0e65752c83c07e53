#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# The long run: the soak program, and a minute of each fuzz target. Takes SECONDS of stress, 60 if not given.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
cmake --preset release >/dev/null
cmake --build --preset release --target soak -j "${JOBS:-$(nproc)}"
build/release/bin/soak --gtest_brief=1 --seconds="${1:-60}"
FUZZ_SECONDS="${FUZZ_SECONDS:-60}" ./test.sh fuzz
