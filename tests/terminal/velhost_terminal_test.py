#!/usr/bin/python3
"""Every command of velhost typed in a real terminal (tmux), under one locale.

usage: velhost_terminal_test.py VELHOST MODULES_DIR EXAMPLES_DIR LOCALE [CASE...]

LOCALE is the value of LANG for velhost ("-" runs it with no LANG at all). Each case of
the table that lists this locale (or each CASE named) runs in a fresh folder holding copies of the example
drawing and schedule; a failure prints what the terminal showed.

Steps of a case, one string each:
    "? PROMPT"     wait until velhost asks PROMPT (the cursor at its end)
    "> TEXT"       type TEXT and Enter ("> " alone: Enter)
    "! KEY..."     press tmux keys (C-c, C-d, Up, Down, End, BSpace, "-l TEXT" types TEXT)
    "= TEXT"       wait until TEXT appears after the last input
    "# TEXT"       wait until TEXT is on the screen (a full-screen program's)
    "@ FILE | TEXT"  the file (in the case's folder) holds TEXT ("@WORK@": that folder)
    "$ STATUS"     wait for velhost to end with STATUS
    "~"            start velhost again in the same folder (after it ended)
"""
import os
import shutil
import sys
import tempfile
from dataclasses import dataclass, field

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
from tmux_harness import TerminalSession  # noqa: E402

EVERYWHERE = ("-", "C.UTF-8", "fr_FR.UTF-8")
# Locales whose character type is not UTF-8, where the prompts used to crash the host.
NOT_UTF8 = ("-", "C", "POSIX", "fr_FR.ISO-8859-1")
LATIN1_NAME = os.fsdecode(b"\xe9t\xe9.dxf")  # "été.dxf" written in Latin-1: not UTF-8
OPTION = "Entrez une option [?/Charger/Décharger] : "
CONFIG_PAGE = "Page Métré [Parcourir/Terminer] <Terminer> : "
PURGE = "Purger à la prochaine mise à jour [Oui/Non]"


@dataclass
class Case:
    name: str
    steps: list
    locales: tuple = EVERYWHERE
    args: tuple = ("projet_vrd.dxf",)
    copies: dict = field(default_factory=dict)  # extra file name -> example it copies


