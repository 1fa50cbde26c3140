#!/usr/bin/python3
"""Writes the example project of the demo: projet_vrd.dxf and VelaBordereau.xml.

projet_vrd.dxf - "Lotissement Les Tilleuls", a small housing estate: a 120 m access road
with a visitors' car park, a storm-water network (EP: PVC 315 and concrete 400 mains,
manholes, gullies and their PVC 200 leads) and a foul-water network (EU: PVC 200 main,
manholes, six house connections in PVC 160 with their connection boxes). Every network
element carries the network sizing module's XData (application VELANTO_RSX: network
name, network index, project, element kind, model, trench depths, useful length, trench
width). The road and the car park carry their quantity records (application DAZUVUVUD)
in VELANTO_ROUT2_DICT/VELANTO_ROUT2_PROJ and VELANTO_PFM_VRD/PROJECTS.

VelaBordereau.xml - the price schedule a session over this drawing produces (schedule
read, both networks updated, structure materials and stripping thickness updated), built
from the standard catalogue as transcribed in tests/data/catalogue_expected.tsv, with unit
prices excluding tax of a 2024 French VRD tender. Quantities that only inform (pipe counts,
2D lengths by depth class...) keep a zero price so that nothing is counted twice.

Run: /usr/bin/python3 examples/make_example.py   (needs python3-ezdxf)
"""
import os
import re
import sys

import ezdxf

HERE = os.path.dirname(os.path.abspath(__file__))
CATALOGUE = os.path.join(HERE, "..", "tests", "data", "catalogue_expected.tsv")

NETWORK_APP = "VELANTO_RSX"
RECORD_APP = "DAZUVUVUD"
DEPTH_BOUNDS = [0.00, 1.30, 2.00, 3.50]  # the network sizing module's depth classes
TAX_RATE = 20.0


def ground(x):
    """Level of the natural ground along the road (gentle fall to the east)."""
    return 100.0 - 0.005 * x


# ---------------------------------------------------------------- the networks

# (entity, kind, model, points (x, y), depths at the ends, useful length, trench width)
EP_PIPES = [
    ("LINE", "TUY", "PVC 315", [(0, -2.5), (40, -2.5)], (1.30, 1.55), 6.0, 0.90),
    ("LINE", "TUY", "PVC 315", [(40, -2.5), (80, -2.5)], (1.55, 1.85), 6.0, 0.90),
    ("LINE", "TUY", "Béton 400", [(80, -2.5), (120, -2.5)], (1.85, 2.10), 2.5, 1.10),
    ("POLYLINE", "TUY", "Béton 400", [(120, -2.5), (132, -8.0), (140, -20.0)], (2.10, 1.20), 2.5, 1.10),
    ("LWPOLYLINE", "TUY", "PVC 200", [(20, -5.5), (20, -2.5)], (0.90, 1.40), 6.0, 0.70),
    ("LWPOLYLINE", "TUY", "PVC 200", [(60, -5.5), (60, -2.5)], (0.90, 1.70), 6.0, 0.70),
    ("LWPOLYLINE", "TUY", "PVC 200", [(100, -5.5), (100, -2.5)], (0.90, 1.95), 6.0, 0.70),
    ("LWPOLYLINE", "TUY", "PVC 200", [(60, 5.5), (62, 0.0), (60, -2.5)], (0.90, 1.70), 6.0, 0.70),
]
# (kind, model, point, depth)
EP_FITTINGS = [("SBL", "Regard 1000", (x, -2.5), d) for x, d in ((0, 1.30), (40, 1.55), (80, 1.85), (120, 2.10))]
EP_FITTINGS += [("SBL", "Avaloir 40x40", p, 0.90) for p in ((20, -5.5), (60, -5.5), (100, -5.5), (60, 5.5))]

