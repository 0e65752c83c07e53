#!/usr/bin/env -S zsh -f
# SPDX-License-Identifier: Apache-2.0
# What an interactive zsh makes of a line and the Tab key: the matches that it lists, if any, and the line as it is then.
#
#   complete.zsh FUNCTIONS LINE
#
# FUNCTIONS is the folder with the completion functions. No file of the user's is read or written.
zmodload zsh/zpty
export ZDOTDIR=/nonexistent HOME=/nonexistent TERM=dumb LC_ALL=C.UTF-8
zpty shell zsh -f -i
TRAPEXIT() { zpty -d shell }

# In one line, so that the prompts between do not matter. The marks are put together by the shell, and so are not in
# the echo of what it is told.
zpty -w shell "stty columns 300 rows 100 -echo; fpath=(${(q)1} \$fpath); autoload -U compinit; compinit -D -u;" \
    'unsetopt prompt_sp prompt_cr beep list_ambiguous; PS1=; tell() { print; print -r -- "=""> $BUFFER <""="; BUFFER= };' \
    'zle -N tell; bindkey "^X" tell; print "rea""dy"'
zpty -r -m shell shown '*ready*'
zpty -w -n shell "$2"$'\t\x18'
zpty -r -m shell shown '*=>*<=*'
print -r -- "$shown" | tr -d '\r' | sed 's/\x1B\[[?0-9]*[A-Za-z]//g; s/ *$//; /^ *quenxctl/d; /^$/d'
