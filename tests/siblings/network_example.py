#!/usr/bin/python3
"""Runs velhost on the example project: loads the main services and the network sizing
module, writes the network quantity records, saves, then checks the saved drawing with
ezdxf: the records are there, hold the expected quantities, every key names an article of
the example schedule, and the road and platform records are unchanged.

With --schedule the metre module is loaded too and the network update command runs
first: the example schedule already holds every article of both networks, so nothing is
added and the schedule is written back byte for byte.

usage: network_example.py VELHOST MODULES_DIR EXAMPLES_DIR WORK_DIR [--schedule]
"""
import os
import sys
import xml.etree.ElementTree as ET

import ezdxf

sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "support"))
from velrun import fresh_folder, report, run_velhost  # noqa: E402

SCRIPT = """OPEN projet_vrd.dxf
APPLOAD Vel2000Srv
APPLOAD VelReseDimVRD15
RsxMetres
SAVEAS resultat.dxf
QUIT
"""
SCHEDULE_SCRIPT = """OPEN projet_vrd.dxf
APPLOAD Vel2000Srv
APPLOAD VelVuzazORE15
APPLOAD VelReseDimVRD15
RsxMajBordereau
RsxMetres
SAVEAS resultat.dxf
QUIT
"""
SCHEDULE_OUTPUT = [
    "Réseau EP (indice 0) : 3 modèle(s) de canalisation, 2 de regard : bordereau déjà à jour.",
    "Réseau EU (indice 1) : 2 modèle(s) de canalisation, 2 de regard : bordereau déjà à jour.",
    "Bordereau des prix enregistré.",
]

EXPECTED_OUTPUT = [
    "Réseau EP, projet « EP Les Tilleuls » : 165.70 m de canalisations, 8 regard(s) ou accessoire(s)",
    "Réseau EU, projet « EU Les Tilleuls » : 177.03 m de canalisations, 10 regard(s) ou accessoire(s)",
    "Dessin enregistré dans",
]

# Quantities checked by value (counts exactly, lengths to the millimetre).
EXPECTED = {
    "EP Les Tilleuls": {'"RSX_SBL_NB_Regard 1000"': 4, '"RSX_SBL_NB_Avaloir 40x40"': 4,
                        '"RSX_TUY_NB_PVC 315"': 14, '"RSX_TUY_LIN_3D_PVC 315"': 80.006},
    "EU Les Tilleuls": {'"RSX_SBL_NB_Regard 1000"': 4, '"RSX_SBL_NB_Boîte de branchement"': 6,
                        '"RSX_TUY_LIN_3D_PVC 160"': 27.0, '"RSX_TUY_NB_PVC 160"': 12,
                        '"RSX_LIN_3.50_2D"': 70.0},
}


def record(entity):
    tags = [tuple(t) for t in entity.get_xdata("DAZUVUVUD")]
    assert tags[0] == (1000, "PRJ_NOM"), tags[:2]
    quantities = {}
    for (kc, key), (vc, value) in zip(tags[2::2], tags[3::2]):
        assert kc == 1000 and vc in (1040, 1071), (key, vc)
        quantities[key] = value
    return tags[1][1], quantities


def schedule_keys(path):
    keys = {}
    for article in ET.parse(path).getroot():
        keys.setdefault(article.get("groupKey"), set()).add(article.get("quantityKey"))
    return keys


def main():
    velhost, modules, examples, work = (os.path.abspath(a) for a in sys.argv[1:5])
    with_schedule = sys.argv[5:] == ["--schedule"]
    fresh_folder(work, examples, ("projet_vrd.dxf", "VelaBordereau.xml"))
    with open(os.path.join(work, "reseaux.scr"), "w", encoding="utf-8") as f:
        f.write(SCHEDULE_SCRIPT if with_schedule else SCRIPT)
    returncode, output = run_velhost(velhost, modules, work, "reseaux.scr", timeout=120)
    failures = []
    if returncode != 0:
        failures.append("exit status %d" % returncode)
    for text in EXPECTED_OUTPUT + (SCHEDULE_OUTPUT if with_schedule else []):
        if text not in output:
            failures.append("not in the output: %r" % text)
    with open(os.path.join(examples, "VelaBordereau.xml"), "rb") as f, \
            open(os.path.join(work, "VelaBordereau.xml"), "rb") as g:
        if f.read() != g.read():
            failures.append("the schedule was changed")
    if failures:
        print(output)
        print("\n".join(failures))
        return 1

    saved = ezdxf.readfile(os.path.join(work, "resultat.dxf"))
    original = ezdxf.readfile(os.path.join(examples, "projet_vrd.dxf"))
    keys = schedule_keys(os.path.join(examples, "VelaBordereau.xml"))
    if "DAZUVUVUD" not in saved.appids:
        failures.append("application DAZUVUVUD not registered")
    projects = saved.rootdict["VELANTO_RSX_VRD"]["PROJECTS"]
    networks = {"EP Les Tilleuls": "EP", "EU Les Tilleuls": "EU"}
    if sorted(projects.keys()) != sorted(networks):
        failures.append("network records: %s" % sorted(projects.keys()))
    for entry, network in networks.items():
        name, quantities = record(projects[entry])
        if name != entry:
            failures.append("record %s names the project %r" % (entry, name))
        for key, value in EXPECTED[entry].items():
            if key not in quantities or abs(quantities[key] - value) > 5e-4:
                failures.append("%s %s: %r, expected %r" % (entry, key, quantities.get(key), value))
        group = keys.get("PRJ_RES(%s)" % network, set())
        for key in quantities:
            if key not in group:
                failures.append("%s: no article of the example schedule counts %s" % (entry, key))
    road_group = keys["PRJ_PFM(),PRJ_RTE(),PRJ_PCV()"]
    for first, second in (("VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ"), ("VELANTO_PFM_VRD", "PROJECTS")):
        for entry, value in original.rootdict[first][second].items():
            before = record(value)
            after = record(saved.rootdict[first][second][entry])
            if before != after:
                failures.append("%s/%s changed" % (second, entry))
            for key in before[1]:
                if key not in road_group:
                    failures.append("%s: no article of the example schedule counts %s" % (entry, key))
    return report(output, failures)


if __name__ == "__main__":
    sys.exit(main())