CASES = [
    Case("arx", [
        "? Commande: ", "> ARX", f"? {OPTION}", "> ?", "= Aucun module chargé.",
        "? Commande: ", "> ARX", f"? {OPTION}", "! C-c",
        "? Commande: ", "> ARX Charger VelVuzazORE15", "= VelVuzazORE15.arx chargé.",
        "? Commande: ", "> ARX ?", "= VelSrvConfig15.arx",
        "? Commande: ", "> ARX", f"? {OPTION}", "> Déc", "? Module à décharger : ", "> VelVuzazORE15",
        "= VelVuzazORE15.arx déchargé.",
        "? Commande: ", "! C-d", "$ 0"]),
    Case("appload", [
        "? Commande: ", "> APPLOAD", "? Module à charger : ", "> absent",
        "= Impossible de trouver le module absent.arx.",
        "? Commande: ", "> APPLOAD", "? Module à charger : ", "! C-c",
        "? Commande: ", "> APPLOAD VelVuzazORE15.arx", "= Module chargé : tapez la commande du module",
        "? Commande: ", "> VelVuzazORE15", "= VelaZodEVIBdrPurge  ZodEVIBdrPurge",
        "? Commande: ", "> QUIT", "$ 0"]),
    Case("drawings", [
        "? Commande: ", "> OPEN", "? Dessin à ouvrir : ", "> absent.dxf", "= impossible d'ouvrir le fichier",
        "? Commande: ", "> NEW", "? Commande: ", "> DOCUMENT", "= * 2 Dessin1",
        "? Commande: ", "> SETVAR OSMODE 1",
        "? Commande: ", "> SAVEAS", "? Nom du fichier DXF : ", "> nouveau.dxf", "= Dessin enregistré dans",
        "? Commande: ", "> CLOSE", "? Commande: ", "> DOCUMENT", "= * 1 projet_vrd.dxf",
        "? Commande: ", "> SETVAR OSMODE 33", "? Commande: ", "> SAVE", "= Dessin enregistré dans",
        "? Commande: ", "> SETVAR OSMODE 7", "? Commande: ", "> OPEN nouveau.dxf", "= nouveau.dxf ouvert.",
        "? Commande: ", "> QUIT",
        "? Enregistrer les modifications de projet_vrd.dxf ? [Oui/Non/Annuler] <Oui> : ", "> Annuler",
        "= Fermeture de projet_vrd.dxf annulée.",
        "? Commande: ", "> QUIT",
        "? Enregistrer les modifications de projet_vrd.dxf ? [Oui/Non/Annuler] <Oui> : ", "> n", "$ 0",
        "@ projet_vrd.dxf | $OSMODE\n 70\n33\n"]),
    Case("variables", [
        "? Commande: ", "> GETVAR", "? Nom de la variable : ", "> OSMODE", "= OSMODE = 37",
        "? Commande: ", "> SETVAR", "? Nom de la variable : ", "> OSMODE", "? Nouvelle valeur de OSMODE : ",
        "> 33", "? Commande: ", "> GETVAR OSMODE", "= OSMODE = 33",
        "? Commande: ", "> SETVAR ANGBASE 0,5", "= La variable ANGBASE attend un nombre, pas \"0,5\".",
        "? Commande: ", "> SETVAR CLAYER", "? Nouvelle valeur de CLAYER : ", "! C-c",
        # Ctrl-D ends as QUIT does, asking about the changed drawing.
        "? Commande: ", "! C-d", "? Enregistrer les modifications de projet_vrd.dxf ? [Oui/Non/Annuler] <Oui> : ",
        "! C-c", "= Fermeture de projet_vrd.dxf annulée.",
        "? Commande: ", "! C-d", "? Enregistrer les modifications de projet_vrd.dxf ? [Oui/Non/Annuler] <Oui> : ",
        "> ", "$ 0", "@ projet_vrd.dxf | $OSMODE\n 70\n33\n"]),
    Case("history", [
        "? Commande: ", "> GETVAR DWGNAME", "= DWGNAME = projet_vrd.dxf", "? Commande: ", "! C-d", "$ 0",
        "~", "? Commande: ", "! Up", "# Commande: GETVAR DWGNAME", "> ", "= DWGNAME = projet_vrd.dxf",
        "? Commande: ", "! C-d", "$ 0"]),
    Case("purge", [
        "? Commande: ", "> APPLOAD VelVuzazORE15", "? Commande: ", "> ZodEVIBdrPurge",
        "= Attention !!! Purger rallonge les temps de traitement !", f"? {PURGE} <Non> : ", "> peut-être",
        "= Mot-clé attendu : Oui, Non.", f"? {PURGE} <Non> : ", "> o",
        "? Commande: ", "> ZodEVIBdrPurge", f"? {PURGE} <Oui> : ", "! C-c",
        "? Commande: ", "> ZodEVIBdrPurge", f"? {PURGE} <Oui> : ", "> ",
        "? Commande: ", "! C-d", "$ 0"]),
    Case("config", [
        "? Commande: ", "> APPLOAD VelVuzazORE15", "? Commande: ", "> VelConfig",
        f"? {CONFIG_PAGE}", "> P", "? Fichier de bordereau des prix (*.xml) : ", "> absent.xml",
        "= absent.xml : ce fichier n'existe pas.",
        f"? {CONFIG_PAGE}", "> Parcourir", "? Fichier de bordereau des prix (*.xml) : ", "> projet_vrd.dxf",
        "= ERREUR : impossible de lire le bordereau des prix !", "? [OK]", "> ",
        f"? {CONFIG_PAGE}", "> p", "? Fichier de bordereau des prix (*.xml) : ", "> autre.xml",
        "= Bordereau des prix : @WORK@/autre.xml", f"? {CONFIG_PAGE}", "> ",
        "? Enregistrer la configuration ? [Oui/Non] <Oui> : ", "> ", "= Configuration enregistrée.",
        "? Commande: ", "> VelConfig", f"? {CONFIG_PAGE}", "! C-c", "= Configuration abandonnée.",
        "? Commande: ", "! C-d", "$ 0",
        "@ profil/Velanto.ini | Bordereau=@WORK@/autre.xml"],
        copies={"autre.xml": "VelaBordereau.xml"}),
    # The schedule in nano, its accents shown whatever the locale; line 9 is the first
    # article's unit price (4500).
    Case("editor", [
        "? Commande: ", "> APPLOAD VelVuzazORE15", "? Commande: ", "> ZodEVIBdrPrix",
        "# GNU nano", "# Article associé aux projets",
        "! Down Down Down Down Down Down Down Down End BSpace BSpace BSpace BSpace", "! -l 4600", "! C-s C-x",
        "= 0 article(s) supprimé(s), 1 modifié(s), 0 ajouté(s).",
        "? Commande: ", "! C-d", "$ 0",
        "@ VelaBordereau.xml | unitPrice=\"4600\""]),
    Case("network", [
        "? Commande: ", "> APPLOAD VelReseDimVRD15.arx", "? Commande: ", "> RsxMetres",
        "= Réseau EU, projet « EU Les Tilleuls »", "? Commande: ", "> RsxMajBordereau",
        "= Bordereau des prix enregistré.", "? Commande: ", "> SAVE", "= Dessin enregistré",
        "? Commande: ", "! C-d", "$ 0"]),
    Case("client", [
        "? Commande: ", "> APPLOAD VelDemoPrix.arx", "? Commande: ", "> DemoPrix",
        "? Quantité (0 tuyaux, 6 regards, 9 à 12 matériaux) <0> : ", "> tuyaux",
        "= « tuyaux » n'est pas une quantité",
        "? Commande: ", "> DemoPrix", "? Quantité (0 tuyaux, 6 regards, 9 à 12 matériaux) <0> : ", "> ",
        "? Nom de l'élément : ", "> PVC 315", "? Réseau (vide : réseau général) : ", "> EP",
        "? Prix unitaire HT : ", "> 72,50", "= Prix unitaire de « PVC 315 » : 72.50 € HT.",
        "? Commande: ", "! C-d", "$ 0"]),
    # Prompts holding text that is not UTF-8 (a drawing named in Latin-1), under locales
    # whose character type is not UTF-8 either.
    Case("prompts", [
        "? Commande: ", "> ARX", f"? {OPTION}", "! -l Déc", "! C-c",
        "? Commande: ", "> SETVAR OSMODE 1", "? Commande: ", "> QUIT",
        "? Enregistrer les modifications de \ufffdt\ufffd.dxf ? [Oui/Non/Annuler] <Oui> : ", "> Non", "$ 0"],
        locales=NOT_UTF8 + ("fr_FR.UTF-8",), args=(LATIN1_NAME,), copies={LATIN1_NAME: "projet_vrd.dxf"}),
]


