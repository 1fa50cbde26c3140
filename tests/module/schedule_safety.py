#!/usr/bin/python3
"""Nothing lost: velhost run on copies of the example files where a schedule does not read,
where two velhost processes share one schedule, where another program holds its lock, and
where the disk is full.

usage: schedule_safety.py VELHOST MODULES_DIR EXAMPLES_DIR WORK_DIR SCENARIO [FULL_DISK_MODULE]

SCENARIO: unreadable, two-users, lock, full-disk-tmpfs (exit 77, skipped, where a tmpfs
cannot be mounted), full-disk-injected (ENOSPC from FULL_DISK_MODULE).
"""
import fcntl
import os
import shutil
import subprocess
import sys
import threading
import time

sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "support"))
from velrun import fresh_folder, report, run_velhost  # noqa: E402

SKIPPED = 77
LOAD = "APPLOAD VelVuzazORE15.arx\nAPPLOAD VelReseDimVRD15.arx\nRsxMetres\n"


def prepare(examples, work):
    fresh_folder(work, examples, ("projet_vrd.dxf", "VelaBordereau.xml"))


def read(path):
    with open(path, "rb") as f:
        return f.read()


def velhost(args, work, profile, script, extra=()):
    """Runs velhost on a script given as text; answers (exit status, output)."""
    # Beside the work folder, which may be a full disk.
    path = os.path.join(os.path.dirname(work), os.path.basename(work) + "_" + profile + ".scr")
    with open(path, "w", encoding="utf-8") as f:
        f.write(script)
    return run_velhost(args.velhost, args.modules, work, path, list(extra) + ["projet_vrd.dxf"], profile)


class Args:
    def __init__(self, argv):
        self.velhost, self.modules, self.examples, self.work = (os.path.abspath(a) for a in argv[1:5])
        self.scenario = argv[5]
        self.full_disk_module = os.path.abspath(argv[6]) if len(argv) > 6 else None


