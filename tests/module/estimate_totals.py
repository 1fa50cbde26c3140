"""The total excluding tax that an estimate must show, worked out from the drawing's
project records and the schedule's prices alone, and the total its workbook shows.
Each line is priced on its quantity as shown, to the cent.

Used by run_demo.py; runs under /usr/bin/python3 (python3-ezdxf, python3-openpyxl).
"""
import xml.etree.ElementTree as ET
from decimal import ROUND_HALF_UP, Decimal

import ezdxf
import openpyxl

RECORD_APP = "DAZUVUVUD"
NETWORK_APP = "VELANTO_RSX"
ROAD_GROUP = "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()"
# kind -> (first-level dictionary, second-level dictionary)
PLACES = {3: ("VELANTO_RSX_VRD", "PROJECTS"), 2: ("VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ"),
          4: ("KORVANE", "KORVANE_PROJET"), 1: ("VELANTO_PFM_VRD", "PROJECTS")}


def quantity(code, value):
    if code in (1040, 1070, 1071):
        return float(value)
    text, number = str(value).strip(), ""
    for c in text:
        if c.isdigit() or c in ".+-":
            number += c
        else:
            break
    try:
        return float(number)
    except ValueError:
        return 0.0


def drawing_projects(path):
    """{kind: {name: {key: quantity}}} and {project: network} from the drawing."""
    doc = ezdxf.readfile(path)
    projects = {kind: {} for kind in PLACES}
    for kind, (first, second) in PLACES.items():
        if first not in doc.rootdict or second not in doc.rootdict[first]:
            continue
        entries = doc.rootdict[first][second]
        for key in sorted(entries.keys()):
            entity = entries[key]
            if not entity.has_xdata(RECORD_APP):
                continue
            tags = list(entity.get_xdata(RECORD_APP))
            if len(tags) < 2 or tags[0] != (1000, "PRJ_NOM") or tags[1][0] != 1000:
                continue
            table = {}
            for (kcode, k), (vcode, v) in zip(tags[2::2], tags[3::2]):
                if kcode != 1000 or vcode not in (1000, 1040, 1070, 1071):
                    break
                table[k] = quantity(vcode, v)
            projects[kind][tags[1][1]] = table
    networks = {}
    for entity in doc.modelspace():
        if entity.has_xdata(NETWORK_APP):
            tags = list(entity.get_xdata(NETWORK_APP))
            networks[tags[2][1]] = tags[0][1]
    return projects, networks


def schedule_articles(path):
    return [a.attrib for a in ET.parse(path).getroot().iter("article")]


def expected_total(drawing, schedule, kept, per_project, article_kept=lambda tree_path: True):
    """Total HT of the estimate of the checked projects (kept(kind, name)) and the checked
    articles, each line rounded to the cent as the estimate does."""
    projects, networks = drawing_projects(drawing)
    articles = [a for a in schedule_articles(schedule) if article_kept(a["treePath"])]
    amounts = []

    def cents(value):
        return float(Decimal(repr(value)).quantize(Decimal("0.01"), rounding=ROUND_HALF_UP))

    # A line's amount is its quantity as shown (to the cent) times its price, to the cent.
    def count(article, quantities):
        price = float(article["unitPrice"])
        if not quantities:
            return
        if per_project:
            amounts.extend(cents(cents(q) * price) for q in quantities)
        else:
            amounts.append(cents(cents(sum(quantities)) * price))

    def matching(table, key):
        found = [q for k, q in table.items() if k.casefold() == key.casefold()]
        return found[-1:]

    road_kinds = (2, 4, 1)
    road_checked = any(kept(kind, name) for kind in road_kinds for name in projects[kind])
    for article in articles:
        group, nature = article["groupKey"], int(article["nature"])
        if group == ROAD_GROUP:
            quantities = [q for kind in road_kinds for name, table in projects[kind].items() if kept(kind, name)
                          for q in matching(table, article["quantityKey"])]
            if nature == 6 and road_checked:
                quantities.append(1.0)
            count(article, quantities)
        elif group.startswith("PRJ_RES(") and group.endswith(")"):
            network = group[len("PRJ_RES("):-1]
            members = [name for name in projects[3] if networks.get(name) == network and kept(3, name)]
            quantities = [q for name in members for q in matching(projects[3][name], article["quantityKey"])]
            if nature == 6 and members:
                quantities.append(1.0)
            count(article, quantities)
        elif nature == 6 and not any(m in group for m in ("PRJ_RES", "PRJ_PFM", "PRJ_RTE", "PRJ_PCV")):
            count(article, [1.0])
    return cents(sum(amounts))


def workbook_total(path):
    """The "Total HT" the workbook's first sheet shows (its computed value)."""
    sheet = openpyxl.load_workbook(path, data_only=True).worksheets[0]
    for row in sheet.iter_rows(values_only=True):
        if "Total HT" in row:
            values = [v for v in row if isinstance(v, (int, float))]
            if values:
                return float(values[-1])
    return None
