#!/usr/bin/python3
"""The quantities dialog of ZodEVICreate on a real terminal (tmux), under one locale: what
only its screen view does (layout, resize, keys, mouse, the way back to the command line).

usage: velhost_dialog_test.py VELHOST MODULES_DIR EXAMPLES_DIR LOCALE [CASE...]

LOCALE is the value of LANG for velhost ("-" runs it with no LANG at all). Each case that
lists the locale (or each CASE named) runs in a fresh folder holding copies of the example
drawing and schedule; a failure prints what the terminal showed. Mouse acts are the
terminal's reports: X10 for TERM=tmux-256color, SGR for TERM=xterm-256color.
"""
import os
import re
import shutil
import sys
import tempfile

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
from tmux_harness import TerminalSession  # noqa: E402

CAPTION = "Quantités à prendre en compte"
# An article row's price ("9.50 €/m³") and quantity ("1006.50 m³", "1.00") before the border.
PRICED = re.compile(r"(\d+\.\d\d €\S*) +(\d+\.\d\d(?: \S+)?) │$")
EVERYWHERE = ("-", "C.UTF-8", "fr_FR.UTF-8", "fr_FR.ISO-8859-1")


class CaseFailure(AssertionError):
    pass


class Dialog:
    """velhost in tmux, with the acts a person makes in the dialog."""

    def __init__(self, argv, work, locale, width, height, term):
        env = {"TERM": term}
        if locale != "-":
            env["LANG"] = locale
        self.term = term
        self.work = work
        self.t = TerminalSession(argv, cwd=work, env=env, width=width, height=height)

    def close(self):
        self.t.close()

    # ---- command line ----

    def command(self, line):
        self.t.wait_for_prompt("Commande: ")
        self.t.send_line(line)

    def open(self):
        self.command("APPLOAD VelVuzazORE15")
        self.command("ZodEVICreate")
        return self.until(lambda s: CAPTION in s.split("\n")[0] and "[ Quitter ]" in s, "the dialog")

    def quit(self):
        self.t.wait_for_prompt("Commande: ")
        self.t.send_keys("C-d")
        self.t.wait_for("Enregistrer les modifications")
        self.t.wait_for_prompt("> : ")
        self.t.send_line("Non")
        status = self.t.wait_exit()
        if status != 0:
            raise CaseFailure(f"exit status {status}")

    # ---- screen ----

    def until(self, condition, what):
        return self.t.wait_screen(condition, what)

    def rows(self):
        return self.t.screen().split("\n")

    def find(self, text, rows=None):
        """(x, y) of the first cell of text on the screen."""
        for y, row in enumerate(rows or self.rows()):
            x = row.find(text)
            if x >= 0:
                return x, y
        raise CaseFailure(f"{text!r} is not on the screen:\n{self.t.screen()}")

    def state(self, item, screen=None):
        """The check box of the item whose text starts with `item`: " ", "x" or "~"."""
        rows = (screen or self.t.screen()).split("\n")
        x, y = self.find("] " + item, rows)
        return rows[y][x - 1]

    def until_state(self, item, wanted):
        return self.until(lambda s: self.state(item, s) == wanted, f"[{wanted}] {item}")

    # ---- input ----

    def keys(self, *keys):
        self.t.send_keys(*keys)

    def _mouse(self, button, x, y, release):
        if self.term.startswith("xterm"):
            data = f"\x1b[<{button};{x + 1};{y + 1}M".encode()
            if release:
                data += f"\x1b[<{button};{x + 1};{y + 1}m".encode()
        else:
            data = b"\x1b[M" + bytes([32 + button, 33 + x, 33 + y])
            if release:
                data += b"\x1b[M" + bytes([32 + 3, 33 + x, 33 + y])
        self.t.send_raw(data)

    def click(self, x, y):
        self._mouse(0, x, y, True)

    def wheel(self, x, y, down):
        self._mouse(65 if down else 64, x, y, False)

    def click_box(self, item):
        x, y = self.find("] " + item)
        self.click(x - 1, y)

    def click_text(self, item):
        x, y = self.find("] " + item)
        self.click(x + 3, y)