class CaseFailure(AssertionError):
    pass


def run_case(case, velhost, modules, examples, locale):
    work = tempfile.mkdtemp(prefix=f"velhost-{case.name}-")
    term = None
    try:
        for name in ("projet_vrd.dxf", "VelaBordereau.xml"):
            shutil.copy(os.path.join(examples, name), work)
        for name, example in case.copies.items():
            shutil.copy(os.path.join(examples, example), os.path.join(os.fsencode(work), os.fsencode(name)))
        argv = [velhost, "--modules", modules, "--profile", os.path.join(work, "profil"), *case.args]
        env = {"VISUAL": "nano"}
        if locale != "-":
            env["LANG"] = locale

        def start():
            return TerminalSession(argv, cwd=work, env=env, width=110, height=35)

        term = start()
        for step in case.steps:
            kind, _, text = step.partition(" ")
            text = text.replace("@WORK@", work)
            try:
                if kind == "?":
                    term.wait_for_prompt(text)
                elif kind == ">":
                    term.send_line(text)
                elif kind == "!":
                    keys = text.split(" ", 1) if text.startswith("-l ") else text.split()
                    term.send_keys(*keys)
                elif kind == "=":
                    term.wait_for(text)
                elif kind == "#":
                    term.wait_for(text, where="screen")
                elif kind == "$":
                    status = term.wait_exit()
                    if status != int(text):
                        raise CaseFailure(f"exit status {status}, expected {text}")
                elif kind == "~":
                    term.close()
                    term = start()
                elif kind == "@":
                    name, _, wanted = text.partition(" | ")
                    with open(os.path.join(work, name), encoding="utf-8", errors="replace") as f:
                        content = f.read()
                    if wanted not in content:
                        raise CaseFailure(f"{name} does not hold {wanted!r}")
                else:
                    raise CaseFailure(f"unknown step {step!r}")
            except AssertionError as failure:
                raise CaseFailure(f"step {step!r}: {failure}\n--- transcript ---\n{term.transcript()}") from None
    finally:
        if term is not None:
            term.close()
        shutil.rmtree(work, ignore_errors=True)


def main():
    velhost, modules, examples = (os.path.abspath(a) for a in sys.argv[1:4])
    locale, chosen = sys.argv[4], sys.argv[5:]
    failures = 0
    for case in CASES:
        if (case.name not in chosen) if chosen else (locale not in case.locales):
            continue
        try:
            run_case(case, velhost, modules, examples, locale)
            print(f"ok     {case.name} (LANG={locale})", flush=True)
        except CaseFailure as failure:
            failures += 1
            print(f"ÉCHEC  {case.name} (LANG={locale}) : {failure}", flush=True)
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main())
