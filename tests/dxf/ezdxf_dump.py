#!/usr/bin/python3
"""Prints what ezdxf reads in a drawing, one sorted line per fact: header settings,
layers, applications, dictionaries (recursively) with their XData and XRECORD data,
and the entities of model space with their XData."""
import sys

import ezdxf

SETTINGS = ["$ACADVER", "$DWGCODEPAGE", "$AUNITS", "$ANGBASE", "$ANGDIR", "$OSMODE", "$CECOLOR",
            "$ATTDIA", "$ATTREQ", "$LIMCHECK", "$ORTHOMODE", "$CLAYER"]


def xdata_lines(where, entity, out):
    if entity.xdata is None:
        return
    for app in sorted(entity.xdata.data.keys()):
        out.append("xdata %s %s %r" % (where, app, [tuple(t) for t in entity.get_xdata(app)]))


def walk(path, dictionary, out):
    for key, value in dictionary.items():
        where = path + "/" + key
        if isinstance(value, str):
            out.append("entry %s -> %s" % (where, value))
            continue
        out.append("object %s %s %s" % (where, value.dxftype(), value.dxf.handle))
        xdata_lines(where, value, out)
        if value.dxftype() == "XRECORD":
            out.append("xrecord %s %r" % (where, [tuple(t) for t in value.tags]))
        if value.dxftype() in ("DICTIONARY", "ACDBDICTIONARYWDFLT"):
            walk(where, value, out)


def main(path):
    doc = ezdxf.readfile(path)
    out = []
    for name in SETTINGS:
        out.append("header %s %r" % (name, doc.header.get(name)))
    for layer in doc.layers:
        out.append("layer %s %s" % (layer.dxf.name, layer.dxf.color))
    for app in doc.appids:
        out.append("appid %s" % app.dxf.name)
    if doc.dxfversion > "AC1009":
        walk("", doc.rootdict, out)
    for e in doc.modelspace():
        where = "%s:%s" % (e.dxftype(), e.dxf.get("handle", "?"))
        layer = e.dxf.get("layer", "") if e.dxf.is_supported("layer") else ""
        out.append("entity %s %s" % (where, layer))
        xdata_lines(where, e, out)
    for line in sorted(out):
        print(line)


if __name__ == "__main__":
    main(sys.argv[1])
