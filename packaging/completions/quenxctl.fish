# SPDX-License-Identifier: Apache-2.0
# Completion of quenxctl for fish: the program itself says what a word may become.
function __quenxctl_candidates
    set -l words (commandline --tokenize --cut-at-cursor --current-process) (commandline --current-token --cut-at-cursor)
    set -l found ($words[1] complete $words[2..-1] 2>/dev/null)
    if test "$found[1]" = ":files"
        __fish_complete_path (commandline --current-token --cut-at-cursor)
    else
        printf '%s\n' $found
    end
end
complete --command quenxctl --no-files --arguments '(__quenxctl_candidates)'
