#!/usr/bin/env python3
"""Runs the shipped demo on copies of the example files and checks what it leaves: the
schedule with its new price, and the two estimates whose totals must follow from the
drawing's records and the schedule's prices.

usage: run_demo.py VELHOST MODULES_DIR EXAMPLES_DIR WORK_DIR
"""
import os
import sys
import xml.etree.ElementTree as ET

from estimate_totals import expected_total, workbook_total
sys.path.insert(0, os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "support"))
from velrun import fresh_folder, report, run_velhost  # noqa: E402


def main():
    velhost, modules, examples, work = (os.path.abspath(a) for a in sys.argv[1:5])
    fresh_folder(work, examples, ("projet_vrd.dxf", "VelaBordereau.xml"))
    returncode, output = run_velhost(velhost, modules, work, os.path.join(examples, "demo.scr"), ["projet_vrd.dxf"])
    failures = []
    if returncode != 0:
        failures.append(f"exit status {returncode}")
    for text in ("Réseau EP, projet « EP Les Tilleuls »", "Réseau EU, projet « EU Les Tilleuls »",
                 "Prix unitaire de « PVC 315 » : 72.50 € HT.", "Bordereau des prix enregistré.",
                 "VelVuzazORE15 : VelaZodEVIBdrPrix", "Dessin enregistré"):
        if text not in output:
            failures.append(f"missing from the output: {text!r}")
    schedule = ET.parse(os.path.join(work, "VelaBordereau.xml")).getroot()
    prices = [a.get("unitPrice") for a in schedule.iter("article")
              if a.get("quantityKey") == '"RSX_TUY_LIN_3D_PVC 315"' and a.get("groupKey") == "PRJ_RES(EP)"]
    if prices != ["72.5"]:
        failures.append(f"PVC 315 of EP priced {prices} in the written schedule")
    if not os.path.exists(os.path.join(work, "VelaBordereau.xml.bak")):
        failures.append("the previous schedule was not kept as .bak")
    for text in ("Devis « Devis » :", "Devis « Devis 2 » :", "[x] EU\n    [x] EU Les Tilleuls"):
        if text not in output:
            failures.append(f"missing from the output: {text!r}")
    drawing, prices = os.path.join(work, "projet_vrd.dxf"), os.path.join(work, "VelaBordereau.xml")
    # Everything, one line per project; then the EU network alone, summed.
    for name, kept, per_project in (("Devis", lambda kind, project: True, True),
                                    ("Devis 2", lambda kind, project: project == "EU Les Tilleuls", False)):
        for extension in (".xlsx", ".csv"):
            if not os.path.exists(os.path.join(work, name + extension)):
                failures.append(f"{name}{extension} was not written")
        if os.path.exists(os.path.join(work, name + ".xlsx")):
            expected = expected_total(drawing, prices, kept, per_project)
            shown = workbook_total(os.path.join(work, name + ".xlsx"))
            if shown is None or abs(shown - expected) > 0.005:
                failures.append(f"{name}.xlsx: Total HT {shown}, expected {expected} from the drawing and the prices")
    return report(output, failures)


if __name__ == "__main__":
    sys.exit(main())