def check_layout(d, width, height):
    """Caption, trees with their headings and columns, option box, buttons, help line."""
    rows = d.rows()
    problems = []

    def expect(condition, what):
        if not condition:
            problems.append(what)

    expect(CAPTION in rows[0] and rows[0].rstrip().endswith("[×]"), "the caption and the close box on row 0")
    _, top = d.find("┌ Projet ")
    heading = rows[top]
    left, right = heading.find("┌ Article "), heading.rfind("┐")
    expect(heading.index("┌ Projet ") < left and right == width - 2,
           "both trees side by side, the articles on the right")
    expect(heading[:right].rstrip("─ ").endswith("Quantité"), "the heading Quantité on the right end")
    expect(" Prix unit" in heading, "the heading Prix unitaire HT")
    # Prices and quantities right-aligned in their quarters of the article tree.
    inner = right - left - 1
    priced = [PRICED.search(row, left) for row in rows]
    ends = {(m.end(1), m.end(2)) for m in priced if m}
    expect(len(ends) == 1 and abs(next(iter(ends))[0] - (left + round(inner * 0.75))) <= 1
           and next(iter(ends))[1] == right - 1, f"prices and quantities right-aligned in their columns: {ends}")
    for item in ("[x] Projets rout", "[x] Voie princ", "[x] EU Les Till"):
        expect(any(item in row for row in rows), f"the item {item}")
    box = d.find("┌ Article comptant les quantités")
    expect(box[1] > top + 4 and d.find("(•) Afficher la somme")[1] == box[1] + 1
           and d.find("( ) Détailler les quantités")[1] == box[1] + 2, "the option box and its radio buttons")
    buttons = [row for row in rows if "[ Valider ]" in row and "[ Quitter ]" in row]
    expect(len(buttons) == 1 and buttons[0].rstrip().endswith("[ Quitter ]")
           and len(buttons[0].rstrip()) >= width - 4 and rows.index(buttons[0]) >= height - 4,
           "the buttons in the bottom right corner")
    expect("Espace cocher" in rows[height - 1] and "Tab suivant" in rows[height - 1], "the key help on the last row")
    if problems:
        raise CaseFailure("; ".join(problems) + f"\n--- {width}×{height} ---\n" + d.t.screen())
    return left, right, heading.find("┐")


def case_layout_resize(d):
    d.open()
    left, right, project_right = check_layout(d, 160, 50)
    for text in ("Article comptant les quantités de plusieurs projets", "Prix unitaire HT",
                 "(•) Afficher la somme des quantités dans l'article",
                 "( ) Détailler les quantités de chaque projet en sous-articles (=> sous-totaux)"):
        d.find(text)
    # The last article chosen: every size keeps it in view.
    d.keys("Tab", "End")
    d.until(lambda s: "Regards Boîte de branchement" in s, "the last article")
    d.t.resize(80, 24)
    d.until(lambda s: "…" in s and len(s.split("\n")) == 24, "the dialog at 80×24")
    left80, right80, project_right80 = check_layout(d, 80, 24)
    grown_projects, grown_articles = project_right - project_right80, (right - left) - (right80 - left80)
    if abs(grown_projects - 20) > 1 or abs(grown_articles - 60) > 1:
        raise CaseFailure(f"80 more columns gave the trees {grown_projects} and {grown_articles}, not 20 and 60")
    d.find("└ Regards Boîte de branchement")  # cut in its row, whole on the border
    d.t.resize(60, 20)
    too_small = "le terminal fait 60 colonnes sur 20 lignes, il en faut au moins 80 sur 12"
    d.until(lambda s: too_small in " ".join(s.split()), "the message of a terminal too small")
    d.t.resize(100, 30)
    d.until(lambda s: "[ Quitter ]" in s and len(s.split("\n")) == 30, "the dialog at 100×30")
    check_layout(d, 100, 30)
    d.keys("Escape")
    d.quit()


def case_toggles(d):
    d.open()
    # Space acts on the selection, the project tree's first item to start with.
    d.keys("Space")
    d.until_state("Voie princ", " ")
    if d.state("Projets rout") != " ":
        raise CaseFailure("the group was not unchecked with its project")
    d.click_box("Voie princ")
    d.until_state("Projets rout", "x")
    # A click on the text only selects: Space then toggles that item, once.
    d.keys("Tab")
    d.click_text("Travaux pr")
    d.keys("Space")
    d.until_state("Installation du", "x")
    if d.state("Travaux pr") != "x" or d.state("Voirie") != "~":
        raise CaseFailure("the click on the text toggled the item:\n" + d.t.screen())
    # Enter on "Valider" moves the focus to "Quitter", as Tab does; Escape is "Quitter".
    d.keys("Tab", "Tab")
    valider = d.find("[ Valider ]")
    d.until(lambda s: d.t.cursor() == (valider[0] + 2, valider[1]), "the focus on Valider")
    d.keys("Enter")
    quitter = d.find("[ Quitter ]")
    d.until(lambda s: d.t.cursor() == (quitter[0] + 2, quitter[1]) and CAPTION in s, "the focus on Quitter")
    d.keys("Escape")
    # Back on the command line: the screen as it was, line editing and history at work.
    d.t.wait_for_prompt("Commande: ")
    d.t.wait_for("Module /")  # the lines printed before the dialog are still there
    d.keys("Up")
    d.until(lambda s: s.rstrip().endswith("Commande: ZodEVICreate"), "the last line recalled")
    d.keys("C-u")
    d.t.send_line("GETVAR DWGNAME")
    d.t.wait_for("DWGNAME = projet_vrd.dxf")
    if os.path.exists(os.path.join(d.work, "Devis.xlsx")):
        raise CaseFailure("an estimate was written")
    d.quit()


