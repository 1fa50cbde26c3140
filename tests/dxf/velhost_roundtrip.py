#!/usr/bin/python3
"""End-to-end round trip through velhost: a drawing written by ezdxf is given on the
command line (or opened by OPEN), changed with SETVAR, saved with SAVE and SAVEAS; ezdxf
must read back the same header, layers, dictionaries, XData and entities, only OSMODE
changed, and the entity and object nobody knows kept byte for byte.

usage: velhost_roundtrip.py VELHOST FIXTURE WORK_DIR"""
import os
import shutil
import subprocess
import sys

DUMP = os.path.join(os.path.dirname(os.path.abspath(__file__)), "ezdxf_dump.py")


def dump(path):
    out = subprocess.run(["/usr/bin/python3", DUMP, path], capture_output=True, text=True, check=True)
    return set(out.stdout.splitlines())


def raw_record(text, kind):
    begin = text.index("  0\n" + kind + "\n")
    return text[begin:text.index("  0\n", begin + 4)]


def main():
    velhost, fixture, work = (os.path.abspath(a) for a in sys.argv[1:4])
    shutil.rmtree(work, ignore_errors=True)
    os.makedirs(os.path.join(work, "modules"))
    drawing = os.path.join(work, "plan.dxf")
    shutil.copyfile(fixture, drawing)
    failures = []
    runs = [
        ("command line", ["plan.dxf"], "SETVAR OSMODE 100\nSAVE\nSAVEAS copie.dxf\nQUIT\n"),
        ("OPEN command", [], "OPEN copie.dxf\nSETVAR OSMODE 101\nSAVEAS copie2.dxf\nQUIT\n"),
    ]
    for name, args, script in runs:
        with open(os.path.join(work, "script.scr"), "w", encoding="utf-8") as f:
            f.write(script)
        run = subprocess.run([velhost, "--script", "script.scr", "--modules", "modules", "--profile",
                              os.path.join(work, "profil")] + args,
                             cwd=work, capture_output=True, text=True, timeout=120)
        if run.returncode != 0:
            failures.append("%s: exit status %d\n%s%s" % (name, run.returncode, run.stdout, run.stderr))
    if failures:
        print("\n".join(failures))
        return 1
    before = dump(fixture)
    with open(fixture, encoding="utf-8", newline="") as f:
        original = f.read()
    for saved, osmode in (("plan.dxf", 100), ("copie.dxf", 100), ("copie2.dxf", 101)):
        path = os.path.join(work, saved)
        after = dump(path)
        gone = sorted(before - after)
        added = sorted(after - before)
        if not any(line.startswith("header $OSMODE") for line in gone) or added != ["header $OSMODE %d" % osmode]:
            failures.append("%s: lost %r, gained %r" % (saved, gone, added))
        gone = [line for line in gone if not line.startswith("header $OSMODE")]
        if gone:
            failures.append("%s: lost %r" % (saved, gone))
        with open(path, encoding="utf-8", newline="") as f:
            text = f.read()
        for kind in ("VEL_CHOSE", "VEL_OBJET"):
            if raw_record(original, kind) not in text:
                failures.append("%s: %s not kept byte for byte" % (saved, kind))
        if len(text) - len(original) > 200:
            failures.append("%s: grew by %d bytes" % (saved, len(text) - len(original)))
    if failures:
        print("\n".join(failures))
        return 1
    return 0


if __name__ == "__main__":
    sys.exit(main())
