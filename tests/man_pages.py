#!/usr/bin/env python3
"""Compares a manual page with the commands and options that its program knows: man_pages.py PAGE PROGRAM

Every command and option of the program is in the page, and every one in the page is in the program; so are
the names of arguments, somewhere. A section of COMMANDS that has a command's name tells of the commands
below it.
"""

import re
import subprocess
import sys


def tree(program, path=(), words=()):
    """The options and arguments of each command, by the words that lead to it; `words` has arguments, too."""
    text = subprocess.run([program, *words, "--help"], check=True, capture_output=True, text=True).stdout
    found = {path: set(re.findall(r"^  (?:-\w,)?(--[\w-]+)", text, re.M)) - {"--help", "--json", "--version"}}
    arguments = re.findall(r"^  (\S+)", text.partition("\nPositionals:\n")[2].partition("\n\n")[0], re.M)
    found[path] |= set(arguments)
    for name in re.findall(r"^  ([\w-]+)", text.partition("\nSubcommands:\n")[2], re.M):
        found |= tree(program, (*path, name), (*words, *["x"] * len(arguments), name))
    return found


def plain(roff):
    """A line of the page without its macros, quotes and fonts."""
    roff = re.sub(r"^\.[A-Z]+ ?", "", roff)
    return re.sub(r"\\f.|\\&|\"", "", roff).replace(r"\-", "-")


def main(page_file, program):
    commands = tree(program)
    with open(page_file, encoding="utf-8") as file:
        page = file.read()
    body = re.split(r"^\.SH (?!OPTIONS)", page.partition(".SH COMMANDS\n")[2], flags=re.M)[0]
    complaints = []
    named = {()}
    for section in re.split(r"^\.SS ", "\n" + body, flags=re.M):
        title, *lines = section.splitlines()
        above = (title,) if (title,) in commands else ()
        here = {above} - {()}
        for before, line in zip(lines, lines[1:]):
            if before != ".TP" or plain(line).startswith("--"):
                continue
            for words in re.split(", ", plain(line).partition(" [")[0]):
                words = words.split()
                path = (*above, words[0])
                if (*path, *words[1:2]) in commands:
                    path = (*path, *words[1:2])
                if path in commands:
                    here |= {path[:length] for length in range(len(above) + 1, len(path) + 1)}
                else:
                    complaints.append(f"{title}: no command {' '.join(path)}")
        text = "\n".join(map(plain, lines))
        # Commands below one that is told of here may be words of its text.
        words = set(re.findall(r"[\w-]+", text))
        here |= {path for path in commands if path[:-1] in here - {above} and path[-1] in words}
        shown = set(re.findall(r"--[a-z][\w-]*", text)) - {"--json"}
        known = {name for path in here for name in commands[path] if name.startswith("--")}
        complaints += [f"{title}: no command has {option}" for option in sorted(shown - known)]
        complaints += [f"{title}: {option} is missing" for option in sorted(known - shown)]
        named |= here
    complaints += [f"{' '.join(path)} is missing" for path in sorted(set(commands) - named)]
    arguments = {name for names in commands.values() for name in names if not name.startswith("--")}
    complaints += [f"{name} is missing" for name in sorted(arguments - set(re.findall(r"\w+", page)))]
    for complaint in complaints:
        print(f"{page_file}: {complaint}", file=sys.stderr)
    return 1 if complaints or len(commands) < 4 else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
