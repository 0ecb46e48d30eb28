#!/usr/bin/env bash
# Asks the completion scripts of the vespctl in $1 what may come next, in each shell that is there.
set -euo pipefail
vespctl=$(realpath "$1")
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
mkdir -p "$work/here/a folder"
touch "$work/here/a file" "$work/here/plain"
cd "$work/here"
PATH=$(dirname "$vespctl"):$PATH  # the scripts ask the program
for shell in bash zsh fish; do "$vespctl" completion $shell >"$work/$shell"; done
# An empty word at the end is what is being completed.
cat >"$work/ask.bash" <<'END'
source "$1"
compopt() { :; }
COMP_WORDS=("${@:2}") COMP_CWORD=$(($# - 2))
_vespctl
printf '%s\n' "${COMPREPLY[@]}"
END
# What zsh's own functions do with the candidates needs a terminal: here they print them.
cat >"$work/ask.zsh" <<'END'
compdef() { : }
_describe() { print -l -- ${${(P)@[-1]}%%:*} }
_files() { [[ ${1-} == -/ ]] && print -l -- *(/) || print -l -- * }
source $1
words=("${@:2}") CURRENT=$(($# - 1))
_vespctl | grep -- "^${words[CURRENT]}" || true
END
cat >"$work/ask.fish" <<'END'
source $argv[1]
complete -C (string join ' ' -- (string escape -- $argv[2..-2]) $argv[-1]) | string split -f1 \t | string replace -r '/$' ''
exit 0
END
failures=0
while IFS='|' read -r line expected; do
  read -ra words <<<"$line"
  [[ $line != *' ' ]] || words+=("")
  for shell in bash zsh fish; do
    command -v $shell >/dev/null || continue
    answer=$($shell "$work/ask.$shell" "$work/$shell" "${words[@]}" | sort | paste -sd,)
    if [ "$answer" != "$expected" ]; then
      echo "$shell: \"$line\" gives $answer, not $expected" >&2
      failures=1
    fi
  done
done <<'END'
vespctl comp|completion
vespctl completion |bash,fish,zsh
vespctl -C |a folder
vespctl counters |add,dump,get,import,sample,set
vespctl counters d|dump
vespctl -C x counters set --|--day,--help,--json
vespctl counters set --day |
vespctl counters set --day 3 key --|--day,--help,--json
vespctl counters import |a file,a folder,plain
vespctl counters import -- |a file,a folder,plain
vespctl prefs --user someone re|remove
vespctl run -- -|
vespctl decode f|ftl,ftl-keys
vespctl decode ftl pl|plain
vespctl fields legacy|legacy-key-map
vespctl nand set connect |
END
exit $failures
