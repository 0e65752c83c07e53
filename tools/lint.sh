#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Checks the format of C++ files and what clang-tidy and cppcheck say of them. Changes nothing.
#
#   tools/lint.sh             what differs from main, changes that are not committed included
#   tools/lint.sh --staged    what the next commit changes, as the working tree has it (for the hook)
#   tools/lint.sh --all       every file
#   tools/lint.sh FILE...     these
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
tools/need.sh git clang-format clang-tidy clang++ cppcheck

all() { git ls-files -- '*.cpp' '*.h'; }
since() { git diff --name-only --diff-filter=d "$@" -- '*.cpp' '*.h'; }
case "${1:-}" in
    --all) list="$(all)" ;;
    --staged) list="$(since --cached)" ;;
    -h | --help)
        sed -n '3,8s/^# \{0,1\}//p' "$0"
        exit 0
        ;;
    -*)
        echo "$0: unknown option $1 (see --help)" >&2
        exit 2
        ;;
    "")
        base="$(git merge-base main HEAD 2>/dev/null)" || {
            echo "$0: There is no branch main to compare with. Fetch it (git fetch origin main:main), or use --all." >&2
            exit 2
        }
        list="$(since "$base"; git ls-files --others --exclude-standard -- '*.cpp' '*.h')"
        ;;
    *)
        for file in "$@"; do
            [ -f "$file" ] || { echo "$0: There is no file $file." >&2; exit 2; }
        done
        list="$(printf '%s\n' "$@")"
        ;;
esac
mapfile -t files < <(grep . <<<"$list" || true)
if [ "${#files[@]}" = 0 ]; then
    echo "No C++ file to check."
    exit 0
fi

. tools/environment.sh # only now: a hook names the index by a variable

status=0
clang-format --dry-run --Werror "${files[@]}" || {
    echo "Format them: clang-format -i FILE..." >&2
    status=1
}

# Headers are checked with the sources that include them.
mapfile -t sources < <(printf '%s\n' "${files[@]}" | grep '^src/.*\.cpp$' || true)
if [ "${#sources[@]}" != 0 ]; then
    cmake --preset clang >/dev/null
    printf '%s\0' "${sources[@]}" |
        xargs -0 -n 1 -P "${JOBS:-$(nproc)}" clang-tidy -quiet -warnings-as-errors='*' -p build/clang 2>&1 |
        sed '/^[0-9]* warnings\? generated/d' || status=1
    cppcheck --quiet --std=c++20 --language=c++ --inline-suppr --error-exitcode=1 -I src "${sources[@]}" || status=1
fi
[ "$status" = 0 ] && echo "Checked ${#files[@]} files: nothing to say."
exit "$status"
