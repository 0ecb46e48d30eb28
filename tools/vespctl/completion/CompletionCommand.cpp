#include <algorithm>
#include <iostream>
#include <string>
#include <string_view>

#include "Command.h"

namespace vesprun {
namespace {

// Each script holds the table of the command tree in place of the line @TABLE@, and walks over the
// words before the cursor to find the command that they lead to. PATH are the words of a command:
//
//   PATH|command|NAME|HELP    a command below it
//   PATH|KIND|--NAME|HELP     an option; KIND is "flag" or that of its value
//   PATH|argument|KIND|       a positional argument; a star behind KIND: it may be repeated
//
// Kinds of values are "dir", "file" and "word".

constexpr std::string_view kBash = R"SCRIPT(# bash completion of vespctl
_vespctl() {
  local at kind name help word path=vespctl given=0 bare= wanted= i
  local current=${COMP_WORDS[COMP_CWORD]}
  local -A kinds=() arguments=() names=()
  local -a kindOf=()
  while IFS='|' read -r at kind name help; do
    if [[ $kind == argument ]]; then
      arguments[$at]+="$name "
    else
      kinds[$at|$name]=$kind
      [[ $kind == command ]] && names[$at|command]+="$name " || names[$at|option]+="$name "
    fi
  done <<'END'
@TABLE@
END
  for ((i = 1; i < COMP_CWORD; i++)); do
    word=${COMP_WORDS[i]}
    kind=${kinds[$path|$word]}
    if [[ -n $bare ]]; then
      ((given++))
    elif [[ $word == -- ]]; then
      bare=1
    elif [[ $word == -* ]]; then
      if [[ -n $kind && $kind != flag ]]; then
        [[ ${COMP_WORDS[i + 1]} == '=' && i+1 -lt COMP_CWORD ]] && ((i++))
        ((++i == COMP_CWORD)) && wanted=$kind
      fi
    else
      kindOf=(${arguments[$path]})
      if [[ $kind == command && $given -ge ${#kindOf[@]} ]]; then
        path+=" $word" given=0
      else
        ((given++))
      fi
    fi
  done
  COMPREPLY=()
  if [[ -z $wanted && -z $bare && $current == -* ]]; then
    mapfile -t COMPREPLY < <(compgen -W "${names[$path|option]}" -- "$current")
    return
  fi
  if [[ -z $wanted ]]; then
    kindOf=(${arguments[$path]})
    wanted=${kindOf[given]}
    [[ -z $wanted && ${arguments[$path]} == *'* ' ]] && wanted=${kindOf[-1]}
  fi
  case $wanted in
    dir*) compopt -o filenames; mapfile -t COMPREPLY < <(compgen -d -- "$current") ;;
    file*) compopt -o filenames; mapfile -t COMPREPLY < <(compgen -f -- "$current") ;;
    '') mapfile -t COMPREPLY < <(compgen -W "${names[$path|command]}" -- "$current") ;;
  esac
}
complete -F _vespctl vespctl
)SCRIPT";

constexpr std::string_view kZsh = R"SCRIPT(#compdef vespctl
_vespctl() {
  local line at kind name help key word path_=vespctl bare= wanted=
  local -i given=0 i
  local -A kinds arguments
  local -a rows kindOf commands options
  rows=("${(@f)$(<<'END'
@TABLE@
END
)}")
  for line in $rows; do
    IFS='|' read -r at kind name help <<<$line
    if [[ $kind == argument ]]; then
      arguments[$at]+="$name "
    else
      key="$at|$name"
      kinds[$key]=$kind
    fi
  done
  for ((i = 2; i < CURRENT; i++)); do
    word=${words[i]}
    key="$path_|$word"
    kind=${kinds[$key]}
    if [[ -n $bare ]]; then
      ((given++))
    elif [[ $word == -- ]]; then
      bare=1
    elif [[ $word == -* ]]; then
      if [[ -n $kind && $kind != flag ]]; then
        ((++i == CURRENT)) && wanted=$kind
      fi
    else
      kindOf=(${=arguments[$path_]})
      if [[ $kind == command && $given -ge ${#kindOf} ]]; then
        path_+=" $word"
        given=0
      else
        ((given++))
      fi
    fi
  done
  for line in $rows; do
    IFS='|' read -r at kind name help <<<$line
    [[ $at == $path_ && $kind != argument ]] || continue
    if [[ $kind == command ]]; then
      commands+=("$name:$help")
    else
      options+=("$name:$help")
    fi
  done
  if [[ -z $wanted && -z $bare && ${words[CURRENT]} == -* ]]; then
    _describe -o option options
    return
  fi
  if [[ -z $wanted ]]; then
    kindOf=(${=arguments[$path_]})
    wanted=${kindOf[given + 1]}
    [[ -z $wanted && ${kindOf[-1]} == *\* ]] && wanted=${kindOf[-1]}
  fi
  case $wanted in
    dir*) _files -/ ;;
    file*) _files ;;
    '') _describe command commands ;;
  esac
}
if [[ ${funcstack[1]} == _vespctl ]]; then
  _vespctl "$@"
