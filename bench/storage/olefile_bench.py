"""Times olefile on the benchmark's compound files and prints the seconds the work took.

    olefile_bench.py all FILE        opens FILE and reads every stream
    olefile_bench.py one FILE NAME   opens FILE and reads the stream NAME
"""
import sys
import time

import olefile


def main(mode, path, name=None):
    start = time.perf_counter()
    ole = olefile.OleFileIO(path)
    names = ["/".join(entry) for entry in ole.listdir()] if mode == "all" else [name]
    total = sum(len(ole.openstream(entry).read()) for entry in names)
    ole.close()
    elapsed = time.perf_counter() - start
    if total == 0:
        sys.exit(1)
    print("%.6f" % elapsed)


if __name__ == "__main__":
    main(*sys.argv[1:])