def unreadable(args, failures):
    """A truncated schedule: the network update runs twice, the file and its backup stay."""
    work = args.work
    prepare(args.examples, work)
    schedule = os.path.join(work, "VelaBordereau.xml")
    shutil.copy(schedule, schedule + ".bak")
    whole = read(schedule)
    with open(schedule, "wb") as f:
        f.write(whole[:len(whole) // 2])
    cut = read(schedule)
    _, output = velhost(args, work, "profil", LOAD + "RsxMajBordereau\nRsxMajBordereau\nZodEVIBdrPrix\nQUIT\nNon\n")
    if read(schedule) != cut:
        failures.append("the unreadable schedule was written over")
    if read(schedule + ".bak") != whole:
        failures.append("the backup of the schedule was written over")
    refusal = f"ERREUR : le bordereau « {schedule} » n'a pas pu être lu"
    if output.count(refusal) != 3:
        failures.append(f"{output.count(refusal)} refusals instead of 3 (two updates, the display command)")
    if output.count("Le bordereau n'a pas pu être enregistré (code 2)") != 2:
        failures.append("the network module was not told the write failed")
    return output


class Interactive:
    """A velhost whose script is fed line by line, with its output gathered as it comes."""

    def __init__(self, args, work, profile):
        self.process = subprocess.Popen(
            [args.velhost, "--modules", args.modules, "--profile", os.path.join(work, profile), "projet_vrd.dxf"],
            cwd=work, stdin=subprocess.PIPE, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
        self.output = ""
        self.lock = threading.Lock()
        self.reader = threading.Thread(target=self._read, daemon=True)
        self.reader.start()

    def _read(self):
        for chunk in iter(lambda: self.process.stdout.read(1), ""):
            with self.lock:
                self.output += chunk

    def send(self, lines, prompts):
        """Sends lines, then waits until `prompts` command lines have been read. A line is
        read, and shown after its prompt, once the command before it has ended."""
        self.process.stdin.write(lines)
        self.process.stdin.flush()
        deadline = time.time() + 120
        while time.time() < deadline:
            with self.lock:
                if self.output.count("Commande: ") >= prompts:
                    return True
            time.sleep(0.05)
        return False

    def finish(self):
        self.process.stdin.close()
        self.process.wait(timeout=120)
        self.reader.join(timeout=10)
        return self.output


def two_users(args, failures):
    """A reads the schedule, B changes a price and writes it, then A's update is refused."""
    work = args.work
    prepare(args.examples, work)
    schedule = os.path.join(work, "VelaBordereau.xml")
    first = Interactive(args, work, "profilA")
    if not first.send(LOAD + "\n", 4):
        failures.append("the first velhost did not load the modules")
    _, second = velhost(args, work, "profilB", LOAD + "APPLOAD VelDemoPrix.arx\nDemoPrix\n0\nPVC 315\nEP\n72,50\nQUIT\nNon\n")
    if "Bordereau des prix enregistré" not in second and "72.50 € HT" not in second:
        failures.append("the second velhost did not write its price")
    theirs = read(schedule)
    first.send("RsxMajBordereau\n\n", 6)
    output = first.finish() + second
    if read(schedule) != theirs:
        failures.append("the first velhost wrote over the second one's price")
    if f"le bordereau « {schedule} » a été modifié par un autre utilisateur ou programme depuis sa lecture" \
            not in output:
        failures.append("the refusal does not say the schedule changed")
    return output


def lock(args, failures):
    """Another program holds the schedule's lock: the write waits for it, then goes on."""
    work = args.work
    prepare(args.examples, work)
    schedule = os.path.join(work, "VelaBordereau.xml")
    with open(os.path.join(work, ".VelaBordereau.xml.verrou"), "a+") as held:
        fcntl.lockf(held, fcntl.LOCK_EX)
        user = Interactive(args, work, "profil")
        if not user.send(LOAD + "\n", 4):
            failures.append("velhost did not load the modules")
        user.send("RsxMajBordereau\n\n", 5)
        time.sleep(2)
        with user.lock:
            waiting = user.output.count("Commande: ") == 5
        if not waiting or os.path.exists(schedule + ".bak"):
            failures.append("the schedule was written while another program held its lock")
        fcntl.lockf(held, fcntl.LOCK_UN)
    user.send("", 6)
    user.send("QUIT\nNon\n", 0)
    output = user.finish()
    if "Bordereau des prix enregistré." not in output or not os.path.exists(schedule + ".bak"):
        failures.append("the schedule was not written once the lock was free")
    return output


def full_disk(args, failures, folder, extra):
    """Every write of a session fails for want of space: each file stays as it was."""
    for name in ("projet_vrd.dxf", "VelaBordereau.xml"):
        shutil.copy(os.path.join(args.examples, name), folder)
    os.makedirs(os.path.join(folder, "profil"), exist_ok=True)
    before = {name: read(os.path.join(folder, name)) for name in ("projet_vrd.dxf", "VelaBordereau.xml")}
    if not extra:
        try:
            with open(os.path.join(folder, "remplissage"), "wb") as f:
                while True:
                    f.write(b"\0" * 4096)
                    f.flush()
        except OSError:
            pass
    listing = sorted(os.listdir(folder))
    _, output = velhost(args, folder, "profil",
                        LOAD + "RsxMajBordereau\nVelConfig\nTerminer\nOui\nSAVE\nQUIT\nNon\n", extra)
    for name, content in before.items():
        if read(os.path.join(folder, name)) != content:
            failures.append(f"{name} changed on a full disk")
    left = sorted(n for n in os.listdir(folder) if not n.startswith(".") or not n.endswith(".verrou"))
    if [n for n in left if n not in listing]:
        failures.append(f"files left behind: {[n for n in left if n not in listing]}")
    for text in (f"Fichier « {os.path.join(folder, 'VelaBordereau.xml')} » non enregistré : disque plein",
                 "Le bordereau n'a pas pu être enregistré (code 2)",
                 f"« {os.path.join(folder, 'projet_vrd.dxf')} » non enregistré : disque plein"):
        if text not in output:
            failures.append(f"missing from the output: {text!r}")
    return output


def main():
    args = Args(sys.argv)
    failures = []
    if args.scenario == "unreadable":
        output = unreadable(args, failures)
    elif args.scenario == "two-users":
        output = two_users(args, failures)
    elif args.scenario == "lock":
        output = lock(args, failures)
    elif args.scenario == "full-disk-injected":
        shutil.rmtree(args.work, ignore_errors=True)
        os.makedirs(args.work)
        output = full_disk(args, failures, args.work, ["--load", args.full_disk_module])
    elif args.scenario == "full-disk-tmpfs":
        if os.environ.get("VEL_INSIDE_TMPFS") != "1":
            # A mount namespace of its own, so that the tmpfs goes with the test.
            shutil.rmtree(args.work, ignore_errors=True)
            os.makedirs(args.work)
            probe = subprocess.run(["unshare", "--mount", "--propagation", "private", "mount", "-t", "tmpfs",
                                    "-o", "size=2m", "tmpfs", args.work], capture_output=True)
            if probe.returncode != 0:
                print("tmpfs impossible à monter ici : essai sauté")
                return SKIPPED
            return subprocess.run(["unshare", "--mount", "--propagation", "private", sys.executable] + sys.argv,
                                  env=dict(os.environ, VEL_INSIDE_TMPFS="1")).returncode
        subprocess.run(["mount", "-t", "tmpfs", "-o", "size=2m", "tmpfs", args.work], check=True)
        output = full_disk(args, failures, args.work, [])
    else:
        failures.append(f"unknown scenario {args.scenario}")
        output = ""
    return report(output, failures)


if __name__ == "__main__":
    sys.exit(main())
