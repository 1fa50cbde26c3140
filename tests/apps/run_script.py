#!/usr/bin/env python3
"""Runs velhost on a script in a fresh folder and checks its exit status and output.

usage: run_script.py VELHOST SCRIPT MODULES_DIR WORK_DIR STATUS EXPECTED [ARGUMENT...]

The arguments are added to velhost's command line.

EXPECTED holds, one per line, texts that must appear in the output (standard output then
standard error) in that order; lines starting with "#" are comments.
"""
import os
import sys

sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "support"))
from velrun import fresh_folder, missing_texts, report, run_velhost  # noqa: E402


def main():
    velhost, script, modules, work = (os.path.abspath(a) for a in sys.argv[1:5])
    status, expected = sys.argv[5:7]
    fresh_folder(work)
    returncode, output = run_velhost(velhost, modules, work, script, sys.argv[7:], timeout=120)
    failures = []
    if returncode != int(status):
        failures.append(f"exit status {returncode}, expected {status}")
    failures += missing_texts(output, expected)
    return report(output, failures)


if __name__ == "__main__":
    sys.exit(main())
