#!/usr/bin/env python3
# Writes catalogue_expected.tsv: the expected texts of the 53 standard article templates,
# one row per (template, network index). Transcribed by hand from the written catalogue
# description, not from code, so that the catalogue can be checked against an independent copy.
#
# TSV escaping: backslash -> \\, line feed -> \n, carriage return -> \r, tab -> \t.
# Category patterns below are raw strings: r"%s\\X" holds two backslash characters.

import os

# Sentence put in front of per-network descriptions; index 12 has none.
NETWORK_SENTENCE = [
    "Article associé aux réseaux EP.\r\n",
    "Article associé aux réseaux EU.\r\n",
    "Article associé aux réseaux AEP.\r\n",
    "Article associé aux réseaux GAZ.\r\n",
    "Article associé aux réseaux BTA.\r\n",
    "Article associé aux réseaux BTB.\r\n",
    "Article associé aux réseaux HTA.\r\n",
    "Article associé aux réseaux HTB.\r\n",
    "Article associé aux réseaux 'Téléphone'.\r\n",
    "Article associé aux réseaux 'Télévision'.\r\n",
    "Article associé aux réseaux 'Eclairage'.\r\n",
    "Article associé aux réseaux 'Chauffage'.\r\n",
    "",
]

# index: (prefix, pipe/cable pattern, manhole/fitting pattern, supply pattern)
NETWORK_TABLE = [
    ("EP", r"%s\\Canalisation EP", r"%s\\Regard EP", None),
    ("EU", r"%s\\Canalisation EU", r"%s\\Regard EU", None),
    ("AEP", r"%s\\Canalisation adduction eau potable", r"%s\\Accessoire adduction eau potable", r"%s\\Fourniture adduction eau potable"),
    ("GAZ", r"%s\\Canalisation gaz", r"%s\\Accessoire gaz", r"%s\\Fourniture gaz"),
    ("BT", r"%s\\Câble basse tension", r"%s\\Accessoire basse tension", r"%s\\Fourniture basse tension"),
    ("BT", r"%s\\Câble BTB", r"%s\\Accessoire BTB", r"%s\\Fourniture BTB"),
    ("CH", r"%s\\Câble HTA", r"%s\\Accessoire HTA", r"%s\\Fourniture HTA"),
    ("CH", r"%s\\Câble HTB", r"%s\\Accessoire HTB", r"%s\\Fourniture HTB"),
    ("TL", r"%s\\Câble téléphone", r"%s\\Accessoire téléphone", r"%s\\Fourniture téléphone"),
    ("TV", r"%s\\Câble vidéo", r"%s\\Accessoire vidéo", r"%s\\Fourniture vidéo"),
    ("EP", r"%s\\Câble éclairage public", r"%s\\Accessoire éclairage public", r"%s\\Fourniture éclairage public"),
    ("CH", r"%s\\Canalisation chauffage", r"%s\\Accessoire chauffage", r"%s\\Fourniture chauffage"),
    ("", r"%s\\Câble", r"%s\\Accessoire", r"%s\\Fourniture"),
]
PIPE, FITTING, SUPPLY = 1, 2, 3

RANGES = {
    "all": list(range(0, 13)),
    "EP,EU": [0, 1],
    "2-12": list(range(2, 13)),
    "single": [0],
}

CAT_DEMOLITION = r"%s\\Travaux de génie civil\\Démolition de chausée"
CAT_FONDATION = r"%s\\Travaux de génie civil\\Traitement du sol de fondation"
CAT_TRANCHEES = r"%s\\Travaux de génie civil\\Terrassements\\Tranchées"
CAT_BLINDAGE = r"%s\\Travaux de génie civil\\Terrassements\\Protection contre les éboulements"
CAT_ENROBAGE = r"%s\\Travaux de génie civil\\Terrassements\\Enrobage et lit de pose"
CAT_REMBLAIS = r"%s\\Travaux de génie civil\\Terrassements\\Remblais et apports"
CAT_BRANCHEMENTS = r"%s\\Travaux de génie civil\\Terrassements\\Tranchées des branchements"
CAT_FOURREAU = r"%s\\Travaux de génie civil\\Fourreau"
CAT_DECAPAGE = r"Voirie\\Terrassements\\Terre végétale\\Décapage"
CAT_VEGETALISATION = r"Voirie\\Terrassements\\Terre végétale\\Végétalisation des talus"
CAT_CHAUSSEES = r"Voirie\\Travaux sur chaussées existantes"

