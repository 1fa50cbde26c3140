#!/usr/bin/env python3
"""Runs a velhost script on copies of the example drawing and schedule, then checks the
output and the schedule the script leaves.

usage: run_example_script.py VELHOST MODULES_DIR EXAMPLES_DIR WORK_DIR SCRIPT EXPECTED
           [--field TREE_PATH FIELD VALUE]... [--absent TREE_PATH]... [--file-has FILE TEXT]...

EXPECTED holds texts that must appear in the output in that order ("#" starts a comment).
"""
import os
import sys
import xml.etree.ElementTree as ET

sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "support"))
from velrun import fresh_folder, missing_texts, report, run_velhost  # noqa: E402


def main():
    velhost, modules, examples, work, script, expected = (os.path.abspath(a) for a in sys.argv[1:7])
    checks = sys.argv[7:]
    fresh_folder(work, examples, ("projet_vrd.dxf", "VelaBordereau.xml"))
    returncode, output = run_velhost(velhost, modules, work, script, ["projet_vrd.dxf"])
    failures = []
    if returncode != 0:
        failures.append(f"exit status {returncode}")
    failures += missing_texts(output, expected)
    articles = {a.get("treePath"): a for a in
                ET.parse(os.path.join(work, "VelaBordereau.xml")).getroot().iter("article")}
    i = 0
    while i < len(checks):
        if checks[i] == "--field":
            path, field, value = checks[i + 1:i + 4]
            got = articles[path].get(field) if path in articles else None
            if got != value:
                failures.append(f"{path}: {field} is {got!r}, expected {value!r}")
            i += 4
        elif checks[i] == "--file-has":
            name, text = checks[i + 1:i + 3]
            content = open(os.path.join(work, name), encoding="utf-8").read() \
                if os.path.exists(os.path.join(work, name)) else ""
            if text.replace("@WORK@", work) not in content:
                failures.append(f"{name} does not hold {text!r}: {content!r}")
            i += 3
        elif checks[i] == "--absent":
            if checks[i + 1] in articles:
                failures.append(f"{checks[i + 1]} is still in the schedule")
            i += 2
        else:
            failures.append(f"unknown check {checks[i]}")
            break
    return report(output, failures)


if __name__ == "__main__":
    sys.exit(main())
