"""Reads the sample compound file with olefile and checks every element the writer put there."""
import sys

import olefile


def pattern(size, seed):
    return bytes((i * 7 + seed) & 255 for i in range(size))


def main(path):
    ole = olefile.OleFileIO(path, raise_defects=olefile.DEFECT_INCORRECT)
    streams = {"/".join(p) for p in ole.listdir(streams=True, storages=False)}
    expected = {"Contents", "Big", "Empty", "Sub/Inner"} | {"n%d" % i for i in range(300)}
    assert streams == expected, sorted(streams ^ expected)
    assert ole.openstream("Contents").read() == pattern(100, 1)
    assert ole.openstream("Big").read() == pattern(10000, 2)
    assert ole.openstream("Empty").read() == b""
    assert ole.openstream(["Sub", "Inner"]).read() == pattern(5, 4)
    assert ole.openstream("n42").read() == b"42"
    assert ole.root.clsid == "12345678-9ABC-DEF0-0102-030405060708", ole.root.clsid
    assert ole.getclsid("Sub") == "AABBCCDD-1122-3344-0908-070605040302", ole.getclsid("Sub")
    sub = ole.direntries[ole._find("Sub")]
    assert sub.dwUserFlags == 0x5A, sub.dwUserFlags
    print("olefile reads the sample")


if __name__ == "__main__":
    main(sys.argv[1])