PROJ_ALL = "Article associé aux projets 'multi plates-formes', 'projet linéaire par profils-types' et 'Korvane'.\n"
PROJ_PROFILS = "Article associé aux 'projets linéaires par profils-types'.\n"
PROJ_KORVANE = "Article associé aux projets 'Korvane'.\n"

# Uniform and single templates:
# (num, kind, nature, code, unit, designation, description, category, prefix, range)
FIXED = [
    (1, 0, 6, "", "", "Installation du chantier", "Forfait", r"%s\\Travaux préparatoires", "TP", "all"),
    (2, 0, 6, "", "", "Piquetage, implantation, sondage", "Forfait", r"%s\\Travaux préparatoires", "TP", "all"),
    (3, 5, 2, "RSX_LIN_DEC_2D", "ml", "Longueur 2D de découpage",
     "Encore appelée longueur de sciage, il s'agit de la longueur 2D totale des tronçons de canalisations ayant une structure de décaissement.",
     CAT_DEMOLITION, "GC", "all"),
    (4, 6, 2, "RSX_LIN_DEC_3D", "ml", "Longueur 3D de découpage",
     "Encore appelée longueur de sciage, il s'agit de la longueur 3D totale des tronçons de canalisations ayant une structure de décaissement.",
     CAT_DEMOLITION, "GC", "all"),
    (5, 11, 3, "RSX_SFC_DEC", "m²", "Surface 2D de démolition",
     "Encore appelée surface de découpe, il s'agit de la surface 2D totale de décaissement des tranchées associées aux tronçons de canalisations ayant une structure de décaissement.",
     CAT_DEMOLITION, "GC", "all"),
    (6, 18, 4, "RSX_VOL_DEC", "m³", "Volume de démolition",
     "Volume total de décaissement des tranchées associées aux tronçons de canalisations ayant une structure de décaissement.",
     CAT_DEMOLITION, "GC", "all"),
    (7, 3, 2, "RSX_LIN_FDT_2D", "ml", "Longueur 2D",
     "Longueur 2D totale des tronçons de canalisations ayant une structure de fondation.",
     CAT_FONDATION, "GC", "all"),
    (8, 4, 2, "RSX_LIN_FDT_3D", "ml", "Longueur 3D",
     "Longueur 3D totale des tronçons de canalisations ayant une structure de fondation.",
     CAT_FONDATION, "GC", "all"),
    (9, 14, 4, "RSX_VOL_FDT", "m³", "Volume",
     "Volume total de fondation des tranchées associées aux tronçons de canalisations ayant une structure de fondation.",
     CAT_FONDATION, "GC", "all"),
    (10, 13, 4, "RSX_VOL_FOU", "m³", "Volume de fouille",
     "Volume total de fouille des tranchées.",
     CAT_TRANCHEES, "GC", "all"),
    (11, 21, 4, "RSX_VOL_%.2f_%.2f", "m³", "Volume de fouille %.2f m <= H <= %.2f m",
     "Volume de fouille des tranchées pour %.2f m <= H <= %.2f m.",
     CAT_TRANCHEES, "GC", "all"),
    (12, 22, 4, "RSX_VOL_%.2f", "m³", "Volume de fouille H > %.2f m",
     "Volume de fouille des tranchées pour H > %.2f m.",
     CAT_TRANCHEES, "GC", "all"),
    (13, 8, 2, "RSX_LIN_%.2f_%.2f_2D", "ml", "Longueur 2D %.2f m <= H <= %.2f m",
     "Longueur 2D totale des tranchées ayant un volume de fouille pour %.2f m <= H <= %.2f m.",
     CAT_TRANCHEES, "GC", "all"),
    (14, 9, 2, "RSX_LIN_%.2f_2D", "ml", "Longueur 2D H > %.2f m",
     "Longueur 2D totale des tranchées ayant un volume de fouille pour H > %.2f m.",
     CAT_TRANCHEES, "GC", "all"),
    (15, 7, 2, "RSX_LIN_BLI_2D", "ml", "Longueur 2D blindée",
     "Longueur 2D totale des tranchées blindées.",
     CAT_BLINDAGE, "GC", "all"),
    (16, 12, 3, "RSX_SFC_BLI", "m²", "Surface de blindage",
     "Surface 2D totale des panneaux de blindage.",
     CAT_BLINDAGE, "GC", "all"),
    (17, 20, 4, "RSX_VOL_BLI", "m³", "Volume de blindage",
     "Volume total des panneaux de blindage.",
     CAT_BLINDAGE, "GC", "all"),
    (18, 16, 4, "RSX_VOL_EBG", "m³", "Volume d'enrobage",
     "Volume total d'enrobage des canalisations.",
     CAT_ENROBAGE, "GC", "all"),
    (19, 15, 4, "RSX_VOL_LPO", "m³", "Volume de lit de pose",
     "Volume total du lit de pose des canalisations.",
     CAT_ENROBAGE, "GC", "all"),
    (20, 17, 4, "RSX_VOL_RBL", "m³", "Volume de remblai",
     "Volume total de remblai des tranchées associées aux canalisations.",
     CAT_REMBLAIS, "GC", "all"),
    (21, 19, 4, "RSX_VOL_DEC_%s", "m³", "Volume de %s",
     "Volume total du matériau %s dans la structure de décaissement.",
     CAT_REMBLAIS, "GC", "all"),
    (22, 34, 4, "RSX_BRA_VOL_FO", "m³", "Volume de fouille",
     "Volume total de fouille des tranchées associées aux branchements.",
     CAT_BRANCHEMENTS, "GC", "EP,EU"),
    (23, 35, 4, "RSX_BRA_VOL_%.2f_%.2f", "m³", "Volume de fouille %.2f m <= H <= %.2f m",
     "Volume de fouille des tranchées associées aux branchements pour %.2f m <= H <= %.2f m.",
     CAT_BRANCHEMENTS, "GC", "EP,EU"),
    (24, 36, 2, "RSX_BRA_VOL_%.2f", "m³", "Longueur 2D %.2f m <= H <= %.2f m",
     "Longueur 2D totale des tranchées aassociées aux branchements ayant un volume de fouille pour %.2f m <= H <= %.2f m.",
     CAT_BRANCHEMENTS, "GC", "EP,EU"),
    (25, 28, 2, "RSX_FRX_LIN_3D_%s", "ml", "Fourniture et pose de fourreau %s",
     "Longueur 3D totale des fourreaux simples de modèle %s",
     CAT_FOURREAU, "GC", "2-12"),
    (26, 29, 2, "RSX_FRX_NB_%s", "ml", "Nombre de couronnes %s",
     "Nombre de couronnes nécessaires pour les fourreaux simples de modèle %s (longueur 3D / longueur utile).",
     CAT_FOURREAU, "GC", "2-12"),
    (35, 30, 2, "RSX_PGN_LIN_3D_%s", "ml", "Fourniture et pose du peigne %s",
     "Longueur 3D totale du peigne de modèle %s",
     "Fourreau (peigne)", "GC", "single"),
    (36, 31, 2, "RSX_PGN_NB_%s", "", "Nombre de couronnes %s",
     "Nombre de couronnes nécessaires pour les peignes de modèle %s (longueur 3D / longueur utile).",
     "Fourreau (peigne)", "GC", "single"),
    (37, 1, 6, "", "", "Installation du chantier",
     PROJ_ALL + "Forfait",
     r"Voirie\\Travaux préparatoires", "TP", "single"),
    (38, 1, 6, "", "", "Signalisation provisoire du chantier",
     PROJ_ALL + "Forfait",
     r"Voirie\\Travaux préparatoires", "TP", "single"),
    (39, 1, 6, "", "", "Implantation, plan de phasage et contrôle",
     PROJ_ALL + "Forfait",
     r"Voirie\\Travaux préparatoires", "TP", "single"),
    (40, 37, 4, "PRJ_VOL_TOT_DEC_%.3f", "m³", "Volume de décapage sur une épaisseur de %.2f m",
     PROJ_ALL + "Volume total de décapage sur une épaisseur de %.2f m",
     CAT_DECAPAGE, "GC", "single"),
    (41, 38, 3, "PRJ_SFC_DEC_3D_%.3f", "m²", "Surface 3D de décapage sur une épaisseur de %.2f m",
     PROJ_ALL + "Surface 3D totale de décapage sur une épaisseur de %.2f m.",
     CAT_DECAPAGE, "GC", "single"),
    (42, 39, 4, "PRJ_VOL_TOT_VEG_%.3f", "m³", "Volume de végétalisation sur une épaisseur de %.2f m",
     PROJ_ALL + "Volume total de végétalisation des talus sur une épaisseur de %.2f m",
     CAT_VEGETALISATION, "GC", "single"),
    (43, 40, 3, "PRJ_SFC_TOT_VEG_%.3f", "m²", "Surface 3D de végétalisation sur une épaisseur de %.2f m",
     PROJ_ALL + "Surface 3D totale de végétalisation des talus sur une épaisseur de %.2f m.",
     CAT_VEGETALISATION, "GC", "single"),
    (44, 41, 4, "PRJ_VOL_TOT_DBL", "m³", "Volume des déblais",
     PROJ_ALL + "Volume total des déblais.",
     r"Voirie\\Terrassements\\Déblais", "GC", "single"),
    (45, 42, 4, "PRJ_VOL_TOT_RBL", "m³", "Volume des remblais",
     PROJ_ALL + "Volume total des remblais.",
     r"Voirie\\Terrassements\\Remblais", "GC", "single"),
    (46, 43, 4, "PRJ_VOL_MAT_%s", "m³", "Fourniture et mise en oeuvre de %s",
     PROJ_ALL + "Volume total du matériau %s.",
     r"Voirie\\Matériaux de structure", "GC", "single"),
    (47, 44, 4, "PRJ_TON_MAT_%s", "tonne", "%s en tonnes",
     PROJ_PROFILS + "Masse totale du matériau %s en tonnes.",
     r"Voirie\\Matériaux de structure", "GC", "single"),
    (48, 45, 3, "PRJ_SFC_MAT_%s", "m²", "Fourniture et mise en oeuvre de %s",
     PROJ_PROFILS + "Surface 3D totale du matériau %s.",
     r"Voirie\\Surface de matériaux (enduits, pavés...)", "GC", "single"),
    (49, 46, 2, "PRJ_LIN_MAT_%s", "ml", "Fourniture et mise en oeuvre de %s",
     PROJ_PROFILS + "Longueur 3D totale du matériau %s.",
     r"Voirie\\Bordures, caniveaux...", "GC", "single"),
    (50, 47, 3, "PRJ_SFC_RAB_%.2f_%.2f_3D", "m²", "Surface 3D de rabotage d'épaisseur entre %.2f m et %.2f m",
     PROJ_KORVANE + "Surface 3D totale de rabotage d'épaisseur comprise entre %.2f m et %.2f m.",
     CAT_CHAUSSEES, "GC", "single"),
    (51, 48, 3, "PRJ_SFC_RAB_%.2f_3D", "m²", "Surface 3D de rabotage d'épaisseur > à %.2f m",
     PROJ_KORVANE + "Surface 3D totale de rabotage d'épaisseur > à %.2f m.",
     CAT_CHAUSSEES, "GC", "single"),
    (52, 49, 4, "PRJ_VOL_RPF_%s", "m³", "Volume de reprofilage de %s",
     PROJ_KORVANE + "Volume de reprofilage utilisé pour le matériau %s",
     CAT_CHAUSSEES, "GC", "single"),
    (53, 50, 2, "PRJ_SCI_LIN_3D", "ml", "Sciage de chaussée",
     PROJ_KORVANE + "Longueur 3D totale de découpe de chaussée par sciage.",
     CAT_CHAUSSEES, "GC", "single"),
]

