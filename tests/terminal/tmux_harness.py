"""A terminal program driven in tmux as a person at the keyboard drives it: for tests of
velhost's command line and of its full-screen dialogs.

Each TerminalSession runs one program in a detached tmux session of its own (a private
tmux server on a socket in a temporary folder, no user configuration), with exactly the
environment the test gives, and kills that server and removes the folder when it ends.
Waiting is always polling of the screen against a deadline, never a fixed sleep.

    from tmux_harness import TerminalSession

    with TerminalSession([velhost, "--profile", "profil", "projet_vrd.dxf"], cwd=work,
                         env={"LANG": "fr_FR.UTF-8"}, width=100, height=30) as term:
        term.wait_for_prompt("Commande: ")
        term.send_line("ARX")
        term.wait_for_prompt("Entrez une option [?/Charger/Décharger] : ")
        term.send_keys("C-c")                         # tmux key names
        term.wait_for_prompt("Commande: ")
        term.send_line("GETVAR DWGNAME")
        term.wait_for("DWGNAME = projet_vrd.dxf")
        term.send_keys("C-d")
        assert term.wait_exit() == 0
        print(term.transcript())

    # In a full-screen dialog: a click (press, release) on column 12 of row 5, as the
    # terminal reports it, then a smaller window.
    term.send_raw(b"\\x1b[<0;12;5M\\x1b[<0;12;5m")
    term.resize(80, 24)
    term.wait_for("Annuler", where="screen")

TerminalSession(argv, cwd, env=None, width=100, height=30, timeout=None)
    argv     the program and its arguments, run directly (no shell; a small launcher
             records the exit status and leaves the terminal's signals to the program).
    env      variables on top of a bare environment (PATH, HOME=cwd, TERM=screen, and the
             sanitizers' *_OPTIONS taken from the test's own environment); a variable not
             given is unset: {"LANG": None} or no LANG at all runs without a locale. A
             curses program that reads SGR mouse reports may want TERM=tmux-256color.
    timeout  default deadline of every wait, in seconds (TIMEOUT, or the environment's
             VEL_TERMINAL_TIMEOUT).
    Starts at construction; use it in a "with" block (or call close()).

send_line(text)          types text literally, then Enter.
send_keys(*keys)         presses tmux keys: "Enter", "C-c", "C-d", "Escape", "Up", "BSpace",
                         "F10", "M-x"...
send_raw(data)           writes bytes (or a str, as UTF-8) to the program's terminal as
                         typed: escape sequences, mouse reports once the program has asked
                         for them (SGR "\\x1b[<b;x;yM" / "...m", X10 "\\x1b[M" + three
                         bytes, 1-based cells), invalid UTF-8.
resize(width, height)    resizes the window; the program gets SIGWINCH.
screen()                 the visible screen, one string, trailing blanks of lines removed.
transcript()             everything since the start (scrollback and screen), wrapped lines
                         joined.
cursor()                 (x, y) of the cursor on the screen.
wait_for(text, timeout=None, where="transcript")
                         waits until text appears after the last send in the transcript,
                         or anywhere on the visible screen with where="screen" (the one to
                         use while a full-screen program shows its alternate screen, which
                         has no transcript); answers the screen.
wait_for_prompt(prompt, timeout=None)
                         waits until the cursor stands at the end of prompt on a line below
                         the one where the last send_line or send_keys happened (input sent
                         to a full-screen program does not count: after it, the line of the
                         input that started it); answers the screen.
wait_screen(condition, what, timeout=None)
                         waits until condition(screen) is true, the screen being the visible
                         one as screen() answers it (for full-screen programs); answers it.
wait_exit(timeout=None)  waits for the program's end and answers its exit status (a
                         negative signal number when a signal killed it).
exit_status()            the status once ended, else None.
close()                  kills the tmux server and removes the temporary folder.

Every wait raises TerminalTimeout (with the screen in its message) at its deadline, and
ProgramEnded when the program ends while a text or prompt is still awaited.
"""
import json
import os
import shutil
import subprocess
import sys
import tempfile
import time

