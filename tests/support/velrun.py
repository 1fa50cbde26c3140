"""What the scripts that run velhost share: a fresh work folder with copies of the example
files, velhost run there on a script, the texts its output must hold, and the report."""
import os
import shutil
import subprocess


def fresh_folder(work, examples=None, names=()):
    """Empties (or makes) the folder `work` and copies the files `names` of `examples` into it."""
    shutil.rmtree(work, ignore_errors=True)
    os.makedirs(work)
    for name in names:
        shutil.copy(os.path.join(examples, name), work)


def run_velhost(velhost, modules, work, script, extra=(), profile="profil", timeout=300):
    """Runs velhost in `work` on `script`; answers (exit status, standard output then standard error)."""
    run = subprocess.run(
        [velhost, "--modules", modules, "--profile", os.path.join(work, profile), "--script", script] + list(extra),
        cwd=work, capture_output=True, text=True, timeout=timeout)
    return run.returncode, run.stdout + run.stderr


def missing_texts(output, expected):
    """The texts of the file `expected` that the output lacks, in order, as messages: one text
    a line, blank lines and lines starting with "#" left out."""
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


def report(output, failures):
    """Prints the output and the failures when there are any; answers the exit status."""
    if failures:
        print(output)
        print("\n".join(failures))
        return 1
    return 0