EU_MANHOLES = ((0, 2.20), (40, 2.65), (80, 3.10), (120, 4.10))
EU_PIPES = [
    ("LINE", "TUY", "PVC 200", [(a[0], 2.5), (b[0], 2.5)], (a[1], b[1]), 6.0, 0.80)
    for a, b in zip(EU_MANHOLES, EU_MANHOLES[1:])
]
EU_PIPES.append(("LINE", "TUY", "PVC 200", [(120, 2.5), (150, 2.5)], (4.10, 3.90), 6.0, 0.80))
EU_PIPES += [("LWPOLYLINE", "TUY", "PVC 160", [(x, 7.0), (x, 2.5)], (1.00, 2.20 + x * 0.012), 3.0, 0.60)
             for x in (10, 30, 50, 70, 90, 110)]
EU_FITTINGS = [("SBL", "Regard 1000", (x, 2.5), d) for x, d in EU_MANHOLES]
EU_FITTINGS += [("SBL", "Boîte de branchement", (x, 7.0), 1.00) for x in (10, 30, 50, 70, 90, 110)]

NETWORKS = [
    {"name": "EP", "index": 0, "project": "EP Les Tilleuls", "pipes": EP_PIPES, "fittings": EP_FITTINGS},
    {"name": "EU", "index": 1, "project": "EU Les Tilleuls", "pipes": EU_PIPES, "fittings": EU_FITTINGS},
]


def models(items):
    """Distinct models in order of first appearance, as the network module lists them."""
    out = []
    for item in items:
        model = item[1] if len(item) == 4 else item[2]
        if model not in out:
            out.append(model)
    return out


# ---------------------------------------------------------------- road and platform

MAT_VOLUME = ["GNT 0/31.5", "GB3 0/14"]
MAT_SURFACE = ["BBSG 0/10", "Enduit bicouche"]
MAT_LENGTH = ["Bordure T2", "Caniveau CC1"]
STRIPPING = [0.30]

ROAD = ("Voie principale", [
    ("PRJ_VOL_MAT_GNT 0/31.5", 231.0), ("PRJ_TON_MAT_GNT 0/31.5", 485.1),
    ("PRJ_VOL_MAT_GB3 0/14", 66.0), ("PRJ_TON_MAT_GB3 0/14", 155.1),
    ("PRJ_SFC_MAT_BBSG 0/10", 660.0),
    ("PRJ_LIN_MAT_Bordure T2", 240.0), ("PRJ_LIN_MAT_Caniveau CC1", 240.0),
    ("PRJ_VOL_TOT_DBL", 820.5), ("PRJ_VOL_TOT_RBL", 145.2),
    ("PRJ_VOL_TOT_DEC_0.300", 324.0), ("PRJ_SFC_DEC_3D_0.300", 1080.4),
    ("PRJ_SCI_LIN_3D", 12.0),
])
PLATFORM = ("Parking visiteurs", [
    ("PRJ_VOL_MAT_GNT 0/31.5", 120.0), ("PRJ_TON_MAT_GNT 0/31.5", 252.0),
    ("PRJ_SFC_MAT_Enduit bicouche", 400.0),
    ("PRJ_LIN_MAT_Bordure T2", 82.0),
    ("PRJ_VOL_TOT_DBL", 186.0), ("PRJ_VOL_TOT_RBL", 42.5),
    ("PRJ_VOL_TOT_DEC_0.300", 132.0), ("PRJ_SFC_DEC_3D_0.300", 440.0),
])


def quoted(name):
    return '"%s"' % name


def record_xdata(name, quantities):
    tags = [(1000, "PRJ_NOM"), (1000, name)]
    for key, value in quantities:
        tags += [(1000, quoted(key)), (1040, value)]
    return tags


