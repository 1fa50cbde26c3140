#!/usr/bin/python3
"""Writes the DXF fixtures of the drawing reader tests with ezdxf (Debian's
python3-ezdxf): run `/usr/bin/python3 make_fixtures.py` in this folder."""
import ezdxf

LONG = "".join("abcdefghij"[i % 10] for i in range(3000))


def project_dicts(doc, hard_owned):
    """The project records the quantity take-off reads: nested dictionaries with
    XRECORDs carrying XData of DAZUVUVUD."""
    doc.appids.new("DAZUVUVUD")
    root = doc.rootdict
    rsx = root.add_new_dict("VELANTO_RSX_VRD", hard_owned=hard_owned)
    projects = rsx.add_new_dict("PROJECTS", hard_owned=not hard_owned)
    for name, items in [
        ("P2", [(1000, "Réseau EU"), (1000, "EU_LIN"), (1040, 12.5), (1000, "EU_NB"), (1070, 12)]),
        ("P1", [(1000, "Réseau EP"), (1000, "EP_LIN"), (1000, "12.5"), (1000, "EP_BIG"), (1071, 100000)]),
    ]:
        x = projects.add_xrecord(name)
        x.reset([(1, "donnée de l'enregistrement"), (40, 1.5), (70, 3)])
        x.set_xdata("DAZUVUVUD", [(1000, "PRJ_NOM")] + items)
    road = root.add_new_dict("VELANTO_ROUT2_DICT")
    rp = road.add_new_dict("VELANTO_ROUT2_PROJ")
    x = rp.add_xrecord("R1")
    x.set_xdata("DAZUVUVUD", [(1000, "PRJ_NOM"), (1000, "Route 1"), (1000, "CHAUSSEE"), (1041, 250.0)])


def every_xdata(entity):
    entity.doc.appids.new("VEL_TEST")
    entity.set_xdata("VEL_TEST", [
        (1000, "texte avec  espaces "),
        (1002, "{"),
        (1003, "0"),
        (1002, "{"),
        (1004, b"\x00\x01\xfe\xff"),
        (1002, "}"),
        (1005, "1F"),
        (1002, "}"),
        (1010, (1.5, 2.5, 3.5)),
        (1011, (4.0, 5.0, 6.0)),
        (1012, (7.0, 8.0, 9.0)),
        (1013, (0.0, 0.0, 1.0)),
        (1040, 3.14159),
        (1041, 2.5),
        (1042, 0.5),
        (1070, -32768),
        (1071, 2147483647),
    ])


def content(doc, text):
    msp = doc.modelspace()
    doc.layers.add("RESEAU_EP", color=5)
    line = msp.add_line((0, 0), (10, 5), dxfattribs={"layer": "RESEAU_EP"})
    every_xdata(line)
    msp.add_circle((3, 3), 2)
    msp.add_text(text, dxfattribs={"height": 2.5})
    if doc.dxfversion > "AC1009":
        msp.add_lwpolyline([(0, 0), (5, 0), (5, 5)])
        msp.add_mtext("ligne 1\\Pligne 2")
        msp.add_text(LONG)


def r12():
    doc = ezdxf.new("R12")
    content(doc, "R12 texte simple")
    doc.header["$OSMODE"] = 33
    doc.saveas("r12.dxf")


def r2000():
    doc = ezdxf.new("R2000")
    content(doc, "R2000")
    project_dicts(doc, hard_owned=True)
    doc.header["$AUNITS"] = 1
    doc.header["$ANGBASE"] = 90.0
    doc.header["$ANGDIR"] = 1
    doc.header["$CECOLOR"] = 3
    doc.header["$CLAYER"] = "RESEAU_EP"
    doc.saveas("r2000.dxf")


def r2004():
    doc = ezdxf.new("R2004")
    doc.header["$DWGCODEPAGE"] = "ANSI_1252"
    content(doc, "Déblai à 5 € — ΩΣ")
    doc.layers.add("Réseau_Été")
    project_dicts(doc, hard_owned=False)
    doc.saveas("r2004_1252.dxf", encoding="cp1252")


def r2018(name="r2018.dxf"):
    doc = ezdxf.new("R2018")
    content(doc, "Déblai à 5 € — ΩΣ 日本")
    project_dicts(doc, hard_owned=True)
    x = doc.rootdict.add_xrecord("SANS_DRAPEAU")
    x.reset([(1, LONG), (10, (1, 2, 3))])
    doc.header["$LIMCHECK"] = 1
    doc.header["$ORTHOMODE"] = 1
    doc.saveas(name)
    return name


def patch_r2018():
    """Things ezdxf does not write by itself: an XRECORD without its 280 flag, an entity
    and an object of classes nobody knows, and the header variables a recent writer may
    leave out."""
    with open("r2018.dxf", encoding="utf-8") as f:
        text = f.read()
    lines = text.split("\n")
    seed_at = lines.index("$HANDSEED") + 2
    seed = int(lines[seed_at], 16)
    lines[seed_at] = "%X" % (seed + 2)
    # Drop the 280 of the XRECORD filed as SANS_DRAPEAU.
    handle = None
    for i in range(len(lines) - 1):
        if lines[i].strip() == "3" and lines[i + 1] == "SANS_DRAPEAU":
            handle = lines[i + 3]
    for i in range(len(lines) - 3):
        if lines[i] == "XRECORD" and lines[i + 2] == handle:
            j = i + 1
            while lines[j].strip() != "280":
                j += 2
            del lines[j:j + 2]
            break
    for var in ("$OSMODE", "$ATTDIA", "$ATTREQ"):
        if var in lines:
            k = lines.index(var)
            del lines[k - 1:k + 3]
    text = "\n".join(lines)
    unknown_entity = ("  0\nVEL_CHOSE\n  5\n%X\n330\n1F\n100\nAcDbEntity\n  8\n0\n100\nVelChose\n"
                      "  1\n valeur  avec espaces \n 10\n1.0\n 20\n2.0\n 30\n0.0\n" % seed)
    unknown_object = ("  0\nVEL_OBJET\n  5\n%X\n330\n0\n100\nVelObjet\n 90\n42\n" % (seed + 1))
    entities_end = text.index("  0\nENDSEC", text.index("ENTITIES"))
    text = text[:entities_end] + unknown_entity + text[entities_end:]
    objects_end = text.index("  0\nENDSEC", text.index("OBJECTS"))
    text = text[:objects_end] + unknown_object + text[objects_end:]
    with open("r2018.dxf", "w", encoding="utf-8", newline="") as f:
        f.write(text)


def crlf():
    r2018("crlf.dxf")
    with open("crlf.dxf", encoding="utf-8") as f:
        text = f.read()
    with open("crlf.dxf", "w", encoding="utf-8", newline="") as f:
        f.write(text.replace("\n", "\r\n"))


def binary():
    doc = ezdxf.new("R2018")
    content(doc, "Binaire — Ω")
    project_dicts(doc, hard_owned=True)
    doc.saveas("r2018_bin.dxf", fmt="bin")
    doc = ezdxf.new("R12")
    content(doc, "R12 binaire")
    doc.saveas("r12_bin.dxf", fmt="bin")


if __name__ == "__main__":
    r12()
    r2000()
    r2004()
    r2018()
    patch_r2018()
    crlf()
    binary()
