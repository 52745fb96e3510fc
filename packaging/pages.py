#!/usr/bin/env python3
"""Writes manual pages and shell completions from the program's own --help: pages.py PROGRAM VERSION FOLDER [--compress]

Everything comes from the program as it was built, so that pages and completions always match it. A help text that cannot
be parsed is an error.
"""

import gzip
import os
import pathlib
import re
import shutil
import subprocess
import sys
from dataclasses import dataclass, field

NAME = ""  # of the program; set by main()
FOLDERS = {"FOLDER", "DIRECTORY", "DIR"}
FILES = {"FILE", "FILES", "IN", "OUT", "PATH", "ARRANGEMENT", "IMAGE", "PICTURE"}
ENVIRONMENT = {
    "tonewright": [
        ("TONEWRIGHT_PLUGIN_PATH", "Folders, separated by colons, that are searched first for media plug-ins."),
        ("TONEWRIGHT_RESAMPLER", "With the value best, a steeper filter changes sample rates."),
    ]
}


@dataclass
class Entry:
    """An option, an argument or a command, as one item of a list in the help."""

    head: str
    text: str

    @property
    def names(self):
        return re.findall(r"(?<![^\s,])--?[A-Za-z0-9][\w-]*", re.split(r" (?:Excludes|Needs):", self.head)[0])

    @property
    def value(self):
        """The placeholder of an option's value, or None."""
        words = re.split(r" (?:Excludes|Needs):", self.head)[0].split(" ", 1)
        return re.split(r"[\s:\[]", words[1])[0] if len(words) > 1 else None

    @property
    def excludes(self):
        found = re.search(r" Excludes:((?: --?[\w-]+)+)", self.head)
        return found.group(1).split() if found else []


@dataclass
class Command:
    path: tuple
    description: list = field(default_factory=list)  # paragraphs, and lists of lines to be shown as they are
    usage: str = ""
    sections: list = field(default_factory=list)  # (title, entries), or (title, lines) for a text
    footer: list = field(default_factory=list)
    commands: list = field(default_factory=list)
    values: dict = field(default_factory=dict)  # of options, by name

    def entries(self, kind):
        for title, entries in self.sections:
            for entry in entries:
                if isinstance(entry, Entry) and kind == kind_of(title, entry):
                    yield entry

    @property
    def page(self):
        return "-".join(self.path)

    @property
    def summary(self):
        sentence = re.split(r"[.:;](?: |$)", self.description[0])[0] if self.description else self.page
        sentence = re.sub(r" \([^()]*\)$", "", sentence)
        return sentence[0].lower() + sentence[1:]


def kind_of(title, entry):
    if title.lower() == "subcommands":
        return "command"
    return "option" if entry.head.startswith("-") else "argument"


def run(program, *arguments):
    return subprocess.run(
        [program, *arguments],
        capture_output=True,
        text=True,
        stdin=subprocess.DEVNULL,
        env={**os.environ, "LC_ALL": "C"},  # the pages are English
    )


def paragraphs(text):
    result = []
    for block in re.split(r"\n\s*\n", text.strip("\n")):
        plain = [line.strip() for line in block.splitlines() if not line.startswith(" ")]
        aligned = [line for line in block.splitlines() if line.startswith(" ")]
        result += ([" ".join(plain)] if plain else []) + ([aligned] if aligned else [])
    return result


def parse(text, path):
    """Parses one --help text."""
    command = Command(path)
    before, usage, rest = text.partition("\nUsage: ")
    if not usage:
        before, usage, rest = "", *text.partition("Usage: ")[1:]
    if not usage:
        raise ValueError("no usage line")
    command.description = paragraphs(before)
    command.usage, _, rest = rest.partition("\n")
    # A line of blanks is part of a description.
    for block in re.split(r"\n\n+", rest.strip("\n")):
        title, _, body = block.partition("\n")
        lines = body.splitlines()
        if title.startswith(" "):
            raise ValueError(f"cannot parse {title!r}")
        if not re.fullmatch(r"\S.*:", title) or not lines:
            command.footer += paragraphs(block)
        elif title.lower().startswith("example"):
            command.sections.append((title[:-1], [line.strip() for line in lines]))
        else:
            command.sections.append((title[:-1], parse_entries(lines)))
    command.commands = [entry.head for entry in command.entries("command")]
    return command