def write_drawing(path):
    # Fixed dates and identifiers: running the script again gives the same file.
    ezdxf.options.write_fixed_meta_data_for_testing = True
    doc = ezdxf.new("R2018", setup=False)
    doc.header["$INSUNITS"] = 6  # metres
    for app in (NETWORK_APP, RECORD_APP):
        doc.appids.new(app)
    for name, color in (("VOIRIE", 8), ("EP_CANALISATIONS", 5), ("EP_REGARDS", 5),
                        ("EU_CANALISATIONS", 1), ("EU_REGARDS", 1), ("TEXTES", 7)):
        doc.layers.new(name, dxfattribs={"color": color})
    regard = doc.blocks.new("REGARD")
    regard.add_circle((0, 0), 0.5)
    avaloir = doc.blocks.new("AVALOIR")
    avaloir.add_lwpolyline([(-0.2, -0.2), (0.2, -0.2), (0.2, 0.2), (-0.2, 0.2)], close=True)
    msp = doc.modelspace()

    # The road and the car park, drawn without any network data.
    msp.add_lwpolyline([(0, -5.5), (150, -5.5)], dxfattribs={"layer": "VOIRIE"})
    msp.add_lwpolyline([(0, 5.5), (150, 5.5)], dxfattribs={"layer": "VOIRIE"})
    msp.add_lwpolyline([(30, 5.5), (55, 5.5), (55, 21.5), (30, 21.5)], close=True, dxfattribs={"layer": "VOIRIE"})
    msp.add_text("Lotissement Les Tilleuls", dxfattribs={"layer": "TEXTES", "height": 1.5, "insert": (0, 25)})

    for network in NETWORKS:
        head = [(1000, network["name"]), (1070, network["index"]), (1000, network["project"])]
        pipes_layer = network["name"] + "_CANALISATIONS"
        fittings_layer = network["name"] + "_REGARDS"
        for shape, kind, model, points, depths, useful, width in network["pipes"]:
            (d1, d2) = depths
            # Pipe inverts: the ground less the depth, which varies evenly from end to end.
            p3 = [(x, y, ground(x) - (d1 + (d2 - d1) * i / (len(points) - 1))) for i, (x, y) in enumerate(points)]
            if shape == "LINE":
                entity = msp.add_line(p3[0], p3[1], dxfattribs={"layer": pipes_layer})
            elif shape == "POLYLINE":
                entity = msp.add_polyline3d(p3, dxfattribs={"layer": pipes_layer})
            else:
                entity = msp.add_lwpolyline(points, dxfattribs={"layer": pipes_layer})
            entity.set_xdata(NETWORK_APP, head + [(1000, kind), (1000, model), (1040, d1), (1040, d2),
                                                  (1041, useful), (1041, width)])
        for kind, model, (x, y), depth in network["fittings"]:
            if model.startswith("Regard"):
                entity = msp.add_blockref("REGARD", (x, y, ground(x)), dxfattribs={"layer": fittings_layer})
            elif model.startswith("Avaloir"):
                entity = msp.add_blockref("AVALOIR", (x, y, ground(x)), dxfattribs={"layer": fittings_layer})
            elif model.startswith("Boîte"):
                entity = msp.add_circle((x, y, ground(x)), 0.25, dxfattribs={"layer": fittings_layer})
            else:
                entity = msp.add_point((x, y, ground(x)), dxfattribs={"layer": fittings_layer})
            entity.set_xdata(NETWORK_APP, head + [(1000, kind), (1000, model), (1040, depth)])

    root = doc.rootdict
    roads = root.add_new_dict("VELANTO_ROUT2_DICT").add_new_dict("VELANTO_ROUT2_PROJ")
    roads.add_xrecord(ROAD[0]).set_xdata(RECORD_APP, record_xdata(*ROAD))
    platforms = root.add_new_dict("VELANTO_PFM_VRD").add_new_dict("PROJECTS")
    platforms.add_xrecord(PLATFORM[0]).set_xdata(RECORD_APP, record_xdata(*PLATFORM))
    doc.saveas(path)


# ---------------------------------------------------------------- the schedule

def unescape(text):
    out, i = [], 0
    while i < len(text):
        c = text[i]
        if c == "\\" and i + 1 < len(text):
            out.append({"\\": "\\", "n": "\n", "r": "\r", "t": "\t"}[text[i + 1]])
            i += 2
        else:
            out.append(c)
            i += 1
    return "".join(out)


