#!/usr/bin/env python3
"""Runs velhost on a script in a fresh folder and checks its exit status and output.

usage: run_script.py VELHOST SCRIPT MODULES_DIR WORK_DIR STATUS EXPECTED [ARGUMENT...]

The arguments are added to velhost's command line.

EXPECTED holds, one per line, texts that must appear in the output (standard output then
standard error) in that order; lines starting with "#" are comments.
"""
import os
import shutil
import subprocess
import sys


def missing_texts(output, expected):
    """The texts of the file EXPECTED that the output lacks, in order, as messages."""
    failures = []
    position = 0
    with open(expected, encoding="utf-8") as f:
        for line in f:
            text = line.rstrip("\n")
            if not text or text.startswith("#"):
                continue
            found = output.find(text, position)
            if found < 0:
                failures.append(f"not found after offset {position}: {text!r}")
                continue
            position = found + len(text)
    return failures


def main():
    velhost, script, modules, work = (os.path.abspath(a) for a in sys.argv[1:5])
    status, expected = sys.argv[5:7]
    shutil.rmtree(work, ignore_errors=True)
    os.makedirs(work)
    run = subprocess.run(
        [velhost, "--script", script, "--modules", modules, "--profile", os.path.join(work, "profil")]
        + sys.argv[7:],
        cwd=work, capture_output=True, text=True, timeout=120)
    output = run.stdout + run.stderr
    failures = []
    if run.returncode != int(status):
        failures.append(f"exit status {run.returncode}, expected {status}")
    failures += missing_texts(output, expected)
    if failures:
        print(output)
        print("\n".join(failures))
        return 1
    return 0


if __name__ == "__main__":
    sys.exit(main())
