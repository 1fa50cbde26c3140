#!/usr/bin/python3
"""Generates the large drawing of the DXF benchmark: an R2018 drawing made by ezdxf
(tables, layouts, project dictionaries with XData) to which several hundred thousand
entities are appended as text, every tenth with XData.

usage: gen_large_dxf.py OUTPUT [ENTITIES]"""
import io
import sys

import ezdxf


def base(path):
    doc = ezdxf.new("R2018")
    doc.appids.new("DAZUVUVUD")
    for name in ("RESEAU_EP", "RESEAU_EU", "VOIRIE", "TEXTE"):
        doc.layers.add(name)
    rsx = doc.rootdict.add_new_dict("VELANTO_RSX_VRD")
    projects = rsx.add_new_dict("PROJECTS")
    for i in range(200):
        x = projects.add_xrecord("P%03d" % i)
        items = [(1000, "PRJ_NOM"), (1000, "Réseau %d" % i)]
        for k in range(20):
            items += [(1000, "RSX_TUY_LIN_%d" % k), (1040, 12.5 * k + i)]
        x.set_xdata("DAZUVUVUD", items)
    doc.saveas(path)


LINE = ("  0\nLINE\n  5\n%X\n330\n1F\n100\nAcDbEntity\n  8\n%s\n100\nAcDbLine\n"
        " 10\n%.4f\n 20\n%.4f\n 30\n0.0\n 11\n%.4f\n 21\n%.4f\n 31\n0.0\n")
CIRCLE = ("  0\nCIRCLE\n  5\n%X\n330\n1F\n100\nAcDbEntity\n  8\n%s\n100\nAcDbCircle\n"
          " 10\n%.4f\n 20\n%.4f\n 30\n0.0\n 40\n%.3f\n")
TEXT = ("  0\nTEXT\n  5\n%X\n330\n1F\n100\nAcDbEntity\n  8\nTEXTE\n100\nAcDbText\n"
        " 10\n%.4f\n 20\n%.4f\n 30\n0.0\n 40\n2.5\n  1\nRegard n°%d — cote %.2f\n100\nAcDbText\n")
POLY = ("  0\nLWPOLYLINE\n  5\n%X\n330\n1F\n100\nAcDbEntity\n  8\nVOIRIE\n100\nAcDbPolyline\n"
        " 90\n4\n 70\n0\n 10\n%.4f\n 20\n%.4f\n 10\n%.4f\n 20\n%.4f\n 10\n%.4f\n 20\n%.4f\n 10\n%.4f\n 20\n%.4f\n")
XDATA = ("1001\nDAZUVUVUD\n1000\nTRONCON_%d\n1002\n{\n1040\n%.3f\n1070\n%d\n1002\n}\n"
         "1010\n%.3f\n1020\n%.3f\n1030\n0.0\n1071\n%d\n")


def main(path, count):
    base(path)
    with open(path, encoding="utf-8") as f:
        text = f.read()
    lines = text.split("\n")
    seed_at = lines.index("$HANDSEED") + 2
    handle = int(lines[seed_at], 16)
    lines[seed_at] = "%X" % (handle + count + 1)
    text = "\n".join(lines)
    out = io.StringIO()
    layers = ("RESEAU_EP", "RESEAU_EU")
    for i in range(count):
        x = (i % 1000) * 10.0
        y = (i // 1000) * 10.0
        kind = i % 4
        if kind == 0:
            out.write(LINE % (handle, layers[i & 1], x, y, x + 7.5, y + 3.25))
        elif kind == 1:
            out.write(CIRCLE % (handle, layers[i & 1], x, y, 0.5 + i % 7))
        elif kind == 2:
            out.write(TEXT % (handle, x, y, i, y / 3.0))
        else:
            out.write(POLY % (handle, x, y, x + 5, y, x + 5, y + 5, x, y + 5))
        if i % 10 == 0:
            out.write(XDATA % (i, x * 0.5, i % 1000, x, y, i))
        handle += 1
    at = text.index("  0\nENDSEC", text.index("\nENTITIES\n"))
    with open(path, "w", encoding="utf-8", newline="") as f:
        f.write(text[:at])
        f.write(out.getvalue())
        f.write(text[at:])


if __name__ == "__main__":
    main(sys.argv[1], int(sys.argv[2]) if len(sys.argv) > 2 else 450000)