def read_catalogue():
    """Templates in catalogue order: number, kind, nature, code, unit, texts by index."""
    templates = {}
    with open(CATALOGUE, encoding="utf-8") as f:
        next(f)
        for line in f:
            num, kind, nature, code, unit, index, designation, description, category, prefix = \
                [unescape(c) for c in line.rstrip("\n").split("\t")]
            t = templates.setdefault(int(num), {"num": int(num), "kind": int(kind), "nature": int(nature),
                                                "code": code, "unit": unit, "texts": {}})
            t["texts"][int(index)] = (designation, description, category, prefix)
    return [templates[n] for n in sorted(templates)]


NATURE_LEVEL = {1: "\\\\Ponctuel", 2: "\\\\Linéaire", 3: "\\\\Surfacique", 4: "\\\\Volumique",
                5: "\\\\Textuel", 6: "\\\\Non Graphique"}

FIELDS = [
    ("code", "s", ""), ("unitPrice", "r", 0.0), ("metreReal1", "r", 0.0), ("taxRate", "r", 19.6),
    ("metreReal2", "r", 1.0), ("metreText1", "s", ""), ("number", "i", -1), ("metreInt1", "i", 0),
    ("metreText2", "s", ""), ("nature", "i", 2), ("designation", "s", ""), ("metreText3", "s", ""),
    ("unit", "s", ""), ("quantityKey", "s", ""), ("description", "s", ""), ("metreInt2", "i", 0),
    ("metreInt3", "i", 0), ("metreText4", "s", ""), ("metreInt4", "i", 0), ("groupKey", "s", ""),
    ("metreInt5", "i", 0), ("metreInt6", "i", 7), ("metreInt7", "i", 0), ("metreText5", "s", ""),
    ("metreInt8", "i", 0), ("metreReal3", "r", 0.0), ("metreReal4", "r", 0.0), ("metreInt9", "i", 0),
    ("metreText6", "s", ""), ("metreInt10", "i", 0), ("metreText7", "s", ""), ("metreInt11", "i", 7),
    ("metreText8", "s", ""), ("metreText9", "s", ""), ("metreReal5", "r", 0.0), ("metreInt12", "i", 7),
    ("metreText10", "s", ""), ("metreText11", "s", ""), ("metreReal6", "r", 1.0), ("metreReal7", "r", 0.0),
    ("metreReal8", "r", 1.0), ("metreInt13", "i", 0), ("metreText12", "s", ""), ("metreInt14", "i", 0),
    ("metreReal9", "r", 1.0), ("metreReal10", "r", 1.0), ("metreReal11", "r", 0.0), ("treePath", "s", ""),
]


