#!/usr/bin/env python3
"""Fails on an #include that crosses folders against the intended arrows, on an
operating-system header or <thread> above the platform seam, and on sqlite3.h
outside the SQLite access layer. Prints file:line and the rule for each.

    check_layout.py ROOT
"""
import pathlib
import re
import sys

SRC = {  # what each folder of src/ may include besides itself and common/
    "entry": {"collect", "store", "log", "platform"},
    "collect": {"mail", "extract", "store", "log", "platform"},
    "extract": {"log"},
    "store": {"log", "platform"},
    "mail": {"platform"},
    "log": {"platform"},
    "platform": set(),
    "common": set(),
}
ALL_SRC = {"src/" + name for name in SRC}
TOP = {  # the other top folders: what they may include besides themselves
    "testkit": ALL_SRC,
    "tools": ALL_SRC | {"testkit"},
    "tests": ALL_SRC | {"testkit"},
    "bench": ALL_SRC | {"testkit"},
    "fuzz": ALL_SRC | {"testkit"},
}
INCLUDE_DIRS = {  # the include folders the build gives each top folder
    "src": ["src"],
    "testkit": ["testkit", "src"],
    "tools": ["src", "testkit"],
    "tests": ["tests", "src", "testkit"],
    "bench": ["bench", "src", "testkit"],
    "fuzz": ["fuzz", "src", "testkit"],
}
OS_HEADER = re.compile(
    r"^(windows|winsock2?|ws2tcpip|shlobj|objbase|oleauto|unistd|dlfcn|pthread|fcntl|dirent|iconv|"
    r"langinfo|poll|signal|spawn|termios|sys/.*|linux/.*|thread)(\.h)?$")
# Files that must talk to the system or to SQLite themselves, and why.
OS_ALLOWED = {
    "tools/testhost/": "the test host loads the library as the service does",
    "tests/platform/": "tests of the backends themselves",
    "tests/faults/crash_test.cpp": "kills a collector process mid-backlog",
    "tests/faults/fault_support.cpp": "tells Wine from Windows",
    "tests/faults/faults_test.cpp": "asks whether it runs as root",
    "tests/faults/hostile_test.cpp": "runs a cycle on a thread with a small stack",
    "tests/store/retention_test.cpp": "makes a database file unwritable, for root too",
}
# Tests run callers against each other with the language's own threads.
THREAD_ALLOWED = {"tests/": "runs callers against each other"}
SQLITE_ALLOWED = {
    "src/store/sqlite_db.cpp": "the SQLite access layer",
    "tests/": "tests that hold locks or break databases on purpose",
    "bench/": "benchmarks that compare with bare SQLite",
}
INCLUDE = re.compile(r'^\s*#\s*include\s*([<"])([^>"]+)[>"]')


def folder_of(rel):
    parts = rel.split("/")
    if parts[0] == "src":
        return "src/" + parts[1] if len(parts) > 2 else None
    return parts[0]


def allowed(frm, to):
    if frm == to or to == "src/common":
        return True
    if frm.startswith("src/"):
        return to.startswith("src/") and to[4:] in SRC[frm[4:]]
    return to in TOP[frm]


def exempt(rel, table):
    return any(rel == key or (key.endswith("/") and rel.startswith(key)) for key in table)


def check(root):
    problems = []
    for top in INCLUDE_DIRS:
        for path in sorted((root / top).rglob("*")):
            if path.suffix not in (".h", ".hpp", ".cpp", ".cc", ".c") or "corpus" in path.parts:
                continue
            rel = path.relative_to(root).as_posix()
            frm = folder_of(rel)
            if frm is None:
                continue
            for number, line in enumerate(path.read_text(errors="replace").splitlines(), 1):
                match = INCLUDE.match(line)
                if not match:
                    continue
                kind, name = match.groups()
                where = f"{rel}:{number}: #include {kind}{name}{'>' if kind == '<' else kind}"
                if kind == "<":
                    excused = exempt(rel, OS_ALLOWED) or (name == "thread" and exempt(rel, THREAD_ALLOWED))
                    if OS_HEADER.match(name) and not rel.startswith("src/platform/") and not excused:
                        problems.append(f"{where}: operating-system header outside src/platform/")
                    if name == "sqlite3.h" and not exempt(rel, SQLITE_ALLOWED):
                        problems.append(f"{where}: sqlite3.h outside the SQLite access layer")
                    continue
                candidates = [path.parent / name] + [root / d / name for d in INCLUDE_DIRS[top]]
                target = next((c for c in candidates if c.is_file()), None)
                if target is None:
                    problems.append(f"{where}: names no file of the tree")
                    continue
                to = folder_of(target.resolve().relative_to(root.resolve()).as_posix())
                if to and not allowed(frm, to):
                    problems.append(f"{where}: {frm} may not include from {to}")
    return problems


if __name__ == "__main__":
    found = check(pathlib.Path(sys.argv[1]))
    print("\n".join(found) if found else "layout: every include follows the arrows")
    sys.exit(1 if found else 0)
