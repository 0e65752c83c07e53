#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Changes the code in small ways, one at a time, and tells which changes no test notices.

    tests/mutate.py [--seed N] [--count N] [--skip N] [--only PATH]... [--list]

--seed   chooses the changes; the same seed and tree give the same ones (default: from the clock; it is printed)
--count  how many changes that compile are tried (default 80)
--skip   goes on behind that many changes of the seed, compiled or not
--only   changes files below PATH alone, such as src/MidAPI, or one line, such as src/MidAPI/ma.cpp:40
--list   prints the changes and tries none

Works on a copy of the index in build/mutants, built like the preset release; the checkout stays as it is. Tests of
changed code could write anywhere, so they run in tools/contained.sh, which needs root or user namespaces. A test
notices a change when it fails, or takes far too long, twice in a row. A change whose libraries and programs are the
same, byte for byte, is none and does not count. Ends with 1 when fewer than nine in ten of the changes are noticed. A
survivor is a hole in the tests, or code that could be simpler, or a change that changes nothing.
"""
import argparse
import collections
import filecmp
import fcntl
import hashlib
import json
import os
import pathlib
import random
import re
import resource
import shutil
import signal
import subprocess
import sys
import time

ROOT = pathlib.Path(__file__).resolve().parent.parent
WORK = ROOT / "build" / "mutants"
TREE = WORK / "tree"
BUILD = TREE / "build" / "release"  # the preset's own place, for the compiler cache
WANTED = 0.9
JOBS = os.cpu_count()
BUILD_SECONDS = 1200
TEST_SECONDS = 15  # and five times what the test took with the unchanged code
LONG_SECONDS = 2  # a test that takes longer is not among the first
TEST_MEMORY = 8 << 30

# What the standard's classes declare is the standard's schema, written down: a test could only repeat it.
SCHEMA = ("src/Providers/Schema/CIM_", "src/Providers/Schema/ValueMapTexts.h")

# Below the fronts nothing depends on them, and their changes cannot matter to the tests there.
FRONTS = {"CimXml", "Host", "Cli"}
ABOVE = FRONTS | {"System"}

# What stands between blanks is an operator: clang-format leaves none around the brackets of a template.
SWAPS = {
    " == ": [" != "], " != ": [" == "], " < ": [" <= ", " > "], " <= ": [" < "], " > ": [" >= ", " < "],
    " >= ": [" > "], " && ": [" || "], " || ": [" && "], " + ": [" - "], " - ": [" + "], " * ": [" / "], " / ": [" * "],
    " % ": [" / "], " & ": [" | "], " | ": [" & "], " << ": [" >> "], " += ": [" -= "], " -= ": [" += "],
    "++": ["--"], "--": ["++"], "true": ["false"], "false": ["true"], "break;": ["continue;"], "continue;": ["break;"],
}
WORDS = {"true", "false"}
CONDITION = re.compile(r"\b(?:if|while) \((?!.*\bconstexpr\b)(.*)\)(?= [^)]*$| \{$|$)")
STATEMENT = re.compile(r"^\s+[A-Za-z_][\w:.>\-]*\(.*\);$")
NUMBER = re.compile(r"(?<![\w.'\"])\d+(?![\w.'\"])")
TEXT = re.compile(r'"(?:[^"\\]|\\.)*"')
# Besides what is no code: debug lines, whose wording is free, the size of room set aside, which nobody sees, and what
# another compiler alone reads.
DEBUG_LINE = re.compile(r"(?:^|\s)QUENX_DEBUG|\bTimeStamp \w+\(")
LEFT_ALONE = re.compile(r"^\s*(#|//|///|using |namespace |static_assert|template)|__FILE__|__attribute__|"
                        r"\.reserve\(|\bchar \w+\[|QUENX_CAPABILITY\(")
WORDING = re.compile(r"\s|^\\n$")  # in a text of a front: something for people to read


def changes_of(line, is_front):
    """(what it is, the changed line) for each small change of one line of code."""
    if LEFT_ALONE.search(line):
        return
    code = re.split(r"\s//", line)[0]
    texts = [match.span() for match in TEXT.finditer(code)]

    def inside_text(place):
        return any(first <= place < last for first, last in texts)

    for sign, replacements in SWAPS.items():
        pattern = rf"\b{sign}\b" if sign in WORDS else re.escape(sign)
        for match in re.finditer(pattern, code):
            if inside_text(match.start()):
                continue
            # Texts that are joined, and what is written to a stream, are no arithmetic.
            if sign == " + " and texts:
                continue
            if sign == " << " and not re.search(r"[\w)] << \(?\d|1U? <<", code):
                continue
            for new in replacements:
                yield f"{sign.strip()} to {new.strip()}", line[:match.start()] + new + line[match.end():]
    if match := CONDITION.search(code):
        first, last = match.span(1)
        if ";" not in match.group(1) and match.group(1).count("(") == match.group(1).count(")"):
            yield "condition negated", f"{line[:first]}!({line[first:last]}){line[last:]}"
    for match in NUMBER.finditer(code):
        if not inside_text(match.start()):
            yield "number plus one", line[:match.start()] + str(int(match.group()) + 1) + line[match.end():]
    # Clients read the library's texts letter for letter. In the fronts names, keys and elements go missing.
    for first, last in texts:
        text = line[first + 1:last - 1]
        if text and not is_front:
            yield "text changed", f"{line[:last - 1]}~{line[last - 1:]}"
        elif text and not WORDING.search(text):
            yield "text emptied", f'{line[:first]}""{line[last:]}'
    if STATEMENT.match(code):
        yield "call left out", re.match(r"\s*", line).group() + ";"


def all_changes(below):
    """(file, number of the line, what it is, the changed line) over the library, the daemon and the command line."""
    for file in sorted(TREE.glob("src/**/*.*")):
        name = str(file.relative_to(TREE))
        if file.suffix not in (".cpp", ".h") or name.startswith(SCHEMA):
            continue
        is_debug = False
        for number, line in enumerate(file.read_text(encoding="utf-8").splitlines(), start=1):
            is_debug = is_debug or DEBUG_LINE.search(line) is not None
            if not is_debug and (not below or any(is_below(path, name, number) for path in below)):
                for kind, changed in changes_of(line, room_of(name) in FRONTS):
                    yield name, number, kind, changed
            is_debug = is_debug and not line.endswith(";")


def is_below(path, name, number):
    if path.rpartition(":")[2].isdigit():
        return path == f"{name}:{number}"
    return name == path or name.startswith(path.rstrip("/") + "/")


def room_of(name):
    return pathlib.Path(name).parts[1]


def copy_tree():
    """Brings the copy up to date; what did not change keeps its time, and so its objects."""
    fresh = WORK / "fresh"
    shutil.rmtree(fresh, ignore_errors=True)
    subprocess.run(["git", "checkout-index", "--all", f"--prefix={fresh}/"], cwd=ROOT, check=True)
    wanted = {file.relative_to(fresh) for file in fresh.rglob("*") if not file.is_dir()}
    for name in wanted:
        source, target = fresh / name, TREE / name
        if target.is_file() and filecmp.cmp(source, target, shallow=False):
            continue
        target.parent.mkdir(parents=True, exist_ok=True)
        shutil.copy(source, target)
    for file in (TREE / "src").rglob("*"):
        if file.is_file() and file.relative_to(TREE) not in wanted:
            file.unlink()
    shutil.rmtree(fresh)


def run(command, limit=BUILD_SECONDS, **options):
    """(its output, whether it succeeded); what takes too long is ended, with all that it has started."""
    with subprocess.Popen(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, errors="replace",
                          cwd=TREE, start_new_session=True, **options) as process:
        try:
            return process.communicate(timeout=limit)[0], process.returncode == 0
        except subprocess.TimeoutExpired:
            return "It took too long.", False
        finally:
            if process.poll() is None:
                # Ninja then ends its compilers, which are in groups of their own.
                os.killpg(process.pid, signal.SIGTERM)
                time.sleep(1)
            end(process)


def end(process):
    try:
        os.killpg(process.pid, signal.SIGKILL)
    except ProcessLookupError:
        pass
    process.wait()


def build(targets=()):
    return run(["cmake", "--build", str(BUILD), "-j", str(JOBS), "--target", *(targets or ["all"])])


def prepare():
    """Builds the unchanged code, and lists its tests."""
    output, configured = run(["cmake", "--preset", "release", "-DQUENX_BENCH=OFF", "-DCMAKE_LINK_DEPENDS_NO_SHARED=ON",
                              "-DCMAKE_GTEST_DISCOVER_TESTS_DISCOVERY_MODE=PRE_TEST"])
    if configured:
        output, configured = build()
    if not configured:
        sys.exit(output[-4000:] + "\nmutate.py: the unchanged code does not build.")
    output, _ = run(["ctest", "--test-dir", str(BUILD), "--show-only=json-v1", "--exclude-regex", "^Pages"])
    tests = []
    for test in json.loads(output[output.index("{"):])["tests"]:
        properties = {entry["name"]: entry["value"] for entry in test["properties"]}
        folder = properties["WORKING_DIRECTORY"]
        tests.append({"name": test["name"], "command": test["command"], "folder": folder,
                      "room": pathlib.Path(folder).relative_to(BUILD / "tests").parts[0], "limit": 120})
    return tests


def products():
    """What is installed, as one sum."""
    total = hashlib.sha256()
    for file in sorted(file for folder in ("lib", "bin") for file in (BUILD / folder).rglob("*") if file.is_file()):
        total.update(file.read_bytes())
    return total.digest()


def first_failure(tests):
    """The name of the first test that fails twice, or None; and how long each that passed took."""
    waiting, running, took = collections.deque(tests), {}, {}
    while waiting or running:
        while waiting and len(running) < 2 * JOBS:  # many wait more than they compute
            test = waiting.popleft()
            running[start(test)] = (test, time.monotonic())
        time.sleep(0.005)
        for process, (test, began) in list(running.items()):
            is_late = time.monotonic() - began > test["limit"]
            if process.poll() is None and not is_late:
                continue
            del running[process]
            end(process)
            if process.returncode == 0:
                took[test["name"]] = time.monotonic() - began
                continue
            # Once more, and alone: it may have failed by chance.
            for other, (interrupted, _) in running.items():
                end(other)
                waiting.appendleft(interrupted)
            running.clear()
            again = start(test)
            try:
                again.wait(test["limit"])
            except subprocess.TimeoutExpired:
                pass
            end(again)
            if again.returncode != 0:
                return test["name"], took
            break
    return None, took


def start(test):
    def prepare_child():
        os.setpgid(0, 0)  # no session of its own: its first terminal would become that session's
        for number in (signal.SIGHUP, signal.SIGINT, signal.SIGQUIT, signal.SIGTERM):
            signal.signal(number, signal.SIG_DFL)  # whoever works in the background ignores some
        resource.setrlimit(resource.RLIMIT_AS, (TEST_MEMORY, TEST_MEMORY))
        resource.setrlimit(resource.RLIMIT_CORE, (0, 0))
    return subprocess.Popen(test["command"], cwd=test["folder"], stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL,
                            stderr=subprocess.DEVNULL, preexec_fn=prepare_child)


def first_failure_contained(tests):
    """The same with the tests, and all that they start, shut in: nothing of it outlasts the call."""
    command = ["unshare", "--pid", "--fork", "--kill-child", "--mount-proc", str(TREE / "tools" / "contained.sh"),
               str(TREE), "--", str(TREE / "tests" / "mutate.py"), "--run"]
    if os.geteuid() != 0:
        command[1:1] = ["--user", "--map-root-user"]
    (WORK / "tests.json").write_text(json.dumps(tests), encoding="utf-8")
    with open(WORK / "tests.json", encoding="utf-8") as listed:
        output, succeeded = run(command, limit=3600, stdin=listed)
    if not succeeded:
        sys.exit(output[-4000:] + "\nmutate.py: tools/contained.sh does not run here, and changed code must not run "
                 "without it. Run as root.")
    return json.loads(output.splitlines()[-1])


def outcome(name, tests, unchanged):
    """Tries the tests that are likely to notice, then all others. Slow ones are last, and build what they need."""
    room = room_of(name)
    tests = [test for test in tests if room not in FRONTS or test["room"] in ABOVE]
    first = [test for test in tests if test["room"] == room and test["seconds"] < LONG_SECONDS]
    programs = {pathlib.Path(test["command"][0]).name for test in first}
    for part, targets in (first, programs), ([test for test in tests if test not in first], ()):
        if not build(targets)[1]:
            return "does not compile"
        if not targets and products() == unchanged:
            return "changes nothing"
        noticed, _ = first_failure_contained(part)
        if noticed:
            return f"noticed by {noticed}"
    return "SURVIVED"


def try_changes(count, changes):
    tests = prepare()
    noticed, took = first_failure_contained(tests)
    if noticed:
        sys.exit(f"mutate.py: {noticed} fails on the unchanged code. Mend that first.")
    for test in tests:
        test["seconds"] = took[test["name"]]
        test["limit"] = TEST_SECONDS + 5 * test["seconds"]
    tests.sort(key=lambda test: test["seconds"])
    unchanged = products()
    print(f"{len(tests)} tests", flush=True)
    compiled, survivors = 0, []
    for name, number, kind, changed in changes:
        if compiled == count:
            break
        file = TREE / name
        original = file.read_text(encoding="utf-8")
        lines = original.splitlines(keepends=True)
        before, lines[number - 1] = lines[number - 1].rstrip("\n"), changed + "\n"
        began = time.monotonic()
        try:
            file.write_text("".join(lines), encoding="utf-8")
            result = outcome(name, tests, unchanged)
        finally:
            file.write_text(original, encoding="utf-8")
        print(f"{name}:{number}: {kind}: {result} ({time.monotonic() - began:.0f} s)", flush=True)
        if result in ("does not compile", "changes nothing"):
            continue
        compiled += 1
        if result == "SURVIVED":
            survivors.append(f"{name}:{number}\n  - {before.strip()}\n  + {changed.strip()}")
            print(survivors[-1], flush=True)
    return compiled, survivors


def main():
    signal.signal(signal.SIGTERM, lambda *_: sys.exit(143))  # what runs is ended, and the copy mended
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--seed", type=int, default=int(time.time()))
    parser.add_argument("--count", type=int, default=80)
    parser.add_argument("--skip", type=int, default=0)
    parser.add_argument("--only", action="append", default=[], metavar="PATH")
    parser.add_argument("--list", action="store_true")
    parser.add_argument("--run", action="store_true", help=argparse.SUPPRESS)
    options = parser.parse_args()
    if options.run:
        print(json.dumps(first_failure(json.load(sys.stdin))))
        return
    WORK.mkdir(parents=True, exist_ok=True)
    alone = open(WORK / "lock", "w", encoding="utf-8")
    try:
        fcntl.flock(alone, fcntl.LOCK_EX | fcntl.LOCK_NB)
    except BlockingIOError:
        sys.exit("mutate.py: another one works in build/mutants. Wait for its end.")
    copy_tree()
    changes = list(all_changes(options.only))
    if not changes:
        sys.exit("mutate.py: there is nothing to change there. --only takes a path such as src/MidAPI.")
    random.Random(options.seed).shuffle(changes)
    del changes[:options.skip]
    print(f"seed {options.seed}, {len(changes)} possible changes", flush=True)
    if options.list:
        for name, number, kind, changed in changes[:options.count]:
            print(f"{name}:{number}: {kind}: {changed.strip()}")
        return
    compiled, survivors = try_changes(options.count, changes)
    if compiled == 0:
        sys.exit("mutate.py: none of the changes compiles.")
    print(f"\n{compiled - len(survivors)} of {compiled} noticed, {len(survivors)} survived (seed {options.seed})")
    print("\n".join(survivors))
    sys.exit(0 if compiled - len(survivors) >= WANTED * compiled else 1)


if __name__ == "__main__":
    main()