TIMEOUT = float(os.environ.get("VEL_TERMINAL_TIMEOUT", "60"))
POLL = 0.05
_PASSED_ON = ("ASAN_OPTIONS", "UBSAN_OPTIONS", "LSAN_OPTIONS")
# Runs the program and writes its exit status to a file: tmux does not always learn the
# status of its pane's process. The launcher ignores the terminal's signals, which the
# program gets as it would from a shell (their default action), and hands it exactly the
# environment given (Python would add its own LC_CTYPE under the C locale).
_LAUNCHER = """
import json, os, signal, subprocess, sys
for s in (signal.SIGINT, signal.SIGQUIT, signal.SIGTSTP):
    signal.signal(s, signal.SIG_IGN)
def defaults():
    for s in (signal.SIGINT, signal.SIGQUIT, signal.SIGTSTP):
        signal.signal(s, signal.SIG_DFL)
try:
    status = subprocess.Popen(sys.argv[3:], env=json.loads(sys.argv[2]), preexec_fn=defaults).wait()
except OSError as e:
    print(e)
    status = 127
with open(sys.argv[1] + ".new", "w") as f:
    f.write(str(status))
os.rename(sys.argv[1] + ".new", sys.argv[1])
"""


class TerminalTimeout(AssertionError):
    pass


class ProgramEnded(AssertionError):
    pass