def parse_entries(lines):
    entries = []
    is_complete = False  # only the first paragraph counts; the rest is on the command's own page
    for line in lines:
        found = re.match(r"  (\S.*?)(?:  +(\S.*))?$", line)
        if found:
            entries.append(Entry(found.group(1).strip(), found.group(2) or ""))
            is_complete = False
        elif line.startswith("      ") and entries:
            is_complete = is_complete or not line.strip()
            if not is_complete:
                entries[-1].text = f"{entries[-1].text} {line.strip()}".strip()
        else:
            raise ValueError(f"cannot parse {line!r}")
    return entries


def allowed_values(program, path, option):
    """The values of an enumerated option, from the program's answer to an invalid one.

    The unknown last argument keeps the command from running in any case.
    """
    answer = run(program, *path[1:], f"{option}=-987654321", "--no-such-option")
    if answer.returncode == 0:
        raise ValueError(f"{' '.join(path)} accepts --no-such-option")
    found = re.search(r"(?:not in|value in) \{([^{}]*)\}", answer.stdout + answer.stderr)
    return [value.split("->")[0] for value in found.group(1).split(",")] if found else []


def read_commands(program, path=()):
    """The command and all commands below it, parents first."""
    path = path or (NAME,)
    answer = run(program, *path[1:], "--help")
    try:
        if answer.returncode != 0:
            raise ValueError(answer.stderr)
        command = parse(answer.stdout, path)
        for option in command.entries("option"):
            if option.value:
                values = allowed_values(program, path, option.names[-1])
                command.values |= {name: values for name in option.names if values}
    except ValueError as error:
        sys.exit(f"help of {' '.join(path)}: {error}")
    result = [command]
    for name in command.commands:
        result += read_commands(program, (*path, name))
    return result


# Manual pages


def roff(text):
    text = text.replace("\\", "\\e").replace("-", "\\-").replace("'", "\\(aq").replace("`", "\\(ga")
    return re.sub(r"^\.", r"\\&.", text)


def option_head(entry):
    value = f" \\fI{roff(entry.value)}\\fR" if entry.value else ""
    return ", ".join(f"\\fB{roff(name)}\\fR" for name in entry.names) + value


def usage_line(command):
    words = command.usage.split()[len(command.path) :]
    marked = [re.sub(r"[A-Z]{2,}", r"\\fI\g<0>\\fR", roff(word)) for word in words]
    return f"\\fB{roff(' '.join(command.path))}\\fR " + " ".join(marked)


def texts(paragraphs):
    lines = []
    for text in paragraphs:
        lines += [".PP", roff(text)] if isinstance(text, str) else [".EX", *map(roff, text), ".EE"]
    return lines


def manual_page(command, commands, version):
    lines = [f'.TH {command.page.upper()} 1 "" "Tonewright {version}" "User Commands"']
    lines += [".SH NAME", f"{roff(command.page)} \\- {roff(command.summary)}"]
    lines += [".SH SYNOPSIS", usage_line(command), ".SH DESCRIPTION"]
    lines += texts(command.description)[1:]
    for title, entries in command.sections:
        heading = {"positionals": "ARGUMENTS", "subcommands": "COMMANDS"}.get(title.lower(), title.upper())
        lines.append(f".SH {heading}")
        if entries and isinstance(entries[0], str):
            lines += [".EX", *map(roff, entries), ".EE"]
            continue
        for entry in entries:
            kind = kind_of(title, entry)
            if kind == "command":
                page = "-".join((*command.path, entry.head))
                head, text = f"\\fB{roff(entry.head)}\\fR", f"{roff(entry.text)} See \\fB{roff(page)}\\fR(1)."
            else:
                head = option_head(entry) if kind == "option" else f"\\fI{roff(entry.head)}\\fR"
                values = command.values.get(entry.names[-1]) if kind == "option" else None
                missing = [value for value in values or [] if not re.search(rf"\b{re.escape(value)}\b", entry.text)]
                text = roff(entry.text if not missing else f"{entry.text}: {', '.join(values)}")
                if entry.excludes:
                    text += roff(f". Not together with {', '.join(entry.excludes)}.")
            lines += [".TP", head, text]
    for text in command.footer:
        codes = isinstance(text, str) and re.fullmatch(r"Exit codes: (.*)", text)
        if not codes:
            lines += texts([text])
            continue
        lines.append(".SH EXIT STATUS")
        for code in re.split(r", (?=\d+ )", codes.group(1).rstrip(".")):
            number, meaning = code.split(" ", 1)
            lines += [".TP", f"\\fB{number}\\fR", roff(meaning)]
    if len(command.path) == 1 and NAME in ENVIRONMENT:
        lines.append(".SH ENVIRONMENT")
        for name, text in ENVIRONMENT[NAME]:
            lines += [".TP", f"\\fB{name}\\fR", roff(text)]
    parents = [other.page for other in commands if other is not command and is_related(command, other)]
    if parents:
        lines += [".SH SEE ALSO", ", ".join(f"\\fB{roff(page)}\\fR(1)" for page in parents)]
    return "\n".join(lines) + "\n"