# Network-dependent templates: texts chosen per index, category from a pattern family,
# prefix from the network table (empty for index 12).
# (num, kind, nature, code, unit, range, category, {indices: (designation, description)})
CANAL_0_1 = (0, 1)
CANAL_2_3_11 = (2, 3, 11)
CABLE = (4, 5, 6, 7, 8, 9, 10, 12)
NETWORK_DEPENDENT = [
    (27, 2, 2, "RSX_LIN_TOT_3D", "ml", "all", PIPE, {
        CANAL_0_1: ("Longueur 3D des canalisations",
                    "Longueur 3D totale des canalisations ; les branchements ne sont pas pris en compte !"),
        CANAL_2_3_11: ("Longueur 3D totale", "Longueur 3D totale des canalisations"),
        CABLE: ("Longueur 3D totale", "Longueur 3D totale (SurLongueur comprise) des câbles"),
    }),
    (28, 32, 2, "RSX_BRA_LIN_3D", "ml", "EP,EU", PIPE, {
        CANAL_0_1: ("Longueur 3D des branchements", "Longueur 3D totale des branchements"),
    }),
    (29, 23, 2, "RSX_TUY_LIN_3D_%s", "ml", "all", PIPE, {
        CANAL_0_1: ("Fourniture et pose des canalisations %s",
                    "Longueur 3D totale des canalisations de modèle %s. Les branchements sont pris en compte !"),
        CANAL_2_3_11: ("Fourniture et pose des canalisations %s",
                       "Longueur 3D totale des canalisations de modèle %s"),
        CABLE: ("Fourniture et pose de câble %s",
                "Longueur 3D totale (SurLongueur comprise) du câble %s"),
    }),
    (30, 24, 2, "RSX_TUY_NB_%s", "", "all", PIPE, {
        CANAL_0_1: ("Nombre de tuyaux %s",
                    "Nombre de tuyaux %s utilisés par les canalisations et les branchements (longueur 3D / longueur utile)."),
        CANAL_2_3_11: ("Nombre de tuyaux %s",
                       "Nombre de tuyaux %s utilisés par les canalisations (longueur 3D / longueur utile)."),
        CABLE: ("Nombre de tourets %s",
                "Nombre de tourets nécessaires pour les câbles de modèle %s (longueur 3D / longueur utile)."),
    }),
    (31, 33, 1, "RSX_BRA_BX_NB", "", "EP,EU", r"%s\\Branchements", {
        CANAL_0_1: ("Boîtes clients", "Nombre total de boîtes clients"),
    }),
    (32, 26, 1, "RSX_SBL_NB_%s", "", "all", FITTING, {
        CANAL_0_1: ("Regards %s", "Nombre total de regards %s"),
        tuple(range(2, 13)): ("%s", "Nombre total d'accessoires %s"),
    }),
    (33, 25, 2, "RSX_TUY_FRNT_LIN_3D_%s", "ml", "2-12", SUPPLY, {
        (2, 3): ("%s", "Longueur 3D totale de fournitures %s pour tuyau"),
        tuple(range(4, 13)): ("%s", "Longueur 3D totale de fournitures %s pour câble"),
    }),
    (34, 27, 1, "RSX_SBL_FRNT_NB_%s", "", "2-12", SUPPLY, {
        tuple(range(2, 13)): ("%s", "Nombre total de fournitures %s pour accessoire"),
    }),
]

