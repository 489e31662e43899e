#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""guide_commands.py PROGRAMS VISA_LIBRARY FILE...: runs the commands of the guide.

Each block fenced as "sh" is run by bash in a folder of its own, with the built programs and two
simulated instruments; a command that fails fails the test. Behind "sh" may stand "with NAME...",
the files that the reader has and the test makes, or "hardware" for what can't run here."""

import concurrent.futures
import math
import os
import pathlib
import re
import signal
import socket
import struct
import subprocess
import sys
import tempfile
import time
import zlib

BENCH = """[generator]
model = TGX-870
gateway = 0
gpib = 28
[analyzer]
model = PAX-630
gateway = 0
gpib = 20
"""
# What the guide calls its instruments, and where the simulated ones are.
ADDRESSES = {"192.168.1.40": "GPIB0::28::INSTR", "192.168.1.43": "GPIB0::20::INSTR"}
TIME_LIMIT_S = 60


def blocks(path):
    """The "sh" blocks of a file: number of the first line, words behind "sh", text."""
    found = []
    lines = path.read_text(encoding="utf-8").splitlines()
    opened = None
    for number, line in enumerate(lines, 1):
        if opened is None and line.startswith("```"):
            opened = (number, line[3:].split())
        elif line == "```":
            if opened[1][:1] == ["sh"]:
                found.append((opened[0] + 1, opened[1][1:], "\n".join(lines[opened[0] : number - 1])))
            opened = None
    return found


def free_port():
    with socket.socket() as one:
        one.bind(("127.0.0.1", 0))
        return one.getsockname()[1]


def matlab_file(variable, count=4096):
    """A level 5 file with a turning vector as one compressed complex variable."""

    def element(kind, data):
        return struct.pack("<II", kind, len(data)) + data + bytes(-len(data) % 8)

    turns = [2 * math.pi * k / 64 for k in range(count)]
    matrix = element(6, struct.pack("<II", 0x0806, 0)) + element(5, struct.pack("<ii", 1, count))
    matrix += element(1, variable)
    for part in (math.cos, math.sin):
        matrix += element(9, struct.pack(f"<{count}d", *map(part, turns)))
    packed = zlib.compress(element(14, matrix))
    header = b"MATLAB 5.0 MAT-file".ljust(124) + struct.pack("<HH", 0x0100, 0x4D49)
    return header + struct.pack("<II", 15, len(packed)) + packed


def make_file(folder, name, environment):
    """A file that the reader of a block has."""
    if name.endswith(".mat"):
        (folder / name).write_bytes(matlab_file(b"burst"))
        return
    for command in (["create", "fm", "-o", ".made.wv"],
                    ["resample", ".made.wv", "--samples", "4096", "-o", name]):
        subprocess.run(["corvane-cli", *command], cwd=folder, env=environment, check=True,
                       capture_output=True)
    (folder / ".made.wv").unlink()


def run_block(text, needed, environment):
    """What went wrong with a block, or an empty text."""
    for address, resource in ADDRESSES.items():
        text = text.replace(address, resource)
    text = text.replace("41000", str(free_port()))
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name)
        for one in needed:
            make_file(folder, one, environment)
        # A group of its own, so that what a block leaves in the background ends with it.
        process = subprocess.Popen(
            ["bash", "-e", "-c", text],
            cwd=folder, env=environment, start_new_session=True, stdin=subprocess.DEVNULL,
            stdout=(folder / ".out").open("wb"), stderr=subprocess.STDOUT)
        try:
            status = process.wait(TIME_LIMIT_S)
            problem = f"exit status {status}" if status else ""
        except subprocess.TimeoutExpired:
            problem = f"not done in {TIME_LIMIT_S} s"
        try:
            os.killpg(process.pid, signal.SIGTERM)
        except ProcessLookupError:
            pass
        process.wait()
        output = (folder / ".out").read_text(encoding="utf-8", errors="replace")
        return problem and f"{problem}\n{output}"


def run_page(programs, library, path):
    """Runs the blocks of a page beside instruments of its own. Gives their count, that of those
    that failed, and what is to be said."""
    failures = ran = 0
    said = []
    with tempfile.TemporaryDirectory() as name:
        home = pathlib.Path(name)
        (home / "bench.ini").write_text(BENCH)
        environment = dict(os.environ, HOME=name, XDG_CONFIG_HOME=name, TMPDIR=name,
                           PATH=f"{programs}:{os.environ['PATH']}", CORVANE_VISA_LIBRARY=library,
                           CORVANE_VISA_CONFIG=str(home / "visa.ini"), QT_QPA_PLATFORM="offscreen")
        with subprocess.Popen(
            ["corvane-simulator", "--config", home / "bench.ini"],
            env=environment, stdout=subprocess.PIPE, text=True) as simulator:
            try:
                ready = [simulator.stdout.readline() for _ in range(2)]
                port = re.match(r"ready 127\.0\.0\.1:(\d+) ", ready[0])[1]
                (home / "visa.ini").write_text(
                    f"[GPIB0]\nhost=127.0.0.1\nport={port}\naddresses=20,28\n")
                for line, words, text in blocks(path):
                    if words == ["hardware"]:
                        continue
                    if words and words[0] != "with":
                        problem = f"unknown mark {' '.join(words)}"
                    else:
                        started = time.monotonic()
                        problem = run_block(text, words[1:], environment)
                        said.append(f"{path.name}:{line}: {time.monotonic() - started:.1f} s")
                    ran += 1
                    if problem:
                        failures += 1
                        said.append(f"{path}:{line}: {problem}\n{text}\n")
            finally:
                simulator.terminate()
    return ran, failures, said


def main():
    programs, library = sys.argv[1:3]
    # Together, since most of their time goes by while an instrument gets ready.
    with concurrent.futures.ThreadPoolExecutor() as pool:
        pages = list(pool.map(lambda path: run_page(programs, library, path),
                              map(pathlib.Path, sys.argv[3:])))
    for _, _, said in pages:
        print("\n".join(said))
    ran, failures = (sum(page[k] for page in pages) for k in range(2))
    print(f"{ran} blocks run, {failures} failed")
    return 1 if failures or not ran else 0


if __name__ == "__main__":
    sys.exit(main())
