#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Says at once which of the named tools are missing, and fails then:  tools/need.sh TOOL...
set -euo pipefail

missing=()
for tool in "$@"; do
    command -v "$tool" >/dev/null || missing+=("$tool")
done
if [ "${#missing[@]}" != 0 ]; then
    echo "These tools are missing: ${missing[*]}. To install them: packaging/install-packages.sh dev" >&2
    exit 1
fi