HEADER = ["num", "kind", "nature", "code", "unit", "index",
          "designation", "description", "category", "prefix"]


def escape(text):
    return (text.replace("\\", "\\\\").replace("\n", "\\n")
            .replace("\r", "\\r").replace("\t", "\\t"))


def fixed_rows(entry):
    num, kind, nature, code, unit, designation, description, category, prefix, rng = entry
    for index in RANGES[rng]:
        sentence = "" if rng == "single" else NETWORK_SENTENCE[index]
        yield (num, kind, nature, code, unit, index,
               designation, sentence + description, category, prefix)


def network_rows(entry):
    num, kind, nature, code, unit, rng, category, texts = entry
    for index in RANGES[rng]:
        matches = [value for indices, value in texts.items() if index in indices]
        assert len(matches) == 1, (num, index)
        designation, description = matches[0]
        prefix = NETWORK_TABLE[index][0]
        pattern = NETWORK_TABLE[index][category] if isinstance(category, int) else category
        assert pattern is not None, (num, index)
        yield (num, kind, nature, code, unit, index,
               designation, NETWORK_SENTENCE[index] + description, pattern, prefix)


def main():
    rows = []
    for entry in FIXED:
        rows.extend(fixed_rows(entry))
    for entry in NETWORK_DEPENDENT:
        rows.extend(network_rows(entry))
    rows.sort(key=lambda row: (row[0], row[5]))
    assert sorted({row[0] for row in rows}) == list(range(1, 54))
    assert len({(row[0], row[5]) for row in rows}) == len(rows)

    out = os.path.join(os.path.dirname(os.path.abspath(__file__)), "catalogue_expected.tsv")
    with open(out, "w", encoding="utf-8", newline="") as f:
        f.write("\t".join(HEADER) + "\n")
        for row in rows:
            f.write("\t".join(escape(str(field)) for field in row) + "\n")
    print(f"{out}: {len(rows)} rows")


if __name__ == "__main__":
    main()
