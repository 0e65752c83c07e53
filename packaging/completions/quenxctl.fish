# SPDX-License-Identifier: Apache-2.0
# Completion of quenxctl for fish: the program itself says what a word may become. It takes the words as it gets them
# from a shell, without quotes.
function __quenxctl_candidates
    set -l word (commandline --current-token --cut-at-cursor)
    # A quote that is still open cannot be unescaped.
    set -l plain (string unescape -- $word; or string trim --left --chars \'\" -- $word)
    set -l words (commandline --tokenize --cut-at-cursor --current-process)
    set -l found ($words[1] complete $words[2..-1] "$plain" 2>/dev/null)
    if test "$found[1]" = ":files"
        __fish_complete_path "$plain"
    else
        printf '%s\n' $found
    end
end
complete --command quenxctl --no-files --arguments '(__quenxctl_candidates)'
