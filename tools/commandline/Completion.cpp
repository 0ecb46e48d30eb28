#include "commandline/Completion.h"

#include <algorithm>
#include <exception>
#include <iostream>
#include <map>

#include "commandline/Program.h"

namespace vesprun {
namespace {

constexpr std::string_view kBash = R"SCRIPT(# bash completion of @PROGRAM@
_@PROGRAM@() {
  local word
  COMPREPLY=()
  while IFS=$'\t' read -r word _; do
    case $word in
      :files) compopt -o filenames; mapfile -t COMPREPLY < <(compgen -f -- "${COMP_WORDS[COMP_CWORD]}") ;;
      :folders) compopt -o filenames; mapfile -t COMPREPLY < <(compgen -d -- "${COMP_WORDS[COMP_CWORD]}") ;;
      *) COMPREPLY+=("$(printf %q "$word")") ;;
    esac
  done < <(@PROGRAM@ complete -- "${COMP_WORDS[@]:1:COMP_CWORD}" 2>/dev/null)
}
complete -F _@PROGRAM@ @PROGRAM@
)SCRIPT";

constexpr std::string_view kZsh = R"SCRIPT(#compdef @PROGRAM@
_@PROGRAM@() {
  local line
  local -a found
  while IFS= read -r line; do
    case $line in
      (:files) _files ;;
      (:folders) _files -/ ;;
      (*) found+=("${${line%%$'\t'*}//:/\\:}:${line#*$'\t'}") ;;
    esac
  done < <(@PROGRAM@ complete -- "${(@Q)words[2,CURRENT]}" 2>/dev/null)
  (( ! $#found )) || _describe @PROGRAM@ found
}
compdef _@PROGRAM@ @PROGRAM@
)SCRIPT";

constexpr std::string_view kFish = R"SCRIPT(# fish completion of @PROGRAM@
function __@PROGRAM@_complete
  set -l words (commandline -opc) (commandline -ct)
  for line in (@PROGRAM@ complete -- $words[2..-1] 2>/dev/null)
    switch $line
      case ':files'
        __fish_complete_path (commandline -ct)
      case ':folders'
        __fish_complete_directories (commandline -ct) ''
      case '*'
        echo $line
    end
  end
end
complete -c @PROGRAM@ -f -a '(__@PROGRAM@_complete)'
)SCRIPT";

const std::pair<const char*, std::string_view> kScripts[] = {
    {"bash", kBash}, {"zsh", kZsh}, {"fish", kFish}};

std::map<const CLI::Option*, Completer>& completers() {
  static std::map<const CLI::Option*, Completer> completers;
  return completers;
}

/// What a command line that is not complete has led to.
struct Place {
  CLI::App* command;
  CLI::Option* wanted = nullptr;  ///< the option whose value is next
  std::size_t given = 0;          ///< positional arguments
  bool isBare = false;            ///< after "--"

  std::vector<CLI::Option*> positionals() const {
    return command->get_options([](const CLI::Option* option) { return option->get_positional(); });
  }
  /// The positional argument that is next, or null.
  CLI::Option* positional() const {
    const std::vector<CLI::Option*> all = positionals();
    if (given < all.size()) {
      return all[given];
    }
    return all.empty() || all.back()->get_items_expected_max() <= 1 ? nullptr : all.back();
  }
};

CLI::App* commandBelow(CLI::App& command, const std::string& name) {
  for (CLI::App* const below : command.get_subcommands({})) {
    if (below->get_name() == name) {
      return below;
    }
  }
  return nullptr;
}

/// Gives the value to the command line, so that completers know it.
void take(CLI::Option* option, const std::string& word) {
  if (option == nullptr) {
    return;
  }
  try {
    option->add_result(word);
    option->run_callback();
  } catch (const std::exception&) {  // a wrong one
  }
}

void goOn(Place& place, const std::string& word) {
  if (place.wanted != nullptr) {
    if (word != "=") {  // as bash parts words
      take(std::exchange(place.wanted, nullptr), word);
    }
  } else if (place.isBare || word.size() < 2 || word.front() != '-') {
    if (CLI::App* const below = place.isBare ? nullptr : commandBelow(*place.command, word)) {
      place = {below};
    } else {
      take(place.positional(), word);
      ++place.given;
    }
  } else if (word == "--") {
    place.isBare = true;
  } else {
    const std::size_t end = std::min(word.find('='), word.size());
    CLI::Option* const option = place.command->get_option_no_throw(word.substr(0, end));
    if (option != nullptr && option->get_items_expected_max() > 0) {
      if (end < word.size()) {
        take(option, word.substr(end + 1));
      } else {
        place.wanted = option;
      }
    }
  }
}

void printWord(std::string_view word, std::string_view begin, std::string_view help = {}) {
  if (word.starts_with(begin) && word.find_first_of("\t\n") == std::string_view::npos) {
    std::cout << word << '\t' << help << '\n';
  }
}

void printValues(const CLI::Option& option, std::string_view begin) {
  if (const auto completer = completers().find(&option); completer != completers().end()) {
    std::vector<std::string> words;
    try {
      words = completer->second();
    } catch (const std::exception&) {
    }
    for (const std::string& word : words) {
      printWord(word, begin);
    }
    return;
  }
  const std::string name = option.get_positional() ? option.get_name(true) : option.get_type_name();
  if (name == "FILE" || name == "PATH" || name == "STORE") {
    std::cout << ":files\n";
  } else if (name == "DIR") {
    std::cout << ":folders\n";
  }
}

}  // namespace

void completeWith(CLI::Option* option, Completer completer) {
  completers().emplace(option, std::move(completer));
}

void printCompletions(CLI::App& program, std::span<char* const> words) {
  Place place{&program};
  for (std::size_t i = 0; i + 1 < words.size(); ++i) {
    goOn(place, words[i]);
  }
  std::string_view begin = words.empty() ? "" : words.back();
  if (place.wanted != nullptr) {
    printValues(*place.wanted, begin == "=" ? "" : begin);
    return;
  }
  if (!place.isBare && begin.starts_with('-')) {
    for (const CLI::Option* option : place.command->get_options()) {
      for (const std::string& name : option->get_lnames()) {
        printWord("--" + name, begin, option->get_description());
      }
      for (const std::string& name : option->get_snames()) {
        printWord("-" + name, begin, option->get_description());
      }
    }
    return;
  }
  if (const CLI::Option* positional = place.positional()) {
    printValues(*positional, begin);
  }
  if (!place.isBare && place.given == 0) {
    for (const CLI::App* command : place.command->get_subcommands({})) {
      printWord(command->get_name(), begin, command->get_description());
    }
  }
}

void addCompletionCommand(CLI::App& command) {
  CLI::Option* const option =
      command
          .add_option_function<std::string>(
              "SHELL",
              [](const std::string& shell) {
                const auto* script = std::ranges::find_if(
                    kScripts, [&shell](const auto& known) { return known.first == shell; });
                if (script == std::end(kScripts)) {
                  throw CLI::ValidationError("SHELL", "is bash, zsh or fish");
                }
                std::string text(script->second);
                constexpr std::string_view kMark = "@PROGRAM@";
                for (std::size_t at = 0; (at = text.find(kMark, at)) != std::string::npos;) {
                  text.replace(at, kMark.size(), invocation().program);
                }
                std::cout << text;
              },
              "bash, zsh or fish")
          ->required();
  completeWith(option, [] {
    std::vector<std::string> names;
    for (const auto& [name, script] : kScripts) {
      names.emplace_back(name);
    }
    return names;
  });
}

}  // namespace vesprun