def case_validate(d):
    d.open()
    # Keyboard only: close Voirie and EP, check EU, one line per project, Valider.
    d.keys("Tab", "Home", "Left")
    d.until(lambda s: "▸[ ] Voirie" in s, "Voirie closed")
    d.keys("Down", "Left")
    d.until(lambda s: "▸[ ] EP" in s, "EP closed")
    d.keys("Down", "Space")
    d.until_state("Canalisation EU", "x")
    d.keys("Tab", "Down")
    d.until(lambda s: "(•) Détailler" in s, "the second radio button")
    d.keys("Tab", "Space")
    d.t.wait_for("Total TTC")
    names = check_workbook(os.path.join(d.work, "Devis.xlsx"))
    if not any("PVC 200" in n for n in names) or any("déblais" in n for n in names):
        raise CaseFailure(f"the estimate does not hold the EU articles alone: {names}")
    # The quantity mode is found again, per profile.
    d.command("ZodEVICreate")
    d.until(lambda s: "(•) Détailler" in s and "[ Quitter ]" in s, "the dialog with the mode kept")
    d.keys("Escape")
    d.quit()


def check_workbook(path):
    """The texts of the workbook's first sheet (Debian's Python has openpyxl)."""
    import openpyxl
    sheet = openpyxl.load_workbook(path, read_only=True).worksheets[0]
    return [c for row in sheet.iter_rows(values_only=True) for c in row if isinstance(c, str)]


def case_mouse(d):
    d.open()
    # The wheel scrolls the tree under the pointer, three rows a notch.
    x, y = d.find("[ ] Voirie")
    d.wheel(x, y + 5, down=True)
    d.until(lambda s: "] Voirie" not in s and "Déblais" in s, "the article tree scrolled")
    d.wheel(x, y + 5, down=False)
    d.until(lambda s: "] Voirie" in s, "the article tree scrolled back")
    # The mark before an item opens and closes it.
    d.click(*d.find("▾[ ] Voirie"))
    d.until(lambda s: "▸[ ] Voirie" in s and "Déblais" not in s, "Voirie closed")
    d.click_box("EU Les Till")
    d.until_state("EU Les Till", " ")
    d.click(*d.find("Détailler"))
    d.until(lambda s: "(•) Détailler" in s, "the radio button clicked")
    d.click(d.find("[×]")[0] + 1, 0)
    d.t.wait_for_prompt("Commande: ")
    d.quit()


def case_unable(d):
    # No dialog where the terminal cannot show it; the command ends as by "Quitter".
    d.command("APPLOAD VelVuzazORE15")
    d.command("ZodEVICreate")
    d.t.wait_for(f"{CAPTION} : impossible d'afficher le dialogue, {d.expected} ; il se ferme comme par « Quitter ».")
    d.command("GETVAR DWGNAME")
    d.t.wait_for("DWGNAME = projet_vrd.dxf")
    d.quit()


# name, function, locales, (width, height), TERM, what case_unable expects
CASES = [
    ("layout_resize", case_layout_resize, EVERYWHERE, (160, 50), "tmux-256color", None),
    ("toggles", case_toggles, EVERYWHERE, (80, 24), "tmux-256color", None),
    ("validate", case_validate, ("fr_FR.UTF-8", "-"), (80, 24), "tmux-256color", None),
    ("mouse_sgr", case_mouse, ("fr_FR.UTF-8",), (100, 30), "xterm-256color", None),
    ("dumb", case_unable, ("fr_FR.UTF-8",), (100, 30), "dumb",
     "le terminal « dumb » ne peut pas afficher un dialogue plein écran"),
    ("small", case_unable, ("fr_FR.UTF-8",), (70, 20), "tmux-256color",
     "le terminal fait 70 colonnes sur 20 lignes, il en faut au moins 80 sur 12"),
    ("unknown", case_unable, ("-",), (100, 30), "vt-inconnu", "type de terminal « vt-inconnu » inconnu"),
]


def run_case(case, velhost, modules, examples, locale):
    name, function, _, (width, height), term, expected = case
    work = tempfile.mkdtemp(prefix=f"velhost-dialog-{name}-")
    d = None
    try:
        for file in ("projet_vrd.dxf", "VelaBordereau.xml"):
            shutil.copy(os.path.join(examples, file), work)
        argv = [velhost, "--modules", modules, "--profile", os.path.join(work, "profil"), "projet_vrd.dxf"]
        d = Dialog(argv, work, locale, width, height, term)
        d.expected = expected
        try:
            function(d)
        except AssertionError as failure:
            raise CaseFailure(f"{failure}\n--- transcript ---\n{d.t.transcript()}") from None
    finally:
        if d is not None:
            d.close()
        shutil.rmtree(work, ignore_errors=True)


def main():
    velhost, modules, examples = (os.path.abspath(a) for a in sys.argv[1:4])
    locale, chosen = sys.argv[4], sys.argv[5:]
    failures = 0
    for case in CASES:
        if (case[0] not in chosen) if chosen else (locale not in case[2]):
            continue
        try:
            run_case(case, velhost, modules, examples, locale)
            print(f"ok     {case[0]} (LANG={locale})", flush=True)
        except CaseFailure as failure:
            failures += 1
            print(f"ÉCHEC  {case[0]} (LANG={locale}) : {failure}", flush=True)
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main())
