#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Makes the manual pages: packaging/man/make-pages.py PROGRAMS OUT

PROGRAMS is the folder with quenxctl and quenx-cimd. Lines of the sources (*.scd, as scdoc reads them) that stand for what
the programs say of themselves, or for what an example says, are filled in:

    {{verbs}}             the verbs of quenxctl, each with its options
    {{options PROGRAM}}   the options of a program
    {{settings}}          the settings of quenx-cimd, by section
    {{status PROGRAM}}    its exit status
    {{example FILE}}      a file of this project, as it is
"""
import pathlib
import re
import subprocess
import sys

HERE = pathlib.Path(__file__).resolve().parent
ROOT = HERE.parent.parent


def escaped(text):
    return re.sub(r"([\\*_`<>#~|\[\]])", r"\\\1", text)


def help_of(programs, *command):
    program = programs / command[0]
    ran = subprocess.run([program, *command[1:]], capture_output=True, text=True, check=True, env={"LC_ALL": "C.UTF-8"})
    # Where this build has its libraries is nobody else's business.
    return ran.stdout.replace(str(programs.parent), "/usr")


def section(text, title):
    found = re.search(rf"^{re.escape(title)}.*:\n((?:  .*\n)+)", text, re.MULTILINE)
    return found.group(1) if found else ""


def entries(block):
    """Pairs of a name and its description; the description may stand in the lines below the name."""
    found = []
    for line in block.splitlines():
        name = re.match(r"  (\S.*?)(?:\s{2,}(.*)|(?<=\S)\s(?=\b)$)?$", line)
        if name and not line.startswith("   "):
            first, rest = line[2:30].rstrip(), line[30:].strip()
            is_name = rest.startswith(("Only with:", "Not with:"))
            if len(line) > 30 and line[29] != " " or not rest or is_name:
                first, rest = line[2:].rstrip(), ""
            found.append([first, rest])
        elif found:
            found[-1][1] = (found[-1][1] + " " + line.strip()).strip()
    return found


def listed(pairs):
    lines = []
    for name, text in pairs:
        word, _, rest = name.partition(" ")
        lines += [f"*{escaped(word)}* {escaped(rest)}".rstrip(), f"\t{escaped(text)}", ""]
    return lines


def options_of(text):
    return listed(pair for pair in entries(section(text, "Options")) if "--help" not in pair[0])


def verbs_of(programs):
    lines = []
    for name, text in entries(section(help_of(programs, "quenxctl", "--help"), "Verbs")):
        own = help_of(programs, "quenxctl", "help", name.split(",")[0])
        usage = re.search(r"^Usage: quenxctl (.*)$", own, re.MULTILINE).group(1)
        lines += [f"## {escaped(name)}", "", f"*quenxctl* {escaped(usage)}", "", f"{escaped(text)}.", ""]
        lines += listed(entries(section(own, "Arguments")))
        lines += options_of(own)
        footer = own.rstrip("\n").split("\n\n")[-1].splitlines()[-1]
        if not footer.startswith(" ") and footer != text and "Usage" not in footer and footer.endswith("."):
            lines += [escaped(footer), ""]
    return lines


def settings_of(text):
    lines = []
    for name in re.findall(r"^Settings \((\w+)\.\* in the file\):", text, re.MULTILINE):
        lines += [f"## [{name}]", ""]
        for option, description in entries(section(text, f"Settings ({name}.* in the file)")):
            key = option.split()[0].removeprefix(f"--{name}-").replace("-", "_")
            lines += [f"*{escaped(key)}*", f"\t{escaped(description)}", ""]
    return lines


def status_of(text):
    block = section(text, "Exit status")
    if not block:
        return [escaped(re.search(r"^Exit status: (.*)$", text, re.MULTILINE).group(1))]
    return listed(line.strip().split("  ", 1) for line in block.splitlines())


def filled(line, programs):
    found = re.fullmatch(r"\{\{(\w+)(?: (\S+))?\}\}", line)
    if not found:
        return [line]
    what, argument = found.groups()
    if what == "example":
        return ["```", *(ROOT / argument).read_text().splitlines(), "```"]
    if what == "verbs":
        return verbs_of(programs)
    text = help_of(programs, argument or "quenx-cimd", "--help")
    return {"options": options_of, "settings": settings_of, "status": status_of}[what](text)


def main():
    programs, out = pathlib.Path(sys.argv[1]).resolve(), pathlib.Path(sys.argv[2])
    out.mkdir(parents=True, exist_ok=True)
    for source in sorted(HERE.glob("*.scd")):
        lines = [new for line in source.read_text().splitlines() for new in filled(line, programs)]
        made = subprocess.run(["scdoc"], input="\n".join(lines) + "\n", capture_output=True, text=True, check=False)
        if made.returncode != 0:
            sys.exit(f"{source}: {made.stderr}")
        (out / source.stem).write_text(made.stdout)


main()
