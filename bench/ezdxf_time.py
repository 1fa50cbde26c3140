#!/usr/bin/python3
"""Times ezdxf reading and writing one drawing; prints "read_seconds write_seconds"."""
import os
import sys
import tempfile
import time

import ezdxf

start = time.perf_counter()
doc = ezdxf.readfile(sys.argv[1])
read = time.perf_counter() - start
with tempfile.TemporaryDirectory() as folder:
    start = time.perf_counter()
    doc.saveas(os.path.join(folder, "copie.dxf"))
    write = time.perf_counter() - start
print("%.6f %.6f" % (read, write))