def is_related(command, other):
    return command.path[:-1] == other.path or other.path[:-1] == command.path or command.path[:-1] == other.path[:-1]


# Completions. All three walk over the words in front of the cursor to find the command: a word that names a command below
# the one found so far extends it, options and their values are skipped, and any other word ends the search.


def value_kind(entry):
    word = (entry.value or entry.head.split()[0]).strip("[].")
    return "folder" if word in FOLDERS else "file" if word in FILES else "none"


def function_name():
    return "_" + NAME.replace("-", "_")


def takes_files(command):
    return any(True for _ in command.entries("argument"))


def shell(text):
    return "'" + text.replace("'", "'\\''") + "'"


def value_options(command):
    return [name for option in command.entries("option") if option.value for name in option.names]


def bash_completion(commands):
    root = commands[0]
    known = "|".join(f'"{" ".join(command.path)}"' for command in commands)
    lines = [
        f"# bash completion for {NAME}, made from the program's --help.",
        f"{function_name()}() {{",
        '    local cur=${COMP_WORDS[COMP_CWORD]} prev=${COMP_WORDS[COMP_CWORD - 1]} command=' + NAME,
        "    local i word words= values= kind=none",
        "    COMPREPLY=()",
        "    # \"=\" is a word of its own.",
        '    if [[ $cur == = ]]; then cur=; elif [[ $prev == = ]]; then prev=${COMP_WORDS[COMP_CWORD - 2]}; fi',
        "    for ((i = 1; i < COMP_CWORD; ++i)); do",
        "        word=${COMP_WORDS[i]}",
        '        case "$command $word" in',
        f"        {known}) command+=\" $word\" ;;",
        *(
            f'        "{NAME} {option}") ((++i)); [[ ${{COMP_WORDS[i]}} != = ]] || ((++i)) ;;'
            for option in value_options(root)
        ),
        f'        "$command "-*) ;;',
        "        *) break ;;",
        "        esac",
        "    done",
        "    case $command in",
    ]
    for command in commands:
        options = [name for option in command.entries("option") for name in option.names]
        lines.append(f"    {shell(' '.join(command.path))})")
        lines.append(f"        words={shell(' '.join(options))}")
        if command.commands:
            lines.append(f"        [[ $cur == -* ]] || words={shell(' '.join(command.commands))}")
        if takes_files(command):
            lines.append("        kind=file")
        cases = []
        for option in command.entries("option"):
            if not option.value:
                continue
            pattern = "|".join(option.names)
            values = command.values.get(option.names[-1])
            if values:
                cases.append(f"        {pattern}) words={shell(' '.join(values))} kind=value ;;")
            else:
                cases.append(f"        {pattern}) words= kind={value_kind(option)} ;;")
        lines += ["        case $prev in", *cases, "        esac"] if cases else []
        lines.append("        ;;")
    lines += [
        "    esac",
        "    # No reply leaves file names to readline.",
        '    if [[ $kind == folder ]]; then compopt -o dirnames +o default +o bashdefault; return; fi',
        '    if [[ $kind == file && ( -z $words || $cur != -* ) ]]; then return; fi',
        "    compopt +o default +o bashdefault",
        '    if [[ -n $words ]]; then mapfile -t COMPREPLY < <(compgen -W "$words" -- "$cur"); fi',
        "}",
        f"complete -o bashdefault -o default -F {function_name()} {NAME}",
    ]
    return "\n".join(lines) + "\n"


def zsh_text(text):
    return re.sub(r"([\[\]:\\])", r"\\\1", text)


