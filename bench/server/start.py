#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""How long programs take to start: from exec to the exit, or to the line of output with a word.

    bench/server/start.py RUNS WORD COMMAND... [-- COMMAND...]

An empty WORD waits for the exit. Several commands run by turns. Prints the median of each in milliseconds, in one line.
"""
import statistics
import subprocess
import sys
import time


def run(word, command):
    begin = time.perf_counter()
    with subprocess.Popen(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True) as program:
        said = ""
        for line in program.stdout:
            said += line
            if word and word in line:
                break
        if not word:
            program.wait()
        taken = time.perf_counter() - begin
        program.terminate()
    if program.returncode != 0 or word not in said:
        sys.exit(f"{' '.join(command)} ended with {program.returncode}: {said}")
    return taken * 1000


def main():
    runs, word = int(sys.argv[1]), sys.argv[2]
    commands = [[]]
    for argument in sys.argv[3:]:
        if argument == "--":
            commands.append([])
        else:
            commands[-1].append(argument)
    times = [[] for _ in commands]
    for _ in range(runs + 1):  # the first finds cold caches
        for taken, command in zip(times, commands):
            taken.append(run(word, command))
    print(*(f"{statistics.median(taken[1:]):.1f}" for taken in times))


main()
