#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Counts how the code is cut: files, functions, comments and includes.

    tools/measure-structure.py            the figures
    tools/measure-structure.py --details  also the files and functions behind them

Run it in a checkout: it reads the files that git tracks. A line of code is neither blank nor comment. The classes'
bindings (src/Providers/Schema) are tables and left out, but for the includes; so are lines that only name the licence.
"""
import re
import statistics
import subprocess
import sys

SMALL = 30
LARGE = 400
INSTANCE_HEADER = "CimInstance.h"


def tracked(*patterns):
    listed = subprocess.run(["git", "ls-files", "-z", "--", *patterns], check=True, capture_output=True, text=True)
    return [name for name in listed.stdout.split("\0") if name]


def read(name):
    with open(name, encoding="utf-8") as file:
        return [line for line in file.read().splitlines() if "SPDX-License-Identifier" not in line]


def without_comments(text):
    """The text with comments and literals blanked; line breaks stay, so line numbers do too."""
    token = re.compile(r'//[^\n]*|/\*.*?\*/|R"(\w*)\(.*?\)\1"|"(?:\\.|[^"\\\n])*"|\'(?:\\.|[^\'\\\n])+\'', re.S)

    def blank(match):
        found = match.group()
        # 1'000 is a number, not a literal.
        before = match.string[max(match.start() - 1, 0):match.start()]
        if found[0] == "'" and before.isdigit():
            return found
        mark = "" if found.startswith(("//", "/*")) else '""'
        return mark + "\n" * found.count("\n")

    return token.sub(blank, text)


def count_lines(lines):
    """Lines of code, and lines that hold a comment alone."""
    code = sum(1 for line in without_comments("\n".join(lines)).split("\n") if line.strip())
    comments = sum(1 for line in lines if line.strip().startswith(("//", "/*", "* ")))
    return code, comments


NO_FUNCTION = re.compile(r"\b(namespace|class|struct|union|enum|extern)\b(?!.*\()|=\s*$|\b(return|else|do|try)\s*$")
CONTROL = re.compile(r"^\s*(if|for|while|switch|catch)\b")


def functions_in(lines):
    """(first line, length) of each function with a body; a lambda belongs to the function around it."""
    text = without_comments("\n".join(lines))
    found, stack, head_start, line = [], [], 0, 1
    head_line = 1
    for position, char in enumerate(text):
        if char == "\n":
            line += 1
        if char in "{};":
            head = re.sub(r"^\s*#.*$", "", text[head_start:position], flags=re.M)
            head = re.sub(r"^\s*((public|private|protected)\s*:|template\s*<[^{};]*?>\s*(?=\w))", "", head.strip())
            inside = any(kind == "function" for kind, _ in stack)
            if char == "{":
                is_function = (not inside and "(" in head and not NO_FUNCTION.search(head)
                               and not CONTROL.match(head) and not re.search(r"\)\s*:\s*.*[\w>]$", head, re.S))
                # A brace that initialises a member in a constructor's list is not the body.
                stack.append(("function" if is_function else "other", head_line if is_function else line))
            elif char == "}" and stack:
                kind, start = stack.pop()
                if kind == "function" and not any(outer == "function" for outer, _ in stack):
                    found.append((start, line - start + 1))
            head_start = position + 1
            head_line = line
        elif not text[head_start:position].strip() and not char.isspace():
            head_line = line
    return found


def include_graph(names):
    roots = ("src/", "tests/")
    graph = {}
    known = set(names)
    for name in names:
        graph[name] = []
        for line in read(name):
            match = re.match(r'\s*#include "([^"]+)"', line)
            if not match:
                continue
            near = name.rsplit("/", 1)[0] + "/" + match.group(1)
            for candidate in [near] + [root + match.group(1) for root in roots]:
                if candidate in known:
                    graph[name].append(candidate)
                    break
    return graph


def reach(graph, name, seen=None):
    seen = set() if seen is None else seen
    for target in graph[name]:
        if target not in seen:
            seen.add(target)
            reach(graph, target, seen)
    return seen


def depths(graph):
    known = {}

    def depth(name, path):
        if name in path:
            return 0
        if name not in known:
            known[name] = max((1 + depth(target, path | {name}) for target in graph[name]), default=0)
        return known[name]

    return {name: depth(name, frozenset()) for name in graph}


def p90(values):
    return sorted(values)[int(len(values) * 0.9)]


def main():
    details = "--details" in sys.argv[1:]
    everything = tracked("src/*.cpp", "src/*.h", "tests/*.cpp", "tests/*.h", "bench/*.cpp", "bench/*.h")
    sources = [name for name in everything if name.startswith("src/") and "/Schema/" not in name]
    lines = {name: read(name) for name in sources}
    sizes = {name: len(content) for name, content in lines.items()}
    counts = {name: count_lines(content) for name, content in lines.items()}
    functions = {name: functions_in(content) for name, content in lines.items()}
    lengths = [length for each in functions.values() for _, length in each]
    cpp = [name for name in sources if name.endswith(".cpp")]
    single = [name for name in cpp if len(functions[name]) == 1]
    small = [name for name in sources if sizes[name] <= SMALL]
    large = [name for name in sources if sizes[name] > LARGE]
    comment_share = 100 * sum(counts[n][1] for n in cpp) / sum(sum(counts[n]) for n in cpp)
    graph = include_graph(everything)
    depth = depths({name: graph[name] for name in graph})
    depth_cpp = [depth[name] for name in graph if name.startswith("src/") and name.endswith(".cpp")]
    touched = [name for name in everything if name.endswith(".cpp")
               and any(target.endswith("/" + INSTANCE_HEADER) for target in reach(graph, name))]

    print(f"files                                {len(sources)}")
    print(f"lines of code                        {sum(code for code, _ in counts.values())}")
    print(f"file lines, median / p90 / most      {statistics.median(sizes.values()):.0f} / {p90(sizes.values())} / {max(sizes.values())}")
    print(f"files of at most {SMALL} lines            {len(small)}")
    print(f"files of more than {LARGE} lines         {len(large)}")
    print(f"functions                            {len(lengths)}")
    print(f"function lines, median / p90 / most  {statistics.median(lengths):.0f} / {p90(lengths)} / {max(lengths)}")
    print(f".cpp files with one function         {len(single)} of {len(cpp)}")
    print(f"comment lines in .cpp files          {comment_share:.1f} %")
    print(f"include depth, most / median         {max(depth_cpp)} / {statistics.median(depth_cpp):.0f}")
    print(f"files compiled again after a change of {INSTANCE_HEADER}: {len(touched)}")
    if not details:
        return
    for title, names in (("small", small), ("large", large), ("one function", single)):
        print(f"\n{title}:")
        for name in names:
            print(f"  {sizes[name]:4} {name}")
    print("\nlong functions:")
    for name in sources:
        for start, length in functions[name]:
            if length > p90(lengths):
                print(f"  {length:4} {name}:{start}")
    print("\ndeep includes:")
    for name in sorted(graph, key=lambda n: -depth[n])[:20]:
        print(f"  {depth[name]:4} {name}")


main()