def zsh_completion(commands):
    actions = {"file": "_files", "folder": "_files -/", "none": " "}
    lines = [f"#compdef {NAME}", f"# zsh completion for {NAME}, made from the program's --help.", ""]
    for command in commands:
        function = "_" + "_".join(command.path).replace("-", "_")
        specs = []
        for option in command.entries("option"):
            repeated = "*" if "repeated" in option.text else ""
            others = " ".join(([] if repeated else option.names) + option.excludes)
            exclusion = f"({others})" if others else ""
            value = ""
            if option.value:
                values = command.values.get(option.names[-1])
                action = f"({' '.join(values)})" if values else actions[value_kind(option)]
                value = f":{zsh_text(option.value)}:{action}"
            for name in option.names:
                suffix = ("=" if name.startswith("--") else "+") if option.value else ""
                specs.append(shell(f"{exclusion}{repeated}{name}{suffix}[{zsh_text(option.text)}]{value}"))
        lines.append(f"{function}() {{")
        if command.commands:
            children = [entry for entry in command.entries("command")]
            lines += ["    local curcontext=$curcontext state line", "    _arguments -C -s -S \\"]
            lines += [f"        {spec} \\" for spec in specs]
            lines += ["        '1:command:->command' '*::argument:->argument'", "    case $state in", "    command)"]
            lines += ["        local -a commands=("]
            for entry in children:
                summary = re.split(r"[.](?: |$)", entry.text)[0]
                lines.append(f"            {shell(entry.head + ':' + summary)}")
            lines += ["        )", "        _describe command commands ;;", "    argument)", "        case $words[1] in"]
            lines += [f"        {entry.head}) {function}_{entry.head.replace('-', '_')} ;;" for entry in children]
            lines += ["        esac ;;", "    esac"]
        else:
            lines.append("    _arguments -s -S \\")
            lines += [f"        {spec} \\" for spec in specs]
            lines.append("        '*:file:_files'" if takes_files(command) else "        ':'")
        lines += ["}", ""]
    lines.append(f'{function_name()} "$@"')
    return "\n".join(lines) + "\n"


def fish_completion(commands):
    text = lambda value: "'" + value.replace("\\", "\\\\").replace("'", "\\'") + "'"
    known = " ".join(text(" ".join(command.path[1:])) for command in commands[1:])
    lines = [
        f"# fish completion for {NAME}, made from the program's --help.",
        "",
        "# Whether the words in front of the cursor select this command, such as \"tag set\".",
        f"function _{function_name()}_at",
        "    set -l found",
        "    set -l skip 0",
        "    for word in (commandline -opc)[2..]",
        "        if test $skip = 1",
        "            set skip 0",
        "        else if string match -q -- '-*' $word",
        f"            contains -- $word {' '.join(value_options(commands[0]))}; and set skip 1",
        f"        else if contains -- (string join ' ' $found $word) {known}",
        "            set -a found $word",
        "        else",
        "            break",
        "        end",
        "    end",
        '    test "$found" = "$argv"',
        "end",
        "",
        f"complete -c {NAME} -f",
    ]
    for command in commands:
        start = f"complete -c {NAME} -n {text(' '.join((f'_{function_name()}_at', *command.path[1:])))}"
        if takes_files(command):
            lines.append(f"{start} -F")
        for entry in command.entries("command"):
            summary = re.split(r"[.](?: |$)", entry.text)[0]
            lines.append(f"{start} -a {entry.head} -d {text(summary)}")
        for option in command.entries("option"):
            parts = [f"-l {name[2:]}" if name.startswith("--") else f"-s {name[1:]}" for name in option.names]
            if option.value:
                values = command.values.get(option.names[-1])
                kind = value_kind(option)
                parts.append(
                    f"-x -a {text(' '.join(values))}"
                    if values
                    else {"file": "-r -F", "folder": "-x -a '(__fish_complete_directories)'", "none": "-x"}[kind]
                )
            lines.append(f"{start} {' '.join(parts)} -d {text(option.text)}")
    return "\n".join(lines) + "\n"


def main():
    global NAME
    program, version, folder = sys.argv[1:4]
    NAME = pathlib.Path(program).name
    compress = "--compress" in sys.argv[4:]
    target = pathlib.Path(folder)
    # A page of a command that no longer exists must not be installed.
    shutil.rmtree(target, ignore_errors=True)
    manuals = target / "man1"
    manuals.mkdir(parents=True)
    commands = read_commands(program)
    for command in commands:
        page = manual_page(command, commands, version).encode()
        if compress:
            (manuals / f"{command.page}.1.gz").write_bytes(gzip.compress(page, 9, mtime=0))
        else:
            (manuals / f"{command.page}.1").write_bytes(page)
    (target / NAME).write_text(bash_completion(commands))
    (target / f"_{NAME}").write_text(zsh_completion(commands))
    (target / f"{NAME}.fish").write_text(fish_completion(commands))


if __name__ == "__main__":
    main()