class TerminalSession:
    def __init__(self, argv, cwd, env=None, width=100, height=30, timeout=None):
        self.timeout = TIMEOUT if timeout is None else timeout
        self._folder = tempfile.mkdtemp(prefix="velterm-")
        self._socket = os.path.join(self._folder, "tmux")
        config = os.path.join(self._folder, "tmux.conf")
        with open(config, "w", encoding="utf-8") as f:
            # The pane outlives the program so that its last screen and status can be read.
            f.write("set -g remain-on-exit on\nset -g history-limit 50000\n"
                    "set -g default-terminal screen\nset -g status off\n")
        variables = {"PATH": os.environ.get("PATH", "/usr/bin:/bin"), "HOME": os.path.abspath(cwd),
                     "TERM": "screen"}
        variables.update({k: os.environ[k] for k in _PASSED_ON if k in os.environ})
        variables.update(env or {})
        variables = {k: v for k, v in variables.items() if v is not None}
        self._mark = -1
        self._mark_joined = 0
        self._status_file = os.path.join(self._folder, "status")
        try:
            self._tmux("-f", config, "new-session", "-d", "-s", "velterm", "-x", str(width), "-y", str(height),
                       "-c", os.path.abspath(cwd), "env", "-i", sys.executable, "-c", _LAUNCHER,
                       self._status_file, json.dumps(variables), *argv)
        except BaseException:
            self.close()
            raise

    # ---- life ----

    def __enter__(self):
        return self

    def __exit__(self, *exc):
        self.close()
        return False

    def close(self):
        if self._folder is None:
            return
        subprocess.run(self._command("kill-server"), capture_output=True, timeout=30)
        shutil.rmtree(self._folder, ignore_errors=True)
        self._folder = None

    # ---- input ----

    def send_line(self, text):
        self._remember_line()
        if text:
            self._tmux("send-keys", "-t", "velterm", "-l", text)
        self._tmux("send-keys", "-t", "velterm", "Enter")

    def send_keys(self, *keys):
        self._remember_line()
        self._tmux("send-keys", "-t", "velterm", *keys)

    def send_raw(self, data):
        if isinstance(data, str):
            data = data.encode("utf-8")
        self._remember_line()
        self._tmux("send-keys", "-t", "velterm", "-H", *(f"{b:02x}" for b in data))

    def resize(self, width, height):
        self._tmux("resize-window", "-t", "velterm", "-x", str(width), "-y", str(height))

    # ---- output ----

    def screen(self):
        return self._tmux("capture-pane", "-p", "-t", "velterm")

    def transcript(self):
        return self._tmux("capture-pane", "-p", "-J", "-S", "-", "-E", "-", "-t", "velterm")

    def cursor(self):
        state = self._state()
        return state["x"], state["y"]

    def exit_status(self):
        state = self._state()
        return state["status"] if state["dead"] else None

    # ---- waits ----

    def wait_for(self, text, timeout=None, where="transcript"):
        def found(state):
            if where == "screen":
                return text in self.screen()
            return text in "\n".join(self.transcript().split("\n")[self._mark_joined:])
        return self._wait(found, f"the text {text!r}", timeout)

    def wait_for_prompt(self, prompt, timeout=None):
        wanted = prompt.rstrip()

        def shown(state):
            if state["line"] <= self._mark:
                return False
            rows = self.screen().split("\n")
            return state["y"] < len(rows) and rows[state["y"]].rstrip().endswith(wanted)
        return self._wait(shown, f"the prompt {prompt!r}", timeout)

    def wait_screen(self, condition, what, timeout=None):
        return self._wait(lambda state: condition(self.screen()), what, timeout)

    def wait_exit(self, timeout=None):
        deadline = time.monotonic() + (self.timeout if timeout is None else timeout)
        while True:
            state = self._state()
            if state["dead"]:
                return state["status"]
            if time.monotonic() > deadline:
                raise TerminalTimeout(f"the program has not ended; screen:\n{self.screen()}")
            time.sleep(POLL)

    # ---- inside ----

    def _command(self, *args):
        return ["tmux", "-S", self._socket, *args]

    def _tmux(self, *args):
        # tmux itself works in UTF-8 whatever the program's locale, so that the screen
        # reads back as the program wrote it.
        run = subprocess.run(self._command(*args), capture_output=True, timeout=30,
                             env={"PATH": os.environ.get("PATH", "/usr/bin:/bin"), "LC_ALL": "C.UTF-8"})
        if run.returncode != 0:
            raise RuntimeError(f"tmux {' '.join(args[:2])}: {run.stderr.decode('utf-8', 'replace').strip()}")
        return run.stdout.decode("utf-8", "replace").rstrip("\n")

    def _state(self):
        fields = self._tmux("display-message", "-p", "-t", "velterm",
                            "#{pane_dead}|#{cursor_x}|#{cursor_y}|#{history_size}|#{alternate_on}").split("|")
        status = None
        try:
            with open(self._status_file, encoding="ascii") as f:
                status = int(f.read())
        except FileNotFoundError:
            pass
        # A launcher that died without a word still ends the wait.
        dead = status is not None or fields[0] == "1"
        x, y, history = (int(v) for v in fields[1:4])
        return {"dead": dead, "status": status, "x": x, "y": y, "line": history + y, "alternate": fields[4] == "1"}

    def _remember_line(self):
        # Where the input goes: later waits look below it. Rows count for prompts (the
        # cursor's row), joined lines for texts. Input to a full-screen program (on the
        # alternate screen) leaves the marks at the last input on the normal screen,
        # where what follows the program appears.
        state = self._state()
        if state["alternate"]:
            return
        self._mark = state["line"]
        joined = self._tmux("capture-pane", "-p", "-J", "-S", "-", "-E", str(state["y"]), "-t", "velterm")
        self._mark_joined = max(joined.count("\n"), 0)

    def _wait(self, condition, what, timeout):
        deadline = time.monotonic() + (self.timeout if timeout is None else timeout)
        while True:
            state = self._state()
            if condition(state):
                return self.screen()
            if state["dead"]:
                raise ProgramEnded(f"the program ended (status {state['status']}) while waiting for {what}; "
                                   f"screen:\n{self.screen()}")
            if time.monotonic() > deadline:
                raise TerminalTimeout(f"{what} did not appear; screen:\n{self.screen()}")
            time.sleep(POLL)
