"""Reads the thumbnail sample with olefile: the title written before is kept, the thumbnail is the
standard summary property, a 64 x 64 24-bit bitmap behind the system clipboard tags."""
import struct
import sys

import olefile


def main(path):
    ole = olefile.OleFileIO(path, raise_defects=olefile.DEFECT_INCORRECT)
    props = ole.getproperties("\x05SummaryInformation")
    assert props.get(1) == 1252, props.get(1)
    assert props.get(2) == b"Shot 10", props.get(2)
    value = props[17]
    assert value[:8] == b"\xff\xff\xff\xff\x08\x00\x00\x00", value[:8]
    size, width, height, planes, bits, compression = struct.unpack("<IiiHHI", value[8:28])
    assert (size, width, height, planes, bits, compression) == (40, 64, 64, 1, 24, 0)
    rows = value[48:]
    assert len(rows) == 64 * 192, len(rows)
    # The rendered view fills 64 x 48 at the top: the bottom rows (stored first) are black, the
    # top row is the dark sky.
    assert rows[:192] == bytes(192)
    top = rows[63 * 192:63 * 192 + 3]
    assert top != b"\0\0\0" and top[0] > top[2], top
    assert ole.get_metadata().title == b"Shot 10"
    print("olefile reads the thumbnail and the title beside it")


if __name__ == "__main__":
    main(sys.argv[1])