else
  compdef _vespctl vespctl
fi
)SCRIPT";

constexpr std::string_view kFish = R"SCRIPT(# fish completion of vespctl
set -g __vespctl_rows (string split \n '@TABLE@')

function __vespctl_kind
    for row in (string match -- "$argv[1]|*|$argv[2]|*" $__vespctl_rows)
        string split '|' -- $row | sed -n 2p
    end
end

function __vespctl_arguments
    string match -- "$argv|argument|*" $__vespctl_rows | string split -f3 '|'
end

function __vespctl
    set -l path vespctl
    set -l given 0
    set -l bare 0
    set -l wanted ''
    for word in (commandline -opc)[2..]
        if test -n "$wanted"
            set wanted ''
            continue
        end
        set -l kind (__vespctl_kind $path $word)
        if test $bare = 1
            set given (math $given + 1)
        else if test "$word" = --
            set bare 1
        else if string match -q -- '-*' $word
            if test -n "$kind"; and test "$kind" != flag
                set wanted $kind
            end
        else if test "$kind" = command -a $given -ge (count (__vespctl_arguments $path))
            set path "$path $word"
            set given 0
        else
            set given (math $given + 1)
        end
    end
    set -l current (commandline -ct)
    set -l choice command
    if test -z "$wanted"
        if test $bare = 0; and string match -q -- '-*' $current
            set choice option
        else
            set -l kinds (__vespctl_arguments $path)
            set -l next (math $given + 1)
            if test $next -le (count $kinds)
                set wanted $kinds[$next]
            else if string match -q -- '*\*' "$kinds[-1]"
                set wanted $kinds[-1]
            end
        end
    end
    switch "$wanted"
        case 'dir*'
            __fish_complete_directories $current
        case 'file*'
            __fish_complete_path $current
        case ''
            for row in (string match -- "$path|*" $__vespctl_rows)
                set -l fields (string split -m3 '|' -- $row)
                if test $fields[2] = argument
                    continue
                end
                if test $choice = command -a $fields[2] = command; or test $choice = option -a $fields[2] != command
                    printf '%s\t%s\n' $fields[3] $fields[4]
                end
            end
    end
end
complete -c vespctl -f -a '(__vespctl)'
)SCRIPT";

const char* valueKind(const std::string& name) {
  return name == "DIR" ? "dir" : name == "FILE" || name == "PATH" ? "file" : "word";
}

void appendRow(std::string& table, const std::string& path, const char* kind,
               const std::string& name, std::string help) {
  std::replace(help.begin(), help.end(), '\n', ' ');
  table.append(table.empty() ? "" : "\n");
  table.append(path).append("|").append(kind).append("|").append(name).append("|").append(help);
}

void appendTree(std::string& table, const CLI::App& app, const std::string& path) {
  for (const CLI::Option* option : app.get_options()) {
    if (option->get_positional()) {
      const bool isRepeated = option->get_items_expected_max() > 1;
      appendRow(table, path, "argument",
                valueKind(option->get_name(true)) + std::string(isRepeated ? "*" : ""), "");
    }
    const bool takesValue = option->get_items_expected_max() > 0;
    for (const std::string& name : option->get_lnames()) {
      appendRow(table, path, takesValue ? valueKind(option->get_type_name()) : "flag", "--" + name,
                option->get_description());
    }
  }
  const auto commands = app.get_subcommands([](const CLI::App*) { return true; });
  for (const CLI::App* command : commands) {
    appendRow(table, path, "command", command->get_name(), command->get_description());
  }
  for (const CLI::App* command : commands) {
    appendTree(table, *command, path + ' ' + command->get_name());
  }
}

std::string quotedForFish(std::string_view text) {
  std::string quoted;
  for (const char letter : text) {
    quoted.append(letter == '\'' || letter == '\\' ? "\\" : "").push_back(letter);
  }
  return quoted;
}

}  // namespace

void addCompletionCommand(CLI::App& vespctl) {
  CLI::App* completion =
      vespctl.add_subcommand("completion", "Prints the completion script for a shell");
  for (const auto& [shell, script] :
       {std::pair("bash", kBash), std::pair("zsh", kZsh), std::pair("fish", kFish)}) {
    completion->add_subcommand(shell, std::string("The script for ") + shell)
        ->callback([&vespctl, isFish = script == kFish, script = script] {
          constexpr std::string_view kMark = "@TABLE@";
          std::string table;
          appendTree(table, vespctl, vespctl.get_name());
          std::string text(script);
          text.replace(text.find(kMark), kMark.size(), isFish ? quotedForFish(table) : table);
          std::cout << text;
        });
  }
  allowOneCommand(*completion);
}

}  // namespace vesprun