class Schedule:
    """The articles a session creates, numbered and coded as the module does it."""

    def __init__(self, catalogue):
        self.catalogue = catalogue
        self.articles = []
        self.groups = {}

    def of_kind(self, kind):
        return [t for t in self.catalogue if t["kind"] == kind]

    def code(self, prefix, group):
        taken = {a["code"].casefold() for a in self.groups[group]}
        n = 1
        while ("%s-%03d" % (prefix, n)).casefold() in taken:
            n += 1
        return "%s-%03d" % (prefix, n)

    def create(self, template, index, group, network, values, text_values=None, fixed=False):
        """One article; a fixed one (a new group's, a new road group's) is made without
        looking for its key, which lump sums share."""
        texts = template["texts"].get(index)
        if texts is None:
            return False
        designation, description, category, prefix = texts
        key = quoted(template["code"] % tuple(values)) if values else quoted(template["code"])
        if not fixed and any(a["quantityKey"].casefold() == key.casefold() for a in self.groups.setdefault(group, [])):
            return False
        tv = tuple(text_values if text_values is not None else values)
        # Each text takes as many values as it has placeholders, as the module fills them.
        fill = (lambda s: s % tv[:len(re.findall(r"%[.0-9]*[sf]", s))]) if tv else (lambda s: s)
        if not prefix and network is not None:
            prefix = network[:2]
        category = (category % network if network is not None else category) + NATURE_LEVEL.get(template["nature"], "")
        article = {f: d for f, _, d in FIELDS}
        article.update(number=len(self.articles) + 1, code=self.code(prefix, group), nature=template["nature"],
                       designation=fill(designation), unit=template["unit"], quantityKey=key,
                       description=fill(description), groupKey=group, metreInt4=0, taxRate=TAX_RATE)
        article["treePath"] = "%s\\\\%s - %s" % (category, article["code"], article["designation"])
        self.articles.append(article)
        self.groups[group].append(article)
        return True

    def read_empty_file(self):
        """What reading a schedule without any road article adds."""
        group = "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()"
        self.groups.setdefault(group, [])
        for kind in (1, 41, 42, 50):
            for t in self.of_kind(kind):
                self.create(t, 0, group, None, (), fixed=kind == 1)

    def update_network(self, index, name, pipe_models, fittings, bounds):
        group = "PRJ_RES(%s)" % name
        self.groups.setdefault(group, [])
        for kind in (0, 2, 32, 33, 3, 4, 5, 6, 7, 10, 11, 12, 13, 34, 14, 15, 16, 17, 18, 20):
            for t in self.of_kind(kind):
                if index not in t["texts"]:
                    break
                self.create(t, index, group, name, (), fixed=True)
        for kind in (23, 24):
            for t in self.of_kind(kind):
                for model in pipe_models:
                    self.create(t, index, group, name, (model,))
        if bounds:
            pairs = list(zip(bounds, bounds[1:]))
            for kind in (21, 22, 8, 9, 35, 36):
                for t in self.of_kind(kind):
                    if kind in (21, 8, 35):
                        for lower, upper in pairs:
                            self.create(t, index, group, name, (lower, upper))
                    else:
                        self.create(t, index, group, name, (bounds[-1],), (bounds[-1], bounds[-1]))
        for t in self.of_kind(26):
            for model in fittings:
                self.create(t, index, group, name, (model,))

    def update_materials(self, volume, surface, length):
        group = "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()"
        for kind, names in ((43, volume), (44, volume), (45, surface), (46, length), (49, volume)):
            for t in self.of_kind(kind):
                for material in names:
                    self.create(t, 0, group, None, (material,))

    def update_stripping(self, thicknesses):
        group = "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()"
        for kind in (37, 38):
            for t in self.of_kind(kind):
                for value in thicknesses:
                    self.create(t, 0, group, None, (value,))

    def price(self, group, key, value):
        for article in self.groups[group]:
            if article["quantityKey"] == key:
                article["unitPrice"] = value
                return
        raise KeyError("%s %s" % (group, key))


def real_text(value):
    """Shortest text that reads back to the same value, as the metre module writes reals."""
    if value == int(value) and abs(value) < 1e15:
        return str(int(value))
    return repr(value)


def xml_attribute(text):
    return (text.replace("&", "&amp;").replace("<", "&lt;").replace('"', "&quot;")
            .replace("\r", "&#13;").replace("\n", "&#10;").replace("\t", "&#9;"))


def write_schedule(path, schedule):
    lines = ['<?xml version="1.0" encoding="UTF-8"?>', "<bordereau>"]
    for article in schedule.articles:
        attributes = []
        for name, kind, _ in FIELDS:
            value = article[name]
            text = real_text(value) if kind == "r" else str(value)
            attributes.append('%s="%s"' % (name, xml_attribute(text)))
        lines.append("  <article " + " ".join(attributes) + " />")
    lines.append("</bordereau>")
    with open(path, "w", encoding="utf-8", newline="\n") as f:
        f.write("\n".join(lines) + "\n")


# Unit prices excluding tax (euros), by group and quantity name; anything else stays at 0.
NETWORK_PRICES = {
    "": 0,  # lump sums are priced by designation below
    "RSX_LIN_DEC_2D": 6.50, "RSX_SFC_DEC": 18.00, "RSX_VOL_DEC": 35.00, "RSX_VOL_FDT": 28.00,
    "RSX_VOL_0.00_1.30": 22.00, "RSX_VOL_1.30_2.00": 26.00, "RSX_VOL_2.00_3.50": 34.00, "RSX_VOL_3.50": 48.00,
    "RSX_SFC_BLI": 14.00, "RSX_VOL_EBG": 38.00, "RSX_VOL_LPO": 36.00, "RSX_VOL_RBL": 24.00,
    "RSX_BRA_VOL_0.00_1.30": 24.00, "RSX_BRA_VOL_1.30_2.00": 28.00, "RSX_BRA_VOL_2.00_3.50": 36.00,
    "RSX_BRA_BX_NB": 390.00,
}
MODEL_PRICES = {
    ("EP", "RSX_TUY_LIN_3D_PVC 315"): 68.00, ("EP", "RSX_TUY_LIN_3D_Béton 400"): 115.00,
    ("EP", "RSX_TUY_LIN_3D_PVC 200"): 45.00, ("EP", "RSX_SBL_NB_Regard 1000"): 1450.00,
    ("EP", "RSX_SBL_NB_Avaloir 40x40"): 680.00,
    ("EU", "RSX_TUY_LIN_3D_PVC 200"): 48.00, ("EU", "RSX_TUY_LIN_3D_PVC 160"): 38.00,
    ("EU", "RSX_SBL_NB_Regard 1000"): 1520.00, ("EU", "RSX_SBL_NB_Boîte de branchement"): 390.00,
}
NETWORK_LUMP_SUMS = {"Installation du chantier": 3500.00, "Piquetage, implantation, sondage": 1200.00}
ROAD_LUMP_SUMS = {
    "Installation du chantier": 4500.00, "Signalisation provisoire du chantier": 1800.00,
    "Implantation, plan de phasage et contrôle": 1500.00,
}
ROAD_PRICES = {
    "PRJ_VOL_TOT_DBL": 9.50, "PRJ_VOL_TOT_RBL": 12.00, "PRJ_SCI_LIN_3D": 7.50,
    "PRJ_VOL_MAT_GNT 0/31.5": 42.00, "PRJ_TON_MAT_GB3 0/14": 88.00,
    "PRJ_SFC_MAT_BBSG 0/10": 16.50, "PRJ_SFC_MAT_Enduit bicouche": 6.80,
    "PRJ_LIN_MAT_Bordure T2": 32.00, "PRJ_LIN_MAT_Caniveau CC1": 29.00,
    "PRJ_VOL_TOT_DEC_0.300": 8.50,
}


def priced_schedule():
    schedule = Schedule(read_catalogue())
    schedule.read_empty_file()
    for network in NETWORKS:
        schedule.update_network(network["index"], network["name"], models(network["pipes"]),
                                models(network["fittings"]), DEPTH_BOUNDS)
    schedule.update_materials(MAT_VOLUME, MAT_SURFACE, MAT_LENGTH)
    schedule.update_stripping(STRIPPING)
    for article in schedule.articles:
        name = article["quantityKey"][1:-1]
        network = article["groupKey"][8:-1] if article["groupKey"].startswith("PRJ_RES(") else None
        if article["nature"] == 6:
            lump_sums = NETWORK_LUMP_SUMS if network is not None else ROAD_LUMP_SUMS
            article["unitPrice"] = lump_sums[article["designation"]]
        elif network is not None:
            article["unitPrice"] = MODEL_PRICES.get((network, name), NETWORK_PRICES.get(name, 0.0))
        else:
            article["unitPrice"] = ROAD_PRICES.get(name, 0.0)
    return schedule


def main():
    # ezdxf writes some objects in the order of a set: a fixed hash seed keeps the file
    # the same from one run to the next.
    if os.environ.get("PYTHONHASHSEED") != "0":
        os.execve(sys.executable, [sys.executable] + sys.argv, dict(os.environ, PYTHONHASHSEED="0"))
    write_drawing(os.path.join(HERE, "projet_vrd.dxf"))
    write_schedule(os.path.join(HERE, "VelaBordereau.xml"), priced_schedule())


if __name__ == "__main__":
    main()
